// Mailing a report through the runtime's mail destination.

#include "core/comerror.h"
#include "engine/moxengine115.h"
#include "engine/moxglobals.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/reportslogging_p.h"
#include "runtime/application.h"
#include "runtime/exportdestination.h"
#include "runtime/exportoptions.h"
#include "runtime/report.h"

#include <QFile>
#include <optional>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

constexpr auto destinationDisk = static_cast<int32_t>(runtime::ExportDestination::DiskFile);
constexpr auto destinationMail = static_cast<int32_t>(runtime::ExportDestination::Mail);
/// Open option of the temporary copy: exclusive use by this process.
constexpr int16_t openExclusive = 1;
/// The report's own file is opened again with the runtime's default option.
constexpr int16_t openDefault = 0;
/// Saves the report without its saved data.
constexpr int32_t saveWithoutData = 0;

/// The name is used inside the temporary folder; anything that could leave it is refused.
bool isPlainFileName(const QString& name)
{
    return !name.contains(u'/') && !name.contains(u'\\') && !name.contains(u".."_s)
        && !name.contains(QChar(0));
}

} // namespace

bool MoxReport115::SendReport(QString& Address, QString& MailSubject, QString& MailMessage,
    int32_t AttachmentType, bool& ShowDialog, bool& FirstMail, QString& CarbonCopy,
    QString& BlindCarbonCopy, QString& Attachment)
{
    if (!isPlainFileName(Attachment)) {
        qCWarning(lcReports,
            "%s: the attachment name \"%s\" is not a file name; nothing was mailed",
            qUtf8Printable(d->FileName), qUtf8Printable(Attachment));
        d->SendMailError = true;
        return false;
    }
    // 1 only while the records are read: that failure alone reaches the caller.
    int step = 0;
    QString temporaryReport;
    bool reopened = false;
    std::optional<bool> keptDisplay;
    const auto restoreDisplay = [&] {
        if (keptDisplay)
            ignoringErrors([&] { d->mReport->setDisplayProgressDialog(*keptDisplay); });
    };
    const auto restoreIfReopened = [&] {
        if (reopened) {
            restoreOwnFile(temporaryReport);
            reopened = false;
        }
    };
    bool result = false;
    try {
        bool noDialog = false;
        if (!LoadReport(false, noDialog)) {
            if (!d->NotOLEDB)
                return false;
            throw notOleDbError();
        }
        if (FirstMail || (!d->UnloadRequest && !d->FreshData && !d->PreviewActive))
            ReloadKeepingParameters(FirstMail);
        d->SendMailError = false;
        d->FreshData = false;
        bool cancelled = false;
        SetParameters(cancelled, false);
        ApplySqlSelection();
        step = 1;
        d->mReport->readRecords();
        step = 0;

        if (!Attachment.isEmpty()) {
            // The runtime names the attachment after the report file, so the mail goes out
            // from a copy saved under the host's name.
            temporaryReport = scratchFolder() + Attachment + u".rpt"_s;
            ignoringErrors([&] {
                if (QFile::exists(temporaryReport))
                    QFile::remove(temporaryReport);
            });
            ignoringErrors([&] { ReloadKeepingParameters(false); });
            ignoringErrors([&] { d->mReport->saveAs(temporaryReport, saveWithoutData); });
            std::shared_ptr<runtime::Report> copy;
            ignoringErrors([&] {
                copy = engine::GetApplication()->openReport(temporaryReport, openExclusive);
            });
            if (!copy) {
                // The report goes out under its own name; the copy must not stay behind.
                ignoringErrors([&] { QFile::remove(temporaryReport); });
            } else {
                releaseReport();
                adoptReport(copy);
                reopened = true;
                ignoringErrors([&] {
                    owningEngine()->SetLocation(
                        d->mReport, d->OleObject, d->PictureObject, d->BlobObject);
                    bindSections();
                });
            }
            ignoringErrors([&] { RestoreParameterValues(); });
            // A report object just opened has none of the selection applied yet.
            d->SelectionApplied = false;
            ignoringErrors([&] { ApplySqlSelection(); });
        }

        const auto options = d->mReport->exportOptions();
        options->reset();
        options->setMailToList(Address);
        options->setMailSubject(MailSubject);
        options->setFormatType(AttachmentType);
        options->setMailMessage(MailMessage);
        options->setMailCcList(CarbonCopy);
        options->setMailBccList(BlindCarbonCopy);
        options->setDestinationType(destinationDisk);
        ignoringErrors([&] {
            // The scratch name is the same whatever the attachment's format.
            if (d->TempExportFile.isEmpty())
                d->TempExportFile = scratchFolder() + u"LUDMoxMassMailTemp.pdf"_s;
            options->setDiskFileName(d->TempExportFile);
            d->NoData = false;
        });

        if (d->UnloadRequest) {
            d->UnloadRequest = false;
            result = true;
        } else {
            keptDisplay = d->mReport->displayProgressDialog();
            d->mReport->setDisplayProgressDialog(ShowDialog);
            d->mReport->exportReport(false);
            CheckNoData();
            if (d->NoData) {
                restoreDisplay();
            } else if (!d->ValidMail) {
                restoreDisplay();
                ignoringErrors(restoreIfReopened);
                d->SendMailError = true;
                return false;
            } else {
                options->setDestinationType(destinationMail);
                d->mReport->exportReport(false);
                restoreIfReopened();
                restoreDisplay();
                d->UnloadRequest = false;
                result = true;
            }
        }
        ignoringErrors(restoreIfReopened);
        return result;
    } catch (const core::ComError& error) {
        ignoringErrors(restoreIfReopened);
        if (error.number() == core::ErrorNumber::GuardedCrash)
            throw;
        d->SendMailError = true;
        qCWarning(lcReports, "%s: the mail was not sent: %s", qUtf8Printable(d->FileName),
            qUtf8Printable(error.lastErrorText()));
        if (step == 1)
            throw core::ComError::basic(core::ErrorNumber::InvalidProcedureCall);
        return false;
    }
}

void MoxReport115::adoptReport(std::shared_ptr<runtime::Report> report)
{
    d->mReport = std::move(report);
    std::weak_ptr<core::Object> self = weak_from_this();
    d->mReport->setNoDataHandler([self](bool& pCancel) {
        if (const auto alive = std::static_pointer_cast<MoxReport115>(self.lock()))
            alive->mReport_NoData(pCancel);
    });
}

void MoxReport115::restoreOwnFile(const QString& temporaryReport)
{
    releaseReport();
    d->ReloadPending = true;
    ignoringErrors([&] {
        adoptReport(engine::GetApplication()->openReport(d->FileName, openDefault));
        owningEngine()->SetLocation(d->mReport, d->OleObject, d->PictureObject, d->BlobObject);
        bindSections();
    });
    // Without its file the report stays closed; the next use opens it again.
    if (d->mReport) {
        ignoringErrors([&] { RestoreParameterValues(); });
        d->SelectionApplied = false;
        ignoringErrors([&] { ApplySqlSelection(); });
    }
    QFile::remove(temporaryReport);
}

} // namespace reports
