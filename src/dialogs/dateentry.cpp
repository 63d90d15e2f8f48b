#include "dialogs/dateentry.h"

#include "core/text.h"

#include <QDateTime>
#include <algorithm>
#include <vector>

namespace dialogs {

namespace {

constexpr int MinYear = 100;
constexpr int MaxYear = 9999;
// A digit is taken only while the caret stands within the first ten characters, the
// length of every four-digit-year mask.
constexpr int DigitCaretLimit = 10;

/// A run of one pattern letter in a mask: "dd", "mm" or "yyyy".
struct MaskPart {
    qsizetype start = 0;
    qsizetype length = 0;
    char16_t letter = u'd'; // 'd', 'm' or 'y'
};

bool isPatternLetter(QChar ch)
{
    const char16_t lower = ch.toLower().unicode();
    return lower == u'd' || lower == u'm' || lower == u'y';
}

std::vector<MaskPart> maskParts(const QString& pattern)
{
    std::vector<MaskPart> parts;
    for (qsizetype i = 0; i < pattern.size(); ++i) {
        if (!isPatternLetter(pattern.at(i)))
            continue;
        const char16_t letter = pattern.at(i).toLower().unicode();
        if (!parts.empty() && parts.back().letter == letter
            && parts.back().start + parts.back().length == i) {
            ++parts.back().length;
        } else {
            parts.push_back({ i, 1, letter });
        }
    }
    return parts;
}

std::vector<char16_t> partOrder(const QString& pattern)
{
    std::vector<char16_t> order;
    for (const MaskPart& part : maskParts(pattern)) {
        if (std::find(order.begin(), order.end(), part.letter) == order.end())
            order.push_back(part.letter);
    }
    if (order.size() != 3)
        return { u'd', u'm', u'y' };
    return order;
}

bool isSeparatorChar(QChar ch)
{
    static const QString separators = QStringLiteral("./-, ");
    return separators.contains(ch) || core::text::dateSeparator().contains(ch);
}

bool isDigitKey(int key)
{
    return key >= '0' && key <= '9';
}

bool isSeparatorKey(int key, const DateEntrySettings& settings)
{
    return key == '/' || key == '.' || key == ',' || key == '-'
        || (!settings.DateSeparator.isEmpty() && key == settings.DateSeparator.at(0).unicode());
}

int windowedYear(const QString& digits)
{
    const int year = digits.toInt();
    if (digits.size() > 2)
        return year;
    return year < 30 ? 2000 + year : 1900 + year;
}

/// The typed text completed to the mask's shape: each typed part kept (a part being
/// typed is padded: day and month with zeros, the year with today's leading digits),
/// the parts not typed yet taken from today. Also gives where the caret ends up.
struct Completion {
    QString text;
    int caret = 0;
};

Completion completeFromToday(
    const TextEdit& edit, const DateEntrySettings& settings, const QDate& today)
{
    const QString& mask = settings.DatePattern;
    const std::vector<MaskPart> parts = maskParts(mask);
    const QString todayText = formatDate(today, mask);
    if (parts.empty())
        return { todayText, 0 };

    std::vector<QString> typed(parts.size());
    size_t current = 0;
    bool endedOnSeparator = false;
    for (const QChar ch : edit.text) {
        if (current >= parts.size())
            break;
        if (ch.isDigit()) {
            if (typed[current].size() == parts[current].length) {
                if (++current >= parts.size())
                    break;
            }
            typed[current] += ch;
            endedOnSeparator = false;
        } else {
            ++current;
            endedOnSeparator = true;
        }
    }

    QString result = todayText;
    for (size_t i = 0; i < parts.size(); ++i) {
        if (typed[i].isEmpty())
            continue;
        const MaskPart& part = parts[i];
        QString digits = typed[i].left(part.length);
        if (digits.size() < part.length) {
            digits = part.letter == u'y'
                ? todayText.mid(part.start, part.length - digits.size()) + digits
                : digits.rightJustified(part.length, u'0');
        }
        result.replace(part.start, part.length, digits);
    }

    // A caret inside the typed text stays; one at its end follows the completed part.
    qsizetype caret = std::min(static_cast<qsizetype>(edit.selStart), result.size());
    if (edit.selStart >= edit.text.size()) {
        if (current >= parts.size())
            caret = result.size();
        else if (endedOnSeparator)
            caret = parts[current].start;
        else
            caret = parts[current].start + parts[current].length;
    }
    return { result, static_cast<int>(caret) };
}

/// The mask part that starts at `position`: its length, up to the next separator.
int partLengthAt(const QString& mask, int position)
{
    int end = position;
    while (end < mask.size() && isPatternLetter(mask.at(end)))
        ++end;
    return end - position;
}

} // namespace

std::optional<QDate> parseDateText(const QString& text, const QString& pattern, const QDate& today)
{
    const QString trimmed = core::text::trimSpaces(text);
    if (trimmed.isEmpty())
        return std::nullopt;

    std::vector<QString> groups;
    QString group;
    for (const QChar ch : trimmed) {
        if (ch.isDigit() && ch.unicode() < 128) {
            group += ch;
        } else if (isSeparatorChar(ch) && !group.isEmpty()) {
            groups.push_back(group);
            group.clear();
        } else {
            return std::nullopt;
        }
    }
    if (group.isEmpty())
        return std::nullopt;
    groups.push_back(group);
    if (groups.size() < 2 || groups.size() > 3)
        return std::nullopt;
    if (std::any_of(groups.begin(), groups.end(), [](const QString& g) { return g.size() > 4; }))
        return std::nullopt;

    std::vector<char16_t> order = partOrder(pattern);
    if (groups.size() == 2) {
        order.erase(std::find(order.begin(), order.end(), u'y'));
        groups.push_back(QString::number(today.year()));
        order.push_back(u'y');
    } else if (groups[0].size() > 2 && order[0] != u'y') {
        order = { u'y', u'm', u'd' };
    }

    int day = 0;
    int month = 0;
    int year = 0;
    for (size_t i = 0; i < 3; ++i) {
        const QString& digits = groups[i];
        switch (order[i]) {
        case u'd':
            if (digits.size() > 2)
                return std::nullopt;
            day = digits.toInt();
            break;
        case u'm':
            if (digits.size() > 2)
                return std::nullopt;
            month = digits.toInt();
            break;
        default:
            year = windowedYear(digits);
            break;
        }
    }
    const QDate date(year, month, day);
    if (!date.isValid() || year < MinYear || year > MaxYear)
        return std::nullopt;
    return date;
}

QString formatDate(const QDate& date, const QString& pattern)
{
    // Noon, so that a daylight-saving change at midnight cannot move the day.
    return core::text::format(QDateTime(date, QTime(12, 0)), pattern);
}

KeyOutcome TypeDateKey(
    const TextEdit& edit, int key, const DateEntrySettings& settings, const QDate& today)
{
    const QString& mask = settings.DatePattern;
    TextEdit result = edit;

    if ((key == '+' || key == '-') && edit.isAllSelected()) {
        if (const auto date = parseDateText(edit.text, mask, today)) {
            const QDate stepped = date->addDays(key == '+' ? 1 : -1);
            if (stepped.year() >= MinYear && stepped.year() <= MaxYear) {
                result.text = formatDate(stepped, mask);
                result.selStart = 0;
                result.selLength = static_cast<int>(result.text.size());
            }
        }
        return { result, 0 };
    }

    // Behind a complete date only a day offset may follow. Backspace stays usable there
    // too: without it a wrong last digit could not be taken back.
    if (edit.selStart >= mask.size() && !edit.text.isEmpty()) {
        const bool hasSuffix = edit.text.size() > mask.size();
        if (hasSuffix) {
            const bool accepted = isDigitKey(key) || key == KeyCode::Backspace;
            return { result, accepted ? key : 0 };
        }
        if (key == '+' || key == '-')
            return { result, key };
        if (key != KeyCode::Backspace)
            return { result, 0 };
    }

    if (isSeparatorKey(key, settings)) {
        if (edit.text.size() < mask.size()) {
            const Completion completion = completeFromToday(edit, settings, today);
            result.text = completion.text;
            result.selStart = completion.caret;
            result.selLength = 0;
        }
        int target = -1;
        if (result.selStart <= settings.DateSep1Pos)
            target = settings.DateSep1Pos + 1;
        else if (result.selStart <= settings.DateSep2Pos)
            target = settings.DateSep2Pos + 1;
        if (target >= 0 && target <= result.text.size()) {
            result.selStart = target;
            result.selLength = std::min(
                partLengthAt(mask, target), static_cast<int>(result.text.size()) - target);
        }
        return { result, 0 };
    }

    if (key == KeyCode::CtrlD) {
        result.text = formatDate(today, mask);
        result.selStart = 0;
        result.selLength = static_cast<int>(result.text.size());
        return { result, 0 };
    }

    if (key == KeyCode::Backspace) {
        const int caret = edit.selStart;
        if (caret == 0)
            return { result, key };
        int from = caret - 1;
        if (caret >= 2 && !settings.DateSeparator.isEmpty()
            && edit.text.at(caret - 1) == settings.DateSeparator.at(0))
            from = caret - 2;
        if (caret == 1)
            from = 0;
        result.selStart = from;
        result.selLength = static_cast<int>(edit.text.size()) - from;
        return { result, key };
    }

    if (isDigitKey(key)) {
        // The selection is replaced by the digit, so it does not count against the mask.
        const bool fits = edit.text.size() - edit.selLength < mask.size();
        return { result, (edit.selStart < DigitCaretLimit && fits) ? key : 0 };
    }

    return { result, key < 32 ? key : 0 };
}

TextEdit InsertDateSeparator(const TextEdit& edit, const DateEntrySettings& settings)
{
    const int caret = edit.selStart;
    if (edit.selLength != 0 || caret != edit.text.size())
        return edit;
    if (caret != settings.DateSep1Pos && caret != settings.DateSep2Pos)
        return edit;
    if (settings.DateSeparator.isEmpty() || edit.text.endsWith(settings.DateSeparator))
        return edit;
    TextEdit result = edit;
    result.text += settings.DateSeparator;
    result.selStart = static_cast<int>(result.text.size());
    return result;
}

KeyOutcome pressDateKey(
    const TextEdit& edit, int key, const DateEntrySettings& settings, const QDate& today)
{
    KeyOutcome outcome = TypeDateKey(edit, key, settings, today);
    if (outcome.key == 0)
        return outcome;
    if (outcome.key != KeyCode::Backspace && outcome.key < 32)
        return outcome;
    const TextEdit typed = typeKey(outcome.edit, outcome.key);
    if (typed.text == outcome.edit.text)
        return { typed, 0 };
    return { InsertDateSeparator(typed, settings), 0 };
}

QString ShiftDate(const QString& text, const QString& format, const QDate& today)
{
    const QString head = text.left(format.size());
    const QString suffix = text.mid(format.size());
    if (suffix.size() > 1 && (suffix.at(0) == u'+' || suffix.at(0) == u'-')) {
        const QString digits = suffix.mid(1);
        const bool allDigits = digits.size() <= 7
            && std::all_of(digits.begin(), digits.end(),
                [](QChar ch) { return ch.isDigit() && ch.unicode() < 128; });
        const auto date = parseDateText(head, format, today);
        if (allDigits && date) {
            const int days = digits.toInt();
            const QDate shifted = date->addDays(suffix.at(0) == u'+' ? days : -days);
            if (shifted.isValid() && shifted.year() >= MinYear && shifted.year() <= MaxYear)
                return formatDate(shifted, format);
        }
    }
    if (const auto date = parseDateText(text, format, today))
        return formatDate(*date, format);
    return text;
}

DateFieldState CheckDateField(
    const DateFieldState& field, const DateEntrySettings& settings, const QDate& today)
{
    DateFieldState result = field;
    if (!result.text.isEmpty())
        result.text = ShiftDate(result.text, settings.DatePattern, today);
    const bool valid
        = result.text.isEmpty() || parseDateText(result.text, settings.DatePattern, today);
    if (valid) {
        if (result.backColor == settings.FieldHighlightColor)
            result.backColor = WindowBackgroundColor;
    } else if (result.backColor == WindowBackgroundColor) {
        result.backColor = settings.FieldHighlightColor;
    }
    return result;
}

} // namespace dialogs
