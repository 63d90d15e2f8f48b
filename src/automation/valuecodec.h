#pragma once

#include "automation/handletable.h"
#include "core/variant.h"

#include <QCborValue>
#include <QString>
#include <optional>
#include <stdexcept>

namespace automation {

/// A protocol value that cannot become a Variant.
class ValueError : public std::runtime_error {
public:
    enum class Kind {
        /// Not one of the protocol's value forms, or a form with bad content.
        BadValue,
        /// An object handle the host does not hold.
        UnknownHandle,
    };
    ValueError(Kind kind, const QString& message);
    Kind kind() const { return m_kind; }
    QString message() const { return QString::fromStdString(what()); }

private:
    Kind m_kind;
};

/// Variants to protocol values and back. Objects travel as handles of the host's handle
/// table: encoding an object hands it out (one host reference more).
///
/// Besides the documented forms, an error value other than a missing argument travels as
/// {"$error": N}, and a plain JSON array is read as a zero-based one-dimensional array.
class ValueCodec {
public:
    explicit ValueCodec(HandleTable& handles);

    QCborValue encode(const core::Variant& value);
    /// Raises ValueError.
    core::Variant decode(const QCborValue& value) const;

    /// "2026-12-06T14:30:00" for an automation date (days since 1899-12-30, the fraction the
    /// time of day); milliseconds only when there are any.
    static QString dateText(double oleDate);
    /// The automation date of such a text (a date alone means midnight); nothing when the
    /// text is no local date and time.
    static std::optional<double> parseDate(const QString& text);
    /// "12.3400": the scaled value with four decimals.
    static QString currencyText(core::Currency value);
    /// A decimal text, rounded half to even to four decimals; nothing when it is no number
    /// or out of the currency range.
    static std::optional<core::Currency> parseCurrency(const QString& text);

private:
    QCborValue encodeArray(const core::VariantArray& array);
    core::Variant decodeArray(const QCborMap& map) const;

    HandleTable& m_handles;
};

} // namespace automation
