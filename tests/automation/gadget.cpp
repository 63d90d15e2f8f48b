#include "gadget.h"

#include "automation/classbuilder.h"
#include "automation/dispatcher.h"
#include "core/comerror.h"
#include "core/dictionary.h"

#include <array>

namespace automationtest {

using automation::byVal;
using automation::optionalParam;
using automation::param;

QString Gadget::Describe(const QString& text, std::optional<int32_t> count, int16_t width)
{
    return QStringLiteral("%1/%2/%3")
        .arg(text, count ? QString::number(*count) : QStringLiteral("none"))
        .arg(width);
}

Gadget::Mode Gadget::SetMode(Mode mode)
{
    return mode == Auto ? On : mode;
}

void Gadget::Fail()
{
    throw core::ComError(1234, QStringLiteral("Gadget.Fail"), QStringLiteral("Broken on purpose"));
}

void Gadget::CallMissingMember()
{
    automation::Dispatcher(gadgetRegistry()).call(shared_from_this(), QStringLiteral("Nowhere"));
}

QString Gadget::Label(int32_t index) const
{
    if (index < 0 || index >= static_cast<int32_t>(m_labels.size()))
        throw core::ComError::basic(core::ErrorNumber::SubscriptOutOfRange);
    return m_labels[static_cast<size_t>(index)];
}

void Gadget::SetLabel(int32_t index, const QString& text)
{
    Label(index);
    m_labels[static_cast<size_t>(index)] = text;
}

std::shared_ptr<Gadget> Gadget::Child()
{
    if (!m_child)
        m_child = std::make_shared<Gadget>();
    return m_child;
}

bool Gadget::Adopt(const std::shared_ptr<Gadget>& other)
{
    m_child = other;
    return other != nullptr;
}

std::vector<core::Variant> Gadget::Items() const
{
    return { core::Variant(QStringLiteral("one")), core::Variant(int32_t(2)),
        core::Variant(core::ObjectPtr(m_child)) };
}

QString Gadget::Ask(const QString& prompt)
{
    std::array<core::Variant, 2> args { core::Variant(prompt), core::Variant(int32_t(7)) };
    raise(AskedEvent, QStringLiteral("Asked"), args);
    return args[0].toText();
}

void Gadget::Tick(int32_t times)
{
    for (int32_t i = 0; i < times; ++i)
        raise(TickedEvent, QStringLiteral("Ticked"), {});
}

namespace {
void registerGadget(automation::Registry& registry)
{
    automation::ClassBuilder<Gadget> c(QStringLiteral("Gadget"), QStringLiteral("_Gadget"));
    c.creatable();
    c.method(QStringLiteral("Add"), 1, &Gadget::Add,
        { byVal(QStringLiteral("a")), byVal(QStringLiteral("b")) });
    c.method(QStringLiteral("Twice"), 2, &Gadget::Twice, { param(QStringLiteral("value")) });
    c.method(QStringLiteral("Describe"), 3, &Gadget::Describe,
        { param(QStringLiteral("text")), optionalParam(QStringLiteral("count")),
            optionalParam(QStringLiteral("width"), int16_t(3)) });
    c.method(QStringLiteral("SetMode"), 4, &Gadget::SetMode,
        { param(QStringLiteral("mode"), QStringLiteral("GadgetMode")) },
        { .returns = QStringLiteral("GadgetMode") });
    c.method(QStringLiteral("Fail"), 5, &Gadget::Fail);
    c.method(QStringLiteral("CallMissingMember"), 6, &Gadget::CallMissingMember);
    c.property<QString>(QStringLiteral("Name"), 7, &Gadget::Name, &Gadget::Name);
    c.get(QStringLiteral("Label"), 8, &Gadget::Label, { param(QStringLiteral("index")) });
    c.put(QStringLiteral("Label"), 8, &Gadget::SetLabel,
        { param(QStringLiteral("index")), byVal(QStringLiteral("RHS")) });
    c.get(QStringLiteral("Child"), 9, &Gadget::Child, {}, { .returns = QStringLiteral("Gadget") });
    c.method(QStringLiteral("Adopt"), 10, &Gadget::Adopt,
        { param(QStringLiteral("other"), QStringLiteral("Gadget")) });
    c.field(QStringLiteral("Value"), 11, &Gadget::Value);
    c.field(QStringLiteral("Counter"), 12, &Gadget::Counter);
    c.method(QStringLiteral("Ask"), 13, &Gadget::Ask, { param(QStringLiteral("prompt")) });
    c.method(QStringLiteral("Tick"), 14, &Gadget::Tick, { param(QStringLiteral("times")) });
    c.enumerator(QStringLiteral("_NewEnum"), &Gadget::Items);
    c.events(QStringLiteral("__Gadget"));
    c.event(QStringLiteral("Asked"), Gadget::AskedEvent,
        { param(QStringLiteral("Prompt"), QStringLiteral("String")),
            byVal(QStringLiteral("Count"), QStringLiteral("Long")) });
    c.event(QStringLiteral("Ticked"), Gadget::TickedEvent, {});
    registry.add(c.take());
    registry.addEnum({ QStringLiteral("GadgetMode"),
        { { QStringLiteral("Off"), 0 }, { QStringLiteral("On"), 1 },
            { QStringLiteral("Auto"), 2 } } });
}
} // namespace

automation::Registry& gadgetRegistry()
{
    static automation::Registry* registry = [] {
        auto* created = new automation::Registry;
        registerGadget(*created);
        // The platform classes come from the component's own tables.
        for (const QString& name :
            { QStringLiteral("Scripting.Dictionary"), QStringLiteral("Enumerator") }) {
            created->add(*automation::Registry::instance().find(name));
        }
        return created;
    }();
    return *registry;
}

} // namespace automationtest
