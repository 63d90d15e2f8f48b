#include "script.h"

#include <QRegularExpression>
#include <stdexcept>

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
    // rules a call behind.
    std::vector<std::function<void()>> actions;
    for (Rule& rule : m_rules) {
        if (!matches(rule, m_log[index]))
            continue;
        ++rule.seen;
        if (rule.occurrence == 0 || rule.seen == rule.occurrence)
            actions.push_back(rule.action);
    }
    try {
        for (const auto& action : actions)
            action();
    } catch (...) {
        m_log[index].raised = true;
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
