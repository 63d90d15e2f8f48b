#include "dialogs/inputboxlayout.h"
#include "dialogsfixture.h"

#include <gtest/gtest.h>

using namespace dialogs;
using namespace Qt::StringLiterals;
using core::Variant;

// All expectations are in twips at 15 twips per pixel (96 DPI) unless a case says otherwise:
// the margin is 14 px = 210, a row 30 px = 450, a button 85 x 27 px = 1275 x 405.

namespace {

std::vector<InputBoxLayoutField> rows(std::initializer_list<FieldKind> kinds)
{
    std::vector<InputBoxLayoutField> fields;
    for (FieldKind kind : kinds)
        fields.push_back({ kind, u"Label"_s });
    return fields;
}

// 100 twips per character keeps label widths easy to follow.
int charWidth(const QString& text)
{
    return static_cast<int>(text.size()) * 100;
}

InputBoxGeometry layout(
    const std::vector<InputBoxLayoutField>& fields, const InputBoxLayoutOptions& options = {})
{
    return layoutInputBox(fields, options, charWidth);
}

} // namespace

TEST(InputBoxLayout, NoFieldsPutsTheButtonsBelowTheIcon)
{
    InputBoxLayoutOptions options;
    options.Buttons = 1;
    const InputBoxGeometry g = layout({}, options);
    EXPECT_EQ(g.contentHeight, 0);
    EXPECT_TRUE(g.iconVisible);
    EXPECT_EQ(g.iconPosition, QPoint(210, 210));
    // The button row is 32 px + 2 margins down.
    EXPECT_EQ(g.cancel, QRect(4455 - 1275, 900, 1275, 405));
    EXPECT_EQ(g.ok, QRect(4455 - 1275 - 210 - 1275, 900, 1275, 405));
    // Tall enough for that row and a margin below it.
    EXPECT_EQ(g.height, 900 + 405 + 210);
    EXPECT_EQ(g.width, 4680);
    EXPECT_EQ(twipsToPixels(g.ok, 15, 15), QRect(113, 60, 85, 27));
    EXPECT_EQ(twipsToPixels(g.cancel, 15, 15), QRect(212, 60, 85, 27));
}

struct ButtonsCase {
    const char* name;
    int32_t buttons;
    ButtonSet set;
    bool cancelVisible;
    MessageIcon icon;
};

class ButtonsTest : public ::testing::TestWithParam<ButtonsCase> { };

TEST_P(ButtonsTest, LowBitsChooseTheButtonsAndIconBitsTheIcon)
{
    InputBoxLayoutOptions options;
    options.Buttons = GetParam().buttons;
    const InputBoxGeometry g = layout(rows({ FieldKind::Text }), options);
    EXPECT_EQ(g.buttonSet, GetParam().set);
    EXPECT_EQ(g.cancelVisible, GetParam().cancelVisible);
    EXPECT_EQ(g.cancelIsCancel, GetParam().cancelVisible);
    EXPECT_TRUE(g.okIsDefault);
    EXPECT_EQ(g.icon, GetParam().icon);
    // One row (30 px) is lower than the icon, so the row sits 32 px + 2 margins down.
    const int buttonTop = 900;
    if (GetParam().cancelVisible) {
        EXPECT_EQ(g.cancel, QRect(3180, buttonTop, 1275, 405));
        EXPECT_EQ(g.ok, QRect(1695, buttonTop, 1275, 405));
    } else {
        // OK alone at the right edge of the input column.
        EXPECT_EQ(g.ok, QRect(3180, buttonTop, 1275, 405));
    }
}

