#include "automation/typelibrary.h"

#include "automation/registry.h"
#include "automation/valuecodec.h"

#include <QCborArray>

namespace automation {

namespace {
QCborArray describeParams(const std::vector<ParamDescription>& params)
{
    // Default values are constants (numbers, text, Booleans); they need no handles.
    HandleTable noHandles;
    ValueCodec codec(noHandles);
    QCborArray list;
    for (const ParamDescription& param : params) {
        QCborMap entry;
        entry.insert(QStringLiteral("name"), param.name);
        entry.insert(QStringLiteral("type"), param.type);
        entry.insert(QStringLiteral("optional"), param.optional);
        entry.insert(QStringLiteral("byref"), param.byRef);
        if (param.optional && param.hasDefault())
            entry.insert(QStringLiteral("default"), codec.encode(param.defaultValue));
        list.append(entry);
    }
    return list;
}

QCborValue nameOrNull(const QString& text)
{
    return text.isEmpty() ? QCborValue(nullptr) : QCborValue(text);
}

QCborMap describeClass(const ClassDescription& description)
{
    QCborMap entry;
    entry.insert(QStringLiteral("name"), description.name);
    entry.insert(QStringLiteral("creatable"), description.creatable);
    entry.insert(QStringLiteral("interface"), description.interfaceName);
    if (description.eventInterfaceName.isEmpty()) {
        entry.insert(QStringLiteral("events"), QCborValue(nullptr));
    } else {
        QCborArray events;
        for (const EventDescription& event : description.events) {
            QCborMap item;
            item.insert(QStringLiteral("name"), event.name);
            item.insert(QStringLiteral("dispid"), event.dispid);
            item.insert(QStringLiteral("params"), describeParams(event.params));
            events.append(item);
        }
        QCborMap eventInterface;
        eventInterface.insert(QStringLiteral("interface"), description.eventInterfaceName);
        eventInterface.insert(QStringLiteral("members"), events);
        entry.insert(QStringLiteral("events"), eventInterface);
    }
    QCborArray members;
    for (const MemberDescription& member : description.members) {
        QCborMap item;
        item.insert(QStringLiteral("name"), member.name);
        item.insert(QStringLiteral("dispid"), member.dispid);
        item.insert(QStringLiteral("kind"), memberKindName(member.kind));
        item.insert(QStringLiteral("params"), describeParams(member.params));
        item.insert(QStringLiteral("returns"), nameOrNull(member.returnType));
        if (member.hidden)
            item.insert(QStringLiteral("hidden"), true);
        members.append(item);
    }
    entry.insert(QStringLiteral("members"), members);
    return entry;
}
} // namespace

QCborMap TypeLibrary::describe(const Registry& registry)
{
    QCborArray classes;
    for (const ClassDescription* description : registry.classes()) {
        if (description->inTypeLibrary)
            classes.append(describeClass(*description));
    }
    QCborArray enums;
    for (const EnumDescription* description : registry.enums()) {
        QCborMap values;
        for (const EnumDescription::Value& value : description->values)
            values.insert(value.name, value.value);
        QCborMap entry;
        entry.insert(QStringLiteral("name"), description->name);
        entry.insert(QStringLiteral("members"), values);
        enums.append(entry);
    }
    QCborMap library;
    library.insert(QStringLiteral("name"), name());
    library.insert(QStringLiteral("version"), version());
    library.insert(QStringLiteral("classes"), classes);
    library.insert(QStringLiteral("enums"), enums);
    return library;
}

} // namespace automation
