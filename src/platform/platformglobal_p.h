#pragma once

#include <QLoggingCategory>
#include <QString>
#include <QVariant>
#include <core/comerror.h>
#include <cstdint>

Q_DECLARE_LOGGING_CATEGORY(lcPlatform)

namespace platform::detail {

/// Language-runtime error numbers the platform services raise.
namespace PlatformError {
constexpr int32_t InvalidProcedureCall = 5;
constexpr int32_t PathFileAccess = 75;
constexpr int32_t InvalidPropertyValue = 380;
constexpr int32_t PrinterError = 482;
} // namespace PlatformError

/// The source a host sees on errors raised by the platform services: the component's project.
QString errorSource();

[[noreturn]] void raise(int32_t number, const QString& description);

/// A value read from an INI file as the text it was written as: QSettings reads a hand-edited
/// "key=a, b" as a list.
QString iniText(const QVariant& value);

} // namespace platform::detail
