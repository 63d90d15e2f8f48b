#pragma once

#include "core/ludmoxexport.h"

#include <functional>
#include <memory>

namespace automation {

class Registry;

/// The automation server: JSON-RPC 2.0, one message per line, requests both ways (the host
/// calls the component; the component raises events to the host). One thread; while the
/// server waits for the host's answer to an event it serves the host's own requests, so a
/// host may call back from inside its handler.
///
/// The server ends when its input closes or after `shutdown`, and then lets go of every
/// object the host still held.
class LUDMOX_EXPORT Server {
public:
    /// Reads requests from `input` and writes answers to `output` (file descriptors the
    /// caller keeps open). Needs a QCoreApplication for the event loop.
    Server(int input, int output, const Registry& registry);
    ~Server();
    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;

    /// Serves until the input ends or `shutdown`; returns the process exit code (0).
    int run();

    /// Objects the host holds right now.
    size_t heldObjects() const;

    /// Runs when the input closes, whatever the server is doing at the time; the server
    /// application uses it to end modal dialogs nobody can answer any more.
    void setInputEndedHandler(std::function<void()> handler);

private:
    class Private;
    std::unique_ptr<Private> d;
};

} // namespace automation
