#pragma once

#include "reportrt/formula/formulaexpr.h"

#include <QDateTime>

namespace reportrt {

/// Evaluates compiled formulas on one record.
///
/// The Null rule: a Null operand makes every operator and function Null, except IsNull
/// (True or False), and And, Or and Not, which follow three-valued logic (False And Null
/// is False, True Or Null is True, Not Null is Null). A record is selected only when the
/// selection formula is True. SQL follows the same rule, so a condition means the same
/// whether the database or the runtime evaluates it.
class FormulaEvaluator {
public:
    /// record: the values of the record's columns (FormulaExpr::column indexes it).
    /// Raises FormulaException (division by zero, a text that is no number...).
    static Value evaluate(const FormulaExpr& e, const Value* record, const QDateTime& now = {});

    /// Whether the formula is True for the record; nullptr selects every record.
    static bool isTrue(const FormulaExpr* e, const Value* record);

    /// Orders two non-Null values of comparable types (numbers with currency, dates with
    /// date-times): negative, zero or positive. Text compares by Unicode code point, as
    /// SQL's binary collations do.
    static int compare(const Value& a, const Value& b);
    static int compareText(const QString& a, const QString& b);

    /// The Like operator: "*" any run of characters, "?" one character, case-sensitive.
    static bool like(QStringView text, QStringView pattern);

    /// ToText of a value (numbers with two decimals, ISO dates).
    static QString toText(const Value& value, int decimals = 2);
};

} // namespace reportrt
