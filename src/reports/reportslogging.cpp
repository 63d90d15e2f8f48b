#include "reportslogging_p.h"

Q_LOGGING_CATEGORY(lcReports, "ludmox.reports")
