#pragma once

#include "core/variant.h"

#include <QString>
#include <cstdint>
#include <vector>

namespace dialogs {

/// Ids of the dialogs' fixed texts.
namespace UIString {
constexpr int16_t OK = 1; // "&OK"
constexpr int16_t Cancel = 2; // "&Cancel"
constexpr int16_t Today = 3; // "Today: "
constexpr int16_t Calendar = 4; // "Calendar"
constexpr int16_t EnterParameterValues = 5; // "Enter parameter values"
} // namespace UIString

/// The dialog text `id` (1 to 5) in the language of gLanguage (3 English, 4 Estonian,
/// 5 Latvian; any other code gives English); "" for any other id.
///
/// With arguments, each "%s" (in any letter case) is replaced by the next argument as
/// text; placeholders without an argument disappear and surplus arguments are appended.
QString GetUIString(int16_t id, const std::vector<core::Variant>& args = {});

/// The "%s" filling of GetUIString: `text` split at each "%s" (any letter case), each part
/// followed by the argument of its number as text.
QString FillUIString(const QString& text, const std::vector<core::Variant>& args);

} // namespace dialogs
