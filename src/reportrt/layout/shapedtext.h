#pragma once

#include <QString>
#include <cstdint>
#include <vector>

namespace reportrt {

/// One line of text turned into glyphs, in twips from its origin on the baseline. Shared
/// between the pages that show the same text in the same font, and never changed once
/// made.
struct ShapedText {
    /// Glyphs [first, first + count) are in font (a FontTable number).
    struct Run {
        int font = 0;
        int first = 0;
        int count = 0;
    };

    QString source; // the text the glyphs show, for exports that write text
    std::vector<uint32_t> glyphs;
    /// Pen position of each glyph, and one more entry: the end of the last glyph, so the
    /// width of the first n glyphs is x[n].
    std::vector<float> x;
    /// Baseline offsets of marks placed by shaping; empty when every glyph sits on the
    /// baseline.
    std::vector<float> y;
    std::vector<Run> runs;

    double width() const { return x.empty() ? 0.0 : static_cast<double>(x.back()); }
    int glyphCount() const { return static_cast<int>(glyphs.size()); }
    /// How many leading glyphs end within width (twips).
    int fittingGlyphs(double width) const;
};

} // namespace reportrt
