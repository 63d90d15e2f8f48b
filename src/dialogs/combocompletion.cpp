#include "dialogs/combocompletion.h"

namespace dialogs {

ComboKeyOutcome AutoCompleteCombo(
    const QStringList& entries, const ComboEdit& combo, int key, bool editable)
{
    if (key == KeyCode::Enter || key == KeyCode::Escape)
        return { combo, key };
    const TextEdit& edit = combo.edit;
    if (edit.selStart + edit.selLength != edit.text.size() || entries.isEmpty())
        return { combo, key };

    QString prefix;
    if (key == KeyCode::Backspace)
        prefix = edit.text.left(std::max(edit.selStart - 1, 0));
    else if (key == KeyCode::Delete)
        prefix = edit.text.left(edit.selStart);
    else if (key < 32)
        return { combo, key };
    else
        prefix = edit.text.left(edit.selStart) + QChar(static_cast<char16_t>(key));

    const QString wanted = prefix.toUpper();
    for (qsizetype i = 0; i < entries.size(); ++i) {
        const QString& entry = entries.at(i);
        if (entry.toUpper().startsWith(wanted)) {
            const int typed = static_cast<int>(prefix.size());
            return {
                { { entry, typed, static_cast<int>(entry.size()) - typed }, static_cast<int>(i) }, 0
            };
        }
    }
    if (!editable)
        return { combo, 0 };
    return { { { prefix, static_cast<int>(prefix.size()), 0 }, -1 }, 0 };
}

} // namespace dialogs
