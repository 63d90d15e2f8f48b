#include "automation/classbuilder.h"
#include "automation/enumerator.h"
#include "automation/registry.h"
#include "automation/tables_p.h"

namespace automation {

// What a hidden enumerator member hands out; a host that asks for it directly can still
// enumerate it.
void registerEnumerator(Registry& registry)
{
    ClassBuilder<Enumerator> c(QStringLiteral("Enumerator"), QStringLiteral("IEnumVARIANT"));
    c.outsideTypeLibrary();
    c.enumerator(QStringLiteral("_NewEnum"), &Enumerator::items);
    registry.add(c.take());
}

} // namespace automation
