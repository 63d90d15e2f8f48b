#pragma once

#include "platform/printerinfo.h"

#include <QDateTime>
#include <QPrinter>
#include <QString>
#include <memory>

namespace platform {

class PrintSettings;

/// A QPrinter configured for one print job on an installed printer.
///
/// On the PDF printer the job is painted into a hidden temporary file in the printer's
/// folder; finish() gives it its final name "<document>-<yyyyMMdd-hhmmss>-<n>.pdf", with n
/// the first number that does not name an existing file, so no earlier output is ever
/// overwritten and no reader sees a half-written PDF. A device destroyed without finish()
/// still publishes a job whose painting ended normally and removes an unfinished or cancelled
/// one.
class PrinterDevice : public QPrinter {
public:
    /// Raises ComError 482 (Printer error) when a system printer is no longer installed and
    /// 75 (Path/File access error) when the PDF printer's folder cannot be written.
    static std::unique_ptr<PrinterDevice> create(
        const PrinterInfo& printer, const PrintSettings& settings, const QString& documentName);

    ~PrinterDevice() override;

    const PrinterInfo& printerInfo() const { return m_printer; }

    /// Ends the job once painting has ended. For the PDF printer: the path of the published
    /// file, or "" when no page was painted or the job was aborted; raises ComError 482 when
    /// painting failed or has not ended and 75 when the file cannot be published (the
    /// temporary file is then kept). For system printers: "".
    QString finish();

    /// Cancels the job: nothing of it is published, whether painting goes on or not. (The PDF
    /// writer cannot abort, so QPrinter::abort() alone would still publish the file.)
    void cancel();

    /// The file name a document gets in the PDF printer's folder, before the time stamp:
    /// the document name without characters that are unsafe in file names, "Document" when
    /// nothing is left.
    static QString fileBaseName(const QString& documentName);

private:
    PrinterDevice(const PrinterInfo& printer, const QPrinterInfo& systemPrinter);

    void discardPartFile();

    PrinterInfo m_printer;
    QString m_partFile; // the PDF printer's temporary output; empty for system printers
    QString m_baseName;
    QDateTime m_started;
    bool m_finished = false;
    bool m_cancelled = false;
    QString m_outputPath;
};

} // namespace platform
