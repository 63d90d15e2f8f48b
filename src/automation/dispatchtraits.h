#pragma once

// How C++ signatures map onto dispatch members: the Basic type of each C++ type, the
// conversion of a (declared-type) Variant into the C++ argument and of a C++ result back.
// Only the class builder uses this.

#include "automation/classdescription.h"
#include "automation/dispatcherror.h"
#include "core/comerror.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <stdexcept>
#include <tuple>
#include <type_traits>
#include <utility>

namespace automation::detail {

template <class T> struct Arg;

/// Scalars: the Basic type, how a Variant already coerced to that type becomes T, and back.
/// An omitted optional argument without default gives the type's zero value, as Basic does.
#define LUDMOX_SCALAR_ARG(CppType, BasicName, Convert)                                             \
    template <> struct Arg<CppType> {                                                              \
        static QString type() { return QStringLiteral(BasicName); }                                \
        static CppType from(const core::Variant& value)                                            \
        {                                                                                          \
            return value.isMissing() ? CppType {} : value.Convert();                               \
        }                                                                                          \
        static core::Variant to(const CppType& value) { return core::Variant(value); }             \
    };

LUDMOX_SCALAR_ARG(bool, "Boolean", toBoolean)
LUDMOX_SCALAR_ARG(uint8_t, "Byte", toByte)
LUDMOX_SCALAR_ARG(int16_t, "Integer", toInteger)
LUDMOX_SCALAR_ARG(int32_t, "Long", toLong)
LUDMOX_SCALAR_ARG(float, "Single", toSingle)
LUDMOX_SCALAR_ARG(double, "Double", toDouble)
LUDMOX_SCALAR_ARG(core::Currency, "Currency", toCurrency)
LUDMOX_SCALAR_ARG(QString, "String", toText)

#undef LUDMOX_SCALAR_ARG

template <> struct Arg<core::Variant> {
    static QString type() { return QStringLiteral("Variant"); }
    static core::Variant from(const core::Variant& value) { return value; }
    static core::Variant to(const core::Variant& value) { return value; }
};

template <> struct Arg<core::VariantArray> {
    static QString type() { return QStringLiteral("Variant()"); }
    static core::VariantArray from(const core::Variant& value)
    {
        return value.isMissing() ? core::VariantArray {} : value.array();
    }
    static core::Variant to(const core::VariantArray& value) { return core::Variant(value); }
};

/// Objects: any class of the component; the declaration names the class where it matters.
template <class T> struct Arg<std::shared_ptr<T>> {
    static_assert(std::is_base_of_v<core::Object, T>, "only core::Object classes dispatch");
    static QString type() { return QStringLiteral("Object"); }
    static std::shared_ptr<T> from(const core::Variant& value)
    {
        if (value.isMissing())
            return nullptr;
        core::ObjectPtr object = value.toObject();
        if constexpr (std::is_same_v<T, core::Object>) {
            return object;
        } else {
            auto typed = std::dynamic_pointer_cast<T>(object);
            if (object && !typed)
                throw core::ComError::basic(core::ErrorNumber::TypeMismatch);
            return typed;
        }
    }
    static core::Variant to(const std::shared_ptr<T>& value)
    {
        return core::Variant(core::ObjectPtr(value));
    }
};

/// An argument the member wants to see omitted: nothing when Missing.
template <class T> struct Arg<std::optional<T>> {
    static QString type() { return Arg<T>::type(); }
    static std::optional<T> from(const core::Variant& value)
    {
        if (value.isMissing())
            return std::nullopt;
        return Arg<T>::from(value);
    }
    static core::Variant to(const std::optional<T>& value)
    {
        return value ? Arg<T>::to(*value) : core::Variant::missing();
    }
};

/// Enumerations travel as Long; their Basic name must be declared with the parameter.
template <class T>
requires std::is_enum_v<T>
struct Arg<T> {
    static QString type() { return QString(); }
    static T from(const core::Variant& value)
    {
        return static_cast<T>(value.isMissing() ? 0 : value.toLong());
    }
    static core::Variant to(T value) { return core::Variant(static_cast<int32_t>(value)); }
};

template <class T> using Plain = std::remove_cvref_t<T>;

/// A parameter the member writes to: the caller sees the final value.
template <class T>
constexpr bool isOutParam
    = std::is_lvalue_reference_v<T> && !std::is_const_v<std::remove_reference_t<T>>;

template <class... A> struct TypeList {
    static constexpr size_t size = sizeof...(A);
};

/// Signature of a member function pointer: the class it needs, its result and arguments.
template <class M> struct MemberFunction;
#define LUDMOX_MEMBER_FUNCTION(Qualifiers)                                                         \
    template <class R, class K, class... A> struct MemberFunction<R (K::*)(A...) Qualifiers> {     \
        using Class = K;                                                                           \
        using Result = R;                                                                          \
        using Args = TypeList<A...>;                                                               \
    };
LUDMOX_MEMBER_FUNCTION()
LUDMOX_MEMBER_FUNCTION(const)
LUDMOX_MEMBER_FUNCTION(noexcept)
LUDMOX_MEMBER_FUNCTION(const noexcept)
#undef LUDMOX_MEMBER_FUNCTION

/// A function object (a lambda) whose first parameter is the object: `[](MoxEngine115&
/// engine, int32_t value) { ... }`.
template <class Op> struct FunctionObject;
template <class L, class R, class Self, class... A>
struct FunctionObject<R (L::*)(Self, A...) const> {
    using Class = std::remove_cvref_t<Self>;
    using Result = R;
    using Args = TypeList<A...>;
};
template <class L, class R, class Self, class... A>
struct FunctionObject<R (L::*)(Self, A...) const noexcept>
    : FunctionObject<R (L::*)(Self, A...) const> { };

/// A plain function whose first parameter is the object.
template <class R, class Self, class... A> struct FreeFunction {
    using Class = std::remove_cvref_t<Self>;
    using Result = R;
    using Args = TypeList<A...>;
};

template <class F> struct Callable : FunctionObject<decltype(&F::operator())> { };
template <class R, class Self, class... A>
struct Callable<R (*)(Self, A...)> : FreeFunction<R, Self, A...> { };
template <class F>
requires std::is_member_function_pointer_v<F>
struct Callable<F> : MemberFunction<F> {
};

template <class T> T convertArg(std::span<core::Variant> args, size_t index)
{
    try {
        return Arg<T>::from(args[index]);
    } catch (const core::ComError& error) {
        throw DispatchError::conversion(error, static_cast<int>(index));
    }
}

template <class A, class Local> void writeBack(core::Variant& arg, const Local& local)
{
    if constexpr (isOutParam<A>)
        arg = Arg<Plain<A>>::to(local);
}

template <class K, class F, class R, class... A, size_t... I>
core::Variant callWith(const F& function, K& object, [[maybe_unused]] std::span<core::Variant> args,
    std::index_sequence<I...>)
{
    // Braced initialisation converts the arguments left to right, so the first one that
    // does not convert is the one reported.
    std::tuple<Plain<A>...> locals { convertArg<Plain<A>>(args, I)... };
    core::Variant result;
    try {
        if constexpr (std::is_void_v<R>)
            std::invoke(function, object, std::get<I>(locals)...);
        else
            result = Arg<Plain<R>>::to(std::invoke(function, object, std::get<I>(locals)...));
    } catch (const DispatchError& error) {
        // A late-bound call made by the member failed; to this member's caller that is the
        // member's own error, not a fault of the call it made.
        throw core::ComError(error.number(), error.source(), error.description());
    }
    (writeBack<A>(args[I], std::get<I>(locals)), ...);
    return result;
}

template <class F, class K, class R, class... A>
core::Variant invokeCallable(
    const F& function, core::Object& self, std::span<core::Variant> args, TypeList<A...>)
{
    auto* object = dynamic_cast<K*>(&self);
    if (!object)
        throw DispatchError(DispatchNumber::MemberNotFound,
            QStringLiteral("The object of class %1 does not have this member")
                .arg(self.className()));
    return callWith<K, F, R, A...>(function, *object, args, std::index_sequence_for<A...> {});
}

/// Fills the declared parameters from the C++ signature: the type where none was declared,
/// and checks that every parameter the member writes to is declared by reference.
template <class... A>
void completeParams(std::vector<ParamDescription>& params, const QString& member, TypeList<A...>)
{
    if (params.size() != sizeof...(A))
        throw std::logic_error(QStringLiteral("%1 declares %2 parameters, its callable takes %3")
                                   .arg(member)
                                   .arg(params.size())
                                   .arg(sizeof...(A))
                                   .toStdString());
    size_t index = 0;
    [[maybe_unused]] auto complete = [&](QString type, bool isOut) {
        ParamDescription& param = params[index++];
        if (param.type.isEmpty())
            param.type = type;
        if (isOut && !param.byRef)
            throw std::logic_error(
                QStringLiteral("%1: %2 is written by the member but declared ByVal")
                    .arg(member, param.name)
                    .toStdString());
    };
    (complete(Arg<Plain<A>>::type(), isOutParam<A>), ...);
}

template <class R> QString resultType()
{
    if constexpr (std::is_void_v<R>)
        return QString();
    else
        return Arg<Plain<R>>::type();
}

} // namespace automation::detail
