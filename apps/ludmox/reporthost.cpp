#include "reporthost.h"

#include "core/collection.h"
#include "core/comerror.h"
#include "core/dictionary.h"
#include "core/variant.h"
#include "dialogs/inputboxparams.h"
#include "dialogs/inputboxparamsitem.h"
#include "engine/moxengine115.h"
#include "logon.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"
#include "reports/moxviewer6exeglobals.h"

#include <QCommandLineParser>
#include <QFileInfo>
#include <QMutex>
#include <cstdio>
#include <unistd.h>

using namespace Qt::StringLiterals;

namespace {

constexpr int16_t english = 3;

core::ComError userError(const QString& text)
{
    return core::ComError(core::ErrorNumber::InvalidProcedureCall, u"ludmox"_s, text);
}

// The report object keeps the cause of a failed mail out of its Boolean result and notes it
// in its logging category; the command line shows it as its one-line error.
QtMessageHandler previousHandler = nullptr;
QString lastWarning;

void keepReportWarnings(QtMsgType type, const QMessageLogContext& context, const QString& text)
{
    if (context.category && qstrcmp(context.category, "ludmox.reports") == 0
        && type == QtWarningMsg) {
        lastWarning = text;
        return;
    }
    if (previousHandler)
        previousHandler(type, context, text);
}

} // namespace

bool ReportHost::parseArguments(QCommandLineParser& parser, const QStringList& arguments)
{
    if (!parser.parse(arguments)) {
        printError(parser.errorText());
        return false;
    }
    if (parser.isSet(QStringLiteral("help")))
        parser.showHelp(0);
    return true;
}

void ReportHost::printError(const QString& text)
{
    std::fputs(qPrintable(QStringLiteral("ludmox: ") + text + u'\n'), stderr);
}

void ReportHost::addReportOptions(QCommandLineParser& parser)
{
    Logon::addOptions(parser);
    parser.addOption({ u"param"_s, u"A parameter value for every report (repeat for more)."_s,
        u"name=value"_s });
    parser.addOption({ u"selection"_s,
        u"A record selection: a formula clause such as \"{Orders.ID} > 10\", or an SQL "
        u"condition."_s,
        u"formula"_s });
}

ReportHost::ReportHost(const Logon& logon)
{
    if (!previousHandler)
        previousHandler = qInstallMessageHandler(keepReportWarnings);
    m_engine = std::make_shared<engine::MoxEngine115>();
    m_engine->Init(english, false, 0, 0);
    logon.apply(*m_engine);
    m_reports = m_engine->GetReports();
    reports::SetInputBoxPresenter([this](const std::shared_ptr<dialogs::InputBoxParams>& params,
                                      int32_t, const QString&, int32_t) {
        // What a user who confirms the dialog at once would give: the fields as they start,
        // with the designer's defaults. A field that starts empty has no answer.
        m_missingParameters.clear();
        for (const auto& item : params->NewEnum()) {
            if (item->Value.isArray() && !item->MultiSelect)
                item->Value = item->DefaultValue;
            if (!item->Value.isArray() && !item->IsCheck && item->Value.toText().isEmpty())
                m_missingParameters << item->Name;
        }
        return m_missingParameters.isEmpty();
    });
}

ReportHost::~ReportHost()
{
    reports::SetInputBoxPresenter({});
    if (m_reports)
        m_reports->Destroy();
}

std::shared_ptr<reports::MoxReport115> ReportHost::open(
    const QString& path, const QCommandLineParser& parser)
{
    if (!QFileInfo(path).isFile())
        throw userError(u"the report %1 does not exist"_s.arg(path));
    m_missingParameters.clear();
    lastWarning.clear();
    const auto report = m_reports->Item(QFileInfo(path).absoluteFilePath());
    const QStringList assignments = parser.values(u"param"_s);
    if (!assignments.isEmpty()) {
        QStringList known;
        const auto parameters = report->GetParamsCollection();
        for (int32_t i = 1; parameters && i <= parameters->count(); ++i)
            known << parameters->item(i).array().at(0).toText();
        auto values = std::make_shared<core::Dictionary>(core::Dictionary::TextCompare);
        for (const QString& assignment : assignments) {
            const qsizetype equals = assignment.indexOf(u'=');
            if (equals <= 0)
                throw userError(u"--param takes NAME=VALUE, not %1"_s.arg(assignment));
            const QString name = assignment.left(equals);
            if (!known.contains(name, Qt::CaseInsensitive))
                throw userError(u"the report has no parameter %1"_s.arg(name));
            values->setItem(name, core::Variant(assignment.mid(equals + 1)));
        }
        if (!report->SetParams(values))
            throw userError(u"the parameter values do not fit the report"_s);
    }
    if (parser.isSet(u"selection"_s)
        && !report->SetSelection(QString(), core::Variant(parser.value(u"selection"_s))))
        throw userError(u"the selection cannot be applied"_s);
    return report;
}

QString ReportHost::explain(const core::ComError& error) const
{
    if (error.number() == core::ErrorNumber::UserCancelled && !m_missingParameters.isEmpty())
        return u"parameters without a value: %1 (give them with --param NAME=VALUE)"_s.arg(
            m_missingParameters.join(u", "_s));
    // A failure while the records are read reaches a host only as error 5; its cause is
    // in the report's diagnostics.
    if (error.number() == core::ErrorNumber::InvalidProcedureCall && !lastWarning.isEmpty())
        return lastWarning;
    // The exports add the scratch and target paths on lines of their own.
    return error.description().section(u"\r\n"_s, 0, 0);
}

QString ReportHost::failureText() const
{
    if (!m_missingParameters.isEmpty())
        return explain(core::ComError(core::ErrorNumber::UserCancelled, QString(), QString()));
    return lastWarning;
}

void ReportHost::progress(const QString& text)
{
    if (!::isatty(STDERR_FILENO))
        return;
    std::fputs(qPrintable(u"\r\x1b[K"_s + text), stderr);
    std::fflush(stderr);
}
