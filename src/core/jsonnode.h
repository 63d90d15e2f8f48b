#pragma once

#include "core/ludmoxexport.h"
#include "core/textposition.h"

#include <QString>
#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace core {

/// A JSON value that remembers where it stood in its text, so that a reader can name the
/// position of every fault it finds, not only of syntax errors. Objects keep their
/// members in the order written, and numbers remember whether they were written as
/// integers ("2" is not "2.0").
struct LUDMOX_EXPORT JsonNode {
    enum class Kind { Null, Boolean, Number, String, Array, Object };

    // Declared here and defaulted in the source: clang with libstdc++ cannot work out the
    // implicit ones while the vectors below still name an incomplete JsonNode.
    JsonNode();
    JsonNode(const JsonNode& other);
    JsonNode(JsonNode&& other) noexcept;
    JsonNode& operator=(const JsonNode& other);
    JsonNode& operator=(JsonNode&& other) noexcept;
    ~JsonNode();

    Kind kind = Kind::Null;
    TextPosition position;
    bool boolean = false;
    double number = 0;
    bool isInteger = false; // written (or to be written) without fraction or exponent
    std::optional<int64_t> integer; // the exact value of an integer that fits 64 bits
    QString text;
    std::vector<JsonNode> items; // Array
    std::vector<std::pair<QString, JsonNode>> members; // Object, in written order

    static JsonNode null() { return {}; }
    static JsonNode fromBool(bool value);
    static JsonNode fromInteger(int64_t value);
    static JsonNode fromDouble(double value);
    static JsonNode fromString(const QString& value);
    static JsonNode array() { return ofKind(Kind::Array); }
    static JsonNode object() { return ofKind(Kind::Object); }

    /// The member with that key (the last one when a key repeats), or nullptr.
    const JsonNode* member(const QString& key) const;
    /// Appends a member; the builder form for writers that keep their own order.
    JsonNode& insert(const QString& key, JsonNode value);
    JsonNode& append(JsonNode value);
    QString kindName() const;

private:
    static JsonNode ofKind(Kind kind);
};

} // namespace core
