#include "reportrt/output/reportprinter.h"

#include "core/comerror.h"
#include "platform/currentprinter.h"
#include "platform/printdialogservice.h"
#include "platform/printerdevice.h"
#include "platform/printers.h"
#include "reportrt/base/logging_p.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/layout/pagination.h"
#include "reportrt/output/allocatortuning_p.h"
#include "reportrt/output/pagerenderer.h"
#include "reportrt/report.h"

#include <QFileInfo>
#include <QPainter>
#include <QPrintEngine>
#include <map>

namespace reportrt {

namespace {

/// Applies one setting; a code the printer settings do not know keeps the default.
template <typename Setter> void applySetting(Setter setter, const char* what, int value)
{
    try {
        setter();
    } catch (const core::ComError&) {
        qCWarning(lcOutput, "the report's %s %d is unknown to the printer; the default is used",
            what, value);
    }
}

QString documentName(const Report& report)
{
    if (!report.title().trimmed().isEmpty())
        return report.title();
    QString name = report.fileName();
    name = name.left(name.indexOf(u'#') < 0 ? name.size() : name.indexOf(u'#'));
    const QString base = QFileInfo(name).completeBaseName();
    return base.isEmpty() ? QStringLiteral("Report") : base;
}

/// The print engine property that carries further job options to a CUPS queue, as a list
/// of names and values.
const auto cupsOptionsKey = QPrintEngine::PrintEnginePropertyKey(0xfe00);

/// The job options of a print queue beyond what QPrinter passes itself.
QStringList spoolerOptions(
    const std::optional<runtime::PageRange>& pages, const platform::PrintSettings& settings)
{
    QStringList options;
    if (pages)
        options << QStringLiteral("page-ranges")
                << QStringLiteral("%1-%2").arg(pages->startPage).arg(pages->stopPage);
    // The trays that IPP names; printer-specific bins stay with the queue's default.
    static const std::map<int16_t, QString> trays { { 1, QStringLiteral("top") },
        { 2, QStringLiteral("bottom") }, { 3, QStringLiteral("middle") },
        { 4, QStringLiteral("manual") }, { 5, QStringLiteral("envelope") },
        { 7, QStringLiteral("auto") }, { 11, QStringLiteral("large-capacity") } };
    const auto tray = trays.find(settings.paperBin());
    if (tray != trays.end())
        options << QStringLiteral("media-source") << tray->second;
    return options;
}

/// Keeps what the user chose in a print dialog with the report.
void keepChoice(
    Report& report, const platform::PrinterInfo& printer, const platform::PrintSettings& settings)
{
    report.selectPrinter(printer.driverName(), printer.deviceName(), printer.port());
    report.setPaperOrientation(settings.orientation());
    report.setPaperSize(settings.paperSize());
    report.setPaperSource(settings.paperBin());
    report.setPrinterDuplex(settings.duplex());
}

} // namespace

platform::PrinterInfo ReportPrinter::printerFor(const Report& report)
{
    const QString device = report.printer().device;
    if (!device.isEmpty()) {
        const QList<platform::PrinterInfo> installed = platform::Printers::installed();
        for (const auto& p : installed) {
            if (p.deviceName() == device)
                return p;
        }
        for (const auto& p : installed) {
            if (p.deviceName().compare(device, Qt::CaseInsensitive) == 0)
                return p;
        }
        qCWarning(lcOutput, "the report's printer %ls is not installed; printing on %ls",
            qUtf16Printable(device),
            qUtf16Printable(platform::CurrentPrinter::instance().deviceName()));
    }
    return platform::CurrentPrinter::instance().printer();
}

platform::PrintSettings ReportPrinter::settingsFor(const Report& report)
{
    const PageSetup& page = report.pageSetup();
    const platform::PrinterInfo printer = printerFor(report);
    platform::PrintSettings settings = printer == platform::CurrentPrinter::instance().printer()
        ? platform::CurrentPrinter::instance().settings()
        : platform::Printers::defaultSettings(printer);
    const auto orientation = static_cast<int16_t>(page.orientation);
    const auto paperSize = static_cast<int16_t>(page.paperSize);
    const auto paperSource = static_cast<int16_t>(page.paperSource);
    const auto duplex = static_cast<int16_t>(page.duplex);
    applySetting([&] { settings.setOrientation(orientation); }, "orientation", orientation);
    applySetting([&] { settings.setPaperSize(paperSize); }, "paper size", paperSize);
    if (paperSource > 0)
        applySetting([&] { settings.setPaperBin(paperSource); }, "paper source", paperSource);
    applySetting([&] { settings.setDuplex(duplex); }, "duplex mode", duplex);
    settings.setCopies(1);
    return settings;
}

void ReportPrinter::printOut(Report& report, bool promptUser, int16_t copies, bool collated,
    std::optional<runtime::PageRange> pages, int groupNode)
{
    if (!report.result())
        report.readRecords();
    runtime::PrintingStatus status = report.printingStatus();
    // The no-data event cancelled the report: there is nothing to print.
    if (status.is(runtime::PrintingProgress::Cancelled))
        return;
    if (pages && (pages->startPage < 1 || pages->stopPage < pages->startPage))
        raiseError(Error::RuntimeFailure,
            QStringLiteral("Pages %1 to %2 are no page range: the first page is 1 and the last "
                           "is not before the first.")
                .arg(pages->startPage)
                .arg(pages->stopPage));
    int count = std::max<int>(1, copies);

    Pagination pagination(report);
    pagination.setGroupNode(groupNode);
    const int totalPages = promptUser ? pagination.countPages() : 0;

    platform::PrinterInfo printer = printerFor(report);
    platform::PrintSettings settings = settingsFor(report);
    if (promptUser) {
        platform::PrintDialogService::Request request;
        request.ownerWindow = report.dialogParentWindow();
        request.pageRangeAllowed = true;
        request.collate = collated;
        request.minPage = 1;
        request.maxPage = totalPages;
        request.fromPage = pages ? pages->startPage : 1;
        request.toPage = pages ? pages->stopPage : totalPages;
        request.copies = count;
        request.printer = printer;
        request.settings = settings;
        const auto choice = platform::PrintDialogService::active()->show(request);
        if (!choice.accepted) {
            status.setProgress(runtime::PrintingProgress::Cancelled);
            report.setPrintingStatus(status);
            return;
        }
        printer = choice.printer;
        settings = choice.settings;
        count = std::max<int>(1, settings.copies());
        collated = choice.collate;
        pages.reset();
        if (choice.range == platform::PrintDialogService::PageRange::Pages)
            pages = runtime::PageRange { static_cast<int16_t>(choice.fromPage),
                static_cast<int16_t>(choice.toPage) };
        const PageSetup before = report.pageSetup();
        keepChoice(report, printer, settings);
        settings.setCopies(1);
        // Other paper gives other pages.
        const PageSetup& after = report.pageSetup();
        if (after.paperSize != before.paperSize || after.orientation != before.orientation)
            pagination.forgetCount();
    }

    tuneAllocatorForPdf();
    const auto device = platform::PrinterDevice::create(printer, settings, documentName(report));
    // A print queue takes copies, collation, the page range and the tray as job options, so
    // the spooler and the printer see them as the user asked (and count one document).
    const bool spooled = !printer.isVirtualPdf();
    if (spooled) {
        device->setCopyCount(count);
        device->setCollateCopies(collated);
        device->printEngine()->setProperty(cupsOptionsKey, spoolerOptions(pages, settings));
        count = 1;
    }
    status.setProgress(runtime::PrintingProgress::InProgress);
    report.setPrintingStatus(status);
    device->setFullPage(true);
    QPainter painter;
    PageRenderer renderer(pagination.fonts());
    int printed = 0;
    int laidOut = 0;
    const auto paint = [&](const Page& page) {
        if (printed == 0) {
            if (!painter.begin(device.get()))
                raiseError(Error::RuntimeFailure,
                    QStringLiteral("The printer %1 cannot start the print job.")
                        .arg(printer.deviceName()));
        } else if (!device->newPage()) {
            raiseError(Error::RuntimeFailure,
                QStringLiteral("The printer %1 cannot start a new page.")
                    .arg(printer.deviceName()));
        }
        painter.save();
        // Device pixels to twips.
        painter.scale(device->resolution() / 1440.0, device->resolution() / 1440.0);
        renderer.paint(painter, page);
        painter.restore();
        ++printed;
    };
    const auto inRange = [&](int number) {
        return spooled || !pages || (number >= pages->startPage && number <= pages->stopPage);
    };
    try {
        if (collated || count == 1) {
            for (int copy = 0; copy < count; ++copy) {
                laidOut = pagination.run([&](Page&& page) {
                    if (inRange(page.number))
                        paint(page);
                });
                if (printed == 0)
                    break;
            }
        } else {
            laidOut = pagination.run([&](Page&& page) {
                if (!inRange(page.number))
                    return;
                for (int copy = 0; copy < count; ++copy)
                    paint(page);
            });
        }
        if (painter.isActive())
            painter.end();
        if (printed == 0 || (pages && pages->startPage > laidOut))
            raiseError(Error::RuntimeFailure,
                QStringLiteral("Nothing to print: the report has %1 page(s) and the range starts "
                               "at page %2.")
                    .arg(laidOut)
                    .arg(pages ? pages->startPage : 1));
        device->finish();
    } catch (...) {
        if (painter.isActive())
            painter.end();
        device->cancel();
        status.setProgress(runtime::PrintingProgress::Failed);
        report.setPrintingStatus(status);
        throw;
    }
    status.setProgress(runtime::PrintingProgress::Completed);
    status.pageCount = laidOut;
    report.setPrintingStatus(status);
}

void ReportPrinter::printerSetup(Report& report, int32_t parentWindow)
{
    platform::PrintDialogService::Request request;
    request.ownerWindow = parentWindow != 0 ? parentWindow : report.dialogParentWindow();
    request.printer = printerFor(report);
    request.settings = settingsFor(report);
    const auto choice = platform::PrintDialogService::active()->show(request);
    if (choice.accepted)
        keepChoice(report, choice.printer, choice.settings);
}

} // namespace reportrt
