#pragma once

#include "reportrt/data/recordset.h"
#include "reportrt/document/reportdocument.h"
#include "reportrt/formula/formulaexpr.h"

#include <memory>
#include <vector>

namespace reportrt {

/// Sorts, groups and summarizes selected records.
///
/// Records sort by the group fields, then by the sort fields; Null sorts before every
/// value, and text by code point. A group area with top N keeps, within its parent group,
/// the N groups with the largest summary (9999 keeps all), largest first; groups with
/// equal summaries keep their order by group field; a Null summary counts as the
/// smallest. Summaries ignore Null values: a sum of none is 0, a count counts values,
/// an average, minimum or maximum of none is Null. Group summaries and report totals
/// cover the records that are printed, that is, without the groups top N left out.
class RecordProcessor {
public:
    struct Group {
        std::shared_ptr<const FormulaExpr> key;
        SortOrder order = SortOrder::Ascending;
        int topN = 0; // 0 = sorted by key
        int topNSummary = -1; // index into the summaries
    };
    struct Sort {
        std::shared_ptr<const FormulaExpr> key;
        SortOrder order = SortOrder::Ascending;
    };
    struct Summary {
        SummaryOperation operation = SummaryOperation::Sum;
        std::shared_ptr<const FormulaExpr> field;
        int level = 0; // 0 = the whole report, 1.. = the group level
    };

    struct GroupNode {
        int level = 1;
        Value key;
        int parent = -1;
        std::vector<int> children;
        qsizetype firstRecord = 0; // position in Result::records
        qsizetype recordCount = 0;
        std::vector<Value> summaries; // per summary of this node's level, else Null
    };

    struct Result {
        std::vector<qsizetype> records; // record indexes in print order
        std::vector<GroupNode> groups;
        std::vector<int> topGroups;
        std::vector<Value> totals; // per summary of level 0, else Null
    };

    /// Raises FormulaException when a key or summary field fails on a record.
    static Result process(const RecordSet& records, const std::vector<Group>& groups,
        const std::vector<Sort>& sorts, const std::vector<Summary>& summaries);

    static Value summarize(SummaryOperation operation, const FormulaExpr& field,
        const RecordSet& records, const qsizetype* indexes, qsizetype count);
};

} // namespace reportrt
