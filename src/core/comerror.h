#pragma once

#include "core/ludmoxexport.h"

#include <QString>
#include <cstdint>
#include <exception>
#include <string>

namespace core {

/// Error numbers the component raises or gives special treatment. Values are the signed
/// 32-bit form a host sees.
namespace ErrorNumber {
constexpr int32_t ObjectErrorBase = static_cast<int32_t>(0x80040000);
/// "User Cancelled" and "Not an OLE DB report - please convert with Crystal Reports."
constexpr int32_t UserCancelled = static_cast<int32_t>(0x80040099);
constexpr int32_t NotOleDbReport = UserCancelled;
/// An exception turned into an error by the crash guard.
constexpr int32_t GuardedCrash = static_cast<int32_t>(0x8004029A);
/// Table-location failure raised by the engine.
constexpr int32_t SetLocationFailed = 666;
/// Runtime: the server logon failed to connect.
constexpr int32_t LogOnFailed = static_cast<int32_t>(0x80047E5D);
/// Runtime: a table's location could not be set (connection failed).
constexpr int32_t TableConnectionFailed = static_cast<int32_t>(0x80047E44);
/// Runtime: a server error while reading records; rewritten to 0x80047E53 when the
/// description does not carry the provider code 0x80004005.
constexpr int32_t ServerError = static_cast<int32_t>(0x80047E52);
constexpr int32_t ServerErrorRewritten = static_cast<int32_t>(0x80047E53);
/// Runtime: a report file could not be opened.
constexpr int32_t OpenReportFailed = static_cast<int32_t>(0x80047689);
/// Runtime: generic failure of a report operation.
constexpr int32_t RuntimeFailure = static_cast<int32_t>(0x80040309);

// Language runtime errors.
constexpr int32_t InvalidProcedureCall = 5;
constexpr int32_t Overflow = 6;
constexpr int32_t OutOfMemory = 7;
constexpr int32_t SubscriptOutOfRange = 9;
constexpr int32_t TypeMismatch = 13;
constexpr int32_t FileNotFound = 53;
constexpr int32_t ObjectVariableNotSet = 91;
constexpr int32_t InvalidPatternString = 93;
constexpr int32_t InvalidUseOfNull = 94;
constexpr int32_t ObjectDoesNotSupport = 438;
constexpr int32_t DuplicateKey = 457;
/// Scripting.Dictionary: Remove of a key that is not there.
constexpr int32_t ElementNotFound = 32811;
} // namespace ErrorNumber

/// An automation error: what Err.Raise raises and an error trap catches. The description
/// must never carry a password or other secret: it travels to hosts and into logs.
class LUDMOX_EXPORT ComError : public std::exception {
public:
    ComError(int32_t number, QString source, QString description);

    /// A language-runtime error with its standard description ("Overflow", "Type mismatch"...)
    /// and the given source.
    static ComError basic(int32_t number, const QString& source = QString());

    int32_t number() const noexcept { return m_number; }
    const QString& source() const noexcept { return m_source; }
    const QString& description() const noexcept { return m_description; }

    /// "number, source, description": the engine's LastError text format.
    QString lastErrorText() const;

    const char* what() const noexcept override;

private:
    int32_t m_number;
    QString m_source;
    QString m_description;
    std::string m_what;
};

} // namespace core
