#pragma once

#include "core/variant.h"
#include "platform/settingsstore.h"

#include <QString>

namespace dialogs {

/// The dialogs' per-user settings (window positions, the calendar's month count): string
/// values under application, section and key. The section is the user's: the value
/// "Default" of the section "Users" of the application names it, and it is "Default" when
/// that value is absent.
class LUDSettings {
public:
    /// Settings of "Orvel LUD 6.0" in the user's settings store.
    LUDSettings();
    /// Settings of "Orvel LUD 6.0" in the given store.
    explicit LUDSettings(platform::SettingsStore store);

    QString App() const { return mApp; }
    /// Switches to another application and to the user section that application names.
    void App(const QString& sApp);
    QString User() const { return mUser; }
    void User(const QString& sUser) { mUser = sUser; }

    /// The stored text under sKey, or vDefault (Empty when not given) when there is none.
    core::Variant Value(const QString& sKey, const core::Variant& vDefault = {}) const;
    /// Stores vNewValue as text under sKey; vDefault is not used. Raises ComError 5 for an
    /// empty key and 75 when the settings cannot be written.
    void Value(const QString& sKey, const core::Variant& vDefault, const core::Variant& vNewValue);

private:
    QString userSection(const QString& application) const;

    platform::SettingsStore m_store;
    QString mUser;
    QString mApp;
};

} // namespace dialogs
