#pragma once

#include "reportrt/layout/page.h"
#include "reportrt/report.h"

#include <QImage>
#include <QJsonArray>
#include <QJsonObject>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>
#include <memory>
#include <vector>

namespace reportrt::layouttest {

/// The examples folder of the source tree.
QString examplesFolder();
/// The sample database (examples/make_sample_db.py, default size), made once per run.
QString sampleDatabase();

/// Opens a report file and points its tables and its subreports' tables at a SQLite
/// database, as the engine does for a file database.
std::shared_ptr<Report> openReport(const QString& path, const QString& database);
std::shared_ptr<Report> openExample(const QString& name);
void relocate(Report& report, const QString& database);

/// Lays the report out and keeps every page (tests only use small reports).
std::vector<Page> layOut(Report& report);
/// The texts of a page, top to bottom and left to right, one string per line of text.
QStringList texts(const Page& page);
/// All texts of all pages.
QStringList allTexts(const std::vector<Page>& pages);

/// A SQLite database with table Items (ID, Grp, Name, Amount, Note, Picture) holding
/// count records: ID 1..count, Grp "G" + (ID - 1) / perGroup, Amount = ID.
QString itemsDatabase(const QTemporaryDir& dir, int count, int perGroup = 5);
/// A report over Items: fields ID, Name, Amount in the details; sections given by the
/// caller (name -> object list) on A4 with 720-twip margins.
QJsonObject itemsReport(const QJsonArray& sections, const QJsonArray& groups = {});
QJsonObject section(const QString& name, int height, const QJsonArray& objects = {});
QJsonObject textObject(const QString& text, int left, int top, int width = 2000, int height = 240);
QJsonObject fieldObject(
    const QString& field, int left, int top, int width = 2000, int height = 240);
QString writeReport(const QTemporaryDir& dir, const QJsonObject& document,
    const QString& name = QStringLiteral("report.rpt"));

/// poppler and qpdf, as a user would check a PDF.
int pdfPageCount(const QString& path);
QString pdfText(const QString& path, int page = 0); // 0: all pages
QSizeF pdfPageSize(const QString& path); // points
bool qpdfCheck(const QString& path, QString* output = nullptr);
QImage renderPdfPage(const QString& path, int page, int dpi = 72);
QString pdfFonts(const QString& path);

/// Runs a program and returns its standard output; throws when it fails.
QString run(const QString& program, const QStringList& arguments);

} // namespace reportrt::layouttest
