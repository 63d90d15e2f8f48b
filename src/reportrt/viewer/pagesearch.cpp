#include "reportrt/viewer/pagesearch.h"

#include "reportrt/layout/fonttable.h"

#include <algorithm>

namespace reportrt {

std::vector<PageSearch::Hit> PageSearch::find(const std::vector<Page>& pages, const QString& text)
{
    std::vector<Hit> hits;
    if (text.trimmed().isEmpty())
        return hits;
    const auto length = static_cast<int>(text.size());
    for (size_t p = 0; p < pages.size(); ++p) {
        const auto& texts = pages[p].texts;
        for (size_t t = 0; t < texts.size(); ++t) {
            const Page::Text& item = texts[t];
            if (!item.text || item.glyphCount < length)
                continue;
            // Glyphs follow the characters one to one for the scripts reports use, so the
            // shown characters are the leading glyphCount ones.
            const QStringView shown = QStringView(item.text->source).left(item.glyphCount);
            qsizetype at = shown.indexOf(text, 0, Qt::CaseInsensitive);
            while (at >= 0) {
                hits.push_back(
                    { static_cast<int>(p), static_cast<int>(t), static_cast<int>(at), length });
                at = shown.indexOf(text, at + length, Qt::CaseInsensitive);
            }
        }
    }
    return hits;
}

QRectF PageSearch::area(const Page& page, const Hit& hit, const FontTable& fonts)
{
    if (hit.text < 0 || static_cast<size_t>(hit.text) >= page.texts.size())
        return {};
    const Page::Text& item = page.texts[static_cast<size_t>(hit.text)];
    const ShapedText& shaped = *item.text;
    const auto last = static_cast<int>(shaped.x.size()) - 1;
    const int from = std::clamp(hit.from, 0, std::max(0, last));
    const int to = std::clamp(hit.from + hit.length, from, std::max(0, last));
    double size = 200; // 10 points, for text without a font
    if (!shaped.runs.empty() && shaped.runs.front().font >= 0
        && shaped.runs.front().font < fonts.size())
        size = fonts.face(shaped.runs.front().font).pixelSize;
    const double left = item.origin.x() + (last >= 0 ? shaped.x[static_cast<size_t>(from)] : 0);
    const double right = item.origin.x() + (last >= 0 ? shaped.x[static_cast<size_t>(to)] : 0);
    // A line's glyphs reach about 0.9 of the size above the baseline and 0.25 below it.
    return QRectF(left, item.origin.y() - size * 0.95, right - left, size * 1.25);
}

} // namespace reportrt
