#include "reportrt/document/documentreader.h"

#include "core/jsonreader.h"
#include "reportrt/base/invarianttext.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/document/documentenvironment.h"
#include "reportrt/formula/formulacompiler.h"

#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>
#include <QSet>
#include <algorithm>
#include <cmath>
#include <numeric>

namespace reportrt {

using core::JsonNode;
using core::JsonReader;

namespace {

constexpr int maxTwips = 1000000; // about 17.6 m: anything beyond is a damaged file
constexpr int maxTables = 256;
constexpr int maxFields = 4096;
constexpr int maxLinks = 1024;
constexpr int maxParameters = 1024;
constexpr int maxFormulas = 4096;
constexpr int maxGroups = 32;
constexpr int maxSorts = 64;
constexpr int maxSections = 1024;
constexpr int maxObjects = 100000;
constexpr int maxValues = 100000;

using Kind = JsonNode::Kind;

struct PendingReference {
    QString field;
    TextPosition position;
    bool allowParameters = false;
    bool numericOnly = false;
    bool needsOrder = false; // minimum, maximum, groups and sorts order values
};

struct PendingFormula {
    QString name; // "Record Selection" or "@Name"
    QString text;
    TextPosition position;
    bool mustBeBoolean = false;
};

class Reader {
public:
    explicit Reader(QString fileName)
        : m_file(std::move(fileName))
    { }

    ReportDocument document(const JsonNode& root, bool nested)
    {
        ReportDocument doc;
        expectObject(root, QStringLiteral("the report document"));
        if (nested) {
            expectKeys(root,
                { u"tables", u"links", u"selectionFormula", u"sqlQuery", u"parameters", u"formulas",
                    u"groups", u"sorts", u"sections" });
        } else {
            expectKeys(root,
                { u"format", u"version", u"summary", u"page", u"printer", u"tables", u"links",
                    u"selectionFormula", u"sqlQuery", u"parameters", u"formulas", u"groups",
                    u"sorts", u"sections", u"savedData" });
            const JsonNode* format = root.member(QStringLiteral("format"));
            if (!format || format->kind != Kind::String || format->text != u"ludmox-report")
                fail(format ? *format : root,
                    QStringLiteral(
                        "not a LUD Mox report document: \"format\" must be \"ludmox-report\""));
            doc.version = integer(root, u"version", 1, 1000000, 0, true);
            if (doc.version > ReportDocument::currentVersion)
                fail(*root.member(QStringLiteral("version")),
                    QStringLiteral(
                        "the document has format version %1; this runtime reads up to version %2")
                        .arg(doc.version)
                        .arg(ReportDocument::currentVersion));
            if (const JsonNode* n = optionalObject(root, u"summary"))
                summary(*n, doc.summary);
            if (const JsonNode* n = optionalObject(root, u"page"))
                page(*n, doc.page);
            if (const JsonNode* n = optionalObject(root, u"printer")) {
                expectKeys(*n, { u"driver", u"device", u"port" });
                doc.printer.driver = string(*n, u"driver");
                doc.printer.device = string(*n, u"device");
                doc.printer.port = string(*n, u"port");
            }
        }
        if (const JsonNode* n = optionalArray(root, u"tables", maxTables)) {
            for (const JsonNode& item : n->items)
                doc.tables.push_back(table(item, doc.tables));
        }
        bool hasCommand = false;
        for (const auto& t : doc.tables)
            hasCommand = hasCommand || t.location.compare(u"Command", Qt::CaseInsensitive) == 0;
        if (hasCommand && doc.tables.size() > 1)
            fail(*root.member(QStringLiteral("tables")),
                QStringLiteral("a report with an SQL command table has no other tables"));

        DocumentEnvironment environment(doc.tables, doc.parameters, doc.formulas);
        m_environment = &environment;

        if (const JsonNode* n = optionalArray(root, u"links", maxLinks)) {
            for (const JsonNode& item : n->items)
                doc.links.push_back(link(item, doc));
            checkLinkCycles(*n, doc);
        }
        if (const JsonNode* n = root.member(QStringLiteral("selectionFormula"))) {
            doc.selectionFormula = stringValue(*n, QStringLiteral("selectionFormula"));
            m_formulas.push_back(
                { QStringLiteral("Record Selection"), doc.selectionFormula, n->position, true });
        }
        doc.sqlQuery = string(root, u"sqlQuery");
        if (const JsonNode* n = optionalArray(root, u"parameters", maxParameters)) {
            for (const JsonNode& item : n->items)
                doc.parameters.push_back(parameter(item, doc.parameters));
        }
        if (const JsonNode* n = optionalArray(root, u"formulas", maxFormulas)) {
            for (const JsonNode& item : n->items) {
                expectObject(item, QStringLiteral("a formula"));
                expectKeys(item, { u"name", u"text" });
                FormulaDefinition f;
                f.name = name(item, u"name");
                for (const auto& other : doc.formulas) {
                    if (other.name.compare(f.name, Qt::CaseInsensitive) == 0)
                        fail(*item.member(QStringLiteral("name")),
                            QStringLiteral("a second formula named \"%1\"").arg(f.name));
                }
                f.text = string(item, u"text", true);
                m_formulas.push_back({ u'@' + f.name, f.text,
                    item.member(QStringLiteral("text"))->position, false });
                doc.formulas.push_back(f);
            }
        }
        if (const JsonNode* n = optionalArray(root, u"groups", maxGroups)) {
            for (const JsonNode& item : n->items)
                doc.groups.push_back(group(item));
        }
        if (const JsonNode* n = optionalArray(root, u"sorts", maxSorts)) {
            for (const JsonNode& item : n->items) {
                expectObject(item, QStringLiteral("a sort"));
                expectKeys(item, { u"field", u"order" });
                SortDefinition s;
                s.field = reference(item, u"field", false, false, true);
                s.order = order(item);
                doc.sorts.push_back(s);
            }
        }
        if (const JsonNode* n = optionalArray(root, u"sections", maxSections)) {
            for (const JsonNode& item : n->items)
                doc.sections.push_back(section(item, doc, nested));
        }
        if (!nested) {
            if (const JsonNode* n = optionalObject(root, u"savedData"))
                doc.savedData = savedData(*n, doc);
        }
        resolve(doc);
        m_environment = nullptr;
        return doc;
    }

private:
    [[noreturn]] void fail(const JsonNode& at, const QString& message) const
    {
        fail(at.position, message);
    }
    [[noreturn]] void fail(TextPosition at, const QString& message) const
    {
        raiseError(Error::InvalidDocument,
            QStringLiteral("%1: line %2, column %3: %4")
                .arg(m_file)
                .arg(at.line)
                .arg(at.column)
                .arg(message));
    }

