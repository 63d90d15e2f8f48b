#pragma once

#include "core/ludmoxexport.h"

#include <functional>
#include <memory>

namespace runtime {

class ViewerControl;

/// Creates the process's viewer controls. The report runtime installs itself; tests install a
/// scripted control.
class LUDMOX_EXPORT ViewerControlFactory {
public:
    using Function = std::function<std::unique_ptr<ViewerControl>()>;

    /// Replaces the factory; returns the previous one.
    static Function install(Function factory);
    /// Raises ComError 429 when no runtime viewer is installed.
    static std::unique_ptr<ViewerControl> create();
};

} // namespace runtime
