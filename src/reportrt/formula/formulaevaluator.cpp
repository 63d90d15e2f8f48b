#include "reportrt/formula/formulaevaluator.h"

#include "reportrt/base/invarianttext.h"

#include <cmath>
#include <limits>

namespace reportrt {

namespace {

using Kind = FormulaExpr::Kind;
using Op = FormulaExpr::Op;

[[noreturn]] void fail(const FormulaExpr& e, const QString& message)
{
    throw FormulaException({ QString(), e.position, message });
}

Value checkedNumber(const FormulaExpr& e, double value)
{
    if (!std::isfinite(value))
        fail(e, QStringLiteral("numeric overflow"));
    return Value::number(value);
}

Value checkedCurrency(const FormulaExpr& e, double amount)
{
    const auto scaled = invarianttext::currencyFromDouble(amount);
    if (!scaled)
        fail(e, QStringLiteral("currency overflow"));
    return Value::currency(*scaled);
}

int64_t dateTimeMsecs(const Value& v)
{
    return v.type() == ValueType::Date ? v.julianDay() * Value::msecsPerDay : v.dateTimeMsecs();
}

/// Whole number argument of a text function.
int64_t wholeNumber(const FormulaExpr& e, const Value& v, const char16_t* what)
{
    const double d = v.toNumber();
    if (!(std::fabs(d) < 2147483647.0))
        fail(e, QStringLiteral("%1 is out of range").arg(QStringView(what)));
    return static_cast<int64_t>(std::trunc(d));
}

Value arithmetic(const FormulaExpr& e, const Value& a, const Value& b)
{
    const ValueType x = a.type();
    const ValueType y = b.type();
    switch (e.op) {
    case Op::Add:
    case Op::Subtract: {
        const bool add = e.op == Op::Add;
        if (x == ValueType::String)
            return Value::string(a.text() + b.text());
        if (x == ValueType::Currency && y == ValueType::Currency) {
            int64_t result = 0;
            const bool overflow = add
                ? __builtin_add_overflow(a.currencyScaled(), b.currencyScaled(), &result)
                : __builtin_sub_overflow(a.currencyScaled(), b.currencyScaled(), &result);
            if (overflow)
                fail(e, QStringLiteral("currency overflow"));
            return Value::currency(result);
        }
        if (x == ValueType::Currency || y == ValueType::Currency)
            return checkedCurrency(e, add ? a.numeric() + b.numeric() : a.numeric() - b.numeric());
        if (x == ValueType::Number && y == ValueType::Number)
            return checkedNumber(
                e, add ? a.toNumber() + b.toNumber() : a.toNumber() - b.toNumber());
        if ((x == ValueType::Date || x == ValueType::DateTime)
            && (y == ValueType::Date || y == ValueType::DateTime)) {
            if (x == ValueType::Date && y == ValueType::Date)
                return Value::number(static_cast<double>(a.julianDay() - b.julianDay()));
            return Value::number(
                static_cast<double>(dateTimeMsecs(a) - dateTimeMsecs(b)) / Value::msecsPerDay);
        }
        // A date and a number of days, either way round.
        const Value& when = (x == ValueType::Number) ? b : a;
        double days = (x == ValueType::Number) ? a.toNumber() : b.toNumber();
        if (!add)
            days = -days;
        if (!(std::fabs(days) < 1e7))
            fail(e, QStringLiteral("the date is out of range"));
        if (when.type() == ValueType::Date) {
            const Value result
                = Value::date(when.julianDay() + static_cast<int64_t>(std::trunc(days)));
            if (!result.toQDate().isValid())
                fail(e, QStringLiteral("the date is out of range"));
            return result;
        }
        return Value::dateTime(when.dateTimeMsecs() + std::llround(days * Value::msecsPerDay));
    }
    case Op::Multiply:
        if (x == ValueType::Currency || y == ValueType::Currency)
            return checkedCurrency(e, a.numeric() * b.numeric());
        return checkedNumber(e, a.toNumber() * b.toNumber());
    case Op::Divide: {
        if (b.numeric() == 0)
            fail(e, QStringLiteral("division by zero"));
        if (x == ValueType::Currency && y == ValueType::Number)
            return checkedCurrency(e, a.numeric() / b.numeric());
        return checkedNumber(e, a.numeric() / b.numeric());
    }
    default:
        break;
    }
    fail(e, QStringLiteral("invalid operator"));
}

bool compareResult(Op op, int order)
{
    switch (op) {
    case Op::Equal:
        return order == 0;
    case Op::NotEqual:
        return order != 0;
    case Op::Less:
        return order < 0;
    case Op::LessEqual:
        return order <= 0;
    case Op::Greater:
        return order > 0;
    case Op::GreaterEqual:
        return order >= 0;
    default:
        return false;
    }
}

bool contains(
    const Value& needle, const FormulaExpr& list, const Value* record, const QDateTime& now)
{
    if (list.kind == Kind::Parameter) {
        for (const Value& v : list.list) {
            if (FormulaEvaluator::compare(needle, v) == 0)
                return true;
        }
        return false;
    }
    const FormulaExpr& source = list.kind == Kind::Formula ? *list.body : list;
    if (source.kind == Kind::Parameter)
        return contains(needle, source, record, now);
    for (const auto& item : source.children) {
        const Value v = FormulaEvaluator::evaluate(*item, record, now);
        if (!v.isNull() && FormulaEvaluator::compare(needle, v) == 0)
            return true;
    }
    return false;
}

Value call(const FormulaExpr& e, const Value* record, const QDateTime& now)
{
    // IsNull and the functions without arguments are the only ones that do not give
    // Null for a Null argument.
    if (e.function == FormulaFunction::IsNull)
        return Value::boolean(FormulaEvaluator::evaluate(*e.children[0], record, now).isNull());
    Value args[6];
    const size_t count = std::min<size_t>(e.children.size(), 6);
    for (size_t i = 0; i < count; ++i) {
        args[i] = FormulaEvaluator::evaluate(*e.children[i], record, now);
        if (args[i].isNull())
            return {};
    }
    const QDateTime current = now.isValid() ? now : QDateTime::currentDateTime();

    switch (e.function) {
    case FormulaFunction::IsNull:
        break;
    case FormulaFunction::Trim: {
        const QString& s = args[0].text();
        qsizetype start = 0;
        qsizetype end = s.size();
        while (start < end && s.at(start) == u' ')
            ++start;
        while (end > start && s.at(end - 1) == u' ')
            --end;
        return Value::string(s.mid(start, end - start));
    }
    case FormulaFunction::UpperCase:
        return Value::string(args[0].text().toUpper());
    case FormulaFunction::LowerCase:
        return Value::string(args[0].text().toLower());
    case FormulaFunction::Left:
    case FormulaFunction::Right: {
        const int64_t n = wholeNumber(e, args[1], u"the length");
        if (n < 0)
            fail(e, QStringLiteral("the length must not be negative"));
        return Value::string(
            e.function == FormulaFunction::Left ? args[0].text().left(n) : args[0].text().right(n));
    }
    case FormulaFunction::Mid: {
        const int64_t start = wholeNumber(e, args[1], u"the start");
        if (start < 1)
            fail(e, QStringLiteral("the start must be 1 or more"));
        int64_t length = -1;
        if (count == 3) {
            length = wholeNumber(e, args[2], u"the length");
            if (length < 0)
                fail(e, QStringLiteral("the length must not be negative"));
        }
        const QString& s = args[0].text();
        if (start > s.size())
            return Value::string(QString());
        return Value::string(s.mid(start - 1, length));
    }
    case FormulaFunction::Len:
        return Value::number(static_cast<double>(args[0].text().size()));
    case FormulaFunction::InStr: {
        int64_t start = 1;
        const Value* text = &args[0];
        const Value* find = &args[1];
        if (count == 3) {
            start = wholeNumber(e, args[0], u"the start");
            if (start < 1)
                fail(e, QStringLiteral("the start must be 1 or more"));
            text = &args[1];
            find = &args[2];
        }
        if (start > text->text().size() + 1)
            return Value::number(0);
        return Value::number(
            static_cast<double>(text->text().indexOf(find->text(), start - 1) + 1));
    }
    case FormulaFunction::ToText: {
        int decimals = 2;
        if (count == 2) {
            const int64_t d = wholeNumber(e, args[1], u"the number of decimals");
            if (d < 0 || d > 15)
                fail(e, QStringLiteral("the number of decimals must be 0 to 15"));
            decimals = static_cast<int>(d);
        }
        return Value::string(FormulaEvaluator::toText(args[0], decimals));
    }
    case FormulaFunction::ToNumber:
        switch (args[0].type()) {
        case ValueType::Boolean:
            return Value::number(args[0].toBoolean() ? 1 : 0);
        case ValueType::String: {
            const auto n = invarianttext::parseNumber(args[0].text());
            if (!n)
                fail(e, QStringLiteral("'%1' is not a number").arg(args[0].text().left(40)));
            return Value::number(*n);
        }
        default:
            return Value::number(args[0].numeric());
        }
    case FormulaFunction::Round: {
        int64_t places = 0;
        if (count == 2) {
            places = wholeNumber(e, args[1], u"the number of decimals");
            if (places < -15 || places > 15)
                fail(e, QStringLiteral("the number of decimals must be -15 to 15"));
        }
        const double factor = std::pow(10.0, static_cast<double>(places));
        // Half away from zero, as report authors expect from Round, and for the
        // decimal value written: 2.345 is 2.34499999... in binary but rounds up.
        const double scaled = args[0].numeric() * factor;
        const double whole = std::trunc(scaled);
        double rounded = std::round(scaled);
        if (std::fabs(std::fabs(scaled - whole) - 0.5) <= 1e-12 * std::max(1.0, std::fabs(scaled)))
            rounded = whole + (scaled < 0 ? -1.0 : 1.0);
        rounded /= factor;
        if (args[0].type() == ValueType::Currency)
            return checkedCurrency(e, rounded);
        return checkedNumber(e, rounded);
    }
    case FormulaFunction::Abs:
        if (args[0].type() == ValueType::Currency) {
            if (args[0].currencyScaled() == std::numeric_limits<int64_t>::min())
                fail(e, QStringLiteral("currency overflow"));
            return Value::currency(std::abs(args[0].currencyScaled()));
        }
        return Value::number(std::fabs(args[0].toNumber()));
    case FormulaFunction::Year:
        return Value::number(args[0].toQDate().year());
    case FormulaFunction::Month:
        return Value::number(args[0].toQDate().month());
    case FormulaFunction::Day:
        return Value::number(args[0].toQDate().day());
    case FormulaFunction::CurrentDate:
        return Value::fromDate(current.date());
    case FormulaFunction::CurrentDateTime:
        return Value::fromDateTime(current);
    case FormulaFunction::CurrentTime:
        return Value::fromTime(current.time());
    case FormulaFunction::Date: {
        if (count == 1)
            return Value::fromDate(args[0].toQDate());
        const int64_t y = wholeNumber(e, args[0], u"the year");
        const int64_t m = wholeNumber(e, args[1], u"the month");
        const int64_t d = wholeNumber(e, args[2], u"the day");
        const QDate date(static_cast<int>(y), static_cast<int>(m), static_cast<int>(d));
        if (!date.isValid() || y < 1 || y > 9999)
            fail(e, QStringLiteral("%1-%2-%3 is not a date").arg(y).arg(m).arg(d));
        return Value::fromDate(date);
    }
    case FormulaFunction::DateTime: {
        if (count == 1)
            return Value::dateTime(dateTimeMsecs(args[0]));
        if (count == 2)
            return Value::dateTime(args[0].julianDay() * Value::msecsPerDay + args[1].msecsOfDay());
        int64_t parts[6] = { 0, 0, 0, 0, 0, 0 };
        for (size_t i = 0; i < count; ++i)
            parts[i] = wholeNumber(e, args[i], u"a date-time part");
        const QDate date(
            static_cast<int>(parts[0]), static_cast<int>(parts[1]), static_cast<int>(parts[2]));
        const QTime time(
            static_cast<int>(parts[3]), static_cast<int>(parts[4]), static_cast<int>(parts[5]));
        if (!date.isValid() || !time.isValid() || parts[0] < 1 || parts[0] > 9999)
            fail(e, QStringLiteral("not a valid date-time"));
        return Value::fromDateTime(QDateTime(date, time));
    }
    case FormulaFunction::Time: {
        if (count == 1)
            return Value::fromTime(args[0].toQTime());
        const int64_t h = wholeNumber(e, args[0], u"the hour");
        const int64_t m = wholeNumber(e, args[1], u"the minute");
        const int64_t s = wholeNumber(e, args[2], u"the second");
        const QTime time(static_cast<int>(h), static_cast<int>(m), static_cast<int>(s));
        if (!time.isValid())
            fail(e, QStringLiteral("%1:%2:%3 is not a time").arg(h).arg(m).arg(s));
        return Value::fromTime(time);
    }
    }
    fail(e, QStringLiteral("unknown function"));
}

} // namespace

int FormulaEvaluator::compareText(const QString& a, const QString& b)
{
    const qsizetype n = std::min(a.size(), b.size());
    const char16_t* x = reinterpret_cast<const char16_t*>(a.constData());
    const char16_t* y = reinterpret_cast<const char16_t*>(b.constData());
    for (qsizetype i = 0; i < n; ++i) {
        if (x[i] == y[i])
            continue;
        // UTF-16 order differs from code point order only where surrogates meet
        // U+E000..U+FFFF; move surrogates above them.
        const auto fix = [](char16_t c) -> int {
            if (c >= 0xD800 && c <= 0xDFFF)
                return c + 0x2000;
            if (c >= 0xE000)
                return c - 0x800;
            return c;
        };
        return fix(x[i]) < fix(y[i]) ? -1 : 1;
    }
    return a.size() < b.size() ? -1 : (a.size() > b.size() ? 1 : 0);
}

int FormulaEvaluator::compare(const Value& a, const Value& b)
{
    const ValueType x = a.type();
    const ValueType y = b.type();
    if (x == ValueType::Currency && y == ValueType::Currency)
        return a.currencyScaled() < b.currencyScaled()
            ? -1
            : (a.currencyScaled() > b.currencyScaled() ? 1 : 0);
    if ((x == ValueType::Number || x == ValueType::Currency)
        && (y == ValueType::Number || y == ValueType::Currency)) {
        const double p = a.numeric();
        const double q = b.numeric();
        return p < q ? -1 : (p > q ? 1 : 0);
    }
    switch (x) {
    case ValueType::String:
        return compareText(a.text(), b.text());
    case ValueType::Boolean:
        return static_cast<int>(a.toBoolean()) - static_cast<int>(b.toBoolean());
    case ValueType::Date:
    case ValueType::DateTime: {
        if (x == ValueType::Date && y == ValueType::Date)
            return a.julianDay() < b.julianDay() ? -1 : (a.julianDay() > b.julianDay() ? 1 : 0);
        const int64_t p = dateTimeMsecs(a);
        const int64_t q = dateTimeMsecs(b);
        return p < q ? -1 : (p > q ? 1 : 0);
    }
    case ValueType::Time:
        return a.msecsOfDay() < b.msecsOfDay() ? -1 : (a.msecsOfDay() > b.msecsOfDay() ? 1 : 0);
    case ValueType::Binary:
        return a.bytes() < b.bytes() ? -1 : (a.bytes() == b.bytes() ? 0 : 1);
    default:
        return 0;
    }
}

namespace {
// Iterative matching with one back-tracking point for the last "*": linear in
// practice and never recursive, so hostile patterns cannot exhaust the stack.
template <class Char>
bool likeMatch(const Char* text, qsizetype textSize, const Char* pattern, qsizetype patternSize)
{
    qsizetype t = 0;
    qsizetype p = 0;
    qsizetype starP = -1;
    qsizetype starT = 0;
    while (t < textSize) {
        if (p < patternSize
            && (pattern[p] == Char('?') || (pattern[p] != Char('*') && pattern[p] == text[t]))) {
            ++t;
            ++p;
        } else if (p < patternSize && pattern[p] == Char('*')) {
            starP = p++;
            starT = t;
        } else if (starP >= 0) {
            p = starP + 1;
            t = ++starT;
        } else {
            return false;
        }
    }
    while (p < patternSize && pattern[p] == Char('*'))
        ++p;
    return p == patternSize;
}

bool hasSurrogates(QStringView text)
{
    for (const QChar c : text) {
        if (c.isSurrogate())
            return true;
    }
    return false;
}
} // namespace

bool FormulaEvaluator::like(QStringView text, QStringView pattern)
{
    // "?" stands for one character, so a character outside the Basic Multilingual Plane
    // (two UTF-16 units) must be matched as one, as the databases do.
    if (hasSurrogates(text) || hasSurrogates(pattern)) {
        const QList<uint> t = text.toUcs4();
        const QList<uint> p = pattern.toUcs4();
        return likeMatch(t.constData(), t.size(), p.constData(), p.size());
    }
    return likeMatch(reinterpret_cast<const char16_t*>(text.data()), text.size(),
        reinterpret_cast<const char16_t*>(pattern.data()), pattern.size());
}

QString FormulaEvaluator::toText(const Value& value, int decimals)
{
    switch (value.type()) {
    case ValueType::Null:
        return QString();
    case ValueType::Number:
    case ValueType::Currency:
        return QString::number(value.numeric(), 'f', decimals);
    case ValueType::String:
        return value.text();
    case ValueType::Boolean:
        return value.toBoolean() ? QStringLiteral("True") : QStringLiteral("False");
    case ValueType::Date:
        return invarianttext::formatDate(value.julianDay());
    case ValueType::Time:
        return invarianttext::formatTime(value.msecsOfDay());
    case ValueType::DateTime:
        return invarianttext::formatDateTime(value.dateTimeMsecs(), u' ');
    case ValueType::Binary:
        return QString();
    }
    return QString();
}

Value FormulaEvaluator::evaluate(const FormulaExpr& e, const Value* record, const QDateTime& now)
{
    switch (e.kind) {
    case Kind::Literal:
        return e.literal;
    case Kind::Field:
        if (!record)
            fail(e, QStringLiteral("a field has no value outside a record"));
        return record[e.column];
    case Kind::Parameter:
        if (e.list.empty())
            fail(e, QStringLiteral("the parameter {?%1} has no value").arg(e.name));
        return e.list.front();
    case Kind::Formula:
        try {
            return evaluate(*e.body, record, now);
        } catch (const FormulaException& error) {
            if (!error.error().formulaName.isEmpty())
                throw;
            throw FormulaException(
                { u'@' + e.name, error.error().position, error.error().message });
        }
    case Kind::List:
        fail(e, QStringLiteral("a list has no single value"));
    case Kind::Negate: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        if (a.type() == ValueType::Currency) {
            if (a.currencyScaled() == std::numeric_limits<int64_t>::min())
                fail(e, QStringLiteral("currency overflow"));
            return Value::currency(-a.currencyScaled());
        }
        return Value::number(-a.toNumber());
    }
    case Kind::Not: {
        const Value a = evaluate(*e.children[0], record, now);
        return a.isNull() ? Value() : Value::boolean(!a.toBoolean());
    }
    case Kind::And:
    case Kind::Or: {
        // Left to right, stopping at the first operand that decides; a Null operand that
        // decides nothing makes the result Null, as SQL's three-valued logic does.
        const bool deciding = e.kind == Kind::Or;
        bool sawNull = false;
        for (const auto& child : e.children) {
            const Value v = evaluate(*child, record, now);
            if (v.isNull())
                sawNull = true;
            else if (v.toBoolean() == deciding)
                return Value::boolean(deciding);
        }
        return sawNull ? Value() : Value::boolean(!deciding);
    }
    case Kind::Arithmetic: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        const Value b = evaluate(*e.children[1], record, now);
        if (b.isNull())
            return {};
        return arithmetic(e, a, b);
    }
    case Kind::Concat: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        const Value b = evaluate(*e.children[1], record, now);
        if (b.isNull())
            return {};
        return Value::string(toText(a) + toText(b));
    }
    case Kind::Compare: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        const Value b = evaluate(*e.children[1], record, now);
        if (b.isNull())
            return {};
        return Value::boolean(compareResult(e.op, compare(a, b)));
    }
    case Kind::InList: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        return Value::boolean(contains(a, *e.children[1], record, now));
    }
    case Kind::InRange: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        const Value low = evaluate(*e.children[1], record, now);
        const Value high = evaluate(*e.children[2], record, now);
        if (low.isNull() || high.isNull())
            return {};
        return Value::boolean(compare(a, low) >= 0 && compare(a, high) <= 0);
    }
    case Kind::InString:
    case Kind::Like:
    case Kind::StartsWith: {
        const Value a = evaluate(*e.children[0], record, now);
        if (a.isNull())
            return {};
        const Value b = evaluate(*e.children[1], record, now);
        if (b.isNull())
            return {};
        if (e.kind == Kind::InString)
            return Value::boolean(b.text().contains(a.text()));
        if (e.kind == Kind::Like)
            return Value::boolean(like(a.text(), b.text()));
        return Value::boolean(a.text().startsWith(b.text()));
    }
    case Kind::Call:
        return call(e, record, now);
    }
    fail(e, QStringLiteral("invalid formula"));
}

bool FormulaEvaluator::isTrue(const FormulaExpr* e, const Value* record)
{
    if (!e)
        return true;
    const Value v = evaluate(*e, record);
    return v.type() == ValueType::Boolean && v.toBoolean();
}

} // namespace reportrt
