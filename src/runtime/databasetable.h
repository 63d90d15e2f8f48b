#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <utility>
#include <vector>

namespace runtime {

/// One table of a report's database: a database table, a view, a stored procedure ("name;1")
/// or an SQL command (location "Command").
class LUDMOX_EXPORT DatabaseTable : public core::Object {
public:
    QString className() const override { return QStringLiteral("DatabaseTable"); }

    virtual QString name() const = 0;
    /// Driver file name; "crdb_ado.dll" marks the OLE DB driver.
    virtual QString driverName() const = 0;
    virtual QString location() const = 0;
    /// Raises 0x80047E44 when the table cannot be reached at the new location.
    virtual void setLocation(
        const QString& location, const QString& subLocation, const QString& connectBufferString)
        = 0;
    virtual void deleteConnectionProperties() = 0;
    virtual void addConnectionProperty(const QString& name, const core::Variant& value) = 0;
    virtual std::vector<std::pair<QString, core::Variant>> connectionProperties() const = 0;
};

} // namespace runtime
