#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QTemporaryDir>
#include <core/comerror.h>
#include <gtest/gtest.h>
#include <platform/settingsstore.h>
#include <platform/sitesettings.h>

using namespace Qt::StringLiterals;

namespace {

const QString app = u"Orvel LUD 6.0"_s;

class SettingsStoreTest : public ::testing::Test {
protected:
    QTemporaryDir base;
    platform::SettingsStore store { base.path() };
};

TEST_F(SettingsStoreTest, ValuesSurviveIntoAnotherStore)
{
    struct Row {
        const char* name;
        QString value;
    };
    // Texts that an INI file would otherwise read back changed: lists, variants, escapes.
    const Row rows[] = {
        { "plain", u"120"_s },
        { "empty", QString() },
        { "comma", u"a, b"_s },
        { "variant marker", u"@Variant(x)"_s },
        { "line break", u"line1\nline2"_s },
        { "quotes and separators", u"\"q\";k=v #c"_s },
        { "surrounding spaces", u"  spaced  "_s },
        { "letters", u"T\u00e4na \u0160odien \u0101"_s },
    };
    for (const Row& row : rows)
        store.saveSetting(app, u"Default"_s, QString::fromLatin1(row.name), row.value);

    const platform::SettingsStore other(base.path());
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(other.getSetting(app, u"Default"_s, QString::fromLatin1(row.name)), row.value);
    }
}

TEST_F(SettingsStoreTest, NamesAreKeptApart)
{
    // Slashes would make nested groups, "%" would clash with the escaping, "General" is
    // QSettings' name for keys outside any section.
    const QString names[] = { u"a/b"_s, u"a"_s, u"back\\slash"_s, u"100%"_s, u"100%25"_s,
        u"General"_s, u"with space"_s, u"[x]"_s, u"\u043a\u043b\u044e\u0447"_s };
    for (const QString& section : names) {
        for (const QString& key : names)
            store.saveSetting(app, section, key, section + u'|' + key);
    }
    store.saveSetting(app, u"a"_s, u"b"_s, u"nested?"_s);

    const platform::SettingsStore other(base.path());
    for (const QString& section : names) {
        for (const QString& key : names) {
            EXPECT_EQ(other.getSetting(app, section, key), section + u'|' + key)
                << section.toStdString() << " / " << key.toStdString();
        }
    }
    EXPECT_EQ(other.getSetting(app, u"a"_s, u"b"_s), u"nested?"_s);
}

TEST_F(SettingsStoreTest, SectionsAndKeysMatchWithoutRegardToCase)
{
    store.saveSetting(app, u"Default"_s, u"MELeft"_s, u"10"_s);
    EXPECT_EQ(store.getSetting(app, u"DEFAULT"_s, u"meleft"_s), u"10"_s);

    store.saveSetting(app, u"default"_s, u"MELEFT"_s, u"20"_s);
    EXPECT_EQ(store.getSetting(app, u"Default"_s, u"MELeft"_s), u"20"_s);

    // One value, not two spellings of it.
    EXPECT_TRUE(store.deleteSetting(app, u"Default"_s, u"meLeft"_s));
    EXPECT_EQ(store.getSetting(app, u"Default"_s, u"MELEFT"_s), std::nullopt);
}

TEST_F(SettingsStoreTest, MissingValuesGiveTheDefault)
{
    store.saveSetting(app, u"Default"_s, u"CalendarLeft"_s, u"5"_s);
    struct Row {
        const char* name;
        QString application;
        QString section;
        QString key;
    };
    const Row rows[] = {
        { "no such application", u"Other"_s, u"Default"_s, u"CalendarLeft"_s },
        { "no such section", app, u"Users"_s, u"CalendarLeft"_s },
        { "no such key", app, u"Default"_s, u"CalendarTop"_s },
        { "empty key", app, u"Default"_s, QString() },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(store.getSetting(row.application, row.section, row.key), std::nullopt);
        EXPECT_EQ(store.getSetting(row.application, row.section, row.key, u"dflt"_s), u"dflt"_s);
    }
}

TEST_F(SettingsStoreTest, DeleteRemovesOnlyWhatItNames)
{
    store.saveSetting(app, u"S1"_s, u"k1"_s, u"1"_s);
    store.saveSetting(app, u"S1"_s, u"k2"_s, u"2"_s);
    store.saveSetting(app, u"S2"_s, u"k1"_s, u"3"_s);

    EXPECT_TRUE(store.deleteSetting(app, u"S1"_s, u"k1"_s));
    EXPECT_FALSE(store.deleteSetting(app, u"S1"_s, u"k1"_s));
    EXPECT_EQ(store.getSetting(app, u"S1"_s, u"k1"_s), std::nullopt);
    EXPECT_EQ(store.getSetting(app, u"S1"_s, u"k2"_s), u"2"_s);

    EXPECT_TRUE(store.deleteSetting(app, u"s2"_s));
    EXPECT_FALSE(store.deleteSetting(app, u"S2"_s));
    EXPECT_EQ(store.getSetting(app, u"S2"_s, u"k1"_s), std::nullopt);
    EXPECT_EQ(store.getSetting(app, u"S1"_s, u"k2"_s), u"2"_s);

    EXPECT_FALSE(store.deleteSetting(u"Never saved"_s, u"S1"_s));
}

TEST_F(SettingsStoreTest, ApplicationsShareOneFileAndStayApart)
{
    const QString apps[] = { app, u"../../escape"_s, u"a/b"_s, u".hidden"_s, u"Mail"_s };
    for (const QString& application : apps)
        store.saveSetting(application, u"S"_s, u"k"_s, application);

    for (const QString& application : apps) {
        SCOPED_TRACE(application.toStdString());
        EXPECT_EQ(store.getSetting(application, u"S"_s, u"k"_s), application);
    }
    EXPECT_EQ(store.filePath(), QDir(base.path()).absoluteFilePath(u"ludmox/ludmox.conf"_s));
    EXPECT_EQ(
        QDir(base.path() + u"/ludmox"_s).entryList(QDir::Files), QStringList { u"ludmox.conf"_s });
    // An application named like a site section does not become the site's mail settings.
    const platform::SiteSettings site({}, { store.filePath() });
    EXPECT_EQ(site.value(platform::SiteSettings::Setting::SmtpUrl), QString());
}

TEST_F(SettingsStoreTest, EmptyNamesAreRefused)
{
    const QString e;
    for (const auto& [application, section, key] : { std::tuple { e, u"S"_s, u"k"_s },
             std::tuple { app, e, u"k"_s }, std::tuple { app, u"S"_s, e } }) {
        try {
            store.saveSetting(application, section, key, u"v"_s);
            ADD_FAILURE() << "no error raised";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), 5);
        }
    }
}

TEST_F(SettingsStoreTest, UnwritableFolderRaisesInsteadOfLosingTheValue)
{
    QFile blocker(base.path() + u"/file"_s);
    ASSERT_TRUE(blocker.open(QIODevice::WriteOnly));
    blocker.close();
    platform::SettingsStore broken(blocker.fileName());

    try {
        broken.saveSetting(app, u"Default"_s, u"MELeft"_s, u"10"_s);
        FAIL() << "no error raised";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 75);
    }
}

} // namespace
