#include "exportcommand.h"

#include "core/comerror.h"
#include "logon.h"
#include "reporthost.h"
#include "reports/moxreport115.h"
#include "reports/moxstatus115.h"
#include "runtime/report.h"

#include <QCommandLineParser>
#include <QCoreApplication>
#include <QDir>
#include <QElapsedTimer>
#include <QFileInfo>
#include <QTemporaryFile>
#include <cerrno>
#include <cstdio>
#include <cstring>

using namespace Qt::StringLiterals;

namespace {

struct Format {
    QString name;
    QString extension;
};

const Format formats[]
    = { { u"pdf"_s, u".pdf"_s }, { u"xlsx"_s, u".xlsx"_s }, { u"html"_s, u".html"_s } };

/// Writes `target` through the report object in one pass. Its usual route lays the report
/// out twice (a scratch file to learn whether there are records, then the target); the user
/// wants the file either way, so the report writes its "scratch" file straight to a hidden
/// name beside the target, which replaces the target only once complete. On failure the
/// report object removes that file and an existing target stays as it was.
void exportReport(reports::MoxReport115& report, const QString& format, const QString& target)
{
    const QFileInfo info(target);
    QString staging;
    {
        QTemporaryFile reserved(info.absolutePath() + u"/."_s + info.completeBaseName()
            + u".XXXXXX."_s + info.suffix());
        if (!reserved.open())
            throw core::ComError(core::ErrorNumber::InvalidProcedureCall, u"ludmox"_s,
                u"cannot write into %1: %2"_s.arg(info.absolutePath(), reserved.errorString()));
        staging = reserved.fileName();
    }
    bool tempFileOnly = true;
    bool forceSave = true;
    if (format == u"xlsx") {
        report.SaveAsXLS(staging, tempFileOnly, forceSave);
    } else if (format == u"html") {
        bool separatePages = false;
        bool navigator = false;
        report.SaveAsHTML(staging, tempFileOnly, forceSave, separatePages, navigator);
    } else {
        bool firstSave = false;
        report.SaveAsPDF(staging, firstSave, tempFileOnly, forceSave);
    }
    if (::rename(QFile::encodeName(staging).constData(), QFile::encodeName(target).constData())
        != 0) {
        const QString cause = QString::fromLocal8Bit(std::strerror(errno));
        QFile::remove(staging);
        throw core::ComError(core::ErrorNumber::InvalidProcedureCall, u"ludmox"_s,
            u"cannot replace %1: %2"_s.arg(target, cause));
    }
}

/// The sample reports: installed beside the program (PREFIX/share/ludmox/examples/reports),
/// else those of the source tree this program was built from, else the current folder's.
QString sampleReports()
{
    const QString installed = QDir(QCoreApplication::applicationDirPath())
                                  .absoluteFilePath(u"../share/ludmox/examples/reports"_s);
    if (QFileInfo(installed).isDir())
        return QDir::cleanPath(installed);
    const QString source = QStringLiteral(LUDMOX_SOURCE_EXAMPLES) + u"/reports"_s;
    if (QFileInfo(source).isDir())
        return source;
    return u"examples/reports"_s;
}

} // namespace

int exportCommand(const QStringList& arguments)
{
    QCommandLineParser parser;
    parser.setApplicationDescription(u"Writes reports as PDF, Excel or HTML files."_s);
    parser.addHelpOption();
    parser.addPositionalArgument(u"export"_s, u"The command."_s);
    parser.addPositionalArgument(u"reports"_s, u"The report files to export."_s, u"REPORT..."_s);
    parser.addOption({ u"format"_s, u"pdf (the default), xlsx or html."_s, u"format"_s, u"pdf"_s });
    parser.addOption(
        { u"output"_s, u"The folder for the files (made when missing)."_s, u"folder"_s });
    parser.addOption({ u"reports"_s,
        u"The folder of the reports to export when none are named (default: the installed "
        u"sample reports)."_s,
        u"folder"_s, sampleReports() });
    ReportHost::addReportOptions(parser);
    if (!ReportHost::parseArguments(parser, arguments))
        return 2;

    const QString format = parser.value(u"format"_s).toLower();
    const auto known = std::find_if(std::begin(formats), std::end(formats),
        [&](const Format& candidate) { return candidate.name == format; });
    if (known == std::end(formats)) {
        ReportHost::printError(u"unknown format %1; use pdf, xlsx or html"_s.arg(format));
        return 2;
    }
    const QString output = parser.value(u"output"_s);
    if (output.isEmpty() || !QDir().mkpath(output)) {
        ReportHost::printError(u"cannot create the output folder %1"_s.arg(output));
        return 2;
    }
    int failures = 0;
    try {
        ReportHost host(Logon::fromOptions(parser));
        QStringList paths = parser.positionalArguments().mid(1);
        if (paths.isEmpty()) {
            const QDir folder(parser.value(u"reports"_s));
            for (const QString& name : folder.entryList({ u"*.rpt"_s }, QDir::Files, QDir::Name))
                paths << folder.filePath(name);
        }
        if (paths.isEmpty()) {
            ReportHost::printError(u"no reports to export"_s);
            return 2;
        }
        for (qsizetype i = 0; i < paths.size(); ++i) {
            const QString& path = paths[i];
            const QString target = QFileInfo(
                QDir(output).filePath(QFileInfo(path).completeBaseName() + known->extension))
                                       .absoluteFilePath();
            ReportHost::progress(u"[%1/%2] %3: reading and writing..."_s.arg(i + 1)
                                     .arg(paths.size())
                                     .arg(QFileInfo(path).fileName()));
            QElapsedTimer timer;
            timer.start();
            try {
                const auto report = host.open(path, parser);
                exportReport(*report, format, target);
                const auto status = report->Status();
                // Status tells the page count only once every record was printed; the
                // runtime's own count is final after an export.
                const auto runtimeReport = report->GetReport();
                const int32_t pages = runtimeReport ? runtimeReport->printingStatus().pageCount : 0;
                ReportHost::progress(QString());
                std::fputs(qPrintable(u"%1: %2 records, %3 pages, %4 ms\n"_s
                                          .arg(QDir::toNativeSeparators(target))
                                          .arg(status ? status->NumberOfRecordPrinted : 0)
                                          .arg(pages)
                                          .arg(timer.elapsed())),
                    stdout);
                std::fflush(stdout);
                report->CloseReport();
            } catch (const core::ComError& error) {
                ReportHost::progress(QString());
                ReportHost::printError(u"%1: %2"_s.arg(path, host.explain(error)));
                ++failures;
            }
        }
    } catch (const core::ComError& error) {
        ReportHost::printError(error.description());
        return 2;
    }
    return failures == 0 ? 0 : 1;
}
