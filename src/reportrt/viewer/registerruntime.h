#pragma once

#include "core/ludmoxexport.h"

namespace reportrt {

/// Registers the report runtime: installs it as the process's runtime application factory
/// (one application object while any holder keeps it, and a new one after), and installs
/// its printing and its writers in the writer table, and its preview control as the
/// process's viewer control factory (creating one raises core::ComError without a
/// QApplication). Calling it again changes nothing.
LUDMOX_EXPORT void registerRuntime();

} // namespace reportrt
