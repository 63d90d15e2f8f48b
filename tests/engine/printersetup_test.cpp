#include "engine/ludpsetup.h"
#include "enginefixture.h"
#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "platform/tempfolder.h"

#include <QFile>
#include <QTemporaryDir>
#include <cstring>

namespace enginetest {
namespace {

using platform::PrintDialogService;

class PrinterSetup : public EngineTest {
protected:
    void SetUp() override
    {
        EngineTest::SetUp();
        platform::CurrentPrinter::instance().select(platform::Printers::virtualPdfPrinter());
    }

    static PrintDialogService::Result confirmed(const platform::PrinterInfo& printer)
    {
        PrintDialogService::Result result;
        result.accepted = true;
        result.printer = printer;
        result.settings = platform::Printers::defaultSettings(printer);
        return result;
    }

    std::shared_ptr<engine::MoxEngine115> engine = makeEngine();
};

struct DialogCase {
    const char* name;
    int16_t numPages;
    int16_t copies;
    uint32_t flags;
    bool pageRange;
    bool selection;
    int maxPage;
    int toPage;
};

class PrintDialogRequest : public PrinterSetup,
                           public ::testing::WithParamInterface<DialogCase> { };

TEST_P(PrintDialogRequest, FollowsThePageCountAndCopies)
{
    const DialogCase& row = GetParam();
    uint32_t flagsShown = 0;
    printDialog->setHandler([&](const PrintDialogService::Request&) {
        flagsShown = engine::PrintDialog().Flags;
        return PrintDialogService::Result();
    });

    EXPECT_FALSE(engine->PrinterSetup(4711, row.numPages, row.copies));

    EXPECT_EQ(flagsShown, row.flags);
    ASSERT_EQ(printDialog->requests().size(), 1);
    const PrintDialogService::Request& request = printDialog->requests().front();
    EXPECT_EQ(request.ownerWindow, 4711);
    EXPECT_TRUE(request.printToFileDisabled);
    EXPECT_TRUE(request.collate);
    EXPECT_EQ(request.pageRangeAllowed, row.pageRange);
    EXPECT_EQ(request.selectionAllowed, row.selection);
    EXPECT_EQ(request.maxPage, row.maxPage);
    EXPECT_EQ(request.toPage, row.toPage);
    if (row.pageRange) {
        EXPECT_EQ(request.minPage, 1);
        EXPECT_EQ(request.fromPage, 1);
    }
    if (row.copies > 0) {
        EXPECT_EQ(request.copies, row.copies);
    }
}

INSTANTIATE_TEST_SUITE_P(Engine, PrintDialogRequest,
    ::testing::Values(
        // PD_DISABLEPRINTTOFILE | PD_COLLATE | PD_NOSELECTION | PD_NOPAGENUMS
        DialogCase { "NoPagesNoRangeNoSelection", 0, 0, 0x8001C, false, false, 0, 0 },
        DialogCase { "OnePageRangeWithoutSelection", 1, 0, 0x80014, true, false, 1, 1 },
        // "To the last page" (65535) is shown as the report's last page.
        DialogCase { "FivePagesAndTwoCopies", 5, 2, 0x80010, true, true, 5, 5 }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(PrinterSetup, CancelOrFailureKeepsTheRecords)
{
    ASSERT_FALSE(engine->PrinterSetup(0, 0, 0)); // nothing queued: cancelled
    const engine::PrintDlgRecord record = engine::PrintDialog();
    const engine::DevModeRecord mode = engine::DevMode();
    const QString device = engine::DevNames().deviceName;

    EXPECT_FALSE(engine->PrinterSetup(99, 7, 3));
    printDialog->setHandler([](const PrintDialogService::Request&) -> PrintDialogService::Result {
        throw core::ComError(32755, u"Print"_s, u"Dialog failed"_s);
    });
    EXPECT_FALSE(engine->PrinterSetup(98, 3, 2));

    EXPECT_EQ(std::memcmp(&record, &engine::PrintDialog(), sizeof record), 0);
    EXPECT_EQ(std::memcmp(&mode, &engine::DevMode(), sizeof mode), 0);
    EXPECT_EQ(engine::DevNames().deviceName, device);
}

TEST_F(PrinterSetup, ConfirmedDialogFillsTheRecordsAndTheCurrentPrinter)
{
    auto result = confirmed(platform::Printers::virtualPdfPrinter());
    result.settings.setDuplex(2);
    result.settings.setPaperSize(8);
    result.settings.setOrientation(2);
    result.settings.setColorMode(1);
    result.settings.setPaperBin(4);
    result.settings.setCopies(3);
    result.settings.setPrintQuality(600);
    printDialog->enqueue(result);

    ASSERT_TRUE(engine->PrinterSetup(0, 0, 0));

    const engine::DevModeRecord& mode = engine::DevMode();
    EXPECT_EQ(mode.dmDuplex, 2);
    EXPECT_EQ(mode.dmPaperSize, 8);
    EXPECT_EQ(mode.dmOrientation, 2);
    EXPECT_EQ(mode.dmColor, 1);
    EXPECT_EQ(mode.dmDefaultSource, 4);
    EXPECT_EQ(mode.dmCopies, 3);
    EXPECT_EQ(mode.dmPrintQuality, 600);
    EXPECT_EQ(mode.dmYResolution, 600);
    // Members outside the copied set stay zero.
    EXPECT_EQ(mode.dmSize, 0);
    EXPECT_EQ(mode.dmDeviceName[0], 0);
    EXPECT_EQ(engine::DevNames().deviceName, platform::Printers::virtualPdfDeviceName());
    EXPECT_EQ(engine::DevNames().driverName, platform::Printers::virtualPdfDriverName());
    EXPECT_EQ(engine::DevNames().outputPort, platform::Printers::virtualPdfFolder());

    const platform::PrintSettings& current = platform::CurrentPrinter::instance().settings();
    EXPECT_EQ(current.duplex(), 2);
    EXPECT_EQ(current.paperSize(), 8);
    EXPECT_EQ(current.orientation(), 2);
    EXPECT_EQ(current.colorMode(), 1);
    EXPECT_EQ(current.paperBin(), 4);
    EXPECT_EQ(current.copies(), 3);
    EXPECT_EQ(current.printQuality(), 600);
    EXPECT_EQ(engine->Properties(u"Printer.DeviceName"_s),
        core::Variant(platform::Printers::virtualPdfDeviceName()));

    // The copies chosen preset the next dialog.
    EXPECT_FALSE(engine->PrinterSetup(0, 0, 0));
    EXPECT_EQ(printDialog->requests().back().copies, 3);
    // So do the printer and its settings.
    EXPECT_EQ(printDialog->requests().back().settings.paperSize(), 8);
}

TEST_F(PrinterSetup, PrinterThatIsNoLongerInstalledLeavesTheCurrentPrinter)
{
    printDialog->enqueue(confirmed(platform::PrinterInfo(u"Gone"_s, u"drv"_s, u"lpt9"_s)));

    ASSERT_TRUE(engine->PrinterSetup(0, 0, 0));

    EXPECT_EQ(engine::DevNames().deviceName, u"Gone"_s);
    EXPECT_EQ(platform::CurrentPrinter::instance().deviceName(),
        platform::Printers::virtualPdfDeviceName());
}

TEST_F(PrinterSetup, LaterEnginesKeepTheSettingsChosenInADialog)
{
    auto result = confirmed(platform::Printers::virtualPdfPrinter());
    result.settings.setDuplex(3);
    printDialog->enqueue(result);
    ASSERT_TRUE(engine->PrinterSetup(0, 0, 0));

    auto later = makeEngine();

    EXPECT_EQ(engine::DevMode().dmDuplex, 3);
}

TEST_F(PrinterSetup, SetPropertiesChangesTheCurrentPrinterAndTheCopy)
{
    platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    EXPECT_TRUE(engine->SetProperties(u"duplex"_s, core::Variant(int16_t { 2 })).isEmpty());
    EXPECT_EQ(current.settings().duplex(), 2);
    EXPECT_EQ(engine::DevMode().dmDuplex, 2);

    engine->SetProperties(u"PAPERSIZE"_s, core::Variant(u"11"_s));
    EXPECT_EQ(current.settings().paperSize(), 11);
    EXPECT_EQ(engine::DevMode().dmPaperSize, 11);

    // Values the printer refuses or that are no numbers change nothing, not even the copy.
    engine->SetProperties(u"Duplex"_s, core::Variant(int16_t { 9 }));
    engine->SetProperties(u"Copies"_s, core::Variant(u"many"_s));
    EXPECT_EQ(current.settings().duplex(), 2);
    EXPECT_EQ(engine::DevMode().dmDuplex, 2);

    engine->SetProperties(u"Orientation"_s, core::Variant(int16_t { 2 }));
    engine->SetProperties(u"Color"_s, core::Variant(int16_t { 1 }));
    engine->SetProperties(u"Copies"_s, core::Variant(int32_t { 4 }));
    engine->SetProperties(u"PaperBin"_s, core::Variant(int16_t { 2 }));
    engine->SetProperties(u"PrintQuality"_s, core::Variant(int16_t { -1 }));
    EXPECT_EQ(current.settings().orientation(), 2);
    EXPECT_EQ(current.settings().colorMode(), 1);
    EXPECT_EQ(current.settings().copies(), 4);
    EXPECT_EQ(current.settings().paperBin(), 2);
    EXPECT_EQ(current.settings().printQuality(), -1);
}

TEST_F(PrinterSetup, DeviceNameSelectsAnInstalledPrinterWithoutRegardToCase)
{
    platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    current.setDuplex(3);

    EXPECT_TRUE(
        engine->SetProperties(u"devicename"_s, core::Variant(u"No such printer"_s)).isEmpty());
    EXPECT_EQ(current.deviceName(), platform::Printers::virtualPdfDeviceName());

    // The printer already current is not selected again, which would reset its settings.
    engine->SetProperties(u"DeviceName"_s, core::Variant(u"lud mox pdf"_s));
    EXPECT_EQ(current.settings().duplex(), 3);
}

// A second printer, configured as another PDF printer of the platform.
class TwoPrinters : public PrinterSetup {
protected:
    void SetUp() override
    {
        qputenv("LUDMOX_PDF_PRINTERS", QFile::encodeName(u"Archive="_s + m_folder.path()));
        PrinterSetup::SetUp();
    }
    void TearDown() override
    {
        PrinterSetup::TearDown();
        qunsetenv("LUDMOX_PDF_PRINTERS");
    }

    QTemporaryDir m_folder;
};

TEST_F(TwoPrinters, ConfirmedDialogThatChoseAnotherPrinterMakesItCurrent)
{
    printDialog->enqueue(confirmed(*platform::Printers::find(u"Archive"_s)));

    ASSERT_TRUE(engine->PrinterSetup(0, 0, 0));

    EXPECT_EQ(engine->Properties(u"Printer.DeviceName"_s), core::Variant(u"Archive"_s));
    EXPECT_EQ(engine->Properties(u"printer.port"_s), core::Variant(m_folder.path()));
    EXPECT_EQ(engine::DevNames().deviceName, u"Archive"_s);
}

TEST_F(TwoPrinters, DeviceNameSwitchesToTheFirstMatchWithoutRegardToCase)
{
    engine->SetProperties(u"DeviceName"_s, core::Variant(u"ARCHIVE"_s));
    EXPECT_EQ(platform::CurrentPrinter::instance().deviceName(), u"Archive"_s);

    engine->SetProperties(u"DeviceName"_s, core::Variant(u"Nowhere"_s));
    EXPECT_EQ(platform::CurrentPrinter::instance().deviceName(), u"Archive"_s);
}

TEST_F(PrinterSetup, PropertiesReadPrinterWindowsAndRecords)
{
    engine->SetDialogParentWindow(321);
    const platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    EXPECT_EQ(engine->Properties(u"printer.drivername"_s), core::Variant(current.driverName()));
    EXPECT_EQ(engine->Properties(u"Printer.Port"_s), core::Variant(current.port()));
    EXPECT_EQ(engine->Properties(u"DialogParentHwnd"_s), core::Variant(int32_t { 321 }));
    EXPECT_TRUE(engine->Properties(u"Printer.Name"_s).isEmpty());
    EXPECT_TRUE(engine->Properties(QString()).isEmpty());

    // The addresses lead to the records themselves.
    const core::Variant devMode = engine->Properties(u"PDEVMODE_PTR"_s);
    const core::Variant dialogRecord = engine->Properties(u"PTPRINTDLG_PTR"_s);
    if (devMode.isEmpty())
        GTEST_SKIP() << "the records could not be placed below 4 GB";
    ASSERT_EQ(devMode.type(), core::VariantType::Long);
    const auto address = [](const core::Variant& value) {
        return reinterpret_cast<const char*>(
            static_cast<uintptr_t>(static_cast<uint32_t>(value.toLong())));
    };
    engine->SetProperties(u"Duplex"_s, core::Variant(int16_t { 2 }));
    EXPECT_EQ(engine::ReadInteger(address(devMode) + 62), 2); // dmDuplex
    EXPECT_EQ(engine::ReadLong(address(dialogRecord)), 66); // lStructSize
}

TEST_F(PrinterSetup, TempPathAlwaysEndsWithASeparator)
{
    EXPECT_EQ(
        engine->Properties(u"GetLUDTempPath"_s), core::Variant(platform::TempFolder::systemPath()));
    engine->SetProperties(u"ludtemppath"_s, core::Variant(u"/data/exports"_s));
    EXPECT_EQ(engine->Properties(u"GetLUDTempPath"_s), core::Variant(u"/data/exports/"_s));
    engine->SetProperties(u"LUDTempPath"_s, core::Variant(u"/data/out/"_s));
    EXPECT_EQ(engine->Properties(u"getludtemppath"_s), core::Variant(u"/data/out/"_s));
}

} // namespace
} // namespace enginetest
