#include "documentwriter.h"

#include "durablefile_p.h"
#include "runtimeerror.h"
#include "valuecodec.h"

#include <QDir>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

using namespace Qt::StringLiterals;

namespace reportrt {

namespace {

QJsonValue jsonValue(const Value& v)
{
    switch (v.type()) {
    case ValueType::Null:
        return QJsonValue::Null;
    case ValueType::Number:
        return v.toNumber();
    case ValueType::Currency:
        return valuecodec::formatCurrency(v.currencyScaled());
    case ValueType::String:
        return v.text();
    case ValueType::Boolean:
        return v.toBoolean();
    case ValueType::Date:
        return valuecodec::formatDate(v.julianDay());
    case ValueType::Time:
        return valuecodec::formatTime(v.msecsOfDay());
    case ValueType::DateTime:
        return valuecodec::formatDateTime(v.dateTimeMsecs());
    case ValueType::Binary:
        return QString::fromLatin1(v.bytes().toBase64());
    }
    return QJsonValue::Null;
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

QJsonObject objectJson(const ObjectDefinition& o);

QJsonObject documentJson(const ReportDocument& doc, bool nested, bool withSavedData)
{
    QJsonObject root;
    if (!nested) {
        root.insert(u"format", QStringLiteral("ludmox-report"));
        root.insert(u"version", ReportDocument::currentVersion);
        root.insert(u"summary",
            QJsonObject { { u"title"_s, doc.summary.title }, { u"subject"_s, doc.summary.subject },
                { u"author"_s, doc.summary.author }, { u"keywords"_s, doc.summary.keywords },
                { u"comments"_s, doc.summary.comments } });
        root.insert(u"page",
            QJsonObject { { u"paperSize"_s, doc.page.paperSize },
                { u"orientation"_s, doc.page.orientation },
                { u"paperSource"_s, doc.page.paperSource }, { u"duplex"_s, doc.page.duplex },
                { u"margins"_s,
                    QJsonObject { { u"left"_s, doc.page.leftMargin },
                        { u"top"_s, doc.page.topMargin }, { u"right"_s, doc.page.rightMargin },
                        { u"bottom"_s, doc.page.bottomMargin } } } });
        root.insert(u"printer",
            QJsonObject { { u"driver"_s, doc.printer.driver }, { u"device"_s, doc.printer.device },
                { u"port"_s, doc.printer.port } });
    }
    QJsonArray tables;
    for (const auto& t : doc.tables) {
        QJsonObject table { { u"name"_s, t.name }, { u"location"_s, t.location },
            { u"driver"_s, t.driver } };
        QJsonArray connection;
        for (const auto& p : t.connection) {
            // A password stays in memory for this session only.
            if (p.name.compare(u"Password", Qt::CaseInsensitive) == 0)
                continue;
            QJsonValue value;
            switch (p.kind) {
            case ConnectionProperty::Kind::Text:
                value = p.text;
                break;
            case ConnectionProperty::Kind::Boolean:
                value = p.boolean;
                break;
            case ConnectionProperty::Kind::Number:
                value = p.number;
                break;
            }
            connection.append(QJsonObject { { u"name"_s, p.name }, { u"value"_s, value } });
        }
        table.insert(u"connection", connection);
        QJsonArray fields;
        for (const auto& f : t.fields)
            fields.append(QJsonObject { { u"name"_s, f.name }, { u"type"_s, typeText(f.type) } });
        table.insert(u"fields", fields);
        if (!t.command.isEmpty())
            table.insert(u"command", t.command);
        tables.append(table);
    }
    root.insert(u"tables", tables);
    QJsonArray links;
    for (const auto& l : doc.links) {
        QJsonArray from;
        for (const auto& f : l.fromFields)
            from.append(f);
        QJsonArray to;
        for (const auto& f : l.toFields)
            to.append(f);
        links.append(QJsonObject { { u"from"_s, l.fromTable }, { u"fromFields"_s, from },
            { u"to"_s, l.toTable }, { u"toFields"_s, to }, { u"join"_s, joinText(l.join) } });
    }
    root.insert(u"links", links);
    root.insert(u"selectionFormula", doc.selectionFormula);
    if (!doc.sqlQuery.isEmpty())
        root.insert(u"sqlQuery", doc.sqlQuery);
    QJsonArray parameters;
    for (const auto& p : doc.parameters) {
        QJsonObject parameter { { u"name"_s, p.name }, { u"prompt"_s, p.prompt },
            { u"valueType"_s, p.valueType }, { u"kind"_s, p.kind },
            { u"allowsMultipleValues"_s, p.allowsMultipleValues },
            { u"onlyListedValues"_s, p.onlyListedValues } };
        QJsonArray defaults;
        for (const auto& d : p.defaultValues)
            defaults.append(QJsonObject {
                { u"value"_s, jsonValue(d.value) }, { u"description"_s, d.description } });
        parameter.insert(u"defaultValues", defaults);
        if (p.defaultValue)
            parameter.insert(u"defaultValue", jsonValue(*p.defaultValue));
        QJsonArray current;
        for (const auto& v : p.currentValues)
            current.append(jsonValue(v));
        parameter.insert(u"currentValues", current);
        parameters.append(parameter);
    }
    root.insert(u"parameters", parameters);
    QJsonArray formulas;
    for (const auto& f : doc.formulas)
        formulas.append(QJsonObject { { u"name"_s, f.name }, { u"text"_s, f.text } });
    root.insert(u"formulas", formulas);
    QJsonArray groups;
    for (const auto& g : doc.groups) {
        QJsonObject group { { u"field"_s, g.field }, { u"order"_s, orderText(g.order) } };
        if (g.topNCount > 0)
            group.insert(u"topN",
                QJsonObject { { u"count"_s, g.topNCount },
                    { u"summary"_s,
                        QJsonObject { { u"operation"_s, operationText(g.topNSummary.operation) },
                            { u"field"_s, g.topNSummary.field } } } });
        groups.append(group);
    }
    root.insert(u"groups", groups);
    QJsonArray sorts;
    for (const auto& s : doc.sorts)
        sorts.append(QJsonObject { { u"field"_s, s.field }, { u"order"_s, orderText(s.order) } });
    root.insert(u"sorts", sorts);
    QJsonArray sections;
    for (const auto& s : doc.sections) {
        QJsonArray objects;
        for (const auto& o : s.objects)
            objects.append(objectJson(o));
        QJsonObject section { { u"name"_s, s.name }, { u"height"_s, s.height },
            { u"suppressed"_s, s.suppressed }, { u"objects"_s, objects } };
        if (s.newPageBefore)
            section.insert(u"newPageBefore", true);
        if (s.newPageAfter)
            section.insert(u"newPageAfter", true);
        sections.append(section);
    }
    root.insert(u"sections", sections);
    if (!nested && withSavedData && doc.savedData) {
        QJsonArray columns;
        for (const auto& c : doc.savedData->columns)
            columns.append(c);
        QJsonArray rows;
        for (const auto& row : doc.savedData->rows) {
            QJsonArray values;
            for (const auto& v : row)
                values.append(jsonValue(v));
            rows.append(values);
        }
        root.insert(u"savedData",
            QJsonObject { { u"columns"_s, columns }, { u"rows"_s, rows },
                { u"recordsRead"_s, doc.savedData->recordsRead },
                { u"signature"_s, doc.savedData->signature } });
    }
    return root;
}

QJsonObject objectJson(const ObjectDefinition& o)
{
    using Kind = ObjectDefinition::Kind;
    static const char16_t* kinds[] = { u"text", u"field", u"special", u"summary", u"line", u"box",
        u"picture", u"blob", u"subreport" };
    static const char16_t* alignments[] = { u"left", u"center", u"right", u"justified" };
    static const char16_t* specials[]
        = { u"pageNumber", u"totalPages", u"printDate", u"recordNumber", u"pageNofM" };
    QJsonObject json { { u"kind"_s, QString::fromUtf16(kinds[static_cast<int>(o.kind)]) },
        { u"left"_s, o.left }, { u"top"_s, o.top }, { u"width"_s, o.width },
        { u"height"_s, o.height }, { u"suppressed"_s, o.suppressed },
        { u"font"_s,
            QJsonObject { { u"family"_s, o.font.family }, { u"size"_s, o.font.pointSize },
                { u"bold"_s, o.font.bold }, { u"italic"_s, o.font.italic },
                { u"underline"_s, o.font.underline } } },
        { u"alignment"_s, QString::fromUtf16(alignments[static_cast<int>(o.alignment)]) },
        { u"color"_s, o.color } };
    if (!o.name.isEmpty())
        json.insert(u"name", o.name);
    if (o.canGrow)
        json.insert(u"canGrow", true);
    if (!o.format.isEmpty())
        json.insert(u"format", o.format);
    switch (o.kind) {
    case Kind::Text:
        json.insert(u"text", o.text);
        break;
    case Kind::Field:
    case Kind::Blob:
        json.insert(u"field", o.field);
        break;
    case Kind::Special:
        json.insert(u"special", QString::fromUtf16(specials[static_cast<int>(o.special)]));
        break;
    case Kind::Summary:
        json.insert(u"operation", operationText(o.operation));
        json.insert(u"field", o.field);
        json.insert(u"group", o.group);
        break;
    case Kind::Line:
        json.insert(u"lineWidth", o.lineWidth);
        break;
    case Kind::Box:
        json.insert(u"lineWidth", o.lineWidth);
        if (!o.fillColor.isEmpty())
            json.insert(u"fillColor", o.fillColor);
        break;
    case Kind::Picture:
        if (!o.image.isEmpty())
            json.insert(u"image", QString::fromLatin1(o.image.toBase64()));
        break;
    case Kind::Subreport: {
        if (o.subreport)
            json.insert(u"subreport", documentJson(*o.subreport, true, false));
        QJsonArray links;
        for (const auto& l : o.links)
            links.append(QJsonObject {
                { u"mainField"_s, l.mainField }, { u"subreportField"_s, l.subreportField } });
        json.insert(u"links", links);
        break;
    }
    }
    return json;
}

} // namespace

QByteArray DocumentWriter::serialize(const ReportDocument& document, bool withSavedData)
{
    return QJsonDocument(documentJson(document, false, withSavedData))
        .toJson(QJsonDocument::Indented);
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
