#include "reportrt/base/runtimeerror.h"

namespace reportrt {

QString errorSource()
{
    return QStringLiteral("LUD Mox Report Runtime");
}

void raiseError(int32_t number, const QString& description)
{
    throw core::ComError(number, errorSource(), description);
}

} // namespace reportrt
