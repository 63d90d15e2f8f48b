#include "runtime/applicationfactory.h"

#include "core/comerror.h"
#include "runtime/application.h"

#include <utility>

namespace runtime {

namespace {
ApplicationFactory::Function& factory()
{
    static ApplicationFactory::Function instance;
    return instance;
}
} // namespace

ApplicationFactory::Function ApplicationFactory::install(Function function)
{
    return std::exchange(factory(), std::move(function));
}

std::shared_ptr<Application> ApplicationFactory::create()
{
    std::shared_ptr<Application> application;
    if (factory())
        application = factory()();
    if (!application)
        throw core::ComError(429, QStringLiteral("LUDMoxViewer115"),
            QStringLiteral("ActiveX component can't create object"));
    return application;
}

} // namespace runtime
