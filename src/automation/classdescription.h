#pragma once

#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>
#include <functional>
#include <span>
#include <vector>

namespace core {
class EventSource;
}

namespace automation {

/// How a member is invoked: a method call, a property read, a property assignment (Let) or
/// an object property assignment (Set).
enum class MemberKind { Method, Get, Put, PutRef };

/// One declared parameter of a member or an event.
struct ParamDescription {
    QString name;
    /// The Basic type name: Boolean, Byte, Integer, Long, Single, Double, Currency, Date,
    /// String, Variant, Object, a class or enumeration name, or an element type followed by
    /// "()" for an array. Empty until the class builder fills it from the C++ signature.
    QString type;
    bool optional = false;
    /// Taken by a missing optional argument; Missing when the declaration gives none (the
    /// member then sees an omitted argument, or the type's zero value).
    core::Variant defaultValue = core::Variant::missing();
    /// Declared by reference: the member's final value of the argument travels back to the
    /// caller.
    bool byRef = true;

    bool hasDefault() const { return !defaultValue.isMissing(); }
};

/// The C++ side of a member. Arguments arrive already coerced to their declared types, one
/// per declared parameter (missing optional ones carry their default or Missing); by-
/// reference results are written back into the span.
using Invoker = std::function<core::Variant(core::Object& self, std::span<core::Variant> args)>;

/// One entry of a dispatch interface. A property with a getter and a setter is two entries
/// that share name and dispatch id.
struct MemberDescription {
    QString name;
    int32_t dispid = 0;
    MemberKind kind = MemberKind::Method;
    std::vector<ParamDescription> params;
    /// Basic type name of the result; empty for a procedure.
    QString returnType;
    /// Not shown to users of the type library (the enumerator, for one).
    bool hidden = false;
    Invoker invoke;
};

/// One event of an outgoing interface.
struct EventDescription {
    QString name;
    int32_t dispid = 0;
    std::vector<ParamDescription> params;
};

/// Everything the automation layer knows about one class: the name its objects report
/// through core::Object::className(), its dispatch interface, how hosts create it and the
/// events it raises.
struct ClassDescription {
    QString name;
    QString interfaceName;
    /// Hosts may create it with `create`.
    bool creatable = false;
    /// Part of the component's type library. Platform and runtime classes that are only
    /// handed out (Scripting.Dictionary, the runtime's report) are described for late binding
    /// but not listed.
    bool inTypeLibrary = true;
    std::function<core::ObjectPtr()> factory;
    /// The outgoing interface; empty when the class raises no events.
    QString eventInterfaceName;
    std::vector<EventDescription> events;
    /// Finds the event source of an object of this class; the default looks for an object
    /// that is itself a core::EventSource.
    std::function<core::EventSource*(core::Object&)> eventSource;
    std::vector<MemberDescription> members;

    const EventDescription* event(int32_t dispid) const;
};

/// A Basic enumeration of the type library.
struct EnumDescription {
    struct Value {
        QString name;
        int32_t value = 0;
    };
    QString name;
    std::vector<Value> values;
};

QString memberKindName(MemberKind kind);

} // namespace automation
