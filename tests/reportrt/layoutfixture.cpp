#include "layoutfixture.h"

#include "core/variant.h"
#include "reportrt/layout/fonttable.h"
#include "reportrt/layout/layoutengine.h"
#include "reportrt/layout/textshaper.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"
#include "runtime/databasetable.h"

#include <QDir>
#include <QFile>
#include <QJsonDocument>
#include <QProcess>
#include <QRegularExpression>
#include <QSqlDatabase>
#include <QSqlError>
#include <QSqlQuery>
#include <algorithm>
#include <stdexcept>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {

QString run(const QString& program, const QStringList& arguments)
{
    QProcess process;
    process.start(program, arguments);
    if (!process.waitForFinished(300000) || process.exitStatus() != QProcess::NormalExit
        || process.exitCode() != 0)
        throw std::runtime_error(QString(program + u' ' + arguments.join(u' ') + u": "
            + QString::fromLocal8Bit(process.readAllStandardError()))
                                     .toStdString());
    return QString::fromUtf8(process.readAllStandardOutput());
}

QString examplesFolder()
{
    const QString folder = qEnvironmentVariable("LUDMOX_EXAMPLES");
    if (folder.isEmpty())
        throw std::runtime_error("LUDMOX_EXAMPLES is not set");
    return folder;
}

QString sampleDatabase()
{
    static QTemporaryDir dir;
    static QString path;
    if (path.isEmpty()) {
        const QString file = dir.filePath(u"sample.db"_s);
        run(u"python3"_s, { examplesFolder() + u"/make_sample_db.py"_s, u"--output"_s, file });
        path = file;
    }
    return path;
}

void relocate(Report& report, const QString& database)
{
    for (const auto& table : report.databaseTables()) {
        table->deleteConnectionProperties();
        table->addConnectionProperty(u"Provider"_s, core::Variant(u"Microsoft.Jet.OLEDB.4.0"_s));
        table->addConnectionProperty(u"Data Source"_s, core::Variant(database));
        if (table->location().compare(u"Command", Qt::CaseInsensitive) == 0)
            continue;
        QString location = table->location();
        table->setLocation(location.mid(location.lastIndexOf(u'.') + 1), QString(), QString());
    }
    for (const auto& section : report.sections()) {
        for (const auto& object : section->reportObjects()) {
            if (object->typeName() == u"ISubreportObject")
                relocate(*std::static_pointer_cast<Report>(object->openSubreport()), database);
        }
    }
}

std::shared_ptr<Report> openReport(const QString& path, const QString& database)
{
    auto report = Report::open(path);
    relocate(*report, database);
    return report;
}

std::shared_ptr<Report> openExample(const QString& name)
{
    return openReport(examplesFolder() + u"/reports/"_s + name, sampleDatabase());
}

std::vector<Page> layOut(Report& report)
{
    FontTable fonts;
    TextShaper shaper(fonts);
    int total = 0;
    if (LayoutEngine::showsTotalPages(report))
        total = LayoutEngine(report, shaper).run({});
    std::vector<Page> pages;
    LayoutEngine engine(report, shaper);
    engine.setTotalPages(total);
    engine.run([&](Page&& page) { pages.push_back(std::move(page)); });
    return pages;
}

QStringList texts(const Page& page)
{
    std::vector<const Page::Text*> sorted;
    for (const auto& t : page.texts)
        sorted.push_back(&t);
    std::stable_sort(sorted.begin(), sorted.end(), [](const Page::Text* a, const Page::Text* b) {
        if (std::abs(a->origin.y() - b->origin.y()) > 1)
            return a->origin.y() < b->origin.y();
        return a->origin.x() < b->origin.x();
    });
    QStringList result;
    for (const Page::Text* t : sorted)
        result << t->text->source.left(t->glyphCount);
    return result;
}

QStringList allTexts(const std::vector<Page>& pages)
{
    QStringList result;
    for (const Page& page : pages)
        result << texts(page);
    return result;
}

QString itemsDatabase(const QTemporaryDir& dir, int count, int perGroup)
{
    const QString path = dir.filePath(u"items.db"_s);
    const QString name = u"layout-test-setup"_s;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, name);
        db.setDatabaseName(path);
        if (!db.open())
            throw std::runtime_error(db.lastError().text().toStdString());
        QSqlQuery query(db);
        query.exec(u"DROP TABLE IF EXISTS Items"_s);
        if (!query.exec(u"CREATE TABLE Items (ID INTEGER PRIMARY KEY, Grp TEXT, Name TEXT, "
                        "Amount NUMERIC, Note TEXT, Picture BLOB)"_s))
            throw std::runtime_error(query.lastError().text().toStdString());
        db.transaction();
        query.prepare(u"INSERT INTO Items VALUES (?, ?, ?, ?, ?, NULL)"_s);
        for (int id = 1; id <= count; ++id) {
            query.addBindValue(id);
            query.addBindValue(
                u"G%1"_s.arg((id - 1) / std::max(1, perGroup) + 1, 2, 10, QChar(u'0')));
            query.addBindValue(u"Item %1"_s.arg(id));
            query.addBindValue(id);
            query.addBindValue(QString());
            if (!query.exec())
                throw std::runtime_error(query.lastError().text().toStdString());
        }
        db.commit();
        db.close();
    }
    QSqlDatabase::removeDatabase(name);
    return path;
}

