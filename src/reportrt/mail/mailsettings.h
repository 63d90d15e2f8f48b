#pragma once

#include <QProcessEnvironment>
#include <QString>

namespace platform {
class SettingsStore;
}

namespace reportrt::mail {

/// Where and how mail is delivered. Read from section "Mail" of the user's "Orvel LUD 6.0"
/// settings (keys Url, User, Password, From, Timeout) with the environment taking precedence:
/// LUDMOX_SMTP_URL, LUDMOX_SMTP_USER, LUDMOX_SMTP_PASSWORD, LUDMOX_SMTP_FROM,
/// LUDMOX_SMTP_TIMEOUT. An empty URL means no server: messages go to the outbox.
class MailSettings {
public:
    /// The server, "smtp://host[:port]" (STARTTLS when the server offers it) or
    /// "smtps://host[:port]" (TLS from the start).
    QString url;
    QString user;
    /// Never written to a log or an error text.
    QString password;
    /// The sender, in any form MailAddress::parse accepts.
    QString from;
    int connectTimeoutSeconds = 15;
    /// The whole delivery, connection included.
    int timeoutSeconds = 300;

    bool hasServer() const { return !url.trimmed().isEmpty(); }

    /// The settings from store, each overridden by its environment variable when that is set
    /// and not empty. A Timeout that is not a positive number of seconds keeps the default.
    static MailSettings load(const platform::SettingsStore& store,
        const QProcessEnvironment& environment = QProcessEnvironment::systemEnvironment());
    /// load() from the user's own settings store.
    static MailSettings load();
};

} // namespace reportrt::mail
