#include "engine/moxglobals.h"
#include "reports/reportslogging_p.h"

namespace reports {
Q_LOGGING_CATEGORY(lcReports, "ludmox.reports", QtWarningMsg)

void traceReport(const QString& message)
{
    engine::TraceWrite(message, QString(), false);
    qCDebug(lcReports, "%ls", qUtf16Printable(message));
}
} // namespace reports
