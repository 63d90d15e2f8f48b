#pragma once

#include "reportrt/data/providermap.h"

#include <QSqlDatabase>
#include <QString>

namespace reportrt {

/// One open Qt SQL connection under a name no other connection of the process uses.
/// The destructor closes and removes it; queries on it must be gone by then.
class SqlConnection {
public:
    explicit SqlConnection(ConnectionSpec spec);
    ~SqlConnection();
    SqlConnection(const SqlConnection&) = delete;
    SqlConnection& operator=(const SqlConnection&) = delete;

    /// Opens the connection; on failure returns false with a message (no password in it)
    /// that completes spec().describe(). A database file must exist and be a SQLite database.
    bool open(QString& message);
    QSqlDatabase database() const;
    const ConnectionSpec& spec() const { return m_spec; }

private:
    ConnectionSpec m_spec;
    QString m_name;
};

} // namespace reportrt
