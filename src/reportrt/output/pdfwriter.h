#pragma once

#include <QString>
#include <memory>

class QIODevice;

namespace reportrt {

class FontTable;
struct Page;

/// Writes laid-out pages as a PDF document, page by page, straight from the page model.
///
/// Coordinates stay in twips (one transformation per page maps them to points), text is
/// written as runs of glyph numbers of the faces the layout shaped with, positioned by the
/// faces' own advance widths with a correction only where shaping placed a glyph
/// elsewhere, and each face is embedded once at the end, cut down to the glyphs the
/// document used, with a map back to Unicode so readers can search and copy the text (a
/// face without TrueType outlines, a Type 1 face say, is embedded as fonts of its glyphs'
/// outlines).
/// Identical pictures are stored once. Pages go to the device as they are written; only
/// the fonts, the page list and the cross-reference table wait for finish().
///
/// Every method runs on the thread that made the writer (fonts are opened there).
class PdfWriter {
public:
    /// device and fonts are not owned and must outlive the writer; device is open for
    /// writing and empty.
    PdfWriter(QIODevice& device, const FontTable& fonts);
    ~PdfWriter();
    PdfWriter(const PdfWriter&) = delete;
    PdfWriter& operator=(const PdfWriter&) = delete;

    void setTitle(const QString& title);
    /// Writes one page. False when the device took fewer bytes than it was given (then
    /// error() says why and the document is unusable).
    bool addPage(const Page& page);
    /// Writes the fonts, the page tree, the cross-reference table and the trailer.
    bool finish();
    QString error() const;

private:
    struct Private;
    std::unique_ptr<Private> d;
};

} // namespace reportrt
