#include "fakeparameterfield.h"

#include "core/comerror.h"

namespace fakeruntime {

FakeParameterField::FakeParameterField(std::weak_ptr<Script> script, State initial)
    : FakeObject(std::move(script), QStringLiteral("Param"))
    , state(std::move(initial))
{ }

QString FakeParameterField::name() const
{
    recordQuery(QStringLiteral("name"));
    return state.name;
}

QString FakeParameterField::formulaName() const
{
    recordQuery(QStringLiteral("formulaName"));
    return state.formulaName.isEmpty() ? u"{?" + state.name + u'}' : state.formulaName;
}

QString FakeParameterField::prompt() const
{
    recordQuery(QStringLiteral("prompt"));
    return state.prompt;
}

int16_t FakeParameterField::valueType() const
{
    recordQuery(QStringLiteral("valueType"));
    return state.valueType;
}

int16_t FakeParameterField::kind() const
{
    recordQuery(QStringLiteral("kind"));
    return state.kind;
}

bool FakeParameterField::needsCurrentValue() const
{
    recordQuery(QStringLiteral("needsCurrentValue"));
    return state.needsCurrentValue;
}

bool FakeParameterField::hasCurrentValue() const
{
    recordQuery(QStringLiteral("hasCurrentValue"));
    return !state.currentValues.empty();
}

bool FakeParameterField::allowsMultipleValues() const
{
    recordQuery(QStringLiteral("allowsMultipleValues"));
    return state.allowsMultipleValues;
}

bool FakeParameterField::onlyListedValues() const
{
    recordQuery(QStringLiteral("onlyListedValues"));
    return state.onlyListedValues;
}

bool FakeParameterField::hasDefaultValue() const
{
    recordQuery(QStringLiteral("hasDefaultValue"));
    return state.defaultValue.has_value();
}

core::Variant FakeParameterField::defaultValue() const
{
    recordQuery(QStringLiteral("defaultValue"));
    return state.defaultValue.value_or(core::Variant());
}

int32_t FakeParameterField::currentValueCount() const
{
    recordQuery(QStringLiteral("currentValueCount"));
    return static_cast<int32_t>(state.currentValues.size());
}

core::Variant FakeParameterField::currentValue(int32_t index) const
{
    recordQuery(QStringLiteral("currentValue"), { arg(index) });
    return state.currentValues[position(index, state.currentValues.size())];
}

void FakeParameterField::addCurrentValue(const core::Variant& value)
{
    record(QStringLiteral("addCurrentValue"), { arg(value) });
    state.currentValues.push_back(value);
}

void FakeParameterField::clearCurrentValues()
{
    record(QStringLiteral("clearCurrentValues"));
    state.currentValues.clear();
}

int32_t FakeParameterField::defaultValueCount() const
{
    recordQuery(QStringLiteral("defaultValueCount"));
    return static_cast<int32_t>(state.defaults.size());
}

core::Variant FakeParameterField::defaultValueAt(int32_t index) const
{
    recordQuery(QStringLiteral("defaultValueAt"), { arg(index) });
    return state.defaults[position(index, state.defaults.size())].value;
}

QString FakeParameterField::defaultValueDescription(int32_t index) const
{
    recordQuery(QStringLiteral("defaultValueDescription"), { arg(index) });
    return state.defaults[position(index, state.defaults.size())].description;
}

void FakeParameterField::addDefaultValue(const core::Variant& value)
{
    record(QStringLiteral("addDefaultValue"), { arg(value) });
    state.defaults.push_back(DefaultEntry { value, QString() });
}

void FakeParameterField::deleteDefaultValue(int32_t index)
{
    record(QStringLiteral("deleteDefaultValue"), { arg(index) });
    state.defaults.erase(state.defaults.begin()
        + static_cast<std::ptrdiff_t>(position(index, state.defaults.size())));
}

void FakeParameterField::setDefaultValueDescription(int32_t index, const QString& description)
{
    record(QStringLiteral("setDefaultValueDescription"), { arg(index), arg(description) });
    state.defaults[position(index, state.defaults.size())].description = description;
}

size_t FakeParameterField::position(int32_t index, size_t count)
{
    if (index < 1 || static_cast<size_t>(index) > count)
        throw core::ComError::basic(core::ErrorNumber::SubscriptOutOfRange);
    return static_cast<size_t>(index - 1);
}

} // namespace fakeruntime
