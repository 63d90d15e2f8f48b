#pragma once

#include <QString>

namespace dialogs {

class InputBoxParamsItem;

/// The one control kind the dialog gives a field.
enum class FieldKind {
    MultiSelectList, // lstData
    DropDownList, // cmbSData: choices only
    EditableCombo, // cmbData: choices or free text
    Color, // txMData swatch with a colour picker button
    CheckBox, // chkData
    Memo, // txMData with the memo editor button, or the calendar for date fields
    FilePath, // txMData with a file picker button
    FolderPath, // txMData with a folder picker button
    Text, // txData: plain, password, date or number
};

/// The kind of a field; the first rule that holds wins: an array value makes a choice
/// field, then colour, check box, memo, path and finally plain text.
FieldKind fieldKind(const InputBoxParamsItem& item);

/// Fields shown as a text box with a browse button beside it.
bool hasBrowseButton(FieldKind kind);

/// What a field's controls hold, as their tag: "Color", "FileDialog", "FolderDialog",
/// "Date", "Numeric" or "" (memo, check box, choice and plain text fields).
QString fieldTag(const InputBoxParamsItem& item);

} // namespace dialogs
