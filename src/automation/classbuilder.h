#pragma once

#include "automation/classdescription.h"
#include "automation/dispatchtraits.h"
#include "automation/enumerator.h"

#include <QString>
#include <concepts>
#include <memory>
#include <utility>
#include <vector>

namespace automation {

/// A parameter declared by reference (Basic's default). The type comes from the C++
/// signature unless given: enumerations and object classes name theirs.
ParamDescription param(const QString& name, const QString& type = QString());
/// A parameter declared ByVal.
ParamDescription byVal(const QString& name, const QString& type = QString());
ParamDescription byVal(ParamDescription param);
/// An optional parameter; without a default value the member sees it omitted (Missing, or
/// std::nullopt for a std::optional argument, or the type's zero value).
ParamDescription optionalParam(const QString& name,
    const core::Variant& defaultValue = core::Variant::missing(), const QString& type = QString());

/// What a declaration may add to a member beyond its signature.
struct MemberOptions {
    /// The Basic type of the result where the C++ type does not tell it (object classes,
    /// enumerations).
    QString returns;
    bool hidden = false;
};

/// Builds the description of one class, one line per member:
///
///     ClassBuilder<MoxEngine115> c(u"MoxEngine115"_s, u"_MoxEngine115"_s);
///     c.creatable();
///     c.method(u"Init"_s, 0x60030008, &MoxEngine115::Init,
///         { param(u"Language"_s), param(u"XPStyle"_s), param(u"BackColor"_s), param(u"MDIHwnd"_s)
///         });
///     c.get(u"LastError"_s, 0x68030006, &MoxEngine115::LastError);
///     registry.add(c.take());
///
/// A callable is a member function of the class (or of a base) or a function object whose
/// first parameter is a reference to the object. Its arguments are bool, uint8_t, int16_t,
/// int32_t, float, double, core::Currency, QString, core::Variant, core::VariantArray,
/// std::shared_ptr of an object class, an enumeration, or std::optional of one of these; by
/// value or const reference for arguments taken in, by non-const reference for arguments the
/// member writes back. Declaration errors raise std::logic_error when the table is built.
template <class C> class ClassBuilder {
public:
    ClassBuilder(const QString& name, const QString& interfaceName)
    {
        m_description.name = name;
        m_description.interfaceName = interfaceName;
    }

    /// Hosts may create it; objects come from the default constructor.
    ClassBuilder& creatable() requires std::default_initializable<C>
    {
        return creatable([] { return std::make_shared<C>(); });
    }
    template <class Factory> ClassBuilder& creatable(Factory factory)
    {
        m_description.creatable = true;
        m_description.factory = [factory]() -> core::ObjectPtr { return factory(); };
        return *this;
    }

    /// Described for late binding only, not listed in the type library.
    ClassBuilder& outsideTypeLibrary()
    {
        m_description.inTypeLibrary = false;
        return *this;
    }

    /// The outgoing interface. Events are raised through the object's core::EventSource:
    /// the object itself by default, or what `source` returns.
    ClassBuilder& events(const QString& interfaceName)
    {
        m_description.eventInterfaceName = interfaceName;
        return *this;
    }
    template <class Source> ClassBuilder& events(const QString& interfaceName, Source source)
    {
        m_description.eventInterfaceName = interfaceName;
        m_description.eventSource = [source](core::Object& object) -> core::EventSource* {
            auto* typed = dynamic_cast<C*>(&object);
            return typed ? source(*typed) : nullptr;
        };
        return *this;
    }
    ClassBuilder& event(const QString& name, int32_t dispid, std::vector<ParamDescription> params)
    {
        m_description.events.push_back({ name, dispid, std::move(params) });
        return *this;
    }

    template <class F>
    ClassBuilder& method(const QString& name, int32_t dispid, F callable,
        std::vector<ParamDescription> params = {}, MemberOptions options = {})
    {
        return member(name, dispid, MemberKind::Method, callable, std::move(params), options);
    }
    template <class F>
    ClassBuilder& get(const QString& name, int32_t dispid, F callable,
        std::vector<ParamDescription> params = {}, MemberOptions options = {})
    {
        return member(name, dispid, MemberKind::Get, callable, std::move(params), options);
    }
    /// A property assignment; the value is the last parameter ("RHS" ByVal when no
    /// parameters are declared).
    template <class F>
    ClassBuilder& put(const QString& name, int32_t dispid, F callable,
        std::vector<ParamDescription> params = {}, MemberOptions options = {})
    {
        return member(
            name, dispid, MemberKind::Put, callable, valueParams(std::move(params)), options);
    }
    template <class F>
    ClassBuilder& putRef(const QString& name, int32_t dispid, F callable,
        std::vector<ParamDescription> params = {}, MemberOptions options = {})
    {
        return member(
            name, dispid, MemberKind::PutRef, callable, valueParams(std::move(params)), options);
    }

    /// A property without index parameters: the getter, and the setter as put, or as putref
    /// for an object type, or as both for a Variant.
    template <class G, class S>
    ClassBuilder& property(
        const QString& name, int32_t dispid, G getter, S setter, MemberOptions options = {})
    {
        get(name, dispid, getter, {}, options);
        using Value = detail::Plain<typename detail::Callable<G>::Result>;
        for (MemberKind kind : assignmentKinds<Value>())
            member(name, dispid, kind, setter, { byVal(QStringLiteral("RHS"), options.returns) },
                { QString(), options.hidden });
        return *this;
    }

    /// A property whose getter and setter share one overloaded name, picked by the value
    /// type: `c.property<bool>(u"ConnectionFailed"_s, 0x68030005, &MoxEngine115::
    /// ConnectionFailed, &MoxEngine115::ConnectionFailed)`.
    template <class T, class K>
    ClassBuilder& property(const QString& name, int32_t dispid, T (K::*getter)() const,
        void (K::*setter)(T), MemberOptions options = {})
    {
        return property<decltype(getter), decltype(setter)>(name, dispid, getter, setter, options);
    }
    template <class T, class K>
    ClassBuilder& property(const QString& name, int32_t dispid, T (K::*getter)() const,
        void (K::*setter)(const T&), MemberOptions options = {})
    {
        return property<decltype(getter), decltype(setter)>(name, dispid, getter, setter, options);
    }

    /// A public field: read and written as a property.
    template <class T, class K>
    ClassBuilder& field(
        const QString& name, int32_t dispid, T K::*field, MemberOptions options = {})
    {
        return property(
            name, dispid, [field](K& object) -> T { return object.*field; },
            [field](K& object, const T& value) { object.*field = value; }, options);
    }

    /// The hidden enumerator (dispatch id -4): `items` returns what iterating the object
    /// yields, as a container of core::Variant.
    template <class F> ClassBuilder& enumerator(const QString& name, F items)
    {
        MemberDescription description;
        description.name = name;
        description.dispid = -4;
        description.kind = MemberKind::Get;
        description.returnType = QStringLiteral("Object");
        description.hidden = true;
        description.invoke = [items](core::Object& self, std::span<core::Variant>) {
            auto* object = dynamic_cast<C*>(&self);
            if (!object)
                throw DispatchError::memberNotFound(self.className(), QStringLiteral("_NewEnum"));
            std::vector<core::Variant> values;
            for (const auto& value : std::invoke(items, *object))
                values.push_back(detail::Arg<detail::Plain<decltype(value)>>::to(value));
            return core::Variant(core::ObjectPtr(std::make_shared<Enumerator>(std::move(values))));
        };
        m_description.members.push_back(std::move(description));
        return *this;
    }

    ClassDescription take() { return std::move(m_description); }

private:
    template <class F>
    ClassBuilder& member(const QString& name, int32_t dispid, MemberKind kind, F callable,
        std::vector<ParamDescription> params, const MemberOptions& options)
    {
        using Signature = detail::Callable<F>;
        using Class = typename Signature::Class;
        using Result = typename Signature::Result;
        static_assert(std::is_base_of_v<Class, C> || std::is_base_of_v<C, Class>,
            "the callable belongs to another class");
        MemberDescription description;
        description.name = name;
        description.dispid = dispid;
        description.kind = kind;
        description.params = std::move(params);
        detail::completeParams(
            description.params, m_description.name + u'.' + name, typename Signature::Args {});
        description.returnType
            = options.returns.isEmpty() ? detail::resultType<Result>() : options.returns;
        description.hidden = options.hidden;
        description.invoke = [callable](core::Object& self, std::span<core::Variant> args) {
            return detail::invokeCallable<F, Class, Result>(
                callable, self, args, typename Signature::Args {});
        };
        m_description.members.push_back(std::move(description));
        return *this;
    }

    static std::vector<ParamDescription> valueParams(std::vector<ParamDescription> params)
    {
        if (params.empty())
            params.push_back(byVal(QStringLiteral("RHS")));
        return params;
    }

    template <class Value> static std::vector<MemberKind> assignmentKinds()
    {
        if constexpr (std::is_same_v<Value, core::Variant>)
            return { MemberKind::Put, MemberKind::PutRef };
        else if constexpr (requires { typename Value::element_type; })
            return { MemberKind::PutRef };
        else
            return { MemberKind::Put };
    }

    ClassDescription m_description;
};

} // namespace automation
