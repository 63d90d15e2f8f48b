#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <optional>
#include <vector>

namespace core {

/// The Basic Collection: ordered, 1-based, optional string keys compared without regard to
/// case, each key at most once.
class LUDMOX_EXPORT Collection : public Object {
public:
    QString className() const override { return QStringLiteral("Collection"); }

    int32_t count() const { return static_cast<int32_t>(m_entries.size()); }
    /// Raises 457 when the key is already used; an empty key means no key.
    void add(const Variant& item, const QString& key = QString());
    /// By 1-based position (Subscript out of range, 9) or by key (Invalid procedure call, 5).
    Variant item(const Variant& indexOrKey) const;
    /// The position (1-based) of a key, or nothing.
    std::optional<int32_t> find(const QString& key) const;
    void remove(const Variant& indexOrKey);
    /// Items in order, for enumeration.
    std::vector<Variant> items() const;

private:
    struct Entry {
        Variant item;
        QString key;
    };
    int32_t position(const Variant& indexOrKey) const; // 0-based

    std::vector<Entry> m_entries;
};

} // namespace core
