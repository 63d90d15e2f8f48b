#include "dialogs/dateentry.h"
#include "dialogs/inputboxlayout.h"
#include "widgetfixture.h"

#include <QCheckBox>
#include <QComboBox>
#include <QListWidget>
#include <QPushButton>

using namespace dialogs;
using namespace widgettest;
using namespace Qt::StringLiterals;
using core::Variant;
using core::VariantArray;

namespace {

Variant choices(const QStringList& texts)
{
    std::vector<Variant> values;
    for (const QString& text : texts)
        values.emplace_back(text);
    return Variant(VariantArray::fromList(values));
}

QStringList texts(const Variant& value)
{
    QStringList result;
    for (const Variant& element : value.array().values())
        result << element.toText();
    return result;
}

const QColor Yellow(255, 255, 0);

class InputBoxTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        QLocale::setDefault(QLocale(QLocale::Estonian, QLocale::Estonia));
        setDateEntrySettings(DateEntrySettings::fromShortDate(u"31.12.1899"_s, u"."_s));
        engine::gLanguage = 3;
        engine::gXPStyle = false;
    }

    std::shared_ptr<InputBoxParamsItem> item(const QString& name) { return params->Item(name); }
    void clickOK() { QTest::mouseClick(child<QPushButton>(box.get(), u"cmdOK"_s), Qt::LeftButton); }
    void clickCancel()
    {
        QTest::mouseClick(child<QPushButton>(box.get(), u"cmdCancel"_s), Qt::LeftButton);
    }
    template <typename T> T* control(const QString& name) { return child<T>(box.get(), name); }

    GlobalsGuard guard;
    std::shared_ptr<InputBoxParams> params = std::make_shared<InputBoxParams>();
    std::unique_ptr<frmInputBox> box;
};

} // namespace

TEST_F(InputBoxTest, DigitsFillTheDayMonthYearMask)
{
    item(u"From"_s)->DateFormat = true;
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    focus(edit);
    QTest::keyClicks(edit, u"12032020"_s);
    EXPECT_EQ(edit->text(), u"12.03.2020"_s);
    QTest::keyClick(edit, '1');
    EXPECT_EQ(edit->text(), u"12.03.2020"_s);
    QTest::keyClick(edit, 'x');
    EXPECT_EQ(edit->text(), u"12.03.2020"_s);
    clickOK();
    EXPECT_TRUE(box->Result);
    EXPECT_FALSE(box->isVisible());
    EXPECT_EQ(item(u"From"_s)->Value, Variant(u"12.03.2020"_s));
}

TEST_F(InputBoxTest, DigitsFillTheMonthDayYearMask)
{
    QLocale::setDefault(QLocale(QLocale::English, QLocale::UnitedStates));
    setDateEntrySettings(DateEntrySettings::fromShortDate(u"12/31/1899"_s, u"/"_s));
    item(u"From"_s)->DateFormat = true;
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    focus(edit);
    QTest::keyClicks(edit, u"03122020"_s);
    EXPECT_EQ(edit->text(), u"03/12/2020"_s);
    // A separator key on a complete date jumps to the day and selects it.
    QTest::keyClick(edit, Qt::Key_Home);
    QTest::keyClick(edit, '/');
    EXPECT_EQ(edit->selectedText(), u"12"_s);
    QTest::keyClick(edit, Qt::Key_Backspace);
    EXPECT_EQ(edit->text(), u"0"_s);
}

