#pragma once

#include "variant.h"

#include <QString>

#include <functional>
#include <span>
#include <vector>

namespace core {

/// The outgoing (event) interface of an object. Handlers receive the event's dispatch id,
/// its name and its arguments in declaration order; a handler writes by-reference results
/// into the arguments. Handlers run in the order they were connected.
class EventSource {
public:
    using Handler = std::function<void(int32_t dispid, const QString& name, std::span<Variant> args)>;

    /// Returns a cookie for disconnect.
    int connect(Handler handler);
    void disconnect(int cookie);
    bool hasHandlers() const { return !m_handlers.empty(); }

protected:
    void raise(int32_t dispid, const QString& name, std::span<Variant> args) const;

private:
    struct Connection {
        int cookie;
        Handler handler;
    };
    std::vector<Connection> m_handlers;
    int m_nextCookie = 1;
};

} // namespace core
