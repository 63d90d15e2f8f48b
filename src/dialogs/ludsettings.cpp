#include "dialogs/ludsettings.h"

namespace dialogs {

namespace {
const QString DefaultApplication = QStringLiteral("Orvel LUD 6.0");
const QString UsersSection = QStringLiteral("Users");
const QString DefaultSection = QStringLiteral("Default");
} // namespace

LUDSettings::LUDSettings()
    : LUDSettings(platform::SettingsStore())
{ }

LUDSettings::LUDSettings(platform::SettingsStore store)
    : m_store(std::move(store))
    , mApp(DefaultApplication)
{
    mUser = userSection(mApp);
}

QString LUDSettings::userSection(const QString& application) const
{
    // An empty name could not be written back; it counts as absent.
    const QString user = m_store.getSetting(application, UsersSection, DefaultSection, QString());
    return user.isEmpty() ? DefaultSection : user;
}

void LUDSettings::App(const QString& sApp)
{
    mApp = sApp;
    mUser = userSection(sApp);
}

core::Variant LUDSettings::Value(const QString& sKey, const core::Variant& vDefault) const
{
    if (const auto stored = m_store.getSetting(mApp, mUser, sKey))
        return core::Variant(*stored);
    return vDefault;
}

void LUDSettings::Value(const QString& sKey, const core::Variant&, const core::Variant& vNewValue)
{
    m_store.saveSetting(mApp, mUser, sKey, vNewValue.toText());
}

} // namespace dialogs
