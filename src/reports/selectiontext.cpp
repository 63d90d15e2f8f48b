#include "reports/selectiontext.h"

#include "core/collection.h"
#include "core/dictionary.h"
#include "core/text.h"

#include <QRegularExpression>
#include <algorithm>
#include <cmath>
#include <vector>

namespace reports::SelectionText {

namespace {

const QString crlf = QStringLiteral("\r\n");

bool sameText(const QString& a, const QString& b)
{
    return a.compare(b, Qt::CaseInsensitive) == 0;
}

QString trimmed(const QString& text)
{
    return core::text::trimSpaces(text);
}

bool isPlainNumber(const QString& text)
{
    // Anchored at the very end: "$" would also take a number followed by a line break.
    static const QRegularExpression number(
        QRegularExpression::anchoredPattern(QStringLiteral("[-+]?[0-9]+(\\.[0-9]+)?")));
    return number.match(trimmed(text)).hasMatch();
}

// A value placed in an SQL IN list. Numbers keep their invariant form; any other text is
// written as a string literal so that it can neither break nor extend the statement.
QString inListElement(const core::Variant& element)
{
    if (element.type() == core::VariantType::Null)
        return QStringLiteral("NULL");
    if (core::isNumberType(element.type())) {
        // Infinity and NaN would be written as names ("inf", "nan"); no ID equals them.
        if (!std::isfinite(element.toDouble()))
            return QStringLiteral("NULL");
        return element.toInvariantText();
    }
    if (element.type() == core::VariantType::Boolean)
        return element.toBoolean() ? QStringLiteral("-1") : QStringLiteral("0");
    const QString text = element.type() == core::VariantType::String ? element.toText()
                                                                     : element.toInvariantText();
    if (isPlainNumber(text))
        return trimmed(text);
    QString quoted = text;
    quoted.replace(QLatin1Char('\''), QStringLiteral("''"));
    return QLatin1Char('\'') + quoted + QLatin1Char('\'');
}

std::vector<core::Variant> elementsOf(const core::Variant& selection)
{
    if (selection.isArray())
        return selection.array().values();
    const core::ObjectPtr object = selection.toObject();
    if (const auto collection = std::dynamic_pointer_cast<core::Collection>(object))
        return collection->items();
    if (const auto dictionary = std::dynamic_pointer_cast<core::Dictionary>(object))
        return dictionary->keys();
    return {};
}

bool isNumberKind(core::VariantType type)
{
    return core::isNumberType(type) || type == core::VariantType::Boolean;
}

QString dropTrailingLineBreaks(QString text)
{
    while (text.endsWith(crlf))
        text.chop(2);
    return text;
}

QString joinLines(const QStringList& lines, qsizetype from, qsizetype to)
{
    QString joined;
    for (qsizetype i = from; i < to; ++i)
        joined += lines.at(i) + crlf;
    return joined;
}

bool isSpace(QChar c)
{
    return c == QLatin1Char(' ') || c == QLatin1Char('\t') || c == QLatin1Char('\r')
        || c == QLatin1Char('\n');
}

bool isWordChar(QChar c)
{
    return c.isLetterOrNumber() || c == u'_';
}

// The index after a literal, quoted name or comment that starts at `i`, or `i` when none
// does. One left open runs to the end of the statement.
qsizetype skipQuoted(const QString& sql, qsizetype i)
{
    const QChar c = sql.at(i);
    const auto closeAt = [&](QChar close) {
        for (qsizetype j = i + 1; j < sql.size(); ++j) {
            if (sql.at(j) != close)
                continue;
            // A doubled quote stands for the quote itself.
            if (close != u']' && j + 1 < sql.size() && sql.at(j + 1) == close) {
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

// Whether the text ends inside a "--" comment: anything appended on its line would be
// commented out.
bool endsInLineComment(const QString& sql)
{
    for (qsizetype i = 0; i < sql.size();) {
        const qsizetype next = skipQuoted(sql, i);
        if (next == i) {
            ++i;
            continue;
        }
        if (next == sql.size() && sql.at(i) == u'-' && !sql.endsWith(u'\n'))
            return true;
        i = next;
    }
    return false;
}

// text, with a line break after it when it ends in a line comment: the comment would
// otherwise swallow what the splice puts after it (a closing parenthesis, AND, the filter).
QString withLineCommentEnded(const QString& text)
{
    return endsInLineComment(text) ? text + QStringLiteral("\r\n") : text;
}

// 0-based index of the last occurrence of keyword as a word of the outermost query, or -1.
// Literals, quoted names, comments and parenthesised sub-queries are passed over: a
// keyword there is text or belongs to another query, and a filter placed after it would
// be lost in a literal or restrict the wrong query.
qsizetype lastKeyword(const QString& sql, const QString& keyword)
{
    qsizetype found = -1;
    int depth = 0;
    for (qsizetype i = 0; i < sql.size();) {
        const qsizetype next = skipQuoted(sql, i);
        if (next != i) {
            i = next;
            continue;
        }
        const QChar c = sql.at(i);
        if (c == u'(') {
            ++depth;
        } else if (c == u')') {
            depth = std::max(0, depth - 1);
        } else if (depth == 0 && (i == 0 || !isWordChar(sql.at(i - 1)))
            && QStringView(sql).mid(i).startsWith(keyword, Qt::CaseInsensitive)
            && (i + keyword.size() == sql.size() || !isWordChar(sql.at(i + keyword.size())))) {
            found = i;
        }
        ++i;
    }
    return found;
}

} // namespace

Request BuildRequest(const QString& tableName, const core::Variant& selection)
{
    Request request;
    if (selection.isNull())
        return request;
    if (selection.isEmpty()) {
        request.noSelection = true;
        return request;
    }
    if (selection.isArray() || selection.isObject()) {
        QStringList elements;
        for (const core::Variant& element : elementsOf(selection))
            elements << inListElement(element);
        request.listClause
            = tableName + QStringLiteral(".ID IN (") + elements.join(QLatin1Char(',')) + u')';
    } else if (isNumberKind(selection.type())) {
        request.formulaSelection = true;
        request.formulaClause
            = u'{' + tableName + QStringLiteral(".ID}=") + inListElement(selection);
    } else if (selection.type() == core::VariantType::String) {
        const QString text = selection.toText();
        if (text.startsWith(u'{')) {
            request.formulaSelection = true;
            request.formulaClause = text;
        } else {
            request.listClause = text;
        }
    }
    return request;
}

QString ComposeSelectionFormula(int mode, const QString& originalSel, const QString& formulaClause)
{
    switch (mode) {
    case 0:
        return QString::fromUtf16(ComponentOnly) + crlf + formulaClause + u')' + crlf
            + QString::fromUtf16(UserAddition);
    case 1:
        return originalSel;
    default:
        if (IsCommentOnly(originalSel))
            return originalSel + crlf + QString::fromUtf16(ComponentClause) + crlf + formulaClause;
        return QString::fromUtf16(AuthorOpen) + crlf + originalSel + crlf
            + QString::fromUtf16(AuthorClose) + crlf + QString::fromUtf16(ComponentClause) + crlf
            + QStringLiteral("AND (") + formulaClause + u')';
    }
}

bool IsCommentOnly(const QString& text)
{
    if (!text.contains(crlf))
        return trimmed(text).startsWith(QStringLiteral("//"));
    const QStringList lines = text.split(crlf);
    for (const QString& line : lines) {
        if (!trimmed(line).startsWith(QStringLiteral("//")))
            return false;
    }
    return true;
}

bool HasSelectionMarkers(const QString& formula)
{
    const QStringList lines = formula.split(crlf);
    const QString& first = lines.first();
    if (sameText(first, QString::fromUtf16(ComponentOnly)))
        return true;
    if (sameText(first, QString::fromUtf16(AuthorOpen))) {
        for (qsizetype i = 1; i + 1 < lines.size(); ++i) {
            if (sameText(lines.at(i), QString::fromUtf16(AuthorClose))
                && sameText(lines.at(i + 1), QString::fromUtf16(ComponentClause)))
                return true;
        }
        return false;
    }
    return first.startsWith(QStringLiteral("//"))
        && formula.contains(QString::fromUtf16(ComponentClause), Qt::CaseInsensitive)
        && !formula.contains(QString::fromUtf16(AuthorClose), Qt::CaseInsensitive);
}

QString ExtractUserSelection(const QString& formula)
{
    const QStringList lines = formula.split(crlf);
    const QString& first = lines.first();

    if (sameText(first, QString::fromUtf16(ComponentOnly))) {
        for (qsizetype i = 1; i + 1 < lines.size(); ++i) {
            if (!sameText(lines.at(i), QString::fromUtf16(UserAddition)))
                continue;
            QString part = joinLines(lines, i + 1, lines.size());
            if (part.size() < 3)
                return {};
            part = dropTrailingLineBreaks(part);
            if (part.startsWith(QStringLiteral("AND "), Qt::CaseInsensitive))
                return part.mid(4);
            return {};
        }
        return {};
    }

    if (sameText(first, QString::fromUtf16(AuthorOpen))) {
        qsizetype end = lines.size();
        for (qsizetype i = 1; i + 1 < lines.size(); ++i) {
            if (sameText(lines.at(i), QString::fromUtf16(AuthorClose))
                && sameText(lines.at(i + 1), QString::fromUtf16(ComponentClause))) {
                end = i;
                break;
            }
        }
        const QString part = joinLines(lines, 1, end);
        return part.size() < 3 ? QString() : dropTrailingLineBreaks(part);
    }

    // The author's text stands before the line break that precedes the marker. A marker at
    // the very start leaves no author's text.
    const qsizetype marker
        = formula.indexOf(QString::fromUtf16(ComponentClause), 0, Qt::CaseInsensitive);
    if (marker < 2)
        return {};
    return formula.left(marker - 2);
}

QString CleanCapturedFormula(const QString& formula)
{
    QString text = trimmed(formula);
    while (text.size() >= 2 && text.startsWith(crlf))
        text = trimmed(text.mid(2));
    while (text.size() >= 2 && text.endsWith(crlf))
        text = trimmed(text.left(text.size() - 2));
    return text;
}

QString BuildSqlConditions(const QString& specialSelection, const QString& selTableName,
    const QStringList& reportTableNames)
{
    if (specialSelection.isEmpty())
        return {};
    QString conditions;
    for (const QString& rawElement : specialSelection.split(u';')) {
        QString element = trimmed(rawElement);
        if (element.startsWith(QStringLiteral("EXISTS"), Qt::CaseInsensitive)
            || element.startsWith(u'(')) {
            conditions += QStringLiteral(" AND (") + element + u')';
            continue;
        }
        QString table;
        if (!element.contains(u'.')) {
            table = selTableName;
            element = selTableName + u'.' + element;
        } else {
            table = trimmed(element.left(element.indexOf(u'.')));
        }
        for (const QString& name : reportTableNames) {
            if (sameText(name, table)) {
                conditions += QStringLiteral(" AND (") + element + u')';
                break;
            }
        }
    }
    if (conditions.isEmpty())
        return {};
    return u'(' + conditions.mid(5) + u')';
}

QString SpliceFilter(const QString& sql, const QString& filter, const QString& specialSelection,
    const QString& formulaClause)
{
    const qsizetype from = lastKeyword(sql, QStringLiteral("FROM"));
    // A keyword before the last FROM belongs to a query joined before it (a UNION).
    const auto afterFrom = [&](qsizetype position) { return position > from ? position : -1; };
    const qsizetype where = afterFrom(lastKeyword(sql, QStringLiteral("WHERE")));
    const qsizetype orderBy = afterFrom(lastKeyword(sql, QStringLiteral("ORDER BY")));
    const qsizetype groupBy = afterFrom(lastKeyword(sql, QStringLiteral("GROUP BY")));

    qsizetype tailKeyword = -1;
    if (orderBy >= 0 && groupBy >= 0)
        tailKeyword = std::min(orderBy, groupBy);
    else
        tailKeyword = std::max(orderBy, groupBy);

    // The white space before the tail's keyword (a line break in the runtime's layout) goes
    // with the tail. A statement written on one line still keeps its keyword separated.
    QString head = sql;
    QString tail;
    if (tailKeyword >= 0) {
        qsizetype gap = tailKeyword;
        while (gap > 0 && isSpace(sql.at(gap - 1)))
            --gap;
        head = sql.left(gap);
        tail = sql.mid(gap);
        if (gap == tailKeyword)
            tail.prepend(crlf);
    }

    QString wherePart;
    if (where < 0 || where >= head.size()) {
        wherePart = crlf + QStringLiteral("WHERE") + crlf + QStringLiteral("    ")
            + withLineCommentEnded(filter);
    } else {
        qsizetype conditionStart = where + 5;
        while (conditionStart < head.size() && isSpace(head.at(conditionStart)))
            ++conditionStart;
        const QString condition = withLineCommentEnded(trimmed(head.mid(conditionStart)));
        qsizetype headEnd = where;
        while (headEnd > 0 && isSpace(head.at(headEnd - 1)))
            --headEnd;
        head = head.left(headEnd);
        if (condition.contains(QStringLiteral(" OR"), Qt::CaseInsensitive))
            wherePart = crlf + QStringLiteral("WHERE") + crlf + QStringLiteral("    (") + condition
                + QStringLiteral(") AND (") + withLineCommentEnded(filter) + u')';
        else
            wherePart = crlf + QStringLiteral("WHERE") + crlf + QStringLiteral("    ") + condition
                + QStringLiteral(" AND (") + withLineCommentEnded(filter) + u')';
    }
    if (!specialSelection.isEmpty() && !formulaClause.isEmpty()) {
        QString clause = formulaClause;
        clause.remove(u'{').remove(u'}');
        wherePart += QStringLiteral("AND (") + withLineCommentEnded(clause) + u')';
    }
    return head + wherePart + tail;
}

QString QuoteForServer(const QString& sql, int32_t serverType)
{
    QString result = sql;
    switch (serverType) {
    case 2:
        result.replace(u'`', u'"');
        break;
    case 1:
    case 3:
        result.replace(u'"', u'`');
        break;
    default:
        break;
    }
    return result;
}

} // namespace reports::SelectionText
