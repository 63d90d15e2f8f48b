#pragma once

// A class that exercises every kind of member the builder supports, described in its own
// registry so the tests do not depend on the component's classes.

#include "automation/registry.h"
#include "core/eventsource.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <memory>
#include <optional>
#include <vector>

namespace automationtest {

class Gadget : public core::Object, public core::EventSource {
public:
    enum Mode : int32_t { Off = 0, On = 1, Auto = 2 };
    enum EventId : int32_t { AskedEvent = 1, TickedEvent = 2 };

    QString className() const override { return QStringLiteral("Gadget"); }

    int16_t Add(int16_t a, int16_t b) { return static_cast<int16_t>(a + b); }
    void Twice(int32_t& value) { value *= 2; }
    /// count: omitted -> "none"; width has a declared default of 3.
    QString Describe(const QString& text, std::optional<int32_t> count, int16_t width);
    Mode SetMode(Mode mode);
    void Fail();
    /// Makes a late-bound call that fails to bind.
    void CallMissingMember();

    QString Name() const { return m_name; }
    void Name(const QString& name) { m_name = name; }
    /// Indexed property: Label(index) get / put.
    QString Label(int32_t index) const;
    void SetLabel(int32_t index, const QString& text);

    std::shared_ptr<Gadget> Child();
    bool Adopt(const std::shared_ptr<Gadget>& other);
    std::vector<core::Variant> Items() const;

    /// Raises Asked(Prompt by reference, Count by value) and returns the final prompt.
    QString Ask(const QString& prompt);
    /// Raises Ticked() `times` times.
    void Tick(int32_t times);

    core::Variant Value;
    int32_t Counter = 0;

private:
    QString m_name;
    std::vector<QString> m_labels = std::vector<QString>(3);
    std::shared_ptr<Gadget> m_child;
};

/// A registry with Gadget (creatable, with events), Scripting.Dictionary and the
/// Enumerator, as the server needs them.
automation::Registry& gadgetRegistry();

} // namespace automationtest
