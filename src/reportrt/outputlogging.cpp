#include "outputlogging_p.h"

Q_LOGGING_CATEGORY(lcOutput, "ludmox.reportrt.output")
