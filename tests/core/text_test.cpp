#include "core/text.h"
#include "corefixture.h"

using coretest::errorOf;
using coretest::LocaleScope;
using namespace core::text;

TEST(TextLike, PatternsMatchLikeBasic)
{
    struct Case {
        const char* name;
        const char16_t* text;
        const char16_t* pattern;
        Compare compare;
        bool matches;
    };
    const Case cases[] = {
        { "star in the middle", u"abc", u"a*c", Compare::Binary, true },
        { "star matches nothing", u"ac", u"a*c", Compare::Binary, true },
        { "question mark needs a character", u"ac", u"a?c", Compare::Binary, false },
        { "hash is a digit", u"a5", u"a#", Compare::Binary, true },
        { "hash is not a letter", u"ab", u"a#", Compare::Binary, false },
        { "range", u"bx", u"[a-c]x", Compare::Binary, true },
        { "negated range", u"dx", u"[!a-c]x", Compare::Binary, true },
        { "negated range excludes", u"bx", u"[!a-c]x", Compare::Binary, false },
        { "list of single characters", u"q", u"[xyzq]", Compare::Binary, true },
        { "special characters in brackets are literal", u"*?#", u"[*][?][#]", Compare::Binary,
            true },
        { "leading hyphen is literal", u"-", u"[-a]", Compare::Binary, true },
        { "trailing hyphen is literal", u"-", u"[a-]", Compare::Binary, true },
        { "lone exclamation mark is literal", u"!", u"[!]", Compare::Binary, true },
        { "empty brackets match nothing", u"a", u"[]a", Compare::Binary, true },
        { "binary compare is case-sensitive", u"ABC", u"a*", Compare::Binary, false },
        { "text compare ignores case", u"ABC", u"a*", Compare::Text, true },
        { "text compare ranges ignore case", u"Q", u"[a-z]", Compare::Text, true },
        { "binary compare ranges by code", u"Q", u"[a-z]", Compare::Binary, false },
        { "star needs backtracking", u"xyzxyzx", u"*x", Compare::Binary, true },
        { "several stars", u"aXbYc", u"a*b*c", Compare::Binary, true },
        { "star alone matches empty text", u"", u"*", Compare::Binary, true },
        { "empty pattern matches only empty text", u"a", u"", Compare::Binary, false },
        { "text longer than pattern", u"abcd", u"abc", Compare::Binary, false },
        { "many stars fail without blowing up", u"aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa",
            u"*a*a*a*a*a*a*a*a*a*b", Compare::Binary, false },
        { "Estonian letters fold", u"ÕUN", u"õ*", Compare::Text, true },
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(like(QString::fromUtf16(row.text), QString::fromUtf16(row.pattern), row.compare),
            row.matches);
    }
}

TEST(TextLike, MalformedPatternsRaiseInvalidPatternString)
{
    for (const char16_t* pattern : { u"a[", u"[z-a]", u"[abc" }) {
        SCOPED_TRACE(QString::fromUtf16(pattern).toStdString());
        EXPECT_EQ(errorOf([&] { like(QStringLiteral("a"), QString::fromUtf16(pattern)); }),
            core::ErrorNumber::InvalidPatternString);
    }
}

TEST(TextSearch, InStrAndInStrRevAreOneBased)
{
    const QString text = QStringLiteral("abcabc");
    EXPECT_EQ(inStr(text, QStringLiteral("c")), 3);
    EXPECT_EQ(inStr(4, text, QStringLiteral("c")), 6);
    EXPECT_EQ(inStr(text, QStringLiteral("C")), 0);
    EXPECT_EQ(inStr(text, QStringLiteral("C"), Compare::Text), 3);
    EXPECT_EQ(inStr(3, text, QString()), 3);
    EXPECT_EQ(inStr(7, text, QStringLiteral("a")), 0);
    EXPECT_EQ(inStr(QString(), QStringLiteral("a")), 0);
    EXPECT_EQ(errorOf([&] { inStr(0, text, QStringLiteral("a")); }),
        core::ErrorNumber::InvalidProcedureCall);

    EXPECT_EQ(inStrRev(text, QStringLiteral("bc")), 5);
    // From position 5 the second "bc" would end at 6, beyond the start.
    EXPECT_EQ(inStrRev(text, QStringLiteral("bc"), 5), 2);
    EXPECT_EQ(inStrRev(text, QStringLiteral("BC"), -1, Compare::Text), 5);
    EXPECT_EQ(inStrRev(text, QStringLiteral("x")), 0);
    EXPECT_EQ(inStrRev(text, QStringLiteral("abc"), 2), 0);
    EXPECT_EQ(inStrRev(text, QStringLiteral("a"), 9), 0);
    EXPECT_EQ(errorOf([&] { inStrRev(text, QStringLiteral("a"), 0); }),
        core::ErrorNumber::InvalidProcedureCall);
}

