#include "core/comerror.h"
#include "layoutfixture.h"
#include "platform/currentprinter.h"
#include "platform/printdialogservice.h"
#include "platform/printers.h"
#include "platform/scriptedprintdialogservice.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/output/reportprinter.h"

#include <QDir>
#include <QRegularExpression>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

template <typename Case> std::string caseName(const testing::TestParamInfo<Case>& info)
{
    return info.param.name;
}

/// Prints into a PDF printer folder of its own, with the PDF printer selected for the
/// report, and puts the process's printer state back afterwards.
class Printing : public testing::Test {
protected:
    void SetUp() override
    {
        m_previousFolder = qEnvironmentVariable("LUDMOX_PDF_PRINTER_DIR");
        qputenv("LUDMOX_PDF_PRINTER_DIR", m_printed.path().toUtf8());
        m_previousPrinter = platform::CurrentPrinter::instance().printer();
        platform::CurrentPrinter::instance().select(platform::Printers::virtualPdfPrinter());
        m_dialog = std::make_shared<platform::ScriptedPrintDialogService>();
        platform::PrintDialogService::setActive(m_dialog);
    }
    void TearDown() override
    {
        platform::PrintDialogService::setActive(nullptr);
        platform::CurrentPrinter::instance().select(m_previousPrinter);
        if (m_previousFolder.isEmpty())
            qunsetenv("LUDMOX_PDF_PRINTER_DIR");
        else
            qputenv("LUDMOX_PDF_PRINTER_DIR", m_previousFolder.toUtf8());
    }

    /// A three-page report: 150 details of 300 twips, 48 to a page (see layout_test.cpp).
    std::shared_ptr<Report> threePages()
    {
        auto report = openReport(
            writeReport(m_reports,
                itemsReport({ section(u"PH"_s, 500, { textObject(u"Heading"_s, 0, 0) }),
                    section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }),
                    section(u"PF"_s, 400,
                        { QJsonObject { { u"kind"_s, u"special"_s },
                            { u"special"_s, u"pageNofM"_s }, { u"width"_s, 3000 },
                            { u"height"_s, 240 } } }) })),
            itemsDatabase(m_reports, 120));
        const auto pdf = platform::Printers::virtualPdfPrinter();
        report->selectPrinter(pdf.driverName(), pdf.deviceName(), pdf.port());
        return report;
    }

    QStringList printedFiles() const
    {
        return QDir(m_printed.path()).entryList({ u"*.pdf"_s }, QDir::Files, QDir::Name);
    }
    QString printedFile() const
    {
        const QStringList files = printedFiles();
        return files.size() == 1 ? QDir(m_printed.path()).filePath(files.front()) : QString();
    }
    /// Which report page each printed page shows, from its "Page n of 3" footer.
    static std::vector<int> printedPages(const QString& path)
    {
        std::vector<int> numbers;
        const int count = pdfPageCount(path);
        for (int page = 1; page <= count; ++page) {
            const auto match = QRegularExpression(u"Page (\\d+) of"_s).match(pdfText(path, page));
            numbers.push_back(match.hasMatch() ? match.captured(1).toInt() : 0);
        }
        return numbers;
    }

    QTemporaryDir m_printed;
    QTemporaryDir m_reports;
    std::shared_ptr<platform::ScriptedPrintDialogService> m_dialog;

private:
    QString m_previousFolder;
    platform::PrinterInfo m_previousPrinter;
};

struct CopiesCase {
    const char* name;
    int16_t copies;
    bool collated;
    int16_t start;
    int16_t stop;
    std::vector<int> pages;
};

class Copies : public Printing, public testing::WithParamInterface<CopiesCase> { };

TEST_P(Copies, ComeOutInTheOrderAsked)
{
    const CopiesCase& c = GetParam();
    auto report = threePages();
    std::optional<runtime::PageRange> range;
    if (c.start != 0)
        range = runtime::PageRange { c.start, c.stop };
    report->printOut(false, c.copies, c.collated, range);
    const QString file = printedFile();
    ASSERT_FALSE(file.isEmpty()) << printedFiles().join(u", "_s).toStdString();
    EXPECT_TRUE(qpdfCheck(file));
    EXPECT_EQ(printedPages(file), c.pages);
    EXPECT_EQ(report->printingStatus().progress, 3);
    EXPECT_EQ(report->printingStatus().pageCount, 3);
}

INSTANTIATE_TEST_SUITE_P(Print, Copies,
    testing::Values(CopiesCase { "One", 1, true, 0, 0, { 1, 2, 3 } },
        CopiesCase { "NoneMeansOne", 0, true, 0, 0, { 1, 2, 3 } },
        CopiesCase { "Collated", 2, true, 0, 0, { 1, 2, 3, 1, 2, 3 } },
        CopiesCase { "Uncollated", 2, false, 0, 0, { 1, 1, 2, 2, 3, 3 } },
        CopiesCase { "Range", 1, true, 2, 3, { 2, 3 } },
        CopiesCase { "RangeCollated", 2, true, 2, 3, { 2, 3, 2, 3 } },
        CopiesCase { "RangeUncollated", 3, false, 3, 3, { 3, 3, 3 } },
        CopiesCase { "RangeBeyondTheEnd", 1, true, 3, 99, { 3 } }),
    caseName<CopiesCase>);

struct PaperCase {
    const char* name;
    int16_t orientation;
    int16_t paperSize;
    QSizeF points;
};

class Paper : public Printing, public testing::WithParamInterface<PaperCase> { };

