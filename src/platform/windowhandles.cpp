#include "platform/windowhandles.h"

#include <QApplication>
#include <QWidget>
#include <QWindow>

namespace platform {

namespace {

int32_t toHandle(WId id)
{
    return static_cast<int32_t>(static_cast<uint32_t>(id));
}

} // namespace

int32_t WindowHandles::handle(QWidget* widget)
{
    if (!widget)
        return 0;
    return toHandle(widget->window()->winId());
}

int32_t WindowHandles::handle(QWindow* window)
{
    if (!window)
        return 0;
    return toHandle(window->winId());
}

QWindow* WindowHandles::findWindow(int32_t handle)
{
    if (handle == 0 || !qGuiApp)
        return nullptr;
    const QWindowList windows = QGuiApplication::allWindows();
    for (QWindow* window : windows) {
        // Only windows that already have a native window: winId() would create one.
        if (window->handle() && toHandle(window->winId()) == handle)
            return window;
    }
    return nullptr;
}

QWidget* WindowHandles::findWidget(int32_t handle)
{
    QWindow* window = findWindow(handle);
    if (!window)
        return nullptr;
    const QWidgetList widgets = QApplication::topLevelWidgets();
    for (QWidget* widget : widgets) {
        if (widget->windowHandle() == window)
            return widget;
    }
    return nullptr;
}

bool WindowHandles::setOwner(QWidget* widget, int32_t owner)
{
    if (!widget || owner == 0)
        return false;
    QWidget* top = widget->window();
    QWindow* ownerWindow = findWindow(owner);
    if (!ownerWindow) {
        ownerWindow = QWindow::fromWinId(static_cast<WId>(static_cast<uint32_t>(owner)));
        if (!ownerWindow)
            return false;
        // The foreign window only describes the host's window; it goes with the widget.
        static_cast<QObject*>(ownerWindow)->setParent(top);
    }
    if (ownerWindow == top->windowHandle())
        return false;
    top->winId();
    top->windowHandle()->setTransientParent(ownerWindow);
    return true;
}

} // namespace platform
