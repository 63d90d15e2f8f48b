// Fuzz target: report documents. Any input must end in a document or a ComError, never a
// crash, a hang or a leak; a document that reads must also write and read back.

#include "core/comerror.h"
#include "reportrt/document/documentreader.h"
#include "reportrt/document/documentwriter.h"
#include "reportrt/report.h"

#include <QByteArray>
#include <cstddef>
#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const QByteArray input(reinterpret_cast<const char*>(data), static_cast<qsizetype>(size));
    try {
        const reportrt::ReportDocument document
            = reportrt::DocumentReader::parse(input, QStringLiteral("fuzz.rpt"));
        const auto report = reportrt::Report::fromDocument(document, QStringLiteral("fuzz.rpt"));
        try {
            (void)report->sqlQueryString();
        } catch (const core::ComError&) { }
        const QByteArray written
            = reportrt::DocumentWriter::serialize(report->document(true), true);
        (void)reportrt::DocumentReader::parse(written, QStringLiteral("fuzz-written.rpt"));
    } catch (const core::ComError&) { }
    return 0;
}
