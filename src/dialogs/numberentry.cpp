#include "dialogs/numberentry.h"

#include "core/comerror.h"
#include "core/variant.h"
#include "dialogs/textedit.h"

#include <QLocale>

namespace dialogs {

int filterNumericKey(int key, QChar decimalSeparator)
{
    if (key >= '0' && key <= '9')
        return key;
    if (key == '.' || key == ',')
        return decimalSeparator.unicode();
    static const QString calculatorCharacters = QStringLiteral(":;+-/*^()%");
    if (key > 0 && key < 0x10000
        && calculatorCharacters.contains(QChar(static_cast<char16_t>(key))))
        return key;
    switch (key) {
    case KeyCode::Backspace:
    case KeyCode::CtrlC:
    case KeyCode::CtrlV:
    case KeyCode::CtrlX:
        return key;
    default:
        return 0;
    }
}

std::optional<QString> normalizeNumber(const QString& text)
{
    try {
        const double value = core::Variant(text).toDouble();
        return core::Variant(value).toText();
    } catch (const core::ComError&) {
        return std::nullopt;
    }
}

QChar localeDecimalSeparator()
{
    const QString point = QLocale().decimalPoint();
    return point.isEmpty() ? QChar(u'.') : point.at(0);
}

} // namespace dialogs
