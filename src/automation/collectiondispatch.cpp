#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "core/collection.h"

namespace automation {

using core::Collection;
using core::Variant;

// The Basic Collection, for the lists of values the component hands to hosts.
void registerCollection(Registry& registry)
{
    ClassBuilder<Collection> c(QStringLiteral("Collection"), QStringLiteral("_Collection"));
    c.outsideTypeLibrary();
    c.method(QStringLiteral("Item"), 0, &Collection::item, { param(QStringLiteral("Index")) });
    c.method(QStringLiteral("Add"), 1,
        [](Collection& collection, const Variant& item, const Variant& key) {
            collection.add(item, key.isMissing() ? QString() : key.toText());
        },
        { param(QStringLiteral("Item")), optionalParam(QStringLiteral("Key")) });
    c.method(QStringLiteral("Count"), 2, &Collection::count);
    c.method(QStringLiteral("Remove"), 3, &Collection::remove, { param(QStringLiteral("Index")) });
    c.enumerator(QStringLiteral("_NewEnum"), &Collection::items);
    registry.add(c.take());
}

} // namespace automation