INSTANTIATE_TEST_SUITE_P(Buttons, ButtonsTest,
    ::testing::Values(ButtonsCase { "OkOnly", 0, ButtonSet::OKOnly, false, MessageIcon::Question },
        ButtonsCase { "OkCancel", 1, ButtonSet::OKCancel, true, MessageIcon::Question },
        ButtonsCase { "OkCancelQuestion", 33, ButtonSet::OKCancel, true, MessageIcon::Question },
        ButtonsCase { "OkOnlyStop", 16, ButtonSet::OKOnly, false, MessageIcon::Critical },
        ButtonsCase { "Exclamation", 49, ButtonSet::OKCancel, true, MessageIcon::Exclamation },
        ButtonsCase { "Information", 64, ButtonSet::OKOnly, false, MessageIcon::Information },
        ButtonsCase { "UnknownIconBitsGiveTheQuestion", 112 + 1, ButtonSet::OKCancel, true,
            MessageIcon::Question },
        // Other button sets keep both designed buttons, laid out as a pair.
        ButtonsCase { "YesNoCancelShowsTheDesignedPair", 3, ButtonSet::Designed, true,
            MessageIcon::Question }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(InputBoxLayout, NoDefaultAndNoCancelReleaseEnterAndEscape)
{
    InputBoxLayoutOptions options;
    options.Buttons = 1;
    options.NoDefault = true;
    options.NoCancel = true;
    const InputBoxGeometry g = layout(rows({ FieldKind::Text }), options);
    EXPECT_FALSE(g.okIsDefault);
    EXPECT_FALSE(g.cancelIsCancel);
    EXPECT_TRUE(g.cancelVisible);
}

TEST(InputBoxLayout, RowsArePlacedThirtyPixelsApart)
{
    const InputBoxGeometry g
        = layout(rows({ FieldKind::Text, FieldKind::CheckBox, FieldKind::EditableCombo }));
    ASSERT_EQ(g.fields.size(), 3u);
    EXPECT_EQ(g.fields[0].control, QRect(2040, 270, 2415, 315));
    EXPECT_EQ(g.fields[1].control, QRect(2040, 720, 2415, 315));
    EXPECT_EQ(g.fields[2].control, QRect(2040, 1170, 2415, 315));
    // Labels are 3 px below their control and end 60 twips before the input column.
    EXPECT_EQ(g.fields[0].label, QRect(1980 - 500, 315, 500, 204));
    EXPECT_EQ(g.contentHeight, 1350);
    EXPECT_EQ(g.iconPosition.y(), (1350 - 480) / 2 + 210);
    EXPECT_EQ(g.ok.top(), 1350 + 420);
    EXPECT_EQ(g.height, 1350 + 405 + 630);
}

TEST(InputBoxLayout, RowsBelowAListMoveByItsExtraHeight)
{
    const InputBoxGeometry g = layout(rows({ FieldKind::MultiSelectList, FieldKind::EditableCombo,
        FieldKind::DropDownList, FieldKind::Text, FieldKind::MultiSelectList, FieldKind::Memo }));
    // The designed list is 735 high, 420 more than a text row: 28 px at 96 DPI.
    EXPECT_EQ(g.fields[0].control, QRect(2040, 270, 2415, 735));
    EXPECT_EQ(g.fields[1].control.top(), 210 + (28 + 4 + 30) * 15);
    EXPECT_EQ(g.fields[2].control.top(), 210 + (28 + 4 + 60) * 15);
    EXPECT_EQ(g.fields[3].control.top(), 420 + 210 + (3 * 30 + 4) * 15);
    EXPECT_EQ(g.fields[4].control, QRect(2040, 420 + 210 + (4 * 30 + 4) * 15, 2415, 735));
    EXPECT_EQ(g.fields[5].control.top(), 2 * 420 + 210 + (5 * 30 + 4) * 15);
    EXPECT_EQ(g.contentHeight, 2 * 420 + 6 * 450);
}

TEST(InputBoxLayout, ATallListPushesComboRowsBelowIt)
{
    InputBoxLayoutOptions options;
    options.InputHeight = Variant(int32_t(2000));
    const InputBoxGeometry g
        = layout(rows({ FieldKind::MultiSelectList, FieldKind::EditableCombo }), options);
    EXPECT_EQ(g.fields[0].control.height(), 2000);
    EXPECT_EQ(g.fields[1].control.top(), g.fields[0].control.bottom() + 1 + 135);
    EXPECT_EQ(g.listHeight, 2000);
}

struct SizeCase {
    const char* name;
    Variant inputWidth;
    Variant inputHeight;
    int extraWidth;
    int listHeight;
};

class SizeOptionTest : public ::testing::TestWithParam<SizeCase> { };

TEST_P(SizeOptionTest, OnlyNumbersCount)
{
    InputBoxLayoutOptions options;
    options.InputWidth = GetParam().inputWidth;
    options.InputHeight = GetParam().inputHeight;
    const InputBoxGeometry g = layout(rows({ FieldKind::MultiSelectList }), options);
    EXPECT_EQ(g.extraWidth, GetParam().extraWidth);
    EXPECT_EQ(g.listHeight, GetParam().listHeight);
    EXPECT_EQ(
        g.fields[0].control.size(), QSize(2415 + GetParam().extraWidth, GetParam().listHeight));
}

INSTANTIATE_TEST_SUITE_P(Sizes, SizeOptionTest,
    ::testing::Values(
        SizeCase { "Numbers", Variant(int32_t(1000)), Variant(int32_t(2000)), 1000, 2000 },
        SizeCase { "NumericText", Variant(u"500"_s), Variant(u"1200"_s), 500, 1200 },
        SizeCase { "EmptyKeepsTheDesign", Variant(), Variant(), 0, 735 },
        SizeCase { "TextKeepsTheDesign", Variant(u"wide"_s), Variant(u"tall"_s), 0, 735 },
        SizeCase { "OverflowCountsAsNothing", Variant(1e12), Variant(1e12), 0, 735 },
        SizeCase { "NegativeHeightKeepsTheDesign", Variant(int32_t(-50)), Variant(int32_t(-50)),
            -50, 735 }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(InputBoxLayout, ExtraWidthWidensControlsButtonsAndDialog)
{
    InputBoxLayoutOptions options;
    options.InputWidth = Variant(int32_t(1000));
    options.Buttons = 1;
    const InputBoxGeometry g = layout(rows({ FieldKind::Text, FieldKind::FilePath }), options);
    EXPECT_EQ(g.fields[0].control, QRect(2040, 270, 3415, 315));
    EXPECT_EQ(g.fields[1].control, QRect(2040, 720, 3055, 315));
    EXPECT_EQ(g.fields[1].browseBox, QRect(5125, 720, 330, 315));
    EXPECT_EQ(g.cancel.right() + 1, 5455);
    EXPECT_EQ(g.width, 5680);
}

TEST(InputBoxLayout, BrowseButtonSitsInsideItsBox)
{
    InputBoxLayoutOptions options;
    const InputBoxGeometry plain = layout(rows({ FieldKind::Color }), options);
    EXPECT_EQ(plain.fields[0].control, QRect(2040, 270, 2055, 315));
    EXPECT_EQ(plain.fields[0].browseBox, QRect(4125, 270, 330, 315));
    EXPECT_EQ(plain.fields[0].browseButton, QRect(15, 15, 255, 240));
    options.xpStyle = true;
    EXPECT_EQ(
        layout(rows({ FieldKind::Color }), options).fields[0].browseButton, QRect(0, 0, 330, 315));
}

TEST(InputBoxLayout, NoIcoWithoutWideControlsKeepsTheTemplatePlaces)
{
    InputBoxLayoutOptions options;
    options.NoIco = true;
    options.Buttons = 1;
    const InputBoxGeometry g
        = layout(rows({ FieldKind::Text, FieldKind::Memo, FieldKind::CheckBox }), options);
    EXPECT_FALSE(g.iconVisible);
    EXPECT_EQ(g.fields[0].control, QRect(2040, 270, 2415, 315));
    EXPECT_EQ(g.fields[1].control, QRect(2040, 720, 2055, 315));
    EXPECT_EQ(g.fields[1].browseBox, QRect(4125, 720, 330, 315));
    EXPECT_EQ(g.fields[2].control, QRect(2040, 1170, 2415, 315));
    EXPECT_EQ(g.cancel, QRect(3180, 1350 + 420, 1275, 405));
    EXPECT_EQ(g.width, 4680);
}

TEST(InputBoxLayout, WideControlsTakeTheIconColumn)
{
    InputBoxLayoutOptions options;
    options.NoIco = true;
    options.WideControls = true;
    options.Buttons = 1;
    const InputBoxGeometry g = layout(
        rows({ FieldKind::Text, FieldKind::Memo, FieldKind::CheckBox, FieldKind::MultiSelectList }),
        options);
    const int shift = 64 * 15;
    EXPECT_EQ(g.fields[0].control, QRect(2040 - shift, 270, 2415 + shift, 315));
    // The text box grows up to its browse box, which stays at the column's right end.
    EXPECT_EQ(g.fields[1].control, QRect(2040 - shift, 720, 2055 + shift, 315));
    EXPECT_EQ(g.fields[1].browseBox, QRect(4125, 720, 330, 315));
    // Check boxes move with the column but do not grow.
    EXPECT_EQ(g.fields[2].control, QRect(2040 - shift, 1170, 2415, 315));
    EXPECT_EQ(g.fields[3].control, QRect(2040 - shift, 1620, 2415 + shift, 735));
    EXPECT_EQ(g.fields[0].label.right() + 1, 2040 - shift - 60);
    EXPECT_EQ(g.cancel.left(), 3180 - shift);
    EXPECT_EQ(g.ok.left(), 1695 - shift);
}

TEST(InputBoxLayout, WideControlsNeedNoIco)
{
    InputBoxLayoutOptions options;
    options.WideControls = true;
    const InputBoxGeometry g = layout(rows({ FieldKind::Text }), options);
    EXPECT_EQ(g.fields[0].control, QRect(2040, 270, 2415, 315));
}

TEST(InputBoxLayout, LabelsAreRightJustifiedOrAlignedOnTheWidest)
{
    std::vector<InputBoxLayoutField> fields { { FieldKind::Text, u"Name"_s },
        { FieldKind::Text, u"Longer label"_s } };
    InputBoxLayoutOptions options;
    options.NoIco = true;
    InputBoxGeometry g = layout(fields, options);
    EXPECT_FALSE(g.labelsLeftAligned);
    EXPECT_EQ(g.fields[0].label, QRect(1980 - 400, 315, 400, 204));
    EXPECT_EQ(g.fields[1].label, QRect(1980 - 1200, 765, 1200, 204));

    options.LabelLeftAlign = true;
    g = layout(fields, options);
    EXPECT_TRUE(g.labelsLeftAligned);
    EXPECT_EQ(g.fields[0].label, QRect(780, 315, 400, 204));
    EXPECT_EQ(g.fields[1].label, QRect(780, 765, 1200, 204));
}

struct AutoSizeCase {
    const char* name;
    bool noIco;
    bool wide;
    int labelChars;
    int width;
    int labelLeft;
};

class LabelAutoSizeTest : public ::testing::TestWithParam<AutoSizeCase> { };

TEST_P(LabelAutoSizeTest, DialogFollowsTheWidestLabel)
{
    const auto& c = GetParam();
    InputBoxLayoutOptions options;
    options.LabelAutoSize = true;
    options.NoIco = c.noIco;
    options.WideControls = c.wide;
    options.InputWidth = Variant(int32_t(1000));
    options.Buttons = 1;
    const std::vector<InputBoxLayoutField> fields { { FieldKind::Text, u"ab"_s },
        { FieldKind::Text, QString(c.labelChars, u'x') } };
    const InputBoxGeometry g = layout(fields, options);
    EXPECT_EQ(g.width, c.width);
    EXPECT_EQ(g.fields[1].label.left(), c.labelLeft);
    // Whatever the width, the input column and the buttons end 225 twips from the right
    // edge, where the designed dialog has them.
    EXPECT_EQ(g.fields[0].control.right() + 1, g.width - 225);
    EXPECT_EQ(g.cancel.right() + 1, g.width - 225 - (c.wide ? 64 * 15 : 0));
    EXPECT_EQ(g.fields[1].label.right() + 1, g.fields[1].control.left() - 60);
}

INSTANTIATE_TEST_SUITE_P(AutoSize, LabelAutoSizeTest,
    ::testing::Values(
        // Width = widest label + input span (2415 + 1000) + 500.
        AutoSizeCase { "NarrowLabels", true, false, 8, 800 + 3415 + 500, 215 },
        AutoSizeCase { "WideLabels", true, false, 40, 4000 + 3415 + 500, 215 },
        AutoSizeCase { "CappedAtFiveHundredPixels", true, false, 90, 7500 + 3415 + 500, 215 },
        AutoSizeCase { "WideControlsWidenTheSpan", true, true, 8, 800 + 3415 + 960 + 500, 215 },
        // The icon column comes on top, so labels never cover the icon.
        AutoSizeCase { "WithIcon", false, false, 8, 800 + 3415 + 500 + 690, 905 }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(InputBoxLayout, ALabelTooWideForTheDesignedDialogWidensIt)
{
    const std::vector<InputBoxLayoutField> fields { { FieldKind::Text, QString(30, u'x') } };
    const InputBoxGeometry g = layout(fields);
    // The label would start at 1980 - 3000; it is moved right of the icon column instead.
    EXPECT_EQ(g.fields[0].label.left(), 690 + 215);
    EXPECT_EQ(g.width, 4680 + (905 - (1980 - 3000)));
    EXPECT_EQ(g.fields[0].control.right() + 1, g.width - 225);
}

TEST(InputBoxLayout, OtherResolutionsScaleThePixelDistances)
{
    InputBoxLayoutOptions options;
    options.twipsPerPixelX = 12;
    options.twipsPerPixelY = 12;
    options.Buttons = 1;
    const InputBoxGeometry g = layout(rows({ FieldKind::Text }), options);
    // Margin 14 px = 168 twips; the row 4 px further down.
    EXPECT_EQ(g.fields[0].control.top(), 168 + 48);
    EXPECT_EQ(twipsToPixels(g.fields[0].control, 12, 12), QRect(170, 18, 201, 26));
    EXPECT_EQ(g.cancel, QRect(4455 - 1020, 384 + 336, 1020, 324));
}
