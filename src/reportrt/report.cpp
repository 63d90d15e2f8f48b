#include "reportrt/report.h"

#include "reportrt/base/reportoutput.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/queryplanner.h"
#include "reportrt/databasetable.h"
#include "reportrt/document/documentreader.h"
#include "reportrt/document/documentwriter.h"
#include "reportrt/exportoptions.h"
#include "reportrt/formula/formulaevaluator.h"
#include "reportrt/parameterfield.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"

#include <QRegularExpression>

namespace reportrt {

namespace {
[[noreturn]] void formulaError(const FormulaException& error)
{
    raiseError(Error::FormulaError, error.error().describe());
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

Report::~Report() = default;

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
        RecordCache::Saved saved { RecordSet(static_cast<int>(document.savedData->columns.size())),
            document.savedData->columns, document.savedData->recordsRead,
            document.savedData->signature };
        saved.records.reserve(static_cast<qsizetype>(document.savedData->rows.size()));
        for (const auto& row : document.savedData->rows) {
            Value* record = saved.records.append();
            for (size_t i = 0; i < row.size(); ++i)
                record[i] = row[i];
        }
        m_cache.keep(std::move(saved));
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
    m_cache.forget();
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

std::shared_ptr<QueryPlan> Report::plan(bool bindParameters) const
{
    QueryPlanner::Input input;
    for (const auto& t : m_tables)
        input.tables.push_back(t->definition());
    for (const auto& parameter : m_parameters)
        input.parameters.push_back(parameter->definition());
    input.document = &m_document;
    for (const auto& section : m_sections) {
        for (const auto& object : section->objects())
            input.objects.emplace_back(object.get(), object->definition());
    }
    return QueryPlanner::plan(input, bindParameters);
}

void Report::readRecords()
{
    m_status = {};
    m_status.setProgress(runtime::PrintingProgress::InProgress);
    m_result.reset();
    m_currentRecord = -1;
    try {
        const std::shared_ptr<QueryPlan> p = plan(true);
        if (!m_cache.matches(*p))
            m_cache.read(*p);
        try {
            m_result = RecordProcessor::process(
                m_cache.saved()->records, p->groups, p->sorts, p->summaries);
        } catch (const FormulaException& error) {
            formulaError(error);
        }
        m_lastPlan = p;
        m_status.recordsRead = m_cache.saved()->recordsRead;
        m_status.recordsSelected = static_cast<int32_t>(m_cache.saved()->records.size());
        m_status.recordsPrinted = static_cast<int32_t>(m_result->size());
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
    if (!m_lastPlan || !m_cache.saved() || m_currentRecord < 0
        || m_currentRecord >= m_cache.saved()->records.size())
        return {};
    const auto found = m_lastPlan->references.find(text.toLower());
    if (found == m_lastPlan->references.end())
        return {};
    try {
        return FormulaEvaluator::evaluate(
            *found->second, m_cache.saved()->records.record(m_currentRecord));
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
    if (withSavedData && m_cache.saved()) {
        SavedData data;
        data.columns = m_cache.saved()->columns;
        data.recordsRead = m_cache.saved()->recordsRead;
        data.signature = m_cache.saved()->signature;
        for (qsizetype i = 0; i < m_cache.saved()->records.size(); ++i) {
            const Value* record = m_cache.saved()->records.record(i);
            data.rows.emplace_back(record, record + m_cache.saved()->records.columnCount());
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
