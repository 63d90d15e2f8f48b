#pragma once

#include <QLoggingCategory>
#include <QString>

namespace reports {
Q_DECLARE_LOGGING_CATEGORY(lcReports)

/// Writes a trace text at a lifecycle point: to the diagnostic log (switched off, as at
/// every call site of the component) and as a debug message of "ludmox.reports", which is
/// how a developer or a test follows what the report did.
void traceReport(const QString& message);
} // namespace reports
