// The Excel and HTML writers, checked with readers that are not the writers: openpyxl and
// Python's HTML parser (writers_check.py), LibreOffice and headless Chromium.

#include "core/comerror.h"
#include "layoutfixture.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/exportoptions.h"
#include "reportrt/output/htmlexporter.h"

#include <QDir>
#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QProcess>
#include <QRegularExpression>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QStandardPaths>
#include <QTemporaryDir>
#include <QUrl>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

template <typename Case> std::string caseName(const testing::TestParamInfo<Case>& info)
{
    return info.param.name;
}

const QString hostile = u"<script>alert(\"x\")</script> & 'q'"_s;

/// Sales: ID 1..count, Grp "G1".. (perGroup records each), Name "Item n" (record 2 carries
/// hostile markup), Amount = ID * 1.25, Day 2024-01-01 + ID - 1, Paid = odd ID, Note Null.
QString salesDatabase(const QTemporaryDir& dir, int count, int perGroup)
{
    const QString path = dir.filePath(u"sales.db"_s);
    const QString name = u"writers-test-setup"_s;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, name);
        db.setDatabaseName(path);
        if (!db.open())
            throw std::runtime_error(db.lastError().text().toStdString());
        QSqlQuery query(db);
        if (!query.exec(u"CREATE TABLE Sales (ID INTEGER, Grp TEXT, Name TEXT, Amount NUMERIC, "
                        "Day TEXT, Paid INTEGER, Note TEXT)"_s))
            throw std::runtime_error(query.lastError().text().toStdString());
        db.transaction();
        query.prepare(u"INSERT INTO Sales VALUES (?, ?, ?, ?, ?, ?, NULL)"_s);
        for (int id = 1; id <= count; ++id) {
            query.addBindValue(id);
            query.addBindValue(u"G%1"_s.arg((id - 1) / perGroup + 1));
            query.addBindValue(id == 2 ? hostile : u"Item %1"_s.arg(id));
            query.addBindValue(id * 1.25);
            query.addBindValue(QDate(2024, 1, 1).addDays(id - 1).toString(Qt::ISODate));
            query.addBindValue(id % 2);
            if (!query.exec())
                throw std::runtime_error(query.lastError().text().toStdString());
        }
        db.commit();
    }
    QSqlDatabase::removeDatabase(name);
    return path;
}

QJsonObject object(const QString& kind, const QString& key, const QString& value, int left,
    int width = 1400, const QString& format = {})
{
    QJsonObject o { { u"kind"_s, kind }, { key, value }, { u"left"_s, left }, { u"top"_s, 0 },
        { u"width"_s, width }, { u"height"_s, 240 } };
    if (!format.isEmpty())
        o.insert(u"format"_s, format);
    return o;
}

QJsonObject summary(
    const QString& field, const QString& operation, int group, int left, const QString& format = {})
{
    QJsonObject o = object(u"summary"_s, u"field"_s, field, left, 1400, format);
    o.insert(u"operation"_s, operation);
    o.insert(u"group"_s, group);
    return o;
}

