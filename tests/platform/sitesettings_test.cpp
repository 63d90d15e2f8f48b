#include <QFile>
#include <QTemporaryDir>
#include <gtest/gtest.h>
#include <platform/sitesettings.h>

using namespace Qt::StringLiterals;
using platform::SiteSettings;
using Setting = platform::SiteSettings::Setting;

namespace {

class SiteSettingsTest : public ::testing::Test {
protected:
    QString write(const QString& name, const QByteArray& text)
    {
        const QString path = dir.filePath(name);
        QFile file(path);
        EXPECT_TRUE(file.open(QIODevice::WriteOnly));
        file.write(text);
        return path;
    }

    QTemporaryDir dir;
};

TEST_F(SiteSettingsTest, EnvironmentThenUserThenSystem)
{
    const QString user
        = write(u"user.conf"_s, "[Mail]\nUrl=smtp://user\n[Database]\nOdbcDriver=\n");
    const QString system = write(u"system.conf"_s,
        "[Mail]\nUrl=smtp://system\nFrom=site@example.com\n[Database]\nOdbcDriver=FreeTDS\n");
    QProcessEnvironment environment;
    environment.insert(u"LUDMOX_SMTP_FROM"_s, u"  env@example.com "_s);
    environment.insert(u"LUDMOX_SMTP_URL"_s, u""_s);
    const SiteSettings settings(environment, { user, dir.filePath(u"missing.conf"_s), system });

    EXPECT_EQ(settings.value(Setting::SmtpFrom), u"env@example.com"_s);
    // Empty values, in the environment or in a file, hide nothing below them.
    EXPECT_EQ(settings.value(Setting::SmtpUrl), u"smtp://user"_s);
    EXPECT_EQ(settings.value(Setting::OdbcDriver), u"FreeTDS"_s);
    EXPECT_EQ(settings.value(Setting::SmtpUser), QString());
}

// In an INI file ";" starts a comment: a value holding one is written in double quotes.
TEST_F(SiteSettingsTest, ValuesReadAsWritten)
{
    const QString file = write(u"ludmox.conf"_s,
        "[Printing]\nPdfPrinters=\"Archive=/srv/a;Inbox=/srv/b, c\"\n[Trace]\nEnabled=Yes\n"
        "[Performance]\nTuneAllocator=0\n");
    const SiteSettings settings({}, { file });
    EXPECT_EQ(settings.value(Setting::PdfPrinters), u"Archive=/srv/a;Inbox=/srv/b, c"_s);
    EXPECT_TRUE(settings.isOn(Setting::Trace));
    EXPECT_FALSE(settings.isOn(Setting::TuneAllocator));
    EXPECT_FALSE(settings.isOn(Setting::SmtpUrl));
}

TEST(SiteSettingsTable, EverySettingHasOneEntryInOrder)
{
    const auto entries = SiteSettings::entries();
    QStringList variables;
    for (size_t i = 0; i < entries.size(); ++i) {
        EXPECT_EQ(static_cast<size_t>(entries[i].setting), i);
        variables.append(QString::fromUtf16(entries[i].variable));
    }
    EXPECT_EQ(variables.removeDuplicates(), 0);
    EXPECT_TRUE(SiteSettings::defaultFiles().value(0).endsWith(u"/ludmox/ludmox.conf"_s));
}

} // namespace
