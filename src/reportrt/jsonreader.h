#pragma once

#include "jsonnode.h"

#include <QByteArray>

namespace reportrt {

/// A strict JSON (RFC 8259) parser that keeps positions. It refuses invalid UTF-8, nesting
/// deeper than maxDepth, duplicate object keys and trailing content, so hostile input ends
/// in an error with a position instead of exhausting the stack or memory.
class JsonReader {
public:
    struct Failure {
        TextPosition position;
        QString message;
    };

    static constexpr int maxDepth = 64;

    /// Parses the whole input. On failure returns false and fills failure.
    static bool parse(const QByteArray& utf8, JsonNode& root, Failure& failure);
};

} // namespace reportrt
