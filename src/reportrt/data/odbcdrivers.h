#pragma once

#include <QString>
#include <QStringList>
#include <optional>

namespace reportrt {

/// The ODBC drivers of the system's driver manager (unixODBC), by the names a connect
/// string's DRIVER keyword takes ("PostgreSQL Unicode", "FreeTDS"; `odbcinst -q -d` lists
/// the same).
class OdbcDrivers {
public:
    /// The registered driver names, or nullopt when the driver manager cannot be asked.
    static std::optional<QStringList> installed();

    /// Why a connect string naming the driver `name` cannot load it, as a sentence part
    /// ("the ODBC driver \"X\" is not installed; ..."), or an empty text when it can be
    /// tried. A name with a "/" is the path of a driver library, which must exist. When the
    /// driver manager cannot list its drivers the name is left for the connection to try.
    static QString problem(const QString& name);
};

} // namespace reportrt
