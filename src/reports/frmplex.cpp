#include "reports/frmplex.h"

namespace reports {

frmPlex::frmPlex()
    : QWidget(nullptr, Qt::Tool | Qt::FramelessWindowHint | Qt::WindowDoesNotAcceptFocus)
{
    setAttribute(Qt::WA_ShowWithoutActivating);
    setObjectName(QStringLiteral("frmPlex"));
    setGeometry(0, 0, 0, 0);
}

} // namespace reports
