#pragma once

#include <QPointer>
#include <QWindow>
#include <cstdint>

class QWidget;

namespace viewer {

/// Moves a widget into a window given by its handle and back: the SetParent and owner-slot
/// operations of the viewer window, on Qt windows. A handle of this process (a widget's
/// window, or a native child window) re-parents the widget as a child widget; another handle
/// is embedded through a foreign window where the platform reaches one (X11). One object per
/// widget that moves; not copyable.
class WindowEmbedding {
public:
    WindowEmbedding() = default;
    ~WindowEmbedding();
    WindowEmbedding(const WindowEmbedding&) = delete;
    WindowEmbedding& operator=(const WindowEmbedding&) = delete;

    /// Makes the window `parent` the parent of widget, shown at its top left. Returns false,
    /// changing nothing, for handle 0 or a window this process cannot reach.
    bool embed(QWidget* widget, int32_t parent);
    /// Puts widget back as a hidden child of home, whatever embed did.
    void restore(QWidget* widget, QWidget* home);
    bool isEmbedded() const { return m_embedded; }

    /// Sets the owner (transient parent) of the window `window` to the window `owner` and
    /// returns the previous owner's handle; 0 and no change when `window` is not a window
    /// of this process. Owner 0 clears it.
    static int32_t setOwner(int32_t window, int32_t owner);
    /// The widget of this process shown in the native window with that handle, or null.
    static QWidget* findWidget(int32_t handle);

private:
    QPointer<QWindow> m_foreign;
    bool m_embedded = false;
};

} // namespace viewer
