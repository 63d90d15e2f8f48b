#include "automation/classbuilder.h"

namespace automation {

ParamDescription param(const QString& name, const QString& type)
{
    ParamDescription description;
    description.name = name;
    description.type = type;
    return description;
}

ParamDescription byVal(const QString& name, const QString& type)
{
    return byVal(param(name, type));
}

ParamDescription byVal(ParamDescription param)
{
    param.byRef = false;
    return param;
}

ParamDescription optionalParam(
    const QString& name, const core::Variant& defaultValue, const QString& type)
{
    ParamDescription description = param(name, type);
    description.optional = true;
    description.defaultValue = defaultValue;
    return description;
}

} // namespace automation
