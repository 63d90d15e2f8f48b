#include "reportrt/output/pagerenderer.h"

#include "reportrt/layout/fonttable.h"
#include "reportrt/layout/page.h"

#include <QGlyphRun>
#include <QPainter>
#include <cmath>

namespace reportrt {

PageRenderer::PageRenderer(const FontTable& fonts)
    : m_fonts(fonts)
{ }

const QRawFont& PageRenderer::rawFont(int font)
{
    const auto index = static_cast<size_t>(font);
    if (index >= m_rawFonts.size()) {
        m_rawFonts.resize(index + 1);
        m_loaded.resize(index + 1);
    }
    if (!m_loaded[index]) {
        m_rawFonts[index] = m_fonts.face(font).rawFont();
        m_loaded[index] = true;
    }
    return m_rawFonts[index];
}

void PageRenderer::paint(QPainter& painter, const Page& page)
{
    painter.save();
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setRenderHint(QPainter::SmoothPixmapTransform);

    painter.setPen(Qt::NoPen);
    for (const Page::Box& box : page.boxes) {
        if (box.filled)
            painter.fillRect(box.rect, QColor::fromRgba(box.fill));
    }
    for (const Page::Picture& picture : page.pictures) {
        painter.save();
        painter.setClipRect(picture.clip);
        painter.drawImage(picture.target, picture.image);
        painter.restore();
    }

    painter.setBrush(Qt::NoBrush);
    for (const Page::Box& box : page.boxes) {
        if (box.lineWidth <= 0)
            continue;
        QPen pen(QColor::fromRgba(box.lineColor), box.lineWidth);
        pen.setJoinStyle(Qt::MiterJoin);
        painter.setPen(pen);
        // The frame lies inside the box, as the designer drew it.
        const double inset = box.lineWidth / 2;
        painter.drawRect(box.rect.adjusted(inset, inset, -inset, -inset));
    }
    for (const Page::Line& line : page.lines) {
        QPen pen(QColor::fromRgba(line.color), line.width);
        pen.setCapStyle(Qt::FlatCap);
        painter.setPen(pen);
        painter.drawLine(line.from, line.to);
    }
    for (const Page::Text& text : page.texts) {
        if (!text.underline || text.glyphCount == 0)
            continue;
        QPen pen(QColor::fromRgba(text.color), text.underlineWidth);
        pen.setCapStyle(Qt::FlatCap);
        painter.setPen(pen);
        const double y = text.origin.y() + text.underlineY;
        const double end = text.text->x[static_cast<size_t>(text.glyphCount)];
        painter.drawLine(QPointF(text.origin.x(), y), QPointF(text.origin.x() + end, y));
    }

    // One glyph run per font and colour.
    struct Batch {
        int font;
        QRgb color;
        QList<quint32> glyphs;
        QList<QPointF> positions;
    };
    std::vector<Batch> batches;
    for (const Page::Text& text : page.texts) {
        const ShapedText& shaped = *text.text;
        for (const ShapedText::Run& run : shaped.runs) {
            const int end = std::min(run.first + run.count, text.glyphCount);
            if (end <= run.first)
                continue;
            Batch* batch = nullptr;
            for (Batch& b : batches) {
                if (b.font == run.font && b.color == text.color) {
                    batch = &b;
                    break;
                }
            }
            if (!batch) {
                batches.push_back({ run.font, text.color, {}, {} });
                batch = &batches.back();
            }
            // Whole twips (1/1440 inch) are finer than any printer's dots, and a PDF writes
            // them in a third fewer characters than fractions: less to write and compress.
            for (int i = run.first; i < end; ++i) {
                const auto g = static_cast<size_t>(i);
                batch->glyphs.append(shaped.glyphs[g]);
                batch->positions.append(QPointF(std::round(text.origin.x() + shaped.x[g]),
                    std::round(text.origin.y() + (shaped.y.empty() ? 0.0f : shaped.y[g]))));
            }
        }
    }
    for (Batch& batch : batches) {
        const QRawFont& font = rawFont(batch.font);
        if (!font.isValid())
            continue;
        QGlyphRun run;
        run.setRawFont(font);
        run.setGlyphIndexes(batch.glyphs);
        run.setPositions(batch.positions);
        painter.setPen(QColor::fromRgba(batch.color));
        painter.drawGlyphRun(QPointF(0, 0), run);
    }
    painter.restore();
}

} // namespace reportrt
