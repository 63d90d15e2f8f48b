#include "automation/tables_p.h"

namespace automation {

void registerComponentTables(Registry& registry)
{
    registerEnumerations(registry);

    registerMoxEngine115(registry);
    registerMoxReports115(registry);
    registerMoxStatus115(registry);
    registerMoxEvents115(registry);
    registerMoxReport115(registry);
    registerClsMoxViewer115(registry);
    registerIMoxViewer115(registry);

    registerDictionary(registry);
    registerCollection(registry);
    registerEnumerator(registry);
    registerRuntimeReport(registry);

    registerInputBoxParams(registry);
    registerInputBoxParamsItem(registry);
}

} // namespace automation