    void expectObject(const JsonNode& n, const QString& what) const
    {
        if (n.kind != Kind::Object)
            fail(n, QStringLiteral("%1 must be an object, not %2").arg(what, n.kindName()));
    }

    void expectKeys(const JsonNode& n, std::initializer_list<const char16_t*> allowed) const
    {
        for (const auto& [key, value] : n.members) {
            bool known = false;
            for (const char16_t* a : allowed)
                known = known || key == QStringView(a);
            if (!known) {
                QStringList names;
                for (const char16_t* a : allowed)
                    names << QString::fromUtf16(a);
                fail(value,
                    QStringLiteral("unknown key \"%1\" (expected one of: %2)")
                        .arg(key, names.join(u", ")));
            }
        }
    }

    const JsonNode* optionalObject(const JsonNode& n, const char16_t* key) const
    {
        const JsonNode* m = n.member(QString::fromUtf16(key));
        if (m)
            expectObject(*m, u'"' + QString::fromUtf16(key) + u'"');
        return m;
    }

    const JsonNode* optionalArray(const JsonNode& n, const char16_t* key, int maxCount) const
    {
        const JsonNode* m = n.member(QString::fromUtf16(key));
        if (!m)
            return nullptr;
        if (m->kind != Kind::Array)
            fail(*m,
                QStringLiteral("\"%1\" must be an array, not %2")
                    .arg(QStringView(key))
                    .arg(m->kindName()));
        if (static_cast<qsizetype>(m->items.size()) > maxCount)
            fail(*m,
                QStringLiteral("\"%1\" has %2 entries; at most %3 are allowed")
                    .arg(QStringView(key))
                    .arg(m->items.size())
                    .arg(maxCount));
        return m;
    }

    QString stringValue(const JsonNode& n, const QString& key) const
    {
        if (n.kind != Kind::String)
            fail(n, QStringLiteral("\"%1\" must be a string, not %2").arg(key, n.kindName()));
        return n.text;
    }

    QString string(const JsonNode& n, const char16_t* key, bool required = false) const
    {
        const QString k = QString::fromUtf16(key);
        const JsonNode* m = n.member(k);
        if (!m) {
            if (required)
                fail(n, QStringLiteral("\"%1\" is missing").arg(k));
            return QString();
        }
        return stringValue(*m, k);
    }

    QString name(const JsonNode& n, const char16_t* key) const
    {
        const QString value = string(n, key, true);
        if (value.trimmed().isEmpty())
            fail(*n.member(QString::fromUtf16(key)),
                QStringLiteral("\"%1\" must not be empty").arg(QStringView(key)));
        for (const QChar c : value) {
            if (c == u'{' || c == u'}' || c.unicode() < 0x20)
                fail(*n.member(QString::fromUtf16(key)),
                    QStringLiteral("the name \"%1\" contains a character that names cannot hold")
                        .arg(value));
        }
        return value;
    }

    int integer(const JsonNode& n, const char16_t* key, int low, int high, int fallback,
        bool required = false) const
    {
        const JsonNode* m = n.member(QString::fromUtf16(key));
        if (!m) {
            if (required)
                fail(n, QStringLiteral("\"%1\" is missing").arg(QStringView(key)));
            return fallback;
        }
        if (m->kind != Kind::Number || m->number != std::trunc(m->number))
            fail(*m, QStringLiteral("\"%1\" must be a whole number").arg(QStringView(key)));
        if (m->number < low || m->number > high)
            fail(*m,
                QStringLiteral("\"%1\" is %2; it must be from %3 to %4")
                    .arg(QStringView(key))
                    .arg(m->number)
                    .arg(low)
                    .arg(high));
        return static_cast<int>(m->number);
    }

    bool boolean(const JsonNode& n, const char16_t* key, bool fallback = false) const
    {
        const JsonNode* m = n.member(QString::fromUtf16(key));
        if (!m)
            return fallback;
        if (m->kind != Kind::Boolean)
            fail(*m, QStringLiteral("\"%1\" must be true or false").arg(QStringView(key)));
        return m->boolean;
    }

