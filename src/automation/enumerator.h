#pragma once

#include "core/object.h"
#include "core/variant.h"

#include <vector>

namespace automation {

/// What a class's hidden enumerator member hands out: a snapshot of the items iterating the
/// object yields, in order. Enumerating the enumerator yields the same items again.
class Enumerator : public core::Object {
public:
    explicit Enumerator(std::vector<core::Variant> items);
    QString className() const override { return QStringLiteral("Enumerator"); }

    const std::vector<core::Variant>& items() const { return m_items; }

private:
    std::vector<core::Variant> m_items;
};

} // namespace automation
