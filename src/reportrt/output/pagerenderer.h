#pragma once

#include <QRawFont>
#include <vector>

class QPainter;

namespace reportrt {

class FontTable;
struct Page;

/// Paints laid-out pages. One renderer per painting thread: it keeps its own raw fonts.
///
/// All text of one font and colour on a page goes out as one glyph run: a PDF then holds
/// one text object per font instead of one per field, which is most of the export's speed.
class PageRenderer {
public:
    explicit PageRenderer(const FontTable& fonts);

    /// Paints page; painter's coordinates must be twips from the paper's top-left corner.
    void paint(QPainter& painter, const Page& page);

private:
    const QRawFont& rawFont(int font);

    const FontTable& m_fonts;
    std::vector<QRawFont> m_rawFonts;
    std::vector<bool> m_loaded;
};

} // namespace reportrt
