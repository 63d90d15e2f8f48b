#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "runtime/printingstatus.h"

#include <QString>
#include <functional>
#include <memory>
#include <optional>
#include <vector>

namespace runtime {

class DatabaseTable;
class ExportOptions;
class ParameterField;
class Section;

/// A page range for printing; pages are 1-based and inclusive.
struct PageRange {
    int16_t startPage = 0;
    int16_t stopPage = 0;
};

/// An opened report (or subreport) of the runtime. Every failure is raised as
/// core::ComError with the runtime's number.
class LUDMOX_EXPORT Report : public core::Object {
public:
    using NoDataHandler = std::function<void(bool& cancel)>;

    QString className() const override { return QStringLiteral("Report"); }

    // Database
    virtual std::vector<std::shared_ptr<DatabaseTable>> databaseTables() const = 0;
    virtual std::vector<std::shared_ptr<Section>> sections() const = 0;
    virtual std::vector<std::shared_ptr<ParameterField>> parameterFields() const = 0;
    virtual void setEnableParameterPrompting(bool value) = 0;
    /// Parent window (a native window id, 0 = none) of the runtime's own dialogs.
    virtual void setDialogParentWindow(int32_t windowId) = 0;

    // Selection
    virtual QString recordSelectionFormula() const = 0;
    virtual void setRecordSelectionFormula(const QString& formula) = 0;
    /// The statement the report runs: generated (lines broken with CR LF before WHERE,
    /// GROUP BY and ORDER BY and between WHERE and its condition) until a statement is set;
    /// a set statement is used verbatim from then on.
    virtual QString sqlQueryString() const = 0;
    virtual void setSqlQueryString(const QString& sql) = 0;
    /// Top-N group count of a group area ("GH1"); 0 = the area does not sort groups by top N.
    virtual int32_t topNGroupCount(const QString& areaName) const = 0;
    virtual void setTopNGroupCount(const QString& areaName, int32_t count) = 0;

    // Data
    virtual bool hasSavedData() const = 0;
    virtual void discardSavedData() = 0;
    virtual void readRecords() = 0;
    virtual PrintingStatus printingStatus() const = 0;
    /// Raised when reading selects no record; a handler may set cancel.
    virtual void setNoDataHandler(NoDataHandler handler) = 0;

    // Printing
    virtual void printOut(
        bool promptUser, int16_t copies, bool collated, std::optional<PageRange> pages)
        = 0;
    virtual void printerSetup(int32_t parentWindowId) = 0;
    virtual void selectPrinter(
        const QString& driverName, const QString& deviceName, const QString& portName)
        = 0;
    virtual QString printerDriverName() const = 0;
    virtual QString printerDeviceName() const = 0;
    virtual QString printerPortName() const = 0;
    /// 1 portrait, 2 landscape (0 = the printer's default).
    virtual int16_t paperOrientation() const = 0;
    virtual void setPaperOrientation(int16_t value) = 0;
    /// Paper size codes as the printer settings record uses them (9 = A4, 1 = Letter...).
    virtual int16_t paperSize() const = 0;
    virtual void setPaperSize(int16_t value) = 0;
    virtual int16_t paperSource() const = 0;
    virtual void setPaperSource(int16_t value) = 0;
    /// 1 simplex, 2 vertical, 3 horizontal.
    virtual int16_t printerDuplex() const = 0;
    virtual void setPrinterDuplex(int16_t value) = 0;

    // Document
    /// The summary comments that report authors edit.
    virtual QString summaryComments() const = 0;
    /// Format 2048: the current format; 0: the same, without saved data.
    virtual void saveAs(const QString& path, int32_t fileFormat) = 0;

    // Export
    virtual std::shared_ptr<ExportOptions> exportOptions() = 0;
    virtual void exportReport(bool promptUser) = 0;
    /// Whether a progress dialog shows during printing and export.
    virtual bool displayProgressDialog() const = 0;
    virtual void setDisplayProgressDialog(bool value) = 0;
};

} // namespace runtime
