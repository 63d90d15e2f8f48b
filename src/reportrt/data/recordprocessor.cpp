#include "reportrt/data/recordprocessor.h"

#include "reportrt/base/invarianttext.h"
#include "reportrt/formula/formulaevaluator.h"

#include <algorithm>
#include <numeric>

namespace reportrt {

namespace {
int compareKeys(const Value& a, const Value& b)
{
    if (a.isNull() || b.isNull())
        return static_cast<int>(!a.isNull()) - static_cast<int>(!b.isNull());
    return FormulaEvaluator::compare(a, b);
}

Value fieldValue(const FormulaExpr& e, const Value* record)
{
    if (e.kind == FormulaExpr::Kind::Field)
        return record[e.column];
    return FormulaEvaluator::evaluate(e, record);
}

struct Builder {
    const RecordSet& records;
    const std::vector<RecordProcessor::Group>& groups;
    const std::vector<RecordProcessor::Summary>& summaries;
    const std::vector<Value>& keys; // per record: one per group level, then sorts
    size_t keyCount;
    RecordProcessor::Result& result;

    const Value& key(qsizetype record, size_t level) const
    {
        return keys[static_cast<size_t>(record) * keyCount + level];
    }

    void build(size_t level, const qsizetype* begin, const qsizetype* end, int parent)
    {
        if (level >= groups.size()) {
            result.order.insert(result.order.end(), begin, end);
            return;
        }
        struct Run {
            const qsizetype* begin;
            const qsizetype* end;
            Value summary;
        };
        std::vector<Run> runs;
        for (const qsizetype* p = begin; p != end;) {
            const qsizetype* q = p + 1;
            while (q != end && compareKeys(key(*p, level), key(*q, level)) == 0)
                ++q;
            runs.push_back({ p, q, Value() });
            p = q;
        }
        const RecordProcessor::Group& group = groups[level];
        if (group.topN > 0 && group.topNSummary >= 0) {
            const RecordProcessor::Summary& s = summaries[static_cast<size_t>(group.topNSummary)];
            for (Run& run : runs)
                run.summary = RecordProcessor::summarize(
                    s.operation, *s.field, records, run.begin, 0, run.end - run.begin);
            std::stable_sort(runs.begin(), runs.end(),
                [](const Run& a, const Run& b) { return compareKeys(a.summary, b.summary) > 0; });
            if (group.topN < 9999 && runs.size() > static_cast<size_t>(group.topN))
                runs.resize(static_cast<size_t>(group.topN));
        }
        for (const Run& run : runs) {
            const int index = static_cast<int>(result.groups.size());
            RecordProcessor::GroupNode node;
            node.level = static_cast<int>(level) + 1;
            node.key = key(*run.begin, level);
            node.parent = parent;
            node.firstRecord = static_cast<qsizetype>(result.order.size());
            result.groups.push_back(std::move(node));
            if (parent >= 0)
                result.groups[static_cast<size_t>(parent)].children.push_back(index);
            else
                result.topGroups.push_back(index);
            build(level + 1, run.begin, run.end, index);
            result.groups[static_cast<size_t>(index)].recordCount
                = static_cast<qsizetype>(result.order.size())
                - result.groups[static_cast<size_t>(index)].firstRecord;
        }
    }
};

std::vector<bool> descendingKeys(const std::vector<RecordProcessor::Group>& groups,
    const std::vector<RecordProcessor::Sort>& sorts)
{
    std::vector<bool> descending;
    for (const RecordProcessor::Group& g : groups)
        descending.push_back(g.order == SortOrder::Descending);
    for (const RecordProcessor::Sort& s : sorts)
        descending.push_back(s.order == SortOrder::Descending);
    return descending;
}

// Groups records that already come in print order, keeping only the keys of the record
// before. False, with result untouched, when a record is out of order or a group keeps
// only its top N: then the records have to be sorted.
bool groupInReadOrder(const RecordSet& records, const std::vector<RecordProcessor::Group>& groups,
    const std::vector<RecordProcessor::Sort>& sorts, RecordProcessor::Result& result)
{
    for (const RecordProcessor::Group& g : groups) {
        if (g.topN > 0)
            return false;
    }
    const std::vector<bool> descending = descendingKeys(groups, sorts);
    const size_t keyCount = descending.size();
    if (keyCount == 0) {
        result.count = records.size();
        return true;
    }
    std::vector<Value> previous(keyCount);
    std::vector<Value> current(keyCount);
    RecordProcessor::Result grouped;
    std::vector<int> open(groups.size(), -1);
    const qsizetype count = records.size();
    const auto close = [&](size_t level, qsizetype end) {
        RecordProcessor::GroupNode& node = grouped.groups[static_cast<size_t>(open[level])];
        node.recordCount = end - node.firstRecord;
    };
    for (qsizetype r = 0; r < count; ++r) {
        const Value* record = records.record(r);
        for (size_t g = 0; g < groups.size(); ++g)
            current[g] = fieldValue(*groups[g].key, record);
        for (size_t s = 0; s < sorts.size(); ++s)
            current[groups.size() + s] = fieldValue(*sorts[s].key, record);
        size_t changed = 0;
        if (r > 0) {
            changed = keyCount;
            for (size_t k = 0; k < keyCount; ++k) {
                const int c = compareKeys(previous[k], current[k]);
                if (c == 0)
                    continue;
                if (descending[k] ? c < 0 : c > 0)
                    return false;
                changed = k;
                break;
            }
        }
        for (size_t level = changed; level < groups.size(); ++level) {
            if (open[level] >= 0)
                close(level, r);
            const int index = static_cast<int>(grouped.groups.size());
            RecordProcessor::GroupNode node;
            node.level = static_cast<int>(level) + 1;
            node.key = current[level];
            node.parent = level > 0 ? open[level - 1] : -1;
            node.firstRecord = r;
            grouped.groups.push_back(std::move(node));
            if (level > 0)
                grouped.groups[static_cast<size_t>(open[level - 1])].children.push_back(index);
            else
                grouped.topGroups.push_back(index);
            open[level] = index;
        }
        std::swap(previous, current);
    }
    for (size_t level = 0; level < groups.size(); ++level) {
        if (open[level] >= 0)
            close(level, count);
    }
    grouped.count = count;
    result = std::move(grouped);
    return true;
}
} // namespace

namespace {
// One summary over values given one at a time: Null values are skipped, a sum of none is 0,
// a count counts values, an average, minimum or maximum of none is Null.
class Accumulator {
public:
    Accumulator(SummaryOperation operation, const FormulaExpr& field)
        : m_operation(operation)
        , m_field(&field)
        , m_currency(field.type == ValueType::Currency)
    { }

