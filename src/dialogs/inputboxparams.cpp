#include "dialogs/inputboxparams.h"

#include <algorithm>

namespace dialogs {

std::vector<InputBoxParams::Entry>::const_iterator InputBoxParams::find(const QString& key) const
{
    return std::find_if(m_items.begin(), m_items.end(),
        [&key](const Entry& entry) { return entry.key.compare(key, Qt::CaseInsensitive) == 0; });
}

InputBoxParams::ItemPtr InputBoxParams::Item(const QString& key)
{
    if (const auto it = find(key); it != m_items.end())
        return it->item;
    auto item = std::make_shared<InputBoxParamsItem>();
    item->Name = key;
    m_items.push_back({ key, item });
    return item;
}

std::vector<InputBoxParams::ItemPtr> InputBoxParams::NewEnum() const
{
    std::vector<ItemPtr> items;
    items.reserve(m_items.size());
    for (const Entry& entry : m_items)
        items.push_back(entry.item);
    return items;
}

bool InputBoxParams::Exists(const QString& key) const
{
    return find(key) != m_items.end();
}

void InputBoxParams::Remove(const QString& key)
{
    if (const auto it = find(key); it != m_items.end())
        m_items.erase(it);
}

} // namespace dialogs
