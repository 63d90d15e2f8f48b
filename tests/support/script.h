#pragma once

#include "core/comerror.h"

#include <QString>
#include <QStringList>
#include <functional>
#include <map>
#include <memory>
#include <vector>

namespace fakeruntime {

class FakeReport;

/// One call made on a fake runtime object.
struct Call {
    QString kind; // "Application", "Report", "Table", "Section", "Object", "Param", "ExportOptions"
    QString label; // the object's name (a report's path); empty for the application
    QString method;
    QStringList arguments; // already formatted: strings quoted, Booleans True/False
    bool isQuery = false; // a getter: left out of FakeRuntime::calls()
    bool raised = false; // an injected failure or hook raised out of the call

    /// `Table(Orders).setLocation("Orders","","")`
    QString text() const;
};

/// What a fake runtime shares between its objects: the ordered call log, the failure and
/// hook rules, the reports the application can open and the application's own answers.
/// Fake objects hold it weakly, so objects that outlive their FakeRuntime still work but no
/// longer record or fail.
class Script {
public:
    /// Appends the call to the log, then runs every rule that matches it, in the order the
    /// rules were added; a rule's action may throw, which the caller of the fake sees.
    void record(Call call);

    /// Adds a rule. `key` is "Kind.method", "Kind(label).method" or either with "*" as the
    /// method; `occurrence` counts matching calls made after the rule was added, 1-based,
    /// and 0 runs the action on every matching call.
    void addRule(const QString& key, std::function<void()> action, int occurrence);

    const std::vector<Call>& log() const { return m_log; }
    void clearLog() { m_log.clear(); }

    void addReport(const QString& path, std::shared_ptr<FakeReport> report);
    std::shared_ptr<FakeReport> report(const QString& path) const;

    bool canClose = true;
    int applicationsCreated = 0;

private:
    struct Rule {
        QString kind;
        QString label; // null: any object of the kind
        QString method; // "*": any method
        int occurrence = 0;
        int seen = 0;
        bool firesNow = false;
        std::function<void()> action;
    };
    static bool matches(const Rule& rule, const Call& call);

    std::vector<Call> m_log;
    std::vector<Rule> m_rules;
    std::map<QString, std::shared_ptr<FakeReport>> m_reports;
};

} // namespace fakeruntime
