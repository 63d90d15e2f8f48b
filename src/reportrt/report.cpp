#include "reportrt/report.h"

#include "reportrt/base/invarianttext.h"
#include "reportrt/base/reportoutput.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/providermap.h"
#include "reportrt/data/recordreader.h"
#include "reportrt/data/sqlconnection.h"
#include "reportrt/data/sqlstatement.h"
#include "reportrt/data/sqltranslator.h"
#include "reportrt/databasetable.h"
#include "reportrt/document/documentenvironment.h"
#include "reportrt/document/documentreader.h"
#include "reportrt/document/documentwriter.h"
#include "reportrt/exportoptions.h"
#include "reportrt/formula/formulacompiler.h"
#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/parameterfield.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"

#include <QCryptographicHash>
#include <QRegularExpression>

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
                return ProviderMap::serverDriver() == u"QPSQL" ? SqlDialect::PostgreSQL
                                                               : SqlDialect::Generic;
        }
        return SqlDialect::SQLite;
    }
}

QString reference(const TableDefinition& table, const FieldDefinition& field)
{
    return u'{' + table.name + u'.' + field.name + u'}';
}

int groupLevel(const QString& areaName, size_t groupCount)
{
    static const QRegularExpression pattern(
        QStringLiteral("^GH([1-9][0-9]?)$"), QRegularExpression::CaseInsensitiveOption);
    const auto match = pattern.match(areaName.trimmed());
    if (!match.hasMatch())
        return -1;
    const int level = match.captured(1).toInt();
    return level <= static_cast<int>(groupCount) ? level : -1;
}
} // namespace

struct Report::Plan {
    std::vector<TableDefinition> tables;
    std::vector<ParameterDefinition> parameters;
    std::vector<FormulaDefinition> formulas;
    std::unique_ptr<DocumentEnvironment> environment;
    std::unique_ptr<FormulaCompiler> compiler;
    std::unique_ptr<FormulaCompiler> checker;
    std::shared_ptr<const FormulaExpr> selection;
    std::vector<const FormulaExpr*> conditions; // evaluated on each record
    std::vector<RecordProcessor::Group> groups;
    std::vector<RecordProcessor::Sort> sorts;
    std::vector<RecordProcessor::Summary> summaries;
    std::map<QString, std::shared_ptr<const FormulaExpr>> references; // lower-case text
    std::map<const ReportObject*, int> summaryOfObject;
    std::vector<RecordReader::Column> columns;
    std::vector<QString> columnReferences;
    QString sql; // the statement as the report shows and saves it
    QString runSql; // what runs: sql, or with this run's parameter conditions added
    bool matchByName = false;
    bool isProcedure = false;
    SqlDialect dialect = SqlDialect::SQLite;
    QString signature;
};

std::shared_ptr<Report> Report::open(const QString& path)
{
    const ReportDocument document = DocumentReader::readFile(path);
    return fromDocument(document, path);
}

std::shared_ptr<Report> Report::fromDocument(
    const ReportDocument& document, const QString& fileName)
{
    std::shared_ptr<Report> report(new Report());
    report->build(document, fileName);
    return report;
}

Report::~Report()
{
    // Queries are gone; the connections close and leave the process's connection list.
    m_connections.clear();
}

std::shared_ptr<Report> Report::self() const
{
    return std::static_pointer_cast<Report>(
        std::const_pointer_cast<core::Object>(shared_from_this()));
}

void Report::build(const ReportDocument& document, const QString& fileName)
{
    m_fileName = fileName;
    m_document = document;
    const std::weak_ptr<Report> weak = self();
    for (const auto& t : document.tables)
        m_tables.push_back(std::make_shared<DatabaseTable>(t, weak));
    for (const auto& p : document.parameters) {
        m_parameters.push_back(std::make_shared<ParameterField>(p, [weak](const QString& name) {
            const auto report = weak.lock();
            return report && report->usesParameter(name);
        }));
    }
    for (const auto& s : document.sections) {
        auto section = std::make_shared<Section>(s, weak);
        section->createObjects(s);
        m_sections.push_back(section);
    }
    m_document.tables.clear();
    m_document.parameters.clear();
    m_document.sections.clear();
    if (document.savedData) {
        Saved saved { RecordSet(static_cast<int>(document.savedData->columns.size())),
            document.savedData->columns, document.savedData->recordsRead,
            document.savedData->signature };
        saved.records.reserve(static_cast<qsizetype>(document.savedData->rows.size()));
        for (const auto& row : document.savedData->rows) {
            Value* record = saved.records.append();
            for (size_t i = 0; i < row.size(); ++i)
                record[i] = row[i];
        }
        m_saved = std::move(saved);
    }
    m_document.savedData.reset();
}

