// Applying the selection request to the open report: the formula clause into the record
// selection formula, list clauses and the host's extra conditions into the SQL statement.

#include "core/comerror.h"
#include "core/text.h"
#include "engine/moxglobals.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/selectiontext.h"
#include "runtime/databasetable.h"
#include "runtime/report.h"

#include <QStringList>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

/// The report's statement, or nothing when the runtime cannot give it (a report without a
/// database statement of its own).
QString readSql(const runtime::Report& report)
{
    try {
        return report.sqlQueryString();
    } catch (const core::ComError&) {
        return {};
    }
}

QStringList tableNames(const runtime::Report& report)
{
    QStringList names;
    for (const auto& table : report.databaseTables())
        names << table->name();
    return names;
}

} // namespace

void MoxReport115::ApplySqlSelection()
{
    if (d->SelectionApplied || d->NoSelection) {
        d->SelectionApplied = true;
        return;
    }
    try {
        if (!d->mReport)
            throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
        runtime::Report& report = *d->mReport;

        d->SqlConditions.clear();
        if (!d->SpecialSelection.isEmpty())
            d->SqlConditions = SelectionText::BuildSqlConditions(
                d->SpecialSelection, d->SelTableName, tableNames(report));
        const bool formulaOnly = d->SqlConditions.isEmpty() && d->FormulaSelection;

        QString sql;
        if (d->BaseSql.isEmpty() && !formulaOnly) {
            // The statement depends on the formula (the runtime pushes parts of it into the
            // WHERE clause), so it is captured with the author's formula in place.
            report.setRecordSelectionFormula(
                d->OriginalSel != u"*" ? d->OriginalSel : report.recordSelectionFormula());
            sql = readSql(report);
            d->BaseSql = sql;
        }
        if (d->FormulaSelection) {
            applySelectionFormula();
            if (!d->SqlConditions.isEmpty())
                sql = readSql(report);
        }
        if (!formulaOnly) {
            if (!d->SqlConditions.isEmpty() || !d->ListClause.isEmpty()) {
                if (d->OriginalSel != u"*" && !d->FormulaSelection)
                    report.setRecordSelectionFormula(d->OriginalSel);
                if (sql.isEmpty())
                    sql = d->BaseSql;
                // Without a statement to restrict, the records cannot be restricted: the
                // report must not run unfiltered.
                if (sql.isEmpty())
                    throw core::ComError::basic(core::ErrorNumber::InvalidProcedureCall);
                QString filter;
                if (!d->ListClause.isEmpty() && !d->SqlConditions.isEmpty())
                    filter = u'(' + d->ListClause + u") AND ("_s + d->SqlConditions + u')';
                else
                    filter = d->ListClause + d->SqlConditions;
                sql = SelectionText::SpliceFilter(
                    sql, filter, d->SpecialSelection, d->FormulaClause);
                sql = SelectionText::QuoteForServer(sql, engine::gServerType);
                // Setting a statement may make the runtime rewrite the formula from it; the
                // formula the component wrote stays.
                const QString formula = report.recordSelectionFormula();
                report.setSqlQueryString(sql);
                if (!core::text::equalsText(report.recordSelectionFormula(), formula))
                    report.setRecordSelectionFormula(formula);
            } else if (!d->BaseSql.isEmpty()) {
                // An empty statement cannot stand for the report's own; with nothing
                // captured there is nothing to put back.
                report.setSqlQueryString(d->BaseSql);
            }
        }
    } catch (const core::ComError&) {
        // A print after this must not run on a half-applied selection.
        d->UnloadRequest = true;
    }
    d->SelectionApplied = true;
}

} // namespace reports
