#include "reportrt/output/pdfwriter.h"

#include "reportrt/layout/fonttable.h"
#include "reportrt/layout/page.h"
#include "reportrt/output/fontprogram.h"

#include <QDateTime>
#include <QHash>
#include <QIODevice>
#include <QPainterPath>
#include <QRawFont>
#include <algorithm>
#include <charconv>
#include <cmath>
#include <initializer_list>
#include <map>
#include <vector>

namespace reportrt {

namespace {
// Fast enough levels: content streams are written once and mostly text; the best level
// costs several times the CPU for a few percent of size.
constexpr int contentLevel = 1;
constexpr int fontLevel = 6;
constexpr qsizetype flushSize = 1 << 20;

void appendNumber(QByteArray& out, double value)
{
    char buffer[32];
    const double rounded = std::round(value);
    std::to_chars_result result;
    if (std::abs(value - rounded) < 0.0005 && std::abs(rounded) < 1e15) {
        result = std::to_chars(buffer, buffer + sizeof buffer, static_cast<long long>(rounded));
    } else {
        result = std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::fixed, 3);
        while (result.ptr[-1] == '0')
            --result.ptr;
        if (result.ptr[-1] == '.')
            --result.ptr;
    }
    out.append(buffer, result.ptr - buffer);
}

// Numbers separated by spaces, and one after the last: "x y w h ".
void appendNumbers(QByteArray& out, std::initializer_list<double> values)
{
    for (const double value : values) {
        appendNumber(out, value);
        out.append(' ');
    }
}

void appendHex4(QByteArray& out, uint32_t value)
{
    static const char digits[] = "0123456789ABCDEF";
    const char hex[4] = { digits[(value >> 12) & 15], digits[(value >> 8) & 15],
        digits[(value >> 4) & 15], digits[value & 15] };
    out.append(hex, 4);
}

void appendHex2(QByteArray& out, uint32_t value)
{
    static const char digits[] = "0123456789ABCDEF";
    const char hex[2] = { digits[(value >> 4) & 15], digits[value & 15] };
    out.append(hex, 2);
}

void appendColor(QByteArray& out, QRgb color, const char* op)
{
    appendNumber(out, qRed(color) / 255.0);
    out.append(' ');
    appendNumber(out, qGreen(color) / 255.0);
    out.append(' ');
    appendNumber(out, qBlue(color) / 255.0);
    out.append(' ');
    out.append(op);
    out.append('\n');
}

QByteArray deflate(const QByteArray& data, int level)
{
    // qCompress puts the length in front of the zlib stream; FlateDecode wants the stream.
    return qCompress(data, level).mid(4);
}

QByteArray utf16Hex(const QString& text)
{
    QByteArray out = "<FEFF";
    for (const QChar c : text)
        appendHex4(out, c.unicode());
    out.append('>');
    return out;
}

// A PostScript name: letters and digits of the family, the style after a hyphen.
QByteArray postScriptName(const FontFace& face)
{
    QByteArray name;
    const auto add = [&name](const QString& text) {
        for (const QChar c : text) {
            if (c.unicode() < 128 && c.isLetterOrNumber())
                name.append(char(c.unicode()));
        }
    };
    add(face.family);
    if (!face.styleName.isEmpty() && face.styleName != u"Regular" && face.styleName != u"Book") {
        name.append('-');
        add(face.styleName);
    }
    return name.isEmpty() ? QByteArray("Font") : name;
}

// A ToUnicode map of codes of digits hex digits to the text they show.
QByteArray toUnicodeMap(const std::map<uint32_t, QString>& byCode, int digits)
{
    QByteArray cmap = "/CIDInit /ProcSet findresource begin\n12 dict begin\nbegincmap\n"
                      "/CIDSystemInfo << /Registry (Adobe) /Ordering (UCS) /Supplement 0 >> def\n"
                      "/CMapName /Adobe-Identity-UCS def\n/CMapType 2 def\n1 begincodespacerange\n";
    cmap += digits == 2 ? "<00> <FF>\n" : "<0000> <FFFF>\n";
    cmap += "endcodespacerange\n";
    auto entry = byCode.begin();
    while (entry != byCode.end()) {
        QByteArray block;
        int n = 0;
        for (; entry != byCode.end() && n < 100; ++entry, ++n) {
            block.append('<');
            if (digits == 2)
                appendHex2(block, entry->first);
            else
                appendHex4(block, entry->first);
            block.append("> <");
            for (const QChar ch : entry->second)
                appendHex4(block, ch.unicode());
            block.append(">\n");
        }
        cmap += QByteArray::number(n) + " beginbfchar\n" + block + "endbfchar\n";
    }
    cmap += "endcmap\nCMapName currentdict /CMap defineresource pop\nend\nend\n";
    return cmap;
}

// A glyph's outline as PDF path operators in glyph space (1000 units to the em, y up).
QByteArray outlineOperators(const QPainterPath& path)
{
    QByteArray out;
    for (int i = 0; i < path.elementCount(); ++i) {
        const QPainterPath::Element e = path.elementAt(i);
        const auto point = [&out](const QPainterPath::Element& p) {
            appendNumber(out, p.x);
            out.append(' ');
            appendNumber(out, -p.y);
            out.append(' ');
        };
        if (e.isMoveTo()) {
            if (i > 0)
                out.append("h\n");
            point(e);
            out.append("m\n");
        } else if (e.isLineTo()) {
            point(e);
            out.append("l\n");
        } else if (e.isCurveTo() && i + 2 < path.elementCount()) {
            point(e);
            point(path.elementAt(i + 1));
            point(path.elementAt(i + 2));
            out.append("c\n");
            i += 2;
        }
    }
    if (!out.isEmpty())
        out.append("h f\n");
    return out;
}

struct UsedFont {
    bool known = false;
    int object = 0; // the Type0 font
    std::vector<bool> glyphs;
    std::map<uint32_t, QString> text; // what each glyph shows, for the ToUnicode map
    bool needsReverseMap = false;
    // A face whose program cannot be embedded (a Type 1 face, say) is drawn from its glyph
    // outlines: Type 3 fonts of up to 256 glyphs each, codes given in the order of first use.
    bool outlines = false;
    std::vector<int> outlineFonts; // by 256 codes
    std::map<uint32_t, int> codes; // glyph -> code (256 per font)
    std::vector<uint32_t> glyphOfCode;
};

struct Image {
    int object = 0;
    int index = 0;
};
} // namespace

