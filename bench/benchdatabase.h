#pragma once

#include <QString>

namespace runtime {
class Report;
}

namespace bench {

/// Prints "program: text" to standard error and ends the process with code 1.
[[noreturn]] void fail(const QString& text);

/// Orders as the sample database has them, made quickly and always the same.
void makeDatabase(const QString& path, int rows);

/// Points every table of the report at the SQLite database.
void relocate(runtime::Report& report, const QString& database);

} // namespace bench
