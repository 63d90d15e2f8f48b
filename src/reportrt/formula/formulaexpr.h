#pragma once

#include "core/textposition.h"
#include "reportrt/base/value.h"

#include <QString>
#include <memory>
#include <vector>

namespace reportrt {

using core::TextPosition;

enum class FormulaFunction {
    IsNull,
    Trim,
    UpperCase,
    LowerCase,
    Left,
    Right,
    Mid,
    Len,
    InStr,
    ToText,
    ToNumber,
    Round,
    Abs,
    Year,
    Month,
    Day,
    CurrentDate,
    CurrentDateTime,
    CurrentTime,
    Date,
    DateTime,
    Time,
};

/// A node of a formula: built by the parser with names only, then typed and bound by the
/// compiler, which also folds constants; evaluated per record and translated to SQL.
struct FormulaExpr {
    enum class Kind {
        Literal, // literal
        Field, // {Table.Field}: table, name; column after compiling
        Parameter, // {?Name}: name; bound values in list after compiling
        Formula, // {@Name}: name; body after compiling
        List, // [a, b, ...]: children
        Negate, // -child
        Not, // Not child
        Arithmetic, // child op child: + - * /
        Concat, // child & child
        Compare, // child op child
        And,
        Or,
        InList, // child In [list] or In {?Multi}: children[1] is a List or a Parameter
        InRange, // child In a To b
        InString, // text In text: containment
        Like,
        StartsWith,
        Call, // function(children)
    };
    enum class Op {
        None,
        Add,
        Subtract,
        Multiply,
        Divide,
        Equal,
        NotEqual,
        Less,
        LessEqual,
        Greater,
        GreaterEqual
    };

    Kind kind = Kind::Literal;
    Op op = Op::None;
    FormulaFunction function = FormulaFunction::IsNull;
    TextPosition position;
    QString table;
    QString name;
    Value literal;
    std::vector<Value> list; // bound values of a Parameter
    std::vector<std::unique_ptr<FormulaExpr>> children;
    std::shared_ptr<const FormulaExpr> body; // Formula

    // Set by the compiler.
    ValueType type = ValueType::Null;
    bool isArray = false; // a List, or a parameter that allows several values
    bool isConstant = false; // no field in it: the same value for every record
    // A parameter's value is in it, also after folding: such a condition holds for this
    // run's values only and must not be written into a statement that outlives the run.
    bool usesParameter = false;
    int column = -1; // Field: index of the record column
};

/// An error in a formula: where (1-based line and column within that formula's text) and
/// what. formulaName names the formula the position belongs to ("Record Selection",
/// "@Total").
struct FormulaError {
    QString formulaName;
    TextPosition position;
    QString message;

    /// "Error in formula @Total at line 2, column 5: unknown field {Orders.Foo}".
    QString describe() const;
};

/// Thrown by the parser, the compiler and the evaluator.
class FormulaException {
public:
    explicit FormulaException(FormulaError error)
        : m_error(std::move(error))
    { }
    const FormulaError& error() const { return m_error; }

private:
    FormulaError m_error;
};

} // namespace reportrt
