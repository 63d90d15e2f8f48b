#pragma once

#include "reportrt/report.h"
#include "runtime/databasetable.h"

#include <QJsonArray>
#include <QJsonObject>
#include <QString>
#include <QTemporaryDir>
#include <memory>
#include <ostream>
#include <vector>

namespace reportrt::test {

/// A SQLite database for the tests: table Orders (ID, Customer, Region, Amount, Price,
/// Shipped, OrderDate, Created) with Nulls, ties and mixed case, and table Customers.
QString createShopDatabase(const QString& path);

/// Runs statements on a SQLite file (creating it).
void execute(const QString& path, const QStringList& statements);

/// A report document over the shop tables, as the designer saves it: qualified locations
/// and SQL Server connection properties.
QJsonObject shopReport();
QJsonArray ordersFields();
QJsonArray customersFields();

/// Writes a document to a file in dir and returns its path.
QString writeReport(const QTemporaryDir& dir, const QJsonObject& document,
    const QString& name = QStringLiteral("report.rpt"));
QString writeText(const QTemporaryDir& dir, const QByteArray& text,
    const QString& name = QStringLiteral("report.rpt"));

/// Points every table at the SQLite database the way the engine does for a Jet database:
/// all connection properties replaced, then the location set to the bare table name.
void relocate(runtime::Report& report, const QString& databasePath);

/// The values of one column over the records of the last read, in print order.
std::vector<QString> column(const Report& report, const QString& reference);
/// The {Orders.ID} values (a field object of the report) of the records printed by the last
/// read, sorted, for comparing selections.
std::vector<int> selectedIds(const Report& report);

} // namespace reportrt::test

/// Readable QStrings in test failures.
inline void PrintTo(const QString& text, std::ostream* out)
{
    *out << '"' << text.toStdString() << '"';
}
