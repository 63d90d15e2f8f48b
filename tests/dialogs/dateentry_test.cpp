#include "dialogs/dateentry.h"
#include "dialogsfixture.h"

#include <QLocale>
#include <gtest/gtest.h>

using namespace dialogs;
using namespace Qt::StringLiterals;

namespace {

// A fixed "today" keeps every expected text stable.
const QDate Today(2024, 7, 15);

class LocaleGuard {
public:
    explicit LocaleGuard(const QLocale& locale) { QLocale::setDefault(locale); }
    ~LocaleGuard() { QLocale::setDefault(m_saved); }

private:
    QLocale m_saved;
};

DateEntrySettings dotted()
{
    return DateEntrySettings::fromShortDate(u"31.12.1899"_s, u"."_s);
}
DateEntrySettings american()
{
    return DateEntrySettings::fromShortDate(u"12/31/1899"_s, u"/"_s);
}

/// Types `keys` (characters; '\b' Backspace, '\x04' Ctrl+D) one after the other.
TextEdit typeKeys(TextEdit edit, const QString& keys, const DateEntrySettings& settings)
{
    for (const QChar key : keys)
        edit = pressDateKey(edit, key.unicode(), settings, Today).edit;
    return edit;
}

TextEdit caretAtEnd(const QString& text)
{
    return { text, static_cast<int>(text.size()), 0 };
}
TextEdit allSelected(const QString& text)
{
    return { text, 0, static_cast<int>(text.size()) };
}

} // namespace

struct PatternCase {
    const char* name;
    QString shortDate;
    QString separator;
    QString pattern;
    int sep1;
    int sep2;
};

class DatePatternTest : public ::testing::TestWithParam<PatternCase> { };

TEST_P(DatePatternTest, FromTheShortDateOfTheLastDayOf1899)
{
    const auto& c = GetParam();
    const DateEntrySettings settings = DateEntrySettings::fromShortDate(c.shortDate, c.separator);
    EXPECT_EQ(settings.DatePattern, c.pattern);
    EXPECT_EQ(settings.DateSep1Pos, c.sep1);
    EXPECT_EQ(settings.DateSep2Pos, c.sep2);
    EXPECT_EQ(settings.FieldHighlightColor, 65535u);
}

INSTANTIATE_TEST_SUITE_P(ShortDates, DatePatternTest,
    ::testing::Values(
        PatternCase { "DayMonthYear", u"31.12.1899"_s, u"."_s, u"dd.mm.yyyy"_s, 2, 5 },
        PatternCase { "MonthDayYear", u"12/31/1899"_s, u"/"_s, u"mm/dd/yyyy"_s, 2, 5 },
        PatternCase { "YearFirst", u"1899-12-31"_s, u"-"_s, u"yyyy-mm-dd"_s, 4, 7 },
        PatternCase { "NoSeparator", u"31121899"_s, u"."_s, u"ddmmyyyy"_s, 2, 5 },
        PatternCase { "SeparatorNotInText", u"31 12 1899"_s, u"."_s, u"dd mm yyyy"_s, 2, 5 }),
    [](const auto& row) { return std::string(row.param.name); });

class DateTyping : public ::testing::Test {
protected:
    LocaleGuard locale { QLocale(QLocale::Estonian, QLocale::Estonia) };
};

TEST_F(DateTyping, DigitsGrowIntoTheMaskAndStopWhenItIsFull)
{
    const TextEdit typed = typeKeys({}, u"12032020"_s, dotted());
    EXPECT_EQ(typed, caretAtEnd(u"12.03.2020"_s));
    EXPECT_EQ(typeKeys(typed, u"1"_s, dotted()), typed);
}

TEST_F(DateTyping, AmericanMaskTakesTheSameDigits)
{
    LocaleGuard us(QLocale(QLocale::English, QLocale::UnitedStates));
    EXPECT_EQ(typeKeys({}, u"03122020"_s, american()), caretAtEnd(u"03/12/2020"_s));
}

TEST_F(DateTyping, ADigitReplacesAWhollySelectedDate)
{
    EXPECT_EQ(typeKeys(allSelected(u"31.12.2020"_s), u"1"_s, dotted()), caretAtEnd(u"1"_s));
}

TEST_F(DateTyping, LettersAreRefusedAndClipboardKeysPass)
{
    const TextEdit edit = caretAtEnd(u"12.0"_s);
    EXPECT_EQ(TypeDateKey(edit, 'a', dotted(), Today).key, 0);
    EXPECT_EQ(TypeDateKey(edit, ' ', dotted(), Today).key, 0);
    const KeyOutcome copy = pressDateKey(edit, KeyCode::CtrlC, dotted(), Today);
    EXPECT_EQ(copy.key, KeyCode::CtrlC);
    EXPECT_EQ(copy.edit, edit);
}

