#include "reportrt/mail/maildelivery.h"

#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/mailrequest.h"
#include "reportrt/mail/outbox.h"
#include "reportrt/mail/smtptransport.h"

#include <QFile>
#include <QFileInfo>
#include <QSysInfo>

namespace reportrt::mail {

MailDelivery::MailDelivery(MailSettings settings, QString outboxFolder)
    : m_settings(std::move(settings))
    , m_outboxFolder(std::move(outboxFolder))
{ }

MailDelivery::Result MailDelivery::send(const MailRequest& request)
{
    return MailDelivery(MailSettings::load()).deliver(request);
}

MailAddress MailDelivery::sender() const
{
    if (!m_settings.from.isEmpty())
        return MailAddress::parse(m_settings.from, QStringLiteral("From"));
    if (m_settings.user.contains(u'@')) {
        try {
            return MailAddress::parse(m_settings.user, QStringLiteral("From"));
        } catch (const MailError&) {
            // A user name that only looks like an address: fall back to the login name.
        }
    }
    QString login = qEnvironmentVariable("USER");
    if (login.isEmpty())
        login = QStringLiteral("ludmox");
    const QString host = QSysInfo::machineHostName();
    try {
        return MailAddress::parse(login + u'@' + host);
    } catch (const MailError&) {
        return MailAddress::parse(login + QStringLiteral("@localhost"));
    }
}

MimeMessage MailDelivery::message(const MailRequest& request, bool draft) const
{
    MimeMessage message;
    message.setFrom(sender());
    message.setTo(MailAddress::parseList(request.to, QStringLiteral("To")));
    message.setCc(MailAddress::parseList(request.cc, QStringLiteral("Cc")));
    message.setBcc(MailAddress::parseList(request.bcc, QStringLiteral("Bcc")));
    if (message.recipients().isEmpty())
        throw MailError(MailError::Kind::NoRecipient,
            QStringLiteral("The mail has no recipient: the To, Cc and Bcc lists are empty."));
    message.setSubject(request.subject);
    message.setText(request.message);
    message.setDraft(draft);
    if (!request.attachmentPath.isEmpty()) {
        QFile file(request.attachmentPath);
        if (!file.open(QIODevice::ReadOnly))
            throw MailError(MailError::Kind::Attachment,
                QStringLiteral("The attachment %1 cannot be read: %2.")
                    .arg(request.attachmentPath, file.errorString()));
        const QByteArray data = file.readAll();
        if (file.error() != QFileDevice::NoError)
            throw MailError(MailError::Kind::Attachment,
                QStringLiteral("The attachment %1 cannot be read: %2.")
                    .arg(request.attachmentPath, file.errorString()));
        message.setAttachment(data,
            request.attachmentName.isEmpty() ? QFileInfo(request.attachmentPath).fileName()
                                             : request.attachmentName);
    }
    return message;
}

MailDelivery::Result MailDelivery::deliver(const MailRequest& request) const
{
    const bool draft = !m_settings.hasServer();
    const MimeMessage built = message(request, draft);
    Result result;
    if (draft) {
        result.outboxPath = Outbox(m_outboxFolder).store(built.toBytes());
        return result;
    }
    SmtpTransport(m_settings).send(sender(), built.recipients(), built.toBytes());
    result.sent = true;
    result.server = SmtpTransport::serverName(m_settings.url);
    return result;
}

} // namespace reportrt::mail
