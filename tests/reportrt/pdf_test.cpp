#include "core/comerror.h"
#include "layoutfixture.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/exportoptions.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"
#include "runtime/parameterfield.h"
#include "support/fulldisk.h"

#include <QBuffer>
#include <QDir>
#include <QFile>
#include <QFont>
#include <QFontInfo>
#include <QRawFont>
#include <QRegularExpression>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

template <typename Case> std::string caseName(const testing::TestParamInfo<Case>& info)
{
    return info.param.name;
}

void exportPdf(Report& report, const QString& path)
{
    const auto options = report.exportOptions();
    options->reset();
    options->setFormatType(31);
    options->setDestinationType(1);
    options->setDiskFileName(path);
    report.exportReport(false);
}

/// Collapses runs of spaces, as pdftotext -layout spreads columns out.
QString simplified(const QString& text)
{
    return QString(text).replace(QRegularExpression(u"[ \\t]+"_s), u" "_s);
}

struct ExampleCase {
    const char* name;
    const char* file;
    QStringList firstPage; // lines pdftotext finds on page 1
    QStringList lastPage;
};

class Examples : public testing::TestWithParam<ExampleCase> { };

TEST_P(Examples, ExportToAValidPdfWithTheirTextAndEmbeddedFonts)
{
    const ExampleCase& c = GetParam();
    auto report = openExample(QString::fromLatin1(c.file));
    const int laidOut = static_cast<int>(layOut(*report).size());
    QTemporaryDir dir;
    const QString path = dir.filePath(u"out.pdf"_s);
    exportPdf(*report, path);

    QString check;
    EXPECT_TRUE(qpdfCheck(path, &check)) << check.toStdString();
    const int pages = pdfPageCount(path);
    EXPECT_EQ(pages, laidOut);
    EXPECT_EQ(report->printingStatus().pageCount, pages);
    const QString first = simplified(pdfText(path, 1));
    for (const QString& line : c.firstPage)
        EXPECT_TRUE(first.contains(line)) << line.toStdString() << " not in\n"
                                          << first.toStdString();
    const QString last = simplified(pdfText(path, pages));
    for (const QString& line : c.lastPage)
        EXPECT_TRUE(last.contains(line)) << line.toStdString() << " not in\n" << last.toStdString();
    EXPECT_TRUE(last.contains(u"Page %1 of %1"_s.arg(pages))
        || QString::fromLatin1(c.file) == u"invoice.rpt"_s);

    // Every font is embedded: pdffonts' "emb" column says "yes" on each font line.
    const QStringList fonts = pdfFonts(path).split(u'\n', Qt::SkipEmptyParts).mid(2);
    ASSERT_FALSE(fonts.isEmpty());
    for (const QString& font : fonts)
        EXPECT_TRUE(font.contains(u" yes "_s)) << font.toStdString();
    // Nothing but the PDF was left in the folder.
    EXPECT_EQ(QDir(dir.path()).entryList(QDir::Files | QDir::Hidden), QStringList { u"out.pdf"_s });
}

INSTANTIATE_TEST_SUITE_P(Pdf, Examples,
    testing::Values(ExampleCase { "OrdersByCustomer", "orders-by-customer.rpt",
                        { u"Orders by customer"_s,
                            u"Order Date Shipped Status City Salesperson Items Amount"_s },
                        { u"Grand total"_s } },
        ExampleCase { "Invoice", "invoice.rpt",
            { u"INVOICE"_s, u"Invoice no. 1"_s, u"Invoice date 06.12.2026"_s,
                u"Due date 20.12.2026"_s, u"Total due (EUR)"_s },
            { u"Thank you for your order."_s } },
        ExampleCase { "CustomerOrders", "customer-orders.rpt",
            { u"Customers and their orders"_s, u"Order Date Status Salesperson Amount"_s }, {} },
        ExampleCase { "SalesByCountry", "sales-by-country.rpt",
            { u"Sales by country"_s, u"Estonia"_s, u"Tallinn"_s, u"All countries"_s }, {} }),
    caseName<ExampleCase>);

