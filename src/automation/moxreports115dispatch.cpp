#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"

namespace automation {

using reports::MoxReports115;

void registerMoxReports115(Registry& registry)
{
    ClassBuilder<MoxReports115> c(
        QStringLiteral("MoxReports115"), QStringLiteral("_MoxReports115"));
    c.method(QStringLiteral("Item"), 0, &MoxReports115::Item,
        { param(QStringLiteral("ReportName")) }, { .returns = QStringLiteral("MoxReport115") });
    c.method(QStringLiteral("Remove"), 0x60030001, &MoxReports115::Remove,
        { param(QStringLiteral("ReportName")) });
    c.method(QStringLiteral("Destroy"), 0x60030002, &MoxReports115::Destroy);
    c.enumerator(QStringLiteral("NewEnum"), &MoxReports115::NewEnum);
    registry.add(c.take());
}

} // namespace automation
