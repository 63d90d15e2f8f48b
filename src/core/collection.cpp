#include "core/collection.h"

#include "core/comerror.h"

namespace core {

void Collection::add(const Variant& item, const QString& key)
{
    if (!key.isEmpty() && find(key))
        throw ComError::basic(ErrorNumber::DuplicateKey);
    m_entries.push_back({ item, key });
}

Variant Collection::item(const Variant& indexOrKey) const
{
    return m_entries[static_cast<size_t>(position(indexOrKey))].item;
}

std::optional<int32_t> Collection::find(const QString& key) const
{
    if (key.isEmpty())
        return std::nullopt;
    for (size_t i = 0; i < m_entries.size(); ++i) {
        if (m_entries[i].key.compare(key, Qt::CaseInsensitive) == 0)
            return static_cast<int32_t>(i) + 1;
    }
    return std::nullopt;
}

void Collection::remove(const Variant& indexOrKey)
{
    m_entries.erase(m_entries.begin() + position(indexOrKey));
}

std::vector<Variant> Collection::items() const
{
    std::vector<Variant> items;
    items.reserve(m_entries.size());
    for (const Entry& entry : m_entries)
        items.push_back(entry.item);
    return items;
}

int32_t Collection::position(const Variant& indexOrKey) const
{
    if (indexOrKey.type() == VariantType::String) {
        const std::optional<int32_t> found = find(indexOrKey.toText());
        if (!found)
            throw ComError::basic(ErrorNumber::InvalidProcedureCall);
        return *found - 1;
    }
    const int32_t index = indexOrKey.toLong();
    if (index < 1 || index > count())
        throw ComError::basic(ErrorNumber::SubscriptOutOfRange);
    return index - 1;
}

} // namespace core
