#include "fakereport.h"

#include <QFile>

namespace fakeruntime {

FakeReport::FakeReport(std::weak_ptr<Script> script, QString label)
    : FakeObject(script, QStringLiteral("Report"))
    , m_label(std::move(label))
    , m_exportOptions(std::make_shared<FakeExportOptions>(script, m_label))
{ }

std::shared_ptr<FakeTable> FakeReport::addTable(FakeTable::State table)
{
    auto created = std::make_shared<FakeTable>(script(), std::move(table));
    state.tables.push_back(created);
    return created;
}

std::shared_ptr<FakeTable> FakeReport::addTable(const QString& name, const QString& location)
{
    FakeTable::State table;
    table.name = name;
    table.location = location;
    return addTable(std::move(table));
}

std::shared_ptr<FakeSection> FakeReport::addSection(const QString& name)
{
    auto created = std::make_shared<FakeSection>(script(), FakeSection::State { name, {} });
    state.sections.push_back(created);
    return created;
}

std::shared_ptr<FakeParameterField> FakeReport::addParameter(FakeParameterField::State parameter)
{
    auto created = std::make_shared<FakeParameterField>(script(), std::move(parameter));
    state.parameters.push_back(created);
    return created;
}

std::vector<std::shared_ptr<runtime::DatabaseTable>> FakeReport::databaseTables() const
{
    recordQuery(QStringLiteral("databaseTables"));
    return { state.tables.begin(), state.tables.end() };
}

std::vector<std::shared_ptr<runtime::Section>> FakeReport::sections() const
{
    recordQuery(QStringLiteral("sections"));
    return { state.sections.begin(), state.sections.end() };
}

std::vector<std::shared_ptr<runtime::ParameterField>> FakeReport::parameterFields() const
{
    recordQuery(QStringLiteral("parameterFields"));
    return { state.parameters.begin(), state.parameters.end() };
}

void FakeReport::setEnableParameterPrompting(bool value)
{
    record(QStringLiteral("setEnableParameterPrompting"), { arg(value) });
    state.parameterPrompting = value;
}

void FakeReport::setDialogParentWindow(int32_t windowId)
{
    record(QStringLiteral("setDialogParentWindow"), { arg(windowId) });
    state.dialogParentWindow = windowId;
}

QString FakeReport::recordSelectionFormula() const
{
    recordQuery(QStringLiteral("recordSelectionFormula"));
    return state.selectionFormula;
}

void FakeReport::setRecordSelectionFormula(const QString& formula)
{
    record(QStringLiteral("setRecordSelectionFormula"), { arg(formula) });
    state.selectionFormula = formula;
}

QString FakeReport::sqlQueryString() const
{
    recordQuery(QStringLiteral("sqlQueryString"));
    return state.sqlQuery;
}

void FakeReport::setSqlQueryString(const QString& sql)
{
    record(QStringLiteral("setSqlQueryString"), { arg(sql) });
    state.sqlQuery = sql;
}

int32_t FakeReport::topNGroupCount(const QString& areaName) const
{
    recordQuery(QStringLiteral("topNGroupCount"), { arg(areaName) });
    const auto found = state.topN.find(areaName);
    return found == state.topN.end() ? 0 : found->second;
}

void FakeReport::setTopNGroupCount(const QString& areaName, int32_t count)
{
    record(QStringLiteral("setTopNGroupCount"), { arg(areaName), arg(count) });
    state.topN[areaName] = count;
}

bool FakeReport::hasSavedData() const
{
    recordQuery(QStringLiteral("hasSavedData"));
    return state.savedData;
}

void FakeReport::discardSavedData()
{
    record(QStringLiteral("discardSavedData"));
    state.savedData = false;
}

void FakeReport::readRecords()
{
    record(QStringLiteral("readRecords"));
    if (state.selectsNoRecords && m_noDataHandler) {
        bool cancel = false;
        m_noDataHandler(cancel);
        state.noDataCancelled = cancel;
    }
}

runtime::PrintingStatus FakeReport::printingStatus() const
{
    recordQuery(QStringLiteral("printingStatus"));
    return state.printingStatus;
}

void FakeReport::setNoDataHandler(NoDataHandler handler)
{
    record(QStringLiteral("setNoDataHandler"));
    m_noDataHandler = std::move(handler);
}

void FakeReport::printOut(
    bool promptUser, int16_t copies, bool collated, std::optional<runtime::PageRange> pages)
{
    QStringList arguments { arg(promptUser), arg(copies), arg(collated) };
    if (pages)
        arguments << arg(pages->startPage) << arg(pages->stopPage);
    record(QStringLiteral("printOut"), arguments);
}

void FakeReport::printerSetup(int32_t parentWindowId)
{
    record(QStringLiteral("printerSetup"), { arg(parentWindowId) });
}

void FakeReport::selectPrinter(
    const QString& driverName, const QString& deviceName, const QString& portName)
{
    record(QStringLiteral("selectPrinter"), { arg(driverName), arg(deviceName), arg(portName) });
    state.printerDriverName = driverName;
    state.printerDeviceName = deviceName;
    state.printerPortName = portName;
}

QString FakeReport::printerDriverName() const
{
    recordQuery(QStringLiteral("printerDriverName"));
    return state.printerDriverName;
}

QString FakeReport::printerDeviceName() const
{
    recordQuery(QStringLiteral("printerDeviceName"));
    return state.printerDeviceName;
}

QString FakeReport::printerPortName() const
{
    recordQuery(QStringLiteral("printerPortName"));
    return state.printerPortName;
}

int16_t FakeReport::paperOrientation() const
{
    recordQuery(QStringLiteral("paperOrientation"));
    return state.paperOrientation;
}

void FakeReport::setPaperOrientation(int16_t value)
{
    record(QStringLiteral("setPaperOrientation"), { arg(value) });
    state.paperOrientation = value;
}

int16_t FakeReport::paperSize() const
{
    recordQuery(QStringLiteral("paperSize"));
    return state.paperSize;
}

void FakeReport::setPaperSize(int16_t value)
{
    record(QStringLiteral("setPaperSize"), { arg(value) });
    state.paperSize = value;
}

int16_t FakeReport::paperSource() const
{
    recordQuery(QStringLiteral("paperSource"));
    return state.paperSource;
}

void FakeReport::setPaperSource(int16_t value)
{
    record(QStringLiteral("setPaperSource"), { arg(value) });
    state.paperSource = value;
}

int16_t FakeReport::printerDuplex() const
{
    recordQuery(QStringLiteral("printerDuplex"));
    return state.printerDuplex;
}

void FakeReport::setPrinterDuplex(int16_t value)
{
    record(QStringLiteral("setPrinterDuplex"), { arg(value) });
    state.printerDuplex = value;
}

QString FakeReport::summaryComments() const
{
    recordQuery(QStringLiteral("summaryComments"));
    return state.summaryComments;
}

void FakeReport::saveAs(const QString& path, int32_t fileFormat)
{
    record(QStringLiteral("saveAs"), { arg(path), arg(fileFormat) });
    writePlaceholder(path);
}

std::shared_ptr<runtime::ExportOptions> FakeReport::exportOptions()
{
    recordQuery(QStringLiteral("exportOptions"));
    return m_exportOptions;
}

void FakeReport::exportReport(bool promptUser)
{
    record(QStringLiteral("exportReport"), { arg(promptUser) });
    // Like the runtime, no destination at all means a disk file.
    const int32_t destination = m_exportOptions->state.destinationType;
    if (destination == 0 || destination == 1)
        writePlaceholder(m_exportOptions->state.diskFileName);
}

bool FakeReport::displayProgressDialog() const
{
    recordQuery(QStringLiteral("displayProgressDialog"));
    return state.displayProgressDialog;
}

void FakeReport::setDisplayProgressDialog(bool value)
{
    record(QStringLiteral("setDisplayProgressDialog"), { arg(value) });
    state.displayProgressDialog = value;
}

void FakeReport::writePlaceholder(const QString& path) const
{
    if (!state.writeOutputFiles || path.isEmpty())
        return;
    QFile file(path);
    if (file.open(QIODevice::WriteOnly | QIODevice::Truncate))
        file.write("fake runtime output of " + m_label.toUtf8() + '\n');
}

} // namespace fakeruntime
