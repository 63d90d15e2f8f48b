#include "platform/platformglobal_p.h"

using namespace Qt::StringLiterals;

Q_LOGGING_CATEGORY(lcPlatform, "ludmox.platform")

namespace platform::detail {

QString errorSource()
{
    return u"LUDMoxViewer115"_s;
}

void raise(int32_t number, const QString& description)
{
    throw core::ComError(number, errorSource(), description);
}

QString iniText(const QVariant& value)
{
    if (value.metaType().id() == QMetaType::QStringList)
        return value.toStringList().join(QStringLiteral(", "));
    return value.toString();
}

} // namespace platform::detail
