#include "dialogs/fieldkind.h"
#include "dialogs/inputboxparams.h"
#include "dialogs/ludsettings.h"
#include "dialogs/uistrings.h"
#include "dialogsfixture.h"
#include "engine/moxglobals.h"
#include "platform/settingsstore.h"

#include <QTemporaryDir>
#include <functional>
#include <gtest/gtest.h>

using namespace dialogs;
using namespace Qt::StringLiterals;
using core::Variant;
using core::VariantArray;

namespace {

class LanguageGuard {
public:
    explicit LanguageGuard(int16_t language)
        : m_saved(engine::gLanguage)
    {
        engine::gLanguage = language;
    }
    ~LanguageGuard() { engine::gLanguage = m_saved; }

private:
    int16_t m_saved;
};

Variant choices(std::initializer_list<const char16_t*> texts)
{
    std::vector<Variant> values;
    for (const char16_t* text : texts)
        values.emplace_back(QString::fromUtf16(text));
    return Variant(VariantArray::fromList(values));
}

} // namespace

TEST(InputBoxParams, ItemCreatesOnMissAndFindsWithoutRegardToCase)
{
    InputBoxParams params;
    const auto created = params.Item(u"StartDate"_s);
    ASSERT_TRUE(created);
    EXPECT_EQ(created->Name, u"StartDate"_s);
    EXPECT_EQ(params.Count(), 1);
    EXPECT_EQ(params.Item(u"STARTDATE"_s), created);
    EXPECT_EQ(params.Count(), 1);
}

TEST(InputBoxParams, ExistsAndRemoveNeverCreateOrFail)
{
    InputBoxParams params;
    EXPECT_FALSE(params.Exists(u"MDIHandle"_s));
    EXPECT_EQ(params.Count(), 0);
    params.Remove(u"MDIHandle"_s);
    EXPECT_EQ(params.Count(), 0);

    params.Item(u"MDIHandle"_s)->Value = Variant(int32_t(4711));
    EXPECT_TRUE(params.Exists(u"mdihandle"_s));
    params.Remove(u"MDIHANDLE"_s);
    EXPECT_FALSE(params.Exists(u"MDIHandle"_s));
}

TEST(InputBoxParams, EnumeratesInInsertionOrderAfterRemovals)
{
    InputBoxParams params;
    for (const char16_t* name : { u"b", u"a", u"c", u"d" })
        params.Item(QString::fromUtf16(name));
    params.Remove(u"c"_s);
    QStringList names;
    for (const auto& item : params.NewEnum())
        names << item->Name;
    EXPECT_EQ(names, QStringList({ u"b"_s, u"a"_s, u"d"_s }));
}

TEST(InputBoxParams, KeyStaysWhenAHostRenamesTheItem)
{
    InputBoxParams params;
    params.Item(u"Region"_s)->Name = u"Area"_s;
    EXPECT_TRUE(params.Exists(u"Region"_s));
    EXPECT_FALSE(params.Exists(u"Area"_s));
    EXPECT_EQ(params.Item(u"Region"_s)->Name, u"Area"_s);
}

struct KindCase {
    const char* name;
    std::function<void(InputBoxParamsItem&)> setUp;
    FieldKind kind;
    QString tag;
};

class FieldKindTest : public ::testing::TestWithParam<KindCase> { };

TEST_P(FieldKindTest, FirstRuleThatHoldsWins)
{
    InputBoxParamsItem item;
    GetParam().setUp(item);
    EXPECT_EQ(fieldKind(item), GetParam().kind);
    EXPECT_EQ(fieldTag(item), GetParam().tag);
}

