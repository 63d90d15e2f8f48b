// Record selection: the host's request, the marked selection formula and the cycle of
// saving a report for editing and putting the edited copy in place.

#include "core/comerror.h"
#include "core/text.h"
#include "engine/moxengine115.h"
#include "engine/moxglobals.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/selectiontext.h"
#include "runtime/application.h"
#include "runtime/report.h"
#include "runtime/reportobject.h"

using namespace Qt::StringLiterals;

namespace reports {

namespace {

/// The file format of a saved report that keeps everything.
constexpr int32_t currentFileFormat = 2048;
/// Not captured yet (OriginalSel).
const QString notCaptured = u"*"_s;

void trace(const QString& message)
{
    engine::TraceWrite(message, QString(), false);
}

} // namespace

bool MoxReport115::SetSelection(
    const QString& TableName, const core::Variant& Selection, const QString& SpecialSelection)
{
    try {
        d->SelTableName = TableName;
        d->SelValue = Selection;
        d->FormulaSelection = false;
        const SelectionText::Request request = SelectionText::BuildRequest(TableName, Selection);
        if (request.noSelection)
            d->NoSelection = true;
        // The same single record asked for again: the next load repeats the logon, which a
        // host uses to pick up a record it has just written.
        const bool singleRecord
            = request.formulaSelection && Selection.type() != core::VariantType::String;
        if (singleRecord && core::text::equalsText(request.formulaClause, d->FormulaClause)
            && core::text::equalsText(SpecialSelection, d->SpecialSelection))
            d->RepeatSelection = true;
        d->ListClause = request.listClause;
        d->FormulaClause = request.formulaClause;
        d->FormulaSelection = request.formulaSelection;
        d->SpecialSelection = SpecialSelection;
        d->SelectionApplied = false;
        if (d->Loaded && !d->ReloadPending)
            ApplySqlSelection();
        return true;
    } catch (const core::ComError&) {
        return false;
    }
}

void MoxReport115::applySelectionFormula()
{
    if (d->OriginalSel == notCaptured) {
        const QString formula = core::text::trimSpaces(d->mReport->recordSelectionFormula());
        trace(u"1. mReport.RecordSelectionFormula="_s + formula);
        d->OriginalSel = SelectionText::CleanCapturedFormula(formula);
    }
    trace(u"2. mReportSelection="_s + d->OriginalSel);
    if (!d->BaseSql.isEmpty()) {
        d->mReport->setRecordSelectionFormula(d->OriginalSel);
        d->mReport->setSqlQueryString(d->BaseSql);
    }
    int mode = 0;
    if (!d->OriginalSel.isEmpty())
        mode = d->FormulaClause.isEmpty() ? 1 : 2;
    d->mReport->setRecordSelectionFormula(
        SelectionText::ComposeSelectionFormula(mode, d->OriginalSel, d->FormulaClause));
    trace(u"3. mReport.RecordSelectionFormula="_s + d->mReport->recordSelectionFormula());
}

bool MoxReport115::SaveReport(const QString& FileName)
{
    if (d->UseOldCrystal || !d->mReport)
        return false;
    try {
        if (!d->NoSelection) {
            d->SavedSel = d->mReport->recordSelectionFormula();
            // The saved file gets the author's statement back, so the designer shows it and
            // the next load captures it again; the formula keeps the component's markers.
            if (!(d->SqlConditions.isEmpty() && d->FormulaSelection)) {
                if (d->OriginalSel != notCaptured)
                    d->mReport->setRecordSelectionFormula(d->OriginalSel);
                // An empty statement would stand for the report's own from then on.
                if (!d->BaseSql.isEmpty())
                    d->mReport->setSqlQueryString(d->BaseSql);
                d->mReport->setRecordSelectionFormula(d->SavedSel);
            }
        }
        d->mReport->saveAs(FileName, currentFileFormat);
        return true;
    } catch (const core::ComError&) {
        return false;
    }
}

bool MoxReport115::CheckEditedSelection(
    QString& FileName, QString& OriginalSel, QString& SavedSel, QString& EditedSel)
{
    if (d->NoSelection)
        return true;
    if (d->UseOldCrystal)
        return false;
    {
        const auto edited = engine::GetApplication()->openReport(FileName, 1);
        EditedSel = edited->recordSelectionFormula();
    }
    SavedSel = d->SavedSel;
    OriginalSel = d->OriginalSel;
    if (!SavedSel.contains(QString::fromUtf16(SelectionText::ComponentClause), Qt::CaseInsensitive)
        && !SavedSel.contains(
            QString::fromUtf16(SelectionText::ComponentOnly), Qt::CaseInsensitive))
        return true;
    if (!SelectionText::HasSelectionMarkers(EditedSel))
        return false;
    EditedSel = SelectionText::ExtractUserSelection(EditedSel);
    return true;
}

bool MoxReport115::ReplaceEdited(const QString& FileName, const core::Variant& Selection)
{
    if (d->UseOldCrystal)
        return false;
    try {
        const auto edited = engine::GetApplication()->openReport(FileName, 1);
        // The edited copy reads the logon's database like the report it replaces; the
        // picture objects it would report belong to a document that is not kept.
        std::shared_ptr<runtime::ReportObject> oleObject;
        std::shared_ptr<runtime::ReportObject> pictureObject;
        std::shared_ptr<runtime::ReportObject> blobObject;
        owningEngine()->SetLocation(edited, oleObject, pictureObject, blobObject);
        if (!d->NoSelection) {
            const QString authorsPart = Selection.isMissing() ? d->OriginalSel : Selection.toText();
            if (authorsPart != notCaptured) {
                edited->setRecordSelectionFormula(authorsPart);
                d->OriginalSel = authorsPart;
            }
        }
        if (!d->BaseSql.isEmpty()) {
            if (!core::text::equalsText(edited->sqlQueryString(), d->BaseSql))
                d->BaseSql.clear();
        }
        edited->discardSavedData();
        edited->saveAs(d->FileName, currentFileFormat);
        // The open document still holds the old design: drop it, so the next operation
        // opens the replaced file and applies parameters, selection and top N to it again.
        releaseReport();
        d->Loaded = false;
        d->SelectionApplied = false;
        d->ReloadPending = true;
        return true;
    } catch (const core::ComError&) {
        return false;
    }
}

} // namespace reports
