#pragma once

#include "dialogs/dateentrysettings.h"
#include "dialogs/textedit.h"

#include <QDate>
#include <QString>
#include <cstdint>
#include <optional>

namespace dialogs {

/// The OLE colour of a text box's normal background (the system window colour).
constexpr uint32_t WindowBackgroundColor = 0x80000005;

/// The date a text means when read against a short-date mask, as the Basic IsDate / CDate
/// read it: day, month and year in the mask's order, separated by one of "." "/" "-" ","
/// " " or the locale's separator; a year of one or two digits lies in 1930..2029; a first
/// part of four digits is a year (year-month-day); day and month alone are in `today`'s
/// year. Nothing when the text is not a date between the years 100 and 9999.
std::optional<QDate> parseDateText(
    const QString& text, const QString& pattern, const QDate& today = QDate::currentDate());

/// A date written with a mask ("dd.mm.yyyy", "mm/dd/yyyy"); "/" in the mask is the locale's
/// date separator.
QString formatDate(const QDate& date, const QString& pattern);

/// One key typed into a date field, before the text box sees it: "+" / "-" on a wholly
/// selected date step it by a day, separator keys complete the date and jump to its next
/// part, Ctrl+D gives today, Backspace removes from the caret to the end, digits are taken
/// while the mask is not full, and behind a complete date only a day offset ("+5", "-12")
/// can be typed. The key comes back 0 when it was consumed.
KeyOutcome TypeDateKey(const TextEdit& edit, int key, const DateEntrySettings& settings,
    const QDate& today = QDate::currentDate());

/// After a change: appends the date separator when the caret is at the end of the text,
/// nothing is selected and the caret stands on a separator position of the mask.
TextEdit InsertDateSeparator(const TextEdit& edit, const DateEntrySettings& settings);

/// A key in a date field as the user sees it: TypeDateKey, then the text box's own typing
/// for a character or Backspace that was not consumed, then InsertDateSeparator. The key
/// comes back non-zero only for control keys the text box must handle itself (clipboard).
KeyOutcome pressDateKey(const TextEdit& edit, int key, const DateEntrySettings& settings,
    const QDate& today = QDate::currentDate());

/// Applies a day offset typed behind a date ("10.03.2021+5" gives "15.03.2021") and writes
/// the date with `format`; a text that is no date comes back unchanged.
QString ShiftDate(
    const QString& text, const QString& format, const QDate& today = QDate::currentDate());

/// A date field after its check: the normalised text and the back colour.
struct DateFieldState {
    QString text;
    uint32_t backColor = WindowBackgroundColor;
    friend bool operator==(const DateFieldState&, const DateFieldState&) = default;
};

/// Normalises a date field (ShiftDate with the mask) and marks it: an empty or valid date
/// turns a highlighted field back to the window colour, anything else turns a field with
/// the window colour into the highlight colour.
DateFieldState CheckDateField(const DateFieldState& field, const DateEntrySettings& settings,
    const QDate& today = QDate::currentDate());

} // namespace dialogs