struct PdfWriter::Private {
    QIODevice& device;
    const FontTable& fonts;
    QString title;
    QString error;
    QByteArray out;
    qint64 written = 0;
    std::vector<qint64> offsets { 0 }; // by object number; 0 is the free head
    std::vector<int> pages;
    // One embedded font per face whatever sizes it is used at: by slot, and the slot of
    // each font table number.
    std::map<int, UsedFont> usedFonts;
    std::vector<FontFace> slotFaces;
    std::vector<int> slotOfFont;
    QHash<qint64, Image> images; // by QImage::cacheKey()
    std::map<int, int> alphaStates; // alpha -> object
    QByteArray content;
    std::vector<QRawFont> rawFonts;
    std::vector<std::vector<int>> advanceCache; // per font: design advances, -1 unknown
    std::vector<int> unitsPerEm;

    static constexpr int catalog = 1;
    static constexpr int pageTree = 2;
    static constexpr int resources = 3;
    static constexpr int info = 4;

    Private(QIODevice& d, const FontTable& f)
        : device(d)
        , fonts(f)
    {
        offsets.resize(5, 0);
    }

    qint64 position() const { return written + out.size(); }
    int allocate()
    {
        offsets.push_back(0);
        return static_cast<int>(offsets.size() - 1);
    }
    void begin(int object)
    {
        offsets[static_cast<size_t>(object)] = position();
        appendNumber(out, object);
        out.append(" 0 obj\n");
    }
    void end() { out.append("endobj\n"); }
    bool flush()
    {
        if (out.isEmpty())
            return error.isEmpty();
        const qint64 n = device.write(out);
        if (n != out.size()) {
            if (error.isEmpty())
                error = device.errorString().isEmpty()
                    ? QStringLiteral("the file took no more data")
                    : device.errorString();
            out.clear();
            return false;
        }
        written += n;
        out.resize(0);
        return error.isEmpty();
    }
    bool maybeFlush() { return out.size() < flushSize || flush(); }
    void stream(int object, const QByteArray& data, const QByteArray& dictionary)
    {
        begin(object);
        out.append("<< ");
        out.append(dictionary);
        out.append(" /Length ");
        appendNumber(out, static_cast<double>(data.size()));
        out.append(" >>\nstream\n");
        out.append(data);
        out.append("\nendstream\n");
        end();
    }

