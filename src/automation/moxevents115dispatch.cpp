#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "reports/moxevents115.h"

namespace automation {

using reports::MoxEvents115;

// Every method raises its event with the same arguments, all by reference.
void registerMoxEvents115(Registry& registry)
{
    ClassBuilder<MoxEvents115> c(QStringLiteral("MoxEvents115"), QStringLiteral("_MoxEvents115"));
    c.method(QStringLiteral("QueryParameters"), 0x60030000, &MoxEvents115::QueryParameters,
        { param(QStringLiteral("Prompt")), param(QStringLiteral("Parameters")) });
    c.method(QStringLiteral("ErrorOccured"), 0x60030001, &MoxEvents115::ErrorOccured,
        { param(QStringLiteral("errorMsg")) });
    c.method(QStringLiteral("ShowParametersDialog"), 0x60030002,
        &MoxEvents115::ShowParametersDialog,
        { param(QStringLiteral("Parameters"), QStringLiteral("Object")),
            param(QStringLiteral("Cancelled")) });
    c.method(QStringLiteral("AfterDialogs"), 0x60030003, &MoxEvents115::AfterDialogs);

    c.events(QStringLiteral("__MoxEvents115"));
    c.event(QStringLiteral("QueryParameters"), MoxEvents115::QueryParametersEvent,
        { param(QStringLiteral("Prompt"), QStringLiteral("String")),
            param(QStringLiteral("Parameters"), QStringLiteral("Variant")) });
    c.event(QStringLiteral("ErrorOccured"), MoxEvents115::ErrorOccuredEvent,
        { param(QStringLiteral("errorMsg"), QStringLiteral("String")) });
    c.event(QStringLiteral("ShowParametersDialogEvent"), MoxEvents115::ShowParametersDialogEvent,
        { param(QStringLiteral("Parameters"), QStringLiteral("Object")),
            param(QStringLiteral("Cancelled"), QStringLiteral("Boolean")) });
    c.event(QStringLiteral("AfterDialogs"), MoxEvents115::AfterDialogsEvent, {});
    registry.add(c.take());
}

} // namespace automation
