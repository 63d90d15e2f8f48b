#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <vector>

namespace core {

/// Scripting.Dictionary: ordered key/item pairs. Binary compare mode (0) compares text keys
/// exactly; text compare mode (1) without regard to case. Numeric keys compare by value.
class LUDMOX_EXPORT Dictionary : public Object {
public:
    enum CompareMode : int32_t { BinaryCompare = 0, TextCompare = 1 };

    explicit Dictionary(CompareMode mode = BinaryCompare);
    QString className() const override { return QStringLiteral("Scripting.Dictionary"); }

    CompareMode compareMode() const { return m_mode; }
    /// Raises 5 once the dictionary holds items.
    void setCompareMode(CompareMode mode);

    int32_t count() const { return static_cast<int32_t>(m_entries.size()); }
    bool exists(const Variant& key) const;
    /// Raises 457 when the key exists, 13 for an array key.
    void add(const Variant& key, const Variant& item);
    /// The item, or Empty when absent (reading adds the key, as Scripting.Dictionary does).
    Variant item(const Variant& key);
    /// The item without adding the key; Empty when absent.
    Variant value(const Variant& key) const;
    void setItem(const Variant& key, const Variant& item);
    /// Raises 32811 ("Element not found") when absent.
    void remove(const Variant& key);
    void removeAll();
    std::vector<Variant> keys() const;
    std::vector<Variant> items() const;

private:
    struct Entry {
        Variant key;
        Variant item;
    };
    int indexOf(const Variant& key) const;

    CompareMode m_mode;
    std::vector<Entry> m_entries;
};

} // namespace core