TEST(TextPieces, TrimLeftRightMidReplace)
{
    const QString padded = QStringLiteral("  \tab c\n  ");
    EXPECT_EQ(trimSpaces(padded), u"\tab c\n");
    EXPECT_EQ(trimLeftSpaces(padded), u"\tab c\n  ");
    EXPECT_EQ(trimRightSpaces(padded), u"  \tab c\n");
    EXPECT_EQ(trimSpaces(QStringLiteral("   ")), u"");

    const QString text = QStringLiteral("Hello");
    EXPECT_EQ(left(text, 2), u"He");
    EXPECT_EQ(left(text, 10), u"Hello");
    EXPECT_EQ(left(text, -1), u"");
    EXPECT_EQ(right(text, 3), u"llo");
    EXPECT_EQ(right(text, 0), u"");
    EXPECT_EQ(mid(text, 2), u"ello");
    EXPECT_EQ(mid(text, 2, 2), u"el");
    EXPECT_EQ(mid(text, 6), u"");
    EXPECT_EQ(mid(text, 0, 2), u"He");

    EXPECT_EQ(
        replace(QStringLiteral("a.b.c"), QStringLiteral("."), QStringLiteral("::")), u"a::b::c");
    EXPECT_EQ(replace(QStringLiteral("Aa"), QStringLiteral("a"), QStringLiteral("x")), u"Ax");
    EXPECT_EQ(
        replace(QStringLiteral("Aa"), QStringLiteral("a"), QStringLiteral("x"), Compare::Text),
        u"xx");
    EXPECT_EQ(replace(QStringLiteral("abc"), QString(), QStringLiteral("x")), u"abc");
    EXPECT_TRUE(equalsText(QStringLiteral("Õun"), QStringLiteral("õUN")));
}

TEST(TextFormat, DatePatterns)
{
    const QDateTime evening(QDate(2026, 12, 4), QTime(22, 48, 31));
    struct Case {
        const char* name;
        const char16_t* locale;
        const char16_t* pattern;
        const char16_t* expected;
    };
    const Case cases[] = {
        { "upper-case compact stamp", u"en_US", u"DDYYMMHHNNSS", u"042612224831" },
        { "dotted date", u"en_US", u"dd.mm.yyyy", u"04.12.2026" },
        { "slash is the US separator", u"en_US", u"mm/dd/yyyy", u"12/04/2026" },
        { "slash is the Estonian separator", u"et_EE", u"mm/dd/yyyy", u"12.04.2026" },
        { "slash alone gives the separator", u"et_EE", u"/", u"." },
        { "m after h is minutes", u"en_US", u"hh:mm", u"22:48" },
        { "m before s is minutes", u"en_US", u"mm:ss", u"48:31" },
        { "unpadded fields", u"en_US", u"d/m/yy h:n:s", u"4/12/26 22:48:31" },
        { "12-hour clock", u"en_US", u"h:nn AM/PM", u"10:48 PM" },
        { "lower-case half", u"en_US", u"hh a/p", u"10 p" },
        { "day and month names", u"en_US", u"dddd d mmmm", u"Friday 4 December" },
        { "short names", u"en_US", u"ddd mmm", u"Fri Dec" },
        { "day of the year", u"en_US", u"y", u"338" },
        { "Finnish month alone", u"fi_FI", u"mmmm", u"joulukuu" },
        { "Finnish month after a day is inflected", u"fi_FI", u"d. mmmm", u"4. joulukuuta" },
        { "quoted and escaped literals", u"en_US", u"\"day\" d \\h", u"day 4 h" },
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(row.name);
        const LocaleScope locale(QString::fromUtf16(row.locale));
        EXPECT_EQ(
            format(evening, QString::fromUtf16(row.pattern)), QString::fromUtf16(row.expected));
    }
    EXPECT_EQ(format(QDateTime(QDate(2026, 1, 2), QTime(0, 5)), QStringLiteral("h:nn am/pm")),
        u"12:05 am");
    EXPECT_EQ(format(QDateTime(QDate(987, 1, 2), QTime()), QStringLiteral("yyyy")), u"0987");
    EXPECT_EQ(format(QDateTime(), QStringLiteral("yyyy")), u"");
}

TEST(TextFormat, ShortDatePatternAlwaysHasAFourDigitYear)
{
    struct Case {
        const char16_t* locale;
        const char16_t* pattern;
        const char16_t* separator;
    };
    const Case cases[] = {
        { u"en_US", u"mm/dd/yyyy", u"/" }, // "M/d/yy"
        { u"et_EE", u"dd.mm.yyyy", u"." }, // "dd.MM.yy"
        { u"lv_LV", u"dd.mm.yyyy", u"." },
        { u"en_GB", u"dd/mm/yyyy", u"/" },
        { u"sv_SE", u"yyyy-mm-dd", u"-" },
        { u"bg_BG", u"dd.mm.yyyy", u"." }, // the quoted year suffix is no part of the date
        { u"hu_HU", u"yyyy. mm. dd", u". " },
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(QString::fromUtf16(row.locale).toStdString());
        const LocaleScope locale(QString::fromUtf16(row.locale));
        EXPECT_EQ(shortDatePattern(), QString::fromUtf16(row.pattern));
        EXPECT_EQ(dateSeparator(), QString::fromUtf16(row.separator));
    }
}
