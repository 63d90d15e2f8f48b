#pragma once

namespace core {

/// A place in a text file: 1-based line and column (columns count UTF-16 code units).
struct TextPosition {
    int line = 1;
    int column = 1;
};

} // namespace core
