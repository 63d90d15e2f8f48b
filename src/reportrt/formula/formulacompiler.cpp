#include "reportrt/formula/formulacompiler.h"

#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/formula/formulaparser.h"

namespace reportrt {

namespace {

using Kind = FormulaExpr::Kind;
using Op = FormulaExpr::Op;

bool isNumeric(ValueType t)
{
    return t == ValueType::Number || t == ValueType::Currency;
}
bool isDateLike(ValueType t)
{
    return t == ValueType::Date || t == ValueType::DateTime;
}

/// Types whose values the comparison operators can order against each other.
bool comparable(ValueType a, ValueType b)
{
    if (a == ValueType::Binary || b == ValueType::Binary)
        return false;
    if (isNumeric(a) && isNumeric(b))
        return true;
    if (isDateLike(a) && isDateLike(b))
        return true;
    return a == b;
}

QString typeName(const FormulaExpr& e)
{
    return e.isArray ? QStringLiteral("a list of %1 values").arg(valueTypeName(e.type))
                     : QStringLiteral("a %1").arg(valueTypeName(e.type));
}

QString functionName(FormulaFunction f)
{
    static const char16_t* names[]
        = { u"IsNull", u"Trim", u"UpperCase", u"LowerCase", u"Left", u"Right", u"Mid", u"Len",
              u"InStr", u"ToText", u"ToNumber", u"Round", u"Abs", u"Year", u"Month", u"Day",
              u"CurrentDate", u"CurrentDateTime", u"CurrentTime", u"Date", u"DateTime", u"Time" };
    return QString::fromUtf16(names[static_cast<int>(f)]);
}

} // namespace

FormulaCompiler::FormulaCompiler(FormulaEnvironment& environment, Mode mode, QDateTime now)
    : m_environment(environment)
    , m_mode(mode)
    , m_now(std::move(now))
{ }

std::shared_ptr<const FormulaExpr> FormulaCompiler::compile(
    const QString& text, const QString& formulaName)
{
    std::unique_ptr<FormulaExpr> tree = FormulaParser::parse(text, formulaName);
    if (!tree)
        return nullptr;
    check(*tree, formulaName);
    if (m_mode == Mode::Bind)
        foldTree(tree);
    return std::shared_ptr<const FormulaExpr>(std::move(tree));
}

std::shared_ptr<const FormulaExpr> FormulaCompiler::compileFormulaField(const QString& name)
{
    const QString key = name.toLower();
    if (auto found = m_formulas.find(key); found != m_formulas.end())
        return found.value();
    const QString formulaName = u'@' + name;
    for (const QString& open : m_compiling) {
        if (open == key)
            throw FormulaException(
                { formulaName, {}, QStringLiteral("the formula refers to itself") });
    }
    const auto text = m_environment.formulaText(name);
    if (!text)
        throw FormulaException(
            { formulaName, {}, QStringLiteral("unknown formula {@%1}").arg(name) });
    m_compiling.push_back(key);
    auto body = compile(*text, formulaName);
    m_compiling.pop_back();
    if (!body)
        throw FormulaException({ formulaName, {}, QStringLiteral("the formula is empty") });
    m_formulas.insert(key, body);
    return body;
}

std::vector<const FormulaExpr*> FormulaCompiler::conjuncts(const FormulaExpr* formula)
{
    std::vector<const FormulaExpr*> result;
    if (!formula)
        return result;
    std::vector<const FormulaExpr*> stack { formula };
    while (!stack.empty()) {
        const FormulaExpr* e = stack.back();
        stack.pop_back();
        if (e->kind == Kind::And) {
            for (auto child = e->children.rbegin(); child != e->children.rend(); ++child)
                stack.push_back(child->get());
        } else if (e->kind == Kind::Formula && e->body && e->body->kind == Kind::And) {
            stack.push_back(e->body.get());
        } else {
            result.push_back(e);
        }
    }
    return result;
}

void FormulaCompiler::check(FormulaExpr& e, const QString& formulaName)
{
    const auto fail = [&](const QString& message) -> void {
        throw FormulaException({ formulaName, e.position, message });
    };
    const auto children = [&] {
        for (auto& child : e.children) {
            check(*child, formulaName);
            e.usesParameter = e.usesParameter || child->usesParameter;
        }
    };
    const auto scalar = [&](const FormulaExpr& child) {
        if (child.isArray)
            throw FormulaException({ formulaName, child.position,
                QStringLiteral("a list of values cannot be used here; compare with = or In") });
    };
    const auto allConstant = [&] {
        bool constant = true;
        for (const auto& child : e.children)
            constant = constant && child->isConstant;
        return constant;
    };

    switch (e.kind) {
    case Kind::Literal:
        e.type = e.literal.type();
        e.isConstant = true;
        return;
    case Kind::Field: {
        const auto binding = m_environment.field(e.table, e.name);
        if (!binding)
            fail(QStringLiteral("unknown field {%1.%2}").arg(e.table, e.name));
        e.type = binding->type;
        e.column = binding->column;
        e.isConstant = false;
        return;
    }
    case Kind::Parameter: {
        auto binding = m_environment.parameter(e.name);
        if (!binding)
            fail(QStringLiteral("unknown parameter {?%1}").arg(e.name));
        e.type = binding->type;
        e.isArray = binding->allowsMultipleValues;
        e.isConstant = true;
        e.usesParameter = true;
        if (m_mode == Mode::Bind) {
            if (!binding->hasValues || binding->values.empty())
                fail(QStringLiteral("the parameter {?%1} has no value").arg(e.name));
            if (e.isArray) {
                e.list = std::move(binding->values);
            } else {
                e.kind = Kind::Literal;
                e.literal = binding->values.front();
            }
        }
        return;
    }
    case Kind::Formula: {
        const QString key = e.name.toLower();
        for (const QString& open : m_compiling) {
            if (open == key)
                fail(QStringLiteral("{@%1} refers to itself").arg(e.name));
        }
        if (!m_formulas.contains(key) && !m_environment.formulaText(e.name))
            fail(QStringLiteral("unknown formula {@%1}").arg(e.name));
        e.body = compileFormulaField(e.name);
        e.type = e.body->type;
        e.isArray = e.body->isArray;
        e.isConstant = e.body->isConstant;
        e.usesParameter = e.body->usesParameter;
        return;
    }
    case Kind::List: {
        children();
        e.isArray = true;
        e.isConstant = allConstant();
        if (e.children.empty()) {
            e.type = ValueType::Null; // compares with anything; selects nothing
            return;
        }
        e.type = e.children.front()->type;
        for (const auto& child : e.children) {
            scalar(*child);
            if (!comparable(child->type, e.type))
                throw FormulaException({ formulaName, child->position,
                    QStringLiteral("the list mixes %1 and %2 values")
                        .arg(valueTypeName(e.type), valueTypeName(child->type)) });
            if (child->type == ValueType::Number)
                e.type = ValueType::Number;
            if (child->type == ValueType::DateTime)
                e.type = ValueType::DateTime;
        }
        return;
    }
    case Kind::Negate: {
        children();
        const FormulaExpr& a = *e.children[0];
        scalar(a);
        if (!isNumeric(a.type))
            fail(QStringLiteral("'-' needs a number, not %1").arg(typeName(a)));
        e.type = a.type;
        e.isConstant = a.isConstant;
        return;
    }
    case Kind::Not: {
        children();
        const FormulaExpr& a = *e.children[0];
        scalar(a);
        if (a.type != ValueType::Boolean)
            fail(QStringLiteral("Not needs a Boolean, not %1").arg(typeName(a)));
        e.type = ValueType::Boolean;
        e.isConstant = a.isConstant;
        return;
    }
    case Kind::And:
    case Kind::Or: {
        children();
        for (const auto& child : e.children) {
            scalar(*child);
            if (child->type != ValueType::Boolean)
                throw FormulaException({ formulaName, child->position,
                    QStringLiteral("%1 needs Boolean operands, not %2")
                        .arg(e.kind == Kind::And ? u"And" : u"Or", typeName(*child)) });
        }
        e.type = ValueType::Boolean;
        e.isConstant = allConstant();
        return;
    }
    case Kind::Arithmetic: {
        children();
        const FormulaExpr& a = *e.children[0];
        const FormulaExpr& b = *e.children[1];
        scalar(a);
        scalar(b);
        const ValueType x = a.type;
        const ValueType y = b.type;
        ValueType result = ValueType::Null;
        switch (e.op) {
        case Op::Add:
            if (isNumeric(x) && isNumeric(y))
                result = (x == ValueType::Currency || y == ValueType::Currency)
                    ? ValueType::Currency
                    : ValueType::Number;
            else if (x == ValueType::String && y == ValueType::String)
                result = ValueType::String;
            else if (isDateLike(x) && y == ValueType::Number)
                result = x;
            else if (x == ValueType::Number && isDateLike(y))
                result = y;
            break;
        case Op::Subtract:
            if (isNumeric(x) && isNumeric(y))
                result = (x == ValueType::Currency || y == ValueType::Currency)
                    ? ValueType::Currency
                    : ValueType::Number;
            else if (isDateLike(x) && y == ValueType::Number)
                result = x;
            else if (isDateLike(x) && isDateLike(y))
                result = ValueType::Number;
            break;
        case Op::Multiply:
            if (isNumeric(x) && isNumeric(y)
                && !(x == ValueType::Currency && y == ValueType::Currency))
                result = (x == ValueType::Currency || y == ValueType::Currency)
                    ? ValueType::Currency
                    : ValueType::Number;
            break;
        case Op::Divide:
            if (isNumeric(x) && y == ValueType::Number)
                result = x;
            else if (x == ValueType::Currency && y == ValueType::Currency)
                result = ValueType::Number;
            else if (x == ValueType::Number && y == ValueType::Currency)
                result = ValueType::Number;
            break;
        default:
            break;
        }
        if (result == ValueType::Null) {
            static const char16_t* symbols[] = { u"", u"+", u"-", u"*", u"/" };
            fail(QStringLiteral("'%1' cannot combine %2 and %3")
                     .arg(QString::fromUtf16(symbols[static_cast<int>(e.op)]), typeName(a),
                         typeName(b)));
        }
        e.type = result;
        e.isConstant = allConstant();
        return;
    }
    case Kind::Concat: {
        children();
        for (const auto& child : e.children) {
            scalar(*child);
            if (child->type == ValueType::Binary)
                throw FormulaException({ formulaName, child->position,
                    QStringLiteral("'&' cannot join binary data") });
        }
        e.type = ValueType::String;
        e.isConstant = allConstant();
        return;
    }
    case Kind::Compare: {
        children();
        FormulaExpr& a = *e.children[0];
        FormulaExpr& b = *e.children[1];
        scalar(a);
        if (b.isArray && (e.op == Op::Equal || e.op == Op::NotEqual)) {
            // "{Orders.Region} = {?Regions}" means one of the values; "<>" none of them.
            if (!b.children.empty() || b.kind != Kind::List) {
                if (!comparable(a.type, b.type))
                    fail(QStringLiteral("'=' cannot compare %1 with %2")
                             .arg(typeName(a), typeName(b)));
            }
            const bool negate = e.op == Op::NotEqual;
            e.kind = Kind::InList;
            e.op = Op::None;
            e.type = ValueType::Boolean;
            e.isConstant = allConstant();
            if (negate) {
                auto inner = std::make_unique<FormulaExpr>();
                std::swap(*inner, e);
                e.kind = Kind::Not;
                e.position = inner->position;
                e.type = ValueType::Boolean;
                e.isConstant = inner->isConstant;
                e.children.clear();
                e.children.push_back(std::move(inner));
            }
            return;
        }
        scalar(b);
        if (!comparable(a.type, b.type) || a.type == ValueType::Binary)
            fail(QStringLiteral("cannot compare %1 with %2").arg(typeName(a), typeName(b)));
        e.type = ValueType::Boolean;
        e.isConstant = allConstant();
        return;
    }
    case Kind::InList: {
        children();
        FormulaExpr& a = *e.children[0];
        FormulaExpr& b = *e.children[1];
        scalar(a);
        if (!b.isArray) {
            if (a.type == ValueType::String && b.type == ValueType::String) {
                e.kind = Kind::InString;
                e.type = ValueType::Boolean;
                e.isConstant = allConstant();
                return;
            }
            fail(QStringLiteral(
                "In needs a list [..], a range a To b or a parameter with several values"));
        }
        if (!(b.kind == Kind::List && b.children.empty()) && !comparable(a.type, b.type))
            fail(QStringLiteral("cannot look for %1 in %2").arg(typeName(a), typeName(b)));
        e.type = ValueType::Boolean;
        e.isConstant = allConstant();
        return;
    }
    case Kind::InRange: {
        children();
        for (const auto& child : e.children)
            scalar(*child);
        const FormulaExpr& a = *e.children[0];
        for (size_t i = 1; i < 3; ++i) {
            if (!comparable(a.type, e.children[i]->type))
                throw FormulaException({ formulaName, e.children[i]->position,
                    QStringLiteral("cannot compare %1 with %2")
                        .arg(typeName(a), typeName(*e.children[i])) });
        }
        e.type = ValueType::Boolean;
        e.isConstant = allConstant();
        return;
    }
    case Kind::InString:
    case Kind::Like:
    case Kind::StartsWith: {
        children();
        for (const auto& child : e.children) {
            scalar(*child);
            if (child->type != ValueType::String)
                throw FormulaException({ formulaName, child->position,
                    QStringLiteral("%1 needs text, not %2")
                        .arg(e.kind == Kind::Like ? u"Like" : u"StartsWith", typeName(*child)) });
        }
        e.type = ValueType::Boolean;
        e.isConstant = allConstant();
        return;
    }
    case Kind::Call:
        children();
        checkCall(e, formulaName);
        return;
    }
}

void FormulaCompiler::checkCall(FormulaExpr& e, const QString& formulaName)
{
    const QString name = functionName(e.function);
    const auto fail = [&](const QString& message) -> void {
        throw FormulaException({ formulaName, e.position, message });
    };
    const size_t count = e.children.size();
    const auto arity = [&](size_t low, size_t high) {
        if (count < low || count > high) {
            if (low == high)
                fail(QStringLiteral("%1 takes %2 argument(s), not %3")
                         .arg(name)
                         .arg(low)
                         .arg(count));
            fail(QStringLiteral("%1 takes %2 to %3 arguments, not %4")
                     .arg(name)
                     .arg(low)
                     .arg(high)
                     .arg(count));
        }
    };
    const auto argType = [&](size_t i) { return e.children[i]->type; };
    const auto expect = [&](size_t i, bool ok, const QString& what) {
        if (e.children[i]->isArray || !ok)
            throw FormulaException({ formulaName, e.children[i]->position,
                QStringLiteral("argument %1 of %2 must be %3, not %4")
                    .arg(i + 1)
                    .arg(name, what, typeName(*e.children[i])) });
    };
    const QString number = QStringLiteral("a number");
    const QString text = QStringLiteral("text");
    const QString date = QStringLiteral("a date or date-time");

    bool constant = true;
    for (const auto& child : e.children)
        constant = constant && child->isConstant;
    e.isConstant = constant;

    switch (e.function) {
    case FormulaFunction::IsNull:
        arity(1, 1);
        expect(0, true, QString());
        e.type = ValueType::Boolean;
        return;
    case FormulaFunction::Trim:
    case FormulaFunction::UpperCase:
    case FormulaFunction::LowerCase:
        arity(1, 1);
        expect(0, argType(0) == ValueType::String, text);
        e.type = ValueType::String;
        return;
    case FormulaFunction::Left:
    case FormulaFunction::Right:
        arity(2, 2);
        expect(0, argType(0) == ValueType::String, text);
        expect(1, argType(1) == ValueType::Number, number);
        e.type = ValueType::String;
        return;
    case FormulaFunction::Mid:
        arity(2, 3);
        expect(0, argType(0) == ValueType::String, text);
        for (size_t i = 1; i < count; ++i)
            expect(i, argType(i) == ValueType::Number, number);
        e.type = ValueType::String;
        return;
    case FormulaFunction::Len:
        arity(1, 1);
        expect(0, argType(0) == ValueType::String, text);
        e.type = ValueType::Number;
        return;
    case FormulaFunction::InStr:
        arity(2, 3);
        if (count == 3) {
            expect(0, argType(0) == ValueType::Number, number);
            expect(1, argType(1) == ValueType::String, text);
            expect(2, argType(2) == ValueType::String, text);
        } else {
            expect(0, argType(0) == ValueType::String, text);
            expect(1, argType(1) == ValueType::String, text);
        }
        e.type = ValueType::Number;
        return;
    case FormulaFunction::ToText:
        arity(1, 2);
        expect(0, argType(0) != ValueType::Binary, QStringLiteral("a value"));
        if (count == 2) {
            expect(0, isNumeric(argType(0)), number);
            expect(1, argType(1) == ValueType::Number, number);
        }
        e.type = ValueType::String;
        return;
    case FormulaFunction::ToNumber:
        arity(1, 1);
        expect(0,
            argType(0) == ValueType::String || isNumeric(argType(0))
                || argType(0) == ValueType::Boolean,
            QStringLiteral("text, a number or a Boolean"));
        e.type = ValueType::Number;
        return;
    case FormulaFunction::Round:
        arity(1, 2);
        expect(0, isNumeric(argType(0)), number);
        if (count == 2)
            expect(1, argType(1) == ValueType::Number, number);
        e.type = argType(0);
        return;
    case FormulaFunction::Abs:
        arity(1, 1);
        expect(0, isNumeric(argType(0)), number);
        e.type = argType(0);
        return;
    case FormulaFunction::Year:
    case FormulaFunction::Month:
    case FormulaFunction::Day:
        arity(1, 1);
        expect(0, isDateLike(argType(0)), date);
        e.type = ValueType::Number;
        return;
    case FormulaFunction::CurrentDate:
    case FormulaFunction::CurrentDateTime:
    case FormulaFunction::CurrentTime:
        arity(0, 0);
        e.type = e.function == FormulaFunction::CurrentDate ? ValueType::Date
            : e.function == FormulaFunction::CurrentTime    ? ValueType::Time
                                                            : ValueType::DateTime;
        return;
    case FormulaFunction::Date:
        if (count == 1) {
            expect(0, isDateLike(argType(0)), date);
        } else {
            arity(3, 3);
            for (size_t i = 0; i < count; ++i)
                expect(i, argType(i) == ValueType::Number, number);
        }
        e.type = ValueType::Date;
        return;
    case FormulaFunction::DateTime:
        if (count == 1) {
            expect(0, isDateLike(argType(0)), date);
        } else if (count == 2) {
            expect(0, argType(0) == ValueType::Date, QStringLiteral("a date"));
            expect(1, argType(1) == ValueType::Time, QStringLiteral("a time"));
        } else {
            if (count != 3 && count != 6)
                fail(QStringLiteral("DateTime takes 1, 2, 3 or 6 arguments, not %1").arg(count));
            for (size_t i = 0; i < count; ++i)
                expect(i, argType(i) == ValueType::Number, number);
        }
        e.type = ValueType::DateTime;
        return;
    case FormulaFunction::Time:
        if (count == 1) {
            expect(0, argType(0) == ValueType::DateTime || argType(0) == ValueType::Time,
                QStringLiteral("a time or date-time"));
        } else {
            arity(3, 3);
            for (size_t i = 0; i < count; ++i)
                expect(i, argType(i) == ValueType::Number, number);
        }
        e.type = ValueType::Time;
        return;
    }
}

void FormulaCompiler::fold(std::unique_ptr<FormulaExpr>& e)
{
    if (!e->isConstant || e->kind == Kind::Literal || e->isArray)
        return;
    try {
        Value value = FormulaEvaluator::evaluate(*e, nullptr, m_now);
        auto literal = std::make_unique<FormulaExpr>();
        literal->kind = Kind::Literal;
        literal->position = e->position;
        literal->literal = std::move(value);
        literal->type = e->type; // a folded Null keeps the type of what it stands for
        literal->isConstant = true;
        literal->usesParameter = e->usesParameter;
        e = std::move(literal);
    } catch (const FormulaException&) {
        // Left as it is: the error is raised when a record reaches it, as without folding.
    }
}

void FormulaCompiler::foldTree(std::unique_ptr<FormulaExpr>& e)
{
    if (e->isConstant) {
        fold(e);
        if (e->kind == Kind::Literal)
            return;
    }
    for (auto& child : e->children)
        foldTree(child);
}

} // namespace reportrt
