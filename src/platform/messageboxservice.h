#pragma once

#include "core/ludmoxexport.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace platform {

/// Message boxes as Basic's MsgBox shows them. The process has one active service: Qt's
/// message boxes unless a test or a host installs another.
class LUDMOX_EXPORT MessageBoxService {
public:
    /// Button sets (the low four bits of `buttons`).
    enum Buttons : int32_t {
        OKOnly = 0,
        OKCancel = 1,
        AbortRetryIgnore = 2,
        YesNoCancel = 3,
        YesNo = 4,
        RetryCancel = 5,
    };
    /// Icons (or-ed into `buttons`).
    enum Icon : int32_t { Critical = 16, Question = 32, Exclamation = 48, Information = 64 };
    /// The button the user pressed.
    enum Answer : int32_t { OK = 1, Cancel = 2, Abort = 3, Retry = 4, Ignore = 5, Yes = 6, No = 7 };

    virtual ~MessageBoxService() = default;

    /// Shows `text` modally with the given buttons and icon and returns the button pressed;
    /// closing the box answers Cancel where there is one, else the only or first button.
    /// An empty title shows the application's name. ownerWindow 0: no owner.
    virtual int32_t showMessage(
        int32_t ownerWindow, const QString& text, int32_t buttons, const QString& title)
        = 0;

    /// The active service; never null.
    static std::shared_ptr<MessageBoxService> active();
    /// Installs service as the active one; null restores Qt's message boxes.
    static void setActive(std::shared_ptr<MessageBoxService> service);

protected:
    MessageBoxService() = default;
    MessageBoxService(const MessageBoxService&) = default;
    MessageBoxService& operator=(const MessageBoxService&) = default;
};

/// The message boxes of the desktop session: QMessageBox.
class LUDMOX_EXPORT QtMessageBoxService : public MessageBoxService {
public:
    int32_t showMessage(
        int32_t ownerWindow, const QString& text, int32_t buttons, const QString& title) override;
};

} // namespace platform
