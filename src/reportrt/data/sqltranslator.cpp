#include "reportrt/data/sqltranslator.h"

#include "reportrt/base/invarianttext.h"

#include <QRegularExpression>
#include <QSet>

namespace reportrt {

namespace {
using Kind = FormulaExpr::Kind;
using Op = FormulaExpr::Op;

QString opText(Op op)
{
    switch (op) {
    case Op::Equal:
        return QStringLiteral("=");
    case Op::NotEqual:
        return QStringLiteral("<>");
    case Op::Less:
        return QStringLiteral("<");
    case Op::LessEqual:
        return QStringLiteral("<=");
    case Op::Greater:
        return QStringLiteral(">");
    case Op::GreaterEqual:
        return QStringLiteral(">=");
    default:
        return {};
    }
}

QString wrap(const QString& text, int precedence, int needed)
{
    return precedence < needed ? u'(' + text + u')' : text;
}

/// Date-times in SQLite's strftime form, always with milliseconds.
QString sqliteDateTime(int64_t msecs)
{
    QString text = invarianttext::formatDateTime(msecs, u' ');
    if (text.size() == 19)
        text += QStringLiteral(".000");
    return text;
}

QString sqliteTime(int32_t msecs)
{
    QString text = invarianttext::formatTime(msecs);
    if (text.size() == 8)
        text += QStringLiteral(".000");
    return text;
}
} // namespace

QString SqlTranslator::join(QStringList terms, QStringView op)
{
    // Databases parse "a OR b OR c..." into a tree as deep as the chain is long and refuse
    // deep ones (SQLite at 1000 levels); groups in parentheses keep the depth logarithmic.
    constexpr qsizetype groupSize = 32;
    while (terms.size() > groupSize) {
        QStringList groups;
        groups.reserve(terms.size() / groupSize + 1);
        for (qsizetype i = 0; i < terms.size(); i += groupSize)
            groups << u'(' + terms.mid(i, groupSize).join(op) + u')';
        terms = std::move(groups);
    }
    return terms.join(op);
}

SqlTranslator::SqlTranslator(
    SqlDialect dialect, std::function<QString(const FormulaExpr&)> columnName)
    : m_dialect(dialect)
    , m_columnName(std::move(columnName))
{ }

QString SqlTranslator::identifier(const QString& name)
{
    static const QRegularExpression plain(QStringLiteral("^[A-Za-z_][A-Za-z0-9_]*$"));
    // Words that SQLite, PostgreSQL or SQL Server reserve: such names must be quoted.
    static const QSet<QString> reserved = [] {
        QSet<QString> words;
        for (const char16_t* w : { u"ALL", u"AND", u"ANY", u"AS", u"ASC", u"BETWEEN", u"BY",
                 u"CASE", u"CAST", u"CHECK", u"COLLATE", u"COLUMN", u"CONSTRAINT", u"CREATE",
                 u"CROSS", u"CURRENT_DATE", u"CURRENT_TIME", u"CURRENT_TIMESTAMP", u"CURRENT_USER",
                 u"DEFAULT", u"DELETE", u"DESC", u"DISTINCT", u"DROP", u"ELSE", u"END", u"ESCAPE",
                 u"EXCEPT", u"EXISTS", u"FALSE", u"FOR", u"FOREIGN", u"FROM", u"FULL", u"GLOB",
                 u"GROUP", u"HAVING", u"IN", u"INDEX", u"INNER", u"INSERT", u"INTERSECT", u"INTO",
                 u"IS", u"ISNULL", u"JOIN", u"KEY", u"LEFT", u"LIKE", u"LIMIT", u"NATURAL", u"NOT",
                 u"NOTNULL", u"NULL", u"OFFSET", u"ON", u"OR", u"ORDER", u"OUTER", u"PRIMARY",
                 u"REFERENCES", u"RIGHT", u"SELECT", u"SESSION_USER", u"SET", u"SOME", u"TABLE",
                 u"THEN", u"TO", u"TRUE", u"UNION", u"UNIQUE", u"UPDATE", u"USER", u"USING",
                 u"VALUES", u"WHEN", u"WHERE", u"WITH" })
            words.insert(QString::fromUtf16(w));
        return words;
    }();
    if (plain.match(name).hasMatch() && !reserved.contains(name.toUpper()))
        return name;
    QString quoted = name;
    quoted.replace(u'"', QStringLiteral("\"\""));
    return u'"' + quoted + u'"';
}

QString SqlTranslator::qualifiedName(const QString& location)
{
    QStringList parts = location.split(u'.');
    for (QString& part : parts) {
        if (!part.isEmpty())
            part = identifier(part);
    }
    return parts.join(u'.');
}

QString SqlTranslator::textLiteral(const QString& text)
{
    QString quoted = text;
    quoted.replace(u'\'', QStringLiteral("''"));
    return u'\'' + quoted + u'\'';
}

std::optional<QString> SqlTranslator::literal(SqlDialect dialect, const Value& value)
{
    switch (value.type()) {
    case ValueType::Number:
        return invarianttext::formatNumber(value.toNumber());
    case ValueType::String:
        if (value.text().contains(QChar(0)))
            return std::nullopt;
        return textLiteral(value.text());
    case ValueType::Date: {
        const QString text = textLiteral(invarianttext::formatDate(value.julianDay()));
        switch (dialect) {
        case SqlDialect::SQLite:
            return text;
        case SqlDialect::PostgreSQL:
            return u"DATE " + text;
        case SqlDialect::Generic:
            return u"{d " + text + u'}';
        }
        break;
    }
    case ValueType::DateTime: {
        const QString text = textLiteral(sqliteDateTime(value.dateTimeMsecs()));
        switch (dialect) {
        case SqlDialect::SQLite:
            return text;
        case SqlDialect::PostgreSQL:
            return u"TIMESTAMP " + text;
        case SqlDialect::Generic:
            return u"{ts " + text + u'}';
        }
        break;
    }
    case ValueType::Time: {
        switch (dialect) {
        case SqlDialect::SQLite:
            return textLiteral(sqliteTime(value.msecsOfDay()));
        case SqlDialect::PostgreSQL:
            return u"TIME " + textLiteral(sqliteTime(value.msecsOfDay()));
        case SqlDialect::Generic:
            if (value.msecsOfDay() % 1000 != 0)
                return std::nullopt;
            return u"{t " + textLiteral(invarianttext::formatTime(value.msecsOfDay())) + u'}';
        }
        break;
    }
    default:
        break;
    }
    return std::nullopt;
}

const FormulaExpr& SqlTranslator::unwrap(const FormulaExpr& e) const
{
    const FormulaExpr* current = &e;
    while (current->kind == Kind::Formula && current->body)
        current = current->body.get();
    return *current;
}

bool SqlTranslator::isFieldOperand(const FormulaExpr& e) const
{
    return unwrap(e).kind == Kind::Field;
}

QString SqlTranslator::textCollation() const
{
    return m_dialect == SqlDialect::SQLite ? QStringLiteral(" COLLATE BINARY")
                                           : QStringLiteral(" COLLATE \"C\"");
}

std::optional<QString> SqlTranslator::operand(const FormulaExpr& node, ValueType as) const
{
    const FormulaExpr& e = unwrap(node);
    if (e.isArray)
        return std::nullopt;
    if (e.kind == Kind::Literal) {
        if (e.literal.type() != as)
            return std::nullopt;
        return literal(m_dialect, e.literal);
    }
    if (e.kind != Kind::Field || e.type != as)
        return std::nullopt;
    const QString column = m_columnName(e);
    switch (as) {
    case ValueType::Number:
        return column;
    case ValueType::String:
        if (m_dialect == SqlDialect::Generic)
            return std::nullopt;
        return column + textCollation();
    case ValueType::Date:
        return m_dialect == SqlDialect::SQLite ? u"date(" + column + u')' : column;
    case ValueType::DateTime:
        return m_dialect == SqlDialect::SQLite ? u"strftime('%Y-%m-%d %H:%M:%f', " + column + u')'
                                               : column;
    case ValueType::Time:
        return m_dialect == SqlDialect::SQLite ? u"strftime('%H:%M:%f', " + column + u')' : column;
    default:
        return std::nullopt;
    }
}

std::optional<SqlTranslator::Sql> SqlTranslator::compare(
    const FormulaExpr& a, const QString& op, const FormulaExpr& b) const
{
    const FormulaExpr& x = unwrap(a);
    const FormulaExpr& y = unwrap(b);
    if (!isFieldOperand(x) && !isFieldOperand(y))
        return std::nullopt;
    if (x.type != y.type)
        return std::nullopt; // number with currency, date with date-time: not translated
    if (x.type == ValueType::Boolean) {
        // "{T.Flag} = True" is the flag itself, "= False" its negation.
        const FormulaExpr& field = isFieldOperand(x) ? x : y;
        const FormulaExpr& other = isFieldOperand(x) ? y : x;
        if (other.kind != Kind::Literal || other.literal.isNull() || (op != u"=" && op != u"<>"))
            return std::nullopt;
        auto flag = condition(field);
        if (!flag)
            return std::nullopt;
        const bool wantTrue = other.literal.toBoolean() == (op == u"=");
        if (wantTrue)
            return flag;
        return Sql { u"NOT " + wrap(flag->text, flag->precedence, 3), 3 };
    }
    const auto left = operand(x, x.type);
    const auto right = operand(y, y.type);
    if (!left || !right)
        return std::nullopt;
    return Sql { *left + u' ' + op + u' ' + *right, 4 };
}

std::optional<SqlTranslator::Sql> SqlTranslator::membership(const FormulaExpr& e) const
{
    const FormulaExpr& needle = unwrap(*e.children[0]);
    const FormulaExpr& list = unwrap(*e.children[1]);
    if (needle.kind != Kind::Field)
        return std::nullopt;
    std::vector<Value> values;
    if (list.kind == Kind::Parameter) {
        values = list.list;
    } else if (list.kind == Kind::List) {
        for (const auto& item : list.children) {
            const FormulaExpr& v = unwrap(*item);
            if (v.kind != Kind::Literal)
                return std::nullopt;
            values.push_back(v.literal);
        }
    } else {
        return std::nullopt;
    }
    // An empty list, or a Null in it, would make SQL's IN differ from the formula.
    if (values.empty())
        return std::nullopt;
    const auto column = operand(needle, needle.type);
    if (!column || needle.type == ValueType::Boolean)
        return std::nullopt;
    QStringList items;
    for (const Value& v : values) {
        if (v.type() != needle.type)
            return std::nullopt;
        const auto text = literal(m_dialect, v);
        if (!text)
            return std::nullopt;
        items << *text;
    }
    return Sql { *column + u" IN (" + items.join(QStringLiteral(", ")) + u')', 4 };
}

std::optional<SqlTranslator::Sql> SqlTranslator::condition(const FormulaExpr& node) const
{
    const FormulaExpr& e = unwrap(node);
    if (e.type != ValueType::Boolean || e.isArray)
        return std::nullopt;
    switch (e.kind) {
    case Kind::Literal:
        if (e.literal.isNull()) {
            if (m_dialect == SqlDialect::Generic)
                return std::nullopt;
            return Sql { QStringLiteral("NULL"), 5 };
        }
        return Sql { e.literal.toBoolean() ? QStringLiteral("1 = 1") : QStringLiteral("1 = 0"), 4 };
    case Kind::Field: {
        const QString column = m_columnName(e);
        if (m_dialect == SqlDialect::PostgreSQL)
            return Sql { column, 5 };
        return Sql { column + u" <> 0", 4 };
    }
    case Kind::Not: {
        const auto inner = condition(*e.children[0]);
        if (!inner)
            return std::nullopt;
        return Sql { u"NOT " + wrap(inner->text, inner->precedence, 3), 3 };
    }
    case Kind::And:
    case Kind::Or: {
        const int level = e.kind == Kind::And ? 2 : 1;
        QStringList terms;
        terms.reserve(static_cast<qsizetype>(e.children.size()));
        for (const auto& child : e.children) {
            const auto term = condition(*child);
            if (!term)
                return std::nullopt;
            terms << wrap(term->text, term->precedence, level);
        }
        return Sql { join(terms, e.kind == Kind::And ? u" AND " : u" OR "), level };
    }
    case Kind::Compare:
        return compare(*e.children[0], opText(e.op), *e.children[1]);
    case Kind::InList:
        return membership(e);
    case Kind::InRange: {
        const FormulaExpr& x = unwrap(*e.children[0]);
        if (x.kind != Kind::Field)
            return std::nullopt;
        const auto low = compare(x, QStringLiteral(">="), *e.children[1]);
        const auto high = compare(x, QStringLiteral("<="), *e.children[2]);
        if (!low || !high || x.type == ValueType::Boolean)
            return std::nullopt;
        return Sql { u'(' + low->text + u" AND " + high->text + u')', 5 };
    }
    case Kind::Call: {
        if (e.function != FormulaFunction::IsNull)
            return std::nullopt;
        const FormulaExpr& x = unwrap(*e.children[0]);
        if (x.kind != Kind::Field)
            return std::nullopt;
        return Sql { m_columnName(x) + u" IS NULL", 4 };
    }
    case Kind::Like:
    case Kind::StartsWith:
    case Kind::InString: {
        if (m_dialect == SqlDialect::Generic)
            return std::nullopt;
        // Like and StartsWith test the left text; In tests the right one.
        const bool haystackLeft = e.kind != Kind::InString;
        const FormulaExpr& text = unwrap(*e.children[haystackLeft ? 0 : 1]);
        const FormulaExpr& constant = unwrap(*e.children[haystackLeft ? 1 : 0]);
        if (text.kind != Kind::Field || constant.kind != Kind::Literal
            || constant.literal.type() != ValueType::String)
            return std::nullopt;
        QString value = constant.literal.text();
        if (value.contains(QChar(0)))
            return std::nullopt;
        const QString column = m_columnName(text);
        const bool sqlite = m_dialect == SqlDialect::SQLite;
        if (e.kind == Kind::Like) {
            if (sqlite) {
                // GLOB matches "*" and "?" as the formula does, case-sensitively; only
                // "[" starts a character class and must be escaped.
                value.replace(u'[', QStringLiteral("[[]"));
                return Sql { column + u" GLOB " + textLiteral(value), 4 };
            }
            QString pattern;
            for (const QChar c : value) {
                if (c == u'*')
                    pattern += u'%';
                else if (c == u'?')
                    pattern += u'_';
                else if (c == u'%' || c == u'_' || c == u'\\')
                    pattern += u'\\' + QString(c);
                else
                    pattern += c;
            }
            return Sql { column + u" LIKE " + textLiteral(pattern) + u" ESCAPE '\\'", 4 };
        }
        if (e.kind == Kind::StartsWith) {
            // Lengths in characters (code points), as substr() and left() count them.
            const QString length = QString::number(value.toUcs4().size());
            const QString prefix = sqlite ? QString(u"substr(" + column + u", 1, " + length + u")")
                                          : QString(u"left(" + column + u", " + length + u")");
            return Sql { prefix + textCollation() + u" = " + textLiteral(value), 4 };
        }
        return Sql {
            (sqlite ? u"instr(" : u"strpos(") + column + u", " + textLiteral(value) + u") > 0", 4
        };
    }
    default:
        return std::nullopt;
    }
}

std::optional<QString> SqlTranslator::translate(const FormulaExpr& e) const
{
    const auto sql = condition(e);
    if (!sql)
        return std::nullopt;
    return sql->text;
}

} // namespace reportrt
