#include "tables_p.h"

namespace automation {

void registerComponentTables(Registry& registry)
{
    registerEnumerations(registry);

    registerDictionary(registry);
    registerCollection(registry);
    registerEnumerator(registry);
    registerRuntimeReport(registry);
}

} // namespace automation
