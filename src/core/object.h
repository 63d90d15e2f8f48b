#pragma once

#include "core/ludmoxexport.h"

#include <QString>
#include <memory>

namespace core {

/// Base of every object a Variant can hold: the component's public classes, the runtime's
/// objects and the platform objects handed to hosts. Objects are shared through
/// std::shared_ptr; a non-owning reference is a std::weak_ptr.
class LUDMOX_EXPORT Object : public std::enable_shared_from_this<Object> {
public:
    virtual ~Object() = default;

    /// The class name a host sees (the type library name, e.g. "MoxEngine115").
    virtual QString className() const = 0;

protected:
    Object() = default;
    Object(const Object&) = default;
    Object& operator=(const Object&) = default;
};

using ObjectPtr = std::shared_ptr<Object>;

} // namespace core
