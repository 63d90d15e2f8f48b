#include "automation/handletable.h"

#include <algorithm>
#include <vector>

namespace automation {

HandleTable::Handle HandleTable::handOut(const core::ObjectPtr& object)
{
    if (!object)
        return 0;
    Handle handle = 0;
    const auto known = m_known.find(object.get());
    // An expired entry at the same address belongs to an object that has died; this one is
    // new and gets a new handle.
    if (known != m_known.end() && !known->second.object.expired()) {
        handle = known->second.handle;
    } else {
        handle = m_nextHandle++;
        m_known[object.get()] = Known { object, handle };
    }
    Held& held = m_held[handle];
    held.object = object;
    ++held.references;
    return handle;
}

core::ObjectPtr HandleTable::object(Handle handle) const
{
    const auto found = m_held.find(handle);
    return found == m_held.end() ? nullptr : found->second.object;
}

HandleTable::Handle HandleTable::handleOf(const core::Object* object) const
{
    const auto known = m_known.find(object);
    if (known == m_known.end() || !m_held.contains(known->second.handle))
        return 0;
    return known->second.handle;
}

int32_t HandleTable::hostReferences(Handle handle) const
{
    const auto found = m_held.find(handle);
    return found == m_held.end() ? 0 : found->second.references;
}

bool HandleTable::release(Handle handle)
{
    const auto found = m_held.find(handle);
    if (found == m_held.end())
        return false;
    if (--found->second.references > 0)
        return true;
    if (m_dropping)
        m_dropping(handle);
    // The object may run its destructor here, and that may come back into the table; take
    // it out of the map first.
    core::ObjectPtr object = std::move(m_held.at(handle).object);
    m_held.erase(handle);
    object.reset();
    forgetExpired();
    return true;
}

size_t HandleTable::clear()
{
    std::vector<Handle> handles;
    handles.reserve(m_held.size());
    for (const auto& entry : m_held)
        handles.push_back(entry.first);
    std::sort(handles.begin(), handles.end(), std::greater<> {});
    if (m_dropping) {
        for (Handle handle : handles)
            m_dropping(handle);
    }
    std::vector<core::ObjectPtr> objects;
    objects.reserve(handles.size());
    for (Handle handle : handles)
        objects.push_back(std::move(m_held.at(handle).object));
    m_held.clear();
    const size_t count = objects.size();
    for (core::ObjectPtr& object : objects)
        object.reset();
    m_known.clear();
    return count;
}

void HandleTable::forgetExpired()
{
    if (m_known.size() < 2 * m_held.size() + 64)
        return;
    std::erase_if(m_known, [](const auto& entry) { return entry.second.object.expired(); });
}

} // namespace automation
