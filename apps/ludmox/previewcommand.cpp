#include "previewcommand.h"

#include "core/comerror.h"
#include "logon.h"
#include "reporthost.h"
#include "reports/moxreport115.h"
#include "viewer/clsmoxviewer115.h"
#include "viewer/imoxviewer115.h"
#include "viewer/ludmoxviewerformsdi.h"

#include <QCommandLineParser>
#include <QEvent>
#include <QEventLoop>
#include <QFileInfo>
#include <QGuiApplication>
#include <cstdio>

using namespace Qt::StringLiterals;

namespace {

/// Ends a wait once the watched window is hidden: closing the preview only hides it.
class HideWatcher : public QObject {
public:
    explicit HideWatcher(QEventLoop& loop)
        : m_loop(loop)
    { }

protected:
    bool eventFilter(QObject* watched, QEvent* event) override
    {
        if (event->type() == QEvent::Hide)
            m_loop.quit();
        return QObject::eventFilter(watched, event);
    }

private:
    QEventLoop& m_loop;
};

bool hasDisplay()
{
    const QString platform = QGuiApplication::platformName();
    return platform != u"offscreen"_s && platform != u"minimal"_s;
}

} // namespace

int previewCommand(const QStringList& arguments)
{
    QCommandLineParser parser;
    parser.setApplicationDescription(
        u"Shows a report in the preview window; returns when the window is closed."_s);
    parser.addHelpOption();
    parser.addPositionalArgument(u"preview"_s, u"The command."_s);
    parser.addPositionalArgument(u"report"_s, u"The report file to show."_s, u"REPORT"_s);
    ReportHost::addReportOptions(parser);
    if (!ReportHost::parseArguments(parser, arguments))
        return 2;
    const QStringList paths = parser.positionalArguments().mid(1);
    if (paths.size() != 1) {
        ReportHost::printError(u"preview takes one report; try preview --help"_s);
        return 2;
    }
    if (!hasDisplay()) {
        ReportHost::printError(
            u"preview needs a display (DISPLAY or WAYLAND_DISPLAY); use export instead"_s);
        return 2;
    }
    const QString path = paths.first();
    std::shared_ptr<reports::MoxReport115> report;
    std::unique_ptr<ReportHost> host;
    try {
        host = std::make_unique<ReportHost>(Logon::fromOptions(parser));
        report = host->open(path, parser);
    } catch (const core::ComError& error) {
        ReportHost::printError(
            host ? u"%1: %2"_s.arg(path, host->explain(error)) : error.description());
        return host ? 1 : 2;
    }

    const auto window = std::make_shared<viewer::clsMoxViewer115>();
    QString failure;
    window->connect([&failure](int32_t dispid, const QString&, std::span<core::Variant> args) {
        if (dispid != viewer::clsMoxViewer115::OnReportSourceErrorEvent)
            return;
        const QString message = args[0].toText();
        failure
            = u"%1 (error %2)"_s.arg(message.isEmpty() ? u"the report cannot be shown"_s : message)
                  .arg(args[1].toLong());
    });
    try {
        int32_t owner = 0;
        window->CreateViewerForm(owner);
        window->CRView()->Report(report);
        int16_t copies = 1;
        window->ShowReport(copies, owner);
    } catch (const core::ComError& error) {
        ReportHost::printError(u"%1: %2"_s.arg(path, error.description()));
        window->Destroy();
        return 1;
    }
    if (!failure.isEmpty()) {
        ReportHost::printError(u"%1: %2"_s.arg(path, failure));
        window->Destroy();
        return 1;
    }

    viewer::LUDMoxViewerFormSDI* form = window->form();
    form->setWindowTitle(QFileInfo(path).fileName() + u" - LUD Mox"_s);
    form->resize(900, 700);
    QEventLoop loop;
    HideWatcher watcher(loop);
    form->installEventFilter(&watcher);
    form->show();
    loop.exec();
    form->removeEventFilter(&watcher);
    window->Destroy();
    return 0;
}
