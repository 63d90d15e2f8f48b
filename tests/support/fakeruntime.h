#pragma once

#include "fakeapplication.h"
#include "fakereport.h"
#include "runtime/applicationfactory.h"
#include "script.h"

namespace fakeruntime {

/// An in-memory report runtime for tests. While it lives, runtime::ApplicationFactory
/// creates FakeApplication objects; its destructor puts the previous factory back.
///
///     fakeruntime::FakeRuntime fake;
///     auto report = fake.addReport(u"orders.rpt"_s);
///     report->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
///     auto sub = report->addSection(u"D"_s)->addSubreport(u"Items"_s);
///     sub->addTable(u"spItems"_s, u"spItems;1"_s);
///     fake.failOn(u"Table(Orders).setLocation"_s, core::ComError(...));
///     ... run the component ...
///     EXPECT_EQ(fake.calls(u"Table(Orders)."_s), (QStringList { ... }));
///
/// Every call on a fake object is logged in one ordered list as text such as
/// `Table(Orders).setLocation("Orders","","")`: strings quoted, Booleans True/False,
/// Variants as Empty, Null, "text", True or numbers. Getters are logged too but marked as
/// queries, and calls() leaves them out. Builders and the objects' public `state` are never
/// logged.
class FakeRuntime {
public:
    FakeRuntime();
    ~FakeRuntime();
    FakeRuntime(const FakeRuntime&) = delete;
    FakeRuntime& operator=(const FakeRuntime&) = delete;

    /// A report that Application::openReport(path, ...) returns (the same object every time).
    std::shared_ptr<FakeReport> addReport(const QString& path);
    /// A report not known to the application, to hand to the component directly.
    std::shared_ptr<FakeReport> newReport(const QString& label);

    /// Makes the n-th later call matching `call` raise `error` (n counts from 1). `call` is
    /// "Kind.method" for any object of the kind or "Kind(label).method" for one object;
    /// "*" as the method matches every method. Kinds: Application, ApplicationFactory,
    /// Report, Table, Section, Object, Param, ExportOptions.
    void failOn(const QString& call, const core::ComError& error, int occurrence = 1);
    /// Every later call matching `call` raises `error`.
    void failAlways(const QString& call, const core::ComError& error);
    /// Runs `action` inside matching calls (every one when occurrence is 0), after logging
    /// them; the action may throw or change state.
    void onCall(const QString& call, std::function<void()> action, int occurrence = 0);

    /// What Application::canClose answers.
    void setCanClose(bool value);

    /// The calls, in order, as text, without queries.
    QStringList calls() const;
    /// The calls whose text starts with `prefix`, without queries.
    QStringList calls(const QString& prefix) const;
    /// Every call, queries included.
    QStringList allCalls() const;
    const std::vector<Call>& log() const;
    void clearLog();
    /// The whole log, one call a line, for failure messages.
    QString dump() const;

    /// How many application objects the factory has made.
    int applicationsCreated() const;
    /// The application objects still alive, oldest first.
    std::vector<std::shared_ptr<FakeApplication>> liveApplications() const;

    const std::shared_ptr<Script>& script() const { return m_script; }

private:
    std::shared_ptr<Script> m_script;
    std::vector<std::weak_ptr<FakeApplication>> m_applications;
    runtime::ApplicationFactory::Function m_previousFactory;
};

} // namespace fakeruntime