    template <class Enum, size_t N>
    Enum choice(const JsonNode& n, const char16_t* key,
        const std::pair<const char16_t*, Enum> (&options)[N], Enum fallback,
        bool required = false) const
    {
        const JsonNode* m = n.member(QString::fromUtf16(key));
        if (!m) {
            if (required)
                fail(n, QStringLiteral("\"%1\" is missing").arg(QStringView(key)));
            return fallback;
        }
        QStringList names;
        for (const auto& [text, value] : options) {
            if (m->kind == Kind::String && m->text == QStringView(text))
                return value;
            names << u'"' + QString::fromUtf16(text) + u'"';
        }
        fail(*m,
            QStringLiteral("\"%1\" must be one of %2")
                .arg(QStringView(key))
                .arg(names.join(u", ")));
    }

    void summary(const JsonNode& n, SummaryInfo& s) const
    {
        expectKeys(n, { u"title", u"subject", u"author", u"keywords", u"comments" });
        s.title = string(n, u"title");
        s.subject = string(n, u"subject");
        s.author = string(n, u"author");
        s.keywords = string(n, u"keywords");
        s.comments = string(n, u"comments");
    }

    void page(const JsonNode& n, PageSetup& p) const
    {
        expectKeys(n, { u"paperSize", u"orientation", u"paperSource", u"duplex", u"margins" });
        p.paperSize = integer(n, u"paperSize", 1, 32767, p.paperSize);
        p.orientation = integer(n, u"orientation", 1, 2, p.orientation);
        p.paperSource = integer(n, u"paperSource", 0, 32767, p.paperSource);
        p.duplex = integer(n, u"duplex", 1, 3, p.duplex);
        if (const JsonNode* m = optionalObject(n, u"margins")) {
            expectKeys(*m, { u"left", u"top", u"right", u"bottom" });
            p.leftMargin = integer(*m, u"left", 0, maxTwips, p.leftMargin);
            p.topMargin = integer(*m, u"top", 0, maxTwips, p.topMargin);
            p.rightMargin = integer(*m, u"right", 0, maxTwips, p.rightMargin);
            p.bottomMargin = integer(*m, u"bottom", 0, maxTwips, p.bottomMargin);
        }
    }

    ValueType fieldType(const JsonNode& n) const
    {
        static const std::pair<const char16_t*, ValueType> types[] = {
            { u"number", ValueType::Number },
            { u"currency", ValueType::Currency },
            { u"string", ValueType::String },
            { u"boolean", ValueType::Boolean },
            { u"date", ValueType::Date },
            { u"time", ValueType::Time },
            { u"datetime", ValueType::DateTime },
            { u"binary", ValueType::Binary },
        };
        return choice(n, u"type", types, ValueType::String, true);
    }

    TableDefinition table(const JsonNode& n, const std::vector<TableDefinition>& earlier) const
    {
        expectObject(n, QStringLiteral("a table"));
        expectKeys(n, { u"name", u"location", u"driver", u"connection", u"fields", u"command" });
        TableDefinition t;
        t.name = name(n, u"name");
        if (t.name.contains(u'.'))
            fail(*n.member(QStringLiteral("name")),
                QStringLiteral("a table name cannot contain '.'"));
        for (const auto& other : earlier) {
            if (other.name.compare(t.name, Qt::CaseInsensitive) == 0)
                fail(*n.member(QStringLiteral("name")),
                    QStringLiteral("a second table named \"%1\"").arg(t.name));
        }
        t.location = n.member(QStringLiteral("location")) ? string(n, u"location") : t.name;
        if (n.member(QStringLiteral("driver")))
            t.driver = string(n, u"driver");
        if (const JsonNode* c = optionalArray(n, u"connection", 256)) {
            for (const JsonNode& item : c->items) {
                expectObject(item, QStringLiteral("a connection property"));
                expectKeys(item, { u"name", u"value" });
                ConnectionProperty p;
                p.name = string(item, u"name", true);
                const JsonNode* v = item.member(QStringLiteral("value"));
                if (!v)
                    fail(item, QStringLiteral("\"value\" is missing"));
                if (v->kind == Kind::String) {
                    p.text = v->text;
                } else if (v->kind == Kind::Boolean) {
                    p.kind = ConnectionProperty::Kind::Boolean;
                    p.boolean = v->boolean;
                } else if (v->kind == Kind::Number) {
                    p.kind = ConnectionProperty::Kind::Number;
                    p.number = v->number;
                } else {
                    fail(*v,
                        QStringLiteral(
                            "a connection property value is a string, a Boolean or a number"));
                }
                t.connection.push_back(p);
            }
        }
        if (const JsonNode* f = optionalArray(n, u"fields", maxFields)) {
            for (const JsonNode& item : f->items) {
                expectObject(item, QStringLiteral("a field"));
                expectKeys(item, { u"name", u"type" });
                FieldDefinition field;
                field.name = name(item, u"name");
                for (const auto& other : t.fields) {
                    if (other.name.compare(field.name, Qt::CaseInsensitive) == 0)
                        fail(*item.member(QStringLiteral("name")),
                            QStringLiteral("a second field named \"%1\" in table %2")
                                .arg(field.name, t.name));
                }
                field.type = fieldType(item);
                t.fields.push_back(field);
            }
        }
        t.command = string(n, u"command");
        const bool isCommand = t.location.compare(u"Command", Qt::CaseInsensitive) == 0;
        if (isCommand && t.command.trimmed().isEmpty())
            fail(
                n, QStringLiteral("the command table %1 has no \"command\" statement").arg(t.name));
        if (!isCommand && !t.command.isEmpty())
            fail(*n.member(QStringLiteral("command")),
                QStringLiteral("only a table with location \"Command\" has a command statement"));
        return t;
    }

