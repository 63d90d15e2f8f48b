#include "dialogs/dateentrysettings.h"

#include "core/text.h"

#include <QDateTime>
#include <optional>

namespace dialogs {

namespace {
std::optional<DateEntrySettings>& current()
{
    static std::optional<DateEntrySettings> settings;
    return settings;
}
} // namespace

DateEntrySettings DateEntrySettings::fromShortDate(
    const QString& shortDateText, const QString& separator)
{
    DateEntrySettings settings;
    QString pattern = shortDateText;
    pattern.replace(QStringLiteral("31"), QStringLiteral("dd"));
    pattern.replace(QStringLiteral("12"), QStringLiteral("mm"));
    pattern.replace(QStringLiteral("1899"), QStringLiteral("yyyy"));
    settings.DatePattern = pattern;
    settings.DateSeparator = separator;

    const qsizetype first = separator.isEmpty() ? -1 : pattern.indexOf(separator);
    if (first > 0) {
        settings.DateSep1Pos = static_cast<int16_t>(first);
        settings.DateSep2Pos = static_cast<int16_t>(pattern.indexOf(separator, first + 1));
    } else {
        settings.DateSep1Pos = 2;
        settings.DateSep2Pos = 5;
    }
    return settings;
}

DateEntrySettings DateEntrySettings::fromSystem()
{
    const QDateTime lastDayOf1899(QDate(1899, 12, 31), QTime(0, 0));
    return fromShortDate(core::text::format(lastDayOf1899, core::text::shortDatePattern()),
        core::text::dateSeparator());
}

const DateEntrySettings& dateEntrySettings()
{
    auto& settings = current();
    if (!settings)
        settings = DateEntrySettings::fromSystem();
    return *settings;
}

void setDateEntrySettings(const DateEntrySettings& settings)
{
    current() = settings;
}

} // namespace dialogs