TEST(PdfExport, InvoicesTakeParametersOfEveryKind)
{
    auto report = openExample(u"invoice.rpt"_s);
    const auto set = [&](const QString& name, const core::Variant& value) {
        for (const auto& p : report->parameterFields()) {
            if (p->name() == name) {
                p->clearCurrentValues();
                p->addCurrentValue(value);
            }
        }
    };
    set(u"FromOrder"_s, core::Variant(int32_t(10)));
    set(u"ToOrder"_s, core::Variant(int32_t(12)));
    set(u"InvoiceDate"_s, core::Variant::fromDate(QDate(2027, 1, 31)));
    set(u"DueDays"_s, core::Variant(int32_t(30)));
    set(u"Note"_s, core::Variant(u"Paid in advance."_s));
    QTemporaryDir dir;
    const QString path = dir.filePath(u"invoices.pdf"_s);
    exportPdf(*report, path);
    // One invoice per order, each on its own page.
    ASSERT_EQ(pdfPageCount(path), 3);
    for (int page = 1; page <= 3; ++page) {
        const QString text = simplified(pdfText(path, page));
        EXPECT_TRUE(text.contains(u"Invoice no. %1"_s.arg(9 + page))) << text.toStdString();
        EXPECT_TRUE(text.contains(u"Invoice date 31.01.2027"_s));
        EXPECT_TRUE(text.contains(u"Due date 02.03.2027"_s));
        EXPECT_TRUE(text.contains(u"Paid in advance."_s));
    }
}

struct FailureCase {
    const char* name;
    QString target; // relative to a temporary folder; "" for no file name
    int32_t format;
    int32_t destination;
    int32_t error;
    const char* message;
};

class ExportFailures : public testing::TestWithParam<FailureCase> { };

TEST_P(ExportFailures, AreClearAndLeaveNothingBehind)
{
    const FailureCase& c = GetParam();
    QTemporaryDir dir;
    QDir(dir.path()).mkdir(u"folder"_s);
    const QString database = itemsDatabase(dir, 5);
    auto report = openReport(
        writeReport(dir,
            itemsReport({ section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) }),
            u"items.rpt"_s),
        database);
    const QStringList before
        = QDir(dir.path()).entryList(QDir::AllEntries | QDir::Hidden | QDir::NoDotAndDotDot);
    const auto options = std::static_pointer_cast<ExportOptions>(report->exportOptions());
    options->setFormatType(c.format);
    options->setDestinationType(c.destination);
    options->setDiskFileName(c.target.isEmpty() ? QString() : dir.filePath(c.target));
    options->setExcelAreaType(4);
    options->setHtmlNavigator(true);
    options->setMailToList(u"sales@example.com"_s);
    try {
        report->exportReport(false);
        FAIL() << "the export succeeded";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), c.error);
        EXPECT_TRUE(error.description().contains(QString::fromUtf8(c.message)))
            << error.description().toStdString();
    }
    EXPECT_EQ(
        QDir(dir.path()).entryList(QDir::AllEntries | QDir::Hidden | QDir::NoDotAndDotDot), before);
    // A failed export leaves the options as they were set.
    EXPECT_EQ(options->formatType(), c.format);
    EXPECT_EQ(options->excelAreaType(), 4);
    EXPECT_TRUE(options->htmlNavigator());
    EXPECT_EQ(options->mailToList(), u"sales@example.com"_s);
}

INSTANTIATE_TEST_SUITE_P(Pdf, ExportFailures,
    testing::Values(FailureCase { "NoFileName", u""_s, 31, 1, Error::ExportFailed, "no file name" },
        FailureCase {
            "MissingFolder", u"missing/out.pdf"_s, 31, 1, Error::ExportFailed, "does not exist" },
        FailureCase { "TargetIsAFolder", u"folder"_s, 31, 1, Error::ExportFailed, "is a folder" },
        FailureCase { "ExcelMissingFolder", u"missing/out.xls"_s, 38, 1, Error::ExportFailed,
            "does not exist" },
        FailureCase { "ExcelNoFileName", u""_s, 38, 1, Error::ExportFailed, "no file name" },
        FailureCase {
            "HtmlTargetIsAFolder", u"folder"_s, 32, 0, Error::ExportFailed, "is a folder" },
        FailureCase {
            "UnknownFormat", u"out.pdf"_s, 99, 1, Error::RuntimeFailure, "not an export format" },
        FailureCase { "UnknownDestination", u"out.pdf"_s, 31, 7, Error::RuntimeFailure,
            "not an export destination" }),
    caseName<FailureCase>);

