#include "core/eventsource.h"

#include "core/comerror.h"

#include <algorithm>

namespace core {

bool EventSource::Connection::takes(int32_t dispid) const
{
    return !dispids || std::find(dispids->begin(), dispids->end(), dispid) != dispids->end();
}

int EventSource::connect(Handler handler, std::optional<std::vector<int32_t>> dispids)
{
    if (!handler)
        throw ComError::basic(ErrorNumber::InvalidProcedureCall);
    const int cookie = m_nextCookie++;
    m_handlers.push_back({ cookie, std::move(handler), std::move(dispids) });
    return cookie;
}

bool EventSource::hasHandlerFor(int32_t dispid) const
{
    return std::any_of(m_handlers.begin(), m_handlers.end(),
        [dispid](const Connection& c) { return c.dispids && c.takes(dispid); });
}

void EventSource::disconnect(int cookie)
{
    std::erase_if(m_handlers, [cookie](const Connection& c) { return c.cookie == cookie; });
}

bool EventSource::isConnected(int cookie) const
{
    return std::any_of(m_handlers.begin(), m_handlers.end(),
        [cookie](const Connection& c) { return c.cookie == cookie; });
}

void EventSource::raise(int32_t dispid, const QString& name, std::span<Variant> args) const
{
    // Handlers may connect, disconnect or even destroy this source while the event runs:
    // walk a copy, skip handlers disconnected meanwhile, and stop once the source is gone.
    const std::vector<Connection> connections = m_handlers;
    const std::weak_ptr<char> alive = m_lifetime.token;
    for (const Connection& connection : connections) {
        if (alive.expired())
            return;
        if (connection.takes(dispid) && isConnected(connection.cookie))
            connection.handler(dispid, name, args);
    }
}

} // namespace core
