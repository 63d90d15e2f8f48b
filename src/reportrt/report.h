#pragma once

#include "reportrt/data/recordcache.h"
#include "reportrt/data/recordprocessor.h"
#include "reportrt/data/recordset.h"
#include "reportrt/document/reportdocument.h"
#include "runtime/report.h"

#include <map>
#include <memory>
#include <optional>

namespace reportrt {

class DatabaseTable;
class ExportOptions;
class ParameterField;
class ReportObject;
class Section;

/// An opened report (or subreport) of the runtime.
///
/// Reading records runs the report's statement, keeps the records the selection formula
/// selects, and sorts, groups and summarizes them (RecordProcessor). The statement is
/// generated from the tables, links, used fields, groups and sorts, with every condition
/// of the selection formula that translates to SQL in its WHERE clause, until a statement
/// is set; a set statement is run as it is and the whole formula is then evaluated on
/// each record. Conditions on parameter values narrow the generated statement that runs
/// but never enter its text (sqlQueryString), which hosts read back, set and save. The
/// records read stay as saved data: reading again reuses them while the statement, the
/// formula, the parameter values and the connection are the same, and reads anew when
/// any of them changed.
class Report : public runtime::Report {
public:
    /// Reads a report file; raises Error::OpenReportFailed or Error::InvalidDocument.
    static std::shared_ptr<Report> open(const QString& path);
    static std::shared_ptr<Report> fromDocument(
        const ReportDocument& document, const QString& fileName);
    ~Report() override;

    // runtime::Report
    std::vector<std::shared_ptr<runtime::DatabaseTable>> databaseTables() const override;
    std::vector<std::shared_ptr<runtime::Section>> sections() const override;
    std::vector<std::shared_ptr<runtime::ParameterField>> parameterFields() const override;
    void setEnableParameterPrompting(bool value) override { m_parameterPrompting = value; }
    void setDialogParentWindow(int32_t windowId) override { m_dialogParent = windowId; }

    QString recordSelectionFormula() const override { return m_document.selectionFormula; }
    void setRecordSelectionFormula(const QString& formula) override;
    /// Raises Error::FormulaError when the selection formula has an error.
    QString sqlQueryString() const override;
    /// An empty statement goes back to the generated one.
    void setSqlQueryString(const QString& sql) override;
    /// Raises Error::RuntimeFailure for an area the report does not have.
    int32_t topNGroupCount(const QString& areaName) const override;
    /// Raises Error::RuntimeFailure unless the area sorts its groups by top N and the
    /// count is 1 to 9999.
    void setTopNGroupCount(const QString& areaName, int32_t count) override;

    bool hasSavedData() const override { return m_cache.saved().has_value(); }
    void discardSavedData() override;
    void readRecords() override;
    runtime::PrintingStatus printingStatus() const override { return m_status; }
    void setNoDataHandler(NoDataHandler handler) override { m_noDataHandler = std::move(handler); }

    void printOut(bool promptUser, int16_t copies, bool collated,
        std::optional<runtime::PageRange> pages) override;
    void printerSetup(int32_t parentWindowId) override;
    void selectPrinter(
        const QString& driverName, const QString& deviceName, const QString& portName) override;
    QString printerDriverName() const override { return m_document.printer.driver; }
    QString printerDeviceName() const override { return m_document.printer.device; }
    QString printerPortName() const override { return m_document.printer.port; }
    int16_t paperOrientation() const override
    {
        return static_cast<int16_t>(m_document.page.orientation);
    }
    void setPaperOrientation(int16_t value) override;
    int16_t paperSize() const override { return static_cast<int16_t>(m_document.page.paperSize); }
    void setPaperSize(int16_t value) override;
    int16_t paperSource() const override
    {
        return static_cast<int16_t>(m_document.page.paperSource);
    }
    void setPaperSource(int16_t value) override;
    int16_t printerDuplex() const override { return static_cast<int16_t>(m_document.page.duplex); }
    void setPrinterDuplex(int16_t value) override;

    QString summaryComments() const override { return m_document.summary.comments; }
    /// Raises Error::RuntimeFailure for other format codes, Error::SaveFailed when the
    /// file cannot be written (the old file stays as it was).
    void saveAs(const QString& path, int32_t fileFormat) override;

    std::shared_ptr<runtime::ExportOptions> exportOptions() override;
    void exportReport(bool promptUser) override;
    bool displayProgressDialog() const override { return m_displayProgressDialog; }
    void setDisplayProgressDialog(bool value) override { m_displayProgressDialog = value; }

    // For the runtime's own objects and the layout.
    QString fileName() const { return m_fileName; }
    /// The document with the current state of every table, parameter, section and object.
    ReportDocument document(bool withSavedData) const;
    /// Whether a formula or object refers to the parameter.
    bool usesParameter(const QString& name) const;
    /// The records of the last read, in the order RecordProcessor gives.
    const RecordSet* records() const
    {
        return m_cache.saved() ? &m_cache.saved()->records : nullptr;
    }
    const RecordProcessor::Result* result() const { return m_result ? &*m_result : nullptr; }
    /// The record the layout is formatting (an index into records()), or -1.
    void setCurrentRecord(qsizetype index) { m_currentRecord = index; }
    /// The value of a field reference ("{Orders.ID}", "{@Total}", "{?Customer}") for the
    /// record being formatted; Null outside formatting.
    Value fieldValue(const QString& reference) const;
    /// The shared_ptr of this report, for its children.
    std::shared_ptr<Report> self() const;

    // For the layout, printing and export (layoutengine.h, reportprinter.h, pdfexporter.h).
    /// The compiled reference ("{Orders.ID}", "{@Total}") of a field or blob object or a
    /// subreport link, to evaluate on records() of the last read; null before a read and
    /// for a reference no object uses.
    const FormulaExpr* compiledReference(const QString& reference) const;
    /// Where a summary object's values are in result(): the index into
    /// RecordProcessor::Result::totals and GroupNode::summaries; -1 when unknown.
    int summaryIndex(const ReportObject* object) const;
    const PageSetup& pageSetup() const { return m_document.page; }
    const StoredPrinter& printer() const { return m_document.printer; }
    QString title() const { return m_document.summary.title; }
    int32_t dialogParentWindow() const { return m_dialogParent; }
    bool isParameterPromptingEnabled() const { return m_parameterPrompting; }
    void setPrintingStatus(const runtime::PrintingStatus& status) { m_status = status; }

private:
    Report() = default;
    void build(const ReportDocument& document, const QString& fileName);
    std::shared_ptr<QueryPlan> plan(bool bindParameters) const;

    QString m_fileName;
    ReportDocument m_document; // tables, parameters and sections live in the objects below
    std::vector<std::shared_ptr<DatabaseTable>> m_tables;
    std::vector<std::shared_ptr<ParameterField>> m_parameters;
    std::vector<std::shared_ptr<Section>> m_sections;
    std::shared_ptr<ExportOptions> m_exportOptions;
    runtime::PrintingStatus m_status;
    NoDataHandler m_noDataHandler;
    RecordCache m_cache;
    std::optional<RecordProcessor::Result> m_result;
    std::shared_ptr<QueryPlan> m_lastPlan; // compiled with the last read, for field values
    qsizetype m_currentRecord = -1;
    bool m_parameterPrompting = true;
    int32_t m_dialogParent = 0;
    bool m_displayProgressDialog = true;
};

} // namespace reportrt
