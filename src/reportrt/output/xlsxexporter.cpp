#include "reportrt/output/xlsxexporter.h"

#include "reportrt/base/logging_p.h"
#include "reportrt/exportoptions.h"
#include "reportrt/output/bandwalker.h"
#include "reportrt/output/stagedfile.h"
#include "reportrt/report.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"

#include <QFile>
#include <QHash>
#include <QLocale>
#include <QRegularExpression>
#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <unordered_map>
#include <utility>
#include <xlsxwriter.h>

namespace reportrt {

namespace {

using Kind = ObjectDefinition::Kind;
using Band = BandWalker::Band;

/// The area type the component sets: group and total rows are written with the details.
constexpr int16_t areaWholeReport = 4;
constexpr int maxOutlineLevel = 7; // Excel's limit
constexpr size_t maxPageBreaks = 1023; // Excel's limit
constexpr int maxCellText = 32767; // Excel's limit
constexpr double constantColumnChars = 14;
/// Day 0 of Excel's calendar (1899-12-30) as a Julian day number.
constexpr int64_t excelEpochJulianDay = 2415019;
/// Excel counts a 29 February 1900 that never was: serials before 1 March 1900 are off.
constexpr double firstSafeSerial = 61;

/// Every character of a report pattern's text taken literally in an Excel format.
QString literal(QStringView text)
{
    QString result;
    for (const QChar c : text) {
        result += u'\\';
        result += c;
    }
    return result;
}

/// A report number pattern ("€ #,##0.00", "0.0 %") as an Excel number format; empty when
/// the pattern has no digit places.
QString excelNumberFormat(const QString& pattern)
{
    const qsizetype first = pattern.indexOf(QRegularExpression(QStringLiteral("[0#]")));
    const qsizetype last = pattern.lastIndexOf(QRegularExpression(QStringLiteral("[0#]")));
    if (first < 0)
        return {};
    const QStringView core = QStringView(pattern).mid(first, last - first + 1);
    const qsizetype point = core.indexOf(u'.');
    const int decimals = point < 0
        ? 0
        : static_cast<int>(core.mid(point + 1).count(u'0') + core.mid(point + 1).count(u'#'));
    QString format = core.contains(u',') ? QStringLiteral("#,##0") : QStringLiteral("0");
    if (decimals > 0)
        format += u'.' + QString(decimals, u'0');
    return literal(QStringView(pattern).left(first)) + format
        + literal(QStringView(pattern).mid(last + 1));
}

/// A report date pattern ("dd.mm.yyyy hh:nn") as an Excel date format.
QString excelDateFormat(const QString& pattern)
{
    // Longest first; minutes ("n") become Excel's "m", which it reads as minutes next to
    // hours or seconds.
    static const char* const tokens[][2] = { { "yyyy", "yyyy" }, { "mmmm", "mmmm" },
        { "dddd", "dddd" }, { "mmm", "mmm" }, { "ddd", "ddd" }, { "dd", "dd" }, { "mm", "mm" },
        { "yy", "yy" }, { "hh", "hh" }, { "nn", "mm" }, { "ss", "ss" }, { "d", "d" }, { "m", "m" },
        { "h", "h" }, { "n", "m" }, { "s", "s" } };
    QString result;
    qsizetype i = 0;
    while (i < pattern.size()) {
        bool matched = false;
        for (const auto& token : tokens) {
            const auto length = static_cast<qsizetype>(qstrlen(token[0]));
            if (QStringView(pattern).mid(i, length).compare(
                    QLatin1StringView(token[0]), Qt::CaseInsensitive)
                == 0) {
                result += QLatin1StringView(token[1]);
                i += length;
                matched = true;
                break;
            }
        }
        if (!matched) {
            result += literal(QStringView(pattern).mid(i, 1));
            ++i;
        }
    }
    return result;
}

/// The locale's short date with a four-digit year, as the report shows dates by default.
QString defaultDateFormat()
{
    QString qt = QLocale().dateFormat(QLocale::ShortFormat);
    if (!qt.contains(QStringLiteral("yyyy")))
        qt.replace(QStringLiteral("yy"), QStringLiteral("yyyy"));
    QString result;
    for (const QChar c : qt) {
        if (c == u'M')
            result += u'm';
        else if (c == u'd' || c == u'y')
            result += c;
        else
            result += literal(QStringView(&c, 1));
    }
    return result;
}

QString columnName(int column)
{
    QString name;
    for (int c = column + 1; c > 0; c = (c - 1) / 26)
        name.prepend(QChar(u'A' + (c - 1) % 26));
    return name;
}

/// SUBTOTAL's function number for a summary (the 1..11 forms, which leave out the
/// SUBTOTAL cells of inner groups).
int subtotalFunction(SummaryOperation operation)
{
    switch (operation) {
    case SummaryOperation::Sum:
        return 9;
    case SummaryOperation::Count:
        return 3; // COUNTA: a count counts values of any type
    case SummaryOperation::Average:
        return 1;
    case SummaryOperation::Minimum:
        return 5;
    case SummaryOperation::Maximum:
        return 4;
    }
    return 9;
}

QString sheetName(const QString& title)
{
    QString name;
    for (const QChar c : title) {
        if (!QStringView(u"[]:*?/\\").contains(c) && c.isPrint())
            name += c;
    }
    name = name.trimmed().left(31);
    // An apostrophe may not start or end a sheet name.
    while (name.startsWith(u'\'') || name.endsWith(u'\''))
        name = name.startsWith(u'\'') ? name.mid(1) : name.chopped(1);
    return name.isEmpty() ? QStringLiteral("Report") : name;
}

struct Column {
    const ReportObject* object = nullptr;
    QString field;
    int left = 0;
    int width = 0;
};

/// Where the objects of a group or total section go: per column, the objects that fall
/// in it, left to right.
using RowTemplate = std::vector<std::vector<const ReportObject*>>;

class Writer {
public:
    Writer(Report& report, const ExportOptions& options, const QString& temporaryPath)
        : m_options(options)
        , m_walker(report)
        , m_title(report.title())
    {
        lxw_workbook_options settings {};
        settings.constant_memory = LXW_TRUE;
        settings.use_zip64 = LXW_TRUE;
        m_path = QFile::encodeName(temporaryPath);
        m_workbook = workbook_new_opt(m_path.constData(), &settings);
        if (!m_workbook)
            throw QStringLiteral("the workbook could not be created");
        m_sheet = workbook_add_worksheet(m_workbook, sheetName(m_title).toUtf8().constData());
        if (!m_sheet) {
            lxw_workbook_free(std::exchange(m_workbook, nullptr));
            throw QStringLiteral("the worksheet could not be added");
        }
        m_wholeReport = options.excelAreaType() == areaWholeReport;
    }
    ~Writer()
    {
        if (m_workbook)
            lxw_workbook_free(m_workbook);
    }
    Writer(const Writer&) = delete;
    Writer& operator=(const Writer&) = delete;

