#pragma once

#include <QString>
#include <QStringList>
#include <memory>

class Logon;
class QCommandLineParser;

namespace engine {
class MoxEngine115;
}
namespace reports {
class MoxReport115;
class MoxReports115;
} // namespace reports
namespace core {
class ComError;
}

/// What the command line does as a host application: one engine logged on to the user's
/// database, reports opened through its collection with the user's parameter values
/// and selection. The parameter dialog is never shown (a shell may have no display): the
/// parameters the user did not give take the values the dialog would start with (the
/// designer's defaults), and one without such a value fails the report with a message
/// naming it.
class ReportHost {
public:
    /// --logon, --database, --param and --selection, which every report command takes.
    static void addReportOptions(QCommandLineParser& parser);
    /// Parses a command's arguments; --help prints the help and ends the program. False,
    /// after saying why on standard error, when they do not parse.
    static bool parseArguments(QCommandLineParser& parser, const QStringList& arguments);
    /// "ludmox: text" on standard error.
    static void printError(const QString& text);

    explicit ReportHost(const Logon& logon);
    ~ReportHost();
    ReportHost(const ReportHost&) = delete;
    ReportHost& operator=(const ReportHost&) = delete;

    /// The report at `path` with the parser's parameter values and selection given to it.
    /// Raises core::ComError with a message for the user when the file does not exist or a
    /// --param names no parameter of the report.
    std::shared_ptr<reports::MoxReport115> open(
        const QString& path, const QCommandLineParser& parser);

    /// One line for the user about a failed report operation.
    QString explain(const core::ComError& error) const;
    /// Why a member that answers only true or false failed: the parameters left without a
    /// value, or the last problem the report object noted; empty when neither is known.
    QString failureText() const;

    /// Writes `text` over the current line of standard error, only when it is a terminal;
    /// an empty text clears the line.
    static void progress(const QString& text);

private:
    std::shared_ptr<engine::MoxEngine115> m_engine;
    std::shared_ptr<reports::MoxReports115> m_reports;
    QStringList m_missingParameters;
};
