#include "reportrt/output/bandwalker.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/recordprocessor.h"
#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/layout/layoutengine.h"
#include "reportrt/layout/valueformatter.h"
#include "reportrt/report.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"

#include <algorithm>
#include <unordered_map>

namespace reportrt {

using Kind = ObjectDefinition::Kind;

struct BandWalker::Private {
    Report& report;
    const RecordProcessor::Result* result = nullptr;
    const RecordSet* records = nullptr;
    ValueFormatter formatter;
    QDateTime printDate = QDateTime::currentDateTime();
    PageGeometry geometry;

    Section* reportHeader = nullptr;
    Section* pageHeader = nullptr;
    Section* detail = nullptr;
    Section* reportFooter = nullptr;
    Section* pageFooter = nullptr;
    std::vector<Section*> groupHeaders; // by level - 1
    std::vector<Section*> groupFooters;

    std::vector<int> groupAt; // current group node per level - 1
    qsizetype position = -1;
    int page = 0;
    std::unordered_map<const ReportObject*, const FormulaExpr*> references;

    // Pagination.
    double y = 0;
    double bodyBottom = 0;
    bool hasBody = false;
    bool pendingBreak = false;
    qsizetype lastPlaced = -1;

    explicit Private(Report& r)
        : report(r)
        , geometry(PageGeometry::of(r.pageSetup()))
    { }

    static double shownHeight(const Section* s)
    {
        return s && !s->isSuppressed() ? s->height() : 0.0;
    }

    void setPosition(qsizetype p)
    {
        position = p;
        const qsizetype record = result && p >= 0 && p < result->size() ? result->recordAt(p) : -1;
        report.setCurrentRecord(record);
    }

    void visit(const Visitor* visitor, Section* s, Band band, int level, qsizetype p)
    {
        if (!visitor || !s || s->isSuppressed())
            return;
        setPosition(p);
        if (!s->hasFormatHandlers()) {
            (*visitor)({ s, band, level, p, page });
            return;
        }
        std::vector<ReportObject::FormatState> states;
        for (const auto& o : s->objects())
            states.push_back(o->formatState());
        struct Restore {
            Section* section;
            std::vector<ReportObject::FormatState>& states;
            ~Restore()
            {
                const auto& objects = section->objects();
                for (size_t i = 0; i < objects.size() && i < states.size(); ++i)
                    objects[i]->restoreFormatState(states[i]);
            }
        } restore { s, states };
        s->raiseFormat();
        (*visitor)({ s, band, level, p, page });
    }

    void startPage(const Visitor* visitor)
    {
        ++page;
        y = geometry.top;
        bodyBottom = geometry.height - geometry.bottom - shownHeight(pageFooter);
        hasBody = false;
        pendingBreak = false;
        const qsizetype saved = position;
        if (page == 1) {
            visit(visitor, reportHeader, Band::ReportHeader, 0,
                result && result->size() > 0 ? 0 : -1);
            y += shownHeight(reportHeader);
        }
        visit(visitor, pageHeader, Band::PageHeader, 0, saved >= 0 ? saved : 0);
        y += shownHeight(pageHeader);
        position = saved;
    }

    void finishPage(const Visitor* visitor)
    {
        visit(visitor, pageFooter, Band::PageFooter, 0, lastPlaced);
    }