std::vector<std::shared_ptr<runtime::DatabaseTable>> Report::databaseTables() const
{
    return { m_tables.begin(), m_tables.end() };
}

std::vector<std::shared_ptr<runtime::Section>> Report::sections() const
{
    return { m_sections.begin(), m_sections.end() };
}

std::vector<std::shared_ptr<runtime::ParameterField>> Report::parameterFields() const
{
    return { m_parameters.begin(), m_parameters.end() };
}

void Report::setRecordSelectionFormula(const QString& formula)
{
    m_document.selectionFormula = formula;
}

void Report::setSqlQueryString(const QString& sql)
{
    m_document.sqlQuery = sql.trimmed().isEmpty() ? QString() : sql;
}

QString Report::sqlQueryString() const
{
    try {
        return plan(true)->sql;
    } catch (const core::ComError&) {
        // Parameters without values leave their conditions to the records; the text is
        // still the statement that would run apart from those.
        return plan(false)->sql;
    }
}

int32_t Report::topNGroupCount(const QString& areaName) const
{
    const int level = groupLevel(areaName, m_document.groups.size());
    if (level < 0)
        raiseError(
            Error::RuntimeFailure, QStringLiteral("The report has no area %1.").arg(areaName));
    return m_document.groups[static_cast<size_t>(level - 1)].topNCount;
}

void Report::setTopNGroupCount(const QString& areaName, int32_t count)
{
    const int level = groupLevel(areaName, m_document.groups.size());
    if (level < 0)
        raiseError(
            Error::RuntimeFailure, QStringLiteral("The report has no area %1.").arg(areaName));
    GroupDefinition& group = m_document.groups[static_cast<size_t>(level - 1)];
    if (group.topNCount <= 0)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The area %1 does not sort its groups by top N.").arg(areaName));
    if (count < 1 || count > 9999)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("A top N group count is 1 to 9999 (9999 = all groups), not %1.")
                .arg(count));
    group.topNCount = count;
}

void Report::discardSavedData()
{
    m_saved.reset();
    m_result.reset();
    m_lastPlan.reset();
    m_currentRecord = -1;
}

bool Report::usesParameter(const QString& name) const
{
    for (const auto& p : m_parameters) {
        if (p->name().compare(name, Qt::CaseInsensitive) == 0 && p->kind() == 2)
            return true;
    }
    const QRegularExpression pattern(
        u"\\{\\s*\\?\\s*" + QRegularExpression::escape(name) + u"\\s*\\}",
        QRegularExpression::CaseInsensitiveOption);
    if (pattern.match(m_document.selectionFormula).hasMatch())
        return true;
    for (const auto& f : m_document.formulas) {
        if (pattern.match(f.text).hasMatch())
            return true;
    }
    for (const auto& s : m_sections) {
        for (const auto& o : s->objects()) {
            if (o->kind() == ObjectDefinition::Kind::Field
                && pattern.match(o->definition().field).hasMatch())
                return true;
        }
    }
    return false;
}

