#include "reportrt/formula/formulacompiler.h"
#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/formula/formulaparser.h"
#include "reportrtfixture.h"

#include <gtest/gtest.h>
#include <vector>

using namespace reportrt;

namespace {

/// Fields T.N (number), T.S (text), T.B (Boolean), T.D (date), T.C (currency), T.DT
/// (date-time); parameters P (number 5), M (text, several: "a", "b"), Unset (no value);
/// formulas Double = {T.N} * 2, Loop refers to itself, Ping/Pong to each other.
class TestEnvironment : public FormulaEnvironment {
public:
    std::optional<FieldBinding> field(const QString& table, const QString& field) override
    {
        if (table.compare(u"T", Qt::CaseInsensitive) != 0)
            return std::nullopt;
        static const std::pair<const char16_t*, ValueType> fields[] = { { u"N", ValueType::Number },
            { u"S", ValueType::String }, { u"B", ValueType::Boolean }, { u"D", ValueType::Date },
            { u"C", ValueType::Currency }, { u"DT", ValueType::DateTime } };
        for (int i = 0; i < 6; ++i) {
            if (field.compare(QStringView(fields[i].first), Qt::CaseInsensitive) == 0)
                return FieldBinding { fields[i].second, i };
        }
        return std::nullopt;
    }
    std::optional<ParameterBinding> parameter(const QString& name) override
    {
        if (name.compare(u"P", Qt::CaseInsensitive) == 0)
            return ParameterBinding { ValueType::Number, false, true, { Value::number(5) } };
        if (name.compare(u"M", Qt::CaseInsensitive) == 0)
            return ParameterBinding { ValueType::String, true, true,
                { Value::string(QStringLiteral("a")), Value::string(QStringLiteral("b")) } };
        if (name.compare(u"Unset", Qt::CaseInsensitive) == 0)
            return ParameterBinding { ValueType::Number, false, false, {} };
        return std::nullopt;
    }
    std::optional<QString> formulaText(const QString& name) override
    {
        if (name.compare(u"Double", Qt::CaseInsensitive) == 0)
            return QStringLiteral("{T.N} * 2");
        if (name.compare(u"Loop", Qt::CaseInsensitive) == 0)
            return QStringLiteral("{@Loop} + 1");
        if (name.compare(u"Ping", Qt::CaseInsensitive) == 0)
            return QStringLiteral("{@Pong}");
        if (name.compare(u"Pong", Qt::CaseInsensitive) == 0)
            return QStringLiteral("{@Ping}");
        return std::nullopt;
    }
};

std::vector<Value> record(Value n, Value s, Value b = Value::boolean(true))
{
    return { std::move(n), std::move(s), std::move(b),
        Value::date(QDate(2026, 12, 6).toJulianDay()), Value::currency(123400),
        Value::fromDateTime(QDateTime(QDate(2026, 12, 6), QTime(14, 30))) };
}

QString show(const Value& v)
{
    return v.isNull() ? QStringLiteral("<null>") : FormulaEvaluator::toText(v, 2);
}

QString evaluate(const QString& text, const std::vector<Value>& values)
{
    TestEnvironment environment;
    FormulaCompiler compiler(
        environment, FormulaCompiler::Mode::Bind, QDateTime(QDate(2026, 12, 6), QTime(10, 0)));
    const auto formula = compiler.compile(text, QStringLiteral("Test"));
    return show(FormulaEvaluator::evaluate(*formula, values.data()));
}

struct EvaluationCase {
    const char* name;
    const char16_t* formula;
    std::vector<Value> values;
    const char16_t* expected;
};

class FormulaEvaluation : public testing::TestWithParam<EvaluationCase> { };

TEST_P(FormulaEvaluation, GivesTheExpectedValue)
{
    const auto& c = GetParam();
    EXPECT_EQ(evaluate(QString::fromUtf16(c.formula), c.values), QString::fromUtf16(c.expected));
}

const Value null;
const Value ten = Value::number(10);
const Value text = Value::string(QStringLiteral("Alpha"));

INSTANTIATE_TEST_SUITE_P(Formulas, FormulaEvaluation,
    testing::Values(
        EvaluationCase { "Precedence", u"1 + 2 * 3 - 4 / 2", record(ten, text), u"5.00" },
        EvaluationCase { "FieldArithmetic", u"{T.N} * 2 + {?P}", record(ten, text), u"25.00" },
        EvaluationCase { "FieldNamesIgnoreCase", u"{t.n} + {?p}", record(ten, text), u"15.00" },
        EvaluationCase { "FormulaField", u"{@Double} + 1", record(ten, text), u"21.00" },
        EvaluationCase {
            "Concatenation", u"{T.S} & '-' & {T.N}", record(ten, text), u"Alpha-10.00" },
        EvaluationCase { "DoubledQuotes", u"'it''s' & \"say \"\"hi\"\"\"", record(ten, text),
            u"it'ssay \"hi\"" },
        EvaluationCase {
            "TextComparisonIsCaseSensitive", u"{T.S} = 'alpha'", record(ten, text), u"False" },
        EvaluationCase { "CodePointOrder", u"'\U0001F600' > '\uFFFD'", record(ten, text), u"True" },
        EvaluationCase { "InList", u"{T.N} In [1, 10, 100]", record(ten, text), u"True" },
        EvaluationCase { "InRange", u"{T.N} In 10 To 20", record(ten, text), u"True" },
        EvaluationCase { "InText", u"'lph' In {T.S}", record(ten, text), u"True" },
        EvaluationCase { "MultiValueParameterEquals", u"'b' = {?M}", record(ten, text), u"True" },
        EvaluationCase {
            "MultiValueParameterNotEquals", u"'c' <> {?M}", record(ten, text), u"True" },
        EvaluationCase { "Like", u"{T.S} Like 'A?p*'", record(ten, text), u"True" },
        EvaluationCase { "LikeIsCaseSensitive", u"{T.S} Like 'a*'", record(ten, text), u"False" },
        EvaluationCase { "StartsWith", u"{T.S} StartsWith 'Al'", record(ten, text), u"True" },
        EvaluationCase { "TextFunctions",
            u"UpperCase(Left(Trim('  ab  '), 1)) & LowerCase(Right('XYZ', 2)) & Mid('abcdef', 2, "
            u"3)",
            record(ten, text), u"Ayzbcd" },
        EvaluationCase { "LenAndInStr",
            u"Len('hello') * 10 + InStr('hello', 'l') + InStr(4, 'hello', 'l')", record(ten, text),
            u"57.00" },
        EvaluationCase { "ToNumberAndRound", u"Round(ToNumber('2.345'), 2) + Round(-2.5)",
            record(ten, text), u"-0.65" },
        EvaluationCase { "ToTextDecimals",
            u"ToText(2.5, 0) & '|' & ToText(True) & '|' & ToText(#2026-12-06#)", record(ten, text),
            u"3|True|2026-12-06" },
        EvaluationCase { "DateLiteralAndParts",
            u"Year(#2026-12-06#) * 10000 + Month({T.D}) * 100 + Day(Date(2026, 2, 3))",
            record(ten, text), u"20261203.00" },
        EvaluationCase { "DateArithmetic", u"#2026-12-06# - #2026-11-30# + Day(#2026-12-31# + 1)",
            record(ten, text), u"7.00" },
        EvaluationCase { "DateWithDateTime", u"{T.DT} > {T.D} And {T.DT} < {T.D} + 1",
            record(ten, text), u"True" },
        EvaluationCase { "DateTimeFunction", u"DateTime(2026, 12, 6, 14, 30, 0) = {T.DT}",
            record(ten, text), u"True" },
        EvaluationCase { "CurrentDateIsFixedForTheRun", u"CurrentDate = #2026-12-06#",
            record(ten, text), u"True" },
        EvaluationCase { "CurrencyKeepsCents", u"{T.C} + 0.01", record(ten, text), u"12.35" },
        EvaluationCase {
            "UsDateLiteral", u"#12/6/2026# = #2026-12-06#", record(ten, text), u"True" },
        // The Null rule: operators and functions give Null, IsNull does not, and And, Or
        // and Not follow three-valued logic.
        EvaluationCase { "NullArithmetic", u"{T.N} + 1", record(null, text), u"<null>" },
        EvaluationCase { "NullComparison", u"{T.N} = 1", record(null, text), u"<null>" },
        EvaluationCase { "NullFunction", u"UpperCase({T.S})", record(ten, null), u"<null>" },
        EvaluationCase { "NullConcatenation", u"'x' & {T.S}", record(ten, null), u"<null>" },
        EvaluationCase { "IsNull", u"IsNull({T.N})", record(null, text), u"True" },
        EvaluationCase { "FalseAndNull", u"{T.N} = 1 And False", record(null, text), u"False" },
        EvaluationCase { "TrueAndNull", u"True And {T.N} = 1", record(null, text), u"<null>" },
        EvaluationCase { "TrueOrNull", u"{T.N} = 1 Or True", record(null, text), u"True" },
        EvaluationCase { "FalseOrNull", u"False Or {T.N} = 1", record(null, text), u"<null>" },
        // Chains of three or more operands decide at the first deciding operand wherever it
        // stands; a Null that decides nothing makes the chain Null.
        EvaluationCase {
            "NullChainOrDecidedLast", u"False Or {T.N} = 1 Or True", record(null, text), u"True" },
        EvaluationCase {
            "NullChainOrUndecided", u"False Or {T.N} = 1 Or False", record(null, text), u"<null>" },
        EvaluationCase { "NullChainAndDecidedLast", u"True And {T.N} = 1 And False",
            record(null, text), u"False" },
        EvaluationCase { "NullChainAndUndecided", u"{T.N} = 1 And True And True",
            record(null, text), u"<null>" },
        EvaluationCase { "MixedChainPrecedence", u"False Or True And False Or {T.N} = 10 And True",
            record(ten, text), u"True" },
        EvaluationCase { "NotNull", u"Not ({T.N} = 1)", record(null, text), u"<null>" },
        EvaluationCase { "NullInList", u"{T.N} In [1, 2]", record(null, text), u"<null>" },
        EvaluationCase { "NullBoolean", u"Not {T.B}", record(ten, text, null), u"<null>" },
        EvaluationCase {
            "IsNullGuard", u"IsNull({T.S}) Or {T.S} = ''", record(ten, null), u"True" },
        // The markers the component writes around the author's formula.
        EvaluationCase { "SelectionMarkers",
            u"(//LUD#1\r\n{T.S} = 'Alpha'\r\n)//LUD#2\r\n//LUDSELECTION\r\nAND ({T.N}=10)",
            record(ten, text), u"True" },
        EvaluationCase { "SelectionOnlyMarkers",
            u"(//LUDSELECTIONONLY\r\n{T.N}=10)\r\n//USERSELECTION", record(ten, text), u"True" },
        EvaluationCase { "CommentOnlyAuthorPart", u"// all records\r\n//LUDSELECTION\r\n{T.N}=11",
            record(ten, text), u"False" },
        EvaluationCase { "LineBreaksAnywhere", u"{T.N}\n>\r\n5\rAnd\n{T.S}\r\n<>\n''",
            record(ten, text), u"True" }),
    [](const testing::TestParamInfo<EvaluationCase>& param) { return param.param.name; });

struct ErrorCase {
    const char* name;
    const char16_t* formula;
    int line;
    int column;
    const char16_t* message;
};

class FormulaErrors : public testing::TestWithParam<ErrorCase> { };

TEST_P(FormulaErrors, NameThePositionAndTheProblem)
{
    const auto& c = GetParam();
    TestEnvironment environment;
    FormulaCompiler compiler(environment, FormulaCompiler::Mode::Bind);
    try {
        compiler.compile(QString::fromUtf16(c.formula), QStringLiteral("Test"));
        FAIL() << "no error for " << c.name;
    } catch (const FormulaException& error) {
        EXPECT_EQ(error.error().position.line, c.line);
        EXPECT_EQ(error.error().position.column, c.column);
        EXPECT_TRUE(error.error().message.contains(QString::fromUtf16(c.message)))
            << error.error().describe().toStdString();
        EXPECT_TRUE(error.error().describe().startsWith(u"Error in formula "))
            << error.error().describe().toStdString();
    }
}

INSTANTIATE_TEST_SUITE_P(Formulas, FormulaErrors,
    testing::Values(ErrorCase { "UnknownField", u"{T.N} > 1 And\r\n  {T.Missing} = 2", 2, 3,
                        u"unknown field {T.Missing}" },
        ErrorCase { "UnknownTable", u"{X.N} = 1", 1, 1, u"unknown field" },
        ErrorCase { "UnknownParameter", u"{?Nope} = 1", 1, 1, u"unknown parameter" },
        ErrorCase { "ParameterWithoutValue", u"{T.N} = {?Unset}", 1, 9, u"has no value" },
        ErrorCase { "UnknownFormula", u"{@Nope}", 1, 1, u"unknown formula" },
        ErrorCase { "SelfReference", u"{@Loop}", 1, 1, u"refers to itself" },
        ErrorCase { "MutualReference", u"1 + {@Ping}", 1, 1, u"refers to itself" },
        ErrorCase { "UnclosedText", u"{T.S} = 'abc", 1, 9, u"not closed" },
        ErrorCase { "UnclosedParenthesis", u"({T.N} = 1", 1, 11, u"expected ')'" },
        ErrorCase { "TrailingInput", u"{T.N} = 1 2", 1, 11, u"after the end" },
        ErrorCase { "TypeMismatch", u"{T.S} + 1", 1, 7, u"cannot combine" },
        ErrorCase { "ComparisonTypes", u"{T.S} = {T.N}", 1, 7, u"cannot compare" },
        ErrorCase { "AndNeedsBoolean", u"{T.N} And True", 1, 1, u"Boolean" },
        ErrorCase { "UnknownFunction", u"Frobnicate({T.N})", 1, 1, u"unknown name" },
        ErrorCase { "WrongArity", u"Left('abc')", 1, 1, u"takes 2 argument" },
        ErrorCase { "BadDateLiteral", u"{T.D} = #2026-02-30#", 1, 9, u"not a date" },
        ErrorCase { "StrayCharacter", u"{T.N} = 1 $", 1, 11, u"unexpected character" },
        ErrorCase { "ListOutsideIn", u"{?M} & 'x'", 1, 1, u"list of values" },
        ErrorCase { "EmptyFieldName", u"{} = 1", 1, 1, u"empty field name" },
        ErrorCase { "MissingOperand", u"{T.N} = ", 1, 9, u"ends where a value is expected" }),
    [](const testing::TestParamInfo<ErrorCase>& param) { return param.param.name; });

TEST(FormulaRuntimeErrors, NameTheOperation)
{
    TestEnvironment environment;
    FormulaCompiler compiler(environment, FormulaCompiler::Mode::Bind);
    const auto formula
        = compiler.compile(QStringLiteral("1 / ({T.N} - 10) > 0"), QStringLiteral("Test"));
    const auto values = record(ten, text);
    try {
        FormulaEvaluator::evaluate(*formula, values.data());
        FAIL();
    } catch (const FormulaException& error) {
        EXPECT_EQ(error.error().message, u"division by zero");
        EXPECT_EQ(error.error().position.column, 3);
    }
}

TEST(FormulaRuntimeErrors, ToNumberOfTextThatIsNoNumber)
{
    EXPECT_THROW(evaluate(QStringLiteral("ToNumber({T.S})"), record(ten, text)), FormulaException);
}

TEST(FormulaParsing, EmptyAndCommentOnlyFormulasSelectEverything)
{
    TestEnvironment environment;
    FormulaCompiler compiler(environment, FormulaCompiler::Mode::Check);
    EXPECT_EQ(compiler.compile(QString(), QStringLiteral("Test")), nullptr);
    EXPECT_EQ(
        compiler.compile(QStringLiteral("  // nothing\r\n// at all  \r\n"), QStringLiteral("Test")),
        nullptr);
    EXPECT_TRUE(FormulaEvaluator::isTrue(nullptr, nullptr));
}

TEST(FormulaParsing, HostileNestingIsRefusedNotCrashed)
{
    TestEnvironment environment;
    FormulaCompiler compiler(environment, FormulaCompiler::Mode::Check);
    const QString parentheses = QString(100000, u'(') + u'1' + QString(100000, u')');
    EXPECT_THROW(compiler.compile(parentheses, QStringLiteral("Test")), FormulaException);
    // Nesting by parentheses counts however the operators inside are chained.
    QString nestedOr = QStringLiteral("True");
    for (int i = 0; i < FormulaParser::maxDepth; ++i)
        nestedOr = u'(' + nestedOr + u" Or False)";
    EXPECT_THROW(compiler.compile(nestedOr, QStringLiteral("Test")), FormulaException);
    // Arithmetic chains are trees one level deeper per operator.
    QString sum = QStringLiteral("1");
    for (int i = 0; i < 50000; ++i)
        sum += QStringLiteral(" + 1");
    EXPECT_THROW(compiler.compile(sum, QStringLiteral("Test")), FormulaException);
    QString nots;
    for (int i = 0; i < 50000; ++i)
        nots += QStringLiteral("Not ");
    EXPECT_THROW(compiler.compile(nots + u"True", QStringLiteral("Test")), FormulaException);
}

TEST(FormulaParsing, LongFlatAndOrChainsAreNoNesting)
{
    TestEnvironment environment;
    FormulaCompiler binder(environment, FormulaCompiler::Mode::Bind);
    FormulaCompiler checker(environment, FormulaCompiler::Mode::Check);
    const std::vector<Value> values
        = record(Value::number(10), Value::string(QStringLiteral("Alpha")));
    // 50,000 operands: deep enough to overflow the stack of any recursive walk, also
    // under ASan, if a chain were a tree of two-operand nodes.
    QString orChain = QStringLiteral("{T.N} = 0");
    QString andChain = QStringLiteral("{T.N} > 0");
    for (int i = 1; i < 50000; ++i) {
        orChain += QStringLiteral(" Or {T.N} = %1").arg(i * 20);
        andChain += QStringLiteral(" And {T.N} <> %1").arg(i * 20 + 1);
    }
    for (FormulaCompiler* compiler : { &binder, &checker }) {
        const auto ored = compiler->compile(orChain, QStringLiteral("Test"));
        ASSERT_NE(ored, nullptr);
        EXPECT_FALSE(FormulaEvaluator::isTrue(ored.get(), values.data()))
            << "10 is no multiple of 20";
        const auto anded = compiler->compile(andChain, QStringLiteral("Test"));
        ASSERT_NE(anded, nullptr);
        EXPECT_TRUE(FormulaEvaluator::isTrue(anded.get(), values.data()));
        EXPECT_EQ(FormulaCompiler::conjuncts(anded.get()).size(), 50000u);
    }
}

TEST(FormulaParsing, ConjunctsSplitTopLevelAndOnly)
{
    TestEnvironment environment;
    FormulaCompiler compiler(environment, FormulaCompiler::Mode::Check);
    const auto formula = compiler.compile(
        QStringLiteral("({T.N} = 1 Or {T.N} = 2) And {T.S} = 'a' And ({T.B} And Not {T.B})"),
        QStringLiteral("Test"));
    EXPECT_EQ(FormulaCompiler::conjuncts(formula.get()).size(), 4u);
}

struct LikeCase {
    const char16_t* text;
    const char16_t* pattern;
    bool matches;
};

TEST(FormulaLike, MatchesStarsAndQuestionMarksByCharacter)
{
    const LikeCase cases[] = {
        { u"", u"", true },
        { u"", u"*", true },
        { u"abc", u"a*c", true },
        { u"abc", u"a?c", true },
        { u"abc", u"a?", false },
        { u"aXbXc", u"*X*X*", true },
        { u"aaaaaaaaaaaaaaaaaaaaaaaaaaaaab", u"*a*a*a*a*a*a*c", false },
        { u"\U0001F600x", u"?x", true }, // one character outside the BMP
        { u"[1]", u"[?]", true },
    };
    for (const auto& c : cases)
        EXPECT_EQ(FormulaEvaluator::like(QString::fromUtf16(c.text), QString::fromUtf16(c.pattern)),
            c.matches)
            << QString::fromUtf16(c.text).toStdString() << " Like "
            << QString::fromUtf16(c.pattern).toStdString();
}

} // namespace
