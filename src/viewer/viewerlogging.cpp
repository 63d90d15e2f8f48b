#include "engine/moxglobals.h"
#include "viewer/viewerlogging_p.h"

namespace viewer {
Q_LOGGING_CATEGORY(lcViewer, "ludmox.viewer", QtWarningMsg)

void traceViewer(const QString& message, const QString& file)
{
    engine::TraceWrite(message, file, false);
    qCDebug(lcViewer, "%ls", qUtf16Printable(message));
}
} // namespace viewer
