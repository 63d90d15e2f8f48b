#pragma once

#include "runtime/application.h"

#include <memory>
#include <vector>

namespace reportrt {

class Report;
class SqlConnection;

/// The report runtime's application object.
class Application : public runtime::Application {
public:
    Application();
    ~Application() override;

    /// Raises Error::OpenReportFailed or Error::InvalidDocument with the file and the
    /// position of the fault. Every open option reads the whole file, so the file is never
    /// held open.
    std::shared_ptr<runtime::Report> openReport(const QString& path, int16_t openOption) override;
    void setMatchLogOnInfo(bool value) override;
    /// Opens a connection to the server (ProviderMap::forServer) and keeps it until the
    /// log-off; raises Error::LogOnFailed when it cannot be opened.
    void logOnServer(const QString& dllName, const QString& serverName, const QString& databaseName,
        const QString& userId, const QString& password, const QString& serverType,
        const QString& connectionString) override;
    /// Closes the logon with the same server, database and user id; no such logon is no
    /// error.
    void logOffServer(const QString& dllName, const QString& serverName,
        const QString& databaseName, const QString& userId, const QString& password) override;
    bool canClose() override;

private:
    struct Logon;
    std::vector<std::unique_ptr<Logon>> m_logons;
    std::vector<std::weak_ptr<Report>> m_reports;
};

} // namespace reportrt