    const QRawFont& rawFont(int font)
    {
        const auto index = static_cast<size_t>(font);
        if (index >= rawFonts.size()) {
            rawFonts.resize(index + 1);
            advanceCache.resize(index + 1);
            unitsPerEm.resize(index + 1, 0);
        }
        if (unitsPerEm[index] == 0) {
            rawFonts[index] = fonts.face(font).rawFont();
            unitsPerEm[index] = std::max(1, static_cast<int>(rawFonts[index].unitsPerEm()));
        }
        return rawFonts[index];
    }
    // The advance of a glyph in twips at size, as the PDF reader will place it.
    double advance(int font, uint32_t glyph, double size)
    {
        const QRawFont& raw = rawFont(font);
        std::vector<int>& cache = advanceCache[static_cast<size_t>(font)];
        if (glyph >= cache.size())
            cache.resize(glyph + 1, -1);
        if (cache[glyph] < 0) {
            // At the em size, advances are the design units.
            QRawFont design = raw;
            design.setPixelSize(unitsPerEm[static_cast<size_t>(font)]);
            const QList<QPointF> a = design.advancesForGlyphIndexes(QList<quint32> { glyph });
            cache[glyph] = a.isEmpty() ? 0 : static_cast<int>(std::lround(a.front().x()));
        }
        return cache[glyph] * size / unitsPerEm[static_cast<size_t>(font)];
    }

    int slot(int font)
    {
        const auto index = static_cast<size_t>(font);
        if (index >= slotOfFont.size())
            slotOfFont.resize(index + 1, -1);
        if (slotOfFont[index] < 0) {
            FontFace face = fonts.face(font);
            face.pixelSize = 0;
            const auto found = std::find(slotFaces.begin(), slotFaces.end(), face);
            slotOfFont[index] = static_cast<int>(found - slotFaces.begin());
            if (found == slotFaces.end())
                slotFaces.push_back(face);
        }
        return slotOfFont[index];
    }
    // The first font table number of each slot: any of them gives the face's program.
    int fontOfSlot(int wanted) const
    {
        for (size_t i = 0; i < slotOfFont.size(); ++i) {
            if (slotOfFont[i] == wanted)
                return static_cast<int>(i);
        }
        return 0;
    }
    UsedFont& used(int font)
    {
        UsedFont& u = usedFonts[slot(font)];
        if (!u.known) {
            u.known = true;
            u.outlines = !FontProgram::canEmbed(rawFont(font));
            if (!u.outlines)
                u.object = allocate();
        }
        return u;
    }
    int outlineCode(UsedFont& u, uint32_t glyph)
    {
        const auto [it, added] = u.codes.emplace(glyph, static_cast<int>(u.glyphOfCode.size()));
        if (added) {
            u.glyphOfCode.push_back(glyph);
            if (it->second % 256 == 0)
                u.outlineFonts.push_back(allocate());
        }
        return it->second;
    }
    int alphaState(int alpha)
    {
        auto [it, added] = alphaStates.emplace(alpha, 0);
        if (added)
            it->second = allocate();
        return it->second;
    }
    void writeOutlineFonts(int font, UsedFont& u);

    void writeText(const Page& page);
    void writePicture(const Page::Picture& picture);
    int imageObject(const QImage& image);
    void writeFont(int font, int slot, UsedFont& u);
};

PdfWriter::PdfWriter(QIODevice& device, const FontTable& fonts)
    : d(std::make_unique<Private>(device, fonts))
{
    d->out.reserve(flushSize + (flushSize >> 2));
    d->out.append("%PDF-1.4\n%\xE2\xE3\xCF\xD3\n");
}

