#include "viewer/windowembedding.h"

#include "platform/windowhandles.h"
#include "viewer/viewerlogging_p.h"

#include <QApplication>
#include <QGuiApplication>
#include <QWidget>
#include <cstdlib>
#include <xcb/xcb.h>

namespace viewer {

namespace {

WId toWId(int32_t handle)
{
    return static_cast<WId>(static_cast<uint32_t>(handle));
}

int32_t toHandle(WId id)
{
    return static_cast<int32_t>(static_cast<uint32_t>(id));
}

// Only X11 can wrap a window of another process; elsewhere a foreign window would either
// fail or stand for nothing, and the widget stays where it is.
bool canReachForeignWindows()
{
    return QGuiApplication::platformName() == QLatin1String("xcb");
}

// Whether the X server knows a window of that id (of any process); a widget moved into an
// id that names none would be lost.
bool isX11Window(WId id)
{
    const auto* x11 = qGuiApp->nativeInterface<QNativeInterface::QX11Application>();
    xcb_connection_t* connection = x11 ? x11->connection() : nullptr;
    if (!connection)
        return false;
    xcb_generic_error_t* error = nullptr;
    xcb_get_geometry_reply_t* reply = xcb_get_geometry_reply(
        connection, xcb_get_geometry(connection, static_cast<xcb_drawable_t>(id)), &error);
    const bool found = reply && !error;
    std::free(reply);
    std::free(error);
    return found;
}

} // namespace

WindowEmbedding::~WindowEmbedding()
{
    delete m_foreign.data();
}

QWidget* WindowEmbedding::findWidget(int32_t handle)
{
    QWindow* window = platform::WindowHandles::findWindow(handle);
    if (!window)
        return nullptr;
    const QWidgetList widgets = QApplication::allWidgets();
    for (QWidget* widget : widgets) {
        if (widget->windowHandle() == window)
            return widget;
    }
    return nullptr;
}

bool WindowEmbedding::embed(QWidget* widget, int32_t parent)
{
    if (!widget || parent == 0)
        return false;
    if (QWidget* host = findWidget(parent)) {
        if (host == widget || widget->isAncestorOf(host))
            return false;
        widget->setParent(host);
        widget->move(0, 0);
        widget->show();
        m_embedded = true;
        return true;
    }
    if (!canReachForeignWindows()) {
        qCWarning(lcViewer) << "window" << parent << "is not a window this process can reach";
        return false;
    }
    if (!isX11Window(toWId(parent))) {
        qCWarning(lcViewer) << "window" << parent << "is no window this process can reach";
        return false;
    }
    QWindow* foreign = QWindow::fromWinId(toWId(parent));
    if (!foreign)
        return false;
    delete m_foreign.data();
    m_foreign = foreign;
    // A top-level widget of its own, whose native window then moves into the host's.
    widget->setParent(nullptr);
    widget->winId();
    widget->windowHandle()->setParent(foreign);
    widget->move(0, 0);
    widget->show();
    widget->windowHandle()->requestActivate();
    m_embedded = true;
    return true;
}

void WindowEmbedding::restore(QWidget* widget, QWidget* home)
{
    if (!widget)
        return;
    if (m_embedded) {
        widget->hide();
        if (m_foreign && widget->windowHandle())
            widget->windowHandle()->setParent(nullptr);
        widget->setParent(home);
        widget->move(0, 0);
        widget->show();
    }
    delete m_foreign.data();
    m_embedded = false;
}

int32_t WindowEmbedding::setOwner(int32_t window, int32_t owner)
{
    QWindow* target = platform::WindowHandles::findWindow(window);
    if (!target)
        return 0;
    QWindow* previous = target->transientParent();
    const int32_t previousHandle = previous ? toHandle(previous->winId()) : 0;
    // A child window's owner is its parent window: only top-level windows take one.
    if (!target->isTopLevel())
        return previousHandle;
    QWindow* ownerWindow = nullptr;
    if (owner != 0) {
        ownerWindow = platform::WindowHandles::findWindow(owner);
        if (!ownerWindow && canReachForeignWindows()) {
            ownerWindow = QWindow::fromWinId(toWId(owner));
            // The foreign window only describes the owner; it goes with the owned window.
            if (ownerWindow)
                static_cast<QObject*>(ownerWindow)->setParent(target);
        }
        while (ownerWindow && ownerWindow->parent())
            ownerWindow = ownerWindow->parent();
        if (!ownerWindow || ownerWindow == target)
            return previousHandle;
    }
    target->setTransientParent(ownerWindow);
    return previousHandle;
}

} // namespace viewer