    std::vector<QString> fieldList(const JsonNode& n, const char16_t* key,
        const TableDefinition& table, std::vector<ValueType>& types) const
    {
        const JsonNode* list = optionalArray(n, key, 64);
        if (!list || list->items.empty())
            fail(n, QStringLiteral("\"%1\" must list one or more fields").arg(QStringView(key)));
        std::vector<QString> result;
        for (const JsonNode& item : list->items) {
            const QString field = stringValue(item, QString::fromUtf16(key));
            const FieldDefinition* found = nullptr;
            for (const auto& f : table.fields) {
                if (f.name.compare(field, Qt::CaseInsensitive) == 0)
                    found = &f;
            }
            if (!found)
                fail(item, QStringLiteral("unknown field %1 in table %2").arg(field, table.name));
            types.push_back(found->type);
            result.push_back(found->name);
        }
        return result;
    }

    const TableDefinition& tableNamed(
        const JsonNode& n, const char16_t* key, const ReportDocument& doc) const
    {
        const QString name = string(n, key, true);
        const int index = m_environment->tableIndex(name);
        if (index < 0)
            fail(*n.member(QString::fromUtf16(key)),
                QStringLiteral("unknown table \"%1\"").arg(name));
        return doc.tables[static_cast<size_t>(index)];
    }

    TableLink link(const JsonNode& n, const ReportDocument& doc) const
    {
        expectObject(n, QStringLiteral("a link"));
        expectKeys(n, { u"from", u"fromFields", u"to", u"toFields", u"join" });
        TableLink l;
        const TableDefinition& from = tableNamed(n, u"from", doc);
        const TableDefinition& to = tableNamed(n, u"to", doc);
        if (&from == &to)
            fail(n, QStringLiteral("a link joins table %1 with itself").arg(from.name));
        l.fromTable = from.name;
        l.toTable = to.name;
        std::vector<ValueType> fromTypes;
        std::vector<ValueType> toTypes;
        l.fromFields = fieldList(n, u"fromFields", from, fromTypes);
        l.toFields = fieldList(n, u"toFields", to, toTypes);
        if (l.fromFields.size() != l.toFields.size())
            fail(n, QStringLiteral("a link needs as many \"fromFields\" as \"toFields\""));
        for (size_t i = 0; i < fromTypes.size(); ++i) {
            const bool numeric
                = (fromTypes[i] == ValueType::Number || fromTypes[i] == ValueType::Currency)
                && (toTypes[i] == ValueType::Number || toTypes[i] == ValueType::Currency);
            if (fromTypes[i] != toTypes[i] && !numeric)
                fail(n,
                    QStringLiteral("the link compares %1.%2 (%3) with %4.%5 (%6)")
                        .arg(from.name, l.fromFields[i], valueTypeName(fromTypes[i]), to.name,
                            l.toFields[i], valueTypeName(toTypes[i])));
        }
        static const std::pair<const char16_t*, JoinType> joins[] = {
            { u"inner", JoinType::Inner },
            { u"leftOuter", JoinType::LeftOuter },
            { u"rightOuter", JoinType::RightOuter },
            { u"fullOuter", JoinType::FullOuter },
        };
        l.join = choice(n, u"join", joins, JoinType::Inner);
        return l;
    }

    void checkLinkCycles(const JsonNode& links, const ReportDocument& doc) const
    {
        // The links must form a forest: a second path between two tables would make
        // the join order, and so the records, ambiguous.
        std::vector<int> parent(doc.tables.size());
        std::iota(parent.begin(), parent.end(), 0);
        const auto root = [&](int x) {
            while (parent[static_cast<size_t>(x)] != x)
                x = parent[static_cast<size_t>(x)]
                    = parent[static_cast<size_t>(parent[static_cast<size_t>(x)])];
            return x;
        };
        for (size_t i = 0; i < doc.links.size(); ++i) {
            const int a = root(m_environment->tableIndex(doc.links[i].fromTable));
            const int b = root(m_environment->tableIndex(doc.links[i].toTable));
            if (a == b)
                fail(links.items[i],
                    QStringLiteral(
                        "the links are cyclic: %1 and %2 are already joined by other links")
                        .arg(doc.links[i].fromTable, doc.links[i].toTable));
            parent[static_cast<size_t>(a)] = b;
        }
    }

