#include "reports/moxreport115.h"

#include "core/collection.h"
#include "core/comerror.h"
#include "core/dictionary.h"
#include "core/text.h"
#include "engine/moxengine115.h"
#include "engine/moxglobals.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115_p.h"
#include "reports/moxreports115.h"
#include "reports/moxstatus115.h"
#include "runtime/application.h"
#include "runtime/databasetable.h"
#include "runtime/parameterfield.h"
#include "runtime/report.h"
#include "runtime/reportobject.h"
#include "runtime/section.h"

#include <utility>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

const QString oleDbDriver = u"crdb_ado.dll"_s;
/// The first group header, where a report sorts its groups by top N.
const QString firstGroupArea = u"GH1"_s;
/// A top-N count that shows every group.
constexpr int32_t allGroups = 9999;

} // namespace

MoxReport115::MoxReport115()
    : d(std::make_unique<MoxReport115Private>())
{
    engine::TraceWrite(u"MoxReport_Initialize"_s, QString(), false);
}

MoxReport115::~MoxReport115()
{
    // The runtime objects may outlive the report; they must not call back into it.
    releaseReport();
    engine::TraceWrite(u"MoxReport_Terminate"_s, QString(), false);
}

QString MoxReport115::className() const
{
    return u"MoxReport115"_s;
}

QString MoxReport115::FileName() const
{
    return d->FileName;
}

bool MoxReport115::IgnoreNoDataCheck() const
{
    return d->IgnoreNoDataCheck;
}

void MoxReport115::IgnoreNoDataCheck(bool value)
{
    d->IgnoreNoDataCheck = value;
}

bool MoxReport115::UnloadRequest() const
{
    return d->UnloadRequest;
}

void MoxReport115::UnloadRequest(bool value)
{
    d->UnloadRequest = value;
}

bool MoxReport115::PreviewActive() const
{
    return d->PreviewActive;
}

void MoxReport115::PreviewActive(bool value)
{
    d->PreviewActive = value;
}

QString MoxReport115::DefaultPrinter() const
{
    return d->DefaultPrinter;
}

void MoxReport115::DefaultPrinter(const QString& value)
{
    d->DefaultPrinter = value;
}

int16_t MoxReport115::DefaultPaperSize() const
{
    return d->DefaultPaperSize;
}

void MoxReport115::DefaultPaperSize(int16_t value)
{
    d->DefaultPaperSize = value;
}

bool MoxReport115::UseOldCrystal() const
{
    return d->UseOldCrystal;
}

void MoxReport115::UseOldCrystal(bool value)
{
    d->UseOldCrystal = value;
}

bool MoxReport115::ValidMail() const
{
    return d->ValidMail;
}

void MoxReport115::ValidMail(bool value)
{
    d->ValidMail = value;
}

bool MoxReport115::SendMailError() const
{
    return d->SendMailError;
}

bool MoxReport115::SaveAsPDFError() const
{
    return d->SaveAsPDFError;
}

bool MoxReport115::SaveAsXLSError() const
{
    return d->SaveAsXLSError;
}

int32_t MoxReport115::TopNGroups() const
{
    return d->TopNGroups;
}

void MoxReport115::TopNGroups(int32_t N)
{
    d->TopNGroups = d->Loaded ? ApplyTopNGroups(N) : N;
}

int32_t MoxReport115::ApplyTopNGroups(int32_t N)
{
    if (N == -1)
        return -1;
    try {
        if (!d->mReport)
            return -1;
        // A count of 0 means the report does not sort its groups by top N; it keeps all.
        if (d->mReport->topNGroupCount(firstGroupArea) <= 0)
            return -1;
        d->mReport->setTopNGroupCount(firstGroupArea, N > 0 ? N : allGroups);
        return d->mReport->topNGroupCount(firstGroupArea);
    } catch (const core::ComError&) {
        return -1;
    }
}

std::shared_ptr<MoxEvents115> MoxReport115::MoxEvents()
{
    if (!d->Events)
        d->Events = std::make_shared<MoxEvents115>();
    return d->Events;
}

