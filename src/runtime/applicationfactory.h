#pragma once

#include "core/ludmoxexport.h"

#include <functional>
#include <memory>

namespace runtime {

class Application;

/// The process-wide factory that creates the runtime application object. The report runtime
/// installs itself as the default; tests install a fake.
class LUDMOX_EXPORT ApplicationFactory {
public:
    using Function = std::function<std::shared_ptr<Application>()>;

    /// Replaces the factory; returns the previous one.
    static Function install(Function factory);
    /// Creates an application object; raises ComError 429 ("ActiveX component can't create
    /// object") when no runtime is installed.
    static std::shared_ptr<Application> create();
};

} // namespace runtime
