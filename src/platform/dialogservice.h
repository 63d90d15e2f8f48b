#pragma once

#include "core/ludmoxexport.h"

#include <QString>
#include <cstdint>
#include <memory>
#include <optional>

namespace platform {

/// The common pickers the component's dialogs open from their browse buttons: colour,
/// file-open and folder. The process has one active service: Qt's dialogs unless a test or a
/// host installs another. Every picker returns nothing when the user cancels it.
class LUDMOX_EXPORT DialogService {
public:
    /// File-open flag: the chosen file must exist.
    static constexpr int32_t FileMustExist = 0x1000;
    /// File-open flag: no read-only check box (our pickers never show one).
    static constexpr int32_t HideReadOnly = 0x4;

    struct FileRequest {
        /// Native handle of the owner window; 0 for none.
        int32_t ownerWindow = 0;
        /// Empty: the picker's own title.
        QString title;
        /// Pairs of description and patterns separated by "|", patterns by ";":
        /// "Text files (*.txt)|*.txt|All files|*.*". Empty: every file.
        QString filter;
        QString initialDirectory;
        /// The file name proposed in the picker (a name, or a path).
        QString fileName;
        int32_t flags = 0;
    };

    virtual ~DialogService() = default;

    /// The colour picker, starting on initialColor (an OLE colour, 0x00BBGGRR or a system
    /// colour); the chosen colour as 0x00BBGGRR.
    virtual std::optional<int32_t> chooseColor(int32_t ownerWindow, int32_t initialColor) = 0;
    /// The file-open picker; the chosen file's path.
    virtual std::optional<QString> openFile(const FileRequest& request) = 0;
    /// The folder picker; the chosen folder's path.
    virtual std::optional<QString> chooseFolder(
        int32_t ownerWindow, const QString& title, const QString& initialFolder)
        = 0;

    /// The active service; never null.
    static std::shared_ptr<DialogService> active();
    /// Installs service as the active one; null restores Qt's dialogs.
    static void setActive(std::shared_ptr<DialogService> service);

protected:
    DialogService() = default;
    DialogService(const DialogService&) = default;
    DialogService& operator=(const DialogService&) = default;
};

} // namespace platform
