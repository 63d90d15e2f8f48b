#include "reportrt/data/queryplanner.h"

#include "reportrt/base/invarianttext.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/providermap.h"
#include "reportrt/data/sqlstatement.h"
#include "reportrt/formula/formulaevaluator.h"

#include <QCryptographicHash>

namespace reportrt {

namespace {
[[noreturn]] void formulaError(const FormulaException& error)
{
    raiseError(Error::FormulaError, error.error().describe());
}

SqlDialect dialectOf(const std::vector<ConnectionProperty>& properties)
{
    try {
        return ProviderMap::fromProperties(properties).dialect;
    } catch (const core::ComError&) {
        // Before a table is relocated its provider may not be reachable; the text is
        // still written, for the provider it names.
        for (const auto& p : properties) {
            if (p.name.compare(u"Provider", Qt::CaseInsensitive) == 0
                && p.text.startsWith(u"SQLOLEDB", Qt::CaseInsensitive))
                return ProviderMap::serverDialect();
        }
        return SqlDialect::SQLite;
    }
}

QString reference(const TableDefinition& table, const FieldDefinition& field)
{
    return u'{' + table.name + u'.' + field.name + u'}';
}

} // namespace

std::shared_ptr<QueryPlan> QueryPlanner::plan(const Input& input, bool bindParameters)
{
    const ReportDocument& document = *input.document;
    auto p = std::make_shared<QueryPlan>();
    p->tables = input.tables;
    p->parameters = input.parameters;
    p->formulas = document.formulas;
    p->environment = std::make_unique<DocumentEnvironment>(p->tables, p->parameters, p->formulas);
    p->compiler = std::make_unique<FormulaCompiler>(*p->environment,
        bindParameters ? FormulaCompiler::Mode::Bind : FormulaCompiler::Mode::Check);
    p->checker = std::make_unique<FormulaCompiler>(*p->environment, FormulaCompiler::Mode::Check);

    const auto compileReference = [&](FormulaCompiler& compiler, const QString& text) {
        try {
            auto compiled = compiler.compile(text, text);
            if (!compiled)
                raiseError(Error::FormulaError, QStringLiteral("\"%1\" is not a field").arg(text));
            return compiled;
        } catch (const FormulaException& error) {
            formulaError(error);
        }
    };

    // What objects show is bound to the parameters' values where they have them; a
    // parameter without one must not stop the read, it shows nothing.
    const auto compileShown = [&](const QString& text) {
        if (bindParameters) {
            try {
                return compileReference(*p->compiler, text);
            } catch (const core::ComError&) { }
        }
        return compileReference(*p->checker, text);
    };

    try {
        p->selection
            = p->compiler->compile(document.selectionFormula, QStringLiteral("Record Selection"));
    } catch (const FormulaException& error) {
        formulaError(error);
    }
    if (p->selection && (p->selection->type != ValueType::Boolean || p->selection->isArray))
        raiseError(Error::FormulaError,
            QStringLiteral("Error in formula Record Selection: the formula gives %1, not a Boolean")
                .arg(valueTypeName(p->selection->type)));

    for (size_t i = 0; i < document.groups.size(); ++i) {
        const GroupDefinition& g = document.groups[i];
        RecordProcessor::Group group { compileReference(*p->compiler, g.field), g.order,
            g.topNCount, -1 };
        if (g.topNCount > 0) {
            group.topNSummary = static_cast<int>(p->summaries.size());
            p->summaries.push_back({ g.topNSummary.operation,
                compileReference(*p->compiler, g.topNSummary.field), static_cast<int>(i) + 1 });
        }
        p->groups.push_back(group);
    }
    for (const SortDefinition& s : document.sorts)
        p->sorts.push_back({ compileReference(*p->compiler, s.field), s.order });
    for (const auto& [key, o] : input.objects) {
        {
            if (o.kind == ObjectDefinition::Kind::Summary) {
                p->summaryOfObject[key] = static_cast<int>(p->summaries.size());
                p->summaries.push_back(
                    { o.operation, compileReference(*p->compiler, o.field), o.group });
            }
            if (o.kind == ObjectDefinition::Kind::Field || o.kind == ObjectDefinition::Kind::Blob)
                p->references[o.field.toLower()] = compileShown(o.field);
            for (const SubreportLink& link : o.links)
                p->references[link.mainField.toLower()]
                    = compileReference(*p->checker, link.mainField);
        }
    }

    const TableDefinition* first = p->tables.empty() ? nullptr : &p->tables.front();
    p->dialect = first ? dialectOf(first->connection) : SqlDialect::SQLite;
    for (const RecordColumn& c : p->environment->columns()) {
        const TableDefinition& table = p->tables[static_cast<size_t>(c.table)];
        const FieldDefinition& field = table.fields[static_cast<size_t>(c.field)];
        p->columns.push_back({ table.name + u'.' + field.name, field.type });
        p->columnReferences.push_back(reference(table, field));
    }

    // Conditions SQL can evaluate go first, to the database or, when the statement is
    // set, to the records before the rest; so a record a translated condition rejects
    // never meets the others, with the database filtering or without.
    const SqlTranslator translator(p->dialect, [&](const FormulaExpr& field) {
        const int t = p->environment->tableIndex(field.table);
        const int f = p->environment->fieldIndex(t, field.name);
        return SqlStatement::columnName(p->tables[static_cast<size_t>(t)],
            p->tables[static_cast<size_t>(t)].fields[static_cast<size_t>(f)]);
    });
    // The statement text is read back, set again and saved with the report, so a
    // parameter's value in it would outlive the value's change: conditions with one are
    // left out of the text. This run's values still narrow the generated statement that
    // runs; a set statement leaves them to the records, still ahead of the others.
    std::vector<const FormulaExpr*> translated;
    std::vector<QString> where;
    std::vector<const FormulaExpr*> bound;
    std::vector<QString> boundWhere;
    std::vector<const FormulaExpr*> rest;
    for (const FormulaExpr* conjunct : FormulaCompiler::conjuncts(p->selection.get())) {
        if (auto sql = translator.translate(*conjunct)) {
            (conjunct->usesParameter ? bound : translated).push_back(conjunct);
            (conjunct->usesParameter ? boundWhere : where).push_back(*sql);
        } else {
            rest.push_back(conjunct);
        }
    }

    const bool isCommand = first && first->location.compare(u"Command", Qt::CaseInsensitive) == 0;
    p->isProcedure = first && !isCommand && first->location.contains(u';');
    const bool statementSet = !document.sqlQuery.isEmpty();
    if (isCommand || p->isProcedure) {
        p->matchByName = true;
        if (isCommand) {
            p->sql = statementSet ? document.sqlQuery : first->command;
        } else {
            QStringList arguments;
            for (const ParameterDefinition& parameter : p->parameters) {
                if (parameter.kind != 2)
                    continue;
                const Value v = parameter.currentValues.empty()
                    ? parameter.defaultValue.value_or(Value())
                    : parameter.currentValues.front();
                arguments << SqlTranslator::literal(p->dialect, v).value_or(QStringLiteral("NULL"));
            }
            const QString name
                = SqlTranslator::qualifiedName(first->location.left(first->location.indexOf(u';')));
            const QString call = name + u'(' + arguments.join(QStringLiteral(", ")) + u')';
            p->sql = statementSet
                ? document.sqlQuery
                : (p->dialect == SqlDialect::PostgreSQL ? QString(u"SELECT * FROM " + call)
                                                        : QString(u"{CALL " + call + u'}'));
        }
        p->conditions = translated;
        p->conditions.insert(p->conditions.end(), bound.begin(), bound.end());
        p->conditions.insert(p->conditions.end(), rest.begin(), rest.end());
    } else {
        std::vector<SqlStatement::OrderKey> order;
        const auto addKey = [&](const FormulaExpr& key, SortOrder direction) {
            const FormulaExpr* e = &key;
            while (e->kind == FormulaExpr::Kind::Formula && e->body)
                e = e->body.get();
            if (e->kind != FormulaExpr::Kind::Field)
                return false;
            const int t = p->environment->tableIndex(e->table);
            const int f = p->environment->fieldIndex(t, e->name);
            order.push_back({ SqlStatement::columnName(p->tables[static_cast<size_t>(t)],
                                  p->tables[static_cast<size_t>(t)].fields[static_cast<size_t>(f)]),
                direction == SortOrder::Descending });
            return true;
        };
        bool ordered = true;
        for (const auto& g : p->groups)
            ordered = ordered && addKey(*g.key, g.order);
        for (const auto& s : p->sorts)
            ordered = ordered && addKey(*s.key, s.order);
        if (statementSet) {
            p->sql = document.sqlQuery;
            p->conditions = translated;
            p->conditions.insert(p->conditions.end(), bound.begin(), bound.end());
            p->conditions.insert(p->conditions.end(), rest.begin(), rest.end());
        } else {
            p->sql = SqlStatement::select(
                p->tables, document.links, p->environment->columns(), where, order);
            if (!boundWhere.empty()) {
                where.insert(where.end(), boundWhere.begin(), boundWhere.end());
                p->runSql = SqlStatement::select(
                    p->tables, document.links, p->environment->columns(), where, order);
            }
            p->conditions = rest;
        }
    }
    if (p->runSql.isEmpty())
        p->runSql = p->sql;

    // What the records depend on. The password takes no part: the signature is saved.
    QStringList inputs { p->sql, document.selectionFormula };
    for (const ParameterDefinition& parameter : p->parameters) {
        QStringList values;
        for (const Value& v : parameter.currentValues)
            values << FormulaEvaluator::toText(v, 15) + u'/' + valueTypeName(v.type());
        inputs << parameter.name + u'=' + values.join(u'|');
    }
    if (first) {
        for (const ConnectionProperty& property : first->connection) {
            if (property.name.compare(u"Password", Qt::CaseInsensitive) != 0)
                inputs << property.name + u'=' + property.text + QString::number(property.number)
                        + (property.boolean ? u'1' : u'0');
        }
    }
    for (const QString& column : p->columnReferences)
        inputs << column;
    p->signature = QString::fromLatin1(
        QCryptographicHash::hash(inputs.join(QChar(0x1F)).toUtf8(), QCryptographicHash::Sha256)
            .toHex());
    return p;
}

} // namespace reportrt
