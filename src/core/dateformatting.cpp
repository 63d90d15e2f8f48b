#include "core/dateformatting_p.h"

#include <QStringView>
#include <algorithm>
#include <charconv>
#include <climits>
#include <cmath>
#include <limits>
#include <string>

namespace core::detail {

namespace {

// ---- Date and time patterns --------------------------------------------------------

/// The unquoted pieces of a Qt date/time format: runs of one pattern letter and literal
/// text between them. Quoted text (Bulgarian "'г'.") is dropped: it is no part of a date
/// typed or shown in digits.
struct FormatPiece {
    QChar letter; // null for a literal
    qsizetype count;
    QString literal;
};

std::vector<FormatPiece> splitQtFormat(const QString& format, QStringView letters)
{
    std::vector<FormatPiece> pieces;
    bool quoted = false;
    for (qsizetype i = 0; i < format.size();) {
        const QChar c = format[i];
        if (c == u'\'') {
            quoted = !quoted;
            ++i;
        } else if (!quoted && letters.contains(c)) {
            qsizetype end = i;
            while (end < format.size() && format[end] == c)
                ++end;
            pieces.push_back({ c, end - i, {} });
            i = end;
        } else {
            if (!quoted) {
                if (pieces.empty() || !pieces.back().letter.isNull())
                    pieces.push_back({ QChar(), 0, {} });
                pieces.back().literal += c;
            }
            ++i;
        }
    }
    return pieces;
}

QString escaped(const QString& literal)
{
    QString result;
    for (const QChar c : literal) {
        result += u'\\';
        result += c;
    }
    return result;
}

struct TimeLayout {
    int hourWidth = 2;
    QString separator = QStringLiteral(":");
    int dayHalf = 0; // 0 none, -1 before the time, 1 after it
    QString dayHalfGap = QStringLiteral(" ");
};

TimeLayout shortTimeLayout(const QLocale& locale)
{
    const std::vector<FormatPiece> pieces
        = splitQtFormat(locale.timeFormat(QLocale::ShortFormat), u"hHmsapAPt");
    TimeLayout layout;
    qsizetype hourAt = -1;
    qsizetype dayHalfAt = -1;
    for (size_t i = 0; i < pieces.size(); ++i) {
        const QChar letter = pieces[i].letter.toLower();
        if (letter == u'h' && hourAt < 0) {
            hourAt = static_cast<qsizetype>(i);
            layout.hourWidth = pieces[i].count >= 2 ? 2 : 1;
            if (i + 2 < pieces.size() && pieces[i + 1].letter.isNull()
                && pieces[i + 2].letter == u'm')
                layout.separator = pieces[i + 1].literal;
        } else if (letter == u'a' && dayHalfAt < 0) {
            dayHalfAt = static_cast<qsizetype>(i);
        }
    }
    if (dayHalfAt >= 0) {
        // Qt writes AM/PM as "AP": an 'A' run and a 'P' run; the gap lies outside both.
        layout.dayHalf = dayHalfAt < hourAt ? -1 : 1;
        qsizetype gapAt = dayHalfAt - 1;
        const auto size = static_cast<qsizetype>(pieces.size());
        if (layout.dayHalf < 0) {
            gapAt = dayHalfAt + 1;
            while (gapAt < size && pieces[static_cast<size_t>(gapAt)].letter.toLower() == u'p')
                ++gapAt;
        }
        if (gapAt >= 0 && gapAt < size && pieces[static_cast<size_t>(gapAt)].letter.isNull())
            layout.dayHalfGap = pieces[static_cast<size_t>(gapAt)].literal;
    }
    return layout;
}

// ---- Format$ -----------------------------------------------------------------------

struct FormatToken {
    enum Kind { Literal, Day, Month, Minute, Year, Hour, Second, DayHalf } kind;
    qsizetype count = 0;
    QString text; // the literal, or the AM/PM form as written
};

/// AM/PM forms of Format$ at the start of `text`, longest first.
qsizetype dayHalfFormLength(QStringView text)
{
    for (const QStringView form :
        { QStringView(u"am/pm"), QStringView(u"ampm"), QStringView(u"a/p") }) {
        if (text.startsWith(form, Qt::CaseInsensitive))
            return form.size();
    }
    return 0;
}

std::vector<FormatToken> tokenizeFormat(const QString& pattern, const QString& dateSep)
{
    std::vector<FormatToken> tokens;
    const auto addLiteral = [&tokens](QStringView text) {
        if (tokens.empty() || tokens.back().kind != FormatToken::Literal)
            tokens.push_back({ FormatToken::Literal, 0, {} });
        tokens.back().text += text;
    };
    for (qsizetype i = 0; i < pattern.size();) {
        const QChar c = pattern[i];
        const QChar lower = c.toLower();
        if (c == u'"') {
            const qsizetype end = pattern.indexOf(u'"', i + 1);
            const qsizetype stop = end < 0 ? pattern.size() : end;
            addLiteral(QStringView(pattern).sliced(i + 1, stop - i - 1));
            i = stop + 1;
        } else if (c == u'\\') {
            if (i + 1 < pattern.size())
                addLiteral(QStringView(pattern).sliced(i + 1, 1));
            i += 2;
        } else if (c == u'/') {
            addLiteral(dateSep);
            ++i;
        } else if (const qsizetype length = dayHalfFormLength(QStringView(pattern).sliced(i))) {
            tokens.push_back({ FormatToken::DayHalf, 0, pattern.mid(i, length) });
            i += length;
        } else if (QStringView(u"dmyhns").contains(lower)) {
            qsizetype end = i;
            while (end < pattern.size() && pattern[end].toLower() == lower)
                ++end;
            FormatToken::Kind kind = FormatToken::Second;
            switch (lower.unicode()) {
            case u'd':
                kind = FormatToken::Day;
                break;
            case u'm':
                kind = FormatToken::Month;
                break;
            case u'y':
                kind = FormatToken::Year;
                break;
            case u'h':
                kind = FormatToken::Hour;
                break;
            case u'n':
                kind = FormatToken::Minute;
                break;
            default:
                break;
            }
            tokens.push_back({ kind, end - i, {} });
            i = end;
        } else {
            addLiteral(QStringView(pattern).sliced(i, 1));
            ++i;
        }
    }
    // "m" and "mm" are minutes right after an hour or right before seconds ("hh:mm",
    // "mm:ss"), otherwise months.
    for (size_t i = 0; i < tokens.size(); ++i) {
        if (tokens[i].kind != FormatToken::Month || tokens[i].count > 2)
            continue;
        const auto isField
            = [](const FormatToken& token) { return token.kind != FormatToken::Literal; };
        const auto before
            = std::find_if(tokens.rbegin() + static_cast<std::ptrdiff_t>(tokens.size() - i),
                tokens.rend(), isField);
        const auto after = std::find_if(
            tokens.begin() + static_cast<std::ptrdiff_t>(i + 1), tokens.end(), isField);
        if ((before != tokens.rend() && before->kind == FormatToken::Hour)
            || (after != tokens.end() && after->kind == FormatToken::Second))
            tokens[i].kind = FormatToken::Minute;
    }
    return tokens;
}

QString padded(int value, qsizetype width)
{
    return QString::number(value).rightJustified(width, u'0');
}

QString dayHalfText(const QString& form, bool isAm, const QLocale& locale)
{
    if (form.compare(u"ampm", Qt::CaseInsensitive) == 0)
        return isAm ? locale.amText() : locale.pmText();
    // "AM/PM" and "A/P" print the half that is written, in the case it is written in.
    const qsizetype slash = form.indexOf(u'/');
    return isAm ? form.left(slash) : form.mid(slash + 1);
}

} // namespace

DateLayout shortDateLayout(const QLocale& locale)
{
    const std::vector<FormatPiece> pieces
        = splitQtFormat(locale.dateFormat(QLocale::ShortFormat), u"dMy");
    DateLayout layout;
    QString pending;
    for (const FormatPiece& piece : pieces) {
        if (piece.letter.isNull()) {
            pending += piece.literal;
            continue;
        }
        if (piece.letter == u'd' && piece.count >= 3)
            continue; // a weekday name has no place in a numeric date
        if (!layout.fields.empty())
            layout.separators.push_back(pending);
        pending.clear();
        const char kind = piece.letter == u'd' ? 'd' : piece.letter == u'M' ? 'm' : 'y';
        layout.fields.push_back({ kind, static_cast<int>(piece.count) });
    }
    std::string kinds;
    for (const DateLayout::Field& field : layout.fields)
        kinds += field.kind;
    std::sort(kinds.begin(), kinds.end());
    if (kinds != "dmy") {
        // A locale without a usable numeric short date: fall back to ISO order.
        layout.fields = { { 'y', 4 }, { 'm', 2 }, { 'd', 2 } };
        layout.separators = { QStringLiteral("-"), QStringLiteral("-") };
    }
    return layout;
}

QString timeSeparator(const QLocale& locale)
{
    return shortTimeLayout(locale).separator;
}

QString dateDisplayPattern(const QLocale& locale)
{
    const DateLayout layout = shortDateLayout(locale);
    QString pattern;
    for (size_t i = 0; i < layout.fields.size(); ++i) {
        if (i > 0)
            pattern += escaped(layout.separators[i - 1]);
        const DateLayout::Field& field = layout.fields[i];
        if (field.kind == 'y')
            pattern += u"yyyy";
        else
            pattern += QString(
                std::min(field.width, field.kind == 'd' ? 2 : 4), QLatin1Char(field.kind));
    }
    return pattern;
}

QString timeDisplayPattern(const QLocale& locale)
{
    const TimeLayout layout = shortTimeLayout(locale);
    // Finnish writes times as 9.05.00, which reads back as 9 May 2000; a colon keeps a
    // time of day readable as one.
    const QString separator = escaped(layout.separator == shortDateLayout(locale).separators.front()
            ? QStringLiteral(":")
            : layout.separator);
    const QString time = QString(layout.hourWidth, u'h') + separator + u"nn" + separator + u"ss";
    if (layout.dayHalf < 0)
        return u"ampm" + escaped(layout.dayHalfGap) + time;
    if (layout.dayHalf > 0)
        return time + escaped(layout.dayHalfGap) + u"ampm";
    return time;
}

QString formatDateTime(
    const QDate& date, const QTime& time, const QString& pattern, const QLocale& locale)
{
    const DateLayout layout = shortDateLayout(locale);
    const QString dateSep = layout.separators.empty() ? QString() : layout.separators.front();
    const std::vector<FormatToken> tokens = tokenizeFormat(pattern, dateSep);
    const bool twelveHours = std::any_of(tokens.begin(), tokens.end(),
        [](const FormatToken& token) { return token.kind == FormatToken::DayHalf; });
    // Languages that inflect month names ("4. joulukuuta", but "joulukuu" alone) take the
    // inflected form next to a day number.
    const bool hasDayNumber
        = std::any_of(tokens.begin(), tokens.end(), [](const FormatToken& token) {
              return token.kind == FormatToken::Day && token.count <= 2;
          });
    const auto monthFormat
        = [](qsizetype count) { return count == 3 ? QLocale::ShortFormat : QLocale::LongFormat; };
    QString text;
    for (const FormatToken& token : tokens) {
        switch (token.kind) {
        case FormatToken::Literal:
            text += token.text;
            break;
        case FormatToken::Day:
            if (token.count <= 2)
                text += padded(date.day(), token.count);
            else if (token.count <= 4)
                text += locale.dayName(date.dayOfWeek(),
                    token.count == 3 ? QLocale::ShortFormat : QLocale::LongFormat);
            else if (token.count == 5)
                text += formatDateTime(date, time, dateDisplayPattern(locale), locale);
            else
                text += locale.toString(date, QLocale::LongFormat);
            break;
        case FormatToken::Month:
            if (token.count <= 2)
                text += padded(date.month(), token.count);
            else if (hasDayNumber)
                text += locale.monthName(date.month(), monthFormat(token.count));
            else
                text += locale.standaloneMonthName(date.month(), monthFormat(token.count));
            break;
        case FormatToken::Year:
            if (token.count == 1)
                text += QString::number(date.dayOfYear());
            else if (token.count == 2)
                text += padded(date.year() % 100, 2);
            else if (token.count == 3)
                text += padded(date.year() % 100, 2) + QString::number(date.dayOfYear());
            else
                text += padded(date.year(), 4);
            break;
        case FormatToken::Hour: {
            int hour = time.hour();
            if (twelveHours)
                hour = hour % 12 == 0 ? 12 : hour % 12;
            text += padded(hour, std::min<qsizetype>(token.count, 2));
            break;
        }
        case FormatToken::Minute:
            text += padded(time.minute(), std::min<qsizetype>(token.count, 2));
            break;
        case FormatToken::Second:
            text += padded(time.second(), std::min<qsizetype>(token.count, 2));
            break;
        case FormatToken::DayHalf:
            text += dayHalfText(token.text, time.hour() < 12, locale);
            break;
        }
    }
    return text;
}

} // namespace core::detail