struct StepCase {
    const char* name;
    QString before;
    int key;
    QString after;
};

class DayStepTest : public DateTyping, public ::testing::WithParamInterface<StepCase> { };

TEST_P(DayStepTest, PlusAndMinusStepAWhollySelectedDate)
{
    const auto& c = GetParam();
    const KeyOutcome outcome = TypeDateKey(allSelected(c.before), c.key, dotted(), Today);
    EXPECT_EQ(outcome.key, 0);
    EXPECT_EQ(outcome.edit, allSelected(c.after));
}

INSTANTIATE_TEST_SUITE_P(Steps, DayStepTest,
    ::testing::Values(StepCase { "PlusOverTheYearEnd", u"31.12.2020"_s, '+', u"01.01.2021"_s },
        StepCase { "MinusIntoALeapDay", u"01.03.2020"_s, '-', u"29.02.2020"_s },
        StepCase { "ShortDateIsNormalised", u"1.2.2020"_s, '+', u"02.02.2020"_s },
        StepCase { "NotADateStaysAsItIs", u"31.02.2020"_s, '+', u"31.02.2020"_s }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(DateTyping, MinusWithoutWholeSelectionIsASeparatorKey)
{
    const KeyOutcome outcome = TypeDateKey(caretAtEnd(u"12"_s), '-', dotted(), Today);
    EXPECT_EQ(outcome.key, 0);
    EXPECT_EQ(outcome.edit.text, u"12.07.2024"_s);
}

TEST_F(DateTyping, SeparatorKeyOnAnEmptyFieldGivesTodayAndJumpsToTheMonth)
{
    const KeyOutcome outcome = TypeDateKey({}, '.', dotted(), Today);
    EXPECT_EQ(outcome.key, 0);
    EXPECT_EQ(outcome.edit, (TextEdit { u"15.07.2024"_s, 3, 2 }));
}

struct JumpCase {
    const char* name;
    TextEdit before;
    int key;
    TextEdit after;
};

class SeparatorJumpTest : public DateTyping, public ::testing::WithParamInterface<JumpCase> { };

TEST_P(SeparatorJumpTest, CompletesFromTodayAndSelectsTheNextPart)
{
    const auto& c = GetParam();
    const KeyOutcome outcome = TypeDateKey(c.before, c.key, dotted(), Today);
    EXPECT_EQ(outcome.key, 0);
    EXPECT_EQ(outcome.edit, c.after);
}

INSTANTIATE_TEST_SUITE_P(Jumps, SeparatorJumpTest,
    ::testing::Values(
        JumpCase { "OneDigitDayIsPadded", caretAtEnd(u"1"_s), '.', { u"01.07.2024"_s, 3, 2 } },
        JumpCase {
            "TwoDigitDayKeepsTodaysMonth", caretAtEnd(u"12."_s), '/', { u"12.07.2024"_s, 6, 4 } },
        JumpCase { "OneDigitMonthIsPadded", caretAtEnd(u"12.3"_s), ',', { u"12.03.2024"_s, 6, 4 } },
        JumpCase { "ShortYearTakesTodaysCentury", caretAtEnd(u"12.03.25"_s), '.',
            { u"12.03.2025"_s, 10, 0 } },
        JumpCase { "CompleteDateFromTheStart", allSelected(u"12.03.2020"_s), '.',
            { u"12.03.2020"_s, 3, 2 } },
        JumpCase { "CompleteDateFromTheMonth", { u"12.03.2020"_s, 3, 2 }, '.',
            { u"12.03.2020"_s, 6, 4 } }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(DateTyping, CtrlDGivesTodaySelected)
{
    const KeyOutcome outcome = TypeDateKey(caretAtEnd(u"1"_s), KeyCode::CtrlD, dotted(), Today);
    EXPECT_EQ(outcome.key, 0);
    EXPECT_EQ(outcome.edit, allSelected(u"15.07.2024"_s));
}

struct BackspaceCase {
    const char* name;
    TextEdit before;
    TextEdit after;
};

class BackspaceTest : public DateTyping, public ::testing::WithParamInterface<BackspaceCase> { };

TEST_P(BackspaceTest, RemovesFromBeforeTheCaretToTheEnd)
{
    EXPECT_EQ(pressDateKey(GetParam().before, KeyCode::Backspace, dotted(), Today).edit,
        GetParam().after);
}

INSTANTIATE_TEST_SUITE_P(Backspace, BackspaceTest,
    ::testing::Values(
        // One character would leave "12", where the separator would at once come back.
        BackspaceCase {
            "OverASeparatorTakesTheDigitToo", caretAtEnd(u"12."_s), caretAtEnd(u"1"_s) },
        BackspaceCase {
            "InsideTheTextCutsTheRest", { u"12.03.2020"_s, 4, 0 }, caretAtEnd(u"12."_s) },
        BackspaceCase {
            "AtTheEndOfACompleteDate", caretAtEnd(u"12.03.2020"_s), caretAtEnd(u"12.03.202"_s) },
        BackspaceCase { "CaretAtOneClearsTheField", { u"12.03.2020"_s, 1, 0 }, caretAtEnd({}) },
        BackspaceCase {
            "CaretAtZeroChangesNothing", { u"12.03.2020"_s, 0, 0 }, { u"12.03.2020"_s, 0, 0 } },
        BackspaceCase { "WholeSelectionIsDeleted", allSelected(u"12.03.2020"_s), caretAtEnd({}) },
        BackspaceCase { "InsideAnOffsetOneCharacter", caretAtEnd(u"10.03.2021+12"_s),
            caretAtEnd(u"10.03.2021+1"_s) }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(DateTyping, BehindACompleteDateOnlyADayOffsetCanFollow)
{
    const DateEntrySettings settings = dotted();
    EXPECT_EQ(
        typeKeys(caretAtEnd(u"10.03.2021"_s), u"x./5"_s, settings), caretAtEnd(u"10.03.2021"_s));
    const TextEdit offset = typeKeys(caretAtEnd(u"10.03.2021"_s), u"+12"_s, settings);
    EXPECT_EQ(offset, caretAtEnd(u"10.03.2021+12"_s));
    EXPECT_EQ(typeKeys(offset, u"+-."_s, settings), offset);
    EXPECT_EQ(
        typeKeys(caretAtEnd(u"10.03.2021"_s), u"-3"_s, settings), caretAtEnd(u"10.03.2021-3"_s));
}

TEST_F(DateTyping, SeparatorIsAppendedOnlyAtTheMaskPositions)
{
    const DateEntrySettings settings = dotted();
    EXPECT_EQ(InsertDateSeparator(caretAtEnd(u"12"_s), settings), caretAtEnd(u"12."_s));
    EXPECT_EQ(InsertDateSeparator(caretAtEnd(u"12.03"_s), settings), caretAtEnd(u"12.03."_s));
    EXPECT_EQ(InsertDateSeparator(caretAtEnd(u"1"_s), settings), caretAtEnd(u"1"_s));
    // Only with the caret at the end and nothing selected.
    EXPECT_EQ(InsertDateSeparator({ u"12"_s, 1, 0 }, settings), (TextEdit { u"12"_s, 1, 0 }));
    EXPECT_EQ(InsertDateSeparator({ u"12"_s, 0, 2 }, settings), (TextEdit { u"12"_s, 0, 2 }));
}

struct ShiftCase {
    const char* name;
    QString text;
    QString expected;
};

class ShiftDateTest : public DateTyping, public ::testing::WithParamInterface<ShiftCase> { };

TEST_P(ShiftDateTest, AppliesTheOffsetAndReformats)
{
    EXPECT_EQ(ShiftDate(GetParam().text, u"dd.mm.yyyy"_s, Today), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Shift, ShiftDateTest,
    ::testing::Values(ShiftCase { "PlusFive", u"10.03.2021+5"_s, u"15.03.2021"_s },
        ShiftCase { "MinusTwelveIntoFebruary", u"10.03.2021-12"_s, u"26.02.2021"_s },
        ShiftCase { "PlusIntoTheNextYear", u"31.12.2021+1"_s, u"01.01.2022"_s },
        ShiftCase { "ShortDateIsWrittenInFull", u"1.2.2020"_s, u"01.02.2020"_s },
        ShiftCase { "TwoDigitYear", u"01.02.99"_s, u"01.02.1999"_s },
        ShiftCase { "DayAndMonthTakeTodaysYear", u"3.4"_s, u"03.04.2024"_s },
        ShiftCase { "LoneSignIsNotAnOffset", u"10.03.2021+"_s, u"10.03.2021+"_s },
        ShiftCase { "LettersAreNotAnOffset", u"10.03.2021+x"_s, u"10.03.2021+x"_s },
        ShiftCase { "NotADate", u"abc"_s, u"abc"_s },
        ShiftCase { "InvalidDay", u"31.04.2021"_s, u"31.04.2021"_s },
        ShiftCase { "OffsetBeyondTheCalendar", u"10.03.2021+9999999"_s, u"10.03.2021+9999999"_s }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(DateTyping, ShiftDateFollowsTheAmericanMask)
{
    LocaleGuard us(QLocale(QLocale::English, QLocale::UnitedStates));
    EXPECT_EQ(ShiftDate(u"03/10/2021+5"_s, u"mm/dd/yyyy"_s, Today), u"03/15/2021"_s);
    EXPECT_EQ(ShiftDate(u"2/30/2021"_s, u"mm/dd/yyyy"_s, Today), u"2/30/2021"_s);
}

struct CheckCase {
    const char* name;
    DateFieldState before;
    DateFieldState after;
};

class CheckDateFieldTest : public DateTyping, public ::testing::WithParamInterface<CheckCase> { };

TEST_P(CheckDateFieldTest, NormalisesAndMarks)
{
    EXPECT_EQ(CheckDateField(GetParam().before, dotted(), Today), GetParam().after);
}

constexpr uint32_t Yellow = 65535;
constexpr uint32_t Window = WindowBackgroundColor;

INSTANTIATE_TEST_SUITE_P(Check, CheckDateFieldTest,
    ::testing::Values(
        CheckCase { "OffsetIsApplied", { u"10.03.2021+5"_s, Window }, { u"15.03.2021"_s, Window } },
        CheckCase {
            "InvalidTurnsYellow", { u"32.01.2021"_s, Window }, { u"32.01.2021"_s, Yellow } },
        CheckCase {
            "CorrectedTurnsBack", { u"31.01.2021"_s, Yellow }, { u"31.01.2021"_s, Window } },
        CheckCase { "EmptyIsValid", { QString(), Window }, { QString(), Window } },
        CheckCase { "EmptyClearsTheHighlight", { QString(), Yellow }, { QString(), Window } },
        CheckCase { "InvalidStaysYellow", { u"1.13.2021"_s, Yellow }, { u"1.13.2021"_s, Yellow } },
        // Only the window colour is replaced: a field given another colour keeps it.
        CheckCase { "OtherColourIsKept", { u"abc"_s, 0xFF }, { u"abc"_s, 0xFF } }),
    [](const auto& row) { return std::string(row.param.name); });

struct ParseCase {
    const char* name;
    QString text;
    QDate expected; // invalid: not a date
};

class ParseDateTest : public DateTyping, public ::testing::WithParamInterface<ParseCase> { };

TEST_P(ParseDateTest, ReadsAgainstTheMask)
{
    const auto date = parseDateText(GetParam().text, u"dd.mm.yyyy"_s, Today);
    if (GetParam().expected.isValid()) {
        ASSERT_TRUE(date);
        EXPECT_EQ(*date, GetParam().expected);
    } else {
        EXPECT_FALSE(date);
    }
}

INSTANTIATE_TEST_SUITE_P(Parse, ParseDateTest,
    ::testing::Values(ParseCase { "Full", u"12.03.2020"_s, QDate(2020, 3, 12) },
        ParseCase { "OtherSeparators", u"12/3-2020"_s, QDate(2020, 3, 12) },
        ParseCase { "SpacesAround", u" 12.03.2020 "_s, QDate(2020, 3, 12) },
        ParseCase { "YearBelowThirtyIsThisCentury", u"1.2.29"_s, QDate(2029, 2, 1) },
        ParseCase { "YearFromThirtyIsTheLast", u"1.2.30"_s, QDate(1930, 2, 1) },
        ParseCase { "YearFirst", u"2020-03-12"_s, QDate(2020, 3, 12) },
        ParseCase { "LeapDay", u"29.02.2024"_s, QDate(2024, 2, 29) },
        ParseCase { "NoLeapDay", u"29.02.2023"_s, QDate() },
        ParseCase { "Empty", QString(), QDate() },
        ParseCase { "DoubleSeparator", u"12..03.2020"_s, QDate() },
        ParseCase { "TrailingSeparator", u"12.03.2020."_s, QDate() },
        ParseCase { "FourParts", u"12.03.2020.1"_s, QDate() },
        ParseCase { "OnePart", u"12032020"_s, QDate() },
        ParseCase { "Letters", u"12.march.2020"_s, QDate() },
        ParseCase { "YearBeforeOneHundred", u"1.1.0099"_s, QDate() }),
    [](const auto& row) { return std::string(row.param.name); });
