#include "platform/display.h"

#include <QApplication>
#include <QString>
#include <utility>

namespace platform {

namespace {

std::optional<bool>& interactiveOverride()
{
    static std::optional<bool> value;
    return value;
}

} // namespace

bool Display::isInteractive()
{
    if (const std::optional<bool> overridden = interactiveOverride())
        return *overridden;
    if (!qobject_cast<QApplication*>(QCoreApplication::instance()))
        return false;
    const QString platform = QGuiApplication::platformName();
    if (platform == u"offscreen" || platform == u"minimal" || platform == u"minimalegl")
        return false;
    return !qEnvironmentVariableIsEmpty("DISPLAY")
        || !qEnvironmentVariableIsEmpty("WAYLAND_DISPLAY");
}

std::optional<bool> Display::setInteractiveOverride(std::optional<bool> interactive)
{
    return std::exchange(interactiveOverride(), interactive);
}

} // namespace platform
