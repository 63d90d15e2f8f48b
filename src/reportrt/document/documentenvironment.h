#pragma once

#include "reportrt/document/reportdocument.h"
#include "reportrt/formula/formulacompiler.h"

#include <QHash>
#include <vector>

namespace reportrt {

/// A database field that a report reads: the table (by index in the report) and field.
struct RecordColumn {
    int table = -1;
    int field = -1;
    ValueType type = ValueType::String;
};

/// Resolves the names of a report's formulas against its tables, parameters and formula
/// fields, without regard to case, and numbers the database fields in order of first use:
/// those numbers are the record columns the reader fills.
class DocumentEnvironment : public FormulaEnvironment {
public:
    DocumentEnvironment(const std::vector<TableDefinition>& tables,
        const std::vector<ParameterDefinition>& parameters,
        const std::vector<FormulaDefinition>& formulas);

    std::optional<FieldBinding> field(const QString& table, const QString& field) override;
    std::optional<ParameterBinding> parameter(const QString& name) override;
    std::optional<QString> formulaText(const QString& name) override;

    /// The record column of a field, adding it when new; -1 when unknown.
    int column(int table, int field);
    const std::vector<RecordColumn>& columns() const { return m_columns; }

    /// Table index by name, or -1.
    int tableIndex(const QString& name) const;
    /// Field index in a table by name, or -1.
    int fieldIndex(int table, const QString& name) const;

private:
    const std::vector<TableDefinition>& m_tables;
    const std::vector<ParameterDefinition>& m_parameters;
    const std::vector<FormulaDefinition>& m_formulas;
    std::vector<RecordColumn> m_columns;
    QHash<qint64, int> m_columnOf; // table << 32 | field
};

} // namespace reportrt
