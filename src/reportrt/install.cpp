#include "install.h"

#include "application.h"
#include "runtime/applicationfactory.h"

namespace reportrt {

void install()
{
    runtime::ApplicationFactory::install([]() -> std::shared_ptr<runtime::Application> {
        static std::weak_ptr<Application> current;
        auto application = current.lock();
        if (!application) {
            application = std::make_shared<Application>();
            current = application;
        }
        return application;
    });
}

} // namespace reportrt
