#pragma once

#include "reportrt/base/value.h"

#include <QHash>
#include <QLocale>
#include <QString>

namespace reportrt {

/// The text a field, summary or special field shows for a value.
///
/// Patterns (an object's "format"; docs/report-format.md, "Display formats"):
/// - numbers and currency: "0", "0.00", "#,##0", "#,##0.00"..., with any text before the
///   first and after the last digit place ("€ #,##0.00", "0.0 %"): as many decimals as
///   places after the ".", thousands grouped when the pattern has a ",";
/// - dates, times and date-times: "dd", "d", "mm", "m", "mmm", "mmmm", "yyyy", "yy", "hh",
///   "h", "nn", "ss" (months "m", minutes "n", as in Basic's Format) and other characters
///   as they are.
/// Defaults: whole numbers "#,##0", others and currency "#,##0.00", dates the locale's
/// short date with a four-digit year, times "hh:nn:ss", date-times both. Separators and
/// month names are the locale's; numbers are always grouped in thousands by default. A
/// pattern that does not fit the value's type is ignored (the default is shown).
class ValueFormatter {
public:
    explicit ValueFormatter(const QLocale& locale = QLocale());

    QString format(const Value& value, const QString& pattern = QString());

private:
    struct NumberPattern {
        QString prefix;
        QString suffix;
        int decimals = 0;
        bool grouped = false;
        bool valid = false;
    };
    static NumberPattern numberPattern(const QString& pattern);
    QString formatNumber(double value, const NumberPattern& pattern) const;
    QString dateTimePattern(const QString& pattern) const;

    QLocale m_locale;
    QChar m_decimal;
    QString m_group;
    QString m_minus;
    QString m_shortDate; // Qt pattern
    QHash<QString, NumberPattern> m_numberPatterns;
    QHash<QString, QString> m_datePatterns; // ours -> Qt's
    QHash<QString, QHash<qint64, QString>> m_dates; // by Qt pattern, then day or instant
};

} // namespace reportrt
