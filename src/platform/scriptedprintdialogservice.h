#pragma once

#include "platform/printdialogservice.h"

#include <QList>
#include <deque>
#include <functional>

namespace platform {

/// A print dialog that answers from a script, for tests: each show() records the request
/// and returns the next queued result, or asks the handler when one is set (a handler may
/// raise to simulate a failing dialog). With nothing queued and no handler the dialog is
/// cancelled.
class ScriptedPrintDialogService : public PrintDialogService {
public:
    using Handler = std::function<Result(const Request&)>;

    void enqueue(const Result& result) { m_results.push_back(result); }
    void setHandler(Handler handler);

    /// Every request shown so far, oldest first.
    const QList<Request>& requests() const { return m_requests; }

    Result show(const Request& request) override;

private:
    std::deque<Result> m_results;
    Handler m_handler;
    QList<Request> m_requests;
};

} // namespace platform
