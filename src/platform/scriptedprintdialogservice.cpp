#include "platform/scriptedprintdialogservice.h"

#include <utility>

namespace platform {

void ScriptedPrintDialogService::setHandler(Handler handler)
{
    m_handler = std::move(handler);
}

PrintDialogService::Result ScriptedPrintDialogService::show(const Request& request)
{
    m_requests.append(request);
    if (!m_results.empty()) {
        Result result = m_results.front();
        m_results.pop_front();
        return result;
    }
    if (m_handler)
        return m_handler(request);
    return Result();
}

} // namespace platform