    Value value(const JsonNode& n, ValueType type, bool allowNull) const
    {
        if (n.kind == Kind::Null) {
            if (!allowNull)
                fail(n, QStringLiteral("a value is missing"));
            return {};
        }
        const auto wrong = [&]() {
            fail(n,
                QStringLiteral("expected a %1 value, not %2")
                    .arg(valueTypeName(type), n.kindName()));
        };
        switch (type) {
        case ValueType::Null:
            break;
        case ValueType::Number:
            if (n.kind != Kind::Number)
                wrong();
            return Value::number(n.number);
        case ValueType::Currency:
            if (n.kind == Kind::Number) {
                const auto scaled = invarianttext::currencyFromDouble(n.number);
                if (!scaled)
                    fail(n, QStringLiteral("the currency amount is out of range"));
                return Value::currency(*scaled);
            }
            if (n.kind == Kind::String) {
                const auto scaled = invarianttext::parseCurrency(n.text);
                if (!scaled)
                    fail(n, QStringLiteral("\"%1\" is not a currency amount").arg(n.text));
                return Value::currency(*scaled);
            }
            wrong();
            break;
        case ValueType::String:
            if (n.kind != Kind::String)
                wrong();
            return Value::string(n.text);
        case ValueType::Boolean:
            if (n.kind != Kind::Boolean)
                wrong();
            return Value::boolean(n.boolean);
        case ValueType::Date: {
            const auto day
                = n.kind == Kind::String ? invarianttext::parseDate(n.text) : std::nullopt;
            if (!day)
                fail(n, QStringLiteral("expected a date \"yyyy-mm-dd\""));
            return Value::date(*day);
        }
        case ValueType::Time: {
            const auto ms
                = n.kind == Kind::String ? invarianttext::parseTime(n.text) : std::nullopt;
            if (!ms)
                fail(n, QStringLiteral("expected a time \"hh:mm:ss\""));
            return Value::time(*ms);
        }
        case ValueType::DateTime: {
            const auto ms
                = n.kind == Kind::String ? invarianttext::parseDateTime(n.text) : std::nullopt;
            if (!ms)
                fail(n, QStringLiteral("expected a date-time \"yyyy-mm-ddThh:mm:ss\""));
            return Value::dateTime(*ms);
        }
        case ValueType::Binary: {
            if (n.kind != Kind::String)
                wrong();
            auto decoded = QByteArray::fromBase64Encoding(
                n.text.toLatin1(), QByteArray::AbortOnBase64DecodingErrors);
            if (!decoded)
                fail(n, QStringLiteral("binary data must be Base64"));
            return Value::binary(*decoded);
        }
        }
        wrong();
        return {};
    }

    ParameterDefinition parameter(
        const JsonNode& n, const std::vector<ParameterDefinition>& earlier) const
    {
        expectObject(n, QStringLiteral("a parameter"));
        expectKeys(n,
            { u"name", u"prompt", u"valueType", u"kind", u"allowsMultipleValues",
                u"onlyListedValues", u"defaultValues", u"defaultValue", u"currentValues" });
        ParameterDefinition p;
        p.name = name(n, u"name");
        for (const auto& other : earlier) {
            if (other.name.compare(p.name, Qt::CaseInsensitive) == 0)
                fail(*n.member(QStringLiteral("name")),
                    QStringLiteral("a second parameter named \"%1\"").arg(p.name));
        }
        p.prompt = string(n, u"prompt");
        p.valueType = integer(n, u"valueType", 1, 16, 12, true);
        p.kind = integer(n, u"kind", 1, 2, 1);
        p.allowsMultipleValues = boolean(n, u"allowsMultipleValues");
        p.onlyListedValues = boolean(n, u"onlyListedValues");
        const ValueType type = *invarianttext::parameterValueType(p.valueType);
        if (const JsonNode* list = optionalArray(n, u"defaultValues", maxValues)) {
            for (const JsonNode& item : list->items) {
                expectObject(item, QStringLiteral("a default value"));
                expectKeys(item, { u"value", u"description" });
                const JsonNode* v = item.member(QStringLiteral("value"));
                if (!v)
                    fail(item, QStringLiteral("\"value\" is missing"));
                p.defaultValues.push_back({ value(*v, type, false), string(item, u"description") });
            }
        }
        if (const JsonNode* v = n.member(QStringLiteral("defaultValue")))
            p.defaultValue = value(*v, type, false);
        if (const JsonNode* list = optionalArray(n, u"currentValues", maxValues)) {
            for (const JsonNode& item : list->items)
                p.currentValues.push_back(value(item, type, false));
            if (p.currentValues.size() > 1 && !p.allowsMultipleValues)
                fail(*list, QStringLiteral("the parameter %1 takes one value").arg(p.name));
        }
        return p;
    }

    SortOrder order(const JsonNode& n) const
    {
        static const std::pair<const char16_t*, SortOrder> orders[] = {
            { u"ascending", SortOrder::Ascending },
            { u"descending", SortOrder::Descending },
        };
        return choice(n, u"order", orders, SortOrder::Ascending);
    }

    SummaryOperation operation(const JsonNode& n) const
    {
        static const std::pair<const char16_t*, SummaryOperation> operations[] = {
            { u"sum", SummaryOperation::Sum },
            { u"count", SummaryOperation::Count },
            { u"average", SummaryOperation::Average },
            { u"minimum", SummaryOperation::Minimum },
            { u"maximum", SummaryOperation::Maximum },
        };
        return choice(n, u"operation", operations, SummaryOperation::Sum, true);
    }

    /// A field reference; checked once the whole document is read.
    QString reference(const JsonNode& n, const char16_t* key, bool allowParameters,
        bool numericOnly, bool needsOrder)
    {
        const QString k = QString::fromUtf16(key);
        const QString text = string(n, key, true);
        m_references.push_back(
            { text, n.member(k)->position, allowParameters, numericOnly, needsOrder });
        return text;
    }

    GroupDefinition group(const JsonNode& n)
    {
        expectObject(n, QStringLiteral("a group"));
        expectKeys(n, { u"field", u"order", u"topN" });
        GroupDefinition g;
        g.field = reference(n, u"field", false, false, true);
        g.order = order(n);
        if (const JsonNode* t = optionalObject(n, u"topN")) {
            expectKeys(*t, { u"count", u"summary" });
            g.topNCount = integer(*t, u"count", 1, 9999, 0, true);
            const JsonNode* s = optionalObject(*t, u"summary");
            if (!s)
                fail(*t, QStringLiteral("\"summary\" is missing"));
            expectKeys(*s, { u"operation", u"field" });
            g.topNSummary.operation = operation(*s);
            const bool numeric = g.topNSummary.operation == SummaryOperation::Sum
                || g.topNSummary.operation == SummaryOperation::Average;
            g.topNSummary.field = reference(*s, u"field", false, numeric, !numeric);
        }
        return g;
    }