PdfWriter::~PdfWriter() = default;

void PdfWriter::setTitle(const QString& title)
{
    d->title = title;
}

QString PdfWriter::error() const
{
    return d->error;
}

void PdfWriter::Private::writePicture(const Page::Picture& picture)
{
    if (picture.image.isNull() || picture.target.isEmpty())
        return;
    const Image image = images.value(picture.image.cacheKey());
    const int index = image.object ? image.index : imageObject(picture.image);
    content.append("q\n");
    appendNumbers(content,
        { picture.clip.x(), picture.clip.y(), picture.clip.width(), picture.clip.height() });
    content.append("re W n\n");
    appendNumber(content, picture.target.width());
    content.append(" 0 0 ");
    appendNumber(content, -picture.target.height());
    content.append(' ');
    appendNumber(content, picture.target.x());
    content.append(' ');
    appendNumber(content, picture.target.bottom());
    content.append(" cm /Im");
    appendNumber(content, index);
    content.append(" Do\nQ\n");
}

int PdfWriter::Private::imageObject(const QImage& source)
{
    const bool alpha = source.hasAlphaChannel();
    const QImage rgb = source.convertToFormat(QImage::Format_RGB888);
    QByteArray pixels;
    pixels.reserve(static_cast<qsizetype>(rgb.width()) * rgb.height() * 3);
    for (int y = 0; y < rgb.height(); ++y)
        pixels.append(reinterpret_cast<const char*>(rgb.constScanLine(y)), rgb.width() * 3);
    QByteArray dictionary = "/Type /XObject /Subtype /Image /Width "
        + QByteArray::number(rgb.width()) + " /Height " + QByteArray::number(rgb.height())
        + " /ColorSpace /DeviceRGB /BitsPerComponent 8 /Filter /FlateDecode";
    if (alpha) {
        const QImage mask = source.convertToFormat(QImage::Format_Alpha8);
        QByteArray alphas;
        for (int y = 0; y < mask.height(); ++y)
            alphas.append(reinterpret_cast<const char*>(mask.constScanLine(y)), mask.width());
        const int maskObject = allocate();
        stream(maskObject, deflate(alphas, fontLevel),
            "/Type /XObject /Subtype /Image /Width " + QByteArray::number(mask.width())
                + " /Height " + QByteArray::number(mask.height())
                + " /ColorSpace /DeviceGray /BitsPerComponent 8 /Filter /FlateDecode");
        dictionary += " /SMask " + QByteArray::number(maskObject) + " 0 R";
    }
    const int object = allocate();
    stream(object, deflate(pixels, fontLevel), dictionary);
    const Image image { object, static_cast<int>(images.size()) };
    images.insert(source.cacheKey(), image);
    return image.index;
}

