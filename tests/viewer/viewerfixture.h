#pragma once

#include "reportfixture.h"
#include "support/scriptedviewercontrol.h"

#include <QCoreApplication>
#include <QEvent>
#include <span>
#include <vector>

namespace viewertest {

using namespace Qt::StringLiterals;

/// A report test whose viewer controls are scripted, recording the events an event source
/// raises.
class ViewerTest : public reporttest::ReportTest {
protected:
    struct Event {
        int32_t dispid = 0;
        QString name;
        std::vector<core::Variant> args;
    };

    void TearDown() override
    {
        // Controls released inside their own notifications go once control returns.
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        reporttest::ReportTest::TearDown();
    }

    /// Records every event of source; `answer` may write by-reference results.
    void recordViewerEvents(core::EventSource& source,
        std::function<void(const QString&, std::span<core::Variant>)> answer = {})
    {
        source.connect(
            [this, answer](int32_t dispid, const QString& name, std::span<core::Variant> args) {
                raised.push_back({ dispid, name, { args.begin(), args.end() } });
                if (answer)
                    answer(name, args);
            });
    }

    /// A report that loads: one OLE DB table and no parameters.
    std::shared_ptr<reports::MoxReport115> loadableReport()
    {
        addOrdersReport();
        return open();
    }

    std::shared_ptr<void> factory = fakeruntime::ScriptedViewerControl::install();
    std::vector<Event> raised;
};

} // namespace viewertest