    Font font(const JsonNode& n) const
    {
        Font f;
        expectKeys(n, { u"family", u"size", u"bold", u"italic", u"underline" });
        if (n.member(QStringLiteral("family")))
            f.family = string(n, u"family");
        if (const JsonNode* s = n.member(QStringLiteral("size"))) {
            if (s->kind != Kind::Number || s->number < 1 || s->number > 1638)
                fail(*s, QStringLiteral("\"size\" must be a number of points from 1 to 1638"));
            f.pointSize = s->number;
        }
        f.bold = boolean(n, u"bold");
        f.italic = boolean(n, u"italic");
        f.underline = boolean(n, u"underline");
        return f;
    }

    QString color(const JsonNode& n, const char16_t* key, const QString& fallback) const
    {
        const JsonNode* m = n.member(QString::fromUtf16(key));
        if (!m)
            return fallback;
        const QString text = stringValue(*m, QString::fromUtf16(key));
        static const QRegularExpression pattern(QStringLiteral("^#[0-9a-fA-F]{6}$"));
        if (!pattern.match(text).hasMatch())
            fail(*m, QStringLiteral("a colour is written \"#rrggbb\""));
        return text;
    }

    SectionDefinition section(const JsonNode& n, const ReportDocument& doc, bool nested)
    {
        expectObject(n, QStringLiteral("a section"));
        expectKeys(n,
            { u"name", u"height", u"suppressed", u"newPageBefore", u"newPageAfter", u"objects" });
        SectionDefinition s;
        s.name = string(n, u"name", true);
        static const QRegularExpression pattern(
            QStringLiteral("^(RH|PH|D|PF|RF|G[HF]([1-9][0-9]?))$"));
        const auto match = pattern.match(s.name);
        if (!match.hasMatch())
            fail(*n.member(QStringLiteral("name")),
                QStringLiteral("\"%1\" is not a section name (RH, PH, GH1, D, GF1, PF, RF...)")
                    .arg(s.name));
        if (match.hasCaptured(2) && match.captured(2).toInt() > static_cast<int>(doc.groups.size()))
            fail(*n.member(QStringLiteral("name")),
                QStringLiteral("section %1 belongs to a group the report does not have")
                    .arg(s.name));
        for (const auto& other : doc.sections) {
            if (other.name == s.name)
                fail(*n.member(QStringLiteral("name")),
                    QStringLiteral("a second section named %1").arg(s.name));
        }
        s.height = integer(n, u"height", 0, maxTwips, 0);
        s.suppressed = boolean(n, u"suppressed");
        s.newPageBefore = boolean(n, u"newPageBefore");
        s.newPageAfter = boolean(n, u"newPageAfter");
        if (const JsonNode* list = optionalArray(n, u"objects", maxObjects)) {
            for (const JsonNode& item : list->items)
                s.objects.push_back(object(item, doc, nested));
        }
        return s;
    }

