#include "fakeobject.h"

#include "core/variant.h"
#include "script.h"

namespace fakeruntime {

FakeObject::FakeObject(std::weak_ptr<Script> script, QString kind)
    : m_script(std::move(script))
    , m_kind(std::move(kind))
{ }

void FakeObject::failOn(const QString& method, const core::ComError& error, int occurrence)
{
    if (const auto shared = m_script.lock())
        shared->addRule(
            ruleKey(method), [error] { throw error; }, occurrence);
}

void FakeObject::failAlways(const QString& method, const core::ComError& error)
{
    failOn(method, error, 0);
}

QString FakeObject::arg(const QString& text)
{
    return u'"' + text + u'"';
}

QString FakeObject::arg(bool value)
{
    return value ? QStringLiteral("True") : QStringLiteral("False");
}

QString FakeObject::arg(int32_t value)
{
    return QString::number(value);
}

QString FakeObject::arg(const core::Variant& value)
{
    switch (value.type()) {
    case core::VariantType::Empty:
        return QStringLiteral("Empty");
    case core::VariantType::Null:
        return QStringLiteral("Null");
    case core::VariantType::String:
        return arg(value.toText());
    case core::VariantType::Boolean:
        return arg(value.toBoolean());
    case core::VariantType::Date:
        return u'#' + value.toInvariantText() + u'#';
    case core::VariantType::Object:
        return value.toObject() ? value.toObject()->className() : QStringLiteral("Nothing");
    case core::VariantType::Array:
        return QStringLiteral("Array(%1)").arg(value.array().size());
    case core::VariantType::Error:
        return QStringLiteral("Error(%1)").arg(value.errorCode());
    default:
        return value.toInvariantText();
    }
}

void FakeObject::record(const QString& method, QStringList arguments) const
{
    // No strong reference is held while the call's rules run (see Script::record); the
    // FakeRuntime that owns the script outlives every call made while it is alive.
    if (Script* shared = m_script.lock().get())
        shared->record(Call { m_kind, label(), method, std::move(arguments), false, false });
}

void FakeObject::recordQuery(const QString& method, QStringList arguments) const
{
    if (Script* shared = m_script.lock().get())
        shared->record(Call { m_kind, label(), method, std::move(arguments), true, false });
}

QString FakeObject::ruleKey(const QString& method) const
{
    return m_kind + u'(' + label() + u")." + method;
}

} // namespace fakeruntime
