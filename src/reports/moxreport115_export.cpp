// The exports of a report to PDF, Excel and HTML files.

#include "core/comerror.h"
#include "engine/moxengine115.h"
#include "platform/tempfolder.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/reportslogging_p.h"
#include "reports/stagedtarget.h"
#include "runtime/exportdestination.h"
#include "runtime/exportformat.h"
#include "runtime/exportoptions.h"
#include "runtime/printingprogress.h"
#include "runtime/report.h"

#include <QDateTime>
#include <QFile>
#include <optional>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

constexpr auto formatPdf = static_cast<int32_t>(runtime::ExportFormat::PDF);
constexpr auto formatExcel = static_cast<int32_t>(runtime::ExportFormat::Excel);
constexpr auto formatHtml = static_cast<int32_t>(runtime::ExportFormat::HTML);
constexpr auto destinationDisk = static_cast<int32_t>(runtime::ExportDestination::DiskFile);
constexpr auto progressCompleted = static_cast<int16_t>(runtime::PrintingProgress::Completed);

/// Excel options in the order the runtime takes them: area type, constant column width,
/// column headings, worksheet functions, page breaks, all pages.
constexpr int16_t excelAreaType = 4;

bool hasFolder(const QString& path)
{
    // A host may still name folders in the original platform's notation.
    return path.contains(u'/') || path.contains(u'\\');
}

/// The local time as day, year, month, hour, minutes, seconds, two digits each.
QString scratchStamp()
{
    return QDateTime::currentDateTime().toString(u"ddyyMMHHmmss"_s);
}

void removeFile(const QString& path)
{
    if (!path.isEmpty() && QFile::exists(path))
        QFile::remove(path);
}

} // namespace

enum class ExportKind { Pdf, Excel, Html };

struct MoxReport115::ExportRequest {
    ExportKind kind;
    const QString& FileName;
    bool FirstSave = false;
    bool TempFileOnly = false;
    bool ForceSave = false;
    bool SeparatePages = true;
    bool HTMLNavigator = true;
};

bool MoxReport115::SaveAsPDF(
    QString& FileName, bool& FirstSave, bool& TempFileOnly, bool& ForceSave)
{
    return runExport({ ExportKind::Pdf, FileName, FirstSave, TempFileOnly, ForceSave });
}

bool MoxReport115::SaveAsXLS(QString& FileName, bool& TempFileOnly, bool& ForceSave)
{
    return runExport({ ExportKind::Excel, FileName, false, TempFileOnly, ForceSave });
}

bool MoxReport115::SaveAsHTML(QString& FileName, bool& TempFileOnly, bool& ForceSave,
    bool& SeparatePages, bool& HTMLNavigator)
{
    return runExport({ ExportKind::Html, FileName, false, TempFileOnly, ForceSave, SeparatePages,
        HTMLNavigator });
}

