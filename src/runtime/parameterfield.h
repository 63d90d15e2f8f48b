#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>

namespace runtime {

/// A parameter field of a report. Value type codes: 1..16 (byte, integer, long, number,
/// currency, Boolean, date, time, text, other, date-time; see the report format docs).
/// Indices of current and default values are 1-based.
class LUDMOX_EXPORT ParameterField : public core::Object {
public:
    QString className() const override { return QStringLiteral("ParameterFieldDefinition"); }

    /// Plain name, without braces ("Customer").
    virtual QString name() const = 0;
    /// "{?Customer}".
    virtual QString formulaName() const = 0;
    virtual QString prompt() const = 0;
    virtual int16_t valueType() const = 0;
    /// 1 = report parameter, 2 = stored-procedure parameter.
    virtual int16_t kind() const = 0;
    virtual bool needsCurrentValue() const = 0;
    virtual bool hasCurrentValue() const = 0;
    virtual bool allowsMultipleValues() const = 0;
    virtual bool onlyListedValues() const = 0;

    virtual bool hasDefaultValue() const = 0;
    virtual core::Variant defaultValue() const = 0;

    virtual int32_t currentValueCount() const = 0;
    virtual core::Variant currentValue(int32_t index) const = 0;
    /// Adds a current value; raises when the value does not fit the value type.
    virtual void addCurrentValue(const core::Variant& value) = 0;
    virtual void clearCurrentValues() = 0;

    virtual int32_t defaultValueCount() const = 0;
    virtual core::Variant defaultValueAt(int32_t index) const = 0;
    virtual QString defaultValueDescription(int32_t index) const = 0;
    virtual void addDefaultValue(const core::Variant& value) = 0;
    virtual void deleteDefaultValue(int32_t index) = 0;
    virtual void setDefaultValueDescription(int32_t index, const QString& description) = 0;
};

} // namespace runtime
