#include "reportrt/databasetable.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/providermap.h"
#include "reportrt/data/sqlconnection.h"
#include "reportrt/data/sqlstatement.h"

#include <QSqlError>
#include <QSqlQuery>

namespace reportrt {

DatabaseTable::DatabaseTable(TableDefinition definition, std::weak_ptr<Report> report)
    : m_definition(std::move(definition))
    , m_report(std::move(report))
{ }

void DatabaseTable::verify(const TableDefinition& table)
{
    if (table.location.compare(u"Command", Qt::CaseInsensitive) == 0)
        return;
    const ConnectionSpec spec = ProviderMap::fromProperties(table.connection);
    QString message;
    SqlConnection connection(spec);
    if (!connection.open(message))
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the connection to the %1. Details: %2")
                .arg(spec.describe(), message));
    QSqlQuery query(connection.database());
    query.setForwardOnly(true);
    if (table.location.contains(u';')) {
        const QString name = table.location.left(table.location.indexOf(u';')).trimmed();
        if (spec.dialect == SqlDialect::SQLite)
            raiseError(Error::TableConnectionFailed,
                QStringLiteral("Failed to open the stored procedure %1: SQLite databases have no "
                               "stored procedures.")
                    .arg(name));
        if (spec.dialect == SqlDialect::PostgreSQL) {
            const QString bare = name.mid(name.lastIndexOf(u'.') + 1);
            query.prepare(QStringLiteral("SELECT 1 FROM pg_proc WHERE proname = ?"));
            query.addBindValue(bare.toLower());
            if (!query.exec() || !query.next())
                raiseError(Error::TableConnectionFailed,
                    QStringLiteral("Failed to open the stored procedure %1: the database has no "
                                   "such procedure.")
                        .arg(name));
        }
        return;
    }
    QStringList fields;
    for (const FieldDefinition& f : table.fields)
        fields << SqlTranslator::identifier(f.name);
    const QString sql
        = QStringLiteral("SELECT %1 FROM %2 WHERE 1 = 0")
              .arg(fields.isEmpty() ? QStringLiteral("*") : fields.join(QStringLiteral(", ")),
                  SqlTranslator::qualifiedName(table.location));
    if (!query.exec(sql))
        raiseError(Error::TableConnectionFailed,
            QStringLiteral("Failed to open the table %1 at %2. Details: %3")
                .arg(table.name, table.location, query.lastError().text()));
}

void DatabaseTable::setLocation(const QString& location, const QString&, const QString&)
{
    TableDefinition moved = m_definition;
    moved.location = location;
    verify(moved);
    m_definition.location = location;
}

void DatabaseTable::deleteConnectionProperties()
{
    m_definition.connection.clear();
}

void DatabaseTable::addConnectionProperty(const QString& name, const core::Variant& value)
{
    ConnectionProperty property;
    property.name = name;
    if (value.type() == core::VariantType::Boolean) {
        property.kind = ConnectionProperty::Kind::Boolean;
        property.boolean = value.toBoolean();
    } else if (core::isNumberType(value.type())) {
        property.kind = ConnectionProperty::Kind::Number;
        property.number = value.toDouble();
    } else if (!value.isEmpty() && !value.isNull()) {
        property.text = value.toText();
    }
    for (ConnectionProperty& existing : m_definition.connection) {
        if (existing.name.compare(name, Qt::CaseInsensitive) == 0) {
            existing = property;
            return;
        }
    }
    m_definition.connection.push_back(property);
}

std::vector<std::pair<QString, core::Variant>> DatabaseTable::connectionProperties() const
{
    std::vector<std::pair<QString, core::Variant>> result;
    for (const ConnectionProperty& p : m_definition.connection) {
        switch (p.kind) {
        case ConnectionProperty::Kind::Text:
            result.emplace_back(p.name, core::Variant(p.text));
            break;
        case ConnectionProperty::Kind::Boolean:
            result.emplace_back(p.name, core::Variant(p.boolean));
            break;
        case ConnectionProperty::Kind::Number:
            result.emplace_back(p.name, core::Variant(p.number));
            break;
        }
    }
    return result;
}

} // namespace reportrt
