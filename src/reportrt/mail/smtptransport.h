#pragma once

#include "reportrt/mail/mailaddress.h"
#include "reportrt/mail/mailsettings.h"

#include <QByteArray>
#include <QList>
#include <QString>

namespace reportrt::mail {

/// Delivers a finished message to an SMTP server with libcurl.
///
/// "smtp://" URLs use STARTTLS when the server offers it and go on in clear text when it does
/// not, as most local relays expect; but a user name or password is never sent in clear text
/// to another machine: with credentials and a host that is not a loopback address, a server
/// without STARTTLS is an error. "smtps://" URLs speak TLS from the start. Certificates are
/// checked against the system's trusted authorities.
///
/// Every recipient is given to the server before the message; if the server refuses any of
/// them, the transaction is abandoned before the message is sent, so it reaches all or none.
/// The connection and the whole delivery are bounded by the settings' timeouts.
class SmtpTransport {
public:
    explicit SmtpTransport(MailSettings settings);

    /// Sends message (complete, with CRLF line ends) from sender to every recipient. Throws
    /// MailError whose description names the server (host and port) and the cause: bad
    /// settings, unknown or unreachable host, timeout, TLS failure, refused credentials,
    /// refused sender or recipient (named), refused message. The password never appears in
    /// it.
    void send(const MailAddress& sender, const QList<MailAddress>& recipients,
        const QByteArray& message) const;

    /// "host:port" of an SMTP URL, for messages; never the user information.
    static QString serverName(const QString& url);

private:
    MailSettings m_settings;
};

} // namespace reportrt::mail
