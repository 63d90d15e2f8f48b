#include "reportrt/base/logging_p.h"

Q_LOGGING_CATEGORY(lcOutput, "ludmox.reportrt.output")