TEST(PdfExport, PromptingIsRefused)
{
    QTemporaryDir dir;
    auto report = openReport(
        writeReport(
            dir, itemsReport({ section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) })),
        itemsDatabase(dir, 2));
    report->exportOptions()->setFormatType(31);
    report->exportOptions()->setDiskFileName(dir.filePath(u"out.pdf"_s));
    EXPECT_THROW(report->exportReport(true), core::ComError);
    EXPECT_FALSE(QFile::exists(dir.filePath(u"out.pdf"_s)));
}

TEST(PdfExport, AFailureHalfwayKeepsTheOldFile)
{
    QTemporaryDir dir;
    const QString database = itemsDatabase(dir, 300);
    QJsonObject document = itemsReport({ section(u"D"_s, 300,
        { fieldObject(u"{Items.Name}"_s, 0, 0), fieldObject(u"{@Ratio}"_s, 3000, 0) }) });
    // Division by zero on record 250, pages after the first were painted already.
    document.insert(u"formulas"_s,
        QJsonArray { QJsonObject {
            { u"name"_s, u"Ratio"_s }, { u"text"_s, u"{Items.Amount} / ({Items.ID} - 250)"_s } } });
    auto report = openReport(writeReport(dir, document), database);
    const QString target = dir.filePath(u"out/report.pdf"_s);
    QDir(dir.path()).mkdir(u"out"_s);
    QFile old(target);
    ASSERT_TRUE(old.open(QIODevice::WriteOnly));
    old.write("the previous export");
    old.close();
    try {
        exportPdf(*report, target);
        FAIL() << "the export succeeded";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::FormulaError);
        EXPECT_TRUE(error.description().contains(u"Ratio"_s)) << error.description().toStdString();
    }
    QFile kept(target);
    ASSERT_TRUE(kept.open(QIODevice::ReadOnly));
    EXPECT_EQ(kept.readAll(), QByteArray("the previous export"));
    EXPECT_EQ(QDir(dir.filePath(u"out"_s)).entryList(QDir::Files | QDir::Hidden),
        QStringList { u"report.pdf"_s });
}

class PdfExportOnAFullDisk : public testing::TestWithParam<testsupport::FullDisk::Kind> { };

TEST_P(PdfExportOnAFullDisk, FailsAndKeepsTheOldFile)
{
    QTemporaryDir dir;
    QTemporaryDir full;
    testsupport::FullDisk disk(GetParam(), full.path());
    if (!disk.isReady())
        GTEST_SKIP() << "this process may not mount a file system";
    auto report = openReport(
        writeReport(
            dir, itemsReport({ section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) })),
        itemsDatabase(dir, 3));
    report->readRecords();
    const QString target = full.filePath(u"report.pdf"_s);
    QFile old(target);
    ASSERT_TRUE(old.open(QIODevice::WriteOnly));
    old.write("the previous export");
    old.close();

    disk.fill();
    try {
        exportPdf(*report, target);
        ADD_FAILURE() << "the export reported success";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::ExportFailed);
    }
    QFile kept(target);
    ASSERT_TRUE(kept.open(QIODevice::ReadOnly));
    EXPECT_EQ(kept.readAll(), QByteArray("the previous export"));
    QStringList left = QDir(full.path()).entryList(QDir::Files | QDir::Hidden);
    left.removeAll(u"filler"_s);
    EXPECT_EQ(left, QStringList { u"report.pdf"_s });
}

INSTANTIATE_TEST_SUITE_P(Pdf, PdfExportOnAFullDisk,
    testing::Values(testsupport::FullDisk::Kind::Tmpfs, testsupport::FullDisk::Kind::SizeLimit),
    [](const testing::TestParamInfo<testsupport::FullDisk::Kind>& param) {
        return std::string(
            param.param == testsupport::FullDisk::Kind::Tmpfs ? "Tmpfs" : "SizeLimit");
    });

