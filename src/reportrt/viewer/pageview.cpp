#include "reportrt/viewer/pageview.h"

#include "reportrt/layout/fonttable.h"
#include "reportrt/output/pagerenderer.h"
#include "reportrt/viewer/viewerpages.h"

#include <QKeyEvent>
#include <QPainter>
#include <QScrollBar>
#include <algorithm>
#include <cmath>

namespace reportrt {

namespace {
constexpr int gap = 12; // pixels around and between pages
const QSizeF a4(11906, 16838); // twips, shown before any page is laid out
} // namespace

PageView::PageView(QWidget* parent)
    : QAbstractScrollArea(parent)
{
    setFocusPolicy(Qt::StrongFocus);
    viewport()->setBackgroundRole(QPalette::Dark);
    viewport()->setAutoFillBackground(true);
}

PageView::~PageView() = default;

void PageView::setPages(std::shared_ptr<const ViewerPages> pages)
{
    m_pages = std::move(pages);
    m_hits.clear();
    m_currentHit = -1;
    m_current = 0;
    m_tops.clear();
    pagesChanged();
    verticalScrollBar()->setValue(0);
}

void PageView::pagesChanged()
{
    const auto count = m_pages ? m_pages->pages().size() : 0;
    if (m_tops.size() > count + 1 || (m_pages && m_tops.empty()))
        m_tops.assign(1, 0.0);
    for (size_t i = m_tops.size() - 1; i < count; ++i)
        m_tops.push_back(m_tops.back() + m_pages->pages()[i].size.height());
    if (m_current >= static_cast<int>(count))
        m_current = std::max(0, static_cast<int>(count) - 1);
    updateGeometry();
    viewport()->update();
}

double PageView::scale() const
{
    const double pixelsPerTwip = logicalDpiX() / 1440.0;
    const QSizeF size = pageSize(m_current);
    const double width = viewport()->width() - 2.0 * gap - verticalScrollBar()->sizeHint().width();
    const double height = viewport()->height() - 2.0 * gap;
    switch (m_zoom) {
    case fitWidth:
        return std::max(width, 16.0) / size.width();
    case fitPage:
        return std::max(
            std::min(std::max(width, 16.0) / size.width(), std::max(height, 16.0) / size.height()),
            0.001);
    default:
        return pixelsPerTwip * m_zoom / 100.0;
    }
}

int PageView::effectivePercent() const
{
    return static_cast<int>(std::lround(scale() * 1440.0 / logicalDpiX() * 100.0));
}

void PageView::setZoom(int zoom)
{
    m_zoom = zoom == fitWidth || zoom == fitPage ? zoom
                                                 : std::clamp(zoom, minimumPercent, maximumPercent);
    const int page = m_current;
    updateGeometry();
    showPage(page);
    viewport()->update();
}

void PageView::setContinuous(bool continuous)
{
    if (m_continuous == continuous)
        return;
    m_continuous = continuous;
    const int page = m_current;
    updateGeometry();
    showPage(page);
}

QSizeF PageView::pageSize(int index) const
{
    if (!m_pages || index < 0 || static_cast<size_t>(index) >= m_pages->pages().size())
        return a4;
    return m_pages->pages()[static_cast<size_t>(index)].size;
}

QPointF PageView::pageOrigin(int index) const
{
    const double s = scale();
    const double contentWidth
        = std::max<double>(viewport()->width(), pageSize(index).width() * s + 2 * gap);
    const double x = (contentWidth - pageSize(index).width() * s) / 2;
    if (!m_continuous || static_cast<size_t>(index) >= m_tops.size())
        return QPointF(x, gap);
    return QPointF(x, m_tops[static_cast<size_t>(index)] * s + (index + 1) * gap);
}

void PageView::updateGeometry()
{
    const double s = scale();
    const int count = m_pages ? static_cast<int>(m_pages->pages().size()) : 0;
    double width = pageSize(m_current).width() * s + 2 * gap;
    double height = pageSize(m_current).height() * s + 2 * gap;
    if (m_continuous && count > 0) {
        height = m_tops.back() * s + (count + 1) * gap;
        for (const Page& page : m_pages->pages())
            width = std::max(width, page.size.width() * s + 2 * gap);
    }
    horizontalScrollBar()->setRange(0, std::max(0, static_cast<int>(width) - viewport()->width()));
    horizontalScrollBar()->setPageStep(viewport()->width());
    verticalScrollBar()->setRange(0, std::max(0, static_cast<int>(height) - viewport()->height()));
    verticalScrollBar()->setPageStep(viewport()->height());
    verticalScrollBar()->setSingleStep(std::max(1, static_cast<int>(300 * s)));
}

void PageView::showPage(int index)
{
    const int count = m_pages ? static_cast<int>(m_pages->pages().size()) : 0;
    index = std::clamp(index, 0, std::max(0, count - 1));
    const bool changed = index != m_current;
    m_current = index;
    if (m_continuous) {
        const QSignalBlocker blocker(verticalScrollBar());
        verticalScrollBar()->setValue(static_cast<int>(pageOrigin(index).y()) - gap);
    } else {
        updateGeometry();
        verticalScrollBar()->setValue(0);
    }
    viewport()->update();
    if (changed)
        Q_EMIT currentPageChanged(m_current);
}

void PageView::setHits(std::vector<PageSearch::Hit> hits, int current)
{
    m_hits = std::move(hits);
    m_currentHit = current;
    if (current >= 0 && static_cast<size_t>(current) < m_hits.size() && m_pages
        && m_pages->fonts()) {
        const PageSearch::Hit& hit = m_hits[static_cast<size_t>(current)];
        const Page& page = m_pages->pages()[static_cast<size_t>(hit.page)];
        ensureVisible(hit.page, PageSearch::area(page, hit, *m_pages->fonts()));
    }
    viewport()->update();
}

void PageView::ensureVisible(int page, const QRectF& twips)
{
    if (page != m_current || !m_continuous)
        showPage(page);
    const double s = scale();
    const QPointF origin = pageOrigin(page);
    const double top = origin.y() + twips.top() * s;
    const double bottom = origin.y() + twips.bottom() * s;
    QScrollBar* bar = verticalScrollBar();
    if (top < bar->value() || bottom > bar->value() + viewport()->height())
        bar->setValue(static_cast<int>(top) - viewport()->height() / 3);
    const double left = origin.x() + twips.left() * s;
    QScrollBar* across = horizontalScrollBar();
    if (left < across->value() || left > across->value() + viewport()->width())
        across->setValue(static_cast<int>(left) - gap);
}

int PageView::pageAt(const QPoint& point, QPointF* twips) const
{
    if (!m_pages || m_pages->pages().empty())
        return -1;
    const double s = scale();
    const QPointF content(
        point.x() + horizontalScrollBar()->value(), point.y() + verticalScrollBar()->value());
    const auto test = [&](int index) {
        const QPointF origin = pageOrigin(index);
        const QPointF onPage = (content - origin) / s;
        const QSizeF size = pageSize(index);
        if (onPage.x() < 0 || onPage.y() < 0 || onPage.x() > size.width()
            || onPage.y() > size.height())
            return false;
        if (twips)
            *twips = onPage;
        return true;
    };
    if (!m_continuous)
        return test(m_current) ? m_current : -1;
    const int low = pageAtY(content.y());
    return test(low) ? low : -1;
}

int PageView::pageAtY(double y) const
{
    const double s = scale();
    int low = 0;
    int high = static_cast<int>(m_pages->pages().size()) - 1;
    while (low < high) {
        const int middle = (low + high) / 2;
        if (pageOrigin(middle).y() + pageSize(middle).height() * s + gap < y)
            low = middle + 1;
        else
            high = middle;
    }
    return low;
}

void PageView::updateCurrentFromScroll()
{
    if (!m_continuous || !m_pages || m_pages->pages().empty())
        return;
    // The page that holds the view's top third.
    const int page = pageAtY(verticalScrollBar()->value() + viewport()->height() / 3.0);
    if (page != m_current) {
        m_current = page;
        Q_EMIT currentPageChanged(m_current);
    }
}

void PageView::scrollContentsBy(int, int)
{
    updateCurrentFromScroll();
    viewport()->update();
}

void PageView::paintEvent(QPaintEvent*)
{
    QPainter painter(viewport());
    if (!m_pages || m_pages->pages().empty() || !m_pages->renderer())
        return;
    const double s = scale();
    const auto count = static_cast<int>(m_pages->pages().size());
    const QPointF scroll(horizontalScrollBar()->value(), verticalScrollBar()->value());
    const int first = m_continuous ? pageAtY(scroll.y()) : m_current;
    const int last = m_continuous ? count - 1 : m_current;
    for (int index = first; index <= last; ++index) {
        const QPointF origin = pageOrigin(index) - scroll;
        const Page& page = m_pages->pages()[static_cast<size_t>(index)];
        const QRectF paper(origin, page.size * s);
        if (paper.top() > viewport()->height())
            break;
        if (paper.bottom() < 0)
            continue;
        painter.fillRect(paper.translated(3, 3), QColor(0, 0, 0, 60));
        painter.fillRect(paper, Qt::white);
        painter.save();
        painter.setClipRect(paper);
        painter.translate(origin);
        painter.scale(s, s);
        m_pages->renderer()->paint(painter, page);
        if (m_pages->fonts()) {
            const auto range = std::equal_range(m_hits.begin(), m_hits.end(),
                PageSearch::Hit { index, 0, 0, 0 },
                [](const PageSearch::Hit& a, const PageSearch::Hit& b) { return a.page < b.page; });
            for (auto hit = range.first; hit != range.second; ++hit) {
                const bool current = hit - m_hits.begin() == m_currentHit;
                painter.fillRect(PageSearch::area(page, *hit, *m_pages->fonts()),
                    current ? QColor(255, 140, 0, 120) : QColor(255, 230, 0, 110));
            }
        }
        painter.restore();
    }
}

void PageView::resizeEvent(QResizeEvent* event)
{
    QAbstractScrollArea::resizeEvent(event);
    const int page = m_current;
    updateGeometry();
    if (m_zoom == fitWidth || m_zoom == fitPage)
        showPage(page);
    Q_EMIT resized();
}

void PageView::wheelEvent(QWheelEvent* event)
{
    if (event->modifiers() & Qt::ControlModifier) {
        const int steps = event->angleDelta().y() / 120;
        if (steps != 0)
            Q_EMIT zoomStepped(steps);
        event->accept();
        return;
    }
    QAbstractScrollArea::wheelEvent(event);
}

void PageView::mousePressEvent(QMouseEvent* event)
{
    if (event->button() == Qt::LeftButton)
        Q_EMIT pageClicked(event->position().toPoint());
    QAbstractScrollArea::mousePressEvent(event);
}

void PageView::mouseDoubleClickEvent(QMouseEvent* event)
{
    if (event->button() == Qt::LeftButton)
        Q_EMIT pageDoubleClicked(event->position().toPoint());
}

void PageView::keyPressEvent(QKeyEvent* event)
{
    event->accept();
    Q_EMIT keyPressed(event);
}

void PageView::focusInEvent(QFocusEvent* event)
{
    QAbstractScrollArea::focusInEvent(event);
    Q_EMIT focusChanged(true);
}

void PageView::focusOutEvent(QFocusEvent* event)
{
    QAbstractScrollArea::focusOutEvent(event);
    Q_EMIT focusChanged(false);
}

} // namespace reportrt
