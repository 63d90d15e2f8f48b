#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <QPainter>
#include <QPrinter>
#include <QPrinterInfo>
#include <QProcess>
#include <QRegularExpression>
#include <QStandardPaths>
#include <QTemporaryDir>
#include <core/comerror.h>
#include <functional>
#include <gtest/gtest.h>
#include <memory>
#include <platform/currentprinter.h>
#include <platform/printerdevice.h>
#include <platform/printers.h>

using namespace Qt::StringLiterals;
using platform::PrinterDevice;
using platform::Printers;
using platform::PrintSettings;

namespace {

// Points the PDF printer at a folder of the test's own.
class PdfPrinterTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        m_previous = qgetenv("LUDMOX_PDF_PRINTER_DIR");
        qputenv("LUDMOX_PDF_PRINTER_DIR", QFile::encodeName(folder()));
    }
    void TearDown() override
    {
        if (m_previous.isNull())
            qunsetenv("LUDMOX_PDF_PRINTER_DIR");
        else
            qputenv("LUDMOX_PDF_PRINTER_DIR", m_previous);
    }

    QString folder() const { return m_base.path() + u"/pdf out"_s; }
    QStringList filesInFolder() const
    {
        return QDir(folder()).entryList(QDir::Files | QDir::Hidden, QDir::Name);
    }

    static void paint(PrinterDevice& device, const QString& text, int pages = 1)
    {
        QPainter painter;
        ASSERT_TRUE(painter.begin(&device));
        for (int page = 0; page < pages; ++page) {
            if (page > 0)
                device.newPage();
            painter.drawText(QPointF(100, 100), text);
        }
        painter.end();
    }

    static QByteArray contents(const QString& path)
    {
        QFile file(path);
        return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
    }

    // pdfinfo's "Page size" and "Pages" lines, or an empty string when it cannot read the file.
    static QString pdfInfo(const QString& path)
    {
        if (QStandardPaths::findExecutable(u"pdfinfo"_s).isEmpty())
            return u"no pdfinfo"_s;
        QProcess process;
        process.start(u"pdfinfo"_s, { path });
        if (!process.waitForFinished(-1) || process.exitCode() != 0)
            return QString();
        QStringList lines;
        const QStringList output = QString::fromUtf8(process.readAllStandardOutput()).split(u'\n');
        for (const QString& line : output) {
            if (line.startsWith(u"Page size:"_s) || line.startsWith(u"Pages:"_s))
                lines.append(line.simplified());
        }
        return lines.join(u'\n');
    }

private:
    QTemporaryDir m_base;
    QByteArray m_previous;
};

TEST_F(PdfPrinterTest, IsAlwaysInstalledUnderItsOwnNames)
{
    const platform::PrinterInfo pdf(u"LUD Mox PDF"_s, u"ludmox-pdf"_s, folder());
    const QList<platform::PrinterInfo> printers = Printers::installed();
    ASSERT_FALSE(printers.isEmpty());
    EXPECT_EQ(printers.constLast(), pdf);
    EXPECT_TRUE(printers.constLast().isVirtualPdf());
    EXPECT_EQ(Printers::find(u"LUD Mox PDF"_s), pdf);
    // Lookup is exact; matching without regard to case is the caller's choice.
    EXPECT_EQ(Printers::find(u"lud mox pdf"_s), std::nullopt);
    if (QPrinterInfo::defaultPrinter().isNull()) {
        EXPECT_EQ(Printers::defaultPrinter(), pdf);
    }
}

TEST_F(PdfPrinterTest, ConfiguredPdfPrintersFollowTheBuiltInOneAndPrintToTheirOwnFolders)
{
    const QString archive = folder() + u"/archive"_s;
    qputenv("LUDMOX_PDF_PRINTERS",
        QFile::encodeName(
            u"Archive="_s + archive + u";broken;=nameless;lud mox pdf=/x;Archive=/y"_s));
    const QList<platform::PrinterInfo> printers = Printers::installed();
    qunsetenv("LUDMOX_PDF_PRINTERS");

    // Malformed entries and names that would shadow another printer are skipped.
    ASSERT_GE(printers.size(), 2);
    EXPECT_EQ(printers.at(printers.size() - 2).deviceName(), u"LUD Mox PDF"_s);
    const platform::PrinterInfo configured = printers.constLast();
    EXPECT_EQ(configured, platform::PrinterInfo(u"Archive"_s, u"ludmox-pdf"_s, archive));

    auto device = PrinterDevice::create(configured, {}, u"Copy"_s);
    paint(*device, u"Archived"_s);
    EXPECT_EQ(QFileInfo(device->finish()).absolutePath(), archive);
}

