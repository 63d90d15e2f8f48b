#include "reportrt/layout/fontface.h"

#include "reportrt/document/reportdocument.h"

#include <QtMath>

namespace reportrt {

namespace {
constexpr int twipsPerPoint = 20;
constexpr int maximumPixelSize = 32767;
} // namespace

FontFace FontFace::forFont(const Font& font)
{
    FontFace face;
    face.family = font.family;
    face.weight = font.bold ? QFont::Bold : QFont::Normal;
    face.italic = font.italic;
    face.pixelSize = qBound(1, qRound(font.pointSize * twipsPerPoint), maximumPixelSize);
    // The database may give another family for a name it does not have; the renderer must
    // ask for the same file, so the face keeps what was found.
    const QRawFont raw = face.rawFont();
    if (raw.isValid()) {
        face.family = raw.familyName();
        face.styleName = raw.styleName();
    }
    return face;
}

FontFace FontFace::forRawFont(const QRawFont& font)
{
    FontFace face;
    face.family = font.familyName();
    face.styleName = font.styleName();
    face.weight = font.weight();
    face.italic = font.style() != QFont::StyleNormal;
    face.pixelSize = qBound(1, qRound(font.pixelSize()), maximumPixelSize);
    return face;
}

QFont FontFace::font() const
{
    QFont f(family);
    if (!styleName.isEmpty())
        f.setStyleName(styleName);
    f.setWeight(static_cast<QFont::Weight>(weight));
    f.setItalic(italic);
    f.setPixelSize(pixelSize);
    f.setHintingPreference(QFont::PreferNoHinting);
    f.setKerning(false);
    return f;
}

QRawFont FontFace::rawFont() const
{
    QRawFont raw = QRawFont::fromFont(font());
    if (raw.isValid() && !qFuzzyCompare(raw.pixelSize(), qreal(pixelSize)))
        raw.setPixelSize(pixelSize);
    return raw;
}

} // namespace reportrt