std::shared_ptr<MoxStatus115> MoxReport115::Status()
{
    auto status = std::make_shared<MoxStatus115>();
    if (!d->mReport) {
        status->Progress = eppNoReport;
        return status;
    }
    try {
        const runtime::PrintingStatus printing = d->mReport->printingStatus();
        // The page count is final only once every record read was printed.
        status->NumberOfPages = printing.progress == eppPrintingCompleted
                && printing.recordsPrinted == printing.recordsRead
            ? printing.pageCount
            : -1;
        status->NumberOfRecordPrinted = printing.recordsPrinted;
        status->NumberOfRecordRead = printing.recordsRead;
        status->NumberOfRecordSelected = printing.recordsSelected;
        status->Progress = static_cast<enuPrintProgress>(printing.progress);
        return status;
    } catch (const core::ComError&) {
        return nullptr;
    }
}

std::shared_ptr<runtime::Report> MoxReport115::C_Report()
{
    bool noDialog = false;
    LoadReport(false, noDialog);
    return d->mReport;
}

bool MoxReport115::CheckOLEDB()
{
    if (d->NotOLEDB)
        return false;
    if (!d->mReport) {
        if (d->FileName.isEmpty())
            return false;
        return openReportFile();
    }
    return checkOleDbDriver();
}

bool MoxReport115::CloseReport(bool& DontResetParameters)
{
    releaseReport();
    d->Loaded = false;
    d->SelectionApplied = false;
    d->ParamsApplied = false;
    d->PreviewActive = false;
    if (!DontResetParameters) {
        d->Params.reset();
        d->CollectedParams.reset();
    }
    d->Events.reset();
    d->SavedParameterValues.reset();
    return true;
}

bool MoxReport115::CloseReport()
{
    bool dontResetParameters = false;
    return CloseReport(dontResetParameters);
}

void MoxReport115::CloseReport8() { }

void MoxReport115::SetFileName(const QString& name)
{
    d->FileName = name;
}

void MoxReport115::SetParent(const std::weak_ptr<MoxReports115>& parent)
{
    d->Parent = parent;
}

std::shared_ptr<MoxReports115> MoxReport115::GetParent() const
{
    return d->Parent.lock();
}

std::shared_ptr<runtime::Report> MoxReport115::GetReport() const
{
    return d->mReport;
}

std::shared_ptr<engine::MoxEngine115> MoxReport115::owningEngine() const
{
    const auto parent = GetParent();
    auto owner = parent ? parent->GetEngine() : nullptr;
    if (!owner)
        throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
    return owner;
}

bool MoxReport115::LoadReport(bool Refresh, bool& NoDialog)
{
    if (d->Loading)
        return false;
    d->UnloadRequest = false;
    d->Loading = true;
    const auto fail = [this] {
        d->ReloadPending = false;
        d->Loading = false;
        d->UnloadRequest = true;
        return false;
    };
    try {
        if (!d->Loaded || d->ReloadPending) {
            d->RepeatSelection = false;
            if (!d->mReport) {
                if (d->FileName.isEmpty() || !openReportFile())
                    return fail();
            }
            bool located = !GetParent() || owningEngine()->LogOn();
            if (located) {
                if (!d->ReloadPending) {
                    if (d->mReport->hasSavedData())
                        d->mReport->discardSavedData();
                } else {
                    ReloadKeepingParameters(false);
                }
                located = owningEngine()->SetLocation(
                    d->mReport, d->OleObject, d->PictureObject, d->BlobObject);
            }
            if (!located) {
                raiseErrorOccured();
                return fail();
            }
            bindSections();
            if (d->ReloadPending) {
                RestoreParameterValues();
                d->ReloadPending = false;
            }
        }
        if (d->Loaded && d->RepeatSelection) {
            d->RepeatSelection = false;
            if (!owningEngine()->LogOn()) {
                raiseErrorOccured();
                return fail();
            }
        }
        if (!d->Loaded || Refresh) {
            if (Refresh) {
                d->mReport->discardSavedData();
                d->FreshData = false;
            }
            bool cancelled = false;
            SetParameters(cancelled, NoDialog);
            ApplySqlSelection();
            d->TopNGroups = ApplyTopNGroups(d->TopNGroups);
        }
        // A host may close the report from an event raised while it loads.
        if (!d->mReport)
            return fail();
        d->Loaded = true;
        d->Loading = false;
        return true;
    } catch (...) {
        fail();
        throw;
    }
}

void MoxReport115::raiseErrorOccured()
{
    const QString lastError = owningEngine()->LastError();
    // Without an event object no host can be listening. It is held here: a handler may
    // close the report, which releases it.
    if (const auto events = d->Events; events && !lastError.isEmpty())
        events->ErrorOccured(lastError);
}

