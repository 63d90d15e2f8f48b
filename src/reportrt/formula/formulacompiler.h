#pragma once

#include "reportrt/formula/formulaexpr.h"

#include <QDateTime>
#include <QHash>
#include <QString>
#include <memory>
#include <optional>
#include <vector>

namespace reportrt {

/// What a formula can refer to. Names are compared without regard to case.
class FormulaEnvironment {
public:
    struct FieldBinding {
        ValueType type = ValueType::String;
        int column = -1; // where the evaluator finds the field's value in a record
    };
    struct ParameterBinding {
        ValueType type = ValueType::String;
        bool allowsMultipleValues = false;
        bool hasValues = false;
        std::vector<Value> values; // current values, or the default value
    };

    virtual ~FormulaEnvironment() = default;
    /// The field, or nullopt when the table or field does not exist. The environment may
    /// note that the field is used and give it a record column.
    virtual std::optional<FieldBinding> field(const QString& table, const QString& field) = 0;
    virtual std::optional<ParameterBinding> parameter(const QString& name) = 0;
    /// The text of a formula field, or nullopt.
    virtual std::optional<QString> formulaText(const QString& name) = 0;

protected:
    FormulaEnvironment() = default;
    FormulaEnvironment(const FormulaEnvironment&) = default;
    FormulaEnvironment& operator=(const FormulaEnvironment&) = default;
};

/// Types formulas and resolves their names. In checking mode parameters stay unbound and
/// nothing is evaluated; in binding mode parameter values and the current date become
/// constants and every constant part is folded, so the per-record work is only what
/// depends on the record. Formula fields are compiled once and shared by every reference.
class FormulaCompiler {
public:
    enum class Mode { Check, Bind };

    FormulaCompiler(
        FormulaEnvironment& environment, Mode mode, QDateTime now = QDateTime::currentDateTime());

    /// nullptr for a formula without an expression (empty or comments only). Raises
    /// FormulaException.
    std::shared_ptr<const FormulaExpr> compile(const QString& text, const QString& formulaName);

    /// The compiled body of a formula field; raises FormulaException (unknown formula,
    /// errors in its text, formulas that refer to themselves).
    std::shared_ptr<const FormulaExpr> compileFormulaField(const QString& name);

    /// Top-level conjuncts of a Boolean formula: "(A Or B) And C And D" gives three.
    static std::vector<const FormulaExpr*> conjuncts(const FormulaExpr* formula);

private:
    void check(FormulaExpr& e, const QString& formulaName);
    void checkCall(FormulaExpr& e, const QString& formulaName);
    void fold(std::unique_ptr<FormulaExpr>& e);
    void foldTree(std::unique_ptr<FormulaExpr>& e);

    FormulaEnvironment& m_environment;
    Mode m_mode;
    QDateTime m_now;
    QHash<QString, std::shared_ptr<const FormulaExpr>> m_formulas; // lower-case name
    std::vector<QString> m_compiling; // formula fields being compiled, for cycles
};

} // namespace reportrt