    int write()
    {
        setUpColumns();
        if (m_options.excelTabHasColumnHeadings() && !m_columns.empty()) {
            writeHeadings();
            worksheet_freeze_panes(m_sheet, 1, 0);
        }
        const int pages
            = m_walker.run([this](const BandWalker::Instance& instance) { visit(instance); });
        if (!m_breaks.empty()) {
            m_breaks.push_back(0);
            check(worksheet_set_h_pagebreaks(m_sheet, m_breaks.data()));
        }
        lxw_workbook* workbook = std::exchange(m_workbook, nullptr);
        check(workbook_close(workbook));
        return pages;
    }

private:
    void check(lxw_error error)
    {
        if (error != LXW_NO_ERROR)
            throw QString::fromUtf8(lxw_strerror(error));
    }

    lxw_format* format(const QString& numberFormat, bool bold)
    {
        const QString key = numberFormat + (bold ? u'\x1' : u'\x0');
        auto found = m_formats.constFind(key);
        if (found != m_formats.constEnd())
            return *found;
        lxw_format* f = workbook_add_format(m_workbook);
        if (!numberFormat.isEmpty())
            format_set_num_format(f, numberFormat.toUtf8().constData());
        if (bold)
            format_set_bold(f);
        m_formats.insert(key, f);
        return f;
    }