TEST_P(Paper, OrientationAndSizeReachThePrinter)
{
    const PaperCase& c = GetParam();
    auto report = threePages();
    report->setPaperOrientation(c.orientation);
    report->setPaperSize(c.paperSize);
    report->setPrinterDuplex(2);
    report->printOut(false, 1, true, std::nullopt);
    const QSizeF size = pdfPageSize(printedFile());
    EXPECT_NEAR(size.width(), c.points.width(), 1);
    EXPECT_NEAR(size.height(), c.points.height(), 1);
}

INSTANTIATE_TEST_SUITE_P(Print, Paper,
    testing::Values(PaperCase { "A4", 1, 9, { 595.3, 841.9 } },
        PaperCase { "A4Landscape", 2, 9, { 841.9, 595.3 } },
        PaperCase { "Letter", 1, 1, { 612, 792 } },
        PaperCase { "A5Landscape", 2, 11, { 595.3, 419.5 } }),
    caseName<PaperCase>);

TEST_F(Printing, RangesThatSelectNothingAreErrorsAndPrintNothing)
{
    auto report = threePages();
    for (const auto& [start, stop] :
        { std::pair<int16_t, int16_t> { 4, 9 }, { 3, 2 }, { -1, 2 } }) {
        try {
            report->printOut(false, 1, true, runtime::PageRange { start, stop });
            ADD_FAILURE() << start << "-" << stop << " printed";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), Error::RuntimeFailure);
        }
    }
    EXPECT_TRUE(printedFiles().isEmpty());
    EXPECT_TRUE(QDir(m_printed.path()).entryList(QDir::Files | QDir::Hidden).isEmpty());
}

TEST_F(Printing, ThePromptShowsThePagesAndPrintsWhatTheUserChose)
{
    auto report = threePages();
    report->setDialogParentWindow(4242);
    platform::PrintDialogService::Result choice;
    choice.accepted = true;
    choice.printer = platform::Printers::virtualPdfPrinter();
    choice.settings.setCopies(2);
    choice.settings.setOrientation(2);
    choice.settings.setPaperSize(11);
    choice.collate = false;
    choice.range = platform::PrintDialogService::PageRange::Pages;
    choice.fromPage = 1;
    choice.toPage = 2;
    m_dialog->enqueue(choice);
    report->printOut(true, 1, true, std::nullopt);

    ASSERT_EQ(m_dialog->requests().size(), 1);
    const auto& request = m_dialog->requests().front();
    EXPECT_EQ(request.ownerWindow, 4242);
    EXPECT_TRUE(request.pageRangeAllowed);
    EXPECT_EQ(request.minPage, 1);
    EXPECT_EQ(request.maxPage, 3);
    EXPECT_EQ(request.printer.deviceName(), platform::Printers::virtualPdfDeviceName());
    EXPECT_TRUE(request.collate);

    const QString file = printedFile();
    ASSERT_FALSE(file.isEmpty());
    // A5 landscape (8390 twips high) holds 20 of the 120 details a page: 6 pages.
    EXPECT_EQ(printedPages(file), (std::vector<int> { 1, 1, 2, 2 }));
    EXPECT_TRUE(pdfText(file, 1).contains(u"Page 1 of 6"_s)) << pdfText(file, 1).toStdString();
    EXPECT_NEAR(pdfPageSize(file).width(), 595.3, 1);
    // The choice stays with the report.
    EXPECT_EQ(report->paperOrientation(), 2);
    EXPECT_EQ(report->paperSize(), 11);
    EXPECT_EQ(report->printerDeviceName(), platform::Printers::virtualPdfDeviceName());
}

TEST_F(Printing, ACancelledPromptPrintsNothing)
{
    auto report = threePages();
    report->printOut(true, 1, true, std::nullopt);
    EXPECT_EQ(m_dialog->requests().size(), 1);
    EXPECT_TRUE(printedFiles().isEmpty());
    EXPECT_EQ(report->printingStatus().progress, 5);
}

TEST_F(Printing, PrinterSetupKeepsTheChoiceAndCancelKeepsTheOld)
{
    auto report = threePages();
    report->setDialogParentWindow(77);
    report->printerSetup(0);
    ASSERT_EQ(m_dialog->requests().size(), 1);
    EXPECT_EQ(m_dialog->requests()[0].ownerWindow, 77);
    EXPECT_FALSE(m_dialog->requests()[0].pageRangeAllowed);
    EXPECT_EQ(report->paperOrientation(), 1);

    platform::PrintDialogService::Result choice;
    choice.accepted = true;
    choice.printer = platform::Printers::virtualPdfPrinter();
    choice.settings.setOrientation(2);
    choice.settings.setPaperSize(1);
    choice.settings.setDuplex(3);
    m_dialog->enqueue(choice);
    report->printerSetup(99);
    EXPECT_EQ(m_dialog->requests()[1].ownerWindow, 99);
    EXPECT_EQ(report->paperOrientation(), 2);
    EXPECT_EQ(report->paperSize(), 1);
    EXPECT_EQ(report->printerDuplex(), 3);
    EXPECT_TRUE(printedFiles().isEmpty());
}

TEST_F(Printing, AnUninstalledPrinterFallsBackToTheCurrentOne)
{
    auto report = threePages();
    report->selectPrinter(u"winspool"_s, u"Gone Printer 9000"_s, u"LPT1:"_s);
    EXPECT_EQ(ReportPrinter::printerFor(*report).deviceName(),
        platform::Printers::virtualPdfDeviceName());
    report->printOut(false, 1, true, runtime::PageRange { 1, 1 });
    EXPECT_EQ(printedPages(printedFile()), std::vector<int> { 1 });
    // Another letter case names the same printer.
    report->selectPrinter(QString(), u"lud mox pdf"_s, QString());
    EXPECT_EQ(ReportPrinter::printerFor(*report).deviceName(),
        platform::Printers::virtualPdfDeviceName());
}

} // namespace
} // namespace reportrt::layouttest
