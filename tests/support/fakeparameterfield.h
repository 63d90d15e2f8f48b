#pragma once

#include "fakeobject.h"
#include "runtime/parameterfield.h"

#include <optional>
#include <vector>

namespace fakeruntime {

/// A parameter field of a fake report. Logged as `Param(<name>)`.
class FakeParameterField : public runtime::ParameterField, public FakeObject {
public:
    struct DefaultEntry {
        core::Variant value;
        QString description;
    };
    struct State {
        QString name;
        QString formulaName; // empty: "{?" + name + "}"
        QString prompt;
        int16_t valueType = 12; // text
        int16_t kind = 1; // 1 report parameter, 2 stored-procedure parameter
        bool needsCurrentValue = true;
        bool allowsMultipleValues = false;
        bool onlyListedValues = false;
        std::optional<core::Variant> defaultValue; // hasDefaultValue() when set
        std::vector<core::Variant> currentValues;
        std::vector<DefaultEntry> defaults;
    };

    FakeParameterField(std::weak_ptr<Script> script, State state);

    QString label() const override { return state.name; }

    QString name() const override;
    QString formulaName() const override;
    QString prompt() const override;
    int16_t valueType() const override;
    int16_t kind() const override;
    bool needsCurrentValue() const override;
    bool hasCurrentValue() const override;
    bool allowsMultipleValues() const override;
    bool onlyListedValues() const override;
    bool hasDefaultValue() const override;
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

    /// Read and change freely: nothing here is logged.
    State state;

private:
    /// 0-based position of a 1-based index; raises 9 (Subscript out of range) outside.
    static size_t position(int32_t index, size_t count);
};

} // namespace fakeruntime