TEST(PdfExport, AReadOnlyTargetIsReplacedWhenTheFolderIsWritable)
{
    QTemporaryDir dir;
    auto report = openReport(
        writeReport(
            dir, itemsReport({ section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) })),
        itemsDatabase(dir, 3));
    const QString target = dir.filePath(u"report.pdf"_s);
    QFile old(target);
    ASSERT_TRUE(old.open(QIODevice::WriteOnly));
    old.write("old");
    old.close();
    old.setPermissions(QFile::ReadOwner);
    exportPdf(*report, target);
    EXPECT_EQ(pdfPageCount(target), 1);
    EXPECT_TRUE(pdfText(target).contains(u"Item 3"_s));
}

/// The share of pixels of a region that are close to a colour.
double coverage(const QImage& image, const QRect& region, const QColor& color)
{
    int hits = 0;
    int total = 0;
    for (int y = region.top(); y <= region.bottom(); ++y) {
        for (int x = region.left(); x <= region.right(); ++x) {
            const QColor c = image.pixelColor(x, y);
            ++total;
            if (std::abs(c.red() - color.red()) < 40 && std::abs(c.green() - color.green()) < 40
                && std::abs(c.blue() - color.blue()) < 40)
                ++hits;
        }
    }
    return total == 0 ? 0 : static_cast<double>(hits) / total;
}

TEST(PdfExport, AFormatHandlerChangesOnlyItsRecordsPage)
{
    // One record per page; a blue 1000 x 1000 twip picture at (2000, 100) in the details.
    QTemporaryDir dir;
    QJsonObject picture { { u"kind"_s, u"picture"_s }, { u"name"_s, u"Photo"_s },
        { u"left"_s, 2000 }, { u"top"_s, 100 }, { u"width"_s, 1000 }, { u"height"_s, 1000 } };
    {
        QImage blue(20, 20, QImage::Format_RGB32);
        blue.fill(Qt::blue);
        QByteArray bytes;
        QBuffer buffer(&bytes);
        buffer.open(QIODevice::WriteOnly);
        blue.save(&buffer, "PNG");
        picture.insert(u"image"_s, QString::fromLatin1(bytes.toBase64()));
    }
    QJsonObject detail = section(u"D"_s, 1500, { fieldObject(u"{Items.ID}"_s, 0, 0), picture });
    detail.insert(u"newPageAfter"_s, true);
    auto report = openReport(writeReport(dir, itemsReport({ detail })), itemsDatabase(dir, 3));

    std::shared_ptr<runtime::ReportObject> photo;
    std::shared_ptr<runtime::ReportObject> id;
    for (const auto& o : report->sections()[0]->reportObjects()) {
        if (o->name() == u"Photo"_s)
            photo = o;
        if (o->typeName() == u"IFieldObject"_s)
            id = o;
    }
    ASSERT_TRUE(photo && id);
    QImage red(40, 20, QImage::Format_RGB32);
    red.fill(Qt::red);
    report->sections()[0]->addFormatHandler([&] {
        if (id->value().toLong() == 2) {
            photo->setPicture(red);
            photo->setWidth(3000);
            photo->setHeight(1500);
        }
    });
    const QString path = dir.filePath(u"pictures.pdf"_s);
    exportPdf(*report, path);
    ASSERT_EQ(pdfPageCount(path), 3);

    // At 72 DPI a twip is 1/20 pixel: margins 720 -> 36 px; the designed picture covers
    // x 136..186, y 41..91; the changed one x 136..286 (its 2:1 image fills 3000 x 1500).
    const QRect designed(140, 45, 42, 42);
    const QRect widened(200, 45, 80, 30);
    for (int page = 1; page <= 3; ++page) {
        const QImage image = renderPdfPage(path, page);
        ASSERT_FALSE(image.isNull());
        if (page == 2) {
            EXPECT_GT(coverage(image, designed, Qt::red), 0.95);
            EXPECT_GT(coverage(image, widened, Qt::red), 0.95);
            EXPECT_EQ(coverage(image, designed, Qt::blue), 0);
        } else {
            EXPECT_GT(coverage(image, designed, Qt::blue), 0.95) << "page " << page;
            EXPECT_EQ(coverage(image, widened, Qt::red), 0) << "page " << page;
            EXPECT_LT(coverage(image, widened, Qt::blue), 0.05) << "page " << page;
        }
    }
}

