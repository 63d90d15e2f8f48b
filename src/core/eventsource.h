#pragma once

#include "core/variant.h"

#include <QString>
#include <functional>
#include <memory>
#include <span>
#include <vector>

namespace core {

/// The outgoing (event) interface of an object. Handlers receive the event's dispatch id,
/// its name and its arguments in declaration order; a handler writes by-reference results
/// into the arguments. Handlers run in the order they were connected.
class EventSource {
public:
    using Handler
        = std::function<void(int32_t dispid, const QString& name, std::span<Variant> args)>;

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
    /// Lets raise() notice that a handler destroyed this source; a copy gets its own.
    struct Lifetime {
        std::shared_ptr<char> token = std::make_shared<char>();
        Lifetime() = default;
        Lifetime(const Lifetime&)
            : Lifetime()
        { }
        Lifetime& operator=(const Lifetime&) { return *this; }
    };

    bool isConnected(int cookie) const;

    std::vector<Connection> m_handlers;
    int m_nextCookie = 1;
    Lifetime m_lifetime;
};

} // namespace core
