#pragma once

#include "reportrt/mail/mailaddress.h"

#include <QByteArray>
#include <QDateTime>
#include <QList>
#include <QString>

namespace reportrt::mail {

/// Builds an Internet message (RFC 5322 with MIME, RFC 2045 to 2049): a UTF-8 plain-text
/// body, quoted-printable, and optionally one attachment, base64, in a multipart/mixed
/// message. Header texts that are not plain ASCII become UTF-8 encoded-words (RFC 2047), an
/// attachment name that is not becomes an RFC 2231 parameter. Lines end in CRLF; encoded
/// lines are at most 76 characters, none longer than 998.
///
/// Bcc addresses are envelope recipients only and never appear in the header, except in a
/// draft (setDraft), which a mail program opens for sending later and which must keep them.
class MimeMessage {
public:
    MimeMessage();

    void setFrom(const MailAddress& from) { m_from = from; }
    void setTo(const QList<MailAddress>& to) { m_to = to; }
    void setCc(const QList<MailAddress>& cc) { m_cc = cc; }
    void setBcc(const QList<MailAddress>& bcc) { m_bcc = bcc; }
    /// Line breaks and other control characters become blanks: a subject is one line.
    void setSubject(const QString& subject) { m_subject = subject; }
    /// Any line-break convention; sent as CRLF.
    void setText(const QString& text) { m_text = text; }
    /// The attachment's bytes and the name a receiver sees; a path in fileName is cut to its
    /// last component. contentType empty: chosen from the name's extension (contentTypeFor).
    void setAttachment(
        const QByteArray& data, const QString& fileName, const QString& contentType = QString());
    /// Defaults to the time the object was made.
    void setDate(const QDateTime& date) { m_date = date; }
    /// The unique id without angle brackets; defaults to a random one in the sender's domain.
    void setMessageId(const QString& id) { m_messageId = id; }
    /// A draft keeps its Bcc header and carries "X-Unsent: 1", which tells mail programs to
    /// open it for sending.
    void setDraft(bool draft) { m_draft = draft; }

    QList<MailAddress> to() const { return m_to; }
    QList<MailAddress> cc() const { return m_cc; }
    QList<MailAddress> bcc() const { return m_bcc; }
    /// Every envelope recipient: To, Cc and Bcc, each address once.
    QList<MailAddress> recipients() const;

    /// The whole message.
    QByteArray toBytes() const;

    /// The MIME type for a file name's extension (case-insensitive);
    /// "application/octet-stream" for one not known.
    static QString contentTypeFor(const QString& fileName);

private:
    MailAddress m_from;
    QList<MailAddress> m_to;
    QList<MailAddress> m_cc;
    QList<MailAddress> m_bcc;
    QString m_subject;
    QString m_text;
    QByteArray m_attachment;
    QString m_attachmentName;
    QString m_attachmentType;
    bool m_hasAttachment = false;
    QDateTime m_date;
    QString m_messageId;
    bool m_draft = false;
};

} // namespace reportrt::mail
