#pragma once

#include "core/object.h"

#include <QtGlobal>
#include <cstdint>
#include <functional>
#include <memory>
#include <unordered_map>

namespace automation {

/// The objects a host holds, by handle. An object keeps one handle for as long as it lives,
/// so the host always sees the same object under the same number; every hand-out counts one
/// host reference, and the table holds the object while the host holds any.
class HandleTable {
public:
    using Handle = qint64;

    HandleTable() = default;
    HandleTable(const HandleTable&) = delete;
    HandleTable& operator=(const HandleTable&) = delete;

    /// Hands the object to the host: its handle (0 for Nothing), one host reference more.
    Handle handOut(const core::ObjectPtr& object);
    /// The object the host holds under the handle, or null.
    core::ObjectPtr object(Handle handle) const;
    /// The handle of an object the host holds, or 0.
    Handle handleOf(const core::Object* object) const;
    int32_t hostReferences(Handle handle) const;

    /// Gives one host reference back; false for a handle the host does not hold. When the
    /// last one goes, `dropping` runs with the handle and the table lets the object go.
    bool release(Handle handle);
    /// Lets every object go (newest first); returns how many there were.
    size_t clear();

    /// The number of objects the host holds.
    size_t size() const { return m_held.size(); }

    /// Runs before the table lets an object go (to end its event connection).
    void setDroppingHandler(std::function<void(Handle)> handler)
    {
        m_dropping = std::move(handler);
    }

private:
    struct Held {
        core::ObjectPtr object;
        int32_t references = 0;
    };
    struct Known {
        std::weak_ptr<core::Object> object;
        Handle handle = 0;
    };
    void forgetExpired();

    std::unordered_map<Handle, Held> m_held;
    // Every object that ever had a handle and may still live, so that it gets the same one
    // again; entries of dead objects are swept now and then.
    std::unordered_map<const core::Object*, Known> m_known;
    Handle m_nextHandle = 1;
    std::function<void(Handle)> m_dropping;
};

} // namespace automation
