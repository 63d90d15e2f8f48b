#include "script.h"

#include <QRegularExpression>
#include <stdexcept>
#include <utility>

namespace fakeruntime {

QString Call::text() const
{
    QString result = kind;
    if (!label.isEmpty())
        result += u'(' + label + u')';
    return result + u'.' + method + u'(' + arguments.join(u',') + u')';
}

void Script::record(Call call)
{
    m_log.push_back(std::move(call));
    const size_t index = m_log.size() - 1;
    // Count every matching rule first so that one throwing action does not leave later
    // rules a call behind. Nothing here owns memory while the actions run: a test may
    // crash inside an action on purpose, and the crash guard unwinds without destructors.
    for (Rule& rule : m_rules) {
        rule.firesNow = false;
        if (!matches(rule, m_log[index]))
            continue;
        ++rule.seen;
        rule.firesNow = rule.occurrence == 0 || rule.seen == rule.occurrence;
    }
    try {
        // By index: an action may add rules.
        for (size_t i = 0; i < m_rules.size(); ++i) {
            if (std::exchange(m_rules[i].firesNow, false))
                m_rules[i].action();
        }
    } catch (...) {
        m_log[index].raised = true;
        for (Rule& rule : m_rules)
            rule.firesNow = false;
        throw;
    }
}

void Script::addRule(const QString& key, std::function<void()> action, int occurrence)
{
    static const QRegularExpression pattern(QStringLiteral(R"(^(\w+)(?:\((.*)\))?\.(\w+|\*)$)"));
    const QRegularExpressionMatch match = pattern.match(key);
    if (!match.hasMatch() || occurrence < 0)
        throw std::invalid_argument(
            "fake runtime rule: expected Kind.method or Kind(label).method");
    Rule rule;
    rule.kind = match.captured(1);
    rule.label = match.hasCaptured(2) ? match.captured(2) : QString();
    rule.method = match.captured(3);
    rule.occurrence = occurrence;
    rule.action = std::move(action);
    m_rules.push_back(std::move(rule));
}

bool Script::matches(const Rule& rule, const Call& call)
{
    return rule.kind == call.kind && (rule.label.isNull() || rule.label == call.label)
        && (rule.method == u"*" || rule.method == call.method);
}

void Script::addReport(const QString& path, std::shared_ptr<FakeReport> report)
{
    m_reports[path] = std::move(report);
}

std::shared_ptr<FakeReport> Script::report(const QString& path) const
{
    const auto found = m_reports.find(path);
    return found == m_reports.end() ? nullptr : found->second;
}

} // namespace fakeruntime
