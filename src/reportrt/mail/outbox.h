#pragma once

#include <QByteArray>
#include <QString>

namespace reportrt::mail {

/// A folder of messages that could not be sent because no server is configured, one ".eml"
/// file each, which a mail program opens as a message ready to send.
class Outbox {
public:
    /// folder empty: defaultFolder(), which may throw.
    explicit Outbox(const QString& folder = QString());

    /// The site's Outbox setting (LUDMOX_OUTBOX) when set, else "ludmox/outbox" in the user's
    /// generic data folder (QStandardPaths::GenericDataLocation, usually ~/.local/share).
    /// Throws MailError (Outbox) when there is no such folder.
    static QString defaultFolder();

    QString folder() const { return m_folder; }

    /// Writes message as a new file and returns its absolute path. The file appears complete
    /// or not at all: it is written under a temporary name, flushed to disk and renamed. The
    /// folder is created, readable by the user only, when it is missing. Throws MailError
    /// (Outbox) naming the folder when it cannot be written.
    QString store(const QByteArray& message) const;

private:
    QString m_folder;
};

} // namespace reportrt::mail
