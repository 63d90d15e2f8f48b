#pragma once

#include "fakeexportoptions.h"
#include "fakeobject.h"
#include "fakeparameterfield.h"
#include "fakesection.h"
#include "faketable.h"
#include "runtime/report.h"

#include <map>

namespace fakeruntime {

/// A report or subreport of the fake runtime. Logged as `Report(<label>)`: a main report's
/// path, a subreport's name.
class FakeReport : public runtime::Report, public FakeObject {
public:
    struct State {
        std::vector<std::shared_ptr<FakeTable>> tables;
        std::vector<std::shared_ptr<FakeSection>> sections;
        std::vector<std::shared_ptr<FakeParameterField>> parameters;
        bool parameterPrompting = true;
        int32_t dialogParentWindow = 0;
        QString selectionFormula;
        QString sqlQuery;
        std::map<QString, int32_t> topN; // area name ("GH1") to top-N group count
        bool savedData = false;
        /// readRecords raises the no-data event; a handler that cancels sets noDataCancelled.
        bool selectsNoRecords = false;
        bool noDataCancelled = false;
        runtime::PrintingStatus printingStatus;
        QString summaryComments;
        QString printerDriverName;
        QString printerDeviceName;
        QString printerPortName;
        int16_t paperOrientation = 0;
        int16_t paperSize = 0;
        int16_t paperSource = 0;
        int16_t printerDuplex = 0;
        bool displayProgressDialog = true;
        /// saveAs and exportReport write a small placeholder file at their path.
        bool writeOutputFiles = false;
    };

    FakeReport(std::weak_ptr<Script> script, QString label);

    QString label() const override { return m_label; }

    /// Builders; none of them is logged.
    std::shared_ptr<FakeTable> addTable(FakeTable::State table);
    /// A table read through the OLE DB driver ("crdb_ado.dll").
    std::shared_ptr<FakeTable> addTable(const QString& name, const QString& location);
    std::shared_ptr<FakeSection> addSection(const QString& name);
    std::shared_ptr<FakeParameterField> addParameter(FakeParameterField::State parameter);
    std::shared_ptr<FakeExportOptions> fakeExportOptions() const { return m_exportOptions; }
    /// The no-data handler the component set, if any.
    const NoDataHandler& noDataHandler() const { return m_noDataHandler; }

    std::vector<std::shared_ptr<runtime::DatabaseTable>> databaseTables() const override;
    std::vector<std::shared_ptr<runtime::Section>> sections() const override;
    std::vector<std::shared_ptr<runtime::ParameterField>> parameterFields() const override;
    void setEnableParameterPrompting(bool value) override;
    void setDialogParentWindow(int32_t windowId) override;
    QString recordSelectionFormula() const override;
    void setRecordSelectionFormula(const QString& formula) override;
    QString sqlQueryString() const override;
    void setSqlQueryString(const QString& sql) override;
    int32_t topNGroupCount(const QString& areaName) const override;
    void setTopNGroupCount(const QString& areaName, int32_t count) override;
    bool hasSavedData() const override;
    void discardSavedData() override;
    void readRecords() override;
    runtime::PrintingStatus printingStatus() const override;
    void setNoDataHandler(NoDataHandler handler) override;
    void printOut(bool promptUser, int16_t copies, bool collated,
        std::optional<runtime::PageRange> pages) override;
    void printerSetup(int32_t parentWindowId) override;
    void selectPrinter(
        const QString& driverName, const QString& deviceName, const QString& portName) override;
    QString printerDriverName() const override;
    QString printerDeviceName() const override;
    QString printerPortName() const override;
    int16_t paperOrientation() const override;
    void setPaperOrientation(int16_t value) override;
    int16_t paperSize() const override;
    void setPaperSize(int16_t value) override;
    int16_t paperSource() const override;
    void setPaperSource(int16_t value) override;
    int16_t printerDuplex() const override;
    void setPrinterDuplex(int16_t value) override;
    QString summaryComments() const override;
    void saveAs(const QString& path, int32_t fileFormat) override;
    std::shared_ptr<runtime::ExportOptions> exportOptions() override;
    void exportReport(bool promptUser) override;
    bool displayProgressDialog() const override;
    void setDisplayProgressDialog(bool value) override;

    /// Read and change freely: nothing here is logged.
    State state;

private:
    void writePlaceholder(const QString& path) const;

    QString m_label;
    std::shared_ptr<FakeExportOptions> m_exportOptions;
    NoDataHandler m_noDataHandler;
};

} // namespace fakeruntime
