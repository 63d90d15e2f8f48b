#include "reportrt/mail/mailsettings.h"

#include "platform/sitesettings.h"

namespace reportrt::mail {

MailSettings MailSettings::load(const platform::SiteSettings& site)
{
    using Setting = platform::SiteSettings::Setting;
    MailSettings settings;
    settings.url = site.value(Setting::SmtpUrl);
    settings.user = site.value(Setting::SmtpUser);
    settings.password = site.value(Setting::SmtpPassword);
    settings.from = site.value(Setting::SmtpFrom);
    bool ok = false;
    const int timeout = site.value(Setting::SmtpTimeout).toInt(&ok);
    if (ok && timeout > 0) {
        settings.timeoutSeconds = timeout;
        settings.connectTimeoutSeconds = std::min(settings.connectTimeoutSeconds, timeout);
    }
    return settings;
}

MailSettings MailSettings::load()
{
    return load(platform::SiteSettings());
}

} // namespace reportrt::mail
