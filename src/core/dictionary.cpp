#include "core/dictionary.h"

#include "core/comerror.h"

namespace core {

namespace {

bool sameKey(const Variant& a, const Variant& b, Dictionary::CompareMode mode)
{
    // Numbers are one key whatever their type (1, 1.0 and CCur(1)); text "1" is another.
    if (isNumberType(a.type()) && isNumberType(b.type()))
        return a.toDouble() == b.toDouble();
    if (a.type() != b.type())
        return false;
    switch (a.type()) {
    case VariantType::String:
        return a.toText().compare(b.toText(),
                   mode == Dictionary::TextCompare ? Qt::CaseInsensitive : Qt::CaseSensitive)
            == 0;
    case VariantType::Boolean:
    case VariantType::Date:
        return a.toDouble() == b.toDouble();
    default:
        return a == b;
    }
}

void checkMode(int32_t mode)
{
    if (mode != Dictionary::BinaryCompare && mode != Dictionary::TextCompare)
        throw ComError::basic(ErrorNumber::InvalidProcedureCall);
}

/// Arrays cannot be keys: they have no identity to find them by again.
void checkKey(const Variant& key)
{
    if (key.isArray())
        throw ComError::basic(ErrorNumber::TypeMismatch);
}

} // namespace

Dictionary::Dictionary(CompareMode mode)
    : m_mode(mode)
{
    checkMode(mode);
}

void Dictionary::setCompareMode(CompareMode mode)
{
    checkMode(mode);
    if (!m_entries.empty())
        throw ComError::basic(ErrorNumber::InvalidProcedureCall);
    m_mode = mode;
}

bool Dictionary::exists(const Variant& key) const
{
    return indexOf(key) >= 0;
}

void Dictionary::add(const Variant& key, const Variant& item)
{
    checkKey(key);
    if (indexOf(key) >= 0)
        throw ComError::basic(ErrorNumber::DuplicateKey);
    m_entries.push_back({ key, item });
}

Variant Dictionary::item(const Variant& key)
{
    checkKey(key);
    const int index = indexOf(key);
    if (index >= 0)
        return m_entries[static_cast<size_t>(index)].item;
    m_entries.push_back({ key, Variant() });
    return Variant();
}

Variant Dictionary::value(const Variant& key) const
{
    const int index = indexOf(key);
    return index >= 0 ? m_entries[static_cast<size_t>(index)].item : Variant();
}

void Dictionary::setItem(const Variant& key, const Variant& item)
{
    checkKey(key);
    const int index = indexOf(key);
    if (index >= 0)
        m_entries[static_cast<size_t>(index)].item = item;
    else
        m_entries.push_back({ key, item });
}

void Dictionary::remove(const Variant& key)
{
    const int index = indexOf(key);
    if (index < 0)
        throw ComError::basic(ErrorNumber::ElementNotFound);
    m_entries.erase(m_entries.begin() + index);
}

void Dictionary::removeAll()
{
    m_entries.clear();
}

std::vector<Variant> Dictionary::keys() const
{
    std::vector<Variant> keys;
    keys.reserve(m_entries.size());
    for (const Entry& entry : m_entries)
        keys.push_back(entry.key);
    return keys;
}

std::vector<Variant> Dictionary::items() const
{
    std::vector<Variant> items;
    items.reserve(m_entries.size());
    for (const Entry& entry : m_entries)
        items.push_back(entry.item);
    return items;
}

int Dictionary::indexOf(const Variant& key) const
{
    if (key.isArray())
        return -1;
    for (size_t i = 0; i < m_entries.size(); ++i) {
        if (sameKey(m_entries[i].key, key, m_mode))
            return static_cast<int>(i);
    }
    return -1;
}

} // namespace core