INSTANTIATE_TEST_SUITE_P(Precedence, FieldKindTest,
    ::testing::Values(KindCase { "PlainText", [](auto&) {}, FieldKind::Text, {} },
        KindCase { "ArrayIsAnEditableCombo", [](auto& i) { i.Value = choices({ u"a" }); },
            FieldKind::EditableCombo, {} },
        KindCase { "ArrayWithSelectOnlyIsADropDownList",
            [](auto& i) {
                i.Value = choices({ u"a" });
                i.SelectOnly = true;
            },
            FieldKind::DropDownList, {} },
        KindCase { "MultiSelectBeatsSelectOnly",
            [](auto& i) {
                i.Value = choices({ u"a" });
                i.SelectOnly = true;
                i.MultiSelect = true;
            },
            FieldKind::MultiSelectList, {} },
        KindCase { "ArrayBeatsCheckBox",
            [](auto& i) {
                i.Value = choices({ u"a" });
                i.IsCheck = true;
            },
            FieldKind::EditableCombo, {} },
        KindCase { "MultiSelectWithoutArrayIsText", [](auto& i) { i.MultiSelect = true; },
            FieldKind::Text, {} },
        KindCase { "ColorBeatsFileDialog",
            [](auto& i) {
                i.IsColor = true;
                i.IsFileDialog = true;
            },
            FieldKind::Color, u"Color"_s },
        KindCase { "ColorBeatsCheck",
            [](auto& i) {
                i.IsColor = true;
                i.IsCheck = true;
            },
            FieldKind::Color, u"Color"_s },
        KindCase { "CheckBeatsMemo",
            [](auto& i) {
                i.IsCheck = true;
                i.IsMemo = true;
            },
            FieldKind::CheckBox, {} },
        KindCase { "MemoBeatsFileDialog",
            [](auto& i) {
                i.IsMemo = true;
                i.IsFileDialog = true;
            },
            FieldKind::Memo, {} },
        KindCase { "DateMemoOpensTheCalendar",
            [](auto& i) {
                i.IsMemo = true;
                i.DateFormat = true;
            },
            FieldKind::Memo, u"Date"_s },
        KindCase { "FileDialog", [](auto& i) { i.IsFileDialog = true; }, FieldKind::FilePath,
            u"FileDialog"_s },
        KindCase { "FolderDialog",
            [](auto& i) {
                i.IsFileDialog = true;
                i.AskFolder = true;
            },
            FieldKind::FolderPath, u"FolderDialog"_s },
        KindCase {
            "AskFolderAloneIsText", [](auto& i) { i.AskFolder = true; }, FieldKind::Text, {} },
        KindCase {
            "NumericText", [](auto& i) { i.NumericFormat = true; }, FieldKind::Text, u"Numeric"_s },
        KindCase { "DateWinsOverNumeric",
            [](auto& i) {
                i.NumericFormat = true;
                i.DateFormat = true;
            },
            FieldKind::Text, u"Date"_s },
        KindCase { "PasswordIsText", [](auto& i) { i.Password = true; }, FieldKind::Text, {} }),
    [](const auto& row) { return std::string(row.param.name); });

struct StringCase {
    const char* name;
    int16_t id;
    int16_t language;
    QString expected;
};

class UIStringTest : public ::testing::TestWithParam<StringCase> { };

