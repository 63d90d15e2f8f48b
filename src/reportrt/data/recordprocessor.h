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
        qsizetype firstRecord = 0; // print position (Result::recordAt)
        qsizetype recordCount = 0;
        std::vector<Value> summaries; // per summary of this node's level, else Null
    };

    struct Result {
        /// The record index at each print position; empty when the records print in the
        /// order they were read (the database sorted them), which needs no index at all.
        std::vector<qsizetype> order;
        qsizetype count = 0; // the records printed
        qsizetype size() const { return count; }
        qsizetype recordAt(qsizetype position) const
        {
            return order.empty() ? position : order[static_cast<size_t>(position)];
        }
        std::vector<GroupNode> groups;
        std::vector<int> topGroups;
        std::vector<Value> totals; // per summary of level 0, else Null
    };

    /// Records that arrive in print order (the statement sorted them as the report does)
    /// are grouped in one pass without keeping their keys; others are sorted here. Raises
    /// FormulaException when a key or summary field fails on a record.
    static Result process(const RecordSet& records, const std::vector<Group>& groups,
        const std::vector<Sort>& sorts, const std::vector<Summary>& summaries);

    /// Summarizes count records: indexes[0..count), or from record first on when indexes
    /// is null.
    static Value summarize(SummaryOperation operation, const FormulaExpr& field,
        const RecordSet& records, const qsizetype* indexes, qsizetype first, qsizetype count);
};

} // namespace reportrt
