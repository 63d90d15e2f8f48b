#pragma once

#include "core/variant.h"

#include <QString>
#include <QStringList>

namespace reports {

/// The text side of record selection: the selection-formula markers and the rewriting of a
/// report's SQL statement. Pure functions over text, so they build and are tested without a
/// report runtime. Lines of formulas and statements are joined with CR LF.
namespace SelectionText {

/// Marker lines written into selection formulas.
inline constexpr char16_t AuthorOpen[] = u"(//LUD#1";
inline constexpr char16_t AuthorClose[] = u")//LUD#2";
inline constexpr char16_t ComponentClause[] = u"//LUDSELECTION";
inline constexpr char16_t ComponentOnly[] = u"(//LUDSELECTIONONLY";
inline constexpr char16_t UserAddition[] = u"//USERSELECTION";

/// What SetSelection builds from the host's value.
struct Request {
    QString listClause; // SQL form: "Orders.ID IN (3,7,9)" or the host's condition
    QString formulaClause; // formula form: "{Orders.ID}=5"
    bool formulaSelection = false;
    bool noSelection = false; // the value was Empty
};

/// Builds the clause for a selection value: arrays and collections become an SQL IN list
/// (numbers as they are, other texts as quoted SQL strings), numbers an ID formula
/// clause, text starting with "{" a formula clause, other text an SQL condition.
Request BuildRequest(const QString& tableName, const core::Variant& selection);

/// Mode 0: the author's formula is empty; 1: no component clause; 2: both.
QString ComposeSelectionFormula(int mode, const QString& originalSel, const QString& formulaClause);
bool IsCommentOnly(const QString& text);
bool HasSelectionMarkers(const QString& formula);
/// The author's part of a formula that carries the component's markers.
QString ExtractUserSelection(const QString& formula);
/// The author's formula as captured: spaces and blank lines at both ends removed.
QString CleanCapturedFormula(const QString& formula);

/// The conditions of a SpecialSelection text (";"-separated) whose tables the report
/// has, as one parenthesised conjunction; empty when none remain.
QString BuildSqlConditions(const QString& specialSelection, const QString& selTableName,
    const QStringList& reportTableNames);

/// The statement with `filter` added to the WHERE condition of its outermost query
/// (after the last FROM), keeping GROUP BY / ORDER BY at the end. `formulaClause` is
/// appended to the condition when both it and `specialSelection` are given.
QString SpliceFilter(const QString& sql, const QString& filter, const QString& specialSelection,
    const QString& formulaClause);

/// Identifier quotes for the server type: SQL Server (2) uses double quotes, Jet (1, 3)
/// grave accents; the whole statement is converted.
QString QuoteForServer(const QString& sql, int32_t serverType);

} // namespace SelectionText

} // namespace reports
