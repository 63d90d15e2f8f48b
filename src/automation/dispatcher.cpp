#include "automation/dispatcher.h"

#include "automation/dispatcherror.h"
#include "automation/enumerator.h"
#include "automation/registry.h"
#include "core/comerror.h"

#include <QHash>
#include <span>

namespace automation {

namespace {
std::optional<core::VariantType> scalarType(const QString& typeName)
{
    static const QHash<QString, core::VariantType> types {
        { QStringLiteral("Boolean"), core::VariantType::Boolean },
        { QStringLiteral("Byte"), core::VariantType::Byte },
        { QStringLiteral("Integer"), core::VariantType::Integer },
        { QStringLiteral("Long"), core::VariantType::Long },
        { QStringLiteral("Single"), core::VariantType::Single },
        { QStringLiteral("Double"), core::VariantType::Double },
        { QStringLiteral("Currency"), core::VariantType::Currency },
        { QStringLiteral("Date"), core::VariantType::Date },
        { QStringLiteral("String"), core::VariantType::String },
    };
    const auto found = types.constFind(typeName);
    if (found == types.cend())
        return std::nullopt;
    return *found;
}

[[noreturn]] void typeMismatch()
{
    throw core::ComError::basic(core::ErrorNumber::TypeMismatch);
}

const MemberDescription* pick(
    const ClassDescription& description, std::optional<MemberKind> kind, auto matches)
{
    auto find = [&](MemberKind wanted) -> const MemberDescription* {
        for (const MemberDescription& member : description.members) {
            if (member.kind == wanted && matches(member))
                return &member;
        }
        return nullptr;
    };
    if (!kind) {
        if (const MemberDescription* member = find(MemberKind::Method))
            return member;
        return find(MemberKind::Get);
    }
    if (const MemberDescription* member = find(*kind))
        return member;
    switch (*kind) {
    case MemberKind::Method:
        return find(MemberKind::Get);
    case MemberKind::Put:
        return find(MemberKind::PutRef);
    case MemberKind::PutRef:
        return find(MemberKind::Put);
    case MemberKind::Get:
        break;
    }
    return nullptr;
}
} // namespace

Dispatcher::Dispatcher()
    : m_registry(Registry::instance())
{ }

Dispatcher::Dispatcher(const Registry& registry)
    : m_registry(registry)
{ }

const ClassDescription& Dispatcher::describe(const core::Object& object) const
{
    const ClassDescription* description = m_registry.describe(object);
    if (!description)
        throw DispatchError(DispatchNumber::MemberNotFound,
            QStringLiteral("Objects of class %1 have no dispatch interface")
                .arg(object.className()));
    return *description;
}

const MemberDescription& Dispatcher::resolve(
    const ClassDescription& description, const QString& name, std::optional<MemberKind> kind) const
{
    const MemberDescription* member
        = pick(description, kind, [&](const MemberDescription& candidate) {
              return candidate.name.compare(name, Qt::CaseInsensitive) == 0;
          });
    if (!member)
        throw DispatchError::memberNotFound(description.name, name);
    return *member;
}

const MemberDescription& Dispatcher::resolve(
    const ClassDescription& description, int32_t dispid, std::optional<MemberKind> kind) const
{
    const MemberDescription* member = pick(description, kind,
        [&](const MemberDescription& candidate) { return candidate.dispid == dispid; });
    if (!member)
        throw DispatchError::memberNotFound(description.name, QString::number(dispid));
    return *member;
}

core::Variant Dispatcher::invoke(const core::ObjectPtr& object, const MemberDescription& member,
    std::vector<core::Variant>& args) const
{
    if (!object)
        throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
    const int declared = static_cast<int>(member.params.size());
    const int given = static_cast<int>(args.size());
    const bool isAssignment = member.kind == MemberKind::Put || member.kind == MemberKind::PutRef;

    // Which passed argument feeds each declared parameter (-1: none). An assignment's value
    // always goes to the last parameter, whatever index arguments precede it.
    std::vector<int> source(static_cast<size_t>(declared), -1);
    if (isAssignment) {
        if (given == 0 || given > declared)
            throw DispatchError::badParamCount(member.name, given, declared);
        for (int i = 0; i < given - 1; ++i)
            source[static_cast<size_t>(i)] = i;
        source.back() = given - 1;
    } else {
        if (given > declared)
            throw DispatchError::badParamCount(member.name, given, declared);
        for (int i = 0; i < given; ++i)
            source[static_cast<size_t>(i)] = i;
    }

    std::vector<core::Variant> bound(static_cast<size_t>(declared));
    for (size_t i = 0; i < bound.size(); ++i) {
        const ParamDescription& param = member.params[i];
        const int from = source[i];
        const core::Variant passed
            = from >= 0 ? args[static_cast<size_t>(from)] : core::Variant::missing();
        if (passed.isMissing()) {
            if (!param.optional)
                throw DispatchError::paramNotOptional(member.name, from >= 0 ? from : int(i));
            bound[i]
                = param.hasDefault() ? coerce(param.defaultValue, param.type) : param.defaultValue;
            continue;
        }
        try {
            bound[i] = coerce(passed, param.type);
        } catch (const core::ComError& error) {
            throw DispatchError::conversion(error, from);
        }
    }

    core::Variant result = member.invoke(*object, std::span<core::Variant>(bound));

    for (size_t i = 0; i < bound.size(); ++i) {
        const int from = source[i];
        if (from >= 0 && !args[static_cast<size_t>(from)].isMissing())
            args[static_cast<size_t>(from)] = bound[i];
    }
    return result;
}

core::Variant Dispatcher::invoke(const core::ObjectPtr& object, const QString& name,
    std::optional<MemberKind> kind, std::vector<core::Variant>& args) const
{
    if (!object)
        throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
    return invoke(object, resolve(describe(*object), name, kind), args);
}

core::Variant Dispatcher::call(
    const core::ObjectPtr& object, const QString& name, std::vector<core::Variant> args) const
{
    return invoke(object, name, MemberKind::Method, args);
}

core::Variant Dispatcher::get(
    const core::ObjectPtr& object, const QString& name, std::vector<core::Variant> args) const
{
    return invoke(object, name, MemberKind::Get, args);
}

void Dispatcher::put(
    const core::ObjectPtr& object, const QString& name, const core::Variant& value) const
{
    std::vector<core::Variant> args { value };
    invoke(object, name, value.isObject() ? MemberKind::PutRef : MemberKind::Put, args);
}

std::vector<core::Variant> Dispatcher::enumerate(const core::ObjectPtr& object) const
{
    if (!object)
        throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
    if (const auto* enumerator = dynamic_cast<const Enumerator*>(object.get()))
        return enumerator->items();
    std::vector<core::Variant> none;
    const core::Variant items
        = invoke(object, resolve(describe(*object), -4, MemberKind::Get), none);
    if (items.isArray())
        return items.array().values();
    const auto enumerator = items.objectAs<Enumerator>();
    if (!enumerator)
        typeMismatch();
    return enumerator->items();
}

core::Variant Dispatcher::coerce(const core::Variant& value, const QString& typeName) const
{
    if (typeName.isEmpty() || typeName == QStringLiteral("Variant"))
        return value;
    if (const auto scalar = scalarType(typeName)) {
        if (value.isArray() || value.isObject())
            typeMismatch();
        return value.convertedTo(*scalar);
    }
    if (typeName.endsWith(QStringLiteral("()"))) {
        if (!value.isArray())
            typeMismatch();
        const QString elementTypeName = typeName.left(typeName.size() - 2);
        const auto elementType = scalarType(elementTypeName);
        if (!elementType)
            return value;
        const core::VariantArray& source = value.array();
        core::VariantArray converted(source.bounds(), *elementType);
        if (source.dimensions() == 1) {
            for (int32_t i = source.lbound(1); i <= source.ubound(1); ++i)
                converted.at(i) = source.at(i).convertedTo(*elementType);
        } else if (source.dimensions() == 2) {
            for (int32_t i = source.lbound(1); i <= source.ubound(1); ++i) {
                for (int32_t j = source.lbound(2); j <= source.ubound(2); ++j)
                    converted.at({ i, j }) = source.at({ i, j }).convertedTo(*elementType);
            }
        } else {
            typeMismatch();
        }
        return core::Variant(converted);
    }
    if (m_registry.findEnum(typeName))
        return value.convertedTo(core::VariantType::Long);
    // Object, or a class or interface name: the member checks the class itself.
    if (!value.isObject())
        typeMismatch();
    return value;
}

} // namespace automation
