// Fuzz target: record selection as text. The host's selection values, the author's formula
// and the report's statement are all outside the component's control; whatever they hold,
// a host value must stay inside its quoted literal, the author's formula must survive the
// component's markers, and the filter must land in the outermost query's condition.
//
// Input: one flag byte, then UTF-8 fields separated by U+0001: the statement, the author's
// formula, the special selection, the formula clause, the table name and any number of
// selection values ("#" then a number, "!" for Null, otherwise a text).

#include "reports/selectiontext.h"

#include <QRegularExpression>
#include <QString>
#include <QStringList>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace {

using namespace reports;

void check(bool condition)
{
    if (!condition)
        __builtin_trap();
}

bool isWordChar(QChar c)
{
    return c.isLetterOrNumber() || c == u'_';
}

// Skips a literal or comment starting at `i`; returns the index after it, or `i` when none
// starts there. An unterminated one runs to the end.
qsizetype skipQuoted(const QString& sql, qsizetype i)
{
    const QChar c = sql.at(i);
    const auto closeAt = [&](QChar close) {
        for (qsizetype j = i + 1; j < sql.size(); ++j) {
            if (sql.at(j) != close)
                continue;
            if ((close == u'\'' || close == u'"') && j + 1 < sql.size() && sql.at(j + 1) == close) {
                ++j;
                continue;
            }
            return j + 1;
        }
        return sql.size();
    };
    if (c == u'\'' || c == u'"' || c == u'`')
        return closeAt(c);
    if (c == u'[')
        return closeAt(u']');
    if (c == u'-' && i + 1 < sql.size() && sql.at(i + 1) == u'-') {
        const qsizetype end = sql.indexOf(u'\n', i);
        return end < 0 ? sql.size() : end + 1;
    }
    if (c == u'/' && i + 1 < sql.size() && sql.at(i + 1) == u'*') {
        const qsizetype end = sql.indexOf(QStringLiteral("*/"), i + 2);
        return end < 0 ? sql.size() : end + 2;
    }
    return i;
}

// Whether the literal or quoted name opening at `open` and skipped to `end` was closed there:
// a doubled quote inside is part of it, so '"""' at the very end is still open.
bool isClosedQuote(const QString& sql, qsizetype open, qsizetype end)
{
    const QChar close = sql.at(open) == u'[' ? u']' : sql.at(open);
    for (qsizetype j = open + 1; j < end; ++j) {
        if (sql.at(j) != close)
            continue;
        if ((close == u'\'' || close == u'"') && j + 1 < sql.size() && sql.at(j + 1) == close) {
            ++j;
            continue;
        }
        return j + 1 == end;
    }
    return false;
}

// Whether every literal, comment and parenthesis of the statement is closed.
bool isWellFormed(const QString& sql)
{
    int depth = 0;
    for (qsizetype i = 0; i < sql.size();) {
        const qsizetype next = skipQuoted(sql, i);
        if (next != i) {
            const QChar open = sql.at(i);
            if ((open == u'\'' || open == u'"' || open == u'`' || open == u'[')
                && !isClosedQuote(sql, i, next))
                return false;
            if (open == u'/' && (next - i < 4 || !sql.mid(next - 2).startsWith(u"*/")))
                return false;
            i = next;
            continue;
        }
        if (sql.at(i) == u'(')
            ++depth;
        else if (sql.at(i) == u')' && --depth < 0)
            return false;
        ++i;
    }
    return depth == 0;
}

// Whether `needle` stands in plain statement text at parenthesis depth 0, alone or as the
// only content of a parenthesis the splice added.
bool isAtTopLevel(const QString& sql, const QString& needle)
{
    int depth = 0;
    for (qsizetype i = 0; i < sql.size();) {
        const qsizetype next = skipQuoted(sql, i);
        if (next != i) {
            i = next;
            continue;
        }
        if (QStringView(sql).mid(i).startsWith(needle)
            && (depth == 0
                || (depth == 1 && sql.at(i - 1) == u'('
                    && sql.mid(i + needle.size()).startsWith(u')'))))
            return true;
        if (sql.at(i) == u'(')
            ++depth;
        else if (sql.at(i) == u')')
            --depth;
        ++i;
    }
    return false;
}

// Where a keyword stands in plain statement text at parenthesis depth 0.
std::vector<qsizetype> topLevelKeywords(const QString& sql, QStringView keyword)
{
    std::vector<qsizetype> found;
    int depth = 0;
    for (qsizetype i = 0; i < sql.size();) {
        const qsizetype next = skipQuoted(sql, i);
        if (next != i) {
            i = next;
            continue;
        }
        if (depth == 0 && (i == 0 || !isWordChar(sql.at(i - 1)))
            && QStringView(sql).mid(i).startsWith(keyword, Qt::CaseInsensitive)
            && (i + keyword.size() == sql.size() || !isWordChar(sql.at(i + keyword.size()))))
            found.push_back(i);
        if (sql.at(i) == u'(')
            ++depth;
        else if (sql.at(i) == u')')
            --depth;
        ++i;
    }
    return found;
}

// Whether the statement is one query: a single top-level FROM, then at most one WHERE,
// GROUP BY and ORDER BY, in that order.
bool isSingleQuery(const QString& sql)
{
    qsizetype last = -1;
    for (const QStringView keyword : { u"FROM", u"WHERE", u"GROUP BY", u"ORDER BY" }) {
        const std::vector<qsizetype> found = topLevelKeywords(sql, keyword);
        if (found.size() > 1 || (keyword == u"FROM" && found.empty()))
            return false;
        if (!found.empty()) {
            if (found.front() < last)
                return false;
            last = found.front();
        }
    }
    return true;
}

