#pragma once

#include "core/comerror.h"
#include "core/variant.h"

#include <QString>
#include <QStringList>
#include <functional>
#include <memory>

namespace fakeruntime {

class Script;

/// What every fake runtime object has besides its runtime interface: a place in the call log
/// and per-object failure rules.
class FakeObject {
public:
    virtual ~FakeObject() = default;

    /// The kind in the call log ("Table").
    const QString& kind() const { return m_kind; }
    /// The name in the call log ("Orders"); a main report's path.
    virtual QString label() const = 0;

    /// The n-th later call of `method` on this object raises `error`.
    void failOn(const QString& method, const core::ComError& error, int occurrence = 1);
    /// Every later call of `method` on this object raises `error`.
    void failAlways(const QString& method, const core::ComError& error);

    /// Argument formats of the call log.
    static QString arg(const QString& text); // "text", quoted
    static QString arg(bool value); // True / False
    static QString arg(int32_t value);
    static QString arg(const core::Variant& value); // Empty, Null, "text", True, 5, #date#...

protected:
    FakeObject(std::weak_ptr<Script> script, QString kind);

    /// Logs the call, then runs the rules that match it (which may throw).
    void record(const QString& method, QStringList arguments = {}) const;
    /// Logs a getter call.
    void recordQuery(const QString& method, QStringList arguments = {}) const;

    const std::weak_ptr<Script>& script() const { return m_script; }

private:
    QString ruleKey(const QString& method) const;

    std::weak_ptr<Script> m_script;
    QString m_kind;
};

} // namespace fakeruntime
