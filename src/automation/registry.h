#pragma once

#include "automation/classdescription.h"
#include "core/ludmoxexport.h"

#include <QHash>
#include <QString>
#include <QStringList>
#include <memory>
#include <vector>

namespace automation {

/// The class descriptions every automation path reads: the server, the type library and
/// late-bound calls inside the process. Classes are found by the name their objects report
/// through core::Object::className(), without regard to case.
class LUDMOX_EXPORT Registry {
public:
    /// An empty registry.
    Registry();
    ~Registry();
    Registry(const Registry&) = delete;
    Registry& operator=(const Registry&) = delete;

    /// The process-wide registry, holding every table of the component from the first call
    /// on. Libraries that hand out objects of their own (the report runtime) add their
    /// classes to it.
    static Registry& instance();

    /// Adds a class. Raises std::logic_error for a description that cannot be served: a
    /// class name used twice, members of one name with different dispatch ids or one
    /// dispatch id with different names, a name declared twice with the same kind, a member
    /// without callable or parameter type, or events sharing a dispatch id.
    void add(ClassDescription description);
    void addEnum(EnumDescription description);

    const ClassDescription* find(const QString& className) const;
    const ClassDescription* describe(const core::Object& object) const;
    const EnumDescription* findEnum(const QString& name) const;

    /// In the order they were added: the type library lists them so.
    std::vector<const ClassDescription*> classes() const;
    std::vector<const EnumDescription*> enums() const;

    /// Whether a name is a type a declaration may use: a Basic type, a class, an interface
    /// or an enumeration of this registry, or an array of one of them ("String()").
    bool isKnownType(const QString& typeName) const;
    /// "Class.Member: type" for every declared type that does not resolve; empty when all do.
    /// Classes may refer to classes added after them, so this is checked once all are in.
    QStringList unresolvedTypes() const;

private:
    std::vector<std::unique_ptr<ClassDescription>> m_classes;
    std::vector<std::unique_ptr<EnumDescription>> m_enums;
    QHash<QString, const ClassDescription*> m_classByName; // lower-case name
    QHash<QString, const ClassDescription*> m_classByInterface; // lower-case interface name
    QHash<QString, const EnumDescription*> m_enumByName; // lower-case name
};

} // namespace automation
