#include "reportrt/layout/layoutengine.h"

#include "reportrt/base/invarianttext.h"
#include "reportrt/base/logging_p.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/recordprocessor.h"
#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/layout/textshaper.h"
#include "reportrt/layout/valueformatter.h"
#include "reportrt/report.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"

#include <QPageSize>
#include <QVarLengthArray>
#include <algorithm>
#include <cmath>
#include <optional>
#include <unordered_map>

namespace reportrt {

namespace {

using Kind = ObjectDefinition::Kind;

/// Images decoded from blob fields are kept by the bytes they came from, which the cache
/// holds, so the same picture on many records is decoded (and embedded in a PDF) once.
constexpr int imageCacheLimit = 256;

QRgb parseColor(const QString& text)
{
    bool ok = false;
    const uint value = text.mid(1).toUInt(&ok, 16);
    return ok && text.size() == 7 ? (0xff000000u | value) : 0xff000000u;
}

/// A formula that compares a subreport's field with a value of the main report.
QString linkCondition(const QString& field, const Value& value)
{
    switch (value.type()) {
    case ValueType::Null:
        return u"IsNull(" + field + u')';
    case ValueType::Number:
        return field + u" = " + invarianttext::formatNumber(value.toNumber());
    case ValueType::Currency:
        return field + u" = " + invarianttext::formatCurrency(value.currencyScaled());
    case ValueType::Boolean:
        return field + (value.toBoolean() ? u" = True" : u" = False");
    case ValueType::Date:
        return field + u" = #" + invarianttext::formatDate(value.julianDay()) + u'#';
    case ValueType::Time:
        return field + u" = #" + invarianttext::formatTime(value.msecsOfDay()) + u'#';
    case ValueType::DateTime:
        return field + u" = #" + invarianttext::formatDateTime(value.dateTimeMsecs()) + u'#';
    case ValueType::String:
        if (value.text().contains(u'\n') || value.text().contains(u'\r'))
            raiseError(Error::RuntimeFailure,
                QStringLiteral("The subreport link %1 cannot match a value with a line break.")
                    .arg(field));
        return field + u" = \"" + QString(value.text()).replace(u'"', QStringLiteral("\"\""))
            + u'"';
    case ValueType::Binary:
        break;
    }
    raiseError(Error::RuntimeFailure,
        QStringLiteral("The subreport link %1 cannot match binary data.").arg(field));
}

/// The sections of one report by their role.
struct Bands {
    Section* reportHeader = nullptr;
    Section* pageHeader = nullptr;
    Section* detail = nullptr;
    Section* reportFooter = nullptr;
    Section* pageFooter = nullptr;
    std::vector<Section*> groupHeaders; // by level - 1
    std::vector<Section*> groupFooters;

    explicit Bands(const Report& report)
    {
        size_t groupCount = 0;
        for (const auto& s : report.sections()) {
            const QString name = s->name();
            if (name.startsWith(u"GH") || name.startsWith(u"GF"))
                groupCount = std::max(groupCount, static_cast<size_t>(name.mid(2).toInt()));
        }
        groupHeaders.resize(groupCount);
        groupFooters.resize(groupCount);
        for (const auto& s : report.sections()) {
            auto* section = static_cast<Section*>(s.get());
            const QString name = section->name();
            if (name == u"RH")
                reportHeader = section;
            else if (name == u"PH")
                pageHeader = section;
            else if (name == u"D")
                detail = section;
            else if (name == u"RF")
                reportFooter = section;
            else if (name == u"PF")
                pageFooter = section;
            else {
                const auto level = static_cast<size_t>(name.mid(2).toInt());
                if (level >= 1 && level <= groupCount)
                    (name.startsWith(u"GH") ? groupHeaders : groupFooters)[level - 1] = section;
            }
        }
    }
};

double shownHeight(const Section* section)
{
    return section && !section->isSuppressed() ? section->height() : 0.0;
}

/// Puts the objects of a section back as they were before its format event.
class FormatGuard {
public:
    explicit FormatGuard(const Section& section)
        : m_section(section)
    {
        for (const auto& o : section.objects())
            m_states.push_back(o->formatState());
    }
    ~FormatGuard()
    {
        const auto& objects = m_section.objects();
        for (size_t i = 0; i < objects.size() && i < m_states.size(); ++i)
            objects[i]->restoreFormatState(m_states[i]);
    }
    FormatGuard(const FormatGuard&) = delete;
    FormatGuard& operator=(const FormatGuard&) = delete;

private:
    const Section& m_section;
    std::vector<ReportObject::FormatState> m_states;
};

class Pass;

/// One run of the layout: the page being filled and what all passes share.
struct Layout {
    Report& report;
    TextShaper& shaper;
    ValueFormatter formatter;
    PageGeometry geometry;
    QDateTime printDate;
    int totalPages = 0;
    // The records of the main report laid out, in print order: all, or one group's.
    qsizetype firstPosition = 0;
    qsizetype endPosition = -1; // -1: to the last record

