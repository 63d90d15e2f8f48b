#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "core/dictionary.h"

namespace automation {

using core::Dictionary;
using core::Variant;

// Scripting.Dictionary as scripting hosts know it, with its dispatch ids, so a host can
// hand the component a dictionary of parameter values.
void registerDictionary(Registry& registry)
{
    ClassBuilder<Dictionary> c(
        QStringLiteral("Scripting.Dictionary"), QStringLiteral("IDictionary"));
    c.creatable().outsideTypeLibrary();
    c.putRef(QStringLiteral("Item"), 0, &Dictionary::setItem,
        { param(QStringLiteral("Key")), byVal(QStringLiteral("pRetItem")) });
    c.put(QStringLiteral("Item"), 0, &Dictionary::setItem,
        { param(QStringLiteral("Key")), byVal(QStringLiteral("pRetItem")) });
    c.get(QStringLiteral("Item"), 0, &Dictionary::item, { param(QStringLiteral("Key")) });
    c.method(QStringLiteral("Add"), 1, &Dictionary::add,
        { param(QStringLiteral("Key")), param(QStringLiteral("Item")) });
    c.get(QStringLiteral("Count"), 2, &Dictionary::count);
    c.method(QStringLiteral("Exists"), 3, &Dictionary::exists, { param(QStringLiteral("Key")) });
    c.method(QStringLiteral("Items"), 4,
        [](Dictionary& d) { return Variant(core::VariantArray::fromList(d.items())); });
    c.method(QStringLiteral("Keys"), 6,
        [](Dictionary& d) { return Variant(core::VariantArray::fromList(d.keys())); });
    c.method(QStringLiteral("Remove"), 7, &Dictionary::remove, { param(QStringLiteral("Key")) });
    c.method(QStringLiteral("RemoveAll"), 8, &Dictionary::removeAll);
    c.property(
        QStringLiteral("CompareMode"), 9,
        [](Dictionary& d) { return static_cast<int32_t>(d.compareMode()); },
        [](Dictionary& d, int32_t mode) {
            if (mode != Dictionary::BinaryCompare && mode != Dictionary::TextCompare)
                throw core::ComError::basic(core::ErrorNumber::InvalidProcedureCall);
            d.setCompareMode(static_cast<Dictionary::CompareMode>(mode));
        });
    c.enumerator(QStringLiteral("_NewEnum"), &Dictionary::keys);
    registry.add(c.take());
}

} // namespace automation
