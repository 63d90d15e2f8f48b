#pragma once

#include "reportrt/document/reportdocument.h"
#include "runtime/parameterfield.h"

#include <functional>

namespace reportrt {

/// A parameter field of an opened report.
///
/// Adding a current value converts it to the value type by the Basic rules (Type mismatch
/// or Overflow when it does not fit); with "only listed values" a value outside the
/// default list raises Error::RuntimeFailure. A parameter that takes one value replaces
/// its value; one that takes several adds the value unless it holds it already, so
/// applying the same values again does not repeat them.
class ParameterField : public runtime::ParameterField {
public:
    /// isUsed tells whether a formula or object of the report refers to the parameter.
    ParameterField(ParameterDefinition definition, std::function<bool(const QString&)> isUsed);

    QString name() const override { return m_definition.name; }
    QString formulaName() const override { return u"{?" + m_definition.name + u'}'; }
    QString prompt() const override { return m_definition.prompt; }
    int16_t valueType() const override { return static_cast<int16_t>(m_definition.valueType); }
    int16_t kind() const override { return static_cast<int16_t>(m_definition.kind); }
    /// No current value, and the report uses it (a stored-procedure parameter always).
    bool needsCurrentValue() const override;
    bool hasCurrentValue() const override { return !m_definition.currentValues.empty(); }
    bool allowsMultipleValues() const override { return m_definition.allowsMultipleValues; }
    bool onlyListedValues() const override { return m_definition.onlyListedValues; }

    bool hasDefaultValue() const override { return m_definition.defaultValue.has_value(); }
    core::Variant defaultValue() const override;

    int32_t currentValueCount() const override;
    core::Variant currentValue(int32_t index) const override;
    void addCurrentValue(const core::Variant& value) override;
    void clearCurrentValues() override;

    int32_t defaultValueCount() const override;
    core::Variant defaultValueAt(int32_t index) const override;
    QString defaultValueDescription(int32_t index) const override;
    void addDefaultValue(const core::Variant& value) override;
    void deleteDefaultValue(int32_t index) override;
    void setDefaultValueDescription(int32_t index, const QString& description) override;

    const ParameterDefinition& definition() const { return m_definition; }

private:
    size_t checkedIndex(int32_t index, size_t count) const;

    ParameterDefinition m_definition;
    std::function<bool(const QString&)> m_isUsed;
};

} // namespace reportrt
