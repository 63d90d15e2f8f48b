// Fuzz target: the formula language. Parsing, type-checking, folding, evaluation and SQL
// translation must end in a value, a FormulaException or nothing, never a crash or hang.

#include "reportrt/data/sqltranslator.h"
#include "reportrt/formula/formulacompiler.h"
#include "reportrt/formula/formulaevaluator.h"

#include <QString>
#include <cstddef>
#include <cstdint>

namespace {

class Environment : public reportrt::FormulaEnvironment {
public:
    std::optional<FieldBinding> field(const QString& table, const QString& field) override
    {
        using reportrt::ValueType;
        if (table.compare(u"T", Qt::CaseInsensitive) != 0)
            return std::nullopt;
        static const std::pair<const char16_t*, ValueType> fields[] = { { u"N", ValueType::Number },
            { u"S", ValueType::String }, { u"B", ValueType::Boolean }, { u"D", ValueType::Date },
            { u"C", ValueType::Currency }, { u"DT", ValueType::DateTime },
            { u"TM", ValueType::Time }, { u"X", ValueType::Binary } };
        for (int i = 0; i < 8; ++i) {
            if (field.compare(QStringView(fields[i].first), Qt::CaseInsensitive) == 0)
                return FieldBinding { fields[i].second, i };
        }
        return std::nullopt;
    }
    std::optional<ParameterBinding> parameter(const QString& name) override
    {
        using reportrt::Value;
        if (name.compare(u"P", Qt::CaseInsensitive) == 0)
            return ParameterBinding { reportrt::ValueType::Number, false, true,
                { Value::number(5) } };
        if (name.compare(u"M", Qt::CaseInsensitive) == 0)
            return ParameterBinding { reportrt::ValueType::String, true, true,
                { Value::string(QStringLiteral("a")), Value::string(QStringLiteral("b")) } };
        return std::nullopt;
    }
    std::optional<QString> formulaText(const QString& name) override
    {
        if (name.compare(u"F", Qt::CaseInsensitive) == 0)
            return QStringLiteral("{T.N} * 2");
        if (name.compare(u"Loop", Qt::CaseInsensitive) == 0)
            return QStringLiteral("{@Loop}");
        return std::nullopt;
    }
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    using namespace reportrt;
    const QString text
        = QString::fromUtf8(reinterpret_cast<const char*>(data), static_cast<qsizetype>(size));
    const Value record[] = { Value::number(10), Value::string(QStringLiteral("Alpha")),
        Value::boolean(true), Value::date(2461016), Value::currency(12345),
        Value::dateTime(2461016LL * Value::msecsPerDay), Value::time(3600000),
        Value::binary(QByteArray("\x01\x02", 2)) };
    const Value nulls[8];
    Environment environment;
    for (const auto mode : { FormulaCompiler::Mode::Check, FormulaCompiler::Mode::Bind }) {
        try {
            FormulaCompiler compiler(
                environment, mode, QDateTime(QDate(2026, 12, 6), QTime(12, 0)));
            const auto formula = compiler.compile(text, QStringLiteral("Fuzz"));
            if (!formula || mode == FormulaCompiler::Mode::Check)
                continue;
            for (const Value* values : { record, nulls }) {
                try {
                    (void)FormulaEvaluator::evaluate(*formula, values);
                } catch (const FormulaException&) { }
            }
            for (const auto dialect :
                { SqlDialect::SQLite, SqlDialect::PostgreSQL, SqlDialect::Generic }) {
                const SqlTranslator translator(dialect, [](const FormulaExpr& field) -> QString {
                    return field.table + u'.' + field.name;
                });
                for (const FormulaExpr* conjunct : FormulaCompiler::conjuncts(formula.get()))
                    (void)translator.translate(*conjunct);
            }
        } catch (const FormulaException&) { }
    }
    return 0;
}
