#include "platform/printdialogservice.h"

#include "platform/qtprintdialogservice.h"

#include <utility>

namespace platform {

namespace {

std::shared_ptr<PrintDialogService>& activeService()
{
    static std::shared_ptr<PrintDialogService> service;
    return service;
}

} // namespace

std::shared_ptr<PrintDialogService> PrintDialogService::active()
{
    std::shared_ptr<PrintDialogService>& service = activeService();
    if (!service)
        service = std::make_shared<QtPrintDialogService>();
    return service;
}

void PrintDialogService::setActive(std::shared_ptr<PrintDialogService> service)
{
    activeService() = std::move(service);
}

} // namespace platform