/// A grouped list over Sales: headings, a group header, five detail columns, group and
/// report totals, a page footer with the page number.
QJsonObject salesReport(int detailHeight = 300)
{
    const QJsonArray fields {
        QJsonObject { { u"name"_s, u"ID"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Grp"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Name"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Amount"_s }, { u"type"_s, u"currency"_s } },
        QJsonObject { { u"name"_s, u"Day"_s }, { u"type"_s, u"date"_s } },
        QJsonObject { { u"name"_s, u"Paid"_s }, { u"type"_s, u"boolean"_s } },
        QJsonObject { { u"name"_s, u"Note"_s }, { u"type"_s, u"string"_s } },
    };
    QJsonObject box = object(u"box"_s, u"fillColor"_s, u"#ddeeff"_s, 0, 10000);
    QJsonObject line = object(u"line"_s, u"color"_s, u"#ff0000"_s, 0, 10000);
    line.insert(u"height"_s, 20);
    const QJsonArray sections {
        section(u"PH"_s, 300,
            { box, textObject(u"Id"_s, 0, 0, 1000), textObject(u"Name & title"_s, 1500, 0),
                textObject(u"Amount"_s, 4500, 0), textObject(u"Day"_s, 6000, 0),
                textObject(u"Paid"_s, 7500, 0) }),
        section(u"GH1"_s, 300, { object(u"field"_s, u"field"_s, u"{Sales.Grp}"_s, 0), line }),
        section(u"D"_s, detailHeight,
            { object(u"field"_s, u"field"_s, u"{Sales.ID}"_s, 0, 1000, u"0"_s),
                object(u"field"_s, u"field"_s, u"{Sales.Name}"_s, 1500, 2800),
                object(u"field"_s, u"field"_s, u"{Sales.Amount}"_s, 4500, 1400, u"€ #,##0.00"_s),
                object(u"field"_s, u"field"_s, u"{Sales.Day}"_s, 6000, 1400, u"dd.mm.yyyy"_s),
                object(u"field"_s, u"field"_s, u"{Sales.Paid}"_s, 7500, 1000),
                object(u"field"_s, u"field"_s, u"{Sales.Note}"_s, 8600, 1400) }),
        section(u"GF1"_s, 300,
            { textObject(u"Total"_s, 1500, 0), summary(u"{Sales.Amount}"_s, u"sum"_s, 1, 4500),
                summary(u"{Sales.ID}"_s, u"count"_s, 1, 0, u"0"_s) }),
        section(u"RF"_s, 300,
            { textObject(u"Grand total"_s, 1500, 0),
                summary(u"{Sales.Amount}"_s, u"sum"_s, 0, 4500, u"#,##0.00"_s) }),
        section(u"PF"_s, 300,
            { QJsonObject { { u"kind"_s, u"special"_s }, { u"special"_s, u"pageNofM"_s },
                { u"left"_s, 6000 }, { u"top"_s, 0 }, { u"width"_s, 3000 },
                { u"height"_s, 240 } } }),
    };
    QJsonObject document
        = itemsReport(sections, QJsonArray { QJsonObject { { u"field"_s, u"{Sales.Grp}"_s } } });
    document.insert(u"summary"_s, QJsonObject { { u"title"_s, u"Sales [list]"_s } });
    document.insert(u"tables"_s,
        QJsonArray { QJsonObject { { u"name"_s, u"Sales"_s }, { u"fields"_s, fields } } });
    document.insert(u"sorts"_s, QJsonArray { QJsonObject { { u"field"_s, u"{Sales.ID}"_s } } });
    return document;
}

struct Excel {
    int16_t area = 4;
    bool constantWidth = true;
    bool headings = true;
    bool functions = false;
    bool breaks = true;
    bool allPages = true;
};

void exportAs(Report& report, int format, const QString& path, const Excel& excel = {},
    bool separatePages = true, bool navigator = true)
{
    const auto options = std::static_pointer_cast<ExportOptions>(report.exportOptions());
    options->reset();
    options->setFormatType(format);
    options->setDestinationType(format == 38 ? 1 : 0);
    options->setDiskFileName(path);
    options->setHtmlFileName(path);
    options->setHtmlSeparatePages(separatePages);
    options->setHtmlNavigator(navigator);
    options->setExcelAreaType(excel.area);
    options->setExcelConstantColumnWidth(excel.constantWidth);
    options->setExcelTabHasColumnHeadings(excel.headings);
    options->setExcelUseWorksheetFunctions(excel.functions);
    options->setExcelPageBreaks(excel.breaks);
    options->setExcelExportAllPages(excel.allPages);
    report.exportReport(false);
}

QJsonObject check(const QString& kind, const QString& path)
{
    const QString script = QString::fromUtf8(LUDMOX_WRITERS_CHECK);
    // Debian's python3-openpyxl belongs to the system interpreter, which another python3
    // earlier on the PATH would not see.
    const QString python
        = QFile::exists(u"/usr/bin/python3"_s) ? u"/usr/bin/python3"_s : u"python3"_s;
    return QJsonDocument::fromJson(run(python, { script, kind, path }).toUtf8()).object();
}

QStringList folderEntries(const QString& folder)
{
    return QDir(folder).entryList(QDir::Files | QDir::Hidden | QDir::NoDotAndDotDot);
}

class Writers : public testing::Test {
protected:
    void SetUp() override
    {
        database = salesDatabase(dir, 12, 5);
        report = openReport(writeReport(dir, salesReport()), database);
        out = dir.filePath(u"out"_s);
        QDir().mkpath(out);
    }
    QTemporaryDir dir;
    QString database;
    QString out;
    std::shared_ptr<Report> report;
};

// --- Excel ---------------------------------------------------------------------------

TEST_F(Writers, ExcelCellsAreTypedWithNumberFormatsOutlinesAndSubtotals)
{
    const QString path = dir.filePath(u"out/sales.xls"_s); // the caller's name is kept
    exportAs(*report, 38, path, Excel { .constantWidth = false, .functions = true });
    ASSERT_EQ(folderEntries(out), QStringList { u"sales.xls"_s });
    const QJsonObject book = check(u"xlsx"_s, path);
    EXPECT_EQ(book[u"sheet"_s].toString(), u"Sales list"_s);
    EXPECT_EQ(book[u"freeze"_s].toString(), u"A2"_s);
    const QJsonArray rows = book[u"rows"_s].toArray();
    // Headings, then per group: header, details, footer; then the grand total.
    // 12 records in groups of 5, 5, 2: 1 + (1 + 5 + 1) * 2 + (1 + 2 + 1) + 1 = 20 rows.
    ASSERT_EQ(rows.size(), 20);
    auto cell = [&](int row, int column) { return rows[row].toArray()[column].toObject(); };
    EXPECT_EQ(cell(0, 0)[u"value"_s].toString(), u"Id"_s);
    EXPECT_EQ(cell(0, 1)[u"value"_s].toString(), u"Name & title"_s);
    EXPECT_EQ(cell(0, 5)[u"value"_s].toString(), u"Note"_s); // no heading: the field name
    EXPECT_EQ(cell(1, 0)[u"value"_s].toString(), u"G1"_s);

    struct Expected {
        const char* name;
        int column;
        const char* value; // as JSON
        const char* type;
        const char* format;
    };
    const Expected details[] = {
        { "number", 0, "1", "n", "0" },
        { "text", 1, "\"Item 1\"", "s", "General" },
        { "currency", 2, "1.25", "n", "\\€\\ #,##0.00" },
        { "date", 3, "\"2024-01-01T00:00:00\"", "d", "dd\\.mm\\.yyyy" },
        { "boolean", 4, "true", "b", "General" },
        { "null", 5, "null", "n", "General" },
    };
    for (const Expected& e : details) {
        SCOPED_TRACE(e.name);
        const QJsonObject c = cell(2, e.column);
        EXPECT_EQ(QJsonDocument(QJsonArray { c[u"value"_s] }).toJson(QJsonDocument::Compact),
            QByteArray("[") + e.value + "]");
        EXPECT_EQ(c[u"type"_s].toString(), QString::fromLatin1(e.type));
        EXPECT_EQ(c[u"format"_s].toString(), QString::fromUtf8(e.format));
    }
    EXPECT_EQ(cell(3, 1)[u"value"_s].toString(), hostile);

    // Group footer of G1 (row 8 in Excel terms): SUBTOTAL formulas over rows 3..7.
    EXPECT_EQ(cell(7, 1)[u"value"_s].toString(), u"Total"_s);
    EXPECT_EQ(cell(7, 2)[u"value"_s].toString(), u"=SUBTOTAL(9,C3:C7)"_s);
    EXPECT_EQ(cell(7, 0)[u"value"_s].toString(), u"=SUBTOTAL(3,A3:A7)"_s);
    EXPECT_EQ(cell(19, 1)[u"value"_s].toString(), u"Grand total"_s);
    EXPECT_EQ(cell(19, 2)[u"value"_s].toString(), u"=SUBTOTAL(9,C3:C18)"_s);

    // Outline levels: details 1, group rows and totals 0.
    const QJsonObject levels = book[u"levels"_s].toObject();
    EXPECT_EQ(levels[u"3"_s].toInt(), 1);
    EXPECT_EQ(levels[u"7"_s].toInt(), 1);
    EXPECT_EQ(levels[u"2"_s].toInt(), 0);
    EXPECT_EQ(levels[u"8"_s].toInt(), 0);
    // Widths follow the objects: the name column is wider than the ID column.
    const QJsonObject widths = book[u"widths"_s].toObject();
    EXPECT_GT(widths[u"B"_s].toDouble(), widths[u"A"_s].toDouble());
}

TEST_F(Writers, ExcelCachedSubtotalValuesAreTheReportsTotals)
{
    // LibreOffice reads the workbook without complaint and shows the cached totals.
    const QString soffice = QStandardPaths::findExecutable(u"soffice"_s);
    if (soffice.isEmpty())
        GTEST_SKIP() << "LibreOffice (libreoffice-calc-nogui) is not installed";
    const QString path = dir.filePath(u"out/sales.xlsx"_s);
    exportAs(*report, 38, path, Excel { .functions = true });
    QTemporaryDir profile;
    QProcess process;
    process.start(soffice,
        { u"-env:UserInstallation="_s + QUrl::fromLocalFile(profile.path()).toString(),
            u"--headless"_s, u"--convert-to"_s, u"csv:Text - txt - csv (StarCalc):44,34,76"_s,
            u"--outdir"_s, dir.filePath(u"csv"_s), path });
    ASSERT_TRUE(process.waitForFinished(180000));
    EXPECT_EQ(process.exitCode(), 0) << process.readAllStandardError().toStdString();
    QFile csv(dir.filePath(u"csv/sales.csv"_s));
    ASSERT_TRUE(csv.open(QIODevice::ReadOnly)) << process.readAllStandardError().toStdString();
    const QStringList lines = QString::fromUtf8(csv.readAll()).split(u'\n', Qt::SkipEmptyParts);
    ASSERT_EQ(lines.size(), 20);
    EXPECT_TRUE(lines[7].contains(u"Total,"_s)) << lines[7].toStdString();
    // 1.25 * (1 + ... + 5) = 18.75 and 1.25 * 78 = 97.50, as LibreOffice computes them.
    EXPECT_TRUE(lines[7].contains(u"18.75"_s)) << lines[7].toStdString();
    EXPECT_TRUE(lines[19].contains(u"97.50"_s)) << lines[19].toStdString();
    EXPECT_TRUE(lines[3].contains(u"\"<script>alert(\"\"x\"\")</script> & 'q'\""_s))
        << lines[3].toStdString();
}

struct OptionCase {
    const char* name;
    Excel excel;
    int rows; // rows in the sheet
    bool frozen;
    bool formulas;
    int breaks;
};

class ExcelOptions : public testing::TestWithParam<OptionCase> { };

TEST_P(ExcelOptions, ChooseRowsHeadingsFormulasAndBreaks)
{
    const OptionCase& c = GetParam();
    QTemporaryDir dir;
    // Tall details: 12 records take three printed pages.
    auto report = openReport(writeReport(dir, salesReport(2500)), salesDatabase(dir, 12, 5));
    const QString path = dir.filePath(u"out.xlsx"_s);
    exportAs(*report, 38, path, c.excel);
    const QJsonObject book = check(u"xlsx"_s, path);
    const QJsonArray rows = book[u"rows"_s].toArray();
    EXPECT_EQ(rows.size(), c.rows);
    EXPECT_EQ(!book[u"freeze"_s].isNull(), c.frozen);
    bool formulas = false;
    for (const QJsonValue& row : rows) {
        for (const QJsonValue& cell : row.toArray())
            formulas |= cell[u"value"_s].toString().startsWith(u"=SUBTOTAL"_s);
    }
    EXPECT_EQ(formulas, c.formulas);
    EXPECT_EQ(book[u"breaks"_s].toArray().size(), c.breaks);
}

INSTANTIATE_TEST_SUITE_P(Writers, ExcelOptions,
    testing::Values(OptionCase { "AsTheComponentSetsThem", {}, 20, true, false, 2 },
        OptionCase { "DetailsOnly", { .area = 0 }, 13, true, false, 2 },
        OptionCase { "NoHeadings", { .headings = false }, 19, false, false, 2 },
        OptionCase { "WorksheetFunctions", { .functions = true }, 20, true, true, 2 },
        OptionCase { "NoPageBreaks", { .breaks = false }, 20, true, false, 0 },
        OptionCase { "FirstPageOnly", { .allPages = false }, 8, true, false, 0 }),
    caseName<OptionCase>);

// --- HTML ----------------------------------------------------------------------------

TEST_F(Writers, HtmlIsOneEscapedTablePerPage)
{
    const QString path = dir.filePath(u"out/sales.html"_s);
    exportAs(*report, 32, path, {}, false, false);
    ASSERT_EQ(folderEntries(out), QStringList { u"sales.html"_s });
    const QJsonObject html = check(u"html"_s, path);
    EXPECT_EQ(html[u"title"_s].toString(), u"Sales [list]"_s);
    EXPECT_TRUE(html[u"unclosed"_s].toArray().isEmpty());
    const QStringList elements = html[u"elements"_s].toVariant().toStringList();
    EXPECT_FALSE(elements.contains(u"script"_s)) << "a field value became markup";
    for (const QString& element : { u"thead"_s, u"tbody"_s, u"tfoot"_s, u"colgroup"_s })
        EXPECT_TRUE(elements.contains(element)) << element.toStdString();
    const QJsonArray tables = html[u"tables"_s].toArray();
    ASSERT_EQ(tables.size(), 1);
    QStringList texts;
    for (const QJsonValue& row : tables[0].toArray()) {
        for (const QJsonValue& cell : row.toArray()) {
            if (!cell.toString().isEmpty())
                texts << cell.toString();
        }
    }
    for (const QString& expected : { u"Name & title"_s, u"G1"_s, u"Item 1"_s, hostile, u"€ 1.25"_s,
             u"01.01.2024"_s, u"Grand total"_s, u"97.50"_s, u"Page 1 of 1"_s })
        EXPECT_TRUE(texts.contains(expected))
            << expected.toStdString() << " not in " << texts.join(u" | "_s).toStdString();
    QFile file(path);
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    const QByteArray bytes = file.readAll();
    EXPECT_TRUE(bytes.startsWith("<!DOCTYPE html>"));
    EXPECT_TRUE(
        bytes.contains("&lt;script&gt;alert(&quot;x&quot;)&lt;/script&gt; &amp; &#39;q&#39;"));
    EXPECT_TRUE(bytes.contains("background:#ddeeff")); // the page header's box
    EXPECT_TRUE(bytes.contains("solid #ff0000")); // the group header's line
}

QString chromium()
{
    for (const QString& name : { u"chromium"_s, u"chromium-browser"_s }) {
        const QString path = QStandardPaths::findExecutable(name);
        if (!path.isEmpty())
            return path;
    }
    return {};
}

QString renderedDom(const QString& path)
{
    QTemporaryDir profile;
    return run(chromium(),
        { u"--headless"_s, u"--no-sandbox"_s, u"--disable-gpu"_s, u"--disable-quic"_s,
            u"--no-first-run"_s, u"--disable-background-networking"_s,
            u"--disable-component-update"_s, u"--disable-sync"_s,
            u"--user-data-dir="_s + profile.path(), u"--dump-dom"_s,
            QUrl::fromLocalFile(path).toString() });
}

TEST_F(Writers, HtmlSeparatePagesAreLinkedAndRenderInABrowser)
{
    auto tall = openReport(writeReport(dir, salesReport(2500), u"tall.rpt"_s), database);
    const QString path = dir.filePath(u"out/sales.htm"_s);
    exportAs(*tall, 32, path);
    EXPECT_EQ(tall->printingStatus().pageCount, 3);
    EXPECT_EQ(
        folderEntries(out), (QStringList { u"sales.htm"_s, u"sales2.htm"_s, u"sales3.htm"_s }));
    struct Nav {
        const char* file;
        QStringList hrefs; // first, previous, next, last where they are links
        const char* text; // a value on that page
    };
    const Nav pages[] = {
        { "sales.htm", { u"sales2.htm"_s, u"sales3.htm"_s }, "Item 1" },
        { "sales2.htm", { u"sales.htm"_s, u"sales.htm"_s, u"sales3.htm"_s, u"sales3.htm"_s },
            "Item 6" },
        { "sales3.htm", { u"sales.htm"_s, u"sales2.htm"_s }, "Grand total" },
    };
    for (const Nav& page : pages) {
        SCOPED_TRACE(page.file);
        const QJsonObject html
            = check(u"html"_s, dir.filePath(u"out/"_s + QString::fromLatin1(page.file)));
        QStringList hrefs;
        for (const QJsonValue& link : html[u"links"_s].toArray())
            hrefs << link[u"href"_s].toString();
        EXPECT_EQ(hrefs, page.hrefs);
        EXPECT_EQ(html[u"tables"_s].toArray().size(), 1);
    }
    if (chromium().isEmpty())
        GTEST_SKIP() << "chromium is not installed";
    for (const Nav& page : pages) {
        SCOPED_TRACE(page.file);
        const QString dom = renderedDom(dir.filePath(u"out/"_s + QString::fromLatin1(page.file)));
        EXPECT_TRUE(dom.contains(QString::fromLatin1(page.text))) << dom.toStdString();
        EXPECT_TRUE(dom.contains(u"class=\"navigator\""_s));
        // The hostile name stayed text: the browser built no script element from it.
        EXPECT_FALSE(dom.contains(u"<script>"_s));
    }
    EXPECT_TRUE(renderedDom(dir.filePath(u"out/sales.htm"_s)).contains(u"&lt;script&gt;"_s));
}

class ExampleReports : public testing::TestWithParam<const char*> { };

TEST_P(ExampleReports, BreakPagesWhereThePrintedLayoutDoes)
{
    // Reports without can-grow text or subreports: the writers' pages must be the
    // printed ones, or page numbers and page breaks in the exports would lie.
    auto report = openExample(QString::fromLatin1(GetParam()));
    const int printed = static_cast<int>(layOut(*report).size());
    QTemporaryDir dir;
    const QString path = dir.filePath(u"report.html"_s);
    exportAs(*report, 32, path);
    EXPECT_EQ(report->printingStatus().pageCount, printed);
    EXPECT_TRUE(QFile::exists(HtmlExporter::pageFileName(path, printed)));
    EXPECT_FALSE(QFile::exists(HtmlExporter::pageFileName(path, printed + 1)));
    const QJsonObject last = check(u"html"_s, HtmlExporter::pageFileName(path, printed));
    const QString lastText = QString::fromUtf8(QJsonDocument(last[u"tables"_s].toArray()).toJson());
    EXPECT_TRUE(lastText.contains(u"Page %1 of %1"_s.arg(printed))) << lastText.toStdString();

    exportAs(*report, 38, dir.filePath(u"report.xlsx"_s));
    EXPECT_EQ(report->printingStatus().pageCount, printed);
    EXPECT_FALSE(check(u"xlsx"_s, dir.filePath(u"report.xlsx"_s))[u"rows"_s].toArray().isEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Writers, ExampleReports, testing::Values("orders-by-customer.rpt", "sales-by-country.rpt"));

TEST(HtmlPageFiles, AreNumberedBeforeTheExtension)
{
    const struct {
        const char* path;
        int page;
        const char* expected;
    } cases[] = {
        { "/tmp/a/report.html", 1, "/tmp/a/report.html" },
        { "/tmp/a/report.html", 2, "/tmp/a/report2.html" },
        { "/tmp/a/report.v1.htm", 12, "/tmp/a/report.v112.htm" },
        { "/tmp/a/report", 3, "/tmp/a/report3" },
        { "/tmp/a/.hidden", 2, "/tmp/a/.hidden2" },
    };
    for (const auto& c : cases)
        EXPECT_EQ(HtmlExporter::pageFileName(QString::fromLatin1(c.path), c.page),
            QString::fromLatin1(c.expected))
            << c.path << " page " << c.page;
}

// --- Failures ------------------------------------------------------------------------

struct FailureCase {
    const char* name;
    int format;
    bool separatePages;
};

class WriterFailures : public testing::TestWithParam<FailureCase> { };

TEST_P(WriterFailures, AFormulaFailingHalfwayKeepsTheOldFilesAndLeavesNoTemporaryFile)
{
    const FailureCase& c = GetParam();
    QTemporaryDir dir;
    QJsonObject document = salesReport(2500);
    // Division by zero on record 9, after two pages were written.
    document.insert(u"formulas"_s,
        QJsonArray { QJsonObject {
            { u"name"_s, u"Ratio"_s }, { u"text"_s, u"{Sales.Amount} / ({Sales.ID} - 9)"_s } } });
    QJsonArray sections = document[u"sections"_s].toArray();
    for (qsizetype i = 0; i < sections.size(); ++i) {
        QJsonObject s = sections[i].toObject();
        if (s[u"name"_s] == u"D"_s) {
            QJsonArray objects = s[u"objects"_s].toArray();
            objects.append(fieldObject(u"{@Ratio}"_s, 9000, 0, 1000));
            s.insert(u"objects"_s, objects);
            sections[i] = s;
        }
    }
    document.insert(u"sections"_s, sections);
    auto report = openReport(writeReport(dir, document), salesDatabase(dir, 12, 5));
    QDir(dir.path()).mkdir(u"out"_s);
    const QStringList names { u"old.html"_s, u"old2.html"_s };
    for (const QString& name : names) {
        QFile old(dir.filePath(u"out/"_s + name));
        ASSERT_TRUE(old.open(QIODevice::WriteOnly));
        old.write("the previous export");
    }
    try {
        exportAs(*report, c.format, dir.filePath(u"out/old.html"_s), {}, c.separatePages);
        FAIL() << "the export succeeded";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::FormulaError);
    }
    EXPECT_EQ(folderEntries(dir.filePath(u"out"_s)), names);
    for (const QString& name : names) {
        QFile kept(dir.filePath(u"out/"_s + name));
        ASSERT_TRUE(kept.open(QIODevice::ReadOnly));
        EXPECT_EQ(kept.readAll(), QByteArray("the previous export"));
    }
}

INSTANTIATE_TEST_SUITE_P(Writers, WriterFailures,
    testing::Values(FailureCase { "Excel", 38, false }, FailureCase { "HtmlPages", 32, true },
        FailureCase { "HtmlContinuous", 32, false }),
    caseName<FailureCase>);

TEST_F(Writers, AReadOnlyTargetIsReplacedAndAFileAsFolderFails)
{
    for (const int format : { 38, 32 }) {
        SCOPED_TRACE(format);
        const QString path = dir.filePath(u"out/locked"_s);
        QFile old(path);
        ASSERT_TRUE(old.open(QIODevice::WriteOnly));
        old.write("old");
        old.close();
        ASSERT_TRUE(old.setPermissions(QFileDevice::ReadOwner));
        exportAs(*report, format, path, {}, false);
        QFile written(path);
        ASSERT_TRUE(written.open(QIODevice::ReadOnly));
        EXPECT_NE(written.readAll(), QByteArray("old"));
        written.close();
        QFile::remove(path);

        // A path through a file: its folder does not exist.
        EXPECT_THROW(exportAs(*report, format, dir.filePath(u"sales.db/x"_s)), core::ComError);
        EXPECT_EQ(folderEntries(out), QStringList());
    }
}

TEST(HtmlStackedObjects, KeepTheirOwnFont)
{
    // The sample's subtitle sits under its title in one column: it must not take the
    // title's 18 pt bold, which it would inherit from the cell.
    auto report = openExample(u"sales-by-country.rpt"_s);
    QTemporaryDir dir;
    const QString path = dir.filePath(u"report.html"_s);
    exportAs(*report, 32, path);
    QFile file(path);
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    const QString html = QString::fromUtf8(file.readAll());
    const QRegularExpression stacked(u"<div class=\"(o\\d+)\">Orders, revenue"_s);
    const QRegularExpressionMatch match = stacked.match(html);
    ASSERT_TRUE(match.hasMatch()) << html.left(2000).toStdString();
    const QRegularExpression rule(u"\\."_s + match.captured(1) + u"\\{([^}]*)\\}"_s);
    const QString css = rule.match(html).captured(1);
    EXPECT_TRUE(css.contains(u"font-size:9pt"_s)) << css.toStdString();
    EXPECT_TRUE(css.contains(u"font-weight:normal"_s)) << css.toStdString();
}

} // namespace
} // namespace reportrt::layouttest