    void add(const Value& v)
    {
        if (v.isNull())
            return;
        ++m_values;
        switch (m_operation) {
        case SummaryOperation::Sum:
        case SummaryOperation::Average:
            if (m_currency)
                m_overflow = m_overflow
                    || __builtin_add_overflow(m_currencySum, v.currencyScaled(), &m_currencySum);
            else
                m_sum += v.numeric();
            break;
        case SummaryOperation::Minimum:
            if (m_best.isNull() || FormulaEvaluator::compare(v, m_best) < 0)
                m_best = v;
            break;
        case SummaryOperation::Maximum:
            if (m_best.isNull() || FormulaEvaluator::compare(v, m_best) > 0)
                m_best = v;
            break;
        case SummaryOperation::Count:
            break;
        }
    }

    /// Raises FormulaException when a currency sum overflowed.
    Value result() const
    {
        if (m_overflow)
            throw FormulaException(
                { QString(), m_field->position, QStringLiteral("the currency sum overflows") });
        switch (m_operation) {
        case SummaryOperation::Sum:
            return m_currency ? Value::currency(m_currencySum) : Value::number(m_sum);
        case SummaryOperation::Average:
            if (m_values == 0)
                return {};
            if (m_currency)
                return Value::currency(*invarianttext::currencyFromDouble(
                    static_cast<double>(m_currencySum) / 10000.0 / static_cast<double>(m_values)));
            return Value::number(m_sum / static_cast<double>(m_values));
        case SummaryOperation::Count:
            return Value::number(static_cast<double>(m_values));
        case SummaryOperation::Minimum:
        case SummaryOperation::Maximum:
            return m_best;
        }
        return {};
    }

private:
    SummaryOperation m_operation;
    const FormulaExpr* m_field;
    bool m_currency;
    double m_sum = 0;
    int64_t m_currencySum = 0;
    bool m_overflow = false;
    qsizetype m_values = 0;
    Value m_best;
};

// Every summary of every group and of the report in one walk over the printed records: each
// pass over spilled records decodes them again.
void summarizeAll(const RecordSet& records, const std::vector<RecordProcessor::Summary>& summaries,
    size_t levels, RecordProcessor::Result& result)
{
    if (summaries.empty())
        return;
    std::vector<std::vector<int>> nodesOfLevel(levels);
    for (size_t i = 0; i < result.groups.size(); ++i) {
        const auto level = static_cast<size_t>(result.groups[i].level);
        if (level >= 1 && level <= levels)
            nodesOfLevel[level - 1].push_back(static_cast<int>(i));
    }
    std::vector<size_t> cursor(levels, 0);
    std::vector<Accumulator> running;
    for (const RecordProcessor::Summary& s : summaries)
        running.emplace_back(s.operation, *s.field);
    const auto finishNode = [&](size_t level) {
        RecordProcessor::GroupNode& node
            = result.groups[static_cast<size_t>(nodesOfLevel[level][cursor[level]])];
        for (size_t s = 0; s < summaries.size(); ++s) {
            if (static_cast<size_t>(summaries[s].level) != level + 1)
                continue;
            node.summaries[s] = running[s].result();
            running[s] = Accumulator(summaries[s].operation, *summaries[s].field);
        }
        ++cursor[level];
    };
    for (qsizetype p = 0; p < result.size(); ++p) {
        for (size_t l = 0; l < levels; ++l) {
            while (cursor[l] < nodesOfLevel[l].size()) {
                const auto& node = result.groups[static_cast<size_t>(nodesOfLevel[l][cursor[l]])];
                if (p < node.firstRecord + node.recordCount)
                    break;
                finishNode(l);
            }
        }
        const Value* record = records.record(result.recordAt(p));
        for (size_t s = 0; s < summaries.size(); ++s) {
            if (static_cast<size_t>(summaries[s].level) <= levels)
                running[s].add(fieldValue(*summaries[s].field, record));
        }
    }
    for (size_t l = 0; l < levels; ++l) {
        while (cursor[l] < nodesOfLevel[l].size())
            finishNode(l);
    }
    for (size_t s = 0; s < summaries.size(); ++s) {
        if (summaries[s].level == 0)
            result.totals[s] = running[s].result();
    }
}
} // namespace

Value RecordProcessor::summarize(SummaryOperation operation, const FormulaExpr& field,
    const RecordSet& records, const qsizetype* indexes, qsizetype first, qsizetype count)
{
    Accumulator accumulator(operation, field);
    for (qsizetype i = 0; i < count; ++i)
        accumulator.add(fieldValue(field, records.record(indexes ? indexes[i] : first + i)));
    return accumulator.result();
}

RecordProcessor::Result RecordProcessor::process(const RecordSet& records,
    const std::vector<Group>& groups, const std::vector<Sort>& sorts,
    const std::vector<Summary>& summaries)
{
    Result result;
    if (!groupInReadOrder(records, groups, sorts, result)) {
        const qsizetype count = records.size();
        const size_t keyCount = groups.size() + sorts.size();
        std::vector<Value> keys(static_cast<size_t>(count) * keyCount);
        for (qsizetype r = 0; r < count; ++r) {
            const Value* record = records.record(r);
            for (size_t g = 0; g < groups.size(); ++g)
                keys[static_cast<size_t>(r) * keyCount + g] = fieldValue(*groups[g].key, record);
            for (size_t s = 0; s < sorts.size(); ++s)
                keys[static_cast<size_t>(r) * keyCount + groups.size() + s]
                    = fieldValue(*sorts[s].key, record);
        }
        const std::vector<bool> descending = descendingKeys(groups, sorts);
        std::vector<qsizetype> order(static_cast<size_t>(count));
        std::iota(order.begin(), order.end(), 0);
        std::stable_sort(order.begin(), order.end(), [&](qsizetype a, qsizetype b) {
            for (size_t k = 0; k < keyCount; ++k) {
                int c = compareKeys(keys[static_cast<size_t>(a) * keyCount + k],
                    keys[static_cast<size_t>(b) * keyCount + k]);
                if (c != 0)
                    return descending[k] ? c > 0 : c < 0;
            }
            return false;
        });
        Builder builder { records, groups, summaries, keys, keyCount, result };
        builder.build(0, order.data(), order.data() + order.size(), -1);
        result.count = static_cast<qsizetype>(result.order.size());
    }

    // A node per group of a large report: the room growing left over is given back.
    result.groups.shrink_to_fit();
    result.totals.resize(summaries.size());
    for (GroupNode& node : result.groups)
        node.summaries.resize(summaries.size());
    summarizeAll(records, summaries, groups.size(), result);
    return result;
}

} // namespace reportrt
