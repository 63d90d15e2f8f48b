#include "dialogs/fieldkind.h"

#include "dialogs/inputboxparamsitem.h"

namespace dialogs {

FieldKind fieldKind(const InputBoxParamsItem& item)
{
    if (item.Value.isArray()) {
        if (item.MultiSelect)
            return FieldKind::MultiSelectList;
        return item.SelectOnly ? FieldKind::DropDownList : FieldKind::EditableCombo;
    }
    if (item.IsColor)
        return FieldKind::Color;
    if (item.IsCheck)
        return FieldKind::CheckBox;
    if (item.IsMemo)
        return FieldKind::Memo;
    if (item.IsFileDialog)
        return item.AskFolder ? FieldKind::FolderPath : FieldKind::FilePath;
    return FieldKind::Text;
}

bool hasBrowseButton(FieldKind kind)
{
    switch (kind) {
    case FieldKind::Color:
    case FieldKind::Memo:
    case FieldKind::FilePath:
    case FieldKind::FolderPath:
        return true;
    default:
        return false;
    }
}

QString fieldTag(const InputBoxParamsItem& item)
{
    switch (fieldKind(item)) {
    case FieldKind::Color:
        return QStringLiteral("Color");
    case FieldKind::FilePath:
        return QStringLiteral("FileDialog");
    case FieldKind::FolderPath:
        return QStringLiteral("FolderDialog");
    case FieldKind::Memo:
    case FieldKind::Text:
        // A field marked both ways is treated as a date: the stricter entry rules win.
        if (item.DateFormat)
            return QStringLiteral("Date");
        if (item.NumericFormat)
            return QStringLiteral("Numeric");
        return {};
    default:
        return {};
    }
}

} // namespace dialogs
