#pragma once

#include "reportrt/document/reportdocument.h"
#include "runtime/databasetable.h"

#include <memory>

namespace reportrt {

class Report;

/// A table of an opened report. Location changes are checked against the database: a
/// location the table's connection cannot reach raises Error::TableConnectionFailed and
/// leaves the table as it was.
class DatabaseTable : public runtime::DatabaseTable {
public:
    DatabaseTable(TableDefinition definition, std::weak_ptr<Report> report);

    QString name() const override { return m_definition.name; }
    QString driverName() const override { return m_definition.driver; }
    QString location() const override { return m_definition.location; }
    void setLocation(const QString& location, const QString& subLocation,
        const QString& connectBufferString) override;
    void deleteConnectionProperties() override;
    /// A property of the same name (without regard to case) is replaced in its place.
    void addConnectionProperty(const QString& name, const core::Variant& value) override;
    std::vector<std::pair<QString, core::Variant>> connectionProperties() const override;

    const TableDefinition& definition() const { return m_definition; }

    /// Whether the table is reachable at that location through its connection; raises
    /// Error::TableConnectionFailed with the reason when it is not.
    static void verify(const TableDefinition& table);

private:
    TableDefinition m_definition;
    std::weak_ptr<Report> m_report;
};

} // namespace reportrt
