#include "reportrt/document/documentenvironment.h"

#include "reportrt/base/invarianttext.h"

namespace reportrt {

DocumentEnvironment::DocumentEnvironment(const std::vector<TableDefinition>& tables,
    const std::vector<ParameterDefinition>& parameters,
    const std::vector<FormulaDefinition>& formulas)
    : m_tables(tables)
    , m_parameters(parameters)
    , m_formulas(formulas)
{ }

int DocumentEnvironment::tableIndex(const QString& name) const
{
    for (size_t i = 0; i < m_tables.size(); ++i) {
        if (m_tables[i].name.compare(name, Qt::CaseInsensitive) == 0)
            return static_cast<int>(i);
    }
    return -1;
}

int DocumentEnvironment::fieldIndex(int table, const QString& name) const
{
    if (table < 0 || table >= static_cast<int>(m_tables.size()))
        return -1;
    const auto& fields = m_tables[static_cast<size_t>(table)].fields;
    for (size_t i = 0; i < fields.size(); ++i) {
        if (fields[i].name.compare(name, Qt::CaseInsensitive) == 0)
            return static_cast<int>(i);
    }
    return -1;
}

int DocumentEnvironment::column(int table, int field)
{
    if (table < 0 || table >= static_cast<int>(m_tables.size()) || field < 0
        || field >= static_cast<int>(m_tables[static_cast<size_t>(table)].fields.size()))
        return -1;
    const qint64 key = (static_cast<qint64>(table) << 32) | field;
    if (auto found = m_columnOf.find(key); found != m_columnOf.end())
        return found.value();
    const int index = static_cast<int>(m_columns.size());
    m_columns.push_back({ table, field,
        m_tables[static_cast<size_t>(table)].fields[static_cast<size_t>(field)].type });
    m_columnOf.insert(key, index);
    return index;
}

std::optional<FormulaEnvironment::FieldBinding> DocumentEnvironment::field(
    const QString& table, const QString& field)
{
    const int t = tableIndex(table);
    const int f = fieldIndex(t, field);
    if (f < 0)
        return std::nullopt;
    const int c = column(t, f);
    return FieldBinding { m_columns[static_cast<size_t>(c)].type, c };
}

std::optional<FormulaEnvironment::ParameterBinding> DocumentEnvironment::parameter(
    const QString& name)
{
    for (const auto& p : m_parameters) {
        if (p.name.compare(name, Qt::CaseInsensitive) != 0)
            continue;
        ParameterBinding binding;
        binding.type = invarianttext::parameterValueType(p.valueType).value_or(ValueType::String);
        binding.allowsMultipleValues = p.allowsMultipleValues;
        if (!p.currentValues.empty()) {
            binding.values = p.currentValues;
        } else if (p.defaultValue) {
            binding.values = { *p.defaultValue };
        }
        binding.hasValues = !binding.values.empty();
        return binding;
    }
    return std::nullopt;
}

std::optional<QString> DocumentEnvironment::formulaText(const QString& name)
{
    for (const auto& f : m_formulas) {
        if (f.name.compare(name, Qt::CaseInsensitive) == 0)
            return f.text;
    }
    return std::nullopt;
}

} // namespace reportrt
