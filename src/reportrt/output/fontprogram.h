#pragma once

#include <QByteArray>
#include <QRawFont>
#include <vector>

namespace reportrt {

/// The font program a PDF embeds for one face, built from the face's own tables.
///
/// A TrueType face is cut down to the glyphs a document uses (and the parts of composite
/// glyphs they are made of): the other glyphs keep their numbers but lose their outlines,
/// so glyph numbers written in the pages stay valid and the file stays small. Faces of
/// other kinds give no program (the writer draws them from their outlines).
class FontProgram {
public:
    enum class Kind { None, TrueType };

    /// Whether make() gives a program for the face: one with TrueType outlines.
    static bool canEmbed(const QRawFont& font);
    /// used[g] says whether glyph g is drawn; glyph 0 is always kept.
    static FontProgram make(const QRawFont& font, std::vector<bool> used);

    Kind kind() const { return m_kind; }
    const QByteArray& bytes() const { return m_bytes; }
    /// Design units per em, the bounding box of all glyphs in design units, ascent and
    /// descent: what the font descriptor tells a reader.
    int unitsPerEm() const { return m_unitsPerEm; }
    const int* boundingBox() const { return m_box; }
    int ascent() const { return m_ascent; }
    int descent() const { return m_descent; }
    /// Advance widths in design units, by glyph.
    const std::vector<int>& advances() const { return m_advances; }

private:
    Kind m_kind = Kind::None;
    QByteArray m_bytes;
    int m_unitsPerEm = 1000;
    int m_box[4] = { 0, 0, 0, 0 };
    int m_ascent = 0;
    int m_descent = 0;
    std::vector<int> m_advances;
};

} // namespace reportrt
