#include "reportrtfixture.h"

#include "core/variant.h"
#include "reportrt/formula/formulaevaluator.h"

#include <QFile>
#include <QJsonDocument>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <algorithm>
#include <gtest/gtest.h>
#include <stdexcept>

using namespace Qt::StringLiterals;

namespace reportrt::test {

void execute(const QString& path, const QStringList& statements)
{
    const QString name = QStringLiteral("test-setup");
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), name);
        db.setDatabaseName(path);
        if (!db.open())
            throw std::runtime_error(db.lastError().text().toStdString());
        QSqlQuery query(db);
        for (const QString& statement : statements) {
            if (!query.exec(statement))
                throw std::runtime_error(
                    QString(statement + u": " + query.lastError().text()).toStdString());
        }
        db.close();
    }
    QSqlDatabase::removeDatabase(name);
}

QString createShopDatabase(const QString& path)
{
    execute(path,
        {
            QStringLiteral("CREATE TABLE Orders (ID INTEGER PRIMARY KEY, Customer TEXT COLLATE "
                           "NOCASE, Region TEXT, Amount REAL, Price NUMERIC, Shipped INTEGER, "
                           "OrderDate TEXT, Created TEXT, CustomerID INTEGER)"),
            QStringLiteral(
                "CREATE TABLE Customers (ID INTEGER PRIMARY KEY, Name TEXT, Country TEXT)"),
            // Ties in Amount and Region, Nulls in every column but ID, names that differ
            // only in case (the column collates without case: SQL must not use that).
            QStringLiteral("INSERT INTO Orders VALUES (1, 'alpha', 'North', 100, 10.5, 1, "
                           "'2026-01-05', '2026-01-05 08:00:00', 1)"),
            QStringLiteral("INSERT INTO Orders VALUES (2, 'Alpha', 'North', 250, 20, 0, "
                           "'2026-02-10', '2026-02-10T09:30:00.250', 1)"),
            QStringLiteral("INSERT INTO Orders VALUES (3, 'ALPHA', 'South', 100, NULL, 1, "
                           "'2026-02-10', '2026-02-10 23:59:59', 2)"),
            QStringLiteral("INSERT INTO Orders VALUES (4, 'beta', 'South', 75.25, 7.25, NULL, "
                           "'2026-03-01', NULL, 2)"),
            QStringLiteral("INSERT INTO Orders VALUES (5, NULL, 'East', NULL, 3, 0, NULL, "
                           "'2026-03-01 00:00:00', 3)"),
            QStringLiteral("INSERT INTO Orders VALUES (6, 'Élan', NULL, 500, 99.99, 1, "
                           "'2025-12-31', '2025-12-31 12:00:00', 3)"),
            QStringLiteral("INSERT INTO Orders VALUES (7, 'élan', 'East', 250, 0, 1, '2026-04-15', "
                           "'2026-04-15 10:15:00', NULL)"),
            QStringLiteral("INSERT INTO Orders VALUES (8, 'gamma[1]', 'West', 10, 1, 0, "
                           "'2026-04-15', '2026-04-15 10:15:00.5', 4)"),
            QStringLiteral("INSERT INTO Orders VALUES (9, 'o''Brien', 'West', -5, 2.5, 1, "
                           "'2026-05-01', '2026-05-01 00:00:00', 4)"),
            QStringLiteral("INSERT INTO Orders VALUES (10, '', 'North', 0, NULL, NULL, "
                           "'2026-05-02', '2026-05-02 00:00:00', 1)"),
            QStringLiteral("INSERT INTO Customers VALUES (1, 'Acme', 'DE')"),
            QStringLiteral("INSERT INTO Customers VALUES (2, 'Birch', 'de')"),
            QStringLiteral("INSERT INTO Customers VALUES (3, 'Cobalt', NULL)"),
            QStringLiteral("INSERT INTO Customers VALUES (4, 'Delta', 'FR')"),
        });
    return path;
}

QJsonArray ordersFields()
{
    return QJsonArray {
        QJsonObject { { u"name"_s, u"ID"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Customer"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Region"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Amount"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Price"_s }, { u"type"_s, u"currency"_s } },
        QJsonObject { { u"name"_s, u"Shipped"_s }, { u"type"_s, u"boolean"_s } },
        QJsonObject { { u"name"_s, u"OrderDate"_s }, { u"type"_s, u"date"_s } },
        QJsonObject { { u"name"_s, u"Created"_s }, { u"type"_s, u"datetime"_s } },
        QJsonObject { { u"name"_s, u"CustomerID"_s }, { u"type"_s, u"number"_s } },
    };
}

