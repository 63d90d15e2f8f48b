#include "reportrt/layout/textshaper.h"

#include "reportrt/document/reportdocument.h"
#include "reportrt/layout/fonttable.h"

#include <QGlyphRun>
#include <QTextLayout>
#include <algorithm>

namespace reportrt {

namespace {

/// Characters below this are looked up directly; all of Latin, Greek, Cyrillic, general
/// punctuation and currency signs.
constexpr char16_t directLimit = 0x2200;

/// Whether the character can be drawn as its own glyph at its own advance: no combining
/// marks, no scripts that join or reorder, no surrogates.
bool isSimple(char16_t c)
{
    if (c < 0x0300)
        return true;
    if (c < 0x0370) // combining diacritical marks
        return false;
    if (c < 0x0483)
        return true;
    if (c < 0x048A) // Cyrillic combining marks
        return false;
    if (c < 0x0530)
        return true;
    if (c >= 0x1E00 && c < 0x2000)
        return true;
    if (c >= 0x2000 && c < directLimit)
        return c != 0x200C && c != 0x200D && !(c >= 0x202A && c <= 0x202E)
            && !(c >= 0x2066 && c <= 0x2069) && !(c >= 0x20D0 && c <= 0x20FF);
    return false;
}

bool isControl(char16_t c)
{
    return c < 0x20 || (c >= 0x7F && c < 0xA0) || c == 0x2028 || c == 0x2029;
}

QString singleLine(const QString& text)
{
    for (const QChar c : text) {
        if (isControl(c.unicode())) {
            QString copy = text;
            for (QChar& d : copy) {
                if (isControl(d.unicode()))
                    d = u' ';
            }
            return copy;
        }
    }
    return text;
}

} // namespace

struct TextShaper::FontData {
    int id = 0;
    QRawFont raw;
    QFont font;
    Metrics metrics;
    struct Glyph {
        uint32_t index = 0;
        float advance = 0;
        bool known = false;
    };
    std::vector<Glyph> direct = std::vector<Glyph>(directLimit);
    QHash<QString, std::shared_ptr<const ShapedText>> cache;
};

TextShaper::TextShaper(FontTable& fonts)
    : m_fonts(fonts)
{ }

TextShaper::~TextShaper() = default;

int TextShaper::font(const Font& font)
{
    const QString key = font.family + u'/' + QString::number(font.pointSize) + u'/'
        + QString::number(int(font.bold)) + QString::number(int(font.italic));
    const auto found = m_reportFonts.constFind(key);
    if (found != m_reportFonts.constEnd())
        return *found;
    const FontFace face = FontFace::forFont(font);
    const int id = m_fonts.add(face);
    m_reportFonts.insert(key, id);
    data(id);
    return id;
}

TextShaper::FontData& TextShaper::data(int font) const
{
    auto& slots = const_cast<std::vector<std::unique_ptr<FontData>>&>(m_data);
    if (font >= static_cast<int>(slots.size()))
        slots.resize(static_cast<size_t>(font) + 1);
    auto& slot = slots[static_cast<size_t>(font)];
    if (!slot) {
        slot = std::make_unique<FontData>();
        const FontFace face = m_fonts.face(font);
        slot->id = font;
        slot->font = face.font();
        slot->raw = face.rawFont();
        Metrics& m = slot->metrics;
        if (slot->raw.isValid()) {
            m.ascent = slot->raw.ascent();
            m.descent = slot->raw.descent();
            m.leading = slot->raw.leading();
            m.lineWidth = std::max(1.0, slot->raw.lineThickness());
            m.underlinePosition = slot->raw.underlinePosition();
        } else {
            // No font at all on the system: keep the geometry of a plain font so the
            // layout still works; nothing is drawn.
            m.ascent = face.pixelSize * 0.8;
            m.descent = face.pixelSize * 0.2;
            m.lineWidth = face.pixelSize / 20.0;
            m.underlinePosition = face.pixelSize / 10.0;
        }
    }
    return *slot;
}

const TextShaper::Metrics& TextShaper::metrics(int font) const
{
    return data(font).metrics;
}

std::shared_ptr<const ShapedText> TextShaper::shape(const QString& input, int font)
{
    FontData& d = data(font);
    const auto found = d.cache.constFind(input);
    if (found != d.cache.constEnd())
        return *found;
    const QString text = singleLine(input);
    std::shared_ptr<ShapedText> shaped = shapeSimple(text, d);
    if (!shaped)
        shaped = shapeComplex(text, d);
    shaped->source = text;
    if (d.cache.size() >= cacheLimit)
        d.cache.clear();
    d.cache.insert(input, shaped);
    return shaped;
}

std::shared_ptr<ShapedText> TextShaper::shapeSimple(const QString& text, FontData& d)
{
    if (!d.raw.isValid())
        return std::make_shared<ShapedText>();
    const qsizetype n = text.size();
    auto shaped = std::make_shared<ShapedText>();
    shaped->glyphs.resize(static_cast<size_t>(n));
    shaped->x.resize(static_cast<size_t>(n) + 1);
    float x = 0;
    for (qsizetype i = 0; i < n; ++i) {
        const char16_t c = text.at(i).unicode();
        if (!isSimple(c))
            return nullptr;
        FontData::Glyph& g = d.direct[c];
        if (!g.known) {
            const QChar ch(c);
            quint32 index = 0;
            int count = 1;
            if (d.raw.glyphIndexesForChars(&ch, 1, &index, &count) && count == 1) {
                g.index = index;
                const QList<QPointF> advances
                    = d.raw.advancesForGlyphIndexes(QList<quint32> { index });
                g.advance = advances.isEmpty() ? 0.0f : static_cast<float>(advances.front().x());
            }
            g.known = true;
        }
        // A character the font lacks needs a fallback font: the complex path finds one.
        if (g.index == 0 && c != u' ')
            return nullptr;
        shaped->glyphs[static_cast<size_t>(i)] = g.index;
        shaped->x[static_cast<size_t>(i)] = x;
        x += g.advance;
    }
    shaped->x[static_cast<size_t>(n)] = x;
    if (n > 0)
        shaped->runs.push_back({ d.id, 0, static_cast<int>(n) });
    return shaped;
}

std::shared_ptr<ShapedText> TextShaper::shapeComplex(const QString& text, FontData& d)
{
    auto shaped = std::make_shared<ShapedText>();
    QTextLayout layout(text, d.font);
    QTextOption option;
    option.setWrapMode(QTextOption::NoWrap);
    layout.setTextOption(option);
    layout.beginLayout();
    QTextLine line = layout.createLine();
    layout.endLayout();
    if (!line.isValid()) {
        shaped->x.push_back(0);
        return shaped;
    }
    const qreal baseline = line.ascent();
    bool offBaseline = false;
    std::vector<float> ys;
    for (const QGlyphRun& run : line.glyphRuns()) {
        const QList<quint32> indexes = run.glyphIndexes();
        const QList<QPointF> positions = run.positions();
        if (indexes.isEmpty())
            continue;
        const int font = m_fonts.add(FontFace::forRawFont(run.rawFont()));
        shaped->runs.push_back(
            { font, static_cast<int>(shaped->glyphs.size()), static_cast<int>(indexes.size()) });
        for (qsizetype i = 0; i < indexes.size(); ++i) {
            shaped->glyphs.push_back(indexes[i]);
            shaped->x.push_back(static_cast<float>(positions[i].x()));
            const float y = static_cast<float>(positions[i].y() - baseline);
            offBaseline = offBaseline || std::abs(y) > 0.01f;
            ys.push_back(y);
        }
    }
    shaped->x.push_back(static_cast<float>(line.naturalTextWidth()));
    if (offBaseline)
        shaped->y = std::move(ys);
    return shaped;
}

std::vector<QString> TextShaper::wrap(const QString& text, int font, double width)
{
    std::vector<QString> lines;
    const double limit = width + 0.5; // as ShapedText::fittingGlyphs
    const QStringList paragraphs
        = QString(text).replace(QStringLiteral("\r\n"), QStringLiteral("\n")).split(u'\n');
    for (const QString& paragraphText : paragraphs) {
        const QString paragraph = singleLine(paragraphText);
        if (paragraph.trimmed().isEmpty()) {
            lines.emplace_back();
            continue;
        }
        const auto shaped = shape(paragraph, font);
        if (shaped->glyphCount() == paragraph.size() && shaped->y.empty()) {
            // One glyph per character: break on the pen positions, in one pass.
            const auto& x = shaped->x;
            const qsizetype n = paragraph.size();
            qsizetype i = 0;
            while (i < n) {
                while (i < n && paragraph.at(i) == u' ')
                    ++i;
                if (i >= n)
                    break;
                const qsizetype start = i;
                qsizetype lastSpace = -1;
                qsizetype j = start;
                while (j < n) {
                    if (paragraph.at(j) == u' ')
                        lastSpace = j;
                    if (x[static_cast<size_t>(j) + 1] - x[static_cast<size_t>(start)] > limit)
                        break;
                    ++j;
                }
                if (j == n) {
                    lines.push_back(paragraph.mid(start).trimmed());
                    break;
                }
                if (lastSpace > start) {
                    lines.push_back(paragraph.mid(start, lastSpace - start).trimmed());
                    i = lastSpace + 1;
                } else {
                    // A word wider than the line is broken where it must be.
                    const qsizetype take = std::max<qsizetype>(1, j - start);
                    lines.push_back(paragraph.mid(start, take));
                    i = start + take;
                }
            }
            continue;
        }
        // Shaped text: measure whole candidate lines, since glyphs and characters do not
        // match one to one.
        QString line;
        for (const QString& word : paragraph.split(u' ', Qt::SkipEmptyParts)) {
            const QString candidate = line.isEmpty() ? word : line + u' ' + word;
            if (line.isEmpty() || shape(candidate, font)->width() <= limit) {
                line = candidate;
                continue;
            }
            lines.push_back(line);
            line = word;
        }
        if (!line.isEmpty())
            lines.push_back(line);
    }
    return lines;
}

} // namespace reportrt
