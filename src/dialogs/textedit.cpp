#include "dialogs/textedit.h"

namespace dialogs {

TextEdit typeKey(TextEdit edit, int key)
{
    const bool hasSelection = edit.selLength > 0;
    if (key == KeyCode::Backspace || key == KeyCode::Delete) {
        if (!hasSelection) {
            if (key == KeyCode::Backspace && edit.selStart > 0) {
                edit.selStart -= 1;
                edit.selLength = 1;
            } else if (key == KeyCode::Delete && edit.selStart < edit.text.size()) {
                edit.selLength = 1;
            }
        }
        edit.text.remove(edit.selStart, edit.selLength);
        edit.selLength = 0;
        return edit;
    }
    if (key < 32)
        return edit;
    edit.text.replace(edit.selStart, edit.selLength, QChar(static_cast<char16_t>(key)));
    edit.selStart += 1;
    edit.selLength = 0;
    return edit;
}

} // namespace dialogs
