#pragma once

#include <QString>
#include <exception>
#include <string>

namespace reportrt::mail {

/// A mail that could not be built, delivered or kept. The description names the server (host
/// and port, never a user name or password) and the cause; it is meant for the user as it
/// stands. The runtime turns it into its own error when it mails a report.
class MailError : public std::exception {
public:
    enum class Kind {
        InvalidAddress, ///< an address list holds something that is not a mail address
        NoRecipient, ///< no To, Cc or Bcc address at all
        InvalidSettings, ///< the server URL or the sender is unusable
        Attachment, ///< the attachment file cannot be read
        Unreachable, ///< no connection: unknown host, refused or unreachable port
        Authentication, ///< the server refused the user name or password
        RecipientRefused, ///< the server refused a recipient; nothing was sent
        SenderRefused, ///< the server refused the sender address; nothing was sent
        Timeout, ///< the server did not answer in time
        Security, ///< TLS could not be set up or the server's certificate is not trusted
        Delivery, ///< any other failure of the mail transaction
        Outbox, ///< the message could not be written into the outbox
    };

    MailError(Kind kind, QString description);

    Kind kind() const noexcept { return m_kind; }
    QString description() const { return m_description; }
    const char* what() const noexcept override { return m_what.c_str(); }

private:
    Kind m_kind;
    QString m_description;
    std::string m_what;
};

} // namespace reportrt::mail