TEST_F(PdfPrinterTest, PrintsACompletePdfUnderANewName)
{
    auto device = PrinterDevice::create(Printers::virtualPdfPrinter(), {}, u"Invoice 42"_s);
    paint(*device, u"Hello"_s, 2);
    const QString path = device->finish();

    EXPECT_EQ(QFileInfo(path).absolutePath(), folder());
    EXPECT_TRUE(QRegularExpression(u"^Invoice 42-\\d{8}-\\d{6}-1\\.pdf$"_s)
                    .match(QFileInfo(path).fileName())
                    .hasMatch())
        << path.toStdString();
    const QByteArray pdf = contents(path);
    EXPECT_TRUE(pdf.startsWith("%PDF-"));
    EXPECT_TRUE(pdf.trimmed().endsWith("%%EOF"));
    const QString info = pdfInfo(path);
    if (info != u"no pdfinfo"_s) {
        EXPECT_TRUE(info.contains(u"Pages: 2"_s)) << info.toStdString();
    }
    // No temporary file is left next to it.
    EXPECT_EQ(filesInFolder(), QStringList { QFileInfo(path).fileName() });
    EXPECT_EQ(device->finish(), path);
}

TEST_F(PdfPrinterTest, ConcurrentJobsNeverOverwriteEachOther)
{
    auto first = PrinterDevice::create(Printers::virtualPdfPrinter(), {}, u"Same"_s);
    auto second = PrinterDevice::create(Printers::virtualPdfPrinter(), {}, u"Same"_s);
    paint(*first, u"first job"_s);
    paint(*second, u"second job"_s, 3);

    const QString firstPath = first->finish();
    const QByteArray firstBytes = contents(firstPath);
    const QString secondPath = second->finish();

    EXPECT_NE(firstPath, secondPath);
    EXPECT_EQ(contents(firstPath), firstBytes);
    EXPECT_TRUE(contents(secondPath).startsWith("%PDF-"));
    EXPECT_EQ(filesInFolder().size(), 2);
}

TEST_F(PdfPrinterTest, UnfinishedJobsAreSettledWhenTheDeviceGoes)
{
    struct Row {
        const char* name;
        std::function<void(PrinterDevice&)> job;
        int pdfFiles;
    };
    const Row rows[] = {
        { "nothing painted", [](PrinterDevice&) {}, 0 },
        { "painted, finish forgotten", [](PrinterDevice& device) { paint(device, u"x"_s); }, 1 },
        { "cancelled while painting",
            [](PrinterDevice& device) {
                QPainter painter(&device);
                painter.drawText(QPointF(10, 10), u"x"_s);
                device.cancel();
            },
            0 },
        { "cancelled after painting",
            [](PrinterDevice& device) {
                paint(device, u"x"_s);
                device.cancel();
            },
            0 },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        QDir(folder()).removeRecursively();
        {
            auto device = PrinterDevice::create(Printers::virtualPdfPrinter(), {}, u"Doc"_s);
            row.job(*device);
        }
        const QStringList files = filesInFolder();
        EXPECT_EQ(files.size(), row.pdfFiles) << files.join(u", "_s).toStdString();
        for (const QString& file : files)
            EXPECT_TRUE(file.endsWith(u".pdf"_s)) << file.toStdString();
    }
}

TEST_F(PdfPrinterTest, DocumentNamesCannotLeaveTheFolder)
{
    struct Row {
        QString documentName;
        QString baseName;
    };
    const Row rows[] = {
        { u"../../escape"_s, u"_.._escape"_s },
        { u"a/b\\c:d*e?f\"g<h>i|j"_s, u"a_b_c_d_e_f_g_h_i_j"_s },
        { u"..hidden"_s, u"hidden"_s },
        { u"tab\there"_s, u"tab_here"_s },
        { u" . "_s, u"Document"_s },
        { QString(), u"Document"_s },
        { QString(200, u'x'), QString(120, u'x') },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.documentName.toStdString());
        EXPECT_EQ(PrinterDevice::fileBaseName(row.documentName), row.baseName);
    }

    auto device = PrinterDevice::create(Printers::virtualPdfPrinter(), {}, u"../../escape"_s);
    paint(*device, u"x"_s);
    EXPECT_EQ(QFileInfo(device->finish()).absolutePath(), folder());
}

