#include "mailfixture.h"

#include <QDir>
#include <QFile>
#include <QJsonDocument>
#include <QTemporaryFile>
#include <arpa/inet.h>
#include <netinet/in.h>
#include <stdexcept>
#include <sys/socket.h>
#include <unistd.h>

namespace reportrt::mail::test {

namespace {

QString script(const QString& name)
{
    return qEnvironmentVariable("LUDMOX_MAIL_SCRIPTS") + u'/' + name;
}

QString python()
{
    const QString configured = qEnvironmentVariable("LUDMOX_MAIL_PYTHON");
    return configured.isEmpty() ? QStringLiteral("python3") : configured;
}

} // namespace

SmtpServer::SmtpServer(const Options& options)
{
    QStringList arguments { script(QStringLiteral("smtp_server.py")), QStringLiteral("--output"),
        m_folder.path() };
    if (!options.refusePrefix.isEmpty())
        arguments << QStringLiteral("--refuse") << options.refusePrefix;
    if (!options.user.isEmpty())
        arguments << QStringLiteral("--user") << options.user << QStringLiteral("--password")
                  << options.password;
    m_process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
    m_process.start(python(), arguments);
    if (!m_process.waitForStarted(10000))
        throw std::runtime_error("the SMTP test server does not start");
    while (!m_process.canReadLine()) {
        if (!m_process.waitForReadyRead(15000))
            throw std::runtime_error("the SMTP test server does not report its port");
    }
    m_port = m_process.readLine().trimmed().toInt();
}

SmtpServer::~SmtpServer()
{
    m_process.kill();
    m_process.waitForFinished(5000);
}

QStringList SmtpServer::messages() const
{
    QStringList result;
    const QDir folder(m_folder.path());
    for (int n = 1; folder.exists(QStringLiteral("%1.eml").arg(n)); ++n)
        result.append(folder.filePath(QStringLiteral("%1.eml").arg(n)));
    return result;
}

QJsonObject SmtpServer::envelope(const QString& emlPath) const
{
    QFile file(emlPath.chopped(4) + QStringLiteral(".json"));
    if (!file.open(QIODevice::ReadOnly))
        return {};
    return QJsonDocument::fromJson(file.readAll()).object();
}

SilentListener::SilentListener()
{
    m_socket = ::socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address {};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof(address);
    auto* generic = reinterpret_cast<sockaddr*>(&address);
    if (m_socket < 0 || ::bind(m_socket, generic, length) != 0 || ::listen(m_socket, 4) != 0
        || ::getsockname(m_socket, generic, &length) != 0)
        throw std::runtime_error("cannot open a loopback socket");
    m_port = ntohs(address.sin_port);
}

SilentListener::~SilentListener()
{
    ::close(m_socket);
}

int closedPort()
{
    // Bound and closed again: nothing listens there until some other program takes it,
    // which on a loopback port in a test run is unlikely.
    return SilentListener().port();
}

QJsonObject parseMessage(const QString& emlPath)
{
    QProcess process;
    process.setProcessChannelMode(QProcess::ForwardedErrorChannel);
    process.start(python(), { script(QStringLiteral("mime_check.py")), emlPath });
    if (!process.waitForFinished(30000) || process.exitCode() != 0)
        throw std::runtime_error("mime_check.py failed on " + emlPath.toStdString());
    return QJsonDocument::fromJson(process.readAllStandardOutput()).object();
}

QJsonObject parseMessage(const QByteArray& message)
{
    QTemporaryFile file;
    if (!file.open() || file.write(message) != message.size() || !file.flush())
        throw std::runtime_error("cannot write a temporary message file");
    return parseMessage(file.fileName());
}

QStringList entries(const QString& folder)
{
    return QDir(folder).entryList(
        QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot);
}

} // namespace reportrt::mail::test
