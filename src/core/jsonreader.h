#pragma once

#include "core/jsonnode.h"
#include "core/ludmoxexport.h"

#include <QByteArrayView>

namespace core {

/// A strict JSON (RFC 8259) parser that keeps positions, integer versus floating point and
/// member order. It refuses invalid UTF-8, nesting deeper than the limit and trailing
/// content, so hostile input ends in an error with a position instead of exhausting the
/// stack or memory.
class LUDMOX_EXPORT JsonReader {
public:
    struct Failure {
        TextPosition position;
        QString message;
    };

    static constexpr int maxDepth = 64;

    struct Limits {
        int maxDepth = JsonReader::maxDepth;
        /// Report files refuse a repeated key; a protocol message keeps the last one.
        bool allowDuplicateKeys = false;
    };

    /// Parses the whole input (a UTF-8 byte order mark is skipped). On failure returns
    /// false and fills failure.
    static bool parse(QByteArrayView utf8, JsonNode& root, Failure& failure, const Limits& limits);
    /// The same with the default limits.
    static bool parse(QByteArrayView utf8, JsonNode& root, Failure& failure);
};

} // namespace core
