#pragma once

#include <QJsonObject>
#include <QProcess>
#include <QString>
#include <QTemporaryDir>
#include <memory>

namespace reportrt::mail::test {

/// The loopback SMTP server of smtp_server.py, running while the object lives.
class SmtpServer {
public:
    struct Options {
        QString refusePrefix;
        QString user;
        QString password;
    };
    explicit SmtpServer(const Options& options = {});
    ~SmtpServer();

    int port() const { return m_port; }
    QString url() const { return QStringLiteral("smtp://127.0.0.1:%1").arg(m_port); }
    /// Messages received so far: N.eml paths in arrival order.
    QStringList messages() const;
    /// The envelope (mail_from, rcpt_tos) of a received message.
    QJsonObject envelope(const QString& emlPath) const;

private:
    QTemporaryDir m_folder;
    QProcess m_process;
    int m_port = 0;
};

/// A loopback socket that accepts connections (the kernel completes them) but never says a
/// word, like a server that hangs.
class SilentListener {
public:
    SilentListener();
    ~SilentListener();
    SilentListener(const SilentListener&) = delete;
    SilentListener& operator=(const SilentListener&) = delete;
    int port() const { return m_port; }

private:
    int m_socket = -1;
    int m_port = 0;
};

/// A loopback port with nothing listening on it.
int closedPort();

/// mime_check.py's reading of a message file.
QJsonObject parseMessage(const QString& emlPath);
/// parseMessage of bytes.
QJsonObject parseMessage(const QByteArray& message);

/// Files and folders in a folder, hidden ones included.
QStringList entries(const QString& folder);

} // namespace reportrt::mail::test
