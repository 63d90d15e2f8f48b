#include "reportrt/output/fontprogram.h"

#include <algorithm>
#include <map>

namespace reportrt {

namespace {
uint16_t u16(const QByteArray& b, qsizetype at)
{
    if (at < 0 || at + 2 > b.size())
        return 0;
    return static_cast<uint16_t>((uint8_t(b[at]) << 8) | uint8_t(b[at + 1]));
}

int16_t s16(const QByteArray& b, qsizetype at)
{
    return static_cast<int16_t>(u16(b, at));
}

uint32_t u32(const QByteArray& b, qsizetype at)
{
    return (uint32_t(u16(b, at)) << 16) | u16(b, at + 2);
}

void put16(QByteArray& b, uint16_t v)
{
    b.append(char(v >> 8));
    b.append(char(v & 0xff));
}

void put32(QByteArray& b, uint32_t v)
{
    put16(b, static_cast<uint16_t>(v >> 16));
    put16(b, static_cast<uint16_t>(v & 0xffff));
}

void set16(QByteArray& b, qsizetype at, uint16_t v)
{
    b[at] = char(v >> 8);
    b[at + 1] = char(v & 0xff);
}

uint32_t checksum(const QByteArray& table)
{
    uint32_t sum = 0;
    for (qsizetype i = 0; i < table.size(); i += 4) {
        uint32_t word = 0;
        for (int k = 0; k < 4; ++k)
            word = (word << 8) | (i + k < table.size() ? uint8_t(table[i + k]) : 0u);
        sum += word;
    }
    return sum;
}

// An sfnt file of the given tables, in tag order as readers expect.
QByteArray assemble(uint32_t version, const std::map<QByteArray, QByteArray>& tables)
{
    const auto count = static_cast<uint16_t>(tables.size());
    uint16_t power = 1;
    uint16_t log2 = 0;
    while (power * 2 <= count) {
        power *= 2;
        ++log2;
    }
    QByteArray out;
    put32(out, version);
    put16(out, count);
    put16(out, static_cast<uint16_t>(power * 16));
    put16(out, log2);
    put16(out, static_cast<uint16_t>(count * 16 - power * 16));
    uint32_t offset = 12 + 16 * uint32_t(count);
    for (const auto& [tag, data] : tables) {
        out.append(tag);
        put32(out, checksum(data));
        put32(out, offset);
        put32(out, static_cast<uint32_t>(data.size()));
        offset += static_cast<uint32_t>((data.size() + 3) & ~qsizetype(3));
    }
    for (const auto& [tag, data] : tables) {
        out.append(data);
        out.append(QByteArray((4 - data.size() % 4) % 4, '\0'));
    }
    return out;
}

// The glyphs a composite glyph is made of.
void addComponents(const QByteArray& glyph, std::vector<uint32_t>& pending)
{
    if (glyph.size() < 10 || s16(glyph, 0) >= 0)
        return;
    qsizetype at = 10;
    for (;;) {
        const uint16_t flags = u16(glyph, at);
        pending.push_back(u16(glyph, at + 2));
        at += 4 + ((flags & 0x0001) ? 4 : 2);
        if (flags & 0x0008)
            at += 2;
        else if (flags & 0x0040)
            at += 4;
        else if (flags & 0x0080)
            at += 8;
        if (!(flags & 0x0020) || at >= glyph.size())
            return;
    }
}
} // namespace

bool FontProgram::canEmbed(const QRawFont& font)
{
    return font.isValid() && font.fontTable("head").size() >= 54
        && font.fontTable("hhea").size() >= 36 && font.fontTable("maxp").size() >= 6
        && !font.fontTable("glyf").isEmpty() && !font.fontTable("loca").isEmpty();
}

FontProgram FontProgram::make(const QRawFont& font, std::vector<bool> used)
{
    FontProgram program;
    const QByteArray head = font.fontTable("head");
    const QByteArray hhea = font.fontTable("hhea");
    const QByteArray maxp = font.fontTable("maxp");
    const QByteArray hmtx = font.fontTable("hmtx");
    if (head.size() < 54 || hhea.size() < 36 || maxp.size() < 6)
        return program;
    program.m_unitsPerEm = std::max<int>(16, u16(head, 18));
    for (int i = 0; i < 4; ++i)
        program.m_box[i] = s16(head, 36 + 2 * i);
    program.m_ascent = s16(hhea, 4);
    program.m_descent = s16(hhea, 6);
    const uint16_t glyphCount = u16(maxp, 4);
    const uint16_t metrics = std::max<uint16_t>(1, u16(hhea, 34));
    program.m_advances.resize(glyphCount);
    for (uint32_t g = 0; g < glyphCount; ++g)
        program.m_advances[g] = u16(hmtx, 4 * std::min<qsizetype>(g, metrics - 1));

    const QByteArray glyf = font.fontTable("glyf");
    const QByteArray loca = font.fontTable("loca");
    if (glyf.isEmpty() || loca.isEmpty())
        return program;

    const bool longOffsets = s16(head, 50) == 1;
    const auto offsetOf = [&](uint32_t g) -> qsizetype {
        return longOffsets ? qsizetype(u32(loca, 4 * qsizetype(g)))
                           : 2 * qsizetype(u16(loca, 2 * qsizetype(g)));
    };
    const auto glyphBytes = [&](uint32_t g) {
        if (g >= glyphCount)
            return QByteArray();
        const qsizetype from = offsetOf(g);
        const qsizetype to = offsetOf(g + 1);
        if (from < 0 || to <= from || to > glyf.size())
            return QByteArray();
        return glyf.mid(from, to - from);
    };
    used.resize(glyphCount, false);
    if (glyphCount > 0)
        used[0] = true;
    std::vector<uint32_t> pending;
    for (uint32_t g = 0; g < glyphCount; ++g) {
        if (used[g])
            addComponents(glyphBytes(g), pending);
    }
    while (!pending.empty()) {
        const uint32_t g = pending.back();
        pending.pop_back();
        if (g < glyphCount && !used[g]) {
            used[g] = true;
            addComponents(glyphBytes(g), pending);
        }
    }

    QByteArray newGlyf;
    QByteArray newLoca;
    for (uint32_t g = 0; g < glyphCount; ++g) {
        put32(newLoca, static_cast<uint32_t>(newGlyf.size()));
        if (!used[g])
            continue;
        newGlyf.append(glyphBytes(g));
        newGlyf.append(QByteArray((4 - newGlyf.size() % 4) % 4, '\0'));
    }
    put32(newLoca, static_cast<uint32_t>(newGlyf.size()));
    QByteArray newHead = head;
    set16(newHead, 8, 0); // checkSumAdjustment: not needed by readers, left zero
    set16(newHead, 10, 0);
    set16(newHead, 50, 1);

    std::map<QByteArray, QByteArray> tables { { "glyf", newGlyf }, { "head", newHead },
        { "hhea", hhea }, { "hmtx", hmtx }, { "loca", newLoca }, { "maxp", maxp } };
    for (const char* tag : { "cvt ", "fpgm", "prep" }) {
        const QByteArray table = font.fontTable(tag);
        if (!table.isEmpty())
            tables.emplace(QByteArray(tag), table);
    }
    program.m_bytes = assemble(0x00010000, tables);
    program.m_kind = Kind::TrueType;
    return program;
}

} // namespace reportrt
