#include "faketable.h"

namespace fakeruntime {

FakeTable::FakeTable(std::weak_ptr<Script> script, State initial)
    : FakeObject(std::move(script), QStringLiteral("Table"))
    , state(std::move(initial))
{ }

QString FakeTable::name() const
{
    recordQuery(QStringLiteral("name"));
    return state.name;
}

QString FakeTable::driverName() const
{
    recordQuery(QStringLiteral("driverName"));
    return state.driverName;
}

QString FakeTable::location() const
{
    recordQuery(QStringLiteral("location"));
    return state.location;
}

void FakeTable::setLocation(
    const QString& location, const QString& subLocation, const QString& connectBufferString)
{
    record(QStringLiteral("setLocation"),
        { arg(location), arg(subLocation), arg(connectBufferString) });
    state.location = location;
}

void FakeTable::deleteConnectionProperties()
{
    record(QStringLiteral("deleteConnectionProperties"));
    state.connectionProperties.clear();
}

void FakeTable::addConnectionProperty(const QString& name, const core::Variant& value)
{
    record(QStringLiteral("addConnectionProperty"), { arg(name), arg(value) });
    state.connectionProperties.emplace_back(name, value);
}

std::vector<std::pair<QString, core::Variant>> FakeTable::connectionProperties() const
{
    recordQuery(QStringLiteral("connectionProperties"));
    return state.connectionProperties;
}

} // namespace fakeruntime
