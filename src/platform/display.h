#pragma once

#include "core/ludmoxexport.h"

#include <optional>

namespace platform {

/// Whether the windows the component shows reach someone who can answer them. A modal
/// dialog shown where nobody can see it waits for ever: a server started without a display
/// (ludmoxd runs offscreen then) must decide without asking instead.
class LUDMOX_EXPORT Display {
public:
    /// False without a QApplication, under the offscreen or minimal platform plugin, or when
    /// neither DISPLAY nor WAYLAND_DISPLAY is set; true otherwise, or as overridden.
    static bool isInteractive();

    /// Replaces what isInteractive() finds out (nullopt: find it out again) and returns the
    /// previous override. Tests that answer windows offscreen with simulated input are such
    /// a user.
    static std::optional<bool> setInteractiveOverride(std::optional<bool> interactive);
};

} // namespace platform
