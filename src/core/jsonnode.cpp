#include "core/jsonnode.h"

namespace core {

JsonNode JsonNode::ofKind(Kind kind)
{
    JsonNode node;
    node.kind = kind;
    return node;
}

JsonNode::JsonNode() = default;
JsonNode::JsonNode(const JsonNode& other) = default;
JsonNode::JsonNode(JsonNode&& other) noexcept = default;
JsonNode& JsonNode::operator=(const JsonNode& other) = default;
JsonNode& JsonNode::operator=(JsonNode&& other) noexcept = default;
JsonNode::~JsonNode() = default;

JsonNode JsonNode::fromBool(bool value)
{
    JsonNode node = ofKind(Kind::Boolean);
    node.boolean = value;
    return node;
}

JsonNode JsonNode::fromInteger(int64_t value)
{
    JsonNode node = ofKind(Kind::Number);
    node.number = static_cast<double>(value);
    node.isInteger = true;
    node.integer = value;
    return node;
}

JsonNode JsonNode::fromDouble(double value)
{
    JsonNode node = ofKind(Kind::Number);
    node.number = value;
    return node;
}

JsonNode JsonNode::fromString(const QString& value)
{
    JsonNode node = ofKind(Kind::String);
    node.text = value;
    return node;
}

const JsonNode* JsonNode::member(const QString& key) const
{
    for (auto it = members.rbegin(); it != members.rend(); ++it) {
        if (it->first == key)
            return &it->second;
    }
    return nullptr;
}

JsonNode& JsonNode::insert(const QString& key, JsonNode value)
{
    members.emplace_back(key, std::move(value));
    return members.back().second;
}

JsonNode& JsonNode::append(JsonNode value)
{
    items.push_back(std::move(value));
    return items.back();
}

QString JsonNode::kindName() const
{
    switch (kind) {
    case Kind::Null:
        return QStringLiteral("null");
    case Kind::Boolean:
        return QStringLiteral("a Boolean");
    case Kind::Number:
        return QStringLiteral("a number");
    case Kind::String:
        return QStringLiteral("a string");
    case Kind::Array:
        return QStringLiteral("an array");
    case Kind::Object:
        return QStringLiteral("an object");
    }
    return {};
}

} // namespace core
