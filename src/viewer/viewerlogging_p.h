#pragma once

#include <QLoggingCategory>
#include <QString>

namespace viewer {
Q_DECLARE_LOGGING_CATEGORY(lcViewer)

/// Writes a lifecycle trace text to `file` (the default trace file when empty) with the
/// switch off, as every call site of the component does, and as a debug message of
/// "ludmox.viewer" for a developer or a test to follow.
void traceViewer(const QString& message, const QString& file = QString());
} // namespace viewer
