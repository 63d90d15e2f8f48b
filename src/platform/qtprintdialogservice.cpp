#include "platform/qtprintdialogservice.h"

#include "platform/printers.h"
#include "platform/windowhandles.h"

#include <QDir>
#include <QPrintDialog>
#include <QPrinter>
#include <QPrinterInfo>
#include <algorithm>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

void preparePrinter(QPrinter& printer, const PrintDialogService::Request& request)
{
    const QPrinterInfo system = request.printer.isVirtualPdf()
        ? QPrinterInfo()
        : QPrinterInfo::printerInfo(request.printer.deviceName());
    if (system.isNull()) {
        // The dialog refuses a file in a folder that does not exist yet.
        const QString folder = Printers::virtualPdfFolder();
        QDir().mkpath(folder);
        printer.setOutputFormat(QPrinter::PdfFormat);
        printer.setOutputFileName(folder + u'/' + Printers::virtualPdfDeviceName() + u".pdf"_s);
    } else {
        printer.setPrinterName(system.printerName());
    }
    request.settings.applyTo(printer);
    if (request.copies > 0)
        printer.setCopyCount(request.copies);
    printer.setCollateCopies(request.collate);
}

PrintDialogService::PageRange pageRange(QPrinter::PrintRange range)
{
    switch (range) {
    case QPrinter::PageRange:
        return PrintDialogService::PageRange::Pages;
    case QPrinter::Selection:
        return PrintDialogService::PageRange::Selection;
    case QPrinter::CurrentPage:
        return PrintDialogService::PageRange::CurrentPage;
    case QPrinter::AllPages:
        break;
    }
    return PrintDialogService::PageRange::All;
}

} // namespace

PrintDialogService::Result QtPrintDialogService::show(const Request& request)
{
    QPrinter printer(QPrinter::HighResolution);
    preparePrinter(printer, request);

    QPrintDialog dialog(&printer, WindowHandles::findWidget(request.ownerWindow));
    // Building the dialog selects a system queue on the printer itself whenever one exists -
    // the default queue when the request is for the PDF printer - and that queue's paper and
    // duplex replace the requested ones. Applied again, the request makes the dialog open on
    // its PDF entry with the requested settings.
    preparePrinter(printer, request);
    if (!dialog.parentWidget())
        WindowHandles::setOwner(&dialog, request.ownerWindow);

    // The dialog's PDF entry is the only way to pick the component's PDF printer, so it stays
    // even when print-to-file is disabled: that printer is a printer, not print-to-file.
    QAbstractPrintDialog::PrintDialogOptions options = QAbstractPrintDialog::PrintShowPageSize
        | QAbstractPrintDialog::PrintCollateCopies | QAbstractPrintDialog::PrintToFile;
    if (request.pageRangeAllowed)
        options |= QAbstractPrintDialog::PrintPageRange;
    if (request.selectionAllowed)
        options |= QAbstractPrintDialog::PrintSelection;
    dialog.setOptions(options);
    if (request.maxPage > 0) {
        const int minPage = std::clamp(request.minPage, 1, request.maxPage);
        dialog.setMinMax(minPage, request.maxPage);
        const int fromPage = std::clamp(request.fromPage, minPage, request.maxPage);
        dialog.setFromTo(fromPage, std::clamp(request.toPage, fromPage, request.maxPage));
    }

    Result result;
    if (dialog.exec() != QDialog::Accepted)
        return result;

    result.accepted = true;
    if (printer.outputFormat() == QPrinter::PdfFormat) {
        result.printer = Printers::virtualPdfPrinter();
    } else {
        result.printer
            = Printers::find(printer.printerName())
                  .value_or(PrinterInfo(printer.printerName(), u"CUPS"_s, printer.printerName()));
    }
    result.settings = request.settings;
    result.settings.readFrom(printer);
    result.collate = printer.collateCopies();
    result.range = pageRange(printer.printRange());
    result.fromPage = printer.fromPage();
    result.toPage = printer.toPage();
    return result;
}

} // namespace platform