TEST_F(PdfPrinterTest, PageSetupReachesThePdf)
{
    if (QStandardPaths::findExecutable(u"pdfinfo"_s).isEmpty())
        GTEST_SKIP() << "pdfinfo is not installed";
    struct Row {
        int16_t paperSize;
        int16_t orientation;
        const char* pageSize; // as pdfinfo prints it: Qt writes whole points
    };
    const Row rows[] = {
        { 9, 1, "595 x 842 pts (A4)" },
        { 11, 2, "595 x 420 pts (A5)" },
        { 1, 1, "612 x 792 pts (letter)" },
        { 5, 2, "1008 x 612 pts" },
        { 8, 1, "842 x 1191 pts (A3)" },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.paperSize);
        PrintSettings settings;
        settings.setPaperSize(row.paperSize);
        settings.setOrientation(row.orientation);
        auto device = PrinterDevice::create(Printers::virtualPdfPrinter(), settings, u"Page"_s);
        paint(*device, u"x"_s);
        const QString info = pdfInfo(device->finish());
        EXPECT_TRUE(info.contains(u"Page size: "_s + QString::fromLatin1(row.pageSize)))
            << info.toStdString();
    }
}

TEST_F(PdfPrinterTest, UnwritableFolderRaisesPathFileAccess)
{
    QFile blocker(folder());
    ASSERT_TRUE(blocker.open(QIODevice::WriteOnly));
    blocker.close();
    try {
        PrinterDevice::create(Printers::virtualPdfPrinter(), {}, u"Doc"_s);
        FAIL() << "no error raised";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 75);
    }
}

TEST(PrinterDevice, PrinterThatIsNotInstalledRaisesPrinterError)
{
    try {
        PrinterDevice::create(
            platform::PrinterInfo(u"No Such Queue"_s, u"CUPS"_s, u"x"_s), {}, u"Doc"_s);
        FAIL() << "no error raised";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 482);
        EXPECT_TRUE(error.description().contains(u"No Such Queue"_s));
    }
}

TEST(PrintSettings, RejectsCodesOutsideEachSetAndKeepsTheOldValue)
{
    using Setter = void (PrintSettings::*)(int16_t);
    using Getter = int16_t (PrintSettings::*)() const;
    struct Row {
        const char* name;
        Setter set;
        Getter get;
        int16_t value;
        bool valid;
    };
    const Row rows[] = {
        { "colour mono", &PrintSettings::setColorMode, &PrintSettings::colorMode, 1, true },
        { "colour 0", &PrintSettings::setColorMode, &PrintSettings::colorMode, 0, false },
        { "colour 3", &PrintSettings::setColorMode, &PrintSettings::colorMode, 3, false },
        { "copies 2", &PrintSettings::setCopies, &PrintSettings::copies, 2, true },
        { "copies 0", &PrintSettings::setCopies, &PrintSettings::copies, 0, false },
        { "copies -1", &PrintSettings::setCopies, &PrintSettings::copies, -1, false },
        { "bin lower", &PrintSettings::setPaperBin, &PrintSettings::paperBin, 2, true },
        { "bin 12 unassigned", &PrintSettings::setPaperBin, &PrintSettings::paperBin, 12, false },
        { "bin of the printer", &PrintSettings::setPaperBin, &PrintSettings::paperBin, 260, true },
        { "duplex short edge", &PrintSettings::setDuplex, &PrintSettings::duplex, 3, true },
        { "duplex 0", &PrintSettings::setDuplex, &PrintSettings::duplex, 0, false },
        { "duplex 4", &PrintSettings::setDuplex, &PrintSettings::duplex, 4, false },
        { "landscape", &PrintSettings::setOrientation, &PrintSettings::orientation, 2, true },
        { "orientation 3", &PrintSettings::setOrientation, &PrintSettings::orientation, 3, false },
        { "paper A5", &PrintSettings::setPaperSize, &PrintSettings::paperSize, 11, true },
        { "paper 0", &PrintSettings::setPaperSize, &PrintSettings::paperSize, 0, false },
        { "paper 1000", &PrintSettings::setPaperSize, &PrintSettings::paperSize, 1000, false },
        { "quality draft", &PrintSettings::setPrintQuality, &PrintSettings::printQuality, -1,
            true },
        { "quality 600 dpi", &PrintSettings::setPrintQuality, &PrintSettings::printQuality, 600,
            true },
        { "quality 0", &PrintSettings::setPrintQuality, &PrintSettings::printQuality, 0, false },
        { "quality -5", &PrintSettings::setPrintQuality, &PrintSettings::printQuality, -5, false },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        PrintSettings settings;
        const int16_t before = (settings.*row.get)();
        try {
            (settings.*row.set)(row.value);
            EXPECT_TRUE(row.valid);
            EXPECT_EQ((settings.*row.get)(), row.value);
        } catch (const core::ComError& error) {
            EXPECT_FALSE(row.valid);
            EXPECT_EQ(error.number(), 380);
            EXPECT_EQ((settings.*row.get)(), before);
        }
    }
}

