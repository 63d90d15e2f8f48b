#include "reportrt/data/odbcdrivers.h"

#include <QFileInfo>
#include <array>
#include <cstdint>
#include <sql.h>
#include <sqlext.h>

namespace reportrt {

namespace {
/// An ODBC environment handle, freed on every way out.
class Environment {
public:
    Environment()
    {
        if (!SQL_SUCCEEDED(SQLAllocHandle(SQL_HANDLE_ENV, nullptr, &m_handle))) {
            m_handle = nullptr;
            return;
        }
        // SQLDrivers needs the version set first (state HY010 otherwise).
        const auto version
            = reinterpret_cast<SQLPOINTER>(static_cast<std::uintptr_t>(SQL_OV_ODBC3));
        if (!SQL_SUCCEEDED(SQLSetEnvAttr(m_handle, SQL_ATTR_ODBC_VERSION, version, 0))) {
            SQLFreeHandle(SQL_HANDLE_ENV, m_handle);
            m_handle = nullptr;
        }
    }
    ~Environment()
    {
        if (m_handle)
            SQLFreeHandle(SQL_HANDLE_ENV, m_handle);
    }
    Environment(const Environment&) = delete;
    Environment& operator=(const Environment&) = delete;

    SQLHENV handle() const { return m_handle; }

private:
    SQLHENV m_handle = nullptr;
};
} // namespace

std::optional<QStringList> OdbcDrivers::installed()
{
    Environment environment;
    if (!environment.handle())
        return std::nullopt;
    QStringList names;
    std::array<SQLCHAR, 512> description {};
    std::array<SQLCHAR, 4096> attributes {};
    SQLUSMALLINT direction = SQL_FETCH_FIRST;
    for (;;) {
        SQLSMALLINT descriptionLength = 0;
        SQLSMALLINT attributesLength = 0;
        const SQLRETURN result = SQLDrivers(environment.handle(), direction, description.data(),
            static_cast<SQLSMALLINT>(description.size()), &descriptionLength, attributes.data(),
            static_cast<SQLSMALLINT>(attributes.size()), &attributesLength);
        if (result == SQL_NO_DATA)
            break;
        if (!SQL_SUCCEEDED(result))
            return std::nullopt;
        // A longer name comes truncated (SQL_SUCCESS_WITH_INFO) and cannot match anyway.
        const qsizetype length = std::min<qsizetype>(
            descriptionLength, static_cast<qsizetype>(description.size()) - 1);
        names << QString::fromLocal8Bit(reinterpret_cast<const char*>(description.data()), length);
        direction = SQL_FETCH_NEXT;
    }
    return names;
}

QString OdbcDrivers::problem(const QString& name)
{
    if (name.trimmed().isEmpty())
        return QStringLiteral("no ODBC driver is named");
    if (name.contains(u'/')) {
        if (QFileInfo(name).isFile())
            return {};
        return QStringLiteral("the ODBC driver library %1 does not exist").arg(name);
    }
    const auto names = installed();
    if (!names)
        return {};
    for (const QString& each : *names) {
        // unixODBC finds a driver's section without regard to case.
        if (each.compare(name, Qt::CaseInsensitive) == 0)
            return {};
    }
    if (names->isEmpty())
        return QStringLiteral("the ODBC driver \"%1\" is not installed; no ODBC drivers are "
                              "installed")
            .arg(name);
    return QStringLiteral("the ODBC driver \"%1\" is not installed; installed ODBC drivers: %2")
        .arg(name, names->join(QStringLiteral(", ")));
}

} // namespace reportrt
