#pragma once

#include "reportrt/base/value.h"

#include <QByteArray>
#include <QString>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

namespace reportrt {

// The report document as it is read from and written to a .rpt file (docs/report-format.md).
// Plain values: the runtime objects of the boundary are built from them when a report is
// opened, and a document is built back from those objects when a report is saved.

struct SummaryInfo {
    QString title;
    QString subject;
    QString author;
    QString keywords;
    QString comments;
};

struct PageSetup {
    int paperSize = 9; // printer settings paper code: 9 = A4, 1 = Letter
    int orientation = 1; // 1 portrait, 2 landscape
    int paperSource = 0; // printer bin code; 0 = the printer's default
    int duplex = 1; // 1 simplex, 2 vertical, 3 horizontal
    int leftMargin = 1440; // in twips, as the other margins
    int topMargin = 1440;
    int rightMargin = 1440;
    int bottomMargin = 1440;
};

struct StoredPrinter {
    QString driver;
    QString device;
    QString port;
};

struct FieldDefinition {
    QString name;
    ValueType type = ValueType::String;
};

/// A connection property value: text, a Boolean or a number, kept as written.
struct ConnectionProperty {
    QString name;
    enum class Kind { Text, Boolean, Number } kind = Kind::Text;
    QString text;
    bool boolean = false;
    double number = 0;
};

struct TableDefinition {
    QString name;
    QString location;
    QString driver = QStringLiteral("crdb_ado.dll");
    std::vector<ConnectionProperty> connection;
    std::vector<FieldDefinition> fields;
    QString command; // the statement of a table whose location is "Command"
};

enum class JoinType { Inner, LeftOuter, RightOuter, FullOuter };

struct TableLink {
    QString fromTable;
    std::vector<QString> fromFields;
    QString toTable;
    std::vector<QString> toFields;
    JoinType join = JoinType::Inner;
};

struct DefaultValue {
    Value value;
    QString description;
};

struct ParameterDefinition {
    QString name;
    QString prompt;
    int valueType = 12; // 1..16
    int kind = 1; // 1 report parameter, 2 stored-procedure parameter
    bool allowsMultipleValues = false;
    bool onlyListedValues = false;
    std::vector<DefaultValue> defaultValues;
    std::optional<Value> defaultValue;
    std::vector<Value> currentValues;
};

struct FormulaDefinition {
    QString name;
    QString text;
};

enum class SummaryOperation { Sum, Count, Average, Minimum, Maximum };

struct SummaryDefinition {
    SummaryOperation operation = SummaryOperation::Sum;
    QString field; // "{Table.Field}" or "{@Formula}"
};

enum class SortOrder { Ascending, Descending };

struct GroupDefinition {
    QString field; // "{Table.Field}" or "{@Formula}"
    SortOrder order = SortOrder::Ascending;
    /// Groups sorted by a summary, largest first, keeping topNCount of them (9999 = all);
    /// 0 = the groups are sorted by their field.
    int topNCount = 0;
    SummaryDefinition topNSummary;
};

struct SortDefinition {
    QString field;
    SortOrder order = SortOrder::Ascending;
};

struct Font {
    QString family = QStringLiteral("DejaVu Sans");
    double pointSize = 10;
    bool bold = false;
    bool italic = false;
    bool underline = false;
};

enum class Alignment { Left, Center, Right, Justified };

/// PageNofM: "Page 3 of 12"; its format is a template with {page} and {pages}.
enum class SpecialField { PageNumber, TotalPages, PrintDate, RecordNumber, PageNofM };

struct ReportDocument;

struct SubreportLink {
    QString mainField; // a field of the containing report
    QString subreportField; // "{Table.Field}" of the subreport: records must equal the main value
};

struct ObjectDefinition {
    enum class Kind { Text, Field, Special, Summary, Line, Box, Picture, Blob, Subreport };

    Kind kind = Kind::Text;
    QString name;
    int left = 0; // twips, as top, width and height
    int top = 0;
    int width = 0;
    int height = 0;
    bool suppressed = false;
    Font font;
    Alignment alignment = Alignment::Left;
    QString color = QStringLiteral("#000000");
    /// Text, Field: the text wraps at the object's width and the object grows down to hold
    /// it, and its section instance with it.
    bool canGrow = false;
    /// Field, Summary, Special: the display pattern ("#,##0.00", "dd.mm.yyyy"); empty = the
    /// default for the value's type (docs/report-format.md, "Display formats").
    QString format;

    QString text; // Text
    QString field; // Field, Blob: "{Table.Field}", "{@Formula}" or "{?Parameter}"
    SpecialField special = SpecialField::PageNumber; // Special
    SummaryOperation operation = SummaryOperation::Sum; // Summary (over field)
    int group = 0; // Summary: group level, 0 = the whole report
    int lineWidth = 20; // Line, Box: twips
    QString fillColor; // Box: empty = none
    QByteArray image; // Picture: the embedded image file (PNG, JPEG...)
    std::shared_ptr<ReportDocument> subreport; // Subreport
    std::vector<SubreportLink> links; // Subreport
};

struct SectionDefinition {
    QString name; // "RH", "PH", "GH1", "D", "GF1", "PF", "RF"
    int height = 0; // twips
    bool suppressed = false;
    bool newPageBefore = false; // each instance starts a new page (but the first on a page)
    bool newPageAfter = false; // what follows an instance starts a new page
    std::vector<ObjectDefinition> objects;
};

/// Records kept in the file: the values of the report's record columns, in column order.
struct SavedData {
    std::vector<QString> columns; // "{Table.Field}"
    std::vector<std::vector<Value>> rows;
    int recordsRead = 0;
    QString signature; // what the data was read with; differing inputs force a new read
};

struct ReportDocument {
    static constexpr int currentVersion = 1;

    int version = currentVersion;
    SummaryInfo summary;
    PageSetup page;
    StoredPrinter printer;
    std::vector<TableDefinition> tables;
    std::vector<TableLink> links;
    QString selectionFormula;
    QString sqlQuery; // a statement set on the report; empty = generated
    std::vector<ParameterDefinition> parameters;
    std::vector<FormulaDefinition> formulas;
    std::vector<GroupDefinition> groups;
    std::vector<SortDefinition> sorts;
    std::vector<SectionDefinition> sections;
    std::optional<SavedData> savedData;
};

} // namespace reportrt
