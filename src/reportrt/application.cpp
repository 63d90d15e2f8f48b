#include "reportrt/application.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/providermap.h"
#include "reportrt/data/sqlconnection.h"
#include "reportrt/report.h"

namespace reportrt {

struct Application::Logon {
    QString server;
    QString database;
    QString userId;
    std::unique_ptr<SqlConnection> connection;
};

Application::Application() = default;

Application::~Application()
{
    for (const auto& logon : m_logons)
        ProviderMap::removeLogon(logon->server, logon->database, logon->userId);
}

std::shared_ptr<runtime::Report> Application::openReport(const QString& path, int16_t)
{
    auto report = Report::open(path);
    std::erase_if(m_reports, [](const std::weak_ptr<Report>& r) { return r.expired(); });
    m_reports.push_back(report);
    return report;
}

void Application::setMatchLogOnInfo(bool value)
{
    ProviderMap::setMatchLogOnInfo(value);
}

void Application::logOnServer(const QString&, const QString& serverName,
    const QString& databaseName, const QString& userId, const QString& password, const QString&,
    const QString& connectionString)
{
    const bool integrated = userId.isEmpty()
        || connectionString.contains(u"Integrated Security=True", Qt::CaseInsensitive)
        || connectionString.contains(u"Integrated Security=SSPI", Qt::CaseInsensitive);
    const ConnectionSpec spec
        = ProviderMap::forServer(serverName, databaseName, userId, password, integrated);
    auto connection = std::make_unique<SqlConnection>(spec);
    QString message;
    if (!connection->open(message))
        raiseError(Error::LogOnFailed,
            QStringLiteral("Logon failed. Details: could not connect to the %1: %2")
                .arg(spec.describe(), message));
    logOffServer(QString(), serverName, databaseName, userId, QString());
    ProviderMap::addLogon(spec);
    m_logons.push_back(
        std::make_unique<Logon>(Logon { serverName, databaseName, userId, std::move(connection) }));
}

void Application::logOffServer(const QString&, const QString& serverName,
    const QString& databaseName, const QString& userId, const QString&)
{
    for (auto it = m_logons.begin(); it != m_logons.end();) {
        const Logon& logon = **it;
        if (logon.server.compare(serverName, Qt::CaseInsensitive) == 0
            && logon.database.compare(databaseName, Qt::CaseInsensitive) == 0
            && logon.userId.compare(userId, Qt::CaseInsensitive) == 0) {
            ProviderMap::removeLogon(logon.server, logon.database, logon.userId);
            it = m_logons.erase(it);
        } else {
            ++it;
        }
    }
}

bool Application::canClose()
{
    std::erase_if(m_reports, [](const std::weak_ptr<Report>& r) { return r.expired(); });
    return m_reports.empty() && m_logons.empty();
}

} // namespace reportrt
