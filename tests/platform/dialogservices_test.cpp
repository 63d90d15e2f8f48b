#include <QApplication>
#include <QColorDialog>
#include <QDialog>
#include <QFile>
#include <QFileDialog>
#include <QImage>
#include <QPalette>
#include <QPrintDialog>
#include <QPrinter>
#include <QPrinterInfo>
#include <QTemporaryDir>
#include <QTimer>
#include <QWindow>
#include <core/comerror.h>
#include <functional>
#include <gtest/gtest.h>
#include <iostream>
#include <platform/olecolor.h>
#include <platform/printers.h>
#include <platform/qtdialogservice.h>
#include <platform/qtprintdialogservice.h>
#include <platform/scripteddialogservice.h>
#include <platform/scriptedprintdialogservice.h>
#include <platform/twips.h>
#include <platform/windowhandles.h>

using namespace Qt::StringLiterals;
using platform::DialogService;
using platform::PrintDialogService;
using platform::Printers;

namespace {

// Runs action on the modal dialog of type Dialog as soon as its event loop shows it. A dialog
// that never shows is closed after a long while so that the test fails instead of hanging.
template <typename Dialog> void whenShown(std::function<void(Dialog*)> action)
{
    auto* timer = new QTimer;
    auto ticks = std::make_shared<int>(0);
    timer->setInterval(10);
    QObject::connect(timer, &QTimer::timeout, [timer, ticks, action] {
        if (auto* dialog = qobject_cast<Dialog*>(QApplication::activeModalWidget())) {
            timer->stop();
            timer->deleteLater();
            action(dialog);
        } else if (++*ticks > 6000) {
            timer->stop();
            timer->deleteLater();
            QApplication::closeAllWindows();
        }
    });
    timer->start();
}

TEST(DialogServices, ActiveServiceIsQtsUnlessReplaced)
{
    EXPECT_NE(
        dynamic_cast<platform::QtPrintDialogService*>(PrintDialogService::active().get()), nullptr);
    auto scriptedPrint = std::make_shared<platform::ScriptedPrintDialogService>();
    PrintDialogService::setActive(scriptedPrint);
    EXPECT_EQ(PrintDialogService::active(), scriptedPrint);
    PrintDialogService::setActive(nullptr);
    EXPECT_NE(
        dynamic_cast<platform::QtPrintDialogService*>(PrintDialogService::active().get()), nullptr);

    EXPECT_NE(dynamic_cast<platform::QtDialogService*>(DialogService::active().get()), nullptr);
    auto scripted = std::make_shared<platform::ScriptedDialogService>();
    DialogService::setActive(scripted);
    EXPECT_EQ(DialogService::active(), scripted);
    DialogService::setActive(nullptr);
    EXPECT_NE(dynamic_cast<platform::QtDialogService*>(DialogService::active().get()), nullptr);
}

TEST(ScriptedPrintDialog, AnswersInOrderThenCancelsAndRecordsEveryRequest)
{
    platform::ScriptedPrintDialogService service;
    PrintDialogService::Result chosen;
    chosen.accepted = true;
    chosen.printer = Printers::virtualPdfPrinter();
    chosen.range = PrintDialogService::PageRange::Pages;
    chosen.fromPage = 2;
    chosen.toPage = 3;
    service.enqueue(chosen);

    PrintDialogService::Request request;
    request.ownerWindow = 77;
    request.maxPage = 5;
    const PrintDialogService::Result first = service.show(request);
    request.maxPage = 1;
    const PrintDialogService::Result second = service.show(request);

    EXPECT_TRUE(first.accepted);
    EXPECT_EQ(first.fromPage, 2);
    EXPECT_FALSE(second.accepted);
    ASSERT_EQ(service.requests().size(), 2);
    EXPECT_EQ(service.requests().at(0).maxPage, 5);
    EXPECT_EQ(service.requests().at(1).maxPage, 1);
    EXPECT_EQ(service.requests().at(1).ownerWindow, 77);

    service.setHandler([](const PrintDialogService::Request&) -> PrintDialogService::Result {
        throw core::ComError(482, u"test"_s, u"Printer error"_s);
    });
    EXPECT_THROW(service.show(request), core::ComError);
    EXPECT_EQ(service.requests().size(), 3);
}

TEST(ScriptedDialogs, AnswerOnlyThePickerOfTheirKind)
{
    platform::ScriptedDialogService service;
    service.answerColor(0x00FF8000);
    service.answerPath(u"/data/report.txt"_s);
    service.answerColor(0x000000FF); // a colour is no answer to the folder picker
    service.cancel();
    service.answerPath(u"/data"_s);

    DialogService::FileRequest file;
    file.ownerWindow = 5;
    file.initialDirectory = u"/data/"_s;
    file.fileName = u"report.txt"_s;
    file.flags = DialogService::FileMustExist | DialogService::HideReadOnly;

    EXPECT_EQ(service.chooseColor(5, 0x00FFFFFF), 0x00FF8000);
    EXPECT_EQ(service.openFile(file), u"/data/report.txt"_s);
    EXPECT_EQ(service.chooseFolder(5, QString(), u"/data"_s), std::nullopt);
    EXPECT_EQ(service.openFile(file), std::nullopt);
    EXPECT_EQ(service.chooseFolder(5, QString(), u"/"_s), u"/data"_s);
    EXPECT_EQ(service.chooseColor(5, 0), std::nullopt);

    ASSERT_EQ(service.calls().size(), 6);
    const auto& call = service.calls().at(1);
    EXPECT_EQ(call.picker, platform::ScriptedDialogService::Picker::OpenFile);
    EXPECT_EQ(call.initialDirectory, u"/data/"_s);
    EXPECT_EQ(call.fileName, u"report.txt"_s);
    EXPECT_EQ(call.flags, 0x1004);
    EXPECT_EQ(service.calls().at(0).initialColor, 0x00FFFFFF);
}

TEST(QtDialogs, FilterTextBecomesNameFilters)
{
    struct Row {
        const char* name;
        QString filter;
        QStringList expected;
    };
    const Row rows[] = {
        { "empty", QString(), {} },
        { "one pair", u"Text|*.txt"_s, { u"Text (*.txt)"_s } },
        { "several patterns", u"Pictures|*.bmp;*.jpg"_s, { u"Pictures (*.bmp *.jpg)"_s } },
        { "description already names them", u"Text (*.txt)|*.txt|All files (*.*)|*.*"_s,
            { u"Text (*.txt)"_s, u"All files (*.*)"_s } },
        { "dangling description", u"Text|*.txt|All"_s, { u"Text (*.txt)"_s } },
        { "no description", u"|*.rpt"_s, { u"(*.rpt)"_s } },
        { "no patterns", u"Nothing|"_s, {} },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(platform::QtDialogService::nameFilters(row.filter), row.expected);
    }
}

TEST(QtDialogs, ColourPickerSpeaksOleColours)
{
    platform::QtDialogService service;
    QColor shown;
    whenShown<QColorDialog>([&shown](QColorDialog* dialog) {
        shown = dialog->currentColor();
        dialog->setCurrentColor(QColor(0x10, 0x20, 0x30));
        dialog->accept();
    });
    EXPECT_EQ(service.chooseColor(0, 0x000000FF), 0x00302010);
    EXPECT_EQ(shown, QColor(Qt::red));

    whenShown<QColorDialog>([](QColorDialog* dialog) { dialog->reject(); });
    EXPECT_EQ(service.chooseColor(0, 0x000000FF), std::nullopt);
}

TEST(QtDialogs, FilePickerOpensWhereAskedAndReturnsTheChoice)
{
    QTemporaryDir folder;
    const QString path = folder.filePath(u"report.txt"_s);
    QFile file(path);
    ASSERT_TRUE(file.open(QIODevice::WriteOnly));
    file.close();

    platform::QtDialogService service;
    DialogService::FileRequest request;
    request.title = u"Pick"_s;
    request.filter = u"Text|*.txt"_s;
    request.initialDirectory = folder.path();
    request.fileName = u"report.txt"_s;
    request.flags = DialogService::FileMustExist;
    QString title;
    QStringList selected;
    QFileDialog::FileMode mode = QFileDialog::AnyFile;
    whenShown<QFileDialog>([&](QFileDialog* dialog) {
        title = dialog->windowTitle();
        selected = dialog->selectedFiles();
        mode = dialog->fileMode();
        static_cast<QDialog*>(dialog)->accept();
    });
    EXPECT_EQ(service.openFile(request), path);
    EXPECT_EQ(title, u"Pick"_s);
    EXPECT_EQ(selected, QStringList { path });
    EXPECT_EQ(mode, QFileDialog::ExistingFile);

    whenShown<QFileDialog>([](QFileDialog* dialog) { dialog->reject(); });
    EXPECT_EQ(service.openFile(request), std::nullopt);
}

TEST(QtDialogs, FolderPickerReturnsTheChosenFolder)
{
    QTemporaryDir folder;
    platform::QtDialogService service;
    whenShown<QFileDialog>([](QFileDialog* dialog) { static_cast<QDialog*>(dialog)->accept(); });
    EXPECT_EQ(service.chooseFolder(0, u"Folder"_s, folder.path()), folder.path());

    whenShown<QFileDialog>([](QFileDialog* dialog) { dialog->reject(); });
    EXPECT_EQ(service.chooseFolder(0, u"Folder"_s, folder.path()), std::nullopt);
}

TEST(QtPrintDialog, ShowsTheRequestAndReturnsTheChoice)
{
    QTemporaryDir folder;
    qputenv("LUDMOX_PDF_PRINTER_DIR", QFile::encodeName(folder.path()));

    PrintDialogService::Request request;
    request.pageRangeAllowed = true;
    request.collate = true;
    request.minPage = 1;
    request.maxPage = 5;
    request.fromPage = 1;
    request.toPage = 65535;
    request.copies = 2;
    request.printer = Printers::virtualPdfPrinter();
    request.settings.setPaperSize(11);
    request.settings.setOrientation(2);
    request.settings.setDuplex(3);

    platform::QtPrintDialogService service;
    QAbstractPrintDialog::PrintDialogOptions options;
    int minPage = 0;
    int maxPage = 0;
    whenShown<QPrintDialog>([&](QPrintDialog* dialog) {
        options = dialog->options();
        minPage = dialog->minPage();
        maxPage = dialog->maxPage();
        dialog->accept();
    });
    const PrintDialogService::Result result = service.show(request);

    EXPECT_TRUE(options.testFlag(QAbstractPrintDialog::PrintPageRange));
    EXPECT_FALSE(options.testFlag(QAbstractPrintDialog::PrintSelection));
    EXPECT_EQ(minPage, 1);
    EXPECT_EQ(maxPage, 5);
    EXPECT_TRUE(result.accepted);
    EXPECT_EQ(result.printer, Printers::virtualPdfPrinter());
    EXPECT_EQ(result.settings.copies(), 2);
    EXPECT_EQ(result.settings.paperSize(), 11);
    EXPECT_EQ(result.settings.orientation(), 2);
    EXPECT_EQ(result.settings.duplex(), 3);
    EXPECT_TRUE(result.collate);
    EXPECT_EQ(result.range, PrintDialogService::PageRange::All);

    whenShown<QPrintDialog>([](QPrintDialog* dialog) { dialog->reject(); });
    EXPECT_FALSE(service.show(request).accepted);
    qunsetenv("LUDMOX_PDF_PRINTER_DIR");
}

// The dialog builds on the system's queues: whatever CUPS offers, it has to open on the printer
// the request names and hand that printer back with the requested page.
TEST(QtPrintDialog, OpensOnTheRequestedPrinterWhateverQueuesExist)
{
    QTemporaryDir folder;
    qputenv("LUDMOX_PDF_PRINTER_DIR", QFile::encodeName(folder.path()));
    const QStringList queues = QPrinterInfo::availablePrinterNames();
    const QString queue = queues.contains(u"LUDMox-CUPS"_s) ? u"LUDMox-CUPS"_s
        : queues.isEmpty()                                  ? QString()
                                                            : queues.constFirst();
    const QString pdf = Printers::virtualPdfDeviceName();

    struct Row {
        const char* name;
        QString requested;
        int16_t paperSize;
        QString chosen;
        // A CUPS queue's dialog shows the queue's default paper, so only the PDF printer can
        // promise the requested one.
        bool keepsPaper;
    };
    const Row rows[] = {
        { "PDF printer, A5", pdf, 11, pdf, true },
        { "PDF printer, Legal", pdf, 5, pdf, true },
        { "PDF printer, Architecture E, which a queue may not offer", pdf, 26, pdf, true },
        { "system queue", queue, 11, queue, false },
        { "queue that has gone away falls back to the PDF printer", u"LUDMox-Vanished"_s, 11, pdf,
            true },
    };
    platform::QtPrintDialogService service;
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        if (row.requested.isEmpty()) {
            std::cout << "no system print queue; skipped: " << row.name << std::endl;
            continue;
        }
        PrintDialogService::Request request;
        request.printer = row.requested == pdf
            ? Printers::virtualPdfPrinter()
            : platform::PrinterInfo(row.requested, u"CUPS"_s, row.requested);
        request.settings.setPaperSize(row.paperSize);
        request.settings.setOrientation(2);

        bool shownOnPdf = false;
        QString shownQueue;
        whenShown<QPrintDialog>([&](QPrintDialog* dialog) {
            shownOnPdf = dialog->printer()->outputFormat() == QPrinter::PdfFormat;
            shownQueue = dialog->printer()->printerName();
            dialog->accept();
        });
        const PrintDialogService::Result result = service.show(request);

        EXPECT_EQ(shownOnPdf, row.chosen == pdf);
        if (row.chosen != pdf) {
            EXPECT_EQ(shownQueue, row.chosen);
        }
        ASSERT_TRUE(result.accepted);
        EXPECT_EQ(result.printer.deviceName(), row.chosen);
        EXPECT_EQ(result.settings.orientation(), 2);
        if (row.keepsPaper) {
            EXPECT_EQ(result.settings.paperSize(), row.paperSize);
        }
    }
    qunsetenv("LUDMOX_PDF_PRINTER_DIR");
}

