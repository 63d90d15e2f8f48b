#include "dialogs/inputboxlayout.h"

#include "core/comerror.h"

#include <QtMath>
#include <algorithm>

namespace dialogs {

namespace {

// The designed form and its control templates, in twips.
constexpr int FormWidth = 4680;
constexpr int LabelTemplateHeight = 204;
constexpr int LabelGap = 60; // between a label's right edge and the input column
constexpr int InputLeft = 2040;
constexpr int InputWidth = 2415;
constexpr int TextHeight = 315;
constexpr int ListHeight = 735;
constexpr int ButtonTextWidth = 2055; // txMData, which leaves room for its browse box
constexpr int BrowseBoxLeft = 4125;
constexpr int BrowseBoxWidth = 330;
constexpr int BrowseButtonInset = 15;
constexpr int BrowseButtonWidth = 255;
constexpr int BrowseButtonHeight = 240;
// What the auto-sized width adds to the widest label and the input column: the left
// margin, the gap between label and input and the margin right of the input column.
constexpr int AutoSizeAllowance = 500;
// The label column never starts further left than this (beside the icon column).
constexpr int LabelMargin = AutoSizeAllowance - (FormWidth - InputLeft - InputWidth) - LabelGap;

// Screen distances in pixels.
constexpr int ButtonWidthPx = 85;
constexpr int ButtonHeightPx = 27;
constexpr int MarginPx = 14;
constexpr int IconSizePx = 32;
constexpr int RowPitchPx = 30;
constexpr int RowOffsetPx = 4;
constexpr int LabelOffsetPx = 3;
constexpr int WidestLabelPx = 500;
constexpr int WideShiftPx = 2 * IconSizePx;

/// The whole-dialog extra width: a number, else 0.
int extraWidth(const core::Variant& value)
{
    try {
        return value.isNumeric() ? value.toLong() : 0;
    } catch (const core::ComError&) {
        return 0;
    }
}

/// The list height: a positive number, else the designed height. Empty counts as
/// numeric in Basic and would give invisible lists, so only a real value is taken.
int listHeight(const core::Variant& value)
{
    try {
        if (value.isEmpty() || !value.isNumeric())
            return ListHeight;
        const int height = value.toLong();
        return height > 0 ? height : ListHeight;
    } catch (const core::ComError&) {
        return ListHeight;
    }
}

MessageIcon iconFor(int32_t buttons)
{
    switch (buttons & 240) {
    case 16:
        return MessageIcon::Critical;
    case 48:
        return MessageIcon::Exclamation;
    case 64:
        return MessageIcon::Information;
    default:
        return MessageIcon::Question;
    }
}

void shift(QRect& rect, int dx)
{
    if (!rect.isNull())
        rect.translate(dx, 0);
}

} // namespace

InputBoxGeometry layoutInputBox(const std::vector<InputBoxLayoutField>& fields,
    const InputBoxLayoutOptions& options, const LabelWidthFunction& labelWidth)
{
    const double tx = options.twipsPerPixelX;
    const double ty = options.twipsPerPixelY;
    const auto pxX = [tx](double pixels) { return qRound(pixels * tx); };
    const auto pxY = [ty](double pixels) { return qRound(pixels * ty); };

    InputBoxGeometry g;
    const int margin = pxY(MarginPx);
    const int W = extraWidth(options.InputWidth);
    const int H = listHeight(options.InputHeight);
    g.extraWidth = W;
    g.listHeight = H;
    const bool wide = options.NoIco && options.WideControls;
    const int wideShift = wide ? pxX(WideShiftPx) : 0;
    const int iconColumn = options.NoIco ? 0 : pxX(IconSizePx) + margin;
    const int inputLeft = InputLeft - wideShift;
    const int widestLabel = pxX(WidestLabelPx);

    int listsAbove = 0;
    for (size_t i = 0; i < fields.size(); ++i) {
        const int n = static_cast<int>(i) + 1;
        const FieldKind kind = fields[i].kind;
        InputBoxFieldGeometry f;
        // Every row, combo rows included, moves down by the extra height of each list
        // above it, so that no row covers a list taller than the designed one.
        const int top
            = (H - TextHeight) * listsAbove + margin + pxY((n - 1) * RowPitchPx + RowOffsetPx);

        switch (kind) {
        case FieldKind::MultiSelectList:
            f.control = QRect(inputLeft, top, InputWidth + W + wideShift, H);
            ++listsAbove;
            break;
        case FieldKind::CheckBox:
            // Moves with the input column but keeps its width: it does not grow.
            f.control = QRect(inputLeft, top, InputWidth + W, TextHeight);
            break;
        case FieldKind::Color:
        case FieldKind::Memo:
        case FieldKind::FilePath:
        case FieldKind::FolderPath:
            f.control = QRect(inputLeft, top, ButtonTextWidth + W + wideShift, TextHeight);
            // The box stays at the right end of the input column: its text box takes the
            // wide controls' extra width on its left.
            f.browseBox = QRect(BrowseBoxLeft + W, top, BrowseBoxWidth, TextHeight);
            f.browseButton = options.xpStyle ? QRect(0, 0, BrowseBoxWidth, TextHeight)
                                             : QRect(BrowseButtonInset, BrowseButtonInset,
                                                 BrowseButtonWidth, BrowseButtonHeight);
            break;
        default:
            f.control = QRect(inputLeft, top, InputWidth + W + wideShift, TextHeight);
            break;
        }

        const int width = std::clamp(labelWidth ? labelWidth(fields[i].label) : 0, 0, widestLabel);
        const int right = inputLeft - LabelGap;
        f.label = QRect(right - width, top + pxY(LabelOffsetPx), width, LabelTemplateHeight);
        g.fields.push_back(f);
    }

    g.contentHeight
        = (H - TextHeight) * listsAbove + pxY(static_cast<int>(fields.size()) * RowPitchPx);
    const int C = g.contentHeight;
    const int iconSize = pxY(IconSizePx);
    int buttonTop = 0;
    int iconTop = 0;
    if (C < iconSize) {
        iconTop = margin;
        buttonTop = iconSize + 2 * margin;
    } else {
        iconTop = (C - iconSize) / 2 + margin;
        buttonTop = C + 2 * margin;
    }
    const int buttonWidth = pxX(ButtonWidthPx);
    const int buttonHeight = pxY(ButtonHeightPx);
    // Tall enough for the button row also when the rows are lower than the icon.
    g.height = std::max(C + buttonHeight + 3 * margin, buttonTop + buttonHeight + margin);

    switch (options.Buttons & 15) {
    case 0:
        g.buttonSet = ButtonSet::OKOnly;
        break;
    case 1:
        g.buttonSet = ButtonSet::OKCancel;
        break;
    default:
        g.buttonSet = ButtonSet::Designed;
        break;
    }
    const int R = InputLeft + InputWidth + W;
    if (g.buttonSet == ButtonSet::OKOnly) {
        g.ok = QRect(R - buttonWidth, buttonTop, buttonWidth, buttonHeight);
    } else {
        // The designed set shows both buttons too; placed as a pair they cannot overlap.
        g.cancel = QRect(R - buttonWidth, buttonTop, buttonWidth, buttonHeight);
        g.ok = QRect(g.cancel.left() - margin - buttonWidth, buttonTop, buttonWidth, buttonHeight);
        g.cancelVisible = true;
    }
    g.cancelIsCancel = g.cancelVisible && !options.NoCancel;
    g.okIsDefault = !options.NoDefault;
    if (wide) {
        g.ok.translate(-wideShift, 0);
        shift(g.cancel, -wideShift);
    }

    g.iconVisible = !options.NoIco;
    g.icon = iconFor(options.Buttons);
    g.iconPosition = QPoint(pxX(MarginPx), iconTop);

    if (options.LabelLeftAlign && !g.fields.empty()) {
        const auto widest = std::min_element(g.fields.begin(), g.fields.end(),
            [](const auto& a, const auto& b) { return a.label.left() < b.label.left(); });
        const int left = widest->label.left();
        for (auto& f : g.fields)
            f.label.moveLeft(left);
        g.labelsLeftAligned = true;
    }

    const int designedWidth = FormWidth + W;
    int dx = 0;
    if (options.LabelAutoSize) {
        int widest = 0;
        for (const auto& f : g.fields)
            widest = std::max(widest, f.label.width());
        const int inputSpan = InputWidth + W + wideShift;
        g.width = widest + inputSpan + AutoSizeAllowance + iconColumn;
        dx = g.width - designedWidth;
    } else {
        int leftmost = InputLeft;
        for (const auto& f : g.fields)
            leftmost = std::min(leftmost, f.label.left());
        dx = std::max(0, iconColumn + LabelMargin - leftmost);
        g.width = designedWidth + dx;
    }
    // The content keeps its distance from the right edge as the dialog changes width.
    for (auto& f : g.fields) {
        shift(f.label, dx);
        shift(f.control, dx);
        shift(f.browseBox, dx);
    }
    g.ok.translate(dx, 0);
    shift(g.cancel, dx);
    return g;
}

QRect twipsToPixels(const QRect& twips, double twipsPerPixelX, double twipsPerPixelY)
{
    return QRect(qRound(twips.x() / twipsPerPixelX), qRound(twips.y() / twipsPerPixelY),
        qRound(twips.width() / twipsPerPixelX), qRound(twips.height() / twipsPerPixelY));
}

} // namespace dialogs
