#include "reportrt/mail/outbox.h"

#include "platform/sitesettings.h"
#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/maillogging_p.h"

#include <QDateTime>
#include <QDir>
#include <QFileInfo>
#include <QRandomGenerator>
#include <QSaveFile>
#include <QStandardPaths>
#include <fcntl.h>
#include <unistd.h>

namespace reportrt::mail {

namespace {

[[noreturn]] void raiseOutbox(const QString& folder, const QString& why)
{
    throw MailError(MailError::Kind::Outbox,
        QStringLiteral("The message could not be written into the outbox %1: %2.")
            .arg(folder, why));
}

// The rename is only durable once the folder itself is on disk.
void syncFolder(const QString& folder)
{
    const int fd = ::open(QFile::encodeName(folder).constData(), O_RDONLY | O_DIRECTORY);
    if (fd < 0)
        return;
    ::fsync(fd);
    ::close(fd);
}

} // namespace

Outbox::Outbox(const QString& folder)
    : m_folder(
        QDir::cleanPath(QFileInfo(folder.isEmpty() ? defaultFolder() : folder).absoluteFilePath()))
{ }

QString Outbox::defaultFolder()
{
    const QString overridden
        = platform::SiteSettings().value(platform::SiteSettings::Setting::Outbox);
    if (!overridden.isEmpty())
        return overridden;
    const QString data = QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation);
    // Without a home the path would start at the root of the file system.
    if (data.isEmpty())
        throw MailError(MailError::Kind::Outbox,
            QStringLiteral("No mail server is configured and there is no user data folder for "
                           "the outbox; set the outbox folder (LUDMOX_OUTBOX) or the mail "
                           "server."));
    return data + QStringLiteral("/ludmox/outbox");
}

QString Outbox::store(const QByteArray& message) const
{
    if (!QFileInfo(m_folder).isDir()) {
        if (!QDir().mkpath(m_folder))
            raiseOutbox(m_folder, QStringLiteral("the folder cannot be created"));
        // Messages carry report data: the folder is the user's alone.
        QFile::setPermissions(m_folder, QFile::ReadOwner | QFile::WriteOwner | QFile::ExeOwner);
    }
    const QString stamp
        = QDateTime::currentDateTime().toString(QStringLiteral("yyyyMMdd-HHmmss-zzz"));
    QString path;
    do {
        path = m_folder + u'/' + stamp + u'-'
            + QStringLiteral("%1").arg(
                QRandomGenerator::system()->generate(), 8, 16, QLatin1Char('0'))
            + QStringLiteral(".eml");
    } while (QFileInfo::exists(path));

    QSaveFile file(path);
    if (!file.open(QIODevice::WriteOnly))
        raiseOutbox(m_folder, file.errorString());
    if (file.write(message) != message.size()) {
        const QString why = file.errorString();
        file.cancelWriting();
        raiseOutbox(m_folder, why);
    }
    // On disk before the rename, so a crash leaves the whole message or none.
    if (!file.flush() || ::fsync(file.handle()) != 0) {
        const QString why = file.errorString();
        file.cancelWriting();
        raiseOutbox(m_folder, why);
    }
    if (!file.commit())
        raiseOutbox(m_folder, file.errorString());
    syncFolder(m_folder);
    qCInfo(lcMail) << "No mail server configured; message kept in" << path;
    return path;
}

} // namespace reportrt::mail
