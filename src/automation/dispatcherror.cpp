#include "automation/dispatcherror.h"

namespace automation {

DispatchError::DispatchError(
    int32_t number, const QString& description, std::optional<int> argumentIndex)
    : core::ComError(number, QString(), description)
    , m_argumentIndex(argumentIndex)
{ }

DispatchError DispatchError::memberNotFound(const QString& className, const QString& member)
{
    return DispatchError(DispatchNumber::MemberNotFound,
        QStringLiteral("Member not found: %1.%2").arg(className, member));
}

DispatchError DispatchError::badParamCount(const QString& member, int given, int declared)
{
    return DispatchError(DispatchNumber::BadParamCount,
        QStringLiteral("Invalid number of parameters: %1 takes at most %2, %3 given")
            .arg(member)
            .arg(declared)
            .arg(given));
}

DispatchError DispatchError::paramNotOptional(const QString& member, int argumentIndex)
{
    return DispatchError(DispatchNumber::ParamNotOptional,
        QStringLiteral("Parameter not optional: argument %1 of %2")
            .arg(argumentIndex + 1)
            .arg(member),
        argumentIndex);
}

DispatchError DispatchError::conversion(const core::ComError& cause, int argumentIndex)
{
    // Every value that does not convert is a type mismatch to the caller, an out-of-range
    // number included; the description keeps what the conversion said ("Overflow").
    return DispatchError(DispatchNumber::TypeMismatch,
        QStringLiteral("%1: argument %2").arg(cause.description()).arg(argumentIndex + 1),
        argumentIndex);
}

DispatchError DispatchError::typeMismatch(int argumentIndex, const QString& detail)
{
    return DispatchError(DispatchNumber::TypeMismatch,
        QStringLiteral("Type mismatch: argument %1: %2").arg(argumentIndex + 1).arg(detail),
        argumentIndex);
}

} // namespace automation
