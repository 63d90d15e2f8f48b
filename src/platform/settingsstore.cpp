#include "platform/settingsstore.h"

#include "platform/platformglobal_p.h"
#include "platform/sitesettings.h"

#include <QDir>
#include <QFileInfo>
#include <QSettings>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

// QSettings reads "/" and "\" in a name as group separators; names here are flat, so
// those characters (and "%", to keep the mapping reversible) are percent-encoded.
QString encodeName(const QString& name)
{
    QString encoded;
    encoded.reserve(name.size());
    for (const QChar ch : name) {
        if (ch == u'%')
            encoded += u"%25"_s;
        else if (ch == u'/')
            encoded += u"%2F"_s;
        else if (ch == u'\\')
            encoded += u"%5C"_s;
        else
            encoded += ch;
    }
    return encoded;
}

// The stored name that matches wanted without regard to case, preferring an exact match.
QString storedName(const QStringList& names, const QString& wanted)
{
    if (names.contains(wanted))
        return wanted;
    for (const QString& name : names) {
        if (name.compare(wanted, Qt::CaseInsensitive) == 0)
            return name;
    }
    return wanted;
}

void requireName(const QString& name, const QString& what)
{
    if (name.isEmpty()) {
        detail::raise(detail::PlatformError::InvalidProcedureCall,
            u"Invalid procedure call or argument: the %1 name is empty"_s.arg(what));
    }
}

void syncOrRaise(QSettings& settings)
{
    settings.sync();
    if (settings.status() != QSettings::NoError) {
        detail::raise(detail::PlatformError::PathFileAccess,
            u"Path/File access error: the settings file %1 cannot be written"_s.arg(
                settings.fileName()));
    }
}

// Enters the application's group, then the section's, matching stored names without
// regard to case.
void enterSection(QSettings& settings, const QString& application, const QString& section)
{
    settings.beginGroup(storedName(settings.childGroups(), encodeName(application)));
    settings.beginGroup(storedName(settings.childGroups(), encodeName(section)));
}

} // namespace

SettingsStore::SettingsStore()
    : m_files(SiteSettings::defaultFiles())
{ }

SettingsStore::SettingsStore(const QString& baseFolder)
    : m_files { QDir::cleanPath(baseFolder) + u"/ludmox/ludmox.conf"_s }
{ }

QString SettingsStore::filePath() const
{
    return m_files.value(0);
}

std::optional<QString> SettingsStore::getSetting(
    const QString& application, const QString& section, const QString& key) const
{
    if (application.isEmpty() || section.isEmpty() || key.isEmpty())
        return std::nullopt;
    // The user's file first, then the system's under it.
    for (const QString& path : m_files) {
        if (!QFileInfo(path).isFile())
            continue;
        QSettings settings(path, QSettings::IniFormat);
        enterSection(settings, application, section);
        const QString storedKey = storedName(settings.childKeys(), encodeName(key));
        if (settings.contains(storedKey))
            return detail::iniText(settings.value(storedKey));
    }
    return std::nullopt;
}

QString SettingsStore::getSetting(const QString& application, const QString& section,
    const QString& key, const QString& defaultValue) const
{
    return getSetting(application, section, key).value_or(defaultValue);
}

void SettingsStore::saveSetting(
    const QString& application, const QString& section, const QString& key, const QString& value)
{
    requireName(application, u"application"_s);
    requireName(section, u"section"_s);
    requireName(key, u"key"_s);
    const QString folder = QFileInfo(filePath()).absolutePath();
    if (!QDir().mkpath(folder)) {
        detail::raise(detail::PlatformError::PathFileAccess,
            u"Path/File access error: the settings folder %1 cannot be created"_s.arg(folder));
    }

    QSettings settings(filePath(), QSettings::IniFormat);
    enterSection(settings, application, section);
    settings.setValue(storedName(settings.childKeys(), encodeName(key)), value);
    settings.endGroup();
    settings.endGroup();
    syncOrRaise(settings);
}

bool SettingsStore::deleteSetting(const QString& application, const QString& section)
{
    const QString path = filePath();
    if (application.isEmpty() || section.isEmpty() || !QFileInfo::exists(path))
        return false;

    QSettings settings(path, QSettings::IniFormat);
    settings.beginGroup(storedName(settings.childGroups(), encodeName(application)));
    const QStringList sections = settings.childGroups();
    const QString stored = storedName(sections, encodeName(section));
    if (!sections.contains(stored))
        return false;
    settings.remove(stored);
    settings.endGroup();
    syncOrRaise(settings);
    return true;
}

bool SettingsStore::deleteSetting(
    const QString& application, const QString& section, const QString& key)
{
    const QString path = filePath();
    if (application.isEmpty() || section.isEmpty() || key.isEmpty() || !QFileInfo::exists(path))
        return false;

    QSettings settings(path, QSettings::IniFormat);
    enterSection(settings, application, section);
    const QStringList keys = settings.childKeys();
    const QString stored = storedName(keys, encodeName(key));
    if (!keys.contains(stored))
        return false;
    settings.remove(stored);
    settings.endGroup();
    settings.endGroup();
    syncOrRaise(settings);
    return true;
}

} // namespace platform
