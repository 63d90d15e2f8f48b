#include "automation/registry.h"
#include "automation/tables_p.h"

namespace automation {

void registerEnumerations(Registry& registry)
{
    registry.addEnum({ QStringLiteral("enuPrintProgress"),
        {
            { QStringLiteral("eppNoReport"), 0 },
            { QStringLiteral("eppPrintingNotStarted"), 1 },
            { QStringLiteral("eppPrintingInProgress"), 2 },
            { QStringLiteral("eppPrintingCompleted"), 3 },
            { QStringLiteral("eppPrintingFailed"), 4 },
            { QStringLiteral("eppPrintingCancelled"), 5 },
            { QStringLiteral("eppPrintingHalted"), 6 },
        } });
    registry.addEnum({ QStringLiteral("MoxServerTypes"),
        {
            { QStringLiteral("ecstNone"), 0 },
            { QStringLiteral("ecstMSJET"), 1 },
            { QStringLiteral("ecstMSSQL"), 2 },
            { QStringLiteral("ecstMSJET40"), 3 },
        } });
}

} // namespace automation
