#include "reportexporter.h"

#include "exportoptions.h"
#include "pdfexporter.h"
#include "platform/tempfolder.h"
#include "report.h"
#include "reportrt/mail/maildelivery.h"
#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/mailrequest.h"
#include "runtimeerror.h"

#include <QFileInfo>
#include <QTemporaryFile>

namespace reportrt {

namespace {
constexpr int32_t formatPdf = 31;
constexpr int32_t formatExcel = 38;
constexpr int32_t formatHtml = 32;
constexpr int32_t destinationNone = 0;
constexpr int32_t destinationDisk = 1;
constexpr int32_t destinationMail = 2;
constexpr int16_t progressCompleted = 3;
constexpr int16_t progressCancelled = 5;

// Exports into a private temporary file, mails it under the report's own name and removes
// the file on every path. Returns the page count.
int mailReport(Report& report, const ExportOptions& options)
{
    QTemporaryFile attachment(
        platform::TempFolder::systemPath() + QStringLiteral("mail-XXXXXX.pdf"));
    if (!attachment.open())
        raiseError(Error::ExportFailed,
            QStringLiteral("The mail attachment could not be written in the temporary folder: %1.")
                .arg(attachment.errorString()));
    attachment.close();
    const int pageCount = PdfExporter::exportTo(report, attachment.fileName());

    mail::MailRequest request;
    request.to = options.mailToList();
    request.cc = options.mailCcList();
    request.bcc = options.mailBccList();
    request.subject = options.mailSubject();
    request.message = options.mailMessage();
    request.attachmentPath = attachment.fileName();
    const QString baseName = QFileInfo(report.fileName()).completeBaseName();
    request.attachmentName
        = (baseName.isEmpty() ? QStringLiteral("report") : baseName) + QStringLiteral(".pdf");
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
    switch (options.formatType()) {
    case formatPdf:
        break;
    case formatExcel:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("Exporting to Excel (format 38) is not supported yet."));
    case formatHtml:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("Exporting to HTML (format 32) is not supported yet."));
    default:
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not an export format (31 PDF, 38 Excel, 32 HTML).")
                .arg(options.formatType()));
    }
    switch (options.destinationType()) {
    case destinationNone:
    case destinationDisk:
        break;
    case destinationMail:
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
    if (status.progress == progressCancelled)
        return;
    status.pageCount = options.destinationType() == destinationMail
        ? mailReport(report, options)
        : PdfExporter::exportTo(report, options.diskFileName());
    status.progress = progressCompleted;
    report.setPrintingStatus(status);
}

} // namespace reportrt
