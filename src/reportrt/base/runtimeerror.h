#pragma once

#include "core/comerror.h"

#include <QString>
#include <cstdint>

namespace reportrt {

/// The runtime's own error numbers (signed 32-bit form). docs/report-format.md lists them.
namespace Error {
/// The report file is missing, unreadable or too large.
constexpr int32_t OpenReportFailed = core::ErrorNumber::OpenReportFailed;
/// The file is read but is not a valid report document (syntax, schema, references).
constexpr int32_t InvalidDocument = static_cast<int32_t>(0x8004768A);
/// A formula of the report does not parse or does not type-check, or fails on a record.
constexpr int32_t FormulaError = static_cast<int32_t>(0x8004768B);
/// Saving the report document failed; the target file is left as it was.
constexpr int32_t SaveFailed = static_cast<int32_t>(0x8004768C);
/// An export file could not be written; nothing is left at the target path.
constexpr int32_t ExportFailed = static_cast<int32_t>(0x8004768D);
/// A report could not be mailed: bad address, unreachable server, refused credentials or
/// recipient, timeout, or an outbox that cannot be written. Nothing was sent.
constexpr int32_t MailFailed = static_cast<int32_t>(0x8004768E);
constexpr int32_t RuntimeFailure = core::ErrorNumber::RuntimeFailure;
constexpr int32_t LogOnFailed = core::ErrorNumber::LogOnFailed;
constexpr int32_t TableConnectionFailed = core::ErrorNumber::TableConnectionFailed;
constexpr int32_t ServerError = core::ErrorNumber::ServerError;
} // namespace Error

/// The source every runtime error carries.
QString errorSource();

/// Raises core::ComError with the runtime's source.
[[noreturn]] void raiseError(int32_t number, const QString& description);

} // namespace reportrt
