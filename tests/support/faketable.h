#pragma once

#include "fakeobject.h"
#include "runtime/databasetable.h"

namespace fakeruntime {

/// A database table of a fake report. Logged as `Table(<name>)`.
class FakeTable : public runtime::DatabaseTable, public FakeObject {
public:
    struct State {
        QString name;
        QString location;
        QString driverName = QStringLiteral("crdb_ado.dll");
        std::vector<std::pair<QString, core::Variant>> connectionProperties;
    };

    FakeTable(std::weak_ptr<Script> script, State state);

    QString label() const override { return state.name; }

    QString name() const override;
    QString driverName() const override;
    QString location() const override;
    void setLocation(const QString& location, const QString& subLocation,
        const QString& connectBufferString) override;
    void deleteConnectionProperties() override;
    void addConnectionProperty(const QString& name, const core::Variant& value) override;
    std::vector<std::pair<QString, core::Variant>> connectionProperties() const override;

    /// Read and change freely: nothing here is logged.
    State state;
};

} // namespace fakeruntime