    const LayoutEngine::PageSink* sink = nullptr;
    Pass* main = nullptr;

    // The page being filled.
    Page page;
    int pageNumber = 0;
    double y = 0; // where the next instance goes
    double bodyBottom = 0; // where the page footer starts
    bool hasBody = false; // something was placed below the page header
    bool pendingBreak = false; // "new page after" waits for the next instance

    struct CachedImage {
        QByteArray bytes;
        QImage image;
    };
    std::unordered_map<const char*, CachedImage> images;

    Layout(Report& r, TextShaper& s)
        : report(r)
        , shaper(s)
        , geometry(PageGeometry::of(r.pageSetup()))
    { }

    bool drawing() const { return sink && *sink; }
    void startPage();
    void finishPage();
    void breakPage()
    {
        finishPage();
        startPage();
    }
    QImage blobImage(const Value& value);
};

/// The layout of one report's bands: the main report, or a subreport in its section
/// instance (without page header and footer, which belong to the main report).
class Pass {
public:
    Pass(Layout& layout, Report& report, double x, bool isMain)
        : m_layout(layout)
        , m_report(report)
        , m_x(x)
        , m_isMain(isMain)
        , m_result(report.result())
        , m_records(report.records())
        , m_bands(report)
    { }

    /// Places the report header, the records with their groups and the report footer.
    void run();
    /// The page header (when the page starts) and footer (at its end) of the main report.
    void placePageHeader();
    void placePageFooter();
    /// The report header of the main report, on the first page before its page header.
    void placeReportHeader();
    double pageFooterHeight() const { return shownHeight(m_bands.pageFooter); }

private:
    struct Instance {
        Section* section = nullptr;
        qsizetype position = -1; // in print order (Result::records); -1: no record
    };
    struct Item {
        const ReportObject* object = nullptr;
        QRectF rect; // from the instance's top-left corner
        QVarLengthArray<std::shared_ptr<const ShapedText>, 1> lines;
        int font = -1;
        QImage image;
    };
    struct Prepared {
        double height = 0;
        std::vector<Item> items;
        std::vector<ReportObject*> subreports;
    };

    void setContext(const Instance& instance);
    void place(const Instance& instance, double keepWithNext = 0);
    void placeAt(const Instance& instance, double top);
    Prepared prepare(const Instance& instance);
    /// The height of every instance of a section without can-grow text or subreports,
    /// as long as no format handler may change it; nothing for other sections.
    std::optional<double> fixedHeight(const Section& section);
    void draw(const Prepared& prepared, double top);
    void noteBand(const Section& section, double top, double height);
    void drawText(const Item& item, double left, double top);
    void layOutSubreports(const Instance& host, const Prepared& prepared, double top);
    QString text(const ReportObject& object);
    Value fieldValue(const ReportObject& object);
    int fontOf(const ReportObject& object);
    QRgb colorOf(const QString& color);

