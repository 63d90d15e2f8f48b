#pragma once

#include <QLoggingCategory>

// Layout, printing and export: pictures skipped, settings a printer does not know.
Q_DECLARE_LOGGING_CATEGORY(lcOutput)