std::shared_ptr<Report::Plan> Report::plan(bool bindParameters) const
{
    auto p = std::make_shared<Plan>();
    for (const auto& t : m_tables)
        p->tables.push_back(t->definition());
    for (const auto& parameter : m_parameters)
        p->parameters.push_back(parameter->definition());
    p->formulas = m_document.formulas;
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
            = p->compiler->compile(m_document.selectionFormula, QStringLiteral("Record Selection"));
    } catch (const FormulaException& error) {
        formulaError(error);
    }
    if (p->selection && (p->selection->type != ValueType::Boolean || p->selection->isArray))
        raiseError(Error::FormulaError,
            QStringLiteral("Error in formula Record Selection: the formula gives %1, not a Boolean")
                .arg(valueTypeName(p->selection->type)));

    for (size_t i = 0; i < m_document.groups.size(); ++i) {
        const GroupDefinition& g = m_document.groups[i];
        RecordProcessor::Group group { compileReference(*p->compiler, g.field), g.order,
            g.topNCount, -1 };
        if (g.topNCount > 0) {
            group.topNSummary = static_cast<int>(p->summaries.size());
            p->summaries.push_back({ g.topNSummary.operation,
                compileReference(*p->compiler, g.topNSummary.field), static_cast<int>(i) + 1 });
        }
        p->groups.push_back(group);
    }
    for (const SortDefinition& s : m_document.sorts)
        p->sorts.push_back({ compileReference(*p->compiler, s.field), s.order });
    for (const auto& section : m_sections) {
        for (const auto& object : section->objects()) {
            const ObjectDefinition o = object->definition();
            if (o.kind == ObjectDefinition::Kind::Summary) {
                p->summaryOfObject[object.get()] = static_cast<int>(p->summaries.size());
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
    const bool statementSet = !m_document.sqlQuery.isEmpty();
    if (isCommand || p->isProcedure) {
        p->matchByName = true;
        if (isCommand) {
            p->sql = statementSet ? m_document.sqlQuery : first->command;
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
                ? m_document.sqlQuery
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
            p->sql = m_document.sqlQuery;
            p->conditions = translated;
            p->conditions.insert(p->conditions.end(), bound.begin(), bound.end());
            p->conditions.insert(p->conditions.end(), rest.begin(), rest.end());
        } else {
            p->sql = SqlStatement::select(
                p->tables, m_document.links, p->environment->columns(), where, order);
            if (!boundWhere.empty()) {
                where.insert(where.end(), boundWhere.begin(), boundWhere.end());
                p->runSql = SqlStatement::select(
                    p->tables, m_document.links, p->environment->columns(), where, order);
            }
            p->conditions = rest;
        }
    }
    if (p->runSql.isEmpty())
        p->runSql = p->sql;

    // What the records depend on. The password takes no part: the signature is saved.
    QStringList inputs { p->sql, m_document.selectionFormula };
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

SqlConnection& Report::connection(const std::vector<ConnectionProperty>& properties)
{
    const ConnectionSpec spec = ProviderMap::fromProperties(properties);
    const QString key = spec.key();
    // Connections to other databases are left over from earlier locations.
    for (auto it = m_connections.begin(); it != m_connections.end();) {
        if (it->first != key)
            it = m_connections.erase(it);
        else
            ++it;
    }
    auto found = m_connections.find(key);
    if (found != m_connections.end())
        return *found->second;
    auto created = std::make_unique<SqlConnection>(spec);
    QString message;
    if (!created->open(message))
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the connection to the %1. Details: %2")
                .arg(spec.describe(), message));
    return *m_connections.emplace(key, std::move(created)).first->second;
}

void Report::readInto(Plan& p)
{
    if (p.tables.empty())
        raiseError(Error::RuntimeFailure, QStringLiteral("The report has no database tables."));
    const QString firstKey = ProviderMap::fromProperties(p.tables.front().connection).key();
    for (const TableDefinition& t : p.tables) {
        if (ProviderMap::fromProperties(t.connection).key() != firstKey)
            raiseError(Error::RuntimeFailure,
                QStringLiteral("The tables %1 and %2 are in different databases; a report reads "
                               "its tables from one database.")
                    .arg(p.tables.front().name, t.name));
    }
    if (p.isProcedure && p.dialect == SqlDialect::SQLite)
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the stored procedure %1: SQLite databases have no "
                           "stored procedures.")
                .arg(p.tables.front().location));
    SqlConnection& c = connection(p.tables.front().connection);
    RecordReader::Request request;
    request.database = c.database();
    request.sql = p.runSql;
    request.columns = p.columns;
    request.matchByName = p.matchByName;
    request.conditions = p.conditions;
    RecordReader::Result read = RecordReader::read(request);
    m_saved = Saved { std::move(read.records), p.columnReferences, read.recordsRead, p.signature };
}

void Report::readRecords()
{
    m_status = {};
    m_status.setProgress(runtime::PrintingProgress::InProgress);
    m_result.reset();
    m_currentRecord = -1;
    try {
        const std::shared_ptr<Plan> p = plan(true);
        const bool reuse = m_saved && m_saved->signature == p->signature
            && m_saved->columns == p->columnReferences;
        if (!reuse)
            readInto(*p);
        try {
            m_result
                = RecordProcessor::process(m_saved->records, p->groups, p->sorts, p->summaries);
        } catch (const FormulaException& error) {
            formulaError(error);
        }
        m_lastPlan = p;
        m_status.recordsRead = m_saved->recordsRead;
        m_status.recordsSelected = static_cast<int32_t>(m_saved->records.size());
        m_status.recordsPrinted = static_cast<int32_t>(m_result->records.size());
        m_status.setProgress(runtime::PrintingProgress::Completed);
        if (m_status.recordsSelected == 0 && m_noDataHandler) {
            bool cancel = false;
            m_noDataHandler(cancel);
            if (cancel) {
                m_status.setProgress(runtime::PrintingProgress::Cancelled);
                m_status.recordsPrinted = 0;
            }
        }
    } catch (...) {
        m_status.setProgress(runtime::PrintingProgress::Failed);
        throw;
    }
}

