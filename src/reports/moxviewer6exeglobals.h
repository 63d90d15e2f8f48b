#pragma once

#include "core/ludmoxexport.h"

// The parameter dialog of the reports: built from a report's parameter fields, shown, and
// its answers written back as the parameters' current values.

#include <QString>
#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

namespace dialogs {
class InputBoxParams;
}

namespace runtime {
class ParameterField;
}

namespace reports {

class MoxReport115;

/// Asks for every parameter of `Parameters` that still needs a value and adds the answers
/// as current values. Shows nothing (and leaves Cancelled alone) when no parameter needs a
/// value; otherwise Cancelled tells whether the answer was cancelled. A host that handles
/// `Report`'s ShowParametersDialogEvent gets the field list and answers in place of the
/// dialog (a failing handler counts as cancelled); without such a host the input dialog
/// asks, and where no display can show it (platform::Display) that counts as cancelled.
/// `Report`, when given, supplies the owner window (its engine's main window). Runtime
/// errors are skipped statement by statement; nothing is raised.
void PromptParameters(const std::vector<std::shared_ptr<runtime::ParameterField>>& Parameters,
    bool& Cancelled, MoxReport115* Report);

/// Shows the input dialog for `Params` modally with the buttons value (1: OK and Cancel)
/// and title, after taking the date-entry settings from the user's short-date format. An
/// item named "MDIHandle" gives the owner window and is removed first. True when the user
/// confirmed; false when cancelled or when the dialog could not be shown (also for want of a
/// display).
bool ShowInputDialog(
    const std::shared_ptr<dialogs::InputBoxParams>& Params, int32_t Buttons, const QString& Title);

/// Makes the window with handle `OwnerHwnd` the owner of the window `Hwnd`; returns the
/// previous owner's handle (0 for none).
int32_t SetOwnerWindow(int32_t Hwnd, int32_t OwnerHwnd);

/// What shows the prepared dialog: the model (without "MDIHandle"), the buttons value, the
/// title and the owner window's handle; true when the user confirmed.
using InputBoxPresenter = std::function<bool(const std::shared_ptr<dialogs::InputBoxParams>& params,
    int32_t buttons, const QString& title, int32_t owner)>;

/// Replaces what shows the dialog (tests answer it without a window); null restores the
/// input dialog. Returns the previous presenter.
LUDMOX_EXPORT InputBoxPresenter SetInputBoxPresenter(InputBoxPresenter presenter);

} // namespace reports
