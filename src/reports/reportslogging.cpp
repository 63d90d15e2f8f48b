#include "reports/reportslogging_p.h"

namespace reports {
Q_LOGGING_CATEGORY(lcReports, "ludmox.reports")
}
