#pragma once

#include <QLoggingCategory>

namespace dialogs {
Q_DECLARE_LOGGING_CATEGORY(lcDialogs)
}
