#include "platform/messageboxservice.h"

#include "platform/windowhandles.h"

#include <QCoreApplication>
#include <QMessageBox>
#include <utility>
#include <vector>

namespace platform {

namespace {

std::shared_ptr<MessageBoxService>& activeService()
{
    static std::shared_ptr<MessageBoxService> service;
    return service;
}

struct ButtonSet {
    std::vector<std::pair<QMessageBox::StandardButton, int32_t>> buttons;
    /// What closing the box without a button answers.
    int32_t escape;
};

ButtonSet buttonSet(int32_t buttons)
{
    using M = MessageBoxService;
    switch (buttons & 0xF) {
    case M::OKCancel:
        return { { { QMessageBox::Ok, M::OK }, { QMessageBox::Cancel, M::Cancel } }, M::Cancel };
    case M::AbortRetryIgnore:
        return { { { QMessageBox::Abort, M::Abort }, { QMessageBox::Retry, M::Retry },
                     { QMessageBox::Ignore, M::Ignore } },
            M::Abort };
    case M::YesNoCancel:
        return { { { QMessageBox::Yes, M::Yes }, { QMessageBox::No, M::No },
                     { QMessageBox::Cancel, M::Cancel } },
            M::Cancel };
    case M::YesNo:
        return { { { QMessageBox::Yes, M::Yes }, { QMessageBox::No, M::No } }, M::Yes };
    case M::RetryCancel:
        return { { { QMessageBox::Retry, M::Retry }, { QMessageBox::Cancel, M::Cancel } },
            M::Cancel };
    default:
        return { { { QMessageBox::Ok, M::OK } }, M::OK };
    }
}

QMessageBox::Icon icon(int32_t buttons)
{
    switch (buttons & 0x70) {
    case MessageBoxService::Critical:
        return QMessageBox::Critical;
    case MessageBoxService::Question:
        return QMessageBox::Question;
    case MessageBoxService::Exclamation:
        return QMessageBox::Warning;
    case MessageBoxService::Information:
        return QMessageBox::Information;
    default:
        return QMessageBox::NoIcon;
    }
}

} // namespace

std::shared_ptr<MessageBoxService> MessageBoxService::active()
{
    std::shared_ptr<MessageBoxService>& service = activeService();
    if (!service)
        service = std::make_shared<QtMessageBoxService>();
    return service;
}

void MessageBoxService::setActive(std::shared_ptr<MessageBoxService> service)
{
    activeService() = std::move(service);
}

int32_t QtMessageBoxService::showMessage(
    int32_t ownerWindow, const QString& text, int32_t buttons, const QString& title)
{
    QMessageBox box;
    box.setText(text);
    box.setIcon(icon(buttons));
    box.setWindowTitle(title.isEmpty() ? QCoreApplication::applicationName() : title);
    const ButtonSet set = buttonSet(buttons);
    for (const auto& [standard, answer] : set.buttons)
        box.addButton(standard);
    WindowHandles::setOwner(&box, ownerWindow);
    box.exec();
    const auto pressed = box.standardButton(box.clickedButton());
    for (const auto& [standard, answer] : set.buttons) {
        if (standard == pressed)
            return answer;
    }
    return set.escape;
}

} // namespace platform
