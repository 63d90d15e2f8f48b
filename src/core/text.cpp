#include "core/text.h"

#include "core/comerror.h"
#include "core/dateformatting_p.h"
#include "core/dateparsing_p.h"
#include "core/numbertext_p.h"

#include <QLocale>
#include <utility>
#include <vector>

namespace core::text {

namespace {

Qt::CaseSensitivity sensitivity(Compare compare)
{
    return compare == Compare::Text ? Qt::CaseInsensitive : Qt::CaseSensitive;
}

[[noreturn]] void raiseInvalidCall()
{
    throw ComError::basic(ErrorNumber::InvalidProcedureCall);
}

/// One element of a Like pattern; every element but Star matches exactly one character.
struct LikeElement {
    enum Kind { Literal, AnyChar, Digit, Star, List } kind;
    QChar literal;
    std::vector<std::pair<QChar, QChar>> ranges; // for List: single characters are c-c
    bool negated = false;
};

std::vector<LikeElement> parseLikePattern(const QString& pattern)
{
    std::vector<LikeElement> elements;
    for (qsizetype i = 0; i < pattern.size(); ++i) {
        const QChar c = pattern[i];
        if (c == u'?') {
            elements.push_back({ LikeElement::AnyChar, {}, {}, false });
        } else if (c == u'#') {
            elements.push_back({ LikeElement::Digit, {}, {}, false });
        } else if (c == u'*') {
            if (elements.empty() || elements.back().kind != LikeElement::Star)
                elements.push_back({ LikeElement::Star, {}, {}, false });
        } else if (c == u'[') {
            const qsizetype close = pattern.indexOf(u']', i + 1);
            if (close < 0)
                throw ComError::basic(ErrorNumber::InvalidPatternString);
            QStringView list = QStringView(pattern).sliced(i + 1, close - i - 1);
            i = close;
            if (list.isEmpty())
                continue; // "[]" matches the empty string: nothing to consume
            LikeElement element { LikeElement::List, {}, {}, false };
            if (list.size() > 1 && list.front() == u'!') {
                element.negated = true;
                list = list.sliced(1);
            }
            for (qsizetype j = 0; j < list.size();) {
                if (j + 2 < list.size() && list[j + 1] == u'-') {
                    if (list[j] > list[j + 2])
                        throw ComError::basic(ErrorNumber::InvalidPatternString);
                    element.ranges.emplace_back(list[j], list[j + 2]);
                    j += 3;
                } else {
                    element.ranges.emplace_back(list[j], list[j]);
                    ++j;
                }
            }
            elements.push_back(std::move(element));
        } else {
            elements.push_back({ LikeElement::Literal, c, {}, false });
        }
    }
    return elements;
}

bool inRange(QChar c, const std::pair<QChar, QChar>& range, Compare compare)
{
    if (c >= range.first && c <= range.second)
        return true;
    if (compare == Compare::Binary)
        return false;
    const QChar folded = c.toCaseFolded();
    return folded >= range.first.toCaseFolded() && folded <= range.second.toCaseFolded();
}

bool matchesOne(const LikeElement& element, QChar c, Compare compare)
{
    switch (element.kind) {
    case LikeElement::AnyChar:
        return true;
    case LikeElement::Digit:
        return c >= u'0' && c <= u'9';
    case LikeElement::Literal:
        return compare == Compare::Text ? c.toCaseFolded() == element.literal.toCaseFolded()
                                        : c == element.literal;
    case LikeElement::List: {
        bool found = false;
        for (const auto& range : element.ranges)
            found = found || inRange(c, range, compare);
        return found != element.negated;
    }
    case LikeElement::Star:
        break;
    }
    return false;
}

} // namespace

bool equalsText(const QString& a, const QString& b)
{
    return a.compare(b, Qt::CaseInsensitive) == 0;
}

int inStr(int start, const QString& text, const QString& find, Compare compare)
{
    if (start < 1)
        raiseInvalidCall();
    if (text.isEmpty() || start > text.size())
        return 0;
    if (find.isEmpty())
        return start;
    const qsizetype found = text.indexOf(find, start - 1, sensitivity(compare));
    return found < 0 ? 0 : static_cast<int>(found) + 1;
}

int inStr(const QString& text, const QString& find, Compare compare)
{
    return inStr(1, text, find, compare);
}

int inStrRev(const QString& text, const QString& find, int start, Compare compare)
{
    if (start == 0 || start < -1)
        raiseInvalidCall();
    const qsizetype end = start == -1 ? text.size() : start;
    if (text.isEmpty() || end > text.size())
        return 0;
    if (find.isEmpty())
        return static_cast<int>(end);
    // The match has to end at or before position `end`.
    const qsizetype lastStart = end - find.size();
    if (lastStart < 0)
        return 0;
    const qsizetype found = text.lastIndexOf(find, lastStart, sensitivity(compare));
    return found < 0 ? 0 : static_cast<int>(found) + 1;
}

QString trimSpaces(const QString& text)
{
    return trimLeftSpaces(trimRightSpaces(text));
}

QString trimLeftSpaces(const QString& text)
{
    qsizetype first = 0;
    while (first < text.size() && text[first] == u' ')
        ++first;
    return text.mid(first);
}

QString trimRightSpaces(const QString& text)
{
    qsizetype end = text.size();
    while (end > 0 && text[end - 1] == u' ')
        --end;
    return text.left(end);
}

QString left(const QString& text, int length)
{
    return length <= 0 ? QString() : text.left(length);
}

QString right(const QString& text, int length)
{
    return length <= 0 ? QString() : text.right(length);
}

QString mid(const QString& text, int start, int length)
{
    const qsizetype from = std::max(start, 1) - 1;
    if (from >= text.size())
        return QString();
    return length < 0 ? text.mid(from) : text.mid(from, length);
}

QString replace(const QString& text, const QString& find, const QString& with, Compare compare)
{
    if (find.isEmpty())
        return text;
    return QString(text).replace(find, with, sensitivity(compare));
}

bool like(const QString& text, const QString& pattern, Compare compare)
{
    const std::vector<LikeElement> elements = parseLikePattern(pattern);
    // Every element but Star takes one character, so backtracking to the last Star is
    // enough (and linear in practice, unlike recursive matching).
    size_t e = 0;
    qsizetype t = 0;
    size_t starElement = elements.size();
    qsizetype starText = 0;
    while (t < text.size()) {
        if (e < elements.size() && elements[e].kind == LikeElement::Star) {
            starElement = e++;
            starText = t;
        } else if (e < elements.size() && matchesOne(elements[e], text[t], compare)) {
            ++e;
            ++t;
        } else if (starElement < elements.size()) {
            e = starElement + 1;
            t = ++starText;
        } else {
            return false;
        }
    }
    while (e < elements.size() && elements[e].kind == LikeElement::Star)
        ++e;
    return e == elements.size();
}

QString format(const QDateTime& value, const QString& pattern)
{
    if (!value.isValid())
        return QString();
    return detail::formatDateTime(value.date(), value.time(), pattern, QLocale());
}

QString dateSeparator()
{
    const detail::DateLayout layout = detail::shortDateLayout(QLocale());
    return layout.separators.empty() ? QString() : layout.separators.front();
}

QString shortDatePattern()
{
    const detail::DateLayout layout = detail::shortDateLayout(QLocale());
    QString pattern;
    for (size_t i = 0; i < layout.fields.size(); ++i) {
        if (i > 0)
            pattern += layout.separators[i - 1];
        switch (layout.fields[i].kind) {
        case 'd':
            pattern += u"dd";
            break;
        case 'm':
            pattern += u"mm";
            break;
        default:
            pattern += u"yyyy";
            break;
        }
    }
    return pattern;
}

} // namespace core::text
