#pragma once

#include <QString>

namespace dialogs {

/// The state of a one-line text box as the key handlers see it: the text and the
/// selection (start is also the caret position; length 0 means nothing is selected).
struct TextEdit {
    QString text;
    int selStart = 0;
    int selLength = 0;

    QString selectedText() const { return text.mid(selStart, selLength); }
    /// The whole text is selected (and there is text to select).
    bool isAllSelected() const
    {
        return selLength > 0 && selStart == 0 && selLength == text.size();
    }

    friend bool operator==(const TextEdit&, const TextEdit&) = default;
};

/// A key after a handler has seen it: the possibly changed text box and the key that is
/// still to be typed, 0 when the handler consumed it.
struct KeyOutcome {
    TextEdit edit;
    int key = 0;
};

/// Character codes of the keys the handlers treat specially.
namespace KeyCode {
constexpr int CtrlC = 3;
constexpr int CtrlD = 4;
constexpr int Backspace = 8;
constexpr int Enter = 13;
constexpr int CtrlV = 22;
constexpr int CtrlX = 24;
constexpr int Escape = 27;
/// The Delete key. It has no character of its own; 127 keeps it apart from ".", whose
/// character code is the Delete key's virtual key code.
constexpr int Delete = 127;
} // namespace KeyCode

/// What a text box does with a key nobody consumed: a printable character replaces the
/// selection, Backspace removes the selection or the character before the caret, Delete
/// the selection or the character after it; other control keys change nothing.
TextEdit typeKey(TextEdit edit, int key);

} // namespace dialogs
