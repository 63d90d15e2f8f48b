#pragma once

#include "core/ludmoxexport.h"
#include "core/variant.h"

#include <QString>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <vector>

namespace core {

/// The outgoing (event) interface of an object. Handlers receive the event's dispatch id,
/// its name and its arguments in declaration order; a handler writes by-reference results
/// into the arguments. Handlers run in the order they were connected.
class LUDMOX_EXPORT EventSource {
public:
    using Handler
        = std::function<void(int32_t dispid, const QString& name, std::span<Variant> args)>;

    /// Returns a cookie for disconnect. `dispids` lists the events the handler takes; without
    /// a list it takes every event of the source.
    int connect(Handler handler, std::optional<std::vector<int32_t>> dispids = std::nullopt);
    void disconnect(int cookie);
    bool hasHandlers() const { return !m_handlers.empty(); }
    /// Whether a handler was connected for the event `dispid` by naming it in its list. An
    /// object may leave a decision to such a handler and take it itself otherwise; handlers
    /// connected for every event do not count, as they cannot say that they answer it.
    bool hasHandlerFor(int32_t dispid) const;

protected:
    void raise(int32_t dispid, const QString& name, std::span<Variant> args) const;

private:
    struct Connection {
        int cookie;
        Handler handler;
        std::optional<std::vector<int32_t>> dispids; // none: every event

        bool takes(int32_t dispid) const;
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
