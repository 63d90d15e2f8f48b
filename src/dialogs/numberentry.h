#pragma once

#include <QChar>
#include <QString>
#include <optional>

namespace dialogs {

/// The key filter of numeric (and colour) fields: digits, the calculator characters
/// : ; . , + - / * ^ ( ) %, Backspace and the clipboard keys Ctrl+C, Ctrl+V, Ctrl+X pass;
/// "." and "," both become `decimalSeparator`. Any other key gives 0: it is refused and the
/// field beeps.
int filterNumericKey(int key, QChar decimalSeparator);

/// A numeric field's text when it is left: the number it holds, written back in the
/// locale's own form ("1.50" -> "1,5" with a decimal comma); nothing when the text is not
/// a number, so the text stays as typed.
std::optional<QString> normalizeNumber(const QString& text);

/// The decimal separator of the user's locale.
QChar localeDecimalSeparator();

} // namespace dialogs
