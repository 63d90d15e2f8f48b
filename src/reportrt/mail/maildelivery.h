#pragma once

#include "reportrt/mail/mailsettings.h"
#include "reportrt/mail/mimemessage.h"

#include <QString>

namespace reportrt::mail {

class MailRequest;

/// Sends a mail request through the configured SMTP server or, when none is configured,
/// keeps it in the outbox as a message ready to send.
class MailDelivery {
public:
    /// Where a message went.
    struct Result {
        /// True: accepted by the server; false: written into the outbox.
        bool sent = false;
        /// "host:port" of the server that accepted it.
        QString server;
        /// The ".eml" file written into the outbox.
        QString outboxPath;
    };

    /// outboxFolder empty: Outbox::defaultFolder().
    explicit MailDelivery(MailSettings settings, QString outboxFolder = QString());

    /// With the user's settings (MailSettings::load()) and the default outbox.
    static Result send(const MailRequest& request);

    /// Builds the message and delivers it. All addresses are checked first, and the
    /// attachment read, so a bad request sends nothing. Throws MailError: an invalid address
    /// (naming it and its list), no recipient at all, an unreadable attachment, a failed
    /// delivery (see SmtpTransport::send) or an outbox that cannot be written.
    Result deliver(const MailRequest& request) const;

    /// The message deliver() would send (draft: as kept in the outbox), without sending it.
    MimeMessage message(const MailRequest& request, bool draft) const;

    /// The sender: the From setting; else the user name when it is an address; else the
    /// login name at this host.
    MailAddress sender() const;

private:
    MailSettings m_settings;
    QString m_outboxFolder;
};

} // namespace reportrt::mail
