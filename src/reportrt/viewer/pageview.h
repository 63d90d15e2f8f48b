#pragma once

#include "reportrt/viewer/pagesearch.h"

#include <QAbstractScrollArea>
#include <memory>
#include <vector>

namespace reportrt {

class ViewerPages;

/// The paper area of the preview: paints the laid-out pages of one view with the same
/// renderer as the PDF writer, one below the other (continuous) or one at a time, at a zoom
/// in percent or fitted to the width or the whole page.
class PageView : public QAbstractScrollArea {
    Q_OBJECT
public:
    /// Zoom codes besides percentages.
    static constexpr int fitWidth = 1;
    static constexpr int fitPage = 2;
    static constexpr int minimumPercent = 25;
    static constexpr int maximumPercent = 400;

    explicit PageView(QWidget* parent = nullptr);
    ~PageView() override;

    void setPages(std::shared_ptr<const ViewerPages> pages);
    /// The view's pages grew or were replaced.
    void pagesChanged();

    /// 25 to 400 percent, fitWidth or fitPage; other values are clamped to the percentages.
    void setZoom(int zoom);
    int zoom() const { return m_zoom; }
    /// The percentage shown, fitted zooms included.
    int effectivePercent() const;

    void setContinuous(bool continuous);
    bool isContinuous() const { return m_continuous; }

    /// 0-based; the page at the top of the view.
    int currentPage() const { return m_current; }
    void showPage(int index);
    /// Shows hits on the pages, the current one (an index into hits, or -1) set apart and
    /// scrolled into view.
    void setHits(std::vector<PageSearch::Hit> hits, int current);

    /// The page under a point of the viewport and the point on it in twips; -1 for none.
    int pageAt(const QPoint& point, QPointF* twips) const;

Q_SIGNALS:
    void currentPageChanged(int index);
    void pageClicked(const QPoint& point);
    void pageDoubleClicked(const QPoint& point);
    /// Ctrl+wheel: +1 zooms in one step, -1 out.
    void zoomStepped(int steps);
    void keyPressed(QKeyEvent* event);
    void focusChanged(bool hasFocus);
    void resized();

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void scrollContentsBy(int dx, int dy) override;
    void wheelEvent(QWheelEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseDoubleClickEvent(QMouseEvent* event) override;
    void keyPressEvent(QKeyEvent* event) override;
    void focusInEvent(QFocusEvent* event) override;
    void focusOutEvent(QFocusEvent* event) override;

private:
    double scale() const; // pixels per twip
    QSizeF pageSize(int index) const; // twips
    /// The page's top-left corner in content pixels (before scrolling).
    QPointF pageOrigin(int index) const;
    void updateGeometry();
    /// The first page (continuous) whose bottom gap reaches below y, in content pixels.
    int pageAtY(double y) const;
    void updateCurrentFromScroll();
    void ensureVisible(int page, const QRectF& twips);

    std::shared_ptr<const ViewerPages> m_pages;
    int m_zoom = 100;
    bool m_continuous = true;
    int m_current = 0;
    std::vector<double> m_tops; // twips from the first page's top, with the gaps
    std::vector<PageSearch::Hit> m_hits;
    int m_currentHit = -1;
};

} // namespace reportrt
