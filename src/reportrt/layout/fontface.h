#pragma once

#include <QRawFont>
#include <QString>

namespace reportrt {

struct Font;

/// One font face at one size, as the layout measured it and the renderer draws it. Plain
/// values, so a page laid out on one thread can be painted on another: each thread makes
/// its own QRawFont from the face (font engines are not shared between threads).
struct FontFace {
    QString family; // as the font database resolved it, never a substitute's request
    QString styleName;
    int weight = 400; // QFont::Weight
    bool italic = false;
    int pixelSize = 200; // in twips: 20 per point

    /// The face a report font resolves to; sizes are rounded to whole twips (1/20 point).
    static FontFace forFont(const Font& font);
    /// The face of a raw font that shaping chose (a fallback font for characters the
    /// report's font lacks).
    static FontFace forRawFont(const QRawFont& font);

    /// Unhinted, so advances scale linearly from the layout's twips to any device.
    QFont font() const;
    QRawFont rawFont() const;

    friend bool operator==(const FontFace&, const FontFace&) = default;
};

} // namespace reportrt
