#pragma once

#include "reportrt/formula/formulaexpr.h"

#include <QString>
#include <functional>
#include <optional>

namespace reportrt {

/// The SQL a database understands, chosen from the table's provider.
enum class SqlDialect { SQLite, PostgreSQL, Generic };

/// Translates conditions of a selection formula into SQL that selects exactly the same
/// records. Only what is provably equivalent translates; everything else stays with the
/// runtime's own evaluation:
/// - comparisons, In lists, In ranges, IsNull, Like, StartsWith and text In text on a field
///   against constants (or field against field), joined with And, Or and Not, which SQL
///   evaluates with the same three-valued logic as the formula's Null rule;
/// - text compares by code point in both: COLLATE BINARY (SQLite) or COLLATE "C"
///   (PostgreSQL) overrides whatever collation a column was declared with; generic ODBC
///   databases get no text conditions, their collation being unknown;
/// - dates, times and date-times are compared in one normal form (SQLite stores them as
///   text: date(), strftime() normalize them), currency not at all (its rounding to four
///   decimals is the runtime's).
class SqlTranslator {
public:
    /// columnName gives the SQL name of a database field node ("Orders.ID").
    SqlTranslator(SqlDialect dialect, std::function<QString(const FormulaExpr&)> columnName);

    /// The SQL condition, or nullopt when the condition does not translate.
    std::optional<QString> translate(const FormulaExpr& condition) const;

    /// A name as SQL writes it: plain identifiers as they are, anything else in double
    /// quotes.
    static QString identifier(const QString& name);
    /// A location "db.dbo.Orders" as a qualified SQL name.
    static QString qualifiedName(const QString& location);
    /// A constant as an SQL literal of the dialect, or nullopt.
    static std::optional<QString> literal(SqlDialect dialect, const Value& value);
    static QString textLiteral(const QString& text);
    /// Terms joined with op (" AND ", " OR "); each term must bind at least as tightly as
    /// op. Long lists come in nested groups of parentheses, so any number of terms stays
    /// within the expression depth a database parses.
    static QString join(QStringList terms, QStringView op);

private:
    struct Sql {
        QString text;
        int precedence = 0; // 1 OR, 2 AND, 3 NOT, 4 comparison, 5 primary
    };
    std::optional<Sql> condition(const FormulaExpr& e) const;
    std::optional<QString> operand(const FormulaExpr& e, ValueType as) const;
    std::optional<Sql> compare(const FormulaExpr& a, const QString& op, const FormulaExpr& b) const;
    std::optional<Sql> membership(const FormulaExpr& e) const;
    bool isFieldOperand(const FormulaExpr& e) const;
    const FormulaExpr& unwrap(const FormulaExpr& e) const;
    QString textCollation() const;

    SqlDialect m_dialect;
    std::function<QString(const FormulaExpr&)> m_columnName;
};

} // namespace reportrt