    void setUpColumns()
    {
        if (Section* detail = m_walker.section(Band::Detail)) {
            for (const auto& o : detail->objects()) {
                const ObjectDefinition& def = o->current();
                if (def.kind == Kind::Field && !def.suppressed)
                    m_columns.push_back({ o.get(), def.field, def.left, def.width });
            }
        }
        std::stable_sort(m_columns.begin(), m_columns.end(),
            [](const Column& a, const Column& b) { return a.left < b.left; });
        for (size_t c = 0; c < m_columns.size(); ++c) {
            // Excel measures widths in characters of its default font, about 7 pixels.
            const double chars = m_options.excelConstantColumnWidth()
                ? constantColumnChars
                : std::max(1.0, (m_columns[c].width / 15.0 - 5.0) / 7.0);
            check(worksheet_set_column(
                m_sheet, static_cast<lxw_col_t>(c), static_cast<lxw_col_t>(c), chars, nullptr));
        }
        if (m_wholeReport && !m_columns.empty())
            m_detailLevel = std::min(m_walker.groupLevels(), maxOutlineLevel);
    }

    /// The column an object of another section falls in: the one showing the same field
    /// for a summary, otherwise the last column starting at or left of it.
    int columnOf(const ReportObject& object) const
    {
        const ObjectDefinition& def = object.current();
        if (def.kind == Kind::Summary) {
            for (size_t c = 0; c < m_columns.size(); ++c) {
                if (m_columns[c].field.compare(def.field, Qt::CaseInsensitive) == 0)
                    return static_cast<int>(c);
            }
        }
        int column = 0;
        for (size_t c = 0; c < m_columns.size(); ++c) {
            if (m_columns[c].left <= def.left + 60)
                column = static_cast<int>(c);
        }
        return column;
    }

    const RowTemplate& rowTemplate(const Section* section)
    {
        auto found = m_templates.find(section);
        if (found != m_templates.end())
            return found->second;
        RowTemplate row(m_columns.size());
        std::vector<const ReportObject*> objects;
        for (const auto& o : section->objects()) {
            const ObjectDefinition& def = o->current();
            if (!def.suppressed
                && (def.kind == Kind::Text || def.kind == Kind::Field || def.kind == Kind::Summary
                    || def.kind == Kind::Special))
                objects.push_back(o.get());
        }
        std::stable_sort(
            objects.begin(), objects.end(), [](const ReportObject* a, const ReportObject* b) {
                return a->current().left < b->current().left;
            });
        for (const ReportObject* o : objects)
            row[static_cast<size_t>(columnOf(*o))].push_back(o);
        return m_templates.emplace(section, std::move(row)).first->second;
    }

    void writeHeadings()
    {
        std::vector<QStringList> headings(m_columns.size());
        if (Section* header = m_walker.section(Band::PageHeader)) {
            for (const auto& o : header->objects()) {
                const ObjectDefinition& def = o->current();
                if (def.kind != Kind::Text || def.suppressed || def.text.trimmed().isEmpty())
                    continue;
                // The column whose left edge is nearest to the heading's.
                size_t best = 0;
                for (size_t c = 1; c < m_columns.size(); ++c) {
                    if (std::abs(m_columns[c].left - def.left)
                        < std::abs(m_columns[best].left - def.left))
                        best = c;
                }
                headings[best] << def.text;
            }
        }
        lxw_format* bold = format(QString(), true);
        for (size_t c = 0; c < m_columns.size(); ++c) {
            QString heading = headings[c].join(u' ');
            if (heading.isEmpty()) {
                heading = m_columns[c].field;
                heading.remove(u'{').remove(u'}');
                heading = heading.mid(heading.lastIndexOf(u'.') + 1);
            }
            writeText(0, static_cast<int>(c), heading, bold);
        }
        m_row = 1;
    }

    void writeText(lxw_row_t row, int column, QString text, lxw_format* f)
    {
        if (text.size() > maxCellText) {
            qCWarning(lcOutput, "a text of %lld characters was cut to Excel's %d",
                static_cast<long long>(text.size()), maxCellText);
            text.truncate(maxCellText);
        }
        check(worksheet_write_string(
            m_sheet, row, static_cast<lxw_col_t>(column), text.toUtf8().constData(), f));
    }

    enum Shape { WholeNumber, Fraction, Currency, Date, DateTime, Time, shapes };

