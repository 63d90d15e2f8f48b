#pragma once

#include <QString>
#include <cstdint>

namespace dialogs {

/// The process-wide settings of typed date entry, taken from the user's short-date format
/// each time before the parameter dialog is built.
struct DateEntrySettings {
    /// The short-date mask in Basic letters with a four-digit year, e.g. "dd.mm.yyyy".
    QString DatePattern = QStringLiteral("dd.mm.yyyy");
    /// The locale's date separator, inserted while digits are typed.
    QString DateSeparator = QStringLiteral(".");
    /// Zero-based positions of the first and the second separator in DatePattern.
    int16_t DateSep1Pos = 2;
    int16_t DateSep2Pos = 5;
    /// The back colour of a date field whose text is not a date (yellow, as an OLE colour).
    uint32_t FieldHighlightColor = 65535;

    /// Settings from the short-date text of 31 December 1899 (e.g. "31.12.1899") and the
    /// date separator: "31", "12" and "1899" become "dd", "mm" and "yyyy", and a mask
    /// without the separator gets the positions 2 and 5.
    static DateEntrySettings fromShortDate(const QString& shortDateText, const QString& separator);
    /// Settings from the user's locale.
    static DateEntrySettings fromSystem();

    friend bool operator==(const DateEntrySettings&, const DateEntrySettings&) = default;
};

/// The settings the dialogs read; the user's locale until set.
const DateEntrySettings& dateEntrySettings();
void setDateEntrySettings(const DateEntrySettings& settings);

} // namespace dialogs