    ObjectDefinition object(const JsonNode& n, const ReportDocument& doc, bool nested)
    {
        using ObjectKind = ObjectDefinition::Kind;
        expectObject(n, QStringLiteral("a report object"));
        expectKeys(n,
            { u"kind", u"name", u"left", u"top", u"width", u"height", u"suppressed", u"font",
                u"alignment", u"color", u"text", u"field", u"special", u"operation", u"group",
                u"lineWidth", u"fillColor", u"image", u"subreport", u"links", u"canGrow",
                u"format" });
        static const std::pair<const char16_t*, ObjectKind> kinds[] = {
            { u"text", ObjectKind::Text },
            { u"field", ObjectKind::Field },
            { u"special", ObjectKind::Special },
            { u"summary", ObjectKind::Summary },
            { u"line", ObjectKind::Line },
            { u"box", ObjectKind::Box },
            { u"picture", ObjectKind::Picture },
            { u"blob", ObjectKind::Blob },
            { u"subreport", ObjectKind::Subreport },
        };
        ObjectDefinition o;
        o.kind = choice(n, u"kind", kinds, ObjectKind::Text, true);
        o.name = n.member(QStringLiteral("name")) ? name(n, u"name") : QString();
        if (!o.name.isEmpty()) {
            const QString key = o.name.toLower();
            if (m_objectNames.contains(key))
                fail(*n.member(QStringLiteral("name")),
                    QStringLiteral("a second report object named \"%1\"").arg(o.name));
            m_objectNames.insert(key);
        }
        o.left = integer(n, u"left", 0, maxTwips, 0);
        o.top = integer(n, u"top", 0, maxTwips, 0);
        o.width = integer(n, u"width", 0, maxTwips, 0);
        o.height = integer(n, u"height", 0, maxTwips, 0);
        o.suppressed = boolean(n, u"suppressed");
        if (const JsonNode* f = optionalObject(n, u"font"))
            o.font = font(*f);
        static const std::pair<const char16_t*, Alignment> alignments[] = {
            { u"left", Alignment::Left },
            { u"center", Alignment::Center },
            { u"right", Alignment::Right },
            { u"justified", Alignment::Justified },
        };
        o.alignment = choice(n, u"alignment", alignments, Alignment::Left);
        o.color = color(n, u"color", o.color);
        const auto only = [&](std::initializer_list<const char16_t*> keys,
                              std::initializer_list<ObjectKind> allowed) {
            bool ok = false;
            for (ObjectKind k : allowed)
                ok = ok || k == o.kind;
            if (ok)
                return;
            for (const char16_t* key : keys) {
                if (const JsonNode* m = n.member(QString::fromUtf16(key)))
                    fail(*m,
                        QStringLiteral("\"%1\" does not belong to a %2 object")
                            .arg(QStringView(key))
                            .arg(string(n, u"kind")));
            }
        };
        only({ u"text" }, { ObjectKind::Text });
        only({ u"field" }, { ObjectKind::Field, ObjectKind::Summary, ObjectKind::Blob });
        only({ u"special" }, { ObjectKind::Special });
        only({ u"operation", u"group" }, { ObjectKind::Summary });
        only({ u"lineWidth" }, { ObjectKind::Line, ObjectKind::Box });
        only({ u"fillColor" }, { ObjectKind::Box });
        only({ u"image" }, { ObjectKind::Picture });
        only({ u"subreport", u"links" }, { ObjectKind::Subreport });
        only({ u"canGrow" }, { ObjectKind::Text, ObjectKind::Field });
        only({ u"format" }, { ObjectKind::Field, ObjectKind::Summary, ObjectKind::Special });
        o.canGrow = boolean(n, u"canGrow");
        o.format = string(n, u"format");

        switch (o.kind) {
        case ObjectKind::Text:
            o.text = string(n, u"text");
            break;
        case ObjectKind::Field:
            o.field = reference(n, u"field", true, false, false);
            break;
        case ObjectKind::Special: {
            static const std::pair<const char16_t*, SpecialField> specials[] = {
                { u"pageNumber", SpecialField::PageNumber },
                { u"totalPages", SpecialField::TotalPages },
                { u"printDate", SpecialField::PrintDate },
                { u"recordNumber", SpecialField::RecordNumber },
                { u"pageNofM", SpecialField::PageNofM },
            };
            o.special = choice(n, u"special", specials, SpecialField::PageNumber, true);
            break;
        }
        case ObjectKind::Summary: {
            o.operation = operation(n);
            const bool numeric
                = o.operation == SummaryOperation::Sum || o.operation == SummaryOperation::Average;
            o.field = reference(
                n, u"field", false, numeric, !numeric && o.operation != SummaryOperation::Count);
            o.group = integer(n, u"group", 0, static_cast<int>(doc.groups.size()), 0);
            break;
        }
        case ObjectKind::Line:
        case ObjectKind::Box:
            o.lineWidth = integer(n, u"lineWidth", 0, maxTwips, o.lineWidth);
            o.fillColor = color(n, u"fillColor", QString());
            break;
        case ObjectKind::Picture:
            if (const JsonNode* image = n.member(QStringLiteral("image")))
                o.image = value(*image, ValueType::Binary, false).bytes();
            break;
        case ObjectKind::Blob:
            o.field = reference(n, u"field", false, false, false);
            break;
        case ObjectKind::Subreport: {
            if (nested)
                fail(n, QStringLiteral("a subreport cannot hold another subreport"));
            const JsonNode* sub = optionalObject(n, u"subreport");
            if (!sub)
                fail(n, QStringLiteral("\"subreport\" is missing"));
            if (o.name.isEmpty())
                fail(n, QStringLiteral("a subreport object needs a \"name\""));
            Reader inner(m_file);
            o.subreport = std::make_shared<ReportDocument>(inner.document(*sub, true));
            if (const JsonNode* links = optionalArray(n, u"links", 64)) {
                DocumentEnvironment subEnvironment(
                    o.subreport->tables, o.subreport->parameters, o.subreport->formulas);
                for (const JsonNode& item : links->items) {
                    expectObject(item, QStringLiteral("a subreport link"));
                    expectKeys(item, { u"mainField", u"subreportField" });
                    SubreportLink l;
                    l.mainField = reference(item, u"mainField", false, false, false);
                    l.subreportField = string(item, u"subreportField", true);
                    if (!isTableField(subEnvironment, l.subreportField))
                        fail(*item.member(QStringLiteral("subreportField")),
                            QStringLiteral("%1 is not a database field of the subreport")
                                .arg(l.subreportField));
                    o.links.push_back(l);
                }
            }
            break;
        }
        }
        return o;
    }

    static bool isTableField(DocumentEnvironment& environment, const QString& reference)
    {
        if (!reference.startsWith(u'{') || !reference.endsWith(u'}'))
            return false;
        const QString inner = reference.mid(1, reference.size() - 2).trimmed();
        const qsizetype dot = inner.indexOf(u'.');
        if (dot <= 0)
            return false;
        return environment.fieldIndex(
                   environment.tableIndex(inner.left(dot).trimmed()), inner.mid(dot + 1).trimmed())
            >= 0;
    }

