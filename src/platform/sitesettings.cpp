#include "platform/sitesettings.h"

#include "platform/platformglobal_p.h"

#include <QDir>
#include <QFileInfo>
#include <QSettings>
#include <QStandardPaths>
#include <array>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

using S = SiteSettings::Setting;

constexpr std::array<SiteSettings::Entry, 12> settingTable { {
    { S::ServerDriver, u"Database", u"ServerDriver", u"LUDMOX_SERVER_DRIVER" },
    { S::OdbcDriver, u"Database", u"OdbcDriver", u"LUDMOX_ODBC_DRIVER" },
    { S::PdfPrinterFolder, u"Printing", u"PdfFolder", u"LUDMOX_PDF_PRINTER_DIR" },
    { S::PdfPrinters, u"Printing", u"PdfPrinters", u"LUDMOX_PDF_PRINTERS" },
    { S::SmtpUrl, u"Mail", u"Url", u"LUDMOX_SMTP_URL" },
    { S::SmtpUser, u"Mail", u"User", u"LUDMOX_SMTP_USER" },
    { S::SmtpPassword, u"Mail", u"Password", u"LUDMOX_SMTP_PASSWORD" },
    { S::SmtpFrom, u"Mail", u"From", u"LUDMOX_SMTP_FROM" },
    { S::SmtpTimeout, u"Mail", u"Timeout", u"LUDMOX_SMTP_TIMEOUT" },
    { S::Outbox, u"Mail", u"Outbox", u"LUDMOX_OUTBOX" },
    { S::Trace, u"Trace", u"Enabled", u"LUDMOX_TRACE" },
    { S::TuneAllocator, u"Performance", u"TuneAllocator", u"LUDMOX_TUNE_ALLOCATOR" },
} };

const SiteSettings::Entry& entryOf(S setting)
{
    return settingTable[static_cast<size_t>(setting)];
}

} // namespace

SiteSettings::SiteSettings()
    : SiteSettings(QProcessEnvironment::systemEnvironment(), defaultFiles())
{ }

SiteSettings::SiteSettings(QProcessEnvironment environment, QStringList files)
    : m_environment(std::move(environment))
    , m_files(std::move(files))
{ }

QString SiteSettings::value(Setting setting) const
{
    const Entry& entry = entryOf(setting);
    const QString fromEnvironment
        = m_environment.value(QString::fromUtf16(entry.variable)).trimmed();
    if (!fromEnvironment.isEmpty())
        return fromEnvironment;
    const QString key = QString::fromUtf16(entry.section) + u'/' + QString::fromUtf16(entry.key);
    for (const QString& file : m_files) {
        if (!QFileInfo(file).isFile())
            continue;
        const QSettings settings(file, QSettings::IniFormat);
        const QString text = detail::iniText(settings.value(key));
        if (!text.trimmed().isEmpty())
            return text.trimmed();
    }
    return {};
}

bool SiteSettings::isOn(Setting setting) const
{
    const QString text = value(setting).toLower();
    return text == u"1" || text == u"true" || text == u"yes" || text == u"on";
}

std::span<const SiteSettings::Entry> SiteSettings::entries()
{
    return settingTable;
}

QStringList SiteSettings::defaultFiles()
{
    QStringList files;
    for (const QString& folder :
        QStandardPaths::standardLocations(QStandardPaths::GenericConfigLocation))
        files.append(QDir::cleanPath(folder + u"/ludmox/ludmox.conf"_s));
    return files;
}

} // namespace platform
