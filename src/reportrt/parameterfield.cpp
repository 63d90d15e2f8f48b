#include "reportrt/parameterfield.h"

#include "core/comerror.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/base/variantvalue.h"
#include "reportrt/formula/formulaevaluator.h"

namespace reportrt {

ParameterField::ParameterField(
    ParameterDefinition definition, std::function<bool(const QString&)> isUsed)
    : m_definition(std::move(definition))
    , m_isUsed(std::move(isUsed))
{ }

bool ParameterField::needsCurrentValue() const
{
    if (hasCurrentValue())
        return false;
    return m_definition.kind == 2 || (m_isUsed && m_isUsed(m_definition.name));
}

size_t ParameterField::checkedIndex(int32_t index, size_t count) const
{
    if (index < 1 || static_cast<size_t>(index) > count)
        throw core::ComError::basic(core::ErrorNumber::SubscriptOutOfRange);
    return static_cast<size_t>(index - 1);
}

core::Variant ParameterField::defaultValue() const
{
    if (!m_definition.defaultValue)
        return {};
    return variantvalue::parameterVariant(*m_definition.defaultValue, m_definition.valueType);
}

int32_t ParameterField::currentValueCount() const
{
    return static_cast<int32_t>(m_definition.currentValues.size());
}

core::Variant ParameterField::currentValue(int32_t index) const
{
    return variantvalue::parameterVariant(
        m_definition.currentValues[checkedIndex(index, m_definition.currentValues.size())],
        m_definition.valueType);
}

void ParameterField::addCurrentValue(const core::Variant& value)
{
    const Value converted = variantvalue::parameterValue(value, m_definition.valueType);
    const auto same = [&](const Value& v) {
        return v.type() == converted.type() && FormulaEvaluator::compare(v, converted) == 0;
    };
    if (m_definition.onlyListedValues && !m_definition.defaultValues.empty()) {
        bool listed = false;
        for (const DefaultValue& d : m_definition.defaultValues)
            listed = listed || same(d.value);
        if (!listed)
            raiseError(Error::RuntimeFailure,
                QStringLiteral(
                    "The parameter %1 takes only the values of its list; %2 is not one of them.")
                    .arg(m_definition.name, FormulaEvaluator::toText(converted)));
    }
    if (!m_definition.allowsMultipleValues) {
        m_definition.currentValues = { converted };
        return;
    }
    for (const Value& v : m_definition.currentValues) {
        if (same(v))
            return;
    }
    m_definition.currentValues.push_back(converted);
}

void ParameterField::clearCurrentValues()
{
    m_definition.currentValues.clear();
}

int32_t ParameterField::defaultValueCount() const
{
    return static_cast<int32_t>(m_definition.defaultValues.size());
}

core::Variant ParameterField::defaultValueAt(int32_t index) const
{
    return variantvalue::parameterVariant(
        m_definition.defaultValues[checkedIndex(index, m_definition.defaultValues.size())].value,
        m_definition.valueType);
}

QString ParameterField::defaultValueDescription(int32_t index) const
{
    return m_definition.defaultValues[checkedIndex(index, m_definition.defaultValues.size())]
        .description;
}

void ParameterField::addDefaultValue(const core::Variant& value)
{
    m_definition.defaultValues.push_back(
        { variantvalue::parameterValue(value, m_definition.valueType), QString() });
}

void ParameterField::deleteDefaultValue(int32_t index)
{
    const size_t i = checkedIndex(index, m_definition.defaultValues.size());
    m_definition.defaultValues.erase(
        m_definition.defaultValues.begin() + static_cast<std::ptrdiff_t>(i));
}

void ParameterField::setDefaultValueDescription(int32_t index, const QString& description)
{
    m_definition.defaultValues[checkedIndex(index, m_definition.defaultValues.size())].description
        = description;
}

} // namespace reportrt