void PdfWriter::Private::writeText(const Page& page)
{
    // Grouped by font and colour, as few state changes as the page allows.
    struct Key {
        int font;
        QRgb color;
        bool operator<(const Key& o) const
        {
            return font != o.font ? font < o.font : color < o.color;
        }
    };
    struct Piece {
        const Page::Text* text;
        int first;
        int end;
    };
    std::map<Key, std::vector<Piece>> batches;
    for (const Page::Text& text : page.texts) {
        for (const ShapedText::Run& run : text.text->runs) {
            const int end = std::min(run.first + run.count, text.glyphCount);
            if (end > run.first)
                batches[{ run.font, text.color }].push_back({ &text, run.first, end });
        }
    }
    if (batches.empty())
        return;
    content.append("BT\n");
    QRgb currentColor = 0xff000000;
    int currentAlpha = 255;
    for (const auto& [key, pieces] : batches) {
        if (!rawFont(key.font).isValid())
            continue;
        const double size = fonts.face(key.font).pixelSize;
        UsedFont& u = used(key.font);
        if ((key.color & 0xffffff) != (currentColor & 0xffffff) || currentColor == 0xff000000) {
            appendColor(content, key.color, "rg");
            currentColor = key.color | 0xff000000;
        }
        const int alpha = qAlpha(key.color);
        if (alpha != currentAlpha) {
            alphaState(alpha);
            content.append("/GS");
            appendNumber(content, alpha);
            content.append(" gs\n");
            currentAlpha = alpha;
        }
        const int fontSlot = slot(key.font);
        // Outline fonts change with the code's group of 256; -1 until the first glyph.
        int outlineFont = -1;
        const auto selectFont = [&](int group) {
            content.append("/F");
            appendNumber(content, fontSlot);
            if (group >= 0) {
                content.append('s');
                appendNumber(content, group);
            }
            content.append(' ');
            appendNumber(content, size);
            content.append(" Tf\n");
        };
        if (!u.outlines)
            selectFont(-1);
        for (const Piece& piece : pieces) {
            const ShapedText& shaped = *piece.text->text;
            // Text that shaped one glyph per character maps glyphs to characters directly.
            const bool direct = shaped.runs.size() == 1
                && shaped.glyphs.size() == static_cast<size_t>(shaped.source.size());
            const double originX = piece.text->origin.x();
            const double originY = piece.text->origin.y();
            bool open = false;
            double pen = 0;
            for (int g = piece.first; g < piece.end; ++g) {
                const auto i = static_cast<size_t>(g);
                const uint32_t glyph = shaped.glyphs[i];
                if (glyph >= u.glyphs.size())
                    u.glyphs.resize(glyph + 1, false);
                if (!u.glyphs[glyph]) {
                    u.glyphs[glyph] = true;
                    if (direct)
                        u.text.emplace(glyph, QString(shaped.source.at(g)));
                    else
                        u.needsReverseMap = true;
                }
                const double x = originX + shaped.x[i];
                const double dy = shaped.y.empty() ? 0.0 : shaped.y[i];
                const int code = u.outlines ? outlineCode(u, glyph) : -1;
                const bool newFont = u.outlines && code / 256 != outlineFont;
                if (!open || newFont || dy != 0
                    || (g > piece.first && !shaped.y.empty() && shaped.y[i - 1] != 0)) {
                    if (open)
                        content.append(">] TJ\n");
                    if (newFont) {
                        outlineFont = code / 256;
                        selectFont(outlineFont);
                    }
                    content.append("1 0 0 -1 ");
                    appendNumber(content, x);
                    content.append(' ');
                    appendNumber(content, originY + dy);
                    content.append(" Tm [<");
                    open = true;
                    pen = x;
                } else if (std::abs(pen - x) > 0.25) {
                    // Shaping put the glyph elsewhere than the font's advance would.
                    const double adjustment = std::round((pen - x) * 1000.0 / size);
                    content.append("> ");
                    appendNumber(content, adjustment);
                    content.append(" <");
                    pen -= adjustment * size / 1000.0;
                }
                if (u.outlines)
                    appendHex2(content, static_cast<uint32_t>(code % 256));
                else
                    appendHex4(content, glyph);
                pen += advance(key.font, glyph, size);
            }
            if (open)
                content.append(">] TJ\n");
        }
    }
    content.append("ET\n");
    if (currentAlpha != 255) {
        alphaState(255);
        content.append("/GS255 gs\n");
    }
}

