#include "platform/printerdevice.h"

#include "platform/platformglobal_p.h"
#include "platform/printsettings.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QPrinterInfo>
#include <QTemporaryFile>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

constexpr qsizetype maximumBaseNameLength = 120;

[[noreturn]] void raisePrinterError(const QString& text)
{
    detail::raise(detail::PlatformError::PrinterError, u"Printer error: "_s + text);
}

[[noreturn]] void raiseAccess(const QString& text)
{
    detail::raise(detail::PlatformError::PathFileAccess, u"Path/File access error: "_s + text);
}

} // namespace

PrinterDevice::PrinterDevice(const PrinterInfo& printer, const QPrinterInfo& systemPrinter)
    : QPrinter(systemPrinter, QPrinter::HighResolution)
    , m_printer(printer)
    , m_started(QDateTime::currentDateTime())
{ }

std::unique_ptr<PrinterDevice> PrinterDevice::create(
    const PrinterInfo& printer, const PrintSettings& settings, const QString& documentName)
{
    std::unique_ptr<PrinterDevice> device;
    if (printer.isVirtualPdf()) {
        const QString folder = printer.port();
        if (!QDir().mkpath(folder))
            raiseAccess(u"the PDF printer folder %1 cannot be created"_s.arg(folder));
        QTemporaryFile part(folder + u"/.ludmox-XXXXXX.part"_s);
        part.setAutoRemove(false);
        if (!part.open())
            raiseAccess(u"cannot write into the PDF printer folder %1"_s.arg(folder));
        part.close();

        device.reset(new PrinterDevice(printer, QPrinterInfo()));
        device->m_partFile = part.fileName();
        device->m_baseName = fileBaseName(documentName);
        device->setOutputFormat(QPrinter::PdfFormat);
        device->setOutputFileName(device->m_partFile);
    } else {
        const QPrinterInfo system = QPrinterInfo::printerInfo(printer.deviceName());
        if (system.isNull())
            raisePrinterError(u"the printer %1 is not installed"_s.arg(printer.deviceName()));
        device.reset(new PrinterDevice(printer, system));
    }
    device->setDocName(documentName);
    settings.applyTo(*device);
    return device;
}

PrinterDevice::~PrinterDevice()
{
    if (m_finished || m_partFile.isEmpty())
        return;
    try {
        if (printerState() == QPrinter::Idle && !m_cancelled) {
            finish();
            return;
        }
    } catch (const core::ComError& error) {
        qCWarning(lcPlatform, "PDF print job left unpublished: %ls",
            qUtf16Printable(error.description()));
        return;
    }
    discardPartFile();
}

QString PrinterDevice::fileBaseName(const QString& documentName)
{
    static const QString unsafe = u"/\\:*?\"<>|"_s;
    QString name;
    name.reserve(documentName.size());
    for (const QChar ch : documentName)
        name += (ch.category() == QChar::Other_Control || unsafe.contains(ch)) ? u'_' : ch;
    // Leading dots would hide the file; trailing dots and spaces are lost on some file systems.
    while (name.startsWith(u'.') || name.startsWith(u' '))
        name.remove(0, 1);
    name.truncate(maximumBaseNameLength);
    while (name.endsWith(u'.') || name.endsWith(u' '))
        name.chop(1);
    return name.isEmpty() ? u"Document"_s : name;
}

QString PrinterDevice::finish()
{
    if (m_finished)
        return m_outputPath;
    if (m_partFile.isEmpty() || m_cancelled) {
        m_finished = true;
        discardPartFile();
        return m_outputPath;
    }

    switch (printerState()) {
    case QPrinter::Active:
        raisePrinterError(u"the print job has not ended"_s);
    case QPrinter::Error:
        m_finished = true;
        discardPartFile();
        raisePrinterError(u"the PDF file could not be written"_s);
    case QPrinter::Aborted:
        m_finished = true;
        discardPartFile();
        return m_outputPath;
    case QPrinter::Idle:
        break;
    }
    if (QFileInfo(m_partFile).size() == 0) {
        m_finished = true;
        discardPartFile();
        return m_outputPath;
    }

    const QString stem = QFileInfo(m_partFile).absolutePath() + u'/' + m_baseName + u'-'
        + m_started.toString(u"yyyyMMdd-HHmmss"_s) + u'-';
    for (int number = 1; number < 100000; ++number) {
        const QString target = stem + QString::number(number) + u".pdf"_s;
        // QFile::rename never replaces an existing file, so a name taken in the meantime by
        // another job simply moves us on to the next number.
        if (QFile::rename(m_partFile, target)) {
            m_finished = true;
            m_outputPath = target;
            return m_outputPath;
        }
        if (!QFileInfo(target).exists() && !QFileInfo(target).isSymLink())
            raiseAccess(u"the PDF file %1 cannot be created"_s.arg(target));
    }
    raiseAccess(u"no free file name for %1 in the PDF printer folder"_s.arg(m_baseName));
}

void PrinterDevice::cancel()
{
    abort();
    m_cancelled = true;
}

void PrinterDevice::discardPartFile()
{
    if (!m_partFile.isEmpty())
        QFile::remove(m_partFile);
}

} // namespace platform
