#include "reportrt/layout/shapedtext.h"

#include <algorithm>

namespace reportrt {

int ShapedText::fittingGlyphs(double width) const
{
    if (glyphs.empty())
        return 0;
    // A glyph may end a hair past the box from rounding of the advances.
    const float limit = static_cast<float>(width) + 0.5f;
    if (x.back() <= limit)
        return glyphCount();
    const auto end = std::upper_bound(x.begin() + 1, x.end(), limit);
    return static_cast<int>(end - (x.begin() + 1));
}

} // namespace reportrt
