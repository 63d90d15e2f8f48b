#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>

namespace dialogs {

/// One field of the parameter input dialog: a plain record that the report's parameter code
/// fills, a host may change through late binding, and the dialog reads and writes back.
///
/// The dialog writes only `Index` (when it is built), `Value` and, for multi-selection
/// lists, `SelectionCount` (after OK). Every field starts at False / 0 / "" / Empty.
class LUDMOX_EXPORT InputBoxParamsItem : public core::Object {
public:
    QString className() const override { return QStringLiteral("InputBoxParamsItem"); }

    /// The key of the field in its list; shown as the label when `Label` is "".
    QString Name;
    /// Initial value, or the choices when it is an array; the entered value after OK.
    core::Variant Value;
    QString LabelToolTip;
    QString Label;
    /// The choice selected initially (compared as text without regard to case).
    core::Variant DefaultValue;
    bool MultiSelect = false;
    bool SelectOnly = false;
    bool IsCheck = false;
    bool IsMemo = false;
    bool DateFormat = false;
    bool MustExist = false;
    bool NumericFormat = false;
    /// After OK, for a multi-selection list: how many entries were selected.
    int32_t SelectionCount = 0;
    bool IsColor = false;
    bool IsFileDialog = false;
    /// Carried for hosts; the dialog does not act on it.
    bool Reload = false;
    bool ReadOnly = false;
    /// Carried for hosts; the first field always receives the initial focus.
    bool SetFocus = false;
    bool AskFolder = false;
    /// The 1-based position of the field in its list, set by the dialog.
    int32_t Index = 0;
    /// Text beside a check box; nine spaces are shown when it is "".
    QString Caption;
    bool Password = false;
};

} // namespace dialogs