QJsonArray customersFields()
{
    return QJsonArray {
        QJsonObject { { u"name"_s, u"ID"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Name"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Country"_s }, { u"type"_s, u"string"_s } },
    };
}

QJsonObject shopReport()
{
    const QJsonArray designerConnection {
        QJsonObject { { u"name"_s, u"Provider"_s }, { u"value"_s, u"SQLOLEDB"_s } },
        QJsonObject { { u"name"_s, u"Data Source"_s }, { u"value"_s, u"designsrv"_s } },
        QJsonObject { { u"name"_s, u"Initial Catalog"_s }, { u"value"_s, u"shop"_s } },
    };
    return QJsonObject {
        { u"format"_s, u"ludmox-report"_s },
        { u"version"_s, 1 },
        { u"summary"_s,
            QJsonObject { { u"title"_s, u"Orders"_s }, { u"comments"_s, u"UseReportPrinter"_s } } },
        { u"tables"_s,
            QJsonArray {
                QJsonObject { { u"name"_s, u"Orders"_s }, { u"location"_s, u"shop.dbo.Orders"_s },
                    { u"driver"_s, u"crdb_ado.dll"_s }, { u"connection"_s, designerConnection },
                    { u"fields"_s, ordersFields() } },
            } },
        { u"sections"_s,
            QJsonArray {
                QJsonObject { { u"name"_s, u"D"_s }, { u"height"_s, 300 },
                    { u"objects"_s,
                        QJsonArray { QJsonObject { { u"kind"_s, u"field"_s },
                            { u"name"_s, u"IDField"_s }, { u"field"_s, u"{Orders.ID}"_s },
                            { u"width"_s, 1000 }, { u"height"_s, 240 } } } } },
            } },
    };
}

QString writeText(const QTemporaryDir& dir, const QByteArray& text, const QString& name)
{
    const QString path = dir.filePath(name);
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(text) != text.size())
        throw std::runtime_error("cannot write the report file");
    return path;
}

QString writeReport(const QTemporaryDir& dir, const QJsonObject& document, const QString& name)
{
    return writeText(dir, QJsonDocument(document).toJson(), name);
}

void relocate(runtime::Report& report, const QString& databasePath)
{
    for (const auto& table : report.databaseTables()) {
        table->deleteConnectionProperties();
        table->addConnectionProperty(
            QStringLiteral("Provider"), core::Variant(QStringLiteral("Microsoft.Jet.OLEDB.4.0")));
        table->addConnectionProperty(QStringLiteral("Data Source"), core::Variant(databasePath));
        table->addConnectionProperty(QStringLiteral("Initial Catalog"), core::Variant(QString()));
        table->addConnectionProperty(
            QStringLiteral("User ID"), core::Variant(QStringLiteral("admin")));
        table->addConnectionProperty(QStringLiteral("Password"), core::Variant(QString()));
        if (table->location().compare(u"Command", Qt::CaseInsensitive) == 0)
            continue;
        QString location = table->location();
        location = location.mid(location.lastIndexOf(u'.') + 1);
        table->setLocation(location, QString(), QString());
    }
}

std::vector<QString> column(const Report& report, const QString& reference)
{
    std::vector<QString> values;
    const auto* result = report.result();
    if (!result)
        return values;
    Report& mutableReport = const_cast<Report&>(report);
    for (qsizetype position = 0; position < result->size(); ++position) {
        mutableReport.setCurrentRecord(result->recordAt(position));
        const Value v = report.fieldValue(reference);
        values.push_back(v.isNull() ? QStringLiteral("<null>") : FormulaEvaluator::toText(v, 2));
    }
    mutableReport.setCurrentRecord(-1);
    return values;
}

std::vector<int> selectedIds(const Report& report)
{
    std::vector<int> ids;
    for (const QString& id : column(report, QStringLiteral("{Orders.ID}")))
        ids.push_back(id.toDouble());
    std::sort(ids.begin(), ids.end());
    return ids;
}

} // namespace reportrt::test