TEST_P(UIStringTest, TextForLanguage)
{
    LanguageGuard guard(GetParam().language);
    EXPECT_EQ(GetUIString(GetParam().id), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Table, UIStringTest,
    ::testing::Values(StringCase { "OkEnglish", 1, 3, u"&OK"_s },
        StringCase { "OkEstonian", 1, 4, u"&OK"_s }, StringCase { "OkLatvian", 1, 5, u"&OK"_s },
        StringCase { "CancelEnglish", 2, 3, u"&Cancel"_s },
        StringCase { "CancelEstonian", 2, 4, u"Ka&tkesta"_s },
        StringCase { "CancelLatvianHasNoAccessKey", 2, 5, u"Atcelt"_s },
        StringCase { "TodayEnglish", 3, 3, u"Today: "_s },
        StringCase { "TodayEstonian", 3, 4, QString::fromUtf16(u"T\u00e4na: ") },
        StringCase { "TodayLatvian", 3, 5, QString::fromUtf16(u"\u0160odien: ") },
        StringCase { "CalendarEnglish", 4, 3, u"Calendar"_s },
        StringCase { "CalendarEstonian", 4, 4, u"Kalender"_s },
        StringCase { "CalendarLatvian", 4, 5, QString::fromUtf16(u"Kalend\u0101rs") },
        StringCase { "TitleEnglish", 5, 3, u"Enter parameter values"_s },
        StringCase { "TitleEstonian", 5, 4,
            QString::fromUtf16(u"Sisesta parameetrite v\u00e4\u00e4rtused") },
        StringCase { "TitleLatvianFallsBackToEnglish", 5, 5, u"Enter parameter values"_s },
        StringCase { "LanguageZeroIsEnglish", 2, 0, u"&Cancel"_s },
        StringCase { "LanguageSevenIsEnglish", 2, 7, u"&Cancel"_s },
        StringCase { "IdZeroIsEmpty", 0, 3, QString() },
        StringCase { "IdSixIsEmpty", 6, 4, QString() },
        StringCase { "NegativeIdIsEmpty", -1, 3, QString() }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(UIStrings, PlaceholdersFillInOrder)
{
    const Variant a(u"A"_s);
    const Variant b(u"B"_s);
    const Variant c(u"C"_s);
    // Parts and arguments alternate; a surplus argument is appended.
    EXPECT_EQ(FillUIString(u"x%sy%Sz"_s, { a, b, c }), u"xAyBzC"_s);
    // A placeholder without an argument disappears.
    EXPECT_EQ(FillUIString(u"x%sy%sz"_s, { a }), u"xAyz"_s);
    EXPECT_EQ(FillUIString(u"%s"_s, { Variant(int32_t(42)) }), u"42"_s);
    EXPECT_EQ(FillUIString(u"no placeholder"_s, {}), u"no placeholder"_s);
    // Null joins as nothing instead of failing the caption.
    EXPECT_EQ(FillUIString(u"[%s]"_s, { Variant::null() }), u"[]"_s);
}

TEST(UIStrings, ArgumentsAreAppendedToTextsWithoutPlaceholders)
{
    LanguageGuard guard(4);
    EXPECT_EQ(
        GetUIString(3, { Variant(u"01.02.2020"_s) }), QString::fromUtf16(u"T\u00e4na: 01.02.2020"));
}

class LUDSettingsTest : public ::testing::Test {
protected:
    QTemporaryDir dir;
    platform::SettingsStore store { dir.path() };
    const QString app = u"Orvel LUD 6.0"_s;
};

TEST_F(LUDSettingsTest, WithoutUsersDefaultTheSectionIsDefault)
{
    LUDSettings settings(store);
    EXPECT_EQ(settings.App(), app);
    EXPECT_EQ(settings.User(), u"Default"_s);
    EXPECT_TRUE(settings.Value(u"MELeft"_s).isEmpty());
    EXPECT_EQ(settings.Value(u"MELeft"_s, Variant(int32_t(7))), Variant(int32_t(7)));

    settings.Value(u"MELeft"_s, {}, Variant(int32_t(1200)));
    EXPECT_EQ(store.getSetting(app, u"Default"_s, u"MELeft"_s), std::optional(u"1200"_s));
    EXPECT_EQ(settings.Value(u"MELeft"_s), Variant(u"1200"_s));
}

TEST_F(LUDSettingsTest, UsersDefaultNamesTheSection)
{
    store.saveSetting(app, u"Users"_s, u"Default"_s, u"mari"_s);
    LUDSettings settings(store);
    EXPECT_EQ(settings.User(), u"mari"_s);
    settings.Value(u"CalendarTop"_s, {}, Variant(u"300"_s));
    EXPECT_EQ(store.getSetting(app, u"mari"_s, u"CalendarTop"_s), std::optional(u"300"_s));
    EXPECT_FALSE(store.getSetting(app, u"Default"_s, u"CalendarTop"_s));
}

TEST_F(LUDSettingsTest, ChangingTheApplicationRereadsItsUser)
{
    store.saveSetting(u"Other"_s, u"Users"_s, u"Default"_s, u"jaan"_s);
    LUDSettings settings(store);
    settings.User(u"someone"_s);
    settings.App(u"Other"_s);
    EXPECT_EQ(settings.User(), u"jaan"_s);
    settings.App(u"Third"_s);
    EXPECT_EQ(settings.User(), u"Default"_s);
}

TEST_F(LUDSettingsTest, AnEmptyUserNameCountsAsAbsent)
{
    store.saveSetting(app, u"Users"_s, u"Default"_s, QString());
    EXPECT_EQ(LUDSettings(store).User(), u"Default"_s);
}
