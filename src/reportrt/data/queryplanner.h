#pragma once

#include "reportrt/data/queryplan.h"

#include <memory>
#include <utility>
#include <vector>

namespace reportrt {

/// Plans how a report reads its records.
///
/// The statement is generated from the tables, links, used fields, groups and sorts, with
/// every condition of the selection formula that translates to SQL in its WHERE clause,
/// until a statement is set; a set statement is run as it is and the whole formula is then
/// evaluated on each record. Conditions that carry a parameter's value never enter the
/// statement the report shows and saves; the statement that runs has them for this run.
class QueryPlanner {
public:
    struct Input {
        std::vector<TableDefinition> tables; // with their current locations
        std::vector<ParameterDefinition> parameters; // with their current values
        const ReportDocument* document = nullptr; // formulas, selection, statement, groups...
        /// The report's objects, each under a key of the caller's that the plan's
        /// summaryOfObject gives back.
        std::vector<std::pair<const void*, ObjectDefinition>> objects;
    };

    /// With bindParameters false, parameters without values leave their conditions to the
    /// records and the plan can still show its statement. Raises Error::FormulaError.
    static std::shared_ptr<QueryPlan> plan(const Input& input, bool bindParameters);
};

} // namespace reportrt