bool MoxReport115::openReportFile()
{
    d->mReport = engine::GetApplication()->openReport(d->FileName, 1);
    std::weak_ptr<core::Object> self = weak_from_this();
    d->mReport->setNoDataHandler([self](bool& pCancel) {
        if (const auto report = std::static_pointer_cast<MoxReport115>(self.lock()))
            report->mReport_NoData(pCancel);
    });
    return checkOleDbDriver();
}

bool MoxReport115::checkOleDbDriver()
{
    try {
        const auto tables = d->mReport->databaseTables();
        if (tables.empty())
            throw core::ComError::basic(core::ErrorNumber::SubscriptOutOfRange);
        if (core::text::equalsText(tables.front()->driverName(), oleDbDriver)) {
            d->NotOLEDB = false;
            return true;
        }
    } catch (...) {
        // Kept open, the report would skip this check on its next load.
        releaseReport();
        throw;
    }
    releaseReport();
    d->NotOLEDB = true;
    return false;
}

void MoxReport115::releaseReport()
{
    unbindSections();
    d->OleObject.reset();
    d->PictureObject.reset();
    d->BlobObject.reset();
    if (const auto report = std::exchange(d->mReport, nullptr))
        ignoringErrors([&] { report->setNoDataHandler({}); });
}

void MoxReport115::bindSections()
{
    std::weak_ptr<core::Object> self = weak_from_this();
    const auto bind = [&](const std::shared_ptr<runtime::ReportObject>& object,
                          SectionBinding& binding, void (MoxReport115::*handler)()) {
        if (!object)
            return;
        unbind(binding);
        binding.section = object->section();
        binding.cookie = binding.section->addFormatHandler([self, handler] {
            if (const auto report = std::static_pointer_cast<MoxReport115>(self.lock()))
                (report.get()->*handler)();
        });
    };
    bind(d->OleObject, d->mSection, &MoxReport115::mSection_format);
    bind(d->PictureObject, d->mPictureSection, &MoxReport115::mPictureSection_format);
    bind(d->BlobObject, d->mBlobPictureSection, &MoxReport115::mBlobPictureSection_format);
}

void MoxReport115::unbindSections()
{
    unbind(d->mSection);
    unbind(d->mPictureSection);
    unbind(d->mBlobPictureSection);
}

void MoxReport115::unbind(SectionBinding& binding)
{
    if (const auto section = std::exchange(binding.section, nullptr))
        ignoringErrors([&] { section->removeFormatHandler(binding.cookie); });
    binding.cookie = 0;
}

bool MoxReport115::NoData() const
{
    return d->NoData;
}

void MoxReport115::mReport_NoData(bool& pCancel)
{
    Q_UNUSED(pCancel); // left as the runtime gave it
    engine::TraceWrite(u"mReport_NoData=true"_s, QString(), false);
    d->NoData = !d->IgnoreNoDataCheck;
}

bool MoxReport115::ReloadKeepingParameters(bool KeepNothing)
{
    if (KeepNothing) {
        if (d->mReport)
            ignoringErrors([&] { d->mReport->discardSavedData(); });
        return true;
    }
    auto kept = std::make_shared<core::Collection>();
    if (!d->NotOLEDB && d->mReport) {
        ignoringErrors([&] {
            for (const auto& parameter : d->mReport->parameterFields()) {
                ignoringErrors([&] {
                    if (parameter->hasCurrentValue())
                        kept->add(parameter->currentValue(1), parameter->name());
                });
            }
        });
    }
    d->SavedParameterValues = kept;
    if (d->mReport)
        ignoringErrors([&] { d->mReport->discardSavedData(); });
    return kept->count() > 0 && RestoreParameterValues();
}

bool MoxReport115::RestoreParameterValues()
{
    if (!d->mReport || !d->SavedParameterValues || d->SavedParameterValues->count() == 0)
        return false;
    try {
        for (const auto& parameter : d->mReport->parameterFields()) {
            ignoringErrors([&] {
                if (const auto position = d->SavedParameterValues->find(parameter->name()))
                    parameter->addCurrentValue(d->SavedParameterValues->item(*position));
            });
        }
        return true;
    } catch (const core::ComError&) {
        return false;
    }
}

} // namespace reports
