#pragma once

#include "core/comerror.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace core {
class Collection;
class Dictionary;
} // namespace core

namespace runtime {
class Report;
class ReportObject;
class Section;
} // namespace runtime

namespace reports {

class MoxEvents115;
class MoxReports115;

/// A section whose format event the report handles, with the cookie that unbinds it.
struct SectionBinding {
    std::shared_ptr<runtime::Section> section;
    int cookie = 0;

    explicit operator bool() const { return section != nullptr; }
};

/// The fields of one MoxReport115, named as the component has always named them.
///
/// Invariants: mReport is null whenever NotOLEDB is true; Loaded implies mReport; the
/// section bindings and the three picture objects are set only while mReport is.
struct MoxReport115Private {
    QString FileName;
    /// Non-owning, so a report never keeps its collection alive.
    std::weak_ptr<MoxReports115> Parent;

    bool Loaded = false;
    /// The next load reopens the report file.
    bool ReloadPending = false;
    bool NotOLEDB = false;
    bool PrinterChosen = false;
    /// Set while LoadReport runs; a nested call returns at once.
    bool Loading = false;

    // Selection request (SetSelection) and what was captured from the report.
    QString SelTableName;
    core::Variant SelValue;
    QString ListClause;
    bool FormulaSelection = false;
    QString FormulaClause;
    QString SpecialSelection;
    bool NoSelection = false;
    bool SelectionApplied = false;
    bool RepeatSelection = false;
    /// The author's own selection formula; "*" until captured.
    QString OriginalSel = QStringLiteral("*");
    /// The report's statement before the component changed it; empty until captured.
    QString BaseSql;
    QString SqlConditions;
    /// The formula the report had when SaveReport last saved it.
    QString SavedSel;

    int32_t TopNGroups = -1;

    std::shared_ptr<core::Dictionary> Params;
    /// Values gathered from the dialogs, keys without regard to case.
    std::shared_ptr<core::Dictionary> CollectedParams;
    bool ParamsApplied = false;
    /// First current value of each parameter, by name, kept across a reload.
    std::shared_ptr<core::Collection> SavedParameterValues;

    std::shared_ptr<runtime::ReportObject> OleObject;
    std::shared_ptr<runtime::ReportObject> PictureObject;
    std::shared_ptr<runtime::ReportObject> BlobObject;
    QString OlePath;
    /// Image file contents for OleObject; one zero byte means none.
    core::VariantArray PictureBytes
        = core::VariantArray({ core::VariantArray::Bound { 0, 0 } }, core::VariantType::Byte);

    bool UnloadRequest = false;
    bool SendMailError = false;
    bool SaveAsPDFError = false;
    bool SaveAsXLSError = false;
    bool SaveAsHTMLError = false;
    /// The saved data has not been used for output yet.
    bool FreshData = true;
    bool PreviewActive = false;
    std::shared_ptr<MoxEvents115> Events;
    QString DefaultPrinter;
    int16_t DefaultPaperSize = 0;
    bool UseOldCrystal = false;
    bool NoData = false;
    bool ValidMail = false;
    QString TempExportFile;
    bool IgnoreNoDataCheck = false;

    /// The runtime's report object; its no-data event is bound while it is set.
    std::shared_ptr<runtime::Report> mReport;
    /// The sections holding OleObject, PictureObject and BlobObject.
    SectionBinding mSection;
    SectionBinding mPictureSection;
    SectionBinding mBlobPictureSection;
};

} // namespace reports

namespace reports {

/// Runs one step whose runtime error must not stop the steps after it.
template <class Step> void ignoringErrors(Step&& step)
{
    try {
        step();
    } catch (const core::ComError&) {
        // The caller goes on with its next step, whatever this one left undone.
    }
}

} // namespace reports

namespace reports {

/// The error of an operation on a report that is not read through the OLE DB driver.
inline core::ComError notOleDbError()
{
    return core::ComError(core::ErrorNumber::NotOleDbReport, QStringLiteral("LUD Crystal Engine"),
        QStringLiteral("Not an OLE DB report - please convert with Crystal Reports."));
}

/// The error of a cancelled parameter dialog.
inline core::ComError userCancelledError()
{
    return core::ComError(core::ErrorNumber::UserCancelled, QStringLiteral("LUD Crystal Engine"),
        QStringLiteral("User Cancelled"));
}

} // namespace reports

namespace reports {

/// A value converted to what a parameter of value type `valueType` takes (1, 2 byte; 3, 4
/// Integer; 5, 6 Long; 7, 8 Double; 9 Boolean; 10, 11, 16 Date; 12 to 14 String; others
/// unchanged). Raises the conversion's error (6 Overflow, 13 Type mismatch, 94 Null).
core::Variant ConvertParameterValue(const core::Variant& value, int16_t valueType);

} // namespace reports
