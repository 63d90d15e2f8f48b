#pragma once

#include "platform/dialogservice.h"

#include <QStringList>

namespace platform {

/// The pickers of the desktop session: QColorDialog and QFileDialog.
class QtDialogService : public DialogService {
public:
    std::optional<int32_t> chooseColor(int32_t ownerWindow, int32_t initialColor) override;
    std::optional<QString> openFile(const FileRequest& request) override;
    std::optional<QString> chooseFolder(
        int32_t ownerWindow, const QString& title, const QString& initialFolder) override;

    /// QFileDialog name filters for a "description|patterns|..." filter: "Text (*.txt)" for
    /// "Text|*.txt". A description that already ends with its patterns in parentheses is
    /// kept as it is; a trailing description without patterns is dropped.
    static QStringList nameFilters(const QString& filter);
};

} // namespace platform
