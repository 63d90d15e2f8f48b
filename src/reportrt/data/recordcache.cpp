#include "reportrt/data/recordcache.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/providermap.h"

namespace reportrt {

RecordCache::~RecordCache()
{
    // Queries are gone; the connections close and leave the process's connection list.
    m_connections.clear();
}

bool RecordCache::matches(const QueryPlan& plan) const
{
    return m_saved && m_saved->signature == plan.signature
        && m_saved->columns == plan.columnReferences;
}

SqlConnection& RecordCache::connection(const std::vector<ConnectionProperty>& properties)
{
    const ConnectionSpec spec = ProviderMap::fromProperties(properties);
    const QString key = spec.key();
    // Connections to other databases are left over from earlier locations.
    for (auto it = m_connections.begin(); it != m_connections.end();) {
        if (it->first != key)
            it = m_connections.erase(it);
        else
            ++it;
    }
    auto found = m_connections.find(key);
    if (found != m_connections.end())
        return *found->second;
    auto created = std::make_unique<SqlConnection>(spec);
    QString message;
    if (!created->open(message))
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the connection to the %1. Details: %2")
                .arg(spec.describe(), message));
    return *m_connections.emplace(key, std::move(created)).first->second;
}

void RecordCache::read(const QueryPlan& p)
{
    if (p.tables.empty())
        raiseError(Error::RuntimeFailure, QStringLiteral("The report has no database tables."));
    const QString firstKey = ProviderMap::fromProperties(p.tables.front().connection).key();
    for (const TableDefinition& t : p.tables) {
        if (ProviderMap::fromProperties(t.connection).key() != firstKey)
            raiseError(Error::RuntimeFailure,
                QStringLiteral("The tables %1 and %2 are in different databases; a report reads "
                               "its tables from one database.")
                    .arg(p.tables.front().name, t.name));
    }
    if (p.isProcedure && p.dialect == SqlDialect::SQLite)
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the stored procedure %1: SQLite databases have no "
                           "stored procedures.")
                .arg(p.tables.front().location));
    SqlConnection& c = connection(p.tables.front().connection);
    RecordReader::Request request;
    request.database = c.database();
    request.sql = p.runSql;
    request.columns = p.columns;
    request.matchByName = p.matchByName;
    request.conditions = p.conditions;
    RecordReader::Result read = RecordReader::read(request);
    m_saved = Saved { std::move(read.records), p.columnReferences, read.recordsRead, p.signature };
}

} // namespace reportrt
