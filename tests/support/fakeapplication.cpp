#include "fakeapplication.h"

#include "fakereport.h"
#include "script.h"

namespace fakeruntime {

FakeApplication::FakeApplication(std::weak_ptr<Script> script)
    : FakeObject(std::move(script), QStringLiteral("Application"))
{ }

std::shared_ptr<runtime::Report> FakeApplication::openReport(
    const QString& path, int16_t openOption)
{
    record(QStringLiteral("openReport"), { arg(path), arg(openOption) });
    const auto shared = script().lock();
    auto report = shared ? shared->report(path) : nullptr;
    if (!report)
        throw core::ComError(core::ErrorNumber::OpenReportFailed, QStringLiteral("FakeRuntime"),
            QStringLiteral("File not found: ") + path);
    return report;
}

void FakeApplication::setMatchLogOnInfo(bool value)
{
    record(QStringLiteral("setMatchLogOnInfo"), { arg(value) });
    state.matchLogOnInfo = value;
}

void FakeApplication::logOnServer(const QString& dllName, const QString& serverName,
    const QString& databaseName, const QString& userId, const QString& password,
    const QString& serverType, const QString& connectionString)
{
    record(QStringLiteral("logOnServer"),
        { arg(dllName), arg(serverName), arg(databaseName), arg(userId), arg(password),
            arg(serverType), arg(connectionString) });
    state.loggedOn = true;
}

void FakeApplication::logOffServer(const QString& dllName, const QString& serverName,
    const QString& databaseName, const QString& userId, const QString& password)
{
    record(QStringLiteral("logOffServer"),
        { arg(dllName), arg(serverName), arg(databaseName), arg(userId), arg(password) });
    state.loggedOn = false;
}

bool FakeApplication::canClose()
{
    record(QStringLiteral("canClose"));
    const auto shared = script().lock();
    return !shared || shared->canClose;
}

} // namespace fakeruntime
