#include "dialogs/editorlayout.h"

#include <algorithm>

namespace dialogs {

namespace {
constexpr int Gap = 105;
constexpr int ButtonWidth = 1095;
constexpr int ButtonHeight = 345;
} // namespace

EditorGeometry editorGeometry(const QSize& inner, int twipsPerPixelY)
{
    const int width = std::max(inner.width(), EditorMinimumSize.width());
    const int height = std::max(inner.height(), EditorMinimumSize.height());
    EditorGeometry g;
    g.memo = QRect(Gap, Gap, width - 2 * Gap, height - 3 * Gap - ButtonHeight - twipsPerPixelY);
    const int buttonTop = height - Gap - ButtonHeight + twipsPerPixelY;
    g.ok = QRect(width - 2 * Gap - 2 * ButtonWidth, buttonTop, ButtonWidth, ButtonHeight);
    g.cancel = QRect(width - Gap - ButtonWidth, buttonTop, ButtonWidth, ButtonHeight);
    return g;
}

QRect placeEditorWindow(const QRect& stored, const QSize& screen)
{
    const auto fit = [](int size, int screenSize, int minimum) {
        return size > screenSize ? screenSize : std::max(size, minimum);
    };
    const int width = fit(stored.width(), screen.width(), EditorMinimumSize.width());
    const int height = fit(stored.height(), screen.height(), EditorMinimumSize.height());
    int left = stored.left();
    int top = stored.top();
    if (left + width > screen.width())
        left = screen.width() - width;
    if (top + height > screen.height())
        top = screen.height() - height;
    return QRect(left, top, width, height);
}

} // namespace dialogs
