#pragma once

#include <QRect>
#include <QSize>

namespace dialogs {

/// The memo editor's controls for a client area of `inner` twips.
struct EditorGeometry {
    QRect memo;
    QRect ok;
    QRect cancel;
};

/// The smallest editor window, in twips.
constexpr QSize EditorMinimumSize(3285, 1800);

/// Places the text box 105 twips from the edges above a row of two 1095 x 345 buttons that
/// end 105 twips from the right edge, 105 apart. `twipsPerPixelY` is the one-pixel nudge the
/// row gets so that it lines up with the text box's bottom edge.
EditorGeometry editorGeometry(const QSize& inner, int twipsPerPixelY);

/// The window rectangle (twips) for a stored position and size on a screen of `screen`
/// twips: a size larger than the screen becomes the screen's, a smaller one at least the
/// minimum; a window that would end beyond the right or bottom edge is moved back to end at
/// it.
QRect placeEditorWindow(const QRect& stored, const QSize& screen);

} // namespace dialogs
