#include "platform/qtprintdialogservice.h"

#include "platform/printers.h"
#include "platform/windowhandles.h"

#include <QComboBox>
#include <QDir>
#include <QEvent>
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

/// Qt's dialog opens on the system's default printer even for a printer set to PDF output
/// once any print queue exists, and it chooses while it is being shown; the component's PDF
/// printer is the dialog's file entry, so that entry is chosen as the dialog appears.
class FileEntrySelector : public QObject {
public:
    using QObject::QObject;

protected:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() == QEvent::Show) {
            watched->removeEventFilter(this);
            auto* printers = watched->findChild<QComboBox*>(u"printers"_s);
            if (printers && printers->count() > 0)
                printers->setCurrentIndex(printers->count() - 1);
        }
        return false;
    }
};

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

    FileEntrySelector selector;
    if (request.printer.isVirtualPdf())
        dialog.installEventFilter(&selector);

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
