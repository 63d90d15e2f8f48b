#pragma once

#include "reportrt/layout/page.h"

#include <QRectF>
#include <QString>
#include <vector>

namespace reportrt {

class FontTable;

/// Finds text in laid-out pages, as a preview's search does: in the text items the pages
/// show (what is cut off at an object's edge is not shown, so it is not found).
class PageSearch {
public:
    struct Hit {
        int page = 0; // index into the pages searched
        int text = 0; // index into Page::texts
        int from = 0; // first character of the match in the shown text
        int length = 0;
    };

    /// Every match of text, without regard to case, in page order and, within a page, in
    /// the order the layout placed the text (top to bottom for banded reports). Matches do
    /// not overlap and never span two text items. An empty or blank text finds nothing.
    static std::vector<Hit> find(const std::vector<Page>& pages, const QString& text);

    /// Where a hit lies on its page, in twips; fonts gives the text's height.
    static QRectF area(const Page& page, const Hit& hit, const FontTable& fonts);
};

} // namespace reportrt
