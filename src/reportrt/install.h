#pragma once

namespace reportrt {

/// Installs the report runtime as the process's runtime application factory. The factory
/// hands out one application object while any holder keeps it, and a new one after.
void install();

} // namespace reportrt
