#pragma once

#include "reportrt/layout/shapedtext.h"

#include <QHash>
#include <QString>
#include <memory>
#include <vector>

namespace reportrt {

class FontTable;
struct Font;

/// Turns text into glyphs and measures it, for one layout thread.
///
/// Most report text is Latin, Greek or Cyrillic without combining marks: those strings are
/// mapped character by character through a per-font table of glyphs and advances, without
/// calling the text shaper. Anything else (other scripts, marks, characters the font lacks)
/// goes through QTextLayout, which shapes it and picks fallback fonts. Results are kept per
/// string and font, so repeated texts (names, dates, headings) are shaped once. No kerning:
/// a report's columns line up the same whatever the text.
class TextShaper {
public:
    struct Metrics {
        double ascent = 0; // twips
        double descent = 0;
        double leading = 0;
        double lineHeight() const { return ascent + descent + leading; }
        double underlinePosition = 0; // below the baseline
        double lineWidth = 0; // of underlines
    };

    explicit TextShaper(FontTable& fonts);
    ~TextShaper();
    TextShaper(const TextShaper&) = delete;
    TextShaper& operator=(const TextShaper&) = delete;

    /// The FontTable number of a report font.
    int font(const Font& font);
    const Metrics& metrics(int font) const;

    /// One line: control characters (line breaks, tabs) count as spaces.
    std::shared_ptr<const ShapedText> shape(const QString& text, int font);

    /// The lines of text wrapped at width (twips): at spaces, and inside a word only when
    /// the word alone is wider than a line. Line breaks in the text start new lines.
    std::vector<QString> wrap(const QString& text, int font, double width);

    /// Shaped texts are kept up to this many per font, then forgotten all at once.
    static constexpr int cacheLimit = 8192;

private:
    struct FontData;
    FontData& data(int font) const;
    std::shared_ptr<ShapedText> shapeSimple(const QString& text, FontData& data);
    std::shared_ptr<ShapedText> shapeComplex(const QString& text, FontData& data);

    FontTable& m_fonts;
    std::vector<std::unique_ptr<FontData>> m_data; // by font number; null for faces of others
    QHash<QString, int> m_reportFonts; // key of a report font -> font number
};

} // namespace reportrt