// One report header holding a text in the given font, over a one-record Items table.
std::shared_ptr<Report> textReport(
    const QTemporaryDir& dir, const QString& text, const QString& family)
{
    QJsonObject object = textObject(text, 0, 0, 9000, 400);
    object.insert(u"font"_s, QJsonObject { { u"family"_s, family }, { u"size"_s, 12 } });
    const QJsonObject document = itemsReport({ section(u"RH"_s, 600, { object }) });
    return openReport(writeReport(dir, document), itemsDatabase(dir, 1));
}

TEST(PdfWriter, EmbedsEachFaceOnceAsASubsetWhateverItsSizes)
{
    auto report = openExample(u"orders-by-customer.rpt"_s);
    QTemporaryDir dir;
    const QString path = dir.filePath(u"out.pdf"_s);
    exportPdf(*report, path);
    // The report uses DejaVu Sans at several sizes, bold and regular: two faces.
    QStringList names;
    for (const QString& line : pdfFonts(path).split(u'\n', Qt::SkipEmptyParts).mid(2)) {
        const QStringList columns = line.simplified().split(u' ');
        ASSERT_GE(columns.size(), 7) << line.toStdString();
        EXPECT_TRUE(line.contains(u" yes yes yes "_s)) << line.toStdString(); // emb sub uni
        EXPECT_EQ(columns.front().indexOf(u'+'), 6) << line.toStdString(); // a subset tag
        names << columns.front().mid(7);
    }
    names.sort();
    EXPECT_EQ(names, (QStringList { u"DejaVuSans"_s, u"DejaVuSans-Bold"_s }));
}

TEST(PdfWriter, TextThatShapingChangedExtractsAsItReads)
{
    // A decomposed accent, a ligature and Greek take the shaper's complex path, where
    // glyphs and characters no longer pair up one to one.
    const QString text = u"Caf\u0065\u0301 \uFB01ne \u03A9\u03BC\u03AD\u03B3\u03B1 na\u00EFve"_s;
    QTemporaryDir dir;
    auto report = textReport(dir, text, u"DejaVu Sans"_s);
    const QString path = dir.filePath(u"out.pdf"_s);
    exportPdf(*report, path);
    EXPECT_TRUE(qpdfCheck(path));
    const QString extracted = pdfText(path).normalized(QString::NormalizationForm_KC).simplified();
    EXPECT_EQ(extracted, text.normalized(QString::NormalizationForm_KC)) << extracted.toStdString();
}

TEST(PdfWriter, FacesOfOtherFormatsAreEmbeddedToo)
{
    // The URW faces (fonts-urw-base35) come as Type 1 and as OpenType with PostScript
    // outlines: drawn from outlines or embedded whole, the text must show and extract.
    if (!QFontInfo(QFont(u"Nimbus Sans"_s)).family().startsWith(u"Nimbus Sans"_s))
        GTEST_SKIP() << "Nimbus Sans is not installed";
    QTemporaryDir dir;
    auto report = textReport(dir, u"Quarterly totals 2026"_s, u"Nimbus Sans"_s);
    const QString path = dir.filePath(u"out.pdf"_s);
    exportPdf(*report, path);
    EXPECT_TRUE(qpdfCheck(path));
    const QString fonts = pdfFonts(path);
    const QStringList lines = fonts.split(u'\n', Qt::SkipEmptyParts).mid(2);
    ASSERT_FALSE(lines.isEmpty());
    for (const QString& line : lines)
        EXPECT_TRUE(line.contains(u" yes "_s)) << line.toStdString();
    EXPECT_EQ(pdfText(path).simplified(), u"Quarterly totals 2026"_s);
    // Drawn with what was embedded: the rendering has ink where the title is.
    const QImage page = renderPdfPage(path, 1, 72);
    int dark = 0;
    for (int y = 30; y < 60; ++y) {
        for (int x = 30; x < 250; ++x)
            dark += qGray(page.pixel(x, y)) < 128;
    }
    EXPECT_GT(dark, 100);
}

} // namespace
} // namespace reportrt::layouttest
