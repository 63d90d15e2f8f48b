#include "dialogs/combocompletion.h"
#include "dialogs/numberentry.h"
#include "dialogsfixture.h"

#include <QLocale>
#include <gtest/gtest.h>

using namespace dialogs;
using namespace Qt::StringLiterals;

namespace {

class LocaleGuard {
public:
    explicit LocaleGuard(const QLocale& locale) { QLocale::setDefault(locale); }
    ~LocaleGuard() { QLocale::setDefault(m_saved); }

private:
    QLocale m_saved;
};

const QStringList Fruit { u"Apple"_s, u"Apricot"_s, u"Banana"_s };

ComboEdit combo(const QString& text, int start, int length, int index)
{
    return { { text, start, length }, index };
}

} // namespace

struct NumericKeyCase {
    const char* name;
    int key;
    int expected;
};

class NumericKeyTest : public ::testing::TestWithParam<NumericKeyCase> { };

TEST_P(NumericKeyTest, CalculatorCharactersOnly)
{
    EXPECT_EQ(filterNumericKey(GetParam().key, u','), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Keys, NumericKeyTest,
    ::testing::Values(NumericKeyCase { "Digit", '7', '7' },
        NumericKeyCase { "PointBecomesTheLocaleSeparator", '.', ',' },
        NumericKeyCase { "CommaBecomesTheLocaleSeparator", ',', ',' },
        NumericKeyCase { "Percent", '%', '%' }, NumericKeyCase { "Power", '^', '^' },
        NumericKeyCase { "Parenthesis", '(', '(' }, NumericKeyCase { "Colon", ':', ':' },
        NumericKeyCase { "Backspace", 8, 8 }, NumericKeyCase { "Copy", 3, 3 },
        NumericKeyCase { "Paste", 22, 22 }, NumericKeyCase { "Cut", 24, 24 },
        NumericKeyCase { "Letter", 'a', 0 }, NumericKeyCase { "Exponent", 'e', 0 },
        NumericKeyCase { "Space", ' ', 0 }, NumericKeyCase { "SelectAll", 1, 0 },
        NumericKeyCase { "Enter", 13, 0 }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(NumericKey, PointTypesThePointWhereItIsTheSeparator)
{
    EXPECT_EQ(filterNumericKey(',', u'.'), '.');
    EXPECT_EQ(filterNumericKey('.', u'.'), '.');
}

struct NormalizeCase {
    const char* name;
    QString text;
    std::optional<QString> expected;
};

class NormalizeNumberTest : public ::testing::TestWithParam<NormalizeCase> { };

TEST_P(NormalizeNumberTest, RewritesInTheLocalesForm)
{
    LocaleGuard guard(QLocale(QLocale::Estonian, QLocale::Estonia));
    EXPECT_EQ(normalizeNumber(GetParam().text), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Estonian, NormalizeNumberTest,
    ::testing::Values(NormalizeCase { "TrailingZeroGoes", u"1,50"_s, u"1,5"_s },
        NormalizeCase { "LeadingZerosGo", u"007"_s, u"7"_s },
        NormalizeCase { "Negative", u"-3,25"_s, u"-3,25"_s },
        NormalizeCase { "Expression", u"2*3"_s, std::nullopt },
        NormalizeCase { "Letters", u"abc"_s, std::nullopt }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(NormalizeNumber, FollowsTheLocale)
{
    LocaleGuard guard(QLocale(QLocale::English, QLocale::UnitedStates));
    EXPECT_EQ(normalizeNumber(u"1.50"_s), std::optional(u"1.5"_s));
    EXPECT_EQ(localeDecimalSeparator(), u'.');
}

struct CompletionCase {
    const char* name;
    ComboEdit before;
    int key;
    bool editable;
    ComboEdit after;
    int passedKey;
};

class AutoCompleteTest : public ::testing::TestWithParam<CompletionCase> { };

TEST_P(AutoCompleteTest, CompletesFromTheEntries)
{
    const auto& c = GetParam();
    const ComboKeyOutcome outcome = AutoCompleteCombo(Fruit, c.before, c.key, c.editable);
    EXPECT_EQ(outcome.combo, c.after);
    EXPECT_EQ(outcome.key, c.passedKey);
}

INSTANTIATE_TEST_SUITE_P(Combo, AutoCompleteTest,
    ::testing::Values(CompletionCase { "FirstLetterFindsTheFirstEntry", combo({}, 0, 0, -1), 'a',
                          true, combo(u"Apple"_s, 1, 4, 0), 0 },
        CompletionCase { "SecondLetterKeepsIt", combo(u"Apple"_s, 1, 4, 0), 'p', true,
            combo(u"Apple"_s, 2, 3, 0), 0 },
        CompletionCase { "ThirdLetterMovesOn", combo(u"Apple"_s, 2, 3, 0), 'r', true,
            combo(u"Apricot"_s, 3, 4, 1), 0 },
        CompletionCase { "BackspaceCompletesTheShorterPrefix", combo(u"Apricot"_s, 3, 4, 1),
            KeyCode::Backspace, true, combo(u"Apple"_s, 2, 3, 0), 0 },
        CompletionCase { "WhollySelectedTextIsReplaced", combo(u"Apple"_s, 0, 5, 0), 'b', true,
            combo(u"Banana"_s, 1, 5, 2), 0 },
        CompletionCase { "NoMatchLeavesThePrefixInAnEditableCombo", combo(u"Apple"_s, 1, 4, 0), 'z',
            true, combo(u"Az"_s, 2, 0, -1), 0 },
        CompletionCase { "NoMatchKeepsTheEntryOfADropDownList", combo(u"Apple"_s, 1, 4, 0), 'z',
            false, combo(u"Apple"_s, 1, 4, 0), 0 },
        CompletionCase { "DeleteKeepsThePrefix", combo(u"Apricot"_s, 3, 4, 1), KeyCode::Delete,
            false, combo(u"Apricot"_s, 3, 4, 1), 0 },
        CompletionCase { "BackspaceAtTheStartShowsTheFirstEntry", combo(u"Banana"_s, 0, 6, 2),
            KeyCode::Backspace, false, combo(u"Apple"_s, 0, 5, 0), 0 },
        CompletionCase { "PointIsACharacterNotDelete", combo(u"Apple"_s, 5, 0, 0), '.', true,
            combo(u"Apple."_s, 6, 0, -1), 0 },
        CompletionCase { "TypingInTheMiddleIsLeftToTheCombo", combo(u"Apple"_s, 1, 0, 0), 'x', true,
            combo(u"Apple"_s, 1, 0, 0), 'x' },
        CompletionCase { "EnterIsLeftAlone", combo(u"Ap"_s, 2, 0, -1), KeyCode::Enter, true,
            combo(u"Ap"_s, 2, 0, -1), KeyCode::Enter },
        CompletionCase { "EscapeIsLeftAlone", combo(u"Ap"_s, 2, 0, -1), KeyCode::Escape, true,
            combo(u"Ap"_s, 2, 0, -1), KeyCode::Escape },
        CompletionCase { "ClipboardKeysAreLeftAlone", combo(u"Ap"_s, 2, 0, -1), KeyCode::CtrlC,
            true, combo(u"Ap"_s, 2, 0, -1), KeyCode::CtrlC }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(AutoComplete, ComparesWithoutRegardToCaseButShowsTheEntry)
{
    const ComboKeyOutcome outcome
        = AutoCompleteCombo({ u"apple"_s, u"APRICOT"_s }, combo(u"AP"_s, 2, 0, -1), 'R', true);
    EXPECT_EQ(outcome.combo, combo(u"APRICOT"_s, 3, 4, 1));
}

TEST(AutoComplete, ComboWithoutEntriesIsLeftAlone)
{
    const ComboKeyOutcome outcome = AutoCompleteCombo({}, combo({}, 0, 0, -1), 'a', true);
    EXPECT_EQ(outcome.key, 'a');
    EXPECT_EQ(outcome.combo, combo({}, 0, 0, -1));
}