TEST_F(InputBoxTest, PlusAndMinusStepAWhollySelectedDate)
{
    item(u"Day"_s)->DateFormat = true;
    item(u"Day"_s)->Value = Variant::fromDate(QDate(2020, 12, 31));
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    EXPECT_EQ(edit->text(), u"31.12.2020"_s);
    focus(edit);
    EXPECT_EQ(edit->selectedText(), u"31.12.2020"_s);
    QTest::keyClick(edit, '+');
    EXPECT_EQ(edit->text(), u"01.01.2021"_s);
    EXPECT_EQ(edit->selectedText(), u"01.01.2021"_s);
    QTest::keyClick(edit, Qt::Key_Minus, Qt::KeypadModifier);
    QTest::keyClick(edit, '-');
    EXPECT_EQ(edit->text(), u"30.12.2020"_s);
    QTest::keyClick(edit, Qt::Key_D, Qt::ControlModifier);
    EXPECT_EQ(edit->text(), formatDate(QDate::currentDate(), u"dd.mm.yyyy"_s));
    EXPECT_EQ(edit->selectedText(), edit->text());
}

TEST_F(InputBoxTest, DayOffsetsAreAppliedWhenTheFieldIsLeft)
{
    item(u"Day"_s)->DateFormat = true;
    item(u"Note"_s);
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    focus(edit);
    QTest::keyClicks(edit, u"10032021+5"_s);
    EXPECT_EQ(edit->text(), u"10.03.2021+5"_s);
    QTest::keyClick(edit, Qt::Key_Tab);
    EXPECT_EQ(edit->text(), u"15.03.2021"_s);

    focus(edit);
    QTest::keyClicks(edit, u"10032021-12"_s);
    QTest::keyClick(edit, Qt::Key_Tab);
    EXPECT_EQ(edit->text(), u"26.02.2021"_s);
    EXPECT_EQ(QApplication::focusWidget(), control<QLineEdit>(u"txData_2"_s));
}

TEST_F(InputBoxTest, AnInvalidDateIsYellowAndBlocksOK)
{
    item(u"Day"_s)->DateFormat = true;
    item(u"Note"_s);
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    const QColor window = edit->palette().color(QPalette::Base);
    focus(edit);
    QTest::keyClicks(edit, u"31022021"_s);
    clickOK();
    EXPECT_FALSE(box->Result);
    EXPECT_TRUE(box->isVisible());
    EXPECT_EQ(QApplication::focusWidget(), edit);
    EXPECT_EQ(edit->palette().color(QPalette::Base), Yellow);

    QTest::keyClicks(edit, u"28022021"_s);
    QTest::keyClick(edit, Qt::Key_Tab);
    EXPECT_EQ(edit->palette().color(QPalette::Base), window);
    clickOK();
    EXPECT_TRUE(box->Result);
    EXPECT_EQ(item(u"Day"_s)->Value, Variant(u"28.02.2021"_s));
}

TEST_F(InputBoxTest, AnEmptyDateIsValid)
{
    item(u"Day"_s)->DateFormat = true;
    box = showBox(params);
    clickOK();
    EXPECT_TRUE(box->Result);
    EXPECT_EQ(item(u"Day"_s)->Value, Variant(QString()));
}

TEST_F(InputBoxTest, NumericFieldsTakeCalculatorCharactersAndAreNormalised)
{
    item(u"Amount"_s)->NumericFormat = true;
    item(u"Amount"_s)->Value = Variant(u"abc"_s);
    item(u"Note"_s);
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    // A value that is no number is not shown.
    EXPECT_EQ(edit->text(), QString());
    focus(edit);
    QTest::keyClicks(edit, u"1a.50"_s);
    EXPECT_EQ(edit->text(), u"1,50"_s);
    QTest::keyClick(edit, Qt::Key_Tab);
    EXPECT_EQ(edit->text(), u"1,5"_s);
    clickOK();
    EXPECT_EQ(item(u"Amount"_s)->Value, Variant(u"1,5"_s));
}

