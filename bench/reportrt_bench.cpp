// Reads a million records of a SQLite table through a report whose selection formula is
// half pushed down to SQL (the amount condition) and half evaluated on each record (the
// name condition), and prints the throughput in table rows per second.
//
//     reportrt_bench [rows]

#include "core/variant.h"
#include "reportrt/report.h"
#include "runtime/databasetable.h"

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QFile>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <QTemporaryDir>
#include <cstdio>

namespace {

bool createTable(const QString& path, int rows)
{
    bool ok = true;
    {
        QSqlDatabase db
            = QSqlDatabase::addDatabase(QStringLiteral("QSQLITE"), QStringLiteral("bench-setup"));
        db.setDatabaseName(path);
        ok = db.open();
        QSqlQuery query(db);
        ok = ok
            && query.exec(QStringLiteral("CREATE TABLE Items (ID INTEGER PRIMARY KEY, Name TEXT, "
                                         "Amount REAL, Category TEXT)"));
        ok = ok && db.transaction();
        ok = ok && query.prepare(QStringLiteral("INSERT INTO Items VALUES (?, ?, ?, ?)"));
        static const char16_t* categories[] = { u"Books", u"Games", u"Tools", u"Food" };
        for (int i = 1; ok && i <= rows; ++i) {
            query.bindValue(0, i);
            // One name in 26 starts with "X": the runtime's half of the formula drops those.
            query.bindValue(
                1, QString(QString(QChar(u'A' + i % 26)) + QStringLiteral("item %1").arg(i)));
            query.bindValue(2, static_cast<double>((i * 7919) % 1000)); // 0..999, half >= 500
            query.bindValue(3, QString::fromUtf16(categories[i % 4]));
            ok = query.exec();
        }
        ok = ok && db.commit();
        if (!ok)
            std::fprintf(stderr, "setup failed: %s\n", qPrintable(query.lastError().text()));
        db.close();
    }
    QSqlDatabase::removeDatabase(QStringLiteral("bench-setup"));
    return ok;
}

const char report[] = R"json({
  "format": "ludmox-report", "version": 1,
  "tables": [{"name": "Items", "location": "Items", "fields": [
      {"name": "ID", "type": "number"}, {"name": "Name", "type": "string"},
      {"name": "Amount", "type": "number"}, {"name": "Category", "type": "string"}]}],
  "selectionFormula": "{Items.Amount} >= 500 And Not ({Items.Name} StartsWith 'X' Or UpperCase({Items.Category}) = 'FOOD')",
  "sections": [{"name": "D", "objects": [
      {"kind": "field", "field": "{Items.ID}"}, {"kind": "field", "field": "{Items.Name}"},
      {"kind": "field", "field": "{Items.Amount}"}]}]
})json";

} // namespace

int main(int argc, char** argv)
{
    QCoreApplication application(argc, argv);
    const int rows = argc > 1 ? QString::fromLocal8Bit(argv[1]).toInt() : 1000000;
    QTemporaryDir dir;
    const QString database = dir.filePath(QStringLiteral("bench.db"));
    QElapsedTimer timer;
    timer.start();
    if (!createTable(database, rows))
        return 1;
    std::printf("created %d rows in %.1f s\n", rows, static_cast<double>(timer.elapsed()) / 1000.0);

    QFile file(dir.filePath(QStringLiteral("bench.rpt")));
    if (!file.open(QIODevice::WriteOnly) || file.write(report) < 0)
        return 1;
    file.close();

    for (const bool pushdown : { true, false }) {
        const auto opened = reportrt::Report::open(file.fileName());
        const auto table = opened->databaseTables().front();
        table->addConnectionProperty(
            QStringLiteral("Provider"), core::Variant(QStringLiteral("Microsoft.Jet.OLEDB.4.0")));
        table->addConnectionProperty(QStringLiteral("Data Source"), core::Variant(database));
        table->setLocation(QStringLiteral("Items"), QString(), QString());
        if (!pushdown) {
            QString sql = opened->sqlQueryString();
            sql.truncate(sql.indexOf(u"\r\nWHERE"));
            opened->setSqlQueryString(sql);
        }
        timer.restart();
        opened->readRecords();
        const double seconds = static_cast<double>(timer.nsecsElapsed()) / 1e9;
        const auto status = opened->printingStatus();
        std::printf(
            "%s: %d table rows, %d read, %d selected in %.3f s: %.0f table rows per second\n",
            pushdown ? "with pushdown   " : "without pushdown", rows, status.recordsRead,
            status.recordsSelected, seconds, rows / seconds);
    }
    return 0;
}
