#include "reportrt/document/documentwriter.h"

#include "core/jsonwriter.h"
#include "reportrt/base/durablefile_p.h"
#include "reportrt/base/invarianttext.h"
#include "reportrt/base/runtimeerror.h"

#include <QDir>
#include <cmath>

using namespace Qt::StringLiterals;

namespace reportrt {

namespace {

using core::JsonNode;

JsonNode json(const QString& text)
{
    return JsonNode::fromString(text);
}

JsonNode json(bool value)
{
    return JsonNode::fromBool(value);
}

JsonNode json(int value)
{
    return JsonNode::fromInteger(value);
}

/// Whole numbers are written without a fraction, as people write them in a report file.
JsonNode json(double value)
{
    if (std::trunc(value) == value && std::abs(value) < 9.0e15)
        return JsonNode::fromInteger(static_cast<int64_t>(value));
    return JsonNode::fromDouble(value);
}

JsonNode object(std::initializer_list<std::pair<const char16_t*, JsonNode>> members)
{
    JsonNode node = JsonNode::object();
    for (const auto& [key, value] : members)
        node.insert(QString::fromUtf16(key), value);
    return node;
}

JsonNode textArray(const std::vector<QString>& texts)
{
    JsonNode node = JsonNode::array();
    for (const QString& text : texts)
        node.append(json(text));
    return node;
}

JsonNode jsonValue(const Value& v)
{
    switch (v.type()) {
    case ValueType::Null:
        return JsonNode::null();
    case ValueType::Number:
        return json(v.toNumber());
    case ValueType::Currency:
        return json(invarianttext::formatCurrency(v.currencyScaled()));
    case ValueType::String:
        return json(v.text());
    case ValueType::Boolean:
        return json(v.toBoolean());
    case ValueType::Date:
        return json(invarianttext::formatDate(v.julianDay()));
    case ValueType::Time:
        return json(invarianttext::formatTime(v.msecsOfDay()));
    case ValueType::DateTime:
        return json(invarianttext::formatDateTime(v.dateTimeMsecs()));
    case ValueType::Binary:
        return json(QString::fromLatin1(v.bytes().toBase64()));
    }
    return JsonNode::null();
}

QString typeText(ValueType t)
{
    return valueTypeName(t);
}

QString joinText(JoinType j)
{
    switch (j) {
    case JoinType::Inner:
        return QStringLiteral("inner");
    case JoinType::LeftOuter:
        return QStringLiteral("leftOuter");
    case JoinType::RightOuter:
        return QStringLiteral("rightOuter");
    case JoinType::FullOuter:
        return QStringLiteral("fullOuter");
    }
    return {};
}

QString orderText(SortOrder o)
{
    return o == SortOrder::Ascending ? QStringLiteral("ascending") : QStringLiteral("descending");
}

QString operationText(SummaryOperation o)
{
    switch (o) {
    case SummaryOperation::Sum:
        return QStringLiteral("sum");
    case SummaryOperation::Count:
        return QStringLiteral("count");
    case SummaryOperation::Average:
        return QStringLiteral("average");
    case SummaryOperation::Minimum:
        return QStringLiteral("minimum");
    case SummaryOperation::Maximum:
        return QStringLiteral("maximum");
    }
    return {};
}

JsonNode objectJson(const ObjectDefinition& o);

JsonNode documentJson(const ReportDocument& doc, bool nested, bool withSavedData)
{
    JsonNode root = JsonNode::object();
    if (!nested) {
        root.insert(u"format"_s, json(u"ludmox-report"_s));
        root.insert(u"version"_s, json(ReportDocument::currentVersion));
        root.insert(u"summary"_s,
            object({ { u"title", json(doc.summary.title) },
                { u"subject", json(doc.summary.subject) }, { u"author", json(doc.summary.author) },
                { u"keywords", json(doc.summary.keywords) },
                { u"comments", json(doc.summary.comments) } }));
        root.insert(u"page"_s,
            object({ { u"paperSize", json(doc.page.paperSize) },
                { u"orientation", json(doc.page.orientation) },
                { u"paperSource", json(doc.page.paperSource) },
                { u"duplex", json(doc.page.duplex) },
                { u"margins",
                    object({ { u"left", json(doc.page.leftMargin) },
                        { u"top", json(doc.page.topMargin) },
                        { u"right", json(doc.page.rightMargin) },
                        { u"bottom", json(doc.page.bottomMargin) } }) } }));
        root.insert(u"printer"_s,
            object({ { u"driver", json(doc.printer.driver) },
                { u"device", json(doc.printer.device) }, { u"port", json(doc.printer.port) } }));
    }
    JsonNode& tables = root.insert(u"tables"_s, JsonNode::array());
    for (const auto& t : doc.tables) {
        JsonNode& table = tables.append(object({ { u"name", json(t.name) },
            { u"location", json(t.location) }, { u"driver", json(t.driver) } }));
        JsonNode& connection = table.insert(u"connection"_s, JsonNode::array());
        for (const auto& p : t.connection) {
            // A password stays in memory for this session only.
            if (p.name.compare(u"Password", Qt::CaseInsensitive) == 0)
                continue;
            JsonNode value;
            switch (p.kind) {
            case ConnectionProperty::Kind::Text:
                value = json(p.text);
                break;
            case ConnectionProperty::Kind::Boolean:
                value = json(p.boolean);
                break;
            case ConnectionProperty::Kind::Number:
                value = json(p.number);
                break;
            }
            connection.append(object({ { u"name", json(p.name) }, { u"value", value } }));
        }
        JsonNode& fields = table.insert(u"fields"_s, JsonNode::array());
        for (const auto& f : t.fields)
            fields.append(
                object({ { u"name", json(f.name) }, { u"type", json(typeText(f.type)) } }));
        if (!t.command.isEmpty())
            table.insert(u"command"_s, json(t.command));
    }
    JsonNode& links = root.insert(u"links"_s, JsonNode::array());
    for (const auto& l : doc.links) {
        links.append(object({ { u"from", json(l.fromTable) },
            { u"fromFields", textArray(l.fromFields) }, { u"to", json(l.toTable) },
            { u"toFields", textArray(l.toFields) }, { u"join", json(joinText(l.join)) } }));
    }
    root.insert(u"selectionFormula"_s, json(doc.selectionFormula));
    if (!doc.sqlQuery.isEmpty())
        root.insert(u"sqlQuery"_s, json(doc.sqlQuery));
    JsonNode& parameters = root.insert(u"parameters"_s, JsonNode::array());
    for (const auto& p : doc.parameters) {
        JsonNode& parameter = parameters.append(object({ { u"name", json(p.name) },
            { u"prompt", json(p.prompt) }, { u"valueType", json(p.valueType) },
            { u"kind", json(p.kind) }, { u"allowsMultipleValues", json(p.allowsMultipleValues) },
            { u"onlyListedValues", json(p.onlyListedValues) } }));
        JsonNode& defaults = parameter.insert(u"defaultValues"_s, JsonNode::array());
        for (const auto& d : p.defaultValues)
            defaults.append(object(
                { { u"value", jsonValue(d.value) }, { u"description", json(d.description) } }));
        if (p.defaultValue)
            parameter.insert(u"defaultValue"_s, jsonValue(*p.defaultValue));
        JsonNode& current = parameter.insert(u"currentValues"_s, JsonNode::array());
        for (const auto& v : p.currentValues)
            current.append(jsonValue(v));
    }
    JsonNode& formulas = root.insert(u"formulas"_s, JsonNode::array());
    for (const auto& f : doc.formulas)
        formulas.append(object({ { u"name", json(f.name) }, { u"text", json(f.text) } }));
    JsonNode& groups = root.insert(u"groups"_s, JsonNode::array());
    for (const auto& g : doc.groups) {
        JsonNode& group = groups.append(
            object({ { u"field", json(g.field) }, { u"order", json(orderText(g.order)) } }));
        if (g.topNCount > 0)
            group.insert(u"topN"_s,
                object({ { u"count", json(g.topNCount) },
                    { u"summary",
                        object({ { u"operation", json(operationText(g.topNSummary.operation)) },
                            { u"field", json(g.topNSummary.field) } }) } }));
    }
    JsonNode& sorts = root.insert(u"sorts"_s, JsonNode::array());
    for (const auto& s : doc.sorts)
        sorts.append(
            object({ { u"field", json(s.field) }, { u"order", json(orderText(s.order)) } }));
    JsonNode& sections = root.insert(u"sections"_s, JsonNode::array());
    for (const auto& s : doc.sections) {
        JsonNode& section = sections.append(object({ { u"name", json(s.name) },
            { u"height", json(s.height) }, { u"suppressed", json(s.suppressed) } }));
        JsonNode& objects = section.insert(u"objects"_s, JsonNode::array());
        for (const auto& o : s.objects)
            objects.append(objectJson(o));
        if (s.newPageBefore)
            section.insert(u"newPageBefore"_s, json(true));
        if (s.newPageAfter)
            section.insert(u"newPageAfter"_s, json(true));
    }
    if (!nested && withSavedData && doc.savedData) {
        JsonNode& saved = root.insert(u"savedData"_s, JsonNode::object());
        saved.insert(u"columns"_s, textArray(doc.savedData->columns));
        JsonNode& rows = saved.insert(u"rows"_s, JsonNode::array());
        for (const auto& row : doc.savedData->rows) {
            JsonNode& values = rows.append(JsonNode::array());
            for (const auto& v : row)
                values.append(jsonValue(v));
        }
        saved.insert(u"recordsRead"_s, json(doc.savedData->recordsRead));
        saved.insert(u"signature"_s, json(doc.savedData->signature));
    }
    return root;
}

JsonNode objectJson(const ObjectDefinition& o)
{
    using Kind = ObjectDefinition::Kind;
    static const char16_t* kinds[] = { u"text", u"field", u"special", u"summary", u"line", u"box",
        u"picture", u"blob", u"subreport" };
    static const char16_t* alignments[] = { u"left", u"center", u"right", u"justified" };
    static const char16_t* specials[]
        = { u"pageNumber", u"totalPages", u"printDate", u"recordNumber", u"pageNofM" };
    JsonNode node = object({ { u"kind", json(QString::fromUtf16(kinds[static_cast<int>(o.kind)])) },
        { u"left", json(o.left) }, { u"top", json(o.top) }, { u"width", json(o.width) },
        { u"height", json(o.height) }, { u"suppressed", json(o.suppressed) },
        { u"font",
            object({ { u"family", json(o.font.family) }, { u"size", json(o.font.pointSize) },
                { u"bold", json(o.font.bold) }, { u"italic", json(o.font.italic) },
                { u"underline", json(o.font.underline) } }) },
        { u"alignment", json(QString::fromUtf16(alignments[static_cast<int>(o.alignment)])) },
        { u"color", json(o.color) } });
    if (!o.name.isEmpty())
        node.insert(u"name"_s, json(o.name));
    if (o.canGrow)
        node.insert(u"canGrow"_s, json(true));
    if (!o.format.isEmpty())
        node.insert(u"format"_s, json(o.format));
    switch (o.kind) {
    case Kind::Text:
        node.insert(u"text"_s, json(o.text));
        break;
    case Kind::Field:
    case Kind::Blob:
        node.insert(u"field"_s, json(o.field));
        break;
    case Kind::Special:
        node.insert(u"special"_s, json(QString::fromUtf16(specials[static_cast<int>(o.special)])));
        break;
    case Kind::Summary:
        node.insert(u"operation"_s, json(operationText(o.operation)));
        node.insert(u"field"_s, json(o.field));
        node.insert(u"group"_s, json(o.group));
        break;
    case Kind::Line:
        node.insert(u"lineWidth"_s, json(o.lineWidth));
        break;
    case Kind::Box:
        node.insert(u"lineWidth"_s, json(o.lineWidth));
        if (!o.fillColor.isEmpty())
            node.insert(u"fillColor"_s, json(o.fillColor));
        break;
    case Kind::Picture:
        if (!o.image.isEmpty())
            node.insert(u"image"_s, json(QString::fromLatin1(o.image.toBase64())));
        break;
    case Kind::Subreport: {
        if (o.subreport)
            node.insert(u"subreport"_s, documentJson(*o.subreport, true, false));
        JsonNode& links = node.insert(u"links"_s, JsonNode::array());
        for (const auto& l : o.links)
            links.append(object({ { u"mainField", json(l.mainField) },
                { u"subreportField", json(l.subreportField) } }));
        break;
    }
    }
    return node;
}

} // namespace

QByteArray DocumentWriter::serialize(const ReportDocument& document, bool withSavedData)
{
    return core::JsonWriter::write(
        documentJson(document, false, withSavedData), core::JsonWriter::Style::Indented);
}

void DocumentWriter::writeFile(
    const ReportDocument& document, const QString& path, bool withSavedData)
{
    const QByteArray data = serialize(document, withSavedData);
    DurableFile file(path);
    if (!file.start() || file.write(data) != data.size() || !file.finish())
        raiseError(Error::SaveFailed,
            QStringLiteral("Cannot save the report to %1: %2")
                .arg(QDir::toNativeSeparators(path), file.failure()));
}

} // namespace reportrt