    /// The cell format of a value shape with a report pattern, made once per pattern:
    /// this runs for every numeric cell.
    lxw_format* shapeFormat(const QString& pattern, Shape shape, bool bold)
    {
        auto& formats = m_shapeFormats[pattern];
        lxw_format*& cached = formats[static_cast<size_t>(shape * 2 + (bold ? 1 : 0))];
        if (cached)
            return cached;
        QString f;
        switch (shape) {
        case WholeNumber:
        case Fraction:
        case Currency:
            f = excelNumberFormat(pattern);
            if (f.isEmpty())
                f = shape == WholeNumber ? QStringLiteral("#,##0") : QStringLiteral("#,##0.00");
            break;
        case Date:
            f = pattern.isEmpty() ? m_defaultDate : excelDateFormat(pattern);
            break;
        case DateTime:
            f = pattern.isEmpty() ? m_defaultDate + QStringLiteral(" hh:mm:ss")
                                  : excelDateFormat(pattern);
            break;
        case Time:
        case shapes:
            f = pattern.isEmpty() ? QStringLiteral("hh:mm:ss") : excelDateFormat(pattern);
            break;
        }
        cached = format(f, bold);
        return cached;
    }

    /// The cell format and number of a numeric or calendar value; false for others.
    bool numberOf(const Value& value, const QString& pattern, bool bold, lxw_format** cellFormat,
        double* number)
    {
        Shape shape = Fraction;
        switch (value.type()) {
        case ValueType::Number:
            *number = value.numeric();
            shape = *number == std::floor(*number) ? WholeNumber : Fraction;
            break;
        case ValueType::Currency:
            *number = value.numeric();
            shape = Currency;
            break;
        case ValueType::Date:
            *number = static_cast<double>(value.julianDay() - excelEpochJulianDay);
            if (*number < firstSafeSerial)
                return false;
            shape = Date;
            break;
        case ValueType::DateTime:
            *number = static_cast<double>(value.dateTimeMsecs()) / Value::msecsPerDay
                - static_cast<double>(excelEpochJulianDay);
            if (*number < firstSafeSerial)
                return false;
            shape = DateTime;
            break;
        case ValueType::Time:
            *number = static_cast<double>(value.msecsOfDay()) / Value::msecsPerDay;
            shape = Time;
            break;
        default:
            return false;
        }
        *cellFormat = shapeFormat(pattern, shape, bold);
        return true;
    }

    void writeValue(lxw_row_t row, int column, const ReportObject& object, bool bold)
    {
        const Value value = m_walker.value(object);
        const ObjectDefinition& def = object.current();
        const auto col = static_cast<lxw_col_t>(column);
        lxw_format* cellFormat = nullptr;
        double number = 0;
        if (numberOf(value, def.format, bold, &cellFormat, &number)) {
            check(worksheet_write_number(m_sheet, row, col, number, cellFormat));
            return;
        }
        switch (value.type()) {
        case ValueType::Null:
        case ValueType::Binary:
            return;
        case ValueType::Boolean:
            check(worksheet_write_boolean(m_sheet, row, col, value.toBoolean() ? 1 : 0,
                bold ? format(QString(), true) : nullptr));
            return;
        case ValueType::String:
            writeText(row, column, value.text(), bold ? format(QString(), true) : nullptr);
            return;
        default:
            // A date Excel cannot show (before March 1900): its text.
            writeText(row, column, m_walker.text(object), bold ? format(QString(), true) : nullptr);
        }
    }

    void startRow(int level)
    {
        lxw_row_col_options row {};
        row.level = static_cast<uint8_t>(std::clamp(level, 0, maxOutlineLevel));
        check(worksheet_set_row_opt(m_sheet, m_row, LXW_DEF_ROW_HEIGHT, nullptr, &row));
    }

    void visit(const BandWalker::Instance& instance)
    {
        if (m_columns.empty())
            return;
        if (instance.page > 1 && !m_options.excelExportAllPages())
            return;
        const bool rowBand = instance.band == Band::Detail
            || (m_wholeReport
                && (instance.band == Band::GroupHeader || instance.band == Band::GroupFooter
                    || instance.band == Band::ReportFooter));
        if (!rowBand)
            return;
        if (instance.page != m_lastPage) {
            if (m_lastPage > 0 && m_options.excelPageBreaks() && m_breaks.size() < maxPageBreaks)
                m_breaks.push_back(m_row);
            m_lastPage = instance.page;
        }
        if (instance.band == Band::Detail) {
            writeDetail(instance);
        } else {
            const int level = instance.band == Band::ReportFooter ? 0 : instance.level - 1;
            writeSummaryRow(instance, level);
        }
        ++m_row;
    }

