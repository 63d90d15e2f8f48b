#include "reportrt/output/reportexporter.h"

#include "platform/tempfolder.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/exportoptions.h"
#include "reportrt/mail/maildelivery.h"
#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/mailrequest.h"
#include "reportrt/output/writertable.h"
#include "reportrt/report.h"
#include "runtime/exportdestination.h"

#include <QFileInfo>
#include <QTemporaryFile>

namespace reportrt {

namespace {
QString formatName(int32_t code)
{
    switch (static_cast<runtime::ExportFormat>(code)) {
    case runtime::ExportFormat::PDF:
        return QStringLiteral("PDF");
    case runtime::ExportFormat::Excel:
        return QStringLiteral("Excel");
    case runtime::ExportFormat::HTML:
        return QStringLiteral("HTML");
    }
    return {};
}

QString extensionOf(int32_t formatCode)
{
    switch (static_cast<runtime::ExportFormat>(formatCode)) {
    case runtime::ExportFormat::Excel:
        return QStringLiteral("xlsx");
    case runtime::ExportFormat::HTML:
        return QStringLiteral("html");
    case runtime::ExportFormat::PDF:
        break;
    }
    return QStringLiteral("pdf");
}

// Exports into a private temporary file, mails it under the report's own name and removes
// the file on every path. Returns the page count.
int mailReport(Report& report, const ExportOptions& options, const WriterTable::Writer& writer)
{
    const QString extension = extensionOf(options.formatType());
    QTemporaryFile attachment(platform::TempFolder::systemPath() + u"mail-XXXXXX." + extension);
    if (!attachment.open())
        raiseError(Error::ExportFailed,
            QStringLiteral("The mail attachment could not be written in the temporary folder: %1.")
                .arg(attachment.errorString()));
    attachment.close();
    const int pageCount = writer(report, options, attachment.fileName());

    mail::MailRequest request;
    request.to = options.mailToList();
    request.cc = options.mailCcList();
    request.bcc = options.mailBccList();
    request.subject = options.mailSubject();
    request.message = options.mailMessage();
    request.attachmentPath = attachment.fileName();
    const QString baseName = QFileInfo(report.fileName()).completeBaseName();
    request.attachmentName
        = (baseName.isEmpty() ? QStringLiteral("report") : baseName) + u'.' + extension;
    try {
        mail::MailDelivery::send(request);
    } catch (const mail::MailError& error) {
        raiseError(Error::MailFailed, error.description());
    }
    return pageCount;
}
} // namespace

void ReportExporter::exportReport(Report& report, const ExportOptions& options, bool promptUser)
{
    if (promptUser)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The report runtime has no export dialog: set the export format, "
                           "destination and file name, and export without prompting."));
    const WriterTable::Writer* writer = WriterTable::find(options.formatType());
    if (!writer) {
        const QString name = formatName(options.formatType());
        if (!name.isEmpty())
            raiseError(Error::RuntimeFailure,
                QStringLiteral("Exporting to %1 (format %2) is not supported yet.")
                    .arg(name)
                    .arg(options.formatType()));
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not an export format (31 PDF, 38 Excel, 32 HTML).")
                .arg(options.formatType()));
    }
    switch (static_cast<runtime::ExportDestination>(options.destinationType())) {
    case runtime::ExportDestination::None:
    case runtime::ExportDestination::DiskFile:
        break;
    case runtime::ExportDestination::Mail:
        break;
    default:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not an export destination (1 disk file, 2 mail).")
                .arg(options.destinationType()));
    }
    if (!report.result())
        report.readRecords();
    runtime::PrintingStatus status = report.printingStatus();
    // The no-data event cancelled the report: there is nothing to export.
    if (status.is(runtime::PrintingProgress::Cancelled))
        return;
    status.pageCount
        = options.destinationType() == static_cast<int32_t>(runtime::ExportDestination::Mail)
        ? mailReport(report, options, *writer)
        : (*writer)(report, options, options.diskFileName());
    status.setProgress(runtime::PrintingProgress::Completed);
    report.setPrintingStatus(status);
}

} // namespace reportrt
