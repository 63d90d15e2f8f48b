#include "reportrt/layout/pagegeometry.h"

#include "reportrt/base/logging_p.h"
#include "reportrt/document/reportdocument.h"

#include <QPageSize>
#include <QSizeF>

namespace reportrt {

PageGeometry PageGeometry::of(const PageSetup& setup)
{
    QPageSize size(QPageSize::id(setup.paperSize));
    if (!size.isValid() || size.id() == QPageSize::Custom) {
        qCWarning(lcOutput, "paper size code %d is unknown; laying out on A4", setup.paperSize);
        size = QPageSize(QPageSize::A4);
    }
    // 20 twips to the point.
    QSizeF paper = size.size(QPageSize::Point) * 20.0;
    if (setup.orientation == 2)
        paper.transpose();
    PageGeometry g;
    g.width = paper.width();
    g.height = paper.height();
    g.left = setup.leftMargin;
    g.top = setup.topMargin;
    g.right = setup.rightMargin;
    g.bottom = setup.bottomMargin;
    return g;
}

} // namespace reportrt
