#pragma once

#include "core/variant.h"
#include "dialogs/fieldkind.h"

#include <QRect>
#include <QString>
#include <cstdint>
#include <functional>
#include <vector>

namespace dialogs {

/// Which buttons the dialog shows, from the low four bits of its Buttons value.
enum class ButtonSet {
    OKOnly, // 0
    OKCancel, // 1
    Designed, // anything else: both buttons with their English captions
};

/// The message-box icon chosen by the icon bits (Buttons and 240) of the Buttons value.
enum class MessageIcon { Critical, Question, Exclamation, Information };

/// One row of the dialog as the layout needs it.
struct InputBoxLayoutField {
    FieldKind kind = FieldKind::Text;
    QString label; // the text shown: the item's Label, or its Name when that is ""
};

/// The options of the whole dialog (the field list's own options, the Buttons value and
/// the screen's twips per pixel).
struct InputBoxLayoutOptions {
    bool NoIco = false;
    bool LabelAutoSize = false;
    bool LabelLeftAlign = false;
    bool WideControls = false;
    bool NoDefault = false;
    bool NoCancel = false;
    core::Variant InputWidth;
    core::Variant InputHeight;
    int32_t Buttons = 0;
    /// The engine's visual-style flag: the browse button fills its container.
    bool xpStyle = false;
    double twipsPerPixelX = 15.0;
    double twipsPerPixelY = 15.0;
};

/// Where one field's controls go, in twips within the dialog's client area.
struct InputBoxFieldGeometry {
    QRect label;
    QRect control;
    /// Only for fields with a browse button: its container, and the button within it.
    QRect browseBox;
    QRect browseButton;
};

/// The placed dialog, in twips within its client area (the window frame is outside).
struct InputBoxGeometry {
    std::vector<InputBoxFieldGeometry> fields;
    ButtonSet buttonSet = ButtonSet::OKOnly;
    QRect ok;
    QRect cancel;
    bool cancelVisible = false;
    bool okIsDefault = true; // Enter presses OK
    bool cancelIsCancel = false; // Escape presses Cancel
    bool iconVisible = false;
    MessageIcon icon = MessageIcon::Question;
    QPoint iconPosition; // top-left of the 32 x 32 px icon
    int contentHeight = 0; // the rows' height, C
    int listHeight = 0; // H
    int extraWidth = 0; // W
    int width = 0;
    int height = 0;
    /// Labels are drawn left-justified (LabelLeftAlign); otherwise right-justified.
    bool labelsLeftAligned = false;
};

/// The width of a label's text in twips.
using LabelWidthFunction = std::function<int(const QString& text)>;

/// Places the parameter dialog's rows, icon and buttons.
///
/// Rows are 30 px apart from a 14 px margin; every list field above a row pushes it down
/// by (list height - text height). Labels end 60 twips before the input column and are as
/// wide as their text (at most 500 px). The buttons sit at the right edge of the input
/// column below the rows, or below the icon when the rows are lower than it. With
/// LabelAutoSize the dialog is as wide as the widest label plus the input column plus 500
/// twips (plus the icon column); otherwise it is the designed 4680 twips plus the extra
/// width, widened only when a label would not fit.
InputBoxGeometry layoutInputBox(const std::vector<InputBoxLayoutField>& fields,
    const InputBoxLayoutOptions& options, const LabelWidthFunction& labelWidth);

/// A rectangle in twips as pixels (x and widths by the horizontal factor).
QRect twipsToPixels(const QRect& twips, double twipsPerPixelX, double twipsPerPixelY);

} // namespace dialogs