Value Report::fieldValue(const QString& text) const
{
    if (!m_lastPlan || !m_saved || m_currentRecord < 0
        || m_currentRecord >= m_saved->records.size())
        return {};
    const auto found = m_lastPlan->references.find(text.toLower());
    if (found == m_lastPlan->references.end())
        return {};
    try {
        return FormulaEvaluator::evaluate(*found->second, m_saved->records.record(m_currentRecord));
    } catch (const FormulaException& error) {
        formulaError(error);
    }
}

const FormulaExpr* Report::compiledReference(const QString& text) const
{
    if (!m_lastPlan)
        return nullptr;
    const auto found = m_lastPlan->references.find(text.toLower());
    return found == m_lastPlan->references.end() ? nullptr : found->second.get();
}

int Report::summaryIndex(const ReportObject* object) const
{
    if (!m_lastPlan)
        return -1;
    const auto found = m_lastPlan->summaryOfObject.find(object);
    return found == m_lastPlan->summaryOfObject.end() ? -1 : found->second;
}

void Report::printOut(
    bool promptUser, int16_t copies, bool collated, std::optional<runtime::PageRange> pages)
{
    ReportOutput::installed().printOut(*this, promptUser, copies, collated, pages);
}

void Report::printerSetup(int32_t parentWindowId)
{
    ReportOutput::installed().printerSetup(*this, parentWindowId);
}

void Report::exportReport(bool promptUser)
{
    const auto options = std::static_pointer_cast<ExportOptions>(exportOptions());
    ReportOutput::installed().exportReport(*this, *options, promptUser);
}

void Report::selectPrinter(
    const QString& driverName, const QString& deviceName, const QString& portName)
{
    m_document.printer = { driverName, deviceName, portName };
}

void Report::setPaperOrientation(int16_t value)
{
    if (value < 0 || value > 2)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The paper orientation is 1 (portrait) or 2 (landscape), not %1.")
                .arg(value));
    if (value != 0)
        m_document.page.orientation = value;
}

void Report::setPaperSize(int16_t value)
{
    if (value < 1)
        raiseError(
            Error::RuntimeFailure, QStringLiteral("%1 is not a paper size code.").arg(value));
    m_document.page.paperSize = value;
}

void Report::setPaperSource(int16_t value)
{
    if (value < 0)
        raiseError(
            Error::RuntimeFailure, QStringLiteral("%1 is not a paper source code.").arg(value));
    m_document.page.paperSource = value;
}

void Report::setPrinterDuplex(int16_t value)
{
    if (value < 1 || value > 3)
        raiseError(Error::RuntimeFailure,
            QStringLiteral(
                "The duplex mode is 1 (simplex), 2 (vertical) or 3 (horizontal), not %1.")
                .arg(value));
    m_document.page.duplex = value;
}

std::shared_ptr<runtime::ExportOptions> Report::exportOptions()
{
    if (!m_exportOptions)
        m_exportOptions = std::make_shared<ExportOptions>();
    return m_exportOptions;
}

ReportDocument Report::document(bool withSavedData) const
{
    ReportDocument doc = m_document;
    for (const auto& t : m_tables)
        doc.tables.push_back(t->definition());
    for (const auto& p : m_parameters)
        doc.parameters.push_back(p->definition());
    for (const auto& s : m_sections)
        doc.sections.push_back(s->definition());
    if (withSavedData && m_saved) {
        SavedData data;
        data.columns = m_saved->columns;
        data.recordsRead = m_saved->recordsRead;
        data.signature = m_saved->signature;
        for (qsizetype i = 0; i < m_saved->records.size(); ++i) {
            const Value* record = m_saved->records.record(i);
            data.rows.emplace_back(record, record + m_saved->records.columnCount());
        }
        doc.savedData = std::move(data);
    }
    return doc;
}

void Report::saveAs(const QString& path, int32_t fileFormat)
{
    if (fileFormat != 0 && fileFormat != 2048)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 is not a report file format; use 2048, or 0 to save without data.")
                .arg(fileFormat));
    DocumentWriter::writeFile(document(fileFormat == 2048), path, fileFormat == 2048);
}

} // namespace reportrt