TEST(OleColor, ConvertsBothWays)
{
    const QPalette palette = QGuiApplication::palette();
    struct Row {
        const char* name;
        uint32_t ole;
        QColor color;
    };
    const Row rows[] = {
        { "red is the low byte", 0x000000FF, QColor(255, 0, 0) },
        { "blue is the third byte", 0x00FF0000, QColor(0, 0, 255) },
        { "mixed", 0x00302010, QColor(0x10, 0x20, 0x30) },
        { "palette-relative colour", 0x02302010, QColor(0x10, 0x20, 0x30) },
        { "system window background", 0x80000005, palette.color(QPalette::Base) },
        { "system button face", 0x8000000F, palette.color(QPalette::Button) },
        { "unassigned system colour", 0x80000019, QColor() },
        { "system colour out of range", 0x80000040, QColor() },
        { "unknown kind", 0x41000000, QColor() },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        const QColor color = platform::colorFromOle(static_cast<int32_t>(row.ole));
        EXPECT_EQ(color, row.color);
        if (color.isValid() && (row.ole >> 24) == 0) {
            EXPECT_EQ(platform::oleFromColor(color), static_cast<int32_t>(row.ole));
        }
    }
}

TEST(Twips, FollowTheLogicalResolution)
{
    EXPECT_EQ(platform::twipsPerPixel(96), 15);
    EXPECT_EQ(platform::twipsPerPixel(120), 12);
    EXPECT_EQ(platform::twipsPerPixel(144), 10);
    EXPECT_EQ(platform::twipsPerPixel(0), 15);

    QImage image(10, 10, QImage::Format_RGB32);
    image.setDotsPerMeterX(4724); // 120 DPI
    image.setDotsPerMeterY(5669); // 144 DPI
    EXPECT_EQ(platform::twipsPerPixelX(&image), 12);
    EXPECT_EQ(platform::twipsPerPixelY(&image), 10);
}

TEST(WindowHandles, FindWindowsAndSetOwners)
{
    QWidget host;
    host.show();
    const int32_t handle = platform::WindowHandles::handle(&host);
    ASSERT_NE(handle, 0);
    EXPECT_EQ(platform::WindowHandles::findWidget(handle), &host);
    EXPECT_EQ(platform::WindowHandles::findWindow(handle), host.windowHandle());
    EXPECT_EQ(platform::WindowHandles::findWidget(0), nullptr);

    QDialog dialog;
    EXPECT_FALSE(platform::WindowHandles::setOwner(&dialog, 0));
    EXPECT_TRUE(platform::WindowHandles::setOwner(&dialog, handle));
    ASSERT_NE(dialog.windowHandle(), nullptr);
    EXPECT_EQ(dialog.windowHandle()->transientParent(), host.windowHandle());
}

} // namespace
