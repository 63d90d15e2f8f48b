#pragma once

#include "core/jsonnode.h"
#include "core/ludmoxexport.h"

#include <QByteArray>

namespace core {

/// JSON text from a JsonNode, members in their order.
///
/// Numbers marked as integers are written as integers and every other number with a
/// fraction or exponent ("2.0"), so a reader tells them apart again; non-finite numbers,
/// which JSON cannot hold, are written as null. Strings go out as UTF-8 with the escapes
/// JSON requires; lone surrogates, which UTF-8 cannot carry, as \u escapes.
class LUDMOX_EXPORT JsonWriter {
public:
    enum class Style {
        Compact, // one line, no spaces: protocol messages
        Indented // four spaces per level, one member per line: files people read
    };

    static QByteArray write(const JsonNode& node, Style style = Style::Compact);
};

} // namespace core
