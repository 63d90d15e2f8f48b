#pragma once

#include "reportrt/data/recordprocessor.h"
#include "reportrt/data/recordreader.h"
#include "reportrt/data/sqltranslator.h"
#include "reportrt/document/documentenvironment.h"
#include "reportrt/document/reportdocument.h"
#include "reportrt/formula/formulacompiler.h"

#include <map>
#include <memory>
#include <vector>

namespace reportrt {

/// How a report reads its records: the compiled selection, groups, sorts and summaries,
/// the compiled references of what its objects show, the columns and the statement, and
/// the signature of everything the records depend on.
struct QueryPlan {
    std::vector<TableDefinition> tables;
    std::vector<ParameterDefinition> parameters;
    std::vector<FormulaDefinition> formulas;
    std::unique_ptr<DocumentEnvironment> environment;
    std::unique_ptr<FormulaCompiler> compiler;
    std::unique_ptr<FormulaCompiler> checker;
    std::shared_ptr<const FormulaExpr> selection;
    std::vector<const FormulaExpr*> conditions; // evaluated on each record
    std::vector<RecordProcessor::Group> groups;
    std::vector<RecordProcessor::Sort> sorts;
    std::vector<RecordProcessor::Summary> summaries;
    std::map<QString, std::shared_ptr<const FormulaExpr>> references; // lower-case text
    std::map<const void*, int> summaryOfObject; // by the model's object
    std::vector<RecordReader::Column> columns;
    std::vector<QString> columnReferences;
    QString sql; // the statement as the report shows and saves it
    QString runSql; // what runs: sql, or with this run's parameter conditions added
    bool matchByName = false;
    bool isProcedure = false;
    SqlDialect dialect = SqlDialect::SQLite;
    QString signature;
};

} // namespace reportrt