    void writeDetail(const BandWalker::Instance& instance)
    {
        for (int level = 1; level <= m_walker.groupLevels(); ++level) {
            if (m_walker.groupRange(level).first == instance.position)
                m_groupFirstRow[level] = m_row;
        }
        if (m_firstDetailRow < 0)
            m_firstDetailRow = m_row;
        m_lastDetailRow = m_row;
        startRow(m_detailLevel);
        for (size_t c = 0; c < m_columns.size(); ++c)
            writeValue(m_row, static_cast<int>(c), *m_columns[c].object, false);
    }

    void writeSummaryRow(const BandWalker::Instance& instance, int level)
    {
        startRow(level);
        const RowTemplate& row = rowTemplate(instance.section);
        for (size_t c = 0; c < row.size(); ++c) {
            const auto& objects = row[c];
            if (objects.empty())
                continue;
            const int column = static_cast<int>(c);
            if (objects.size() > 1) {
                QStringList parts;
                for (const ReportObject* o : objects) {
                    const QString text = m_walker.text(*o);
                    if (!text.isEmpty())
                        parts << text;
                }
                writeText(m_row, column, parts.join(u' '), format(QString(), true));
                continue;
            }
            const ReportObject& object = *objects.front();
            if (object.current().kind == Kind::Summary && m_options.excelUseWorksheetFunctions()
                && writeSubtotal(instance, column, object))
                continue;
            writeValue(m_row, column, object, true);
        }
    }

    /// A summary over the column's own field as a SUBTOTAL of its detail rows, with the
    /// computed value cached for readers that do not calculate.
    bool writeSubtotal(const BandWalker::Instance& instance, int column, const ReportObject& object)
    {
        const ObjectDefinition& def = object.current();
        if (m_columns[static_cast<size_t>(column)].field.compare(def.field, Qt::CaseInsensitive)
            != 0)
            return false;
        lxw_row_t first = 0;
        if (instance.band == Band::GroupFooter) {
            const auto found = m_groupFirstRow.find(instance.level);
            if (found == m_groupFirstRow.end())
                return false;
            first = found->second;
        } else {
            if (m_firstDetailRow < 0)
                return false;
            first = static_cast<lxw_row_t>(m_firstDetailRow);
        }
        const Value value = m_walker.value(object);
        lxw_format* cellFormat = nullptr;
        double number = 0;
        if (!numberOf(value, def.format, true, &cellFormat, &number))
            return false;
        const QString name = columnName(column);
        const QString formula = QStringLiteral("=SUBTOTAL(%1,%2%3:%2%4)")
                                    .arg(subtotalFunction(def.operation))
                                    .arg(name)
                                    .arg(first + 1)
                                    .arg(m_lastDetailRow + 1);
        check(worksheet_write_formula_num(m_sheet, m_row, static_cast<lxw_col_t>(column),
            formula.toLatin1().constData(), cellFormat, number));
        return true;
    }

    const ExportOptions& m_options;
    BandWalker m_walker;
    QString m_title;
    QByteArray m_path;
    lxw_workbook* m_workbook = nullptr;
    lxw_worksheet* m_sheet = nullptr;
    bool m_wholeReport = false;
    std::vector<Column> m_columns;
    std::unordered_map<const Section*, RowTemplate> m_templates;
    QHash<QString, lxw_format*> m_formats;
    QHash<QString, std::array<lxw_format*, shapes * 2>> m_shapeFormats;
    QString m_defaultDate = defaultDateFormat();
    std::unordered_map<int, lxw_row_t> m_groupFirstRow; // by group level
    std::vector<lxw_row_t> m_breaks;
    lxw_row_t m_row = 0;
    int m_detailLevel = 0;
    int m_lastPage = 0;
    long long m_firstDetailRow = -1;
    long long m_lastDetailRow = -1;
};

} // namespace

int XlsxExporter::exportTo(Report& report, const ExportOptions& options, const QString& path)
{
    StagedFile staged(path, QStringLiteral("Excel"));
    // libxlsxwriter opens the path itself when the workbook is closed.
    staged.file().close();
    int pages = 0;
    try {
        Writer writer(report, options, staged.temporaryPath());
        pages = writer.write();
    } catch (const QString& reason) {
        staged.fail(reason);
    }
    staged.commit();
    return pages;
}

} // namespace reportrt
