#pragma once

#include "core/ludmoxexport.h"

#include <QString>
#include <QStringList>
#include <optional>

namespace platform {

/// Per-user application settings, three levels deep (application, section, key), every value
/// a string. They share the site settings' INI file (platform::SiteSettings), under a group
/// per application: "$XDG_CONFIG_HOME/ludmox/ludmox.conf", with the system's files of the
/// same name read under it; a store given a base folder uses "<base>/ludmox/ludmox.conf"
/// alone. Changes go to the user's file.
///
/// Section and key names are matched without regard to case, as the settings stores hosts
/// know from other systems do; a value saved under "top" replaces one stored as "Top".
/// Every change is written at once and atomically (a new file replaces the old one), so a
/// crash never leaves a half-written file behind.
class LUDMOX_EXPORT SettingsStore {
public:
    /// The store in the user's configuration folder, over the system's.
    SettingsStore();
    /// A store whose only file lives under baseFolder instead.
    explicit SettingsStore(const QString& baseFolder);

    /// The stored value; defaultValue when the application, section or key is not there.
    QString getSetting(const QString& application, const QString& section, const QString& key,
        const QString& defaultValue) const;
    /// The stored value, or nothing when it is not there.
    std::optional<QString> getSetting(
        const QString& application, const QString& section, const QString& key) const;

    /// Stores value. Raises ComError 5 when a name is empty and 75 when the file cannot be
    /// written (the previous contents are then kept).
    void saveSetting(const QString& application, const QString& section, const QString& key,
        const QString& value);

    /// Removes a whole section; returns whether there was one. Raises ComError 75 when the file
    /// cannot be written.
    bool deleteSetting(const QString& application, const QString& section);
    /// Removes one key; returns whether there was one.
    bool deleteSetting(const QString& application, const QString& section, const QString& key);

    /// The file changes are written to.
    QString filePath() const;

private:
    QStringList m_files;
};

} // namespace platform