TEST_F(InputBoxTest, EditableComboCompletesFromTheStartOfTheEntries)
{
    item(u"Fruit"_s)->Value = choices({ u"Apple"_s, u"Apricot"_s, u"Banana"_s });
    item(u"Fruit"_s)->DefaultValue = Variant(u"banana"_s);
    box = showBox(params);
    auto* combo = control<QComboBox>(u"cmbData_1"_s);
    EXPECT_EQ(combo->currentText(), u"Banana"_s);
    focus(combo);
    QTest::keyClicks(combo, u"apr"_s);
    EXPECT_EQ(combo->currentText(), u"Apricot"_s);
    EXPECT_EQ(combo->lineEdit()->selectedText(), u"icot"_s);
    QTest::keyClick(combo, Qt::Key_Backspace);
    EXPECT_EQ(combo->currentText(), u"Apple"_s);
    EXPECT_EQ(combo->lineEdit()->selectedText(), u"ple"_s);
    QTest::keyClick(combo, 'z');
    EXPECT_EQ(combo->currentText(), u"Apz"_s);

    // In the middle of the text keys are typed as they are.
    combo->lineEdit()->setText(u"Apple"_s);
    combo->lineEdit()->setCursorPosition(1);
    QTest::keyClick(combo, 'x');
    EXPECT_EQ(combo->currentText(), u"Axpple"_s);
    clickOK();
    EXPECT_EQ(item(u"Fruit"_s)->Value, Variant(u"Axpple"_s));
}

TEST_F(InputBoxTest, DropDownListCompletesAndKeepsItsEntryWithoutMatch)
{
    item(u"Fruit"_s)->Value = choices({ u"Apple"_s, u"Apricot"_s, u"Banana"_s });
    item(u"Fruit"_s)->SelectOnly = true;
    box = showBox(params);
    auto* combo = control<QComboBox>(u"cmbSData_1"_s);
    focus(combo);
    QTest::keyClicks(combo, u"apr"_s);
    EXPECT_EQ(combo->currentText(), u"Apricot"_s);
    QTest::keyClick(combo, 'z');
    EXPECT_EQ(combo->currentText(), u"Apricot"_s);
    QTest::keyClick(combo, Qt::Key_Delete);
    EXPECT_EQ(combo->currentText(), u"Apricot"_s);
    QTest::keyClick(combo, Qt::Key_Backspace);
    EXPECT_EQ(combo->currentText(), u"Apple"_s);
    clickOK();
    EXPECT_EQ(item(u"Fruit"_s)->Value, Variant(u"Apple"_s));
}

TEST_F(InputBoxTest, RequiredFieldsRefuseOKInListOrder)
{
    auto list = item(u"Regions"_s);
    list->Value = choices({ u"North"_s, u"South"_s });
    list->MultiSelect = true;
    list->MustExist = true;
    auto combo = item(u"Fruit"_s);
    combo->Value = choices({ u"Apple"_s });
    combo->MustExist = true;
    auto text = item(u"Name"_s);
    text->MustExist = true;
    box = showBox(params);

    clickOK();
    auto* listBox = control<QListWidget>(u"lstData_1"_s);
    EXPECT_TRUE(box->isVisible());
    EXPECT_EQ(QApplication::focusWidget(), listBox);
    QTest::mouseClick(listBox->viewport(), Qt::LeftButton, {},
        listBox->visualItemRect(listBox->item(1)).center());

    auto* comboBox = control<QComboBox>(u"cmbData_2"_s);
    focus(comboBox);
    QTest::keyClick(comboBox, Qt::Key_Delete);
    EXPECT_EQ(comboBox->currentText(), QString());
    clickOK();
    EXPECT_TRUE(box->isVisible());
    EXPECT_TRUE(comboBox->hasFocus());

    QTest::keyClicks(comboBox, u"a"_s);
    clickOK();
    auto* edit = control<QLineEdit>(u"txData_3"_s);
    EXPECT_TRUE(box->isVisible());
    EXPECT_EQ(QApplication::focusWidget(), edit);

    QTest::keyClicks(edit, u"Mari"_s);
    clickOK();
    EXPECT_TRUE(box->Result);
    EXPECT_EQ(texts(list->Value), QStringList { u"South"_s });
    EXPECT_EQ(combo->Value, Variant(u"Apple"_s));
    EXPECT_EQ(text->Value, Variant(u"Mari"_s));
}

