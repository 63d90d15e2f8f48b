#include "benchdatabase.h"

#include "core/variant.h"
#include "runtime/databasetable.h"
#include "runtime/report.h"

#include <QCoreApplication>
#include <QDate>
#include <QRandomGenerator>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <cstdio>
#include <cstdlib>

namespace bench {

void fail(const QString& text)
{
    std::fprintf(
        stderr, "%s: %s\n", qPrintable(QCoreApplication::applicationName()), qPrintable(text));
    std::exit(1);
}

void makeDatabase(const QString& path, int rows)
{
    static const char* const cities[][2] = { { "Tallinn", "Estonia" }, { "Tartu", "Estonia" },
        { "Riga", "Latvia" }, { "Liepaja", "Latvia" }, { "Vilnius", "Lithuania" },
        { "Kaunas", "Lithuania" }, { "Helsinki", "Finland" }, { "Turku", "Finland" },
        { "Stockholm", "Sweden" }, { "Gothenburg", "Sweden" }, { "Hamburg", "Germany" },
        { "Berlin", "Germany" }, { "Gdansk", "Poland" }, { "Oslo", "Norway" } };
    static const char* const statuses[] = { "Shipped", "Shipped", "Invoiced", "Open" };
    static const char* const people[]
        = { "A. Tamm", "K. Saar", "J. Ozols", "L. Kalnina", "M. Berg", "E. Virtanen" };
    const QString name = QStringLiteral("bench-setup");
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), name);
        db.setDatabaseName(path);
        if (!db.open())
            fail(db.lastError().text());
        QSqlQuery query(db);
        query.exec(QStringLiteral("PRAGMA journal_mode = OFF"));
        query.exec(QStringLiteral("PRAGMA synchronous = OFF"));
        if (!query.exec(QStringLiteral(
                "CREATE TABLE Orders (OrderID INTEGER PRIMARY KEY, CustomerID INTEGER, "
                "OrderDate TEXT, ShipDate TEXT, Status TEXT, ShipCity TEXT, ShipCountry TEXT, "
                "Salesperson TEXT, Items INTEGER, Amount NUMERIC, Freight NUMERIC)")))
            fail(query.lastError().text());
        QRandomGenerator random(20261206);
        const QDate start(2020, 1, 1);
        db.transaction();
        query.prepare(QStringLiteral("INSERT INTO Orders VALUES (?,?,?,?,?,?,?,?,?,?,?)"));
        for (int id = 1; id <= rows; ++id) {
            const auto& city = cities[random.bounded(14)];
            const QDate day = start.addDays(static_cast<qint64>(id) * 2000 / rows);
            const char* status = statuses[random.bounded(4)];
            query.addBindValue(id);
            query.addBindValue(random.bounded(1, 5000));
            query.addBindValue(day.toString(Qt::ISODate));
            query.addBindValue(qstrcmp(status, "Open") == 0
                    ? QVariant()
                    : QVariant(day.addDays(random.bounded(1, 9)).toString(Qt::ISODate)));
            query.addBindValue(QString::fromLatin1(status));
            query.addBindValue(QString::fromLatin1(city[0]));
            query.addBindValue(QString::fromLatin1(city[1]));
            query.addBindValue(QString::fromLatin1(people[random.bounded(6)]));
            query.addBindValue(random.bounded(1, 120));
            query.addBindValue(random.bounded(100, 5000000) / 100.0);
            query.addBindValue(random.bounded(500, 8000) / 100.0);
            if (!query.exec())
                fail(query.lastError().text());
        }
        db.commit();
        db.close();
    }
    QSqlDatabase::removeDatabase(name);
}

void relocate(runtime::Report& report, const QString& database)
{
    for (const auto& table : report.databaseTables()) {
        table->deleteConnectionProperties();
        table->addConnectionProperty(
            QStringLiteral("Provider"), core::Variant(QStringLiteral("Microsoft.Jet.OLEDB.4.0")));
        table->addConnectionProperty(QStringLiteral("Data Source"), core::Variant(database));
        const QString location = table->location();
        table->setLocation(location.mid(location.lastIndexOf(u'.') + 1), QString(), QString());
    }
}

} // namespace bench
