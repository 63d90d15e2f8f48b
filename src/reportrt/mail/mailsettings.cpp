#include "reportrt/mail/mailsettings.h"

#include "platform/settingsstore.h"

namespace reportrt::mail {

namespace {

const QString application = QStringLiteral("Orvel LUD 6.0");
const QString section = QStringLiteral("Mail");

QString value(const platform::SettingsStore& store, const QProcessEnvironment& environment,
    const QString& key, const QString& variable)
{
    const QString fromEnvironment = environment.value(variable);
    if (!fromEnvironment.isEmpty())
        return fromEnvironment;
    return store.getSetting(application, section, key, QString());
}

} // namespace

MailSettings MailSettings::load(
    const platform::SettingsStore& store, const QProcessEnvironment& environment)
{
    MailSettings settings;
    settings.url
        = value(store, environment, QStringLiteral("Url"), QStringLiteral("LUDMOX_SMTP_URL"))
              .trimmed();
    settings.user
        = value(store, environment, QStringLiteral("User"), QStringLiteral("LUDMOX_SMTP_USER"));
    settings.password = value(
        store, environment, QStringLiteral("Password"), QStringLiteral("LUDMOX_SMTP_PASSWORD"));
    settings.from
        = value(store, environment, QStringLiteral("From"), QStringLiteral("LUDMOX_SMTP_FROM"))
              .trimmed();
    bool ok = false;
    const int timeout = value(
        store, environment, QStringLiteral("Timeout"), QStringLiteral("LUDMOX_SMTP_TIMEOUT"))
                            .trimmed()
                            .toInt(&ok);
    if (ok && timeout > 0) {
        settings.timeoutSeconds = timeout;
        settings.connectTimeoutSeconds = std::min(settings.connectTimeoutSeconds, timeout);
    }
    return settings;
}

MailSettings MailSettings::load()
{
    return load(platform::SettingsStore());
}

} // namespace reportrt::mail