QJsonObject section(const QString& name, int height, const QJsonArray& objects)
{
    return QJsonObject { { u"name"_s, name }, { u"height"_s, height }, { u"objects"_s, objects } };
}

QJsonObject textObject(const QString& text, int left, int top, int width, int height)
{
    return QJsonObject { { u"kind"_s, u"text"_s }, { u"text"_s, text }, { u"left"_s, left },
        { u"top"_s, top }, { u"width"_s, width }, { u"height"_s, height } };
}

QJsonObject fieldObject(const QString& field, int left, int top, int width, int height)
{
    return QJsonObject { { u"kind"_s, u"field"_s }, { u"field"_s, field }, { u"left"_s, left },
        { u"top"_s, top }, { u"width"_s, width }, { u"height"_s, height } };
}

QJsonObject itemsReport(const QJsonArray& sections, const QJsonArray& groups)
{
    const QJsonArray fields {
        QJsonObject { { u"name"_s, u"ID"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Grp"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Name"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Amount"_s }, { u"type"_s, u"number"_s } },
        QJsonObject { { u"name"_s, u"Note"_s }, { u"type"_s, u"string"_s } },
        QJsonObject { { u"name"_s, u"Picture"_s }, { u"type"_s, u"binary"_s } },
    };
    return QJsonObject {
        { u"format"_s, u"ludmox-report"_s },
        { u"version"_s, 1 },
        { u"summary"_s, QJsonObject { { u"title"_s, u"Items"_s } } },
        { u"page"_s,
            QJsonObject { { u"paperSize"_s, 9 },
                { u"margins"_s,
                    QJsonObject { { u"left"_s, 720 }, { u"top"_s, 720 }, { u"right"_s, 720 },
                        { u"bottom"_s, 720 } } } } },
        { u"tables"_s,
            QJsonArray { QJsonObject { { u"name"_s, u"Items"_s }, { u"fields"_s, fields } } } },
        { u"groups"_s, groups },
        { u"sorts"_s, QJsonArray { QJsonObject { { u"field"_s, u"{Items.ID}"_s } } } },
        { u"sections"_s, sections },
    };
}

QString writeReport(const QTemporaryDir& dir, const QJsonObject& document, const QString& name)
{
    const QString path = dir.filePath(name);
    QFile file(path);
    const QByteArray text = QJsonDocument(document).toJson();
    if (!file.open(QIODevice::WriteOnly) || file.write(text) != text.size())
        throw std::runtime_error("cannot write the report file");
    return path;
}

int pdfPageCount(const QString& path)
{
    const QString info = run(u"pdfinfo"_s, { path });
    const auto match = QRegularExpression(u"Pages:\\s+(\\d+)"_s).match(info);
    return match.hasMatch() ? match.captured(1).toInt() : -1;
}

QSizeF pdfPageSize(const QString& path)
{
    const QString info = run(u"pdfinfo"_s, { path });
    const auto match = QRegularExpression(u"Page size:\\s+([\\d.]+) x ([\\d.]+) pts"_s).match(info);
    return match.hasMatch() ? QSizeF(match.captured(1).toDouble(), match.captured(2).toDouble())
                            : QSizeF();
}

QString pdfText(const QString& path, int page)
{
    QStringList arguments { u"-layout"_s };
    if (page > 0)
        arguments << u"-f"_s << QString::number(page) << u"-l"_s << QString::number(page);
    arguments << path << u"-"_s;
    return run(u"pdftotext"_s, arguments);
}

QString pdfFonts(const QString& path)
{
    return run(u"pdffonts"_s, { path });
}

bool qpdfCheck(const QString& path, QString* output)
{
    QProcess process;
    process.start(u"qpdf"_s, { u"--check"_s, path });
    process.waitForFinished(300000);
    if (output)
        *output
            = QString::fromUtf8(process.readAllStandardOutput() + process.readAllStandardError());
    return process.exitStatus() == QProcess::NormalExit && process.exitCode() == 0;
}

QImage renderPdfPage(const QString& path, int page, int dpi)
{
    QTemporaryDir dir;
    const QString stem = dir.filePath(u"page"_s);
    run(u"pdftoppm"_s,
        { u"-png"_s, u"-r"_s, QString::number(dpi), u"-f"_s, QString::number(page), u"-l"_s,
            QString::number(page), u"-singlefile"_s, path, stem });
    return QImage(stem + u".png"_s);
}

} // namespace reportrt::layouttest