bool PdfWriter::addPage(const Page& page)
{
    Private& p = *d;
    p.content.resize(0);
    const double height = page.size.height() / 20.0;
    p.content.append("0.05 0 0 -0.05 0 ");
    appendNumber(p.content, height);
    p.content.append(" cm\n");
    for (const Page::Box& box : page.boxes) {
        if (!box.filled)
            continue;
        appendColor(p.content, box.fill, "rg");
        appendNumbers(
            p.content, { box.rect.x(), box.rect.y(), box.rect.width(), box.rect.height() });
        p.content.append("re f\n");
    }
    for (const Page::Picture& picture : page.pictures)
        p.writePicture(picture);
    for (const Page::Box& box : page.boxes) {
        if (box.lineWidth <= 0)
            continue;
        appendColor(p.content, box.lineColor, "RG");
        appendNumber(p.content, box.lineWidth);
        p.content.append(" w\n");
        // The frame lies inside the box, as the designer drew it.
        const QRectF r = box.rect.adjusted(
            box.lineWidth / 2, box.lineWidth / 2, -box.lineWidth / 2, -box.lineWidth / 2);
        appendNumbers(p.content, { r.x(), r.y(), r.width(), r.height() });
        p.content.append("re S\n");
    }
    const auto line = [&p](QPointF from, QPointF to, double width, QRgb color) {
        appendColor(p.content, color, "RG");
        appendNumbers(p.content, { width });
        p.content.append("w ");
        appendNumbers(p.content, { from.x(), from.y() });
        p.content.append("m ");
        appendNumbers(p.content, { to.x(), to.y() });
        p.content.append("l S\n");
    };
    for (const Page::Line& l : page.lines)
        line(l.from, l.to, l.width, l.color);
    for (const Page::Text& text : page.texts) {
        if (!text.underline || text.glyphCount == 0)
            continue;
        const double y = text.origin.y() + text.underlineY;
        const double end = text.text->x[static_cast<size_t>(text.glyphCount)];
        line(QPointF(text.origin.x(), y), QPointF(text.origin.x() + end, y), text.underlineWidth,
            text.color);
    }
    p.writeText(page);

    const int contents = p.allocate();
    p.stream(contents, deflate(p.content, contentLevel), "/Filter /FlateDecode");
    const int object = p.allocate();
    p.begin(object);
    p.out.append("<< /Type /Page /Parent 2 0 R /MediaBox [0 0 ");
    appendNumber(p.out, page.size.width() / 20.0);
    p.out.append(' ');
    appendNumber(p.out, height);
    p.out.append("] /Resources 3 0 R /Contents ");
    appendNumber(p.out, contents);
    p.out.append(" 0 R >>\n");
    p.end();
    p.pages.push_back(object);
    return p.maybeFlush();
}

void PdfWriter::Private::writeFont(int font, int slot, UsedFont& u)
{
    const FontFace face = fonts.face(font);
    const QRawFont& raw = rawFont(font);
    if (u.needsReverseMap) {
        // Glyphs shaping made from several characters (or one made of several glyphs):
        // the characters of the basic plane that the face maps to them.
        QString all(0xFFFF - 0x20, Qt::Uninitialized);
        for (int c = 0x20; c < 0xFFFF; ++c)
            all[c - 0x20] = (c >= 0xD800 && c < 0xE000) ? QChar(u' ') : QChar(c);
        QList<quint32> indexes(all.size());
        int count = static_cast<int>(all.size());
        if (raw.glyphIndexesForChars(all.constData(), count, indexes.data(), &count)) {
            for (int i = 0; i < count; ++i) {
                const uint32_t g = indexes[i];
                if (g != 0 && g < u.glyphs.size() && u.glyphs[g] && !u.text.count(g))
                    u.text.emplace(g, QString(all.at(i)));
            }
        }
    }

    if (u.outlines) {
        writeOutlineFonts(font, u);
        return;
    }
    const FontProgram program = FontProgram::make(raw, u.glyphs);
    const double scale = 1000.0 / program.unitsPerEm();

    // A subset tag from the face's number, so two subsets of one face never share a name.
    QByteArray tag;
    for (int n = slot, i = 0; i < 6; ++i, n /= 26)
        tag.append(char('A' + n % 26));
    const QByteArray name = tag + '+' + postScriptName(face);

    const int cidFont = allocate();
    const int descriptor = allocate();
    const int toUnicode = allocate();
    int fontFile = 0;
    if (program.kind() == FontProgram::Kind::TrueType) {
        fontFile = allocate();
        stream(fontFile, deflate(program.bytes(), fontLevel),
            "/Filter /FlateDecode /Length1 " + QByteArray::number(program.bytes().size()));
    }

    begin(u.object);
    out.append("<< /Type /Font /Subtype /Type0 /BaseFont /" + name
        + " /Encoding /Identity-H /DescendantFonts [" + QByteArray::number(cidFont)
        + " 0 R] /ToUnicode " + QByteArray::number(toUnicode) + " 0 R >>\n");
    end();

    begin(cidFont);
    out.append("<< /Type /Font /Subtype /CIDFontType2 /BaseFont /");
    out.append(name);
    out.append(" /CIDSystemInfo << /Registry (Adobe) /Ordering (Identity) /Supplement 0 >> "
               "/FontDescriptor ");
    appendNumber(out, descriptor);
    out.append(" 0 R /DW 1000 /W [");
    const std::vector<int>& advances = program.advances();
    for (size_t g = 0; g < u.glyphs.size(); ++g) {
        if (!u.glyphs[g])
            continue;
        appendNumber(out, static_cast<double>(g));
        out.append(" [");
        for (; g < u.glyphs.size() && u.glyphs[g]; ++g) {
            appendNumber(out, g < advances.size() ? advances[g] * scale : 0.0);
            out.append(' ');
        }
        out.append("] ");
    }
    out.append("] /CIDToGIDMap /Identity >>\n");
    end();

    begin(descriptor);
    out.append("<< /Type /FontDescriptor /FontName /" + name + " /Flags ");
    appendNumber(out, face.italic ? 96 : 32);
    out.append(" /FontBBox [");
    for (int i = 0; i < 4; ++i) {
        appendNumber(out, program.boundingBox()[i] * scale);
        out.append(i < 3 ? " " : "");
    }
    out.append("] /ItalicAngle ");
    out.append(face.italic ? "-12" : "0");
    out.append(" /Ascent ");
    appendNumber(out, program.ascent() * scale);
    out.append(" /Descent ");
    appendNumber(out, program.descent() * scale);
    out.append(" /CapHeight ");
    appendNumber(out, program.ascent() * scale);
    out.append(" /StemV ");
    out.append(face.weight >= 600 ? "120" : "80");
    if (fontFile) {
        out.append(" /FontFile2 ");
        appendNumber(out, fontFile);
        out.append(" 0 R");
    }
    out.append(" >>\n");
    end();

    std::map<uint32_t, QString> byCode;
    for (const auto& [glyph, text] : u.text)
        byCode.emplace(glyph, text);
    const QByteArray cmap = toUnicodeMap(byCode, 4);
    stream(toUnicode, deflate(cmap, fontLevel), "/Filter /FlateDecode");
}

