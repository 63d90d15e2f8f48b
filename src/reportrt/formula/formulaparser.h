#pragma once

#include "reportrt/formula/formulaexpr.h"

#include <QString>
#include <memory>

namespace reportrt {

/// Parses formula text into an untyped tree. An empty formula, or one of comments and
/// white space only, gives nullptr (a selection formula that selects every record).
/// Raises FormulaException with the position of the first fault.
class FormulaParser {
public:
    static std::unique_ptr<FormulaExpr> parse(const QString& text, const QString& formulaName);

    /// Nesting limit of parentheses, lists and operators: deeper input is refused instead
    /// of exhausting the stack.
    static constexpr int maxDepth = 200;
};

} // namespace reportrt