bool MoxReport115::runExport(const ExportRequest& request)
{
    const bool pdf = request.kind == ExportKind::Pdf;
    bool& errorFlag = pdf                   ? d->SaveAsPDFError
        : request.kind == ExportKind::Excel ? d->SaveAsXLSError
                                            : d->SaveAsHTMLError;
    // 1 only while the records are read: those failures reach the caller differently.
    int step = 0;
    std::optional<bool> keptDisplay;
    const auto restoreDisplay = [&] {
        if (keptDisplay)
            ignoringErrors([&] { d->mReport->setDisplayProgressDialog(*keptDisplay); });
    };
    try {
        bool noDialog = false;
        if (!LoadReport(false, noDialog)) {
            if (d->NotOLEDB)
                throw notOleDbError();
            return false;
        }
        if ((!d->UnloadRequest && !d->FreshData && !d->PreviewActive) || (pdf && request.FirstSave))
            ReloadKeepingParameters(pdf && request.FirstSave);
        errorFlag = false;
        d->FreshData = false;
        bool cancelled = false;
        SetParameters(cancelled, false);
        ApplySqlSelection();
        step = 1;
        d->mReport->readRecords();
        step = 0;

        const auto options = d->mReport->exportOptions();
        options->reset();
        switch (request.kind) {
        case ExportKind::Pdf:
            options->setFormatType(formatPdf);
            options->setDestinationType(destinationDisk);
            break;
        case ExportKind::Excel:
            options->setFormatType(formatExcel);
            options->setExcelAreaType(excelAreaType);
            options->setExcelConstantColumnWidth(true);
            options->setExcelTabHasColumnHeadings(true);
            options->setExcelUseWorksheetFunctions(false);
            options->setExcelPageBreaks(true);
            options->setExcelExportAllPages(true);
            options->setDestinationType(destinationDisk);
            break;
        case ExportKind::Html:
            options->setFormatType(formatHtml);
            options->setHtmlFileName(request.FileName);
            options->setHtmlSeparatePages(request.SeparatePages);
            options->setHtmlNavigator(request.HTMLNavigator);
            break;
        }

        ignoringErrors([&] {
            if (request.TempFileOnly) {
                d->TempExportFile = hasFolder(request.FileName)
                    ? request.FileName
                    : scratchFolder() + request.FileName;
            } else if (d->TempExportFile.isEmpty()) {
                // The HTML export has always shared the Excel export's scratch name.
                const QString name = pdf ? u"LUDMoxMassMailTemp"_s + scratchStamp() + u".pdf"_s
                                         : u"LUDMoxExportXLSTemp"_s + scratchStamp() + u".xls"_s;
                d->TempExportFile = scratchFolder() + name;
            }
        });
        ignoringErrors([&] { removeFile(d->TempExportFile); });
        ignoringErrors([&] {
            options->setDiskFileName(d->TempExportFile);
            d->NoData = false;
            if (d->DefaultPaperSize != 0)
                d->mReport->setPaperSize(d->DefaultPaperSize);
        });

        if (!d->UnloadRequest) {
            keptDisplay = d->mReport->displayProgressDialog();
            d->mReport->setDisplayProgressDialog(false);
            d->mReport->exportReport(false);
            if (!request.TempFileOnly) {
                ignoringErrors([&] { removeFile(d->TempExportFile); });
                ignoringErrors([&] { CheckNoData(); });
                if (!request.ForceSave && d->NoData) {
                    restoreDisplay();
                    return false;
                }
                // A PDF goes to its file only for a mail the host has approved, unless forced.
                if (!pdf || d->ValidMail || request.ForceSave) {
                    StagedTarget target(request.FileName);
                    options->setDiskFileName(target.path());
                    if (request.kind == ExportKind::Html)
                        options->setHtmlFileName(target.path());
                    d->mReport->exportReport(false);
                    target.commit();
                }
            }
            restoreDisplay();
        }
        d->UnloadRequest = false;
        return true;
    } catch (const core::ComError& error) {
        ignoringErrors([&] { removeFile(d->TempExportFile); });
        if (error.number() == core::ErrorNumber::GuardedCrash)
            throw;
        errorFlag = true;
        if (step == 1) {
            if (pdf) {
                int32_t number = error.number();
                if (number == core::ErrorNumber::ServerError
                    && !error.description().contains(u"0x80004005"_s, Qt::CaseInsensitive))
                    number = core::ErrorNumber::ServerErrorRewritten;
                if (number == core::ErrorNumber::ServerError
                    || number == core::ErrorNumber::TableConnectionFailed)
                    throw core::ComError(number, error.source(), error.description());
            }
            // The record reading's own number and text do not reach the caller; they are
            // kept for whoever reads the diagnostics.
            qCWarning(lcReports, "%s: reading the records failed: %s", qUtf8Printable(d->FileName),
                qUtf8Printable(error.lastErrorText()));
            throw core::ComError::basic(core::ErrorNumber::InvalidProcedureCall);
        }
        throw core::ComError(error.number(), error.source(),
            error.description() + u"\r\nTempFile:"_s + d->TempExportFile + u"\r\nFileName:"_s
                + request.FileName);
    }
}

QString MoxReport115::GetLUDTempPath() const
{
    try {
        return owningEngine()->Properties(u"GetLUDTempPath"_s).toText();
    } catch (const core::ComError&) {
        return {};
    }
}

int32_t MoxReport115::DialogParentHwnd() const
{
    try {
        return owningEngine()->Properties(u"DialogParentHwnd"_s).toLong();
    } catch (const core::ComError&) {
        return 0;
    }
}

QString MoxReport115::scratchFolder() const
{
    const QString folder = GetLUDTempPath();
    // Never the file system's root: scratch files hold report data.
    return folder.isEmpty() ? platform::TempFolder::systemPath() : folder;
}

void MoxReport115::CheckNoData()
{
    d->NoData = false;
    if (d->IgnoreNoDataCheck || !d->mReport)
        return;
    const runtime::PrintingStatus status = d->mReport->printingStatus();
    if (status.progress == progressCompleted && status.recordsRead == 0)
        d->NoData = true;
}

} // namespace reports
