#include "reportrt/viewer/viewerlogging_p.h"

Q_LOGGING_CATEGORY(lcViewer, "ludmox.reportrt.viewer")
