#pragma once

#include "core/ludmoxexport.h"
#include "platform/printerinfo.h"
#include "platform/printsettings.h"

#include <QList>
#include <QString>
#include <optional>

namespace platform {

/// The installed printers: the system's print queues (CUPS) followed by the component's own
/// PDF printer, which is always there. The PDF printer writes one PDF file per print job into
/// its folder; its port is that folder.
class LUDMOX_EXPORT Printers {
public:
    /// "LUD Mox PDF"
    static QString virtualPdfDeviceName();
    /// "ludmox-pdf"
    static QString virtualPdfDriverName();
    /// The PDF printer's folder: the site's PdfFolder setting (LUDMOX_PDF_PRINTER_DIR) when
    /// set, otherwise "ludmox/pdf" in the user's data folder, whatever the host program is
    /// called. It is created when the first job is printed.
    static QString virtualPdfFolder();
    static PrinterInfo virtualPdfPrinter();

    /// Further PDF printers of the site's PdfPrinters setting (LUDMOX_PDF_PRINTERS,
    /// "Name=folder;Name2=folder2");
    /// each writes to its own folder like the built-in one.
    static QList<PrinterInfo> configuredPdfPrinters();
    /// Every installed printer: the system's, the PDF printer, then the configured PDF
    /// printers.
    static QList<PrinterInfo> installed();
    /// The first installed printer whose device name is exactly deviceName.
    static std::optional<PrinterInfo> find(const QString& deviceName);
    /// The system's default printer, or the PDF printer when the system names none.
    static PrinterInfo defaultPrinter();
    /// The settings a printer starts with when it becomes the current printer.
    static PrintSettings defaultSettings(const PrinterInfo& printer);
};

} // namespace platform
