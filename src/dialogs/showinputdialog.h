#pragma once

#include "inputboxparams.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace dialogs {

/// Runs the parameter dialog for `params` modally and tells whether the user confirmed.
///
/// Takes the date-entry settings from the user's locale first. An item "MDIHandle" is not a
/// field: its Value is the window that owns the dialog, and it is removed from the list
/// before the dialog is built. Any failure while the dialog is prepared or shown counts as
/// Cancel.
bool ShowInputDialog(
    const std::shared_ptr<InputBoxParams>& params, int32_t buttons, const QString& title);

} // namespace dialogs
