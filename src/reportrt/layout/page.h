#pragma once

#include "reportrt/layout/shapedtext.h"

#include <QImage>
#include <QPointF>
#include <QRectF>
#include <QRgb>
#include <QSizeF>
#include <QString>
#include <memory>
#include <vector>

namespace reportrt {

/// One laid-out page: what to draw, in twips from the top-left corner of the paper. It
/// holds no font or paint-device objects, so the layout can hand it to a renderer on
/// another thread. PageRenderer paints fills and pictures first, then lines and frames,
/// then text, so shading never hides text.
struct Page {
    struct Text {
        QPointF origin; // the start of the baseline
        std::shared_ptr<const ShapedText> text;
        int glyphCount = 0; // the leading glyphs that fit the object; the rest is cut off
        QRgb color = 0xff000000;
        bool underline = false;
        double underlineY = 0; // below the baseline
        double underlineWidth = 0;
    };
    struct Line {
        QPointF from;
        QPointF to;
        double width = 20;
        QRgb color = 0xff000000;
    };
    struct Box {
        QRectF rect;
        double lineWidth = 20; // 0: no frame
        QRgb lineColor = 0xff000000;
        bool filled = false;
        QRgb fill = 0xffffffff;
    };
    struct Picture {
        QRectF target; // where the image goes, its proportions kept
        QRectF clip; // the part of the page it may cover
        QImage image;
    };

    /// Where a section instance of the main report was placed, so a preview can tell what
    /// lies under the mouse and which group a header opens.
    struct Band {
        QRectF rect;
        QString section; // "GH1", "D", ...
        int groupNode = -1; // the header's node in the record result; -1 for other sections
    };

    int number = 0; // 1-based
    QSizeF size; // twips
    std::vector<Box> boxes;
    std::vector<Picture> pictures;
    std::vector<Line> lines;
    std::vector<Text> texts;
    std::vector<Band> bands;

    bool isEmpty() const
    {
        return boxes.empty() && pictures.empty() && lines.empty() && texts.empty();
    }
};

} // namespace reportrt
