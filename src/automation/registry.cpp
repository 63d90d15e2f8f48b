#include "automation/registry.h"

#include "automation/tables_p.h"
#include "core/eventsource.h"

#include <QSet>
#include <stdexcept>

namespace automation {

namespace {
const QStringList& basicTypes()
{
    static const QStringList types { QStringLiteral("Boolean"), QStringLiteral("Byte"),
        QStringLiteral("Integer"), QStringLiteral("Long"), QStringLiteral("Single"),
        QStringLiteral("Double"), QStringLiteral("Currency"), QStringLiteral("Date"),
        QStringLiteral("String"), QStringLiteral("Variant"), QStringLiteral("Object") };
    return types;
}

[[noreturn]] void reject(const QString& className, const QString& problem)
{
    throw std::logic_error(
        QStringLiteral("automation table of %1: %2").arg(className, problem).toStdString());
}

void checkParams(
    const QString& className, const QString& owner, const std::vector<ParamDescription>& params)
{
    for (const ParamDescription& param : params) {
        if (param.name.isEmpty() || param.type.isEmpty())
            reject(className, owner + QStringLiteral(": a parameter without name or type"));
    }
}

void checkMembers(const ClassDescription& description)
{
    QHash<QString, int32_t> dispidByName;
    QHash<int32_t, QString> nameByDispid;
    QSet<QString> declared;
    for (const MemberDescription& member : description.members) {
        const QString key = member.name.toLower();
        if (!member.invoke)
            reject(description.name, member.name + QStringLiteral(" has no callable"));
        checkParams(description.name, member.name, member.params);
        const QString kindKey = key + u'/' + memberKindName(member.kind);
        if (declared.contains(kindKey))
            reject(description.name,
                member.name + QStringLiteral(" declared twice as ") + memberKindName(member.kind));
        declared.insert(kindKey);
        if (dispidByName.contains(key) && dispidByName.value(key) != member.dispid)
            reject(description.name, member.name + QStringLiteral(" has two dispatch ids"));
        if (nameByDispid.contains(member.dispid) && nameByDispid.value(member.dispid) != key)
            reject(description.name,
                QStringLiteral("dispatch id %1 used by %2 and %3")
                    .arg(member.dispid)
                    .arg(nameByDispid.value(member.dispid), member.name));
        dispidByName.insert(key, member.dispid);
        nameByDispid.insert(member.dispid, key);
    }
    QSet<int32_t> eventDispids;
    for (const EventDescription& event : description.events) {
        checkParams(description.name, event.name, event.params);
        if (eventDispids.contains(event.dispid))
            reject(description.name,
                QStringLiteral("event dispatch id %1 used twice").arg(event.dispid));
        eventDispids.insert(event.dispid);
    }
    if (!description.events.empty() && description.eventInterfaceName.isEmpty())
        reject(description.name, QStringLiteral("events without an event interface"));
    if (description.creatable && !description.factory)
        reject(description.name, QStringLiteral("creatable without a factory"));
}

core::EventSource* objectAsEventSource(core::Object& object)
{
    return dynamic_cast<core::EventSource*>(&object);
}
} // namespace

Registry::Registry() = default;
Registry::~Registry() = default;

Registry& Registry::instance()
{
    // Never destroyed: objects that outlive main (a host's last references released by
    // static destructors) may still be described.
    static Registry* registry = [] {
        auto* created = new Registry;
        registerComponentTables(*created);
        return created;
    }();
    return *registry;
}

void Registry::add(ClassDescription description)
{
    if (description.name.isEmpty())
        reject(QStringLiteral("(unnamed)"), QStringLiteral("a class needs a name"));
    if (m_classByName.contains(description.name.toLower()))
        reject(description.name, QStringLiteral("the class is already registered"));
    checkMembers(description);
    if (!description.eventSource)
        description.eventSource = objectAsEventSource;
    m_classes.push_back(std::make_unique<ClassDescription>(std::move(description)));
    const ClassDescription* added = m_classes.back().get();
    m_classByName.insert(added->name.toLower(), added);
    if (!added->interfaceName.isEmpty())
        m_classByInterface.insert(added->interfaceName.toLower(), added);
}

void Registry::addEnum(EnumDescription description)
{
    if (description.name.isEmpty() || m_enumByName.contains(description.name.toLower()))
        reject(description.name, QStringLiteral("enumeration without a name or added twice"));
    m_enums.push_back(std::make_unique<EnumDescription>(std::move(description)));
    m_enumByName.insert(m_enums.back()->name.toLower(), m_enums.back().get());
}

const ClassDescription* Registry::find(const QString& className) const
{
    return m_classByName.value(className.toLower());
}

const ClassDescription* Registry::describe(const core::Object& object) const
{
    return find(object.className());
}

const EnumDescription* Registry::findEnum(const QString& name) const
{
    return m_enumByName.value(name.toLower());
}

std::vector<const ClassDescription*> Registry::classes() const
{
    std::vector<const ClassDescription*> result;
    result.reserve(m_classes.size());
    for (const auto& description : m_classes)
        result.push_back(description.get());
    return result;
}

std::vector<const EnumDescription*> Registry::enums() const
{
    std::vector<const EnumDescription*> result;
    result.reserve(m_enums.size());
    for (const auto& description : m_enums)
        result.push_back(description.get());
    return result;
}

bool Registry::isKnownType(const QString& typeName) const
{
    QString name = typeName;
    if (name.endsWith(QStringLiteral("()")))
        name.chop(2);
    const QString key = name.toLower();
    return basicTypes().contains(name) || m_classByName.contains(key)
        || m_classByInterface.contains(key) || m_enumByName.contains(key);
}

QStringList Registry::unresolvedTypes() const
{
    QStringList problems;
    auto check = [&](const QString& where, const QString& type) {
        if (!type.isEmpty() && !isKnownType(type))
            problems.append(where + QStringLiteral(": ") + type);
    };
    for (const auto& description : m_classes) {
        for (const MemberDescription& member : description->members) {
            const QString where = description->name + u'.' + member.name;
            check(where, member.returnType);
            for (const ParamDescription& param : member.params)
                check(where, param.type);
        }
        for (const EventDescription& event : description->events) {
            for (const ParamDescription& param : event.params)
                check(description->name + u'.' + event.name, param.type);
        }
    }
    return problems;
}

const EventDescription* ClassDescription::event(int32_t dispid) const
{
    for (const EventDescription& candidate : events) {
        if (candidate.dispid == dispid)
            return &candidate;
    }
    return nullptr;
}

QString memberKindName(MemberKind kind)
{
    switch (kind) {
    case MemberKind::Method:
        return QStringLiteral("method");
    case MemberKind::Get:
        return QStringLiteral("get");
    case MemberKind::Put:
        return QStringLiteral("put");
    case MemberKind::PutRef:
        return QStringLiteral("putref");
    }
    return QString();
}

} // namespace automation
