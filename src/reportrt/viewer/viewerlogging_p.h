#pragma once

#include <QLoggingCategory>

// The preview control: layout runs stopped, failures shown, dialogs left out.
Q_DECLARE_LOGGING_CATEGORY(lcViewer)
