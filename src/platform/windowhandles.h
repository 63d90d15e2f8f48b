#pragma once

#include "core/ludmoxexport.h"

#include <cstdint>

class QWidget;
class QWindow;

namespace platform {

/// Native window handles as hosts pass them: 32-bit Long values of the windowing system's
/// window id (WId). X11 ids fit; ids of other systems are cut to their low 32 bits.
class LUDMOX_EXPORT WindowHandles {
public:
    /// The handle of the top-level window that shows widget, creating its native window when
    /// needed; 0 for null.
    static int32_t handle(QWidget* widget);
    static int32_t handle(QWindow* window);

    /// The window of this process with that handle, or null. Never creates a window.
    static QWindow* findWindow(int32_t handle);
    /// The top-level widget of this process shown in the window with that handle, or null.
    static QWidget* findWidget(int32_t handle);

    /// Makes the window with handle owner the transient parent of widget's top-level window,
    /// so it stays above its owner and opens centred on it. A window of another process is
    /// reached through a foreign window that widget owns. Returns false, changing nothing,
    /// for handle 0 or a window the platform cannot reach.
    static bool setOwner(QWidget* widget, int32_t owner);
};

} // namespace platform
