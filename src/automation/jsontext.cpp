#include "automation/jsontext.h"

#include "core/jsonreader.h"
#include "core/jsonwriter.h"

#include <QCborArray>
#include <QCborMap>

namespace automation {

namespace {
// Deeper nesting than any request needs; it bounds the parser's recursion on hostile
// input. A repeated member name keeps its last value, as a map would.
constexpr core::JsonReader::Limits protocolLimits { 512, true };

QCborValue toCbor(const core::JsonNode& node)
{
    using Kind = core::JsonNode::Kind;
    switch (node.kind) {
    case Kind::Null:
        return QCborValue(nullptr);
    case Kind::Boolean:
        return QCborValue(node.boolean);
    case Kind::Number:
        if (node.integer)
            return QCborValue(qint64(*node.integer));
        return QCborValue(node.number);
    case Kind::String:
        return QCborValue(node.text);
    case Kind::Array: {
        QCborArray list;
        for (const core::JsonNode& item : node.items)
            list.append(toCbor(item));
        return QCborValue(list);
    }
    case Kind::Object: {
        QCborMap map;
        for (const auto& [key, value] : node.members)
            map.insert(key, toCbor(value));
        return QCborValue(map);
    }
    }
    return {};
}

core::JsonNode toJson(const QCborValue& value)
{
    switch (value.type()) {
    case QCborValue::Integer:
        return core::JsonNode::fromInteger(value.toInteger());
    case QCborValue::Double:
        return core::JsonNode::fromDouble(value.toDouble());
    case QCborValue::String:
        return core::JsonNode::fromString(value.toString());
    case QCborValue::True:
    case QCborValue::False:
        return core::JsonNode::fromBool(value.toBool());
    case QCborValue::Array: {
        core::JsonNode list = core::JsonNode::array();
        for (const QCborValue& element : value.toArray())
            list.append(toJson(element));
        return list;
    }
    case QCborValue::Map: {
        core::JsonNode object = core::JsonNode::object();
        const QCborMap map = value.toMap();
        for (auto it = map.cbegin(); it != map.cend(); ++it)
            object.insert(it.key().toString(), toJson(it.value()));
        return object;
    }
    default:
        return core::JsonNode::null();
    }
}
} // namespace

std::optional<QCborValue> JsonText::parse(QByteArrayView text, QString* error)
{
    core::JsonNode root;
    core::JsonReader::Failure failure;
    if (!core::JsonReader::parse(text, root, failure, protocolLimits)) {
        if (error)
            *error = QStringLiteral("%1 at line %2, column %3")
                         .arg(failure.message)
                         .arg(failure.position.line)
                         .arg(failure.position.column);
        return std::nullopt;
    }
    return toCbor(root);
}

QByteArray JsonText::serialize(const QCborValue& value)
{
    return core::JsonWriter::write(toJson(value));
}

} // namespace automation
