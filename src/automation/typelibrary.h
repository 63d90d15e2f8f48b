#pragma once

#include <QCborMap>
#include <QString>

namespace automation {

class Registry;

/// The component's type library as the server hands it to hosts: every class of the
/// registry that belongs to the library, with its interface, event interface and members in
/// interface order, and every enumeration.
class TypeLibrary {
public:
    static QString name() { return QStringLiteral("LUDMoxViewer115"); }
    static QString version() { return QStringLiteral("1.0"); }

    static QCborMap describe(const Registry& registry);
};

} // namespace automation