void PdfWriter::Private::writeOutlineFonts(int font, UsedFont& u)
{
    QRawFont design = rawFont(font);
    design.setPixelSize(1000);
    for (size_t group = 0; group < u.outlineFonts.size(); ++group) {
        const size_t first = group * 256;
        const size_t count = std::min<size_t>(256, u.glyphOfCode.size() - first);
        QByteArray differences = "[0";
        QByteArray procs;
        QByteArray widths;
        std::map<uint32_t, QString> byCode;
        for (size_t code = 0; code < count; ++code) {
            const uint32_t glyph = u.glyphOfCode[first + code];
            const QPainterPath path = design.pathForGlyph(glyph);
            const double width = advance(font, glyph, 1000.0);
            const QRectF box = path.boundingRect();
            QByteArray proc;
            appendNumber(proc, width);
            proc.append(" 0 ");
            appendNumber(proc, std::floor(box.left()));
            proc.append(' ');
            appendNumber(proc, std::floor(-box.bottom()));
            proc.append(' ');
            appendNumber(proc, std::ceil(box.right()));
            proc.append(' ');
            appendNumber(proc, std::ceil(-box.top()));
            proc.append(" d1\n");
            proc.append(outlineOperators(path));
            const int object = allocate();
            stream(object, deflate(proc, fontLevel), "/Filter /FlateDecode");
            const QByteArray name = "/g" + QByteArray::number(static_cast<qulonglong>(code));
            differences += ' ' + name;
            procs += name + ' ' + QByteArray::number(object) + " 0 R ";
            appendNumber(widths, width);
            widths.append(' ');
            if (const auto text = u.text.find(glyph); text != u.text.end())
                byCode.emplace(static_cast<uint32_t>(code), text->second);
        }
        const int toUnicode = allocate();
        stream(toUnicode, deflate(toUnicodeMap(byCode, 2), fontLevel), "/Filter /FlateDecode");
        begin(u.outlineFonts[group]);
        out.append("<< /Type /Font /Subtype /Type3 /FontBBox [0 0 0 0] "
                   "/FontMatrix [0.001 0 0 0.001 0 0] /CharProcs << "
            + procs + ">> /Encoding << /Type /Encoding /Differences " + differences
            + "] >> /FirstChar 0 /LastChar "
            + QByteArray::number(static_cast<qulonglong>(count - 1)) + " /Widths [" + widths
            + "] /ToUnicode " + QByteArray::number(toUnicode) + " 0 R >>\n");
        end();
        if (!maybeFlush())
            return;
    }
}