    Layout& m_layout;
    Report& m_report;
    double m_x; // left edge, twips
    bool m_isMain;
    const RecordProcessor::Result* m_result;
    const RecordSet* m_records;
    Bands m_bands;
    std::vector<int> m_groupAt; // current group node per level - 1
    qsizetype m_position = -1; // the instance's record, in print order
    qsizetype m_lastPlaced = -1; // the last detail placed, for page footers
    qsizetype m_next = 0; // the next detail to place, for page headers
    std::unordered_map<const ReportObject*, const FormulaExpr*> m_references;
    std::unordered_map<const ReportObject*, int> m_fonts;
    std::unordered_map<const Section*, std::optional<double>> m_fixedHeights;
    QString m_lastColorText;
    QRgb m_lastColor = 0xff000000;
};

void Layout::startPage()
{
    ++pageNumber;
    page = Page();
    page.number = pageNumber;
    page.size = QSizeF(geometry.width, geometry.height);
    y = geometry.top;
    bodyBottom = geometry.height - geometry.bottom - main->pageFooterHeight();
    hasBody = false;
    pendingBreak = false;
    if (pageNumber == 1 && endPosition < 0)
        main->placeReportHeader();
    main->placePageHeader();
}

void Layout::finishPage()
{
    main->placePageFooter();
    if (drawing())
        (*sink)(std::move(page));
    page = Page();
}

QImage Layout::blobImage(const Value& value)
{
    if (value.type() != ValueType::Binary || value.bytes().isEmpty())
        return {};
    const QByteArray& bytes = value.bytes();
    const auto found = images.find(bytes.constData());
    if (found != images.end() && found->second.bytes.size() == bytes.size())
        return found->second.image;
    QImage image = QImage::fromData(bytes);
    if (image.isNull())
        qCWarning(lcOutput, "a blob field holds %lld bytes that are not a picture; skipped",
            static_cast<long long>(bytes.size()));
    if (images.size() >= imageCacheLimit)
        images.clear();
    images[bytes.constData()] = { bytes, image };
    return image;
}

void Pass::setContext(const Instance& instance)
{
    m_position = instance.position;
    const qsizetype record
        = m_result && instance.position >= 0 && instance.position < m_result->size()
        ? m_result->recordAt(instance.position)
        : -1;
    m_report.setCurrentRecord(record);
}

QString Pass::text(const ReportObject& object)
{
    const ObjectDefinition& d = object.current();
    switch (d.kind) {
    case Kind::Text:
        return d.text;
    case Kind::Field:
        return m_layout.formatter.format(fieldValue(object), d.format);
    case Kind::Summary: {
        const int index = m_report.summaryIndex(&object);
        if (!m_result || index < 0)
            return {};
        const auto s = static_cast<size_t>(index);
        if (d.group <= 0)
            return m_layout.formatter.format(m_result->totals[s], d.format);
        const auto level = static_cast<size_t>(d.group - 1);
        if (level >= m_groupAt.size() || m_groupAt[level] < 0)
            return {};
        const auto& node = m_result->groups[static_cast<size_t>(m_groupAt[level])];
        return m_layout.formatter.format(node.summaries[s], d.format);
    }
    case Kind::Special:
        switch (d.special) {
        case SpecialField::PageNumber:
            return m_layout.formatter.format(Value::number(m_layout.pageNumber),
                d.format.isEmpty() ? QStringLiteral("0") : d.format);
        case SpecialField::TotalPages:
            if (m_layout.totalPages <= 0)
                return {};
            return m_layout.formatter.format(Value::number(m_layout.totalPages),
                d.format.isEmpty() ? QStringLiteral("0") : d.format);
        case SpecialField::PrintDate:
            return m_layout.formatter.format(Value::fromDate(m_layout.printDate.date()), d.format);
        case SpecialField::PageNofM: {
            QString shown
                = d.format.isEmpty() ? QStringLiteral("Page {page} of {pages}") : d.format;
            shown.replace(QStringLiteral("{page}"), QString::number(m_layout.pageNumber));
            return shown.replace(QStringLiteral("{pages}"),
                m_layout.totalPages > 0 ? QString::number(m_layout.totalPages) : QString());
        }
        case SpecialField::RecordNumber:
            if (m_position < 0)
                return {};
            return m_layout.formatter.format(Value::number(static_cast<double>(m_position + 1)),
                d.format.isEmpty() ? QStringLiteral("0") : d.format);
        }
        return {};
    default:
        return {};
    }
}

Value Pass::fieldValue(const ReportObject& object)
{
    if (!m_records || m_position < 0 || !m_result || m_position >= m_result->size())
        return {};
    auto found = m_references.find(&object);
    if (found == m_references.end())
        found = m_references.emplace(&object, m_report.compiledReference(object.current().field))
                    .first;
    if (!found->second)
        return {};
    const Value* record = m_records->record(m_result->recordAt(m_position));
    try {
        return FormulaEvaluator::evaluate(*found->second, record, m_layout.printDate);
    } catch (const FormulaException& error) {
        raiseError(Error::FormulaError, error.error().describe());
    }
}

QRgb Pass::colorOf(const QString& color)
{
    // Reports use a handful of colours; this runs for every field drawn.
    if (color == m_lastColorText)
        return m_lastColor;
    m_lastColorText = color;
    m_lastColor = parseColor(color);
    return m_lastColor;
}

int Pass::fontOf(const ReportObject& object)
{
    const auto found = m_fonts.find(&object);
    if (found != m_fonts.end())
        return found->second;
    const int font = m_layout.shaper.font(object.current().font);
    m_fonts.emplace(&object, font);
    return font;
}

std::optional<double> Pass::fixedHeight(const Section& section)
{
    const auto found = m_fixedHeights.find(&section);
    if (found != m_fixedHeights.end())
        return found->second;
    std::optional<double> height = section.height();
    for (const auto& o : section.objects()) {
        const ObjectDefinition& d = o->current();
        if (d.suppressed)
            continue;
        if (d.canGrow || d.kind == Kind::Subreport) {
            height.reset();
            break;
        }
        height = std::max<double>(*height, d.top + d.height);
    }
    m_fixedHeights.emplace(&section, height);
    return height;
}

Pass::Prepared Pass::prepare(const Instance& instance)
{
    Section& section = *instance.section;
    Prepared p;
    p.height = section.height();
    const bool drawing = m_layout.drawing();
    for (const auto& o : section.objects()) {
        const ObjectDefinition& d = o->current();
        if (d.suppressed)
            continue;
        Item item;
        item.object = o.get();
        item.rect = QRectF(d.left, d.top, d.width, d.height);
        double height = d.height;
        switch (d.kind) {
        case Kind::Text:
        case Kind::Field:
        case Kind::Summary:
        case Kind::Special: {
            const bool grows = d.canGrow && d.kind != Kind::Special && d.width > 0;
            if (!drawing && !grows)
                break;
            item.font = fontOf(*o);
            const bool deferred = d.kind == Kind::Special
                && (d.special == SpecialField::PageNumber || d.special == SpecialField::TotalPages
                    || d.special == SpecialField::PageNofM);
            if (deferred)
                break;
            const QString shown = text(*o);
            if (grows) {
                const auto& metrics = m_layout.shaper.metrics(item.font);
                for (const QString& line : m_layout.shaper.wrap(shown, item.font, d.width))
                    item.lines.push_back(m_layout.shaper.shape(line, item.font));
                height = std::max<double>(d.height,
                    std::ceil(static_cast<double>(item.lines.size()) * metrics.lineHeight()));
            } else if (!shown.isEmpty()) {
                item.lines.push_back(m_layout.shaper.shape(shown, item.font));
            }
            break;
        }
        case Kind::Picture:
            if (drawing)
                item.image = o->picture();
            break;
        case Kind::Blob:
            if (drawing)
                item.image = m_layout.blobImage(fieldValue(*o));
            break;
        case Kind::Subreport:
            p.subreports.push_back(o.get());
            break;
        case Kind::Line:
        case Kind::Box:
            break;
        }
        item.rect.setHeight(height);
        double bottom = d.top + height;
        // An object that grew keeps the space the designer left below it.
        if (height > d.height)
            bottom += std::max(0, section.height() - (d.top + d.height));
        p.height = std::max(p.height, bottom);
        if (drawing && d.kind != Kind::Subreport)
            p.items.push_back(std::move(item));
    }
    return p;
}

void Pass::drawText(const Item& item, double left, double top)
{
    const ObjectDefinition& d = item.object->current();
    QVarLengthArray<std::shared_ptr<const ShapedText>, 1> lines = item.lines;
    if (d.kind == Kind::Special
        && (d.special == SpecialField::PageNumber || d.special == SpecialField::TotalPages
            || d.special == SpecialField::PageNofM)) {
        const QString shown = text(*item.object);
        if (!shown.isEmpty())
            lines.push_back(m_layout.shaper.shape(shown, item.font));
    }
    if (lines.empty() || item.font < 0)
        return;
    const auto& metrics = m_layout.shaper.metrics(item.font);
    const QRgb color = colorOf(d.color);
    const double boxLeft = left + item.rect.left();
    const double width = item.rect.width();
    double baseline = top + item.rect.top() + metrics.ascent;
    for (const auto& line : lines) {
        if (baseline - metrics.ascent > m_layout.geometry.height)
            break;
        Page::Text t;
        t.text = line;
        t.glyphCount = line->fittingGlyphs(width);
        const double shown = line->x[static_cast<size_t>(t.glyphCount)];
        double x = boxLeft;
        if (t.glyphCount == line->glyphCount()) {
            if (d.alignment == Alignment::Right)
                x = boxLeft + width - shown;
            else if (d.alignment == Alignment::Center)
                x = boxLeft + (width - shown) / 2;
        }
        t.origin = QPointF(x, baseline);
        t.color = color;
        t.underline = d.font.underline;
        t.underlineY = metrics.underlinePosition;
        t.underlineWidth = metrics.lineWidth;
        if (t.glyphCount > 0)
            m_layout.page.texts.push_back(std::move(t));
        baseline += metrics.lineHeight();
    }
}

void Pass::draw(const Prepared& prepared, double top)
{
    const QRectF pageRect(0, 0, m_layout.geometry.width, m_layout.geometry.height);
    for (const Item& item : prepared.items) {
        const ObjectDefinition& d = item.object->current();
        const QRectF rect = item.rect.translated(m_x, top);
        const QRectF visible = rect.intersected(pageRect);
        switch (d.kind) {
        case Kind::Text:
        case Kind::Field:
        case Kind::Summary:
        case Kind::Special:
            if (rect.left() < pageRect.right() && rect.top() < pageRect.bottom())
                drawText(item, m_x, top);
            break;
        case Kind::Line: {
            const QPointF from = rect.topLeft();
            const QPointF to(rect.left() + d.width, rect.top() + d.height);
            if ((d.width > 0 || d.height > 0) && d.lineWidth > 0
                && QRectF(from, to).normalized().adjusted(-1, -1, 1, 1).intersects(pageRect))
                m_layout.page.lines.push_back(
                    { from, to, static_cast<double>(d.lineWidth), colorOf(d.color) });
            break;
        }
        case Kind::Box:
            if (!visible.isEmpty())
                m_layout.page.boxes.push_back({ rect, static_cast<double>(d.lineWidth),
                    colorOf(d.color), !d.fillColor.isEmpty(), colorOf(d.fillColor) });
            break;
        case Kind::Picture:
        case Kind::Blob: {
            if (item.image.isNull() || visible.isEmpty())
                break;
            // The picture keeps its proportions, centred in its frame.
            QSizeF size = item.image.size();
            size.scale(rect.size(), Qt::KeepAspectRatio);
            const QRectF target(rect.left() + (rect.width() - size.width()) / 2,
                rect.top() + (rect.height() - size.height()) / 2, size.width(), size.height());
            m_layout.page.pictures.push_back({ target, visible, item.image });
            break;
        }
        case Kind::Subreport:
            break;
        }
    }
}

void Pass::place(const Instance& instance, double keepWithNext)
{
    Section& section = *instance.section;
    if (section.isSuppressed())
        return;
    if (section.newPageBefore() && m_layout.hasBody)
        m_layout.breakPage();
    setContext(instance);
    std::optional<FormatGuard> guard;
    if (section.hasFormatHandlers()) {
        guard.emplace(section);
        section.raiseFormat();
    }
    // Counting pages, a section whose height cannot change needs no preparing.
    const std::optional<double> fixed
        = m_layout.drawing() || guard ? std::nullopt : fixedHeight(section);
    const Prepared prepared = fixed ? Prepared { *fixed, {}, {} } : prepare(instance);
    if (prepared.height > 0 || !prepared.subreports.empty()) {
        const double body = m_layout.bodyBottom - m_layout.geometry.top;
        const double needed
            = prepared.height + (prepared.height + keepWithNext <= body ? keepWithNext : 0);
        if (m_layout.hasBody
            && (m_layout.pendingBreak || m_layout.y + needed > m_layout.bodyBottom)) {
            m_layout.breakPage();
            setContext(instance);
        }
        m_layout.pendingBreak = false;
    }
    const double top = m_layout.y;
    if (m_layout.drawing()) {
        draw(prepared, top);
        noteBand(section, top, prepared.height);
    }
    m_layout.y = top + prepared.height;
    if (prepared.height > 0)
        m_layout.hasBody = true;
    if (!prepared.subreports.empty())
        layOutSubreports(instance, prepared, top);
    if (section.newPageAfter())
        m_layout.pendingBreak = true;
}

void Pass::placeAt(const Instance& instance, double top)
{
    Section& section = *instance.section;
    if (section.isSuppressed())
        return;
    setContext(instance);
    std::optional<FormatGuard> guard;
    if (section.hasFormatHandlers()) {
        guard.emplace(section);
        section.raiseFormat();
    }
    const Prepared prepared = prepare(instance);
    if (m_layout.drawing()) {
        draw(prepared, top);
        noteBand(section, top, prepared.height);
    }
    m_layout.y = top + prepared.height;
}

void Pass::noteBand(const Section& section, double top, double height)
{
    if (!m_isMain || height <= 0)
        return;
    int node = -1;
    const QString name = section.name();
    if (name.startsWith(u"GH")) {
        const auto level = static_cast<size_t>(name.mid(2).toInt());
        if (level >= 1 && level <= m_groupAt.size())
            node = m_groupAt[level - 1];
    }
    const double width = m_layout.geometry.width - m_layout.geometry.left - m_layout.geometry.right;
    m_layout.page.bands.push_back({ QRectF(m_x, top, width, height), name, node });
}

void Pass::placePageHeader()
{
    if (!m_bands.pageHeader)
        return;
    placeAt({ m_bands.pageHeader, m_result && m_next < m_result->size() ? m_next : m_lastPlaced },
        m_layout.y);
}

void Pass::placePageFooter()
{
    if (!m_bands.pageFooter || m_bands.pageFooter->isSuppressed())
        return;
    const double y = m_layout.y;
    placeAt({ m_bands.pageFooter, m_lastPlaced }, m_layout.bodyBottom);
    m_layout.y = y;
}

void Pass::placeReportHeader()
{
    if (m_bands.reportHeader)
        place({ m_bands.reportHeader, m_result && m_result->size() > 0 ? 0 : -1 });
}

void Pass::layOutSubreports(const Instance& host, const Prepared& prepared, double top)
{
    const double height = prepared.height;
    const int hostPage = m_layout.pageNumber;
    double end = m_layout.y;
    int endPage = hostPage;
    for (ReportObject* object : prepared.subreports) {
        const ObjectDefinition& d = object->current();
        auto subreport = std::static_pointer_cast<Report>(object->openSubreport());
        // A page break in an earlier subreport placed page headers and footers.
        setContext(host);
        // Each instance reads the records its links select: the subreport's own selection
        // and, for each link, its field equal to the main report's value.
        QStringList conditions;
        for (const SubreportLink& link : d.links) {
            const FormulaExpr* expr = m_report.compiledReference(link.mainField);
            Value value;
            if (expr && m_records && m_position >= 0) {
                try {
                    value = FormulaEvaluator::evaluate(*expr,
                        m_records->record(m_result->recordAt(m_position)), m_layout.printDate);
                } catch (const FormulaException& error) {
                    raiseError(Error::FormulaError, error.error().describe());
                }
            }
            conditions << linkCondition(link.subreportField, value);
        }
        const QString own = subreport->recordSelectionFormula();
        if (!conditions.isEmpty()) {
            if (!own.trimmed().isEmpty())
                conditions.prepend(u'(' + own + u')');
            subreport->setRecordSelectionFormula(conditions.join(QStringLiteral(" And ")));
        }
        try {
            subreport->readRecords();
        } catch (...) {
            subreport->setRecordSelectionFormula(own);
            throw;
        }
        subreport->setRecordSelectionFormula(own);

        m_layout.y = m_layout.pageNumber == hostPage ? top + d.top : end;
        Pass pass(m_layout, *subreport, m_x + d.left, false);
        pass.run();
        const double below = std::max(0.0, height - (d.top + d.height));
        const double subreportEnd = m_layout.y + below;
        if (m_layout.pageNumber != endPage) {
            endPage = m_layout.pageNumber;
            end = subreportEnd;
        } else {
            end = std::max(end, subreportEnd);
        }
    }
    m_layout.y = end;
    m_layout.hasBody = true;
}

void Pass::run()
{
    const size_t levels = m_bands.groupHeaders.size();
    m_groupAt.assign(levels, -1);
    m_next = 0;
    m_lastPlaced = -1;
    if (!m_isMain && m_bands.reportHeader)
        place({ m_bands.reportHeader, m_result && m_result->size() > 0 ? 0 : -1 });
    const qsizetype all = m_result ? m_result->size() : 0;
    const bool restricted = m_isMain && m_layout.endPosition >= 0;
    const qsizetype first = restricted ? m_layout.firstPosition : 0;
    const qsizetype count = restricted ? std::min(all, m_layout.endPosition) : all;

    // Group nodes of each level in print order.
    std::vector<std::vector<int>> nodes(levels);
    if (m_result) {
        for (size_t i = 0; i < m_result->groups.size(); ++i) {
            const auto level = static_cast<size_t>(m_result->groups[i].level);
            if (level >= 1 && level <= levels)
                nodes[level - 1].push_back(static_cast<int>(i));
        }
    }
    std::vector<size_t> cursor(levels, 0);
    // Laying out one group: the groups that end before it are passed over, and the groups
    // around it, which started earlier, get neither header nor footer.
    for (size_t l = 0; l < levels; ++l) {
        while (cursor[l] < nodes[l].size()) {
            const auto& node = m_result->groups[static_cast<size_t>(nodes[l][cursor[l]])];
            if (node.firstRecord + node.recordCount > first)
                break;
            ++cursor[l];
        }
    }
    // A group header stays with the first detail of its group (and the headers between).
    std::vector<double> keepWith(levels, 0);
    double below = shownHeight(m_bands.detail);
    for (size_t l = levels; l-- > 0;) {
        keepWith[l] = below;
        below += shownHeight(m_bands.groupHeaders[l]);
    }

    const auto inside = [&](int index) {
        const auto& node = m_result->groups[static_cast<size_t>(index)];
        return node.firstRecord >= first && node.firstRecord + node.recordCount <= count;
    };
    for (qsizetype position = first; position < count; ++position) {
        m_next = position;
        for (size_t l = 0; l < levels; ++l) {
            if (cursor[l] >= nodes[l].size())
                continue;
            const int node = nodes[l][cursor[l]];
            if (m_result->groups[static_cast<size_t>(node)].firstRecord != position)
                continue;
            m_groupAt[l] = node;
            if (m_bands.groupHeaders[l] && inside(node))
                place({ m_bands.groupHeaders[l], position }, keepWith[l]);
        }
        if (m_bands.detail)
            place({ m_bands.detail, position });
        m_lastPlaced = position;
        m_next = position + 1;
        for (size_t l = levels; l-- > 0;) {
            if (cursor[l] >= nodes[l].size())
                continue;
            const auto& node = m_result->groups[static_cast<size_t>(nodes[l][cursor[l]])];
            if (node.firstRecord + node.recordCount - 1 != position)
                continue;
            if (m_bands.groupFooters[l] && inside(nodes[l][cursor[l]]))
                place({ m_bands.groupFooters[l], position });
            ++cursor[l];
        }
    }
    if (m_bands.reportFooter && !restricted)
        place({ m_bands.reportFooter, count > 0 ? count - 1 : -1 });
    m_report.setCurrentRecord(-1);
}

} // namespace

LayoutEngine::LayoutEngine(Report& report, TextShaper& shaper)
    : m_report(report)
    , m_shaper(shaper)
{ }

LayoutEngine::~LayoutEngine() = default;

void LayoutEngine::setTotalPages(int count)
{
    m_totalPages = count;
}

void LayoutEngine::setPrintDate(const QDateTime& dateTime)
{
    m_printDate = dateTime;
}

int LayoutEngine::run(const PageSink& sink)
{
    if (!m_report.result())
        m_report.readRecords();
    Layout layout(m_report, m_shaper);
    const PageGeometry& g = layout.geometry;
    if (g.left + g.right >= g.width || g.top + g.bottom >= g.height)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The margins (left %1, right %2, top %3, bottom %4 twips) leave no "
                           "room on the paper (%5 x %6 twips).")
                .arg(g.left)
                .arg(g.right)
                .arg(g.top)
                .arg(g.bottom)
                .arg(qRound(g.width))
                .arg(qRound(g.height)));
    layout.printDate = m_printDate;
    layout.totalPages = m_totalPages;
    if (m_groupNode >= 0) {
        const RecordProcessor::Result* result = m_report.result();
        if (!result || static_cast<size_t>(m_groupNode) >= result->groups.size())
            raiseError(Error::RuntimeFailure,
                QStringLiteral("The report has no group %1 to lay out.").arg(m_groupNode));
        const auto& node = result->groups[static_cast<size_t>(m_groupNode)];
        layout.firstPosition = node.firstRecord;
        layout.endPosition = node.firstRecord + node.recordCount;
    }
    layout.sink = &sink;
    Pass main(layout, m_report, layout.geometry.left, true);
    layout.main = &main;
    try {
        // The report header comes before the page header on the first page.
        layout.startPage();
        main.run();
        layout.finishPage();
    } catch (...) {
        m_report.setCurrentRecord(-1);
        throw;
    }
    return layout.pageNumber;
}

bool LayoutEngine::showsTotalPages(Report& report)
{
    for (const auto& s : report.sections()) {
        for (const auto& o : static_cast<Section*>(s.get())->objects()) {
            const ObjectDefinition& def = o->current();
            if (def.kind == Kind::Special
                && (def.special == SpecialField::TotalPages
                    || def.special == SpecialField::PageNofM))
                return true;
            if (def.kind == Kind::Subreport
                && showsTotalPages(*std::static_pointer_cast<Report>(o->openSubreport())))
                return true;
        }
    }
    return false;
}

} // namespace reportrt
