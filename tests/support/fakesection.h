#pragma once

#include "fakeobject.h"
#include "fakereportobject.h"
#include "runtime/section.h"

#include <map>

namespace fakeruntime {

class FakeReport;

/// A section of a fake report. Logged as `Section(<name>)`.
class FakeSection : public runtime::Section, public FakeObject {
public:
    struct State {
        QString name;
        std::vector<std::shared_ptr<FakeReportObject>> objects;
    };

    FakeSection(std::weak_ptr<Script> script, State state);

    QString label() const override { return state.name; }

    /// Adds a report object at the end of the section.
    std::shared_ptr<FakeReportObject> addObject(FakeReportObject::State object);
    std::shared_ptr<FakeReportObject> addObject(const QString& typeName, const QString& name);
    /// Adds a subreport object named `name` and returns the subreport it opens (logged as
    /// `Report(<name>)`).
    std::shared_ptr<FakeReport> addSubreport(const QString& name);

    /// Raises the format event: runs the handlers in the order they were added.
    void fireFormat();
    int formatHandlerCount() const { return static_cast<int>(m_handlers.size()); }

    QString name() const override;
    std::vector<std::shared_ptr<runtime::ReportObject>> reportObjects() const override;
    int addFormatHandler(FormatHandler handler) override;
    void removeFormatHandler(int cookie) override;

    /// Read and change freely: nothing here is logged.
    State state;

private:
    std::map<int, FormatHandler> m_handlers;
    int m_nextCookie = 1;
};

} // namespace fakeruntime
