#include "runtime/viewercontrolfactory.h"

#include "core/comerror.h"
#include "runtime/viewercontrol.h"

#include <utility>

namespace runtime {

namespace {
ViewerControlFactory::Function& factory()
{
    static ViewerControlFactory::Function instance;
    return instance;
}
} // namespace

ViewerControlFactory::Function ViewerControlFactory::install(Function function)
{
    return std::exchange(factory(), std::move(function));
}

std::unique_ptr<ViewerControl> ViewerControlFactory::create()
{
    std::unique_ptr<ViewerControl> control;
    if (factory())
        control = factory()();
    if (!control)
        throw core::ComError(429, QStringLiteral("LUDMoxViewer115"),
            QStringLiteral("ActiveX component can't create object"));
    return control;
}

} // namespace runtime
