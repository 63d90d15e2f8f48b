#pragma once

namespace reportrt {

class ExportOptions;
class Report;

/// Carries out Report::exportReport: checks the export options and hands the report to
/// the writer of the chosen format in the writer table.
///
/// A format with a writer is written to a disk file (destination 1, or 0 when none was
/// set). Mail (destination 2) exports into the private temporary folder and mails that
/// file, named after the report, to the export options' mail lists
/// (reportrt::mail::MailDelivery: the configured SMTP server, else the outbox); the
/// temporary file is removed whatever happens, and a failed delivery raises
/// Error::MailFailed. Known formats without a writer yet are accepted as settings but
/// raise Error::RuntimeFailure saying they are not supported yet; unknown codes and a
/// prompting export (the runtime has no export dialog) raise it too. Nothing is ever
/// reported as written that was not.
class ReportExporter {
public:
    static void exportReport(Report& report, const ExportOptions& options, bool promptUser);
};

} // namespace reportrt
