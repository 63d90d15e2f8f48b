#include "platform/dialogservice.h"

#include "platform/qtdialogservice.h"

#include <utility>

namespace platform {

namespace {

std::shared_ptr<DialogService>& activeService()
{
    static std::shared_ptr<DialogService> service;
    return service;
}

} // namespace

std::shared_ptr<DialogService> DialogService::active()
{
    std::shared_ptr<DialogService>& service = activeService();
    if (!service)
        service = std::make_shared<QtDialogService>();
    return service;
}

void DialogService::setActive(std::shared_ptr<DialogService> service)
{
    activeService() = std::move(service);
}

} // namespace platform