TEST_F(InputBoxTest, CancelLeavesEveryValueUntouched)
{
    item(u"Name"_s)->Value = Variant(u"Jaan"_s);
    item(u"Fruit"_s)->Value = choices({ u"Apple"_s, u"Banana"_s });
    item(u"Agree"_s)->IsCheck = true;
    box = showBox(params);
    QTest::keyClicks(control<QLineEdit>(u"txData_1"_s), u"Mari"_s);
    control<QComboBox>(u"cmbData_2"_s)->setCurrentIndex(1);
    QTest::mouseClick(control<QCheckBox>(u"chkData_3"_s), Qt::LeftButton);
    clickCancel();
    EXPECT_FALSE(box->Result);
    EXPECT_FALSE(box->isVisible());
    EXPECT_EQ(item(u"Name"_s)->Value, Variant(u"Jaan"_s));
    EXPECT_EQ(texts(item(u"Fruit"_s)->Value), (QStringList { u"Apple"_s, u"Banana"_s }));
    EXPECT_TRUE(item(u"Agree"_s)->Value.isEmpty());
}

TEST_F(InputBoxTest, EscapeCancelsOnlyWithACancelButton)
{
    item(u"Name"_s)->Value = Variant(u"Jaan"_s);
    box = showBox(params, 0);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    QTest::keyClicks(edit, u"Mari"_s);
    QTest::keyClick(edit, Qt::Key_Escape);
    EXPECT_TRUE(box->isVisible());

    box = showBox(params, 1);
    edit = control<QLineEdit>(u"txData_1"_s);
    QTest::keyClicks(edit, u"Mari"_s);
    QTest::keyClick(edit, Qt::Key_Escape);
    EXPECT_FALSE(box->isVisible());
    EXPECT_FALSE(box->Result);
    EXPECT_EQ(item(u"Name"_s)->Value, Variant(u"Jaan"_s));

    params->NoCancel = true;
    box = showBox(params, 1);
    QTest::keyClick(control<QLineEdit>(u"txData_1"_s), Qt::Key_Escape);
    EXPECT_TRUE(box->isVisible());
}

TEST_F(InputBoxTest, ClosingTheWindowWritesNothing)
{
    item(u"Name"_s)->Value = Variant(u"Jaan"_s);
    box = showBox(params, 0);
    QTest::keyClicks(control<QLineEdit>(u"txData_1"_s), u"Mari"_s);
    box->close();
    EXPECT_FALSE(box->isVisible());
    EXPECT_FALSE(box->Result);
    EXPECT_EQ(item(u"Name"_s)->Value, Variant(u"Jaan"_s));
}

TEST_F(InputBoxTest, MultiSelectionGivesTheSelectedTextsInListOrder)
{
    VariantArray entries({ { 0, 2 }, { 0, 1 } });
    entries.at({ 0, 0 }) = Variant(u"a"_s);
    entries.at({ 1, 0 }) = Variant(u"b"_s);
    entries.at({ 2, 0 }) = Variant(u"c"_s);
    entries.at({ 2, 1 }) = Variant(true);
    auto regions = item(u"Regions"_s);
    regions->Value = Variant(entries);
    regions->MultiSelect = true;
    auto empty = item(u"None"_s);
    empty->Value = choices({ u"x"_s, u"y"_s });
    empty->MultiSelect = true;
    box = showBox(params);
    auto* list = control<QListWidget>(u"lstData_1"_s);
    QTest::mouseClick(
        list->viewport(), Qt::LeftButton, {}, list->visualItemRect(list->item(0)).center());
    clickOK();
    ASSERT_TRUE(box->Result);

    const VariantArray& selected = regions->Value.array();
    EXPECT_EQ(selected.elementType(), core::VariantType::String);
    EXPECT_EQ(selected.lbound(), 0);
    EXPECT_EQ(texts(regions->Value), (QStringList { u"a"_s, u"c"_s }));
    EXPECT_EQ(regions->SelectionCount, 2);
    // Nothing selected: one empty text.
    EXPECT_EQ(texts(empty->Value), QStringList { QString() });
    EXPECT_EQ(empty->SelectionCount, 0);
}

