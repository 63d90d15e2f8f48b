#pragma once

#include <QString>
#include <utility>
#include <vector>

namespace reportrt {

/// A place in a text file: 1-based line and column (columns count UTF-16 code units).
struct TextPosition {
    int line = 1;
    int column = 1;
};

/// A parsed JSON value that remembers where it stood in the file, so that the document
/// reader can name the position of every fault it finds, not only of syntax errors.
struct JsonNode {
    enum class Kind { Null, Boolean, Number, String, Array, Object };

    Kind kind = Kind::Null;
    TextPosition position;
    bool boolean = false;
    double number = 0;
    bool isInteger = false; // the number was written without fraction or exponent
    QString text;
    std::vector<JsonNode> items; // Array
    std::vector<std::pair<QString, JsonNode>> members; // Object, in file order

    /// The member with that key, or nullptr.
    const JsonNode* member(const QString& key) const;
    QString kindName() const;
};

} // namespace reportrt
