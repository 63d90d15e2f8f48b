#pragma once

#include "dialogs/textedit.h"

#include <QStringList>

namespace dialogs {

/// A combo box as completion sees it: its text, selection and list index (-1 for none).
struct ComboEdit {
    TextEdit edit;
    int listIndex = -1;
    friend bool operator==(const ComboEdit&, const ComboEdit&) = default;
};

struct ComboKeyOutcome {
    ComboEdit combo;
    int key = 0; // still to be typed; 0 when consumed
};

/// Completes what is typed into a combo from its entries: when the selection reaches the
/// end of the text, the text left of the selection plus the typed character (Backspace:
/// minus one character; KeyCode::Delete: as it is) is looked up as a prefix of the
/// entries, compared in upper case, and the first match is shown with its untyped part
/// selected. Without a match an editable combo shows the prefix, a drop-down list keeps
/// its entry. Enter, Escape, other control keys, keys typed in the middle of the text and
/// combos without entries are left to the combo.
ComboKeyOutcome AutoCompleteCombo(
    const QStringList& entries, const ComboEdit& combo, int key, bool editable);

} // namespace dialogs
