#include "fakeruntime.h"

namespace fakeruntime {

FakeRuntime::FakeRuntime()
    : m_script(std::make_shared<Script>())
{
    m_previousFactory = runtime::ApplicationFactory::install([this] {
        m_script->record(Call { QStringLiteral("ApplicationFactory"), QString(),
            QStringLiteral("create"), {}, false, false });
        auto application = std::make_shared<FakeApplication>(m_script);
        ++m_script->applicationsCreated;
        m_applications.push_back(application);
        return application;
    });
}

FakeRuntime::~FakeRuntime()
{
    runtime::ApplicationFactory::install(std::move(m_previousFactory));
}

std::shared_ptr<FakeReport> FakeRuntime::addReport(const QString& path)
{
    auto report = newReport(path);
    m_script->addReport(path, report);
    return report;
}

std::shared_ptr<FakeReport> FakeRuntime::newReport(const QString& label)
{
    return std::make_shared<FakeReport>(m_script, label);
}

void FakeRuntime::failOn(const QString& call, const core::ComError& error, int occurrence)
{
    m_script->addRule(
        call, [error] { throw error; }, occurrence);
}

void FakeRuntime::failAlways(const QString& call, const core::ComError& error)
{
    failOn(call, error, 0);
}

void FakeRuntime::onCall(const QString& call, std::function<void()> action, int occurrence)
{
    m_script->addRule(call, std::move(action), occurrence);
}

void FakeRuntime::setCanClose(bool value)
{
    m_script->canClose = value;
}

QStringList FakeRuntime::calls() const
{
    return calls(QString());
}

QStringList FakeRuntime::calls(const QString& prefix) const
{
    QStringList result;
    for (const Call& call : m_script->log()) {
        const QString text = call.text();
        if (!call.isQuery && text.startsWith(prefix))
            result << text;
    }
    return result;
}

QStringList FakeRuntime::allCalls() const
{
    QStringList result;
    for (const Call& call : m_script->log())
        result << call.text();
    return result;
}

const std::vector<Call>& FakeRuntime::log() const
{
    return m_script->log();
}

void FakeRuntime::clearLog()
{
    m_script->clearLog();
}

QString FakeRuntime::dump() const
{
    QString result;
    for (const Call& call : m_script->log()) {
        result += call.text();
        if (call.isQuery)
            result += QStringLiteral("   [query]");
        if (call.raised)
            result += QStringLiteral("   [raised]");
        result += u'\n';
    }
    return result;
}

int FakeRuntime::applicationsCreated() const
{
    return m_script->applicationsCreated;
}

std::vector<std::shared_ptr<FakeApplication>> FakeRuntime::liveApplications() const
{
    std::vector<std::shared_ptr<FakeApplication>> result;
    for (const auto& application : m_applications) {
        if (auto alive = application.lock())
            result.push_back(std::move(alive));
    }
    return result;
}

} // namespace fakeruntime