TEST_F(InputBoxTest, CheckBoxesShowTheirStateAndReturnZeroOrOne)
{
    auto blank = item(u"Blank"_s);
    blank->IsCheck = true;
    blank->Value = Variant(QString());
    auto set = item(u"Set"_s);
    set->IsCheck = true;
    set->Caption = u"Include totals"_s;
    set->Value = Variant(true);
    box = showBox(params);
    auto* blankBox = control<QCheckBox>(u"chkData_1"_s);
    EXPECT_EQ(blankBox->text(), QString(9, u' '));
    EXPECT_FALSE(blankBox->isChecked());
    EXPECT_EQ(control<QCheckBox>(u"chkData_2"_s)->text(), u"Include totals"_s);
    EXPECT_TRUE(control<QCheckBox>(u"chkData_2"_s)->isChecked());
    QTest::mouseClick(control<QCheckBox>(u"chkData_2"_s), Qt::LeftButton);
    clickOK();
    EXPECT_EQ(blank->Value, Variant(u"0"_s));
    EXPECT_EQ(set->Value, Variant(u"0"_s));
}

TEST_F(InputBoxTest, EnterMovesToTheNextEnabledFieldWhenOKIsNotTheDefault)
{
    params->NoDefault = true;
    item(u"A"_s);
    item(u"B"_s)->ReadOnly = true;
    item(u"C"_s)->Value = choices({ u"x"_s });
    box = showBox(params);
    auto* first = control<QLineEdit>(u"txData_1"_s);
    EXPECT_EQ(QApplication::focusWidget(), first);
    QTest::keyClick(first, Qt::Key_Return);
    auto* combo = control<QComboBox>(u"cmbData_3"_s);
    EXPECT_TRUE(combo->hasFocus());
    QTest::keyClick(combo, Qt::Key_Return);
    EXPECT_EQ(QApplication::focusWidget(), first);
    EXPECT_TRUE(box->isVisible());
}

TEST_F(InputBoxTest, EnterPressesTheDefaultOK)
{
    item(u"Amount"_s)->NumericFormat = true;
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    QTest::keyClicks(edit, u"2,50"_s);
    QTest::keyClick(edit, Qt::Key_Return);
    EXPECT_TRUE(box->Result);
    // The field is checked as if it had been left.
    EXPECT_EQ(item(u"Amount"_s)->Value, Variant(u"2,5"_s));
}

TEST_F(InputBoxTest, F2SwitchesBetweenSelectionAndCaret)
{
    item(u"Name"_s)->Value = Variant(u"Jaan"_s);
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    EXPECT_EQ(edit->selectedText(), u"Jaan"_s);
    QTest::keyClick(edit, Qt::Key_F2);
    EXPECT_FALSE(edit->hasSelectedText());
    EXPECT_EQ(edit->cursorPosition(), 4);
    QTest::keyClick(edit, Qt::Key_F2);
    EXPECT_EQ(edit->selectedText(), u"Jaan"_s);
}

TEST_F(InputBoxTest, FieldLeaveHookCanKeepTheFocusButNotBlockCancel)
{
    item(u"A"_s);
    item(u"B"_s);
    box = showBox(params);
    std::vector<int> asked;
    box->setFieldLeaveHook([&asked](int index) {
        asked.push_back(index);
        return false;
    });
    auto* first = control<QLineEdit>(u"txData_1"_s);
    // Without an edit the field is left without asking.
    QTest::keyClick(first, Qt::Key_Tab);
    EXPECT_TRUE(asked.empty());
    focus(first);
    QTest::keyClicks(first, u"x"_s);
    QTest::keyClick(first, Qt::Key_Tab);
    EXPECT_EQ(asked, std::vector<int> { 1 });
    EXPECT_EQ(QApplication::focusWidget(), first);
    clickCancel();
    EXPECT_FALSE(box->isVisible());
}