bool PdfWriter::finish()
{
    Private& p = *d;
    for (auto& [slot, used] : p.usedFonts) {
        p.writeFont(p.fontOfSlot(slot), slot, used);
        if (!p.maybeFlush())
            return false;
    }
    for (const auto& [alpha, object] : p.alphaStates) {
        p.begin(object);
        p.out.append("<< /Type /ExtGState /ca ");
        appendNumber(p.out, alpha / 255.0);
        p.out.append(" /CA ");
        appendNumber(p.out, alpha / 255.0);
        p.out.append(" >>\n");
        p.end();
    }

    p.begin(Private::resources);
    // " /Name n 0 R": one entry of a resource dictionary.
    const auto entry = [&p](const QByteArray& name, int object) {
        p.out.append(" /" + name + ' ');
        appendNumber(p.out, object);
        p.out.append(" 0 R");
    };
    p.out.append("<< /ProcSet [/PDF /Text /ImageB /ImageC] /Font <<");
    for (const auto& [slot, used] : p.usedFonts) {
        const QByteArray name = 'F' + QByteArray::number(slot);
        if (!used.outlines)
            entry(name, used.object);
        for (size_t group = 0; used.outlines && group < used.outlineFonts.size(); ++group)
            entry(name + 's' + QByteArray::number(static_cast<qulonglong>(group)),
                used.outlineFonts[group]);
    }
    p.out.append(" >> /XObject <<");
    for (const Image& image : std::as_const(p.images))
        entry("Im" + QByteArray::number(image.index), image.object);
    p.out.append(" >> /ExtGState <<");
    for (const auto& [alpha, object] : p.alphaStates)
        entry("GS" + QByteArray::number(alpha), object);
    p.out.append(" >> >>\n");
    p.end();

    p.begin(Private::pageTree);
    p.out.append("<< /Type /Pages /Count ");
    appendNumber(p.out, static_cast<double>(p.pages.size()));
    p.out.append(" /Kids [");
    for (const int page : p.pages) {
        appendNumber(p.out, page);
        p.out.append(" 0 R ");
    }
    p.out.append("] >>\n");
    p.end();

    p.begin(Private::catalog);
    p.out.append("<< /Type /Catalog /Pages 2 0 R >>\n");
    p.end();

    p.begin(Private::info);
    p.out.append("<< /Creator (LUD Mox) /Producer (LUD Mox) /CreationDate (D:"
        + QDateTime::currentDateTimeUtc().toString(QStringLiteral("yyyyMMddHHmmss")).toLatin1()
        + "Z)");
    if (!p.title.isEmpty())
        p.out.append(" /Title " + utf16Hex(p.title));
    p.out.append(" >>\n");
    p.end();

    const qint64 xref = p.position();
    p.out.append("xref\n0 ");
    appendNumber(p.out, static_cast<double>(p.offsets.size()));
    p.out.append("\n0000000000 65535 f \n");
    char line[24];
    for (size_t i = 1; i < p.offsets.size(); ++i) {
        std::snprintf(
            line, sizeof line, "%010lld 00000 n \n", static_cast<long long>(p.offsets[i]));
        p.out.append(line, 20);
    }
    p.out.append("trailer\n<< /Size ");
    appendNumber(p.out, static_cast<double>(p.offsets.size()));
    p.out.append(" /Root 1 0 R /Info 4 0 R >>\nstartxref\n");
    appendNumber(p.out, static_cast<double>(xref));
    p.out.append("\n%%EOF\n");
    return p.flush();
}

} // namespace reportrt