TEST(PrintSettings, SurviveAPrinterRoundTrip)
{
    struct Row {
        const char* name;
        int16_t colorMode, copies, paperBin, duplex, orientation, paperSize;
    };
    const Row rows[] = {
        { "mono, long edge, A4", 1, 1, 7, 2, 1, 9 },
        { "colour, short edge, manual feed, A5 landscape", 2, 3, 4, 3, 2, 11 },
        { "simplex, lower bin, legal", 2, 1, 2, 1, 1, 5 },
        { "cassette, letter landscape", 1, 5, 14, 1, 2, 1 },
        { "envelope DL", 2, 1, 5, 1, 1, 27 },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        PrintSettings settings;
        settings.setColorMode(row.colorMode);
        settings.setCopies(row.copies);
        settings.setPaperBin(row.paperBin);
        settings.setDuplex(row.duplex);
        settings.setOrientation(row.orientation);
        settings.setPaperSize(row.paperSize);

        QPrinter printer;
        printer.setOutputFormat(QPrinter::PdfFormat);
        settings.applyTo(printer);
        // PDF output has no duplex mode to read back: readFrom keeps the one it had.
        PrintSettings readBack;
        readBack.setDuplex(row.duplex);
        readBack.readFrom(printer);
        EXPECT_EQ(readBack, settings);
    }
}

class CurrentPrinterTest : public PdfPrinterTest {
protected:
    void TearDown() override
    {
        // Back to the printer other tests start from, with the PDF folder they would see.
        PdfPrinterTest::TearDown();
        platform::CurrentPrinter::instance().select(Printers::defaultPrinter());
    }
};

TEST_F(CurrentPrinterTest, SelectsByExactDeviceName)
{
    platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    ASSERT_TRUE(current.select(u"LUD Mox PDF"_s));
    current.setDuplex(2);

    EXPECT_FALSE(current.select(u"No Such Printer"_s));
    EXPECT_FALSE(current.select(u"lud mox pdf"_s));
    EXPECT_EQ(current.deviceName(), u"LUD Mox PDF"_s);
    EXPECT_EQ(current.driverName(), u"ludmox-pdf"_s);
    EXPECT_EQ(current.port(), folder());
    EXPECT_EQ(current.settings().duplex(), 2);

    // A caller that matches without regard to case picks the name from the list.
    const QString wanted = u"lud mox PDF"_s;
    for (const platform::PrinterInfo& printer : Printers::installed()) {
        if (printer.deviceName().compare(wanted, Qt::CaseInsensitive) == 0) {
            current.select(printer);
            break;
        }
    }
    EXPECT_EQ(current.deviceName(), u"LUD Mox PDF"_s);
    // A newly selected printer starts from its own defaults.
    EXPECT_EQ(current.settings(), Printers::defaultSettings(current.printer()));
}

TEST_F(CurrentPrinterTest, DevicePrintsWithTheCurrentSettings)
{
    if (QStandardPaths::findExecutable(u"pdfinfo"_s).isEmpty())
        GTEST_SKIP() << "pdfinfo is not installed";
    platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    ASSERT_TRUE(current.select(u"LUD Mox PDF"_s));
    current.setPaperSize(11);
    current.setOrientation(2);

    auto device = current.createDevice(u"Current"_s);
    paint(*device, u"x"_s);
    const QString info = pdfInfo(device->finish());
    EXPECT_TRUE(info.contains(u"595 x 420 pts (A5)"_s)) << info.toStdString();
}

} // namespace

TEST(PdfPrinterFolder, DoesNotMoveWithTheHostProgramsName)
{
    const QByteArray previous = qgetenv("LUDMOX_PDF_PRINTER_DIR");
    qunsetenv("LUDMOX_PDF_PRINTER_DIR");
    const QString name = QCoreApplication::applicationName();
    QCoreApplication::setApplicationName(u"first-host"_s);
    const QString first = Printers::virtualPdfFolder();
    QCoreApplication::setApplicationName(u"second host"_s);
    const QString second = Printers::virtualPdfFolder();
    QCoreApplication::setApplicationName(name);
    if (!previous.isNull())
        qputenv("LUDMOX_PDF_PRINTER_DIR", previous);
    EXPECT_EQ(first, second);
    EXPECT_TRUE(first.endsWith(u"/ludmox/pdf"_s)) << first.toStdString();
}