TEST_F(InputBoxTest, PasswordsAreMaskedByTheVisualStyle)
{
    item(u"Secret"_s)->Password = true;
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txData_1"_s);
    EXPECT_EQ(edit->echoMode(), QLineEdit::Password);
    EXPECT_EQ(edit->style()->styleHint(QStyle::SH_LineEdit_PasswordCharacter, nullptr, edit), '*');
    engine::gXPStyle = true;
    box = showBox(params);
    edit = control<QLineEdit>(u"txData_1"_s);
    EXPECT_EQ(
        edit->style()->styleHint(QStyle::SH_LineEdit_PasswordCharacter, nullptr, edit), 0x25CF);
}

struct CaptionCase {
    const char* name;
    int16_t language;
    int32_t buttons;
    QString ok;
    QString cancel;
};

class InputBoxCaptions : public InputBoxTest, public ::testing::WithParamInterface<CaptionCase> { };

TEST_P(InputBoxCaptions, ButtonsSpeakTheHostsLanguage)
{
    engine::gLanguage = GetParam().language;
    item(u"Name"_s);
    box = showBox(params, GetParam().buttons);
    EXPECT_EQ(control<QPushButton>(u"cmdOK"_s)->text(), GetParam().ok);
    EXPECT_EQ(control<QPushButton>(u"cmdCancel"_s)->text(), GetParam().cancel);
    EXPECT_EQ(box->windowTitle(), u"Test"_s);
}

INSTANTIATE_TEST_SUITE_P(Languages, InputBoxCaptions,
    ::testing::Values(CaptionCase { "English", 3, 1, u"&OK"_s, u"&Cancel"_s },
        CaptionCase { "Estonian", 4, 1, u"&OK"_s, u"Ka&tkesta"_s },
        CaptionCase { "Latvian", 5, 1, u"&OK"_s, u"Atcelt"_s },
        CaptionCase { "EstonianOkOnly", 4, 0, u"&OK"_s, u"Ka&tkesta"_s },
        // Button sets other than 0 and 1 keep the designed captions.
        CaptionCase { "DesignedSetStaysEnglish", 4, 3, u"&OK"_s, u"&Cancel"_s }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(InputBoxTest, ControlsArePlacedWhereTheLayoutSays)
{
    params->NoIco = true;
    params->InputWidth = Variant(int32_t(300));
    item(u"Regions"_s)->Value = choices({ u"a"_s });
    item(u"Regions"_s)->MultiSelect = true;
    item(u"Fruit"_s)->Value = choices({ u"a"_s });
    item(u"Path"_s)->IsFileDialog = true;
    box = showBox(params);
    const InputBoxGeometry& g = box->placement();
    ASSERT_EQ(g.fields.size(), 3u);
    EXPECT_EQ(control<QListWidget>(u"lstData_1"_s)->geometry(),
        twipsToPixels(g.fields[0].control, 15, 15));
    EXPECT_EQ(
        control<QComboBox>(u"cmbData_2"_s)->geometry(), twipsToPixels(g.fields[1].control, 15, 15));
    EXPECT_EQ(control<QLineEdit>(u"txMData_3"_s)->geometry(), QRect(136, 106, 157, 21));
    EXPECT_EQ(control<QWidget>(u"Picture2_3"_s)->geometry(), QRect(295, 106, 22, 21));
    EXPECT_EQ(box->size(), QSize(qRound(g.width / 15.0), qRound(g.height / 15.0)));
    EXPECT_EQ(params->Item(u"Path"_s)->Index, 3);
}
