#pragma once

namespace reportrt {

class ExportOptions;
class Report;

/// Carries out Report::exportReport: checks the export options and hands the report to
/// the writer of the chosen format.
///
/// PDF (format 31) to a disk file (destination 1, or 0 when none was set) is written. Mail
/// (destination 2) exports into the private temporary folder and mails that file, named after
/// the report, to the export options' mail lists (reportrt::mail::MailDelivery: the
/// configured SMTP server, else the outbox); the temporary file is removed whatever happens,
/// and a failed delivery raises Error::MailFailed. Excel (38) and HTML (32) are accepted as
/// settings but raise Error::RuntimeFailure saying they are not supported yet; unknown codes
/// and a prompting export (the runtime has no export dialog) raise it too. Nothing is ever
/// reported as written that was not.
class ReportExporter {
public:
    static void exportReport(Report& report, const ExportOptions& options, bool promptUser);
};

} // namespace reportrt
