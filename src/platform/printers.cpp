#include "platform/printers.h"

#include "platform/sitesettings.h"

#include <QDir>
#include <QLocale>
#include <QPageSize>
#include <QPrinterInfo>
#include <QStandardPaths>
#include <algorithm>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

PrinterInfo fromSystem(const QPrinterInfo& info)
{
    // A print queue has no driver file or port of its own: the make and model stand for the
    // driver, and the queue name is where jobs go.
    QString driver = info.makeAndModel();
    if (driver.isEmpty())
        driver = u"CUPS"_s;
    return PrinterInfo(info.printerName(), driver, info.printerName());
}

int16_t localeDefaultPaper()
{
    const QLocale::MeasurementSystem system = QLocale::system().measurementSystem();
    return static_cast<int16_t>(QPageSize::windowsId(
        system == QLocale::ImperialUSSystem ? QPageSize::Letter : QPageSize::A4));
}

} // namespace

QString Printers::virtualPdfDeviceName()
{
    return u"LUD Mox PDF"_s;
}

QString Printers::virtualPdfDriverName()
{
    return u"ludmox-pdf"_s;
}

QString Printers::virtualPdfFolder()
{
    const QString configured = SiteSettings().value(SiteSettings::Setting::PdfPrinterFolder);
    if (!configured.isEmpty())
        return QDir::cleanPath(QDir(configured).absolutePath());
    // Not the application's data folder: the output would move with the host program's name.
    return QDir::cleanPath(
        QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation) + u"/ludmox/pdf"_s);
}

PrinterInfo Printers::virtualPdfPrinter()
{
    return PrinterInfo(virtualPdfDeviceName(), virtualPdfDriverName(), virtualPdfFolder());
}

QList<PrinterInfo> Printers::installed()
{
    QList<PrinterInfo> printers;
    const QList<QPrinterInfo> system = QPrinterInfo::availablePrinters();
    printers.reserve(system.size() + 1);
    for (const QPrinterInfo& info : system)
        printers.append(fromSystem(info));
    printers.append(virtualPdfPrinter());
    printers.append(configuredPdfPrinters());
    return printers;
}

QList<PrinterInfo> Printers::configuredPdfPrinters()
{
    // Sites configure further PDF printers (an archive folder, a scanning inbox) as
    // "Device Name=folder" entries separated by ";". Malformed entries and entries that
    // would shadow another printer's name are skipped.
    QList<PrinterInfo> printers;
    const QString configured = SiteSettings().value(SiteSettings::Setting::PdfPrinters);
    for (const QString& entry : configured.split(u';', Qt::SkipEmptyParts)) {
        const qsizetype separator = entry.indexOf(u'=');
        if (separator <= 0)
            continue;
        const QString name = entry.left(separator).trimmed();
        const QString folder = entry.mid(separator + 1).trimmed();
        if (name.isEmpty() || folder.isEmpty()
            || name.compare(virtualPdfDeviceName(), Qt::CaseInsensitive) == 0)
            continue;
        const bool taken = std::any_of(printers.cbegin(), printers.cend(),
            [&](const PrinterInfo& p) { return p.deviceName() == name; });
        if (!taken)
            printers.append(PrinterInfo(
                name, virtualPdfDriverName(), QDir::cleanPath(QDir(folder).absolutePath())));
    }
    return printers;
}

std::optional<PrinterInfo> Printers::find(const QString& deviceName)
{
    for (const PrinterInfo& printer : installed()) {
        if (printer.deviceName() == deviceName)
            return printer;
    }
    return std::nullopt;
}

PrinterInfo Printers::defaultPrinter()
{
    const QPrinterInfo system = QPrinterInfo::defaultPrinter();
    if (!system.isNull())
        return fromSystem(system);
    return virtualPdfPrinter();
}

PrintSettings Printers::defaultSettings(const PrinterInfo& printer)
{
    PrintSettings settings;
    settings.setPaperSize(localeDefaultPaper());
    if (printer.isVirtualPdf())
        return settings;

    const QPrinterInfo system = QPrinterInfo::printerInfo(printer.deviceName());
    if (system.isNull())
        return settings;
    settings.setColorMode(system.defaultColorMode() == QPrinter::GrayScale ? 1 : 2);
    switch (system.defaultDuplexMode()) {
    case QPrinter::DuplexLongSide:
        settings.setDuplex(2);
        break;
    case QPrinter::DuplexShortSide:
        settings.setDuplex(3);
        break;
    default:
        break;
    }
    const int paperCode = system.defaultPageSize().windowsId();
    if (QPageSize::id(paperCode) != QPageSize::Custom)
        settings.setPaperSize(static_cast<int16_t>(paperCode));
    return settings;
}

} // namespace platform
