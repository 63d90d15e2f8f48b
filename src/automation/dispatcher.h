#pragma once

#include "automation/classdescription.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <optional>
#include <vector>

namespace automation {

class Registry;

/// Late binding: calls a member of any described object by name or dispatch id, the way a
/// host's dispatch call reaches it. The server and the component's own by-name calls both
/// come through here.
///
/// Failures before the member runs raise DispatchError (member not found, wrong number of
/// arguments, argument not optional, an argument that does not convert); whatever the
/// member raises passes through unchanged.
class Dispatcher {
public:
    /// Uses the process-wide registry.
    Dispatcher();
    explicit Dispatcher(const Registry& registry);

    const Registry& registry() const { return m_registry; }

    /// The description of the object's class; DispatchError when it has none.
    const ClassDescription& describe(const core::Object& object) const;

    /// Finds a member by name (without regard to case) or dispatch id. Without a kind, a
    /// method or else a property read is meant. A put finds a putref and the other way round
    /// when the class declares only one of them, and a method call finds a property read
    /// with the same name, as dispatch callers that do not tell the two apart expect.
    const MemberDescription& resolve(const ClassDescription& description, const QString& name,
        std::optional<MemberKind> kind) const;
    const MemberDescription& resolve(
        const ClassDescription& description, int32_t dispid, std::optional<MemberKind> kind) const;

    /// Calls a member with positional arguments; a Missing value omits that argument (it
    /// takes its declared default). For a put or putref the last argument is the value.
    /// On return `args` holds the final value of every argument: by-reference results, the
    /// values as converted for the others, Missing where omitted.
    core::Variant invoke(const core::ObjectPtr& object, const MemberDescription& member,
        std::vector<core::Variant>& args) const;
    core::Variant invoke(const core::ObjectPtr& object, const QString& name,
        std::optional<MemberKind> kind, std::vector<core::Variant>& args) const;

    /// Conveniences for calls by name that need no by-reference results.
    core::Variant call(const core::ObjectPtr& object, const QString& name,
        std::vector<core::Variant> args = {}) const;
    core::Variant get(const core::ObjectPtr& object, const QString& name,
        std::vector<core::Variant> args = {}) const;
    void put(const core::ObjectPtr& object, const QString& name, const core::Variant& value) const;

    /// What iterating the object yields (For Each): the items of its hidden enumerator.
    std::vector<core::Variant> enumerate(const core::ObjectPtr& object) const;

    /// Converts a value to a declared type with the Basic conversion rules; raises the
    /// conversion's ComError (13 Type mismatch, 6 Overflow, 94 Invalid use of Null).
    core::Variant coerce(const core::Variant& value, const QString& typeName) const;

private:
    const Registry& m_registry;
};

} // namespace automation
