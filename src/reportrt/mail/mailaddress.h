#pragma once

#include <QList>
#include <QString>

namespace reportrt::mail {

/// One mailbox: an optional display name and the address itself.
class MailAddress {
public:
    MailAddress() = default;
    /// address must already be valid (see parse); an internationalised domain is kept in its
    /// ASCII form.
    MailAddress(QString displayName, QString address);

    /// One mailbox as a host writes it: "user@example.com", "<user@example.com>",
    /// "Jane Doe <user@example.com>" or "\"Doe, Jane\" <user@example.com>". Blanks around it
    /// are ignored; a domain in Unicode is turned into its ASCII form. Throws MailError
    /// (InvalidAddress) naming the text and listName when it is not a mail address.
    static MailAddress parse(const QString& text, const QString& listName = QString());

    /// A list of mailboxes separated by ";" or "," (outside quotes and angle brackets); empty
    /// entries, as from a trailing separator, are skipped. An empty or blank text is an empty
    /// list. Throws MailError (InvalidAddress) for the first entry that is not a mail address.
    static QList<MailAddress> parseList(const QString& text, const QString& listName = QString());

    QString displayName() const { return m_displayName; }
    /// The address, "local@domain", ASCII only.
    QString address() const { return m_address; }

    bool operator==(const MailAddress&) const = default;

private:
    QString m_displayName;
    QString m_address;
};

} // namespace reportrt::mail
