#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "reports/moxstatus115.h"

namespace automation {

using reports::MoxStatus115;

// Public fields, numbered as public variables of a class are (0x4003xxxx in declaration
// order).
void registerMoxStatus115(Registry& registry)
{
    ClassBuilder<MoxStatus115> c(QStringLiteral("MoxStatus115"), QStringLiteral("_MoxStatus115"));
    c.field(QStringLiteral("NumberOfPages"), 0x40030000, &MoxStatus115::NumberOfPages);
    c.field(
        QStringLiteral("NumberOfRecordPrinted"), 0x40030001, &MoxStatus115::NumberOfRecordPrinted);
    c.field(QStringLiteral("NumberOfRecordRead"), 0x40030002, &MoxStatus115::NumberOfRecordRead);
    c.field(QStringLiteral("NumberOfRecordSelected"), 0x40030003,
        &MoxStatus115::NumberOfRecordSelected);
    c.field(QStringLiteral("Progress"), 0x40030004, &MoxStatus115::Progress,
        { .returns = QStringLiteral("enuPrintProgress") });
    registry.add(c.take());
}

} // namespace automation