    void place(const Visitor* visitor, Section* s, Band band, int level, qsizetype p,
        double keepWithNext = 0)
    {
        const double height = shownHeight(s);
        if (!s || s->isSuppressed())
            return;
        if (height > 0 || !s->objects().empty()) {
            const bool full = y + height + keepWithNext > bodyBottom;
            if (hasBody && (pendingBreak || s->newPageBefore() || full)) {
                position = p;
                finishPage(visitor);
                startPage(visitor);
            }
        }
        visit(visitor, s, band, level, p);
        y += height;
        hasBody = true;
        if (s->newPageAfter())
            pendingBreak = true;
    }
};

BandWalker::BandWalker(Report& report)
    : d(std::make_unique<Private>(report))
{
    if (!report.result())
        report.readRecords();
    d->result = report.result();
    d->records = report.records();
    size_t groupCount = 0;
    for (const auto& s : report.sections()) {
        const QString name = s->name();
        if (name.startsWith(u"GH") || name.startsWith(u"GF"))
            groupCount = std::max(groupCount, static_cast<size_t>(name.mid(2).toInt()));
    }
    d->groupHeaders.resize(groupCount);
    d->groupFooters.resize(groupCount);
    for (const auto& s : report.sections()) {
        auto* section = static_cast<Section*>(s.get());
        const QString name = section->name();
        if (name == u"RH")
            d->reportHeader = section;
        else if (name == u"PH")
            d->pageHeader = section;
        else if (name == u"D")
            d->detail = section;
        else if (name == u"RF")
            d->reportFooter = section;
        else if (name == u"PF")
            d->pageFooter = section;
        else {
            const auto level = static_cast<size_t>(name.mid(2).toInt());
            if (level >= 1 && level <= groupCount)
                (name.startsWith(u"GH") ? d->groupHeaders : d->groupFooters)[level - 1] = section;
        }
    }
}

BandWalker::~BandWalker() = default;

Section* BandWalker::section(Band band, int level) const
{
    const auto index = static_cast<size_t>(level - 1);
    switch (band) {
    case Band::ReportHeader:
        return d->reportHeader;
    case Band::PageHeader:
        return d->pageHeader;
    case Band::Detail:
        return d->detail;
    case Band::ReportFooter:
        return d->reportFooter;
    case Band::PageFooter:
        return d->pageFooter;
    case Band::GroupHeader:
        return level >= 1 && index < d->groupHeaders.size() ? d->groupHeaders[index] : nullptr;
    case Band::GroupFooter:
        return level >= 1 && index < d->groupFooters.size() ? d->groupFooters[index] : nullptr;
    }
    return nullptr;
}

int BandWalker::groupLevels() const
{
    return static_cast<int>(d->groupHeaders.size());
}

qsizetype BandWalker::recordCount() const
{
    return d->result ? d->result->size() : 0;
}

std::pair<qsizetype, qsizetype> BandWalker::groupRange(int level) const
{
    const auto index = static_cast<size_t>(level - 1);
    if (!d->result || level < 1 || index >= d->groupAt.size() || d->groupAt[index] < 0)
        return { -1, -1 };
    const auto& node = d->result->groups[static_cast<size_t>(d->groupAt[index])];
    return { node.firstRecord, node.firstRecord + node.recordCount - 1 };
}

int BandWalker::run(const Visitor& visit)
{
    if (m_totalPages == 0)
        m_totalPages = walk(nullptr);
    return walk(visit ? &visit : nullptr);
}

int BandWalker::walk(const Visitor* visitor)
{
    Private& p = *d;
    const size_t levels = p.groupHeaders.size();
    p.groupAt.assign(levels, -1);
    p.page = 0;
    p.lastPlaced = -1;
    p.position = -1;

    std::vector<std::vector<int>> nodes(levels);
    if (p.result) {
        for (size_t i = 0; i < p.result->groups.size(); ++i) {
            const auto level = static_cast<size_t>(p.result->groups[i].level);
            if (level >= 1 && level <= levels)
                nodes[level - 1].push_back(static_cast<int>(i));
        }
    }
    std::vector<size_t> cursor(levels, 0);
    std::vector<double> keepWith(levels, 0);
    double below = Private::shownHeight(p.detail);
    for (size_t l = levels; l-- > 0;) {
        keepWith[l] = below;
        below += Private::shownHeight(p.groupHeaders[l]);
    }

    try {
        p.startPage(visitor);
        const qsizetype count = recordCount();
        for (qsizetype position = 0; position < count; ++position) {
            for (size_t l = 0; l < levels; ++l) {
                if (cursor[l] >= nodes[l].size())
                    continue;
                const int node = nodes[l][cursor[l]];
                if (p.result->groups[static_cast<size_t>(node)].firstRecord != position)
                    continue;
                p.groupAt[l] = node;
                p.place(visitor, p.groupHeaders[l], Band::GroupHeader, static_cast<int>(l) + 1,
                    position, keepWith[l]);
            }
            p.place(visitor, p.detail, Band::Detail, 0, position);
            p.lastPlaced = position;
            for (size_t l = levels; l-- > 0;) {
                if (cursor[l] >= nodes[l].size())
                    continue;
                const auto& node = p.result->groups[static_cast<size_t>(nodes[l][cursor[l]])];
                if (node.firstRecord + node.recordCount - 1 != position)
                    continue;
                p.place(visitor, p.groupFooters[l], Band::GroupFooter, static_cast<int>(l) + 1,
                    position);
                ++cursor[l];
            }
        }
        p.place(visitor, p.reportFooter, Band::ReportFooter, 0, count > 0 ? count - 1 : -1);
        p.finishPage(visitor);
    } catch (...) {
        p.report.setCurrentRecord(-1);
        throw;
    }
    p.report.setCurrentRecord(-1);
    return p.page;
}

Value BandWalker::value(const ReportObject& object)
{
    Private& p = *d;
    const ObjectDefinition& def = object.current();
    switch (def.kind) {
    case Kind::Text:
        return Value::string(def.text);
    case Kind::Field:
    case Kind::Blob: {
        if (!p.records || !p.result || p.position < 0 || p.position >= p.result->size())
            return {};
        auto found = p.references.find(&object);
        if (found == p.references.end())
            found = p.references.emplace(&object, p.report.compiledReference(def.field)).first;
        if (!found->second)
            return {};
        const Value* record = p.records->record(p.result->recordAt(p.position));
        try {
            return FormulaEvaluator::evaluate(*found->second, record, p.printDate);
        } catch (const FormulaException& error) {
            raiseError(Error::FormulaError, error.error().describe());
        }
    }
    case Kind::Summary: {
        const int index = p.report.summaryIndex(&object);
        if (!p.result || index < 0)
            return {};
        const auto s = static_cast<size_t>(index);
        if (def.group <= 0)
            return s < p.result->totals.size() ? p.result->totals[s] : Value();
        const auto level = static_cast<size_t>(def.group - 1);
        if (level >= p.groupAt.size() || p.groupAt[level] < 0)
            return {};
        const auto& node = p.result->groups[static_cast<size_t>(p.groupAt[level])];
        return s < node.summaries.size() ? node.summaries[s] : Value();
    }
    case Kind::Special:
        switch (def.special) {
        case SpecialField::PageNumber:
            return Value::number(p.page);
        case SpecialField::TotalPages:
            return m_totalPages > 0 ? Value::number(m_totalPages) : Value();
        case SpecialField::PrintDate:
            return Value::fromDate(p.printDate.date());
        case SpecialField::RecordNumber:
            return p.position >= 0 ? Value::number(static_cast<double>(p.position + 1)) : Value();
        case SpecialField::PageNofM: {
            QString shown
                = def.format.isEmpty() ? QStringLiteral("Page {page} of {pages}") : def.format;
            shown.replace(QStringLiteral("{page}"), QString::number(p.page));
            return Value::string(shown.replace(QStringLiteral("{pages}"),
                m_totalPages > 0 ? QString::number(m_totalPages) : QString()));
        }
        }
        return {};
    default:
        return {};
    }
}

QString BandWalker::text(const ReportObject& object)
{
    const ObjectDefinition& def = object.current();
    const Value shown = value(object);
    if (shown.isNull() || shown.type() == ValueType::Binary)
        return {};
    if (shown.type() == ValueType::String)
        return shown.text();
    QString pattern = def.format;
    if (def.kind == Kind::Special && pattern.isEmpty() && shown.type() == ValueType::Number)
        pattern = QStringLiteral("0");
    return d->formatter.format(shown, pattern);
}

} // namespace reportrt
