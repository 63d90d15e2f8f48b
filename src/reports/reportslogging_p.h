#pragma once

#include <QLoggingCategory>

namespace reports {
Q_DECLARE_LOGGING_CATEGORY(lcReports)
}