// An IN list holds only numbers, NULL and complete string literals, so no value can end
// the list or add to the statement.
void checkInList(const QString& listClause, const QString& table)
{
    const QString open = table + QStringLiteral(".ID IN (");
    check(listClause.startsWith(open) && listClause.endsWith(u')'));
    const QString list = listClause.mid(open.size(), listClause.size() - open.size() - 1);
    static const QRegularExpression number(
        QStringLiteral("^[-+]?[0-9]+(\\.[0-9]+)?([eE][-+]?[0-9]+)?"));
    qsizetype i = 0;
    while (i < list.size()) {
        if (list.at(i) == u'\'') {
            const qsizetype end = skipQuoted(list, i);
            check(end - i >= 2 && list.at(end - 1) == u'\'');
            i = end;
        } else if (QStringView(list).mid(i).startsWith(u"NULL")) {
            i += 4;
        } else {
            const auto match = number.match(list.mid(i));
            check(match.hasMatch() && match.capturedLength() > 0);
            i += match.capturedLength();
        }
        if (i == list.size())
            break;
        check(list.at(i) == u',' && i + 1 < list.size());
        ++i;
    }
}

core::Variant valueOf(const QString& field)
{
    if (field.startsWith(u'!'))
        return core::Variant::null();
    if (field.startsWith(u'#'))
        return core::Variant(field.mid(1).toDouble());
    return core::Variant(field);
}

void checkSelection(const QString& table, const QStringList& values)
{
    if (values.isEmpty())
        return;
    std::vector<core::Variant> elements;
    for (const QString& value : values)
        elements.push_back(valueOf(value));
    const SelectionText::Request list
        = SelectionText::BuildRequest(table, core::VariantArray::fromList(elements));
    checkInList(list.listClause, table);

    const core::Variant single = elements.front();
    const SelectionText::Request request = SelectionText::BuildRequest(table, single);
    if (single.type() == core::VariantType::Double) {
        // A number is the record's ID; the clause compares with that number alone.
        check(request.formulaSelection);
        if (std::isfinite(single.toDouble()))
            checkInList(table + QStringLiteral(".ID IN (")
                    + request.formulaClause.mid(table.size() + 6) + u')',
                table);
    }
}

void checkFormulaRoundTrip(const QString& authorFormula, const QString& clause)
{
    const QString original = SelectionText::CleanCapturedFormula(authorFormula);
    const QString crlf = QStringLiteral("\r\n");
    if (original.isEmpty() || original.endsWith(u'\r') || original.endsWith(u'\n')
        || original.contains(QStringLiteral("//LUD"), Qt::CaseInsensitive)
        || original.contains(QStringLiteral("(//"), Qt::CaseInsensitive) || clause.contains(crlf))
        return;
    const QString composed = SelectionText::ComposeSelectionFormula(2, original, clause);
    // The component must recognise its own markers and give the author's formula back
    // unchanged, or a second selection would wrap the first one as the author's.
    check(SelectionText::HasSelectionMarkers(composed));
    check(SelectionText::ExtractUserSelection(composed) == original);

    const QString only = SelectionText::ComposeSelectionFormula(0, QString(), clause);
    check(SelectionText::HasSelectionMarkers(only));
    (void)SelectionText::ExtractUserSelection(only);
    (void)SelectionText::IsCommentOnly(authorFormula);
    (void)SelectionText::HasSelectionMarkers(authorFormula);
    (void)SelectionText::ExtractUserSelection(authorFormula);
}

void checkSplice(const QString& sql, const QString& special, const QString& clause)
{
    const QString filter = QStringLiteral("Fz.ID IN (7)");
    const QString spliced = SelectionText::SpliceFilter(sql, filter, special, clause);
    check(spliced.contains(filter));
    if (!sql.contains(QStringLiteral("Fz.ID"), Qt::CaseInsensitive)
        && sql.contains(QStringLiteral("FROM"), Qt::CaseInsensitive) && isWellFormed(sql)
        && isWellFormed(clause) && isWellFormed(special)) {
        // The filter is a condition of the outermost query: outside every literal, comment
        // and sub-query.
        check(isAtTopLevel(spliced, filter));
        // One query with its clauses in SQL's order keeps a single WHERE. Statements with
        // several queries or clauses out of order are not SQL; the filter still lands at the
        // top level (above), after the last FROM.
        if (isSingleQuery(sql)
            && (special.isEmpty()
                || !clause.contains(QStringLiteral("WHERE"), Qt::CaseInsensitive)))
            check(topLevelKeywords(spliced, u"WHERE").size() == 1);
        check(isWellFormed(spliced));
    }
    for (const int32_t serverType : { 0, 1, 2, 3 })
        check(SelectionText::QuoteForServer(spliced, serverType).size() == spliced.size());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    if (size < 1)
        return 0;
    const QString text = QString::fromUtf8(
        reinterpret_cast<const char*>(data + 1), static_cast<qsizetype>(size - 1));
    QStringList fields = text.split(QChar(1));
    while (fields.size() < 5)
        fields << QString();
    const QString& sql = fields.at(0);
    const QString& authorFormula = fields.at(1);
    const QString& special = fields.at(2);
    const QString& clause = fields.at(3);
    const QString table = fields.at(4).isEmpty() ? QStringLiteral("Orders") : fields.at(4);
    const QStringList values = fields.mid(5);

    checkSelection(table, values);
    checkFormulaRoundTrip(authorFormula, clause);
    const QString conditions
        = SelectionText::BuildSqlConditions(special, table, { table, QStringLiteral("Customers") });
    checkSplice(sql, (data[0] & 1) ? special : QString(), clause);
    if (!conditions.isEmpty())
        (void)SelectionText::SpliceFilter(sql, conditions, special, clause);
    return 0;
}