    SavedData savedData(const JsonNode& n, const ReportDocument& doc) const
    {
        expectKeys(n, { u"columns", u"rows", u"recordsRead", u"signature" });
        SavedData data;
        std::vector<ValueType> types;
        const JsonNode* columns = optionalArray(n, u"columns", maxTables * maxFields);
        if (!columns)
            fail(n, QStringLiteral("\"columns\" is missing"));
        for (const JsonNode& item : columns->items) {
            const QString column = stringValue(item, QStringLiteral("columns"));
            const QString inner = column.mid(1, column.size() - 2);
            const qsizetype dot = inner.indexOf(u'.');
            const int t = m_environment->tableIndex(inner.left(dot));
            const int f = dot > 0 && column.startsWith(u'{') && column.endsWith(u'}')
                ? m_environment->fieldIndex(t, inner.mid(dot + 1))
                : -1;
            if (f < 0)
                fail(item, QStringLiteral("%1 is not a database field of the report").arg(column));
            types.push_back(doc.tables[static_cast<size_t>(t)].fields[static_cast<size_t>(f)].type);
            data.columns.push_back(column);
        }
        const JsonNode* rows = optionalArray(n, u"rows", 50000000);
        if (rows) {
            for (const JsonNode& row : rows->items) {
                if (row.kind != Kind::Array || row.items.size() != types.size())
                    fail(row,
                        QStringLiteral("a saved record must be an array of %1 values")
                            .arg(types.size()));
                std::vector<Value> values;
                values.reserve(types.size());
                for (size_t i = 0; i < types.size(); ++i)
                    values.push_back(value(row.items[i], types[i], true));
                data.rows.push_back(std::move(values));
            }
        }
        data.recordsRead
            = integer(n, u"recordsRead", 0, 2147483647, static_cast<int>(data.rows.size()));
        data.signature = string(n, u"signature");
        return data;
    }

    /// Checks references and formulas once every table, parameter and formula is known.
    void resolve(const ReportDocument& doc)
    {
        FormulaCompiler compiler(*m_environment, FormulaCompiler::Mode::Check);
        for (const PendingFormula& f : m_formulas) {
            try {
                const auto compiled = f.name.startsWith(u'@')
                    ? compiler.compileFormulaField(f.name.mid(1))
                    : compiler.compile(f.text, f.name);
                if (compiled && compiled->isArray)
                    fail(f.position,
                        QStringLiteral("formula %1 gives a list of values, not one value")
                            .arg(f.name));
                if (f.mustBeBoolean && compiled && compiled->type != ValueType::Boolean)
                    fail(f.position,
                        QStringLiteral("the record selection formula gives %1, not a Boolean")
                            .arg(valueTypeName(compiled->type)));
            } catch (const FormulaException& error) {
                fail(f.position, error.error().describe());
            }
        }
        for (const PendingReference& r : m_references) {
            const QString& text = r.field;
            const bool braces = text.startsWith(u'{') && text.endsWith(u'}') && text.size() > 2;
            const QString inner = braces ? text.mid(1, text.size() - 2).trimmed() : QString();
            if (inner.startsWith(u'?') && !r.allowParameters)
                fail(r.position, QStringLiteral("%1: a parameter cannot be used here").arg(text));
            if (!braces || inner.contains(u'{') || inner.contains(u'}'))
                fail(r.position,
                    QStringLiteral(
                        "\"%1\" is not a field: write {Table.Field}, {@Formula} or {?Parameter}")
                        .arg(text));
            try {
                const auto compiled = compiler.compile(text, text);
                if (compiled->isArray && !r.allowParameters)
                    fail(r.position, QStringLiteral("%1 gives a list of values").arg(text));
                const ValueType type = compiled->type;
                if (r.numericOnly && type != ValueType::Number && type != ValueType::Currency)
                    fail(r.position,
                        QStringLiteral("%1 is a %2 field; this summary needs numbers")
                            .arg(text, valueTypeName(type)));
                if (r.needsOrder && type == ValueType::Binary)
                    fail(r.position,
                        QStringLiteral("%1 holds binary data, which has no order").arg(text));
            } catch (const FormulaException& error) {
                fail(r.position, error.error().message);
            }
        }
        (void)doc;
    }

    QString m_file;
    DocumentEnvironment* m_environment = nullptr;
    std::vector<PendingReference> m_references;
    std::vector<PendingFormula> m_formulas;
    QSet<QString> m_objectNames;
};

} // namespace

ReportDocument DocumentReader::readFile(const QString& path)
{
    QFile file(path);
    const QFileInfo info(path);
    if (!info.exists())
        raiseError(
            Error::OpenReportFailed, QStringLiteral("%1: the file does not exist").arg(path));
    if (!info.isFile())
        raiseError(Error::OpenReportFailed, QStringLiteral("%1: not a file").arg(path));
    if (info.size() > maxFileSize)
        raiseError(Error::OpenReportFailed,
            QStringLiteral("%1: the file is %2 bytes; report documents are at most %3 bytes")
                .arg(path)
                .arg(info.size())
                .arg(maxFileSize));
    if (!file.open(QIODevice::ReadOnly))
        raiseError(Error::OpenReportFailed, QStringLiteral("%1: %2").arg(path, file.errorString()));
    // Read by what the file holds: asking for the most a document may be would reserve
    // that much memory for every report opened.
    QByteArray data = file.read(std::min<qint64>(info.size(), maxFileSize) + 1);
    while (data.size() <= maxFileSize && !file.atEnd()) {
        const QByteArray more = file.read(std::min<qint64>(1 << 20, maxFileSize + 1 - data.size()));
        if (more.isEmpty())
            break;
        data += more;
    }
    if (data.size() > maxFileSize)
        raiseError(Error::OpenReportFailed,
            QStringLiteral("%1: the file is larger than %2 bytes").arg(path).arg(maxFileSize));
    return parse(data, path);
}

ReportDocument DocumentReader::parse(const QByteArray& data, const QString& fileName)
{
    JsonNode root;
    JsonReader::Failure failure;
    if (!JsonReader::parse(data, root, failure))
        raiseError(Error::InvalidDocument,
            QStringLiteral("%1: line %2, column %3: %4")
                .arg(fileName)
                .arg(failure.position.line)
                .arg(failure.position.column)
                .arg(failure.message));
    Reader reader(fileName);
    return reader.document(root, false);
}

} // namespace reportrt
