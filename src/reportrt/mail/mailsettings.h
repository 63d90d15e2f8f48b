#pragma once

#include <QString>

namespace platform {
class SiteSettings;
}

namespace reportrt::mail {

/// Where and how mail is delivered: the site settings of section "Mail" (keys Url, User,
/// Password, From, Timeout; variables LUDMOX_SMTP_URL, LUDMOX_SMTP_USER,
/// LUDMOX_SMTP_PASSWORD, LUDMOX_SMTP_FROM, LUDMOX_SMTP_TIMEOUT). An empty URL means no
/// server: messages go to the outbox.
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

    /// The settings from site. A Timeout that is not a positive number of seconds keeps the
    /// default.
    static MailSettings load(const platform::SiteSettings& site);
    /// load() from the process's site settings.
    static MailSettings load();
};

} // namespace reportrt::mail
