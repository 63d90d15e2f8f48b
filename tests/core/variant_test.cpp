#include "core/dictionary.h"
#include "corefixture.h"

using core::Currency;
using core::Variant;
using core::VariantArray;
using core::VariantType;
using core::ErrorNumber::InvalidProcedureCall;
using core::ErrorNumber::InvalidUseOfNull;
using core::ErrorNumber::ObjectDoesNotSupport;
using core::ErrorNumber::ObjectVariableNotSet;
using core::ErrorNumber::OutOfMemory;
using core::ErrorNumber::Overflow;
using core::ErrorNumber::SubscriptOutOfRange;
using core::ErrorNumber::TypeMismatch;
using coretest::errorOf;
using coretest::LocaleScope;
using coretest::oleDate;

namespace {

Variant integer(int value)
{
    return Variant(static_cast<int16_t>(value));
}
Variant byte(int value)
{
    return Variant(static_cast<uint8_t>(value));
}
Variant currency(int64_t scaled)
{
    return Variant(Currency { scaled });
}
Variant date(double value)
{
    return Variant::fromDate(value);
}
Variant text(const char16_t* value)
{
    return Variant(value);
}

struct ConversionCase {
    const char* name;
    const char16_t* locale;
    Variant input;
    VariantType target;
    Variant expected; // unused when error is set
    int32_t error = 0;
};

void checkConversions(const std::vector<ConversionCase>& cases)
{
    for (const ConversionCase& row : cases) {
        SCOPED_TRACE(row.name);
        const LocaleScope locale(QString::fromUtf16(row.locale));
        Variant result;
        const int32_t error = errorOf([&] { result = row.input.convertedTo(row.target); });
        EXPECT_EQ(error, row.error);
        if (row.error == 0 && error == 0) {
            EXPECT_EQ(result.type(), row.expected.type());
            EXPECT_EQ(result, row.expected);
        }
    }
}

const auto Byte = VariantType::Byte;
const auto Integer = VariantType::Integer;
const auto Long = VariantType::Long;
const auto Single = VariantType::Single;
const auto Double = VariantType::Double;
const auto Cur = VariantType::Currency;
const auto Date = VariantType::Date;
const auto Boolean = VariantType::Boolean;
const auto String = VariantType::String;

} // namespace

TEST(VariantConversion, IntegersRoundHalfToEvenAndOverflowAtTheEdges)
{
    checkConversions({
        { "CInt(2.5) rounds down to even", u"en_US", 2.5, Integer, integer(2) },
        { "CInt(3.5) rounds up to even", u"en_US", 3.5, Integer, integer(4) },
        { "CInt(-2.5) rounds toward even", u"en_US", -2.5, Integer, integer(-2) },
        { "CInt(-3.5)", u"en_US", -3.5, Integer, integer(-4) },
        { "CInt(2.5000001) is above half", u"en_US", 2.5000001, Integer, integer(3) },
        { "CInt(32766.5) stays in range", u"en_US", 32766.5, Integer, integer(32766) },
        { "CInt(32767.5) rounds to 32768", u"en_US", 32767.5, Integer, {}, Overflow },
        { "CInt(-32768.5) rounds to even -32768", u"en_US", -32768.5, Integer, integer(-32768) },
        { "CInt(-32769) below range", u"en_US", -32769.0, Integer, {}, Overflow },
        { "CByte(-0.5) rounds to 0", u"en_US", -0.5, Byte, byte(0) },
        { "CByte(-0.6) rounds to -1", u"en_US", -0.6, Byte, {}, Overflow },
        { "CByte(254.5) rounds to even", u"en_US", 254.5, Byte, byte(254) },
        { "CByte(255.5) rounds to 256", u"en_US", 255.5, Byte, {}, Overflow },
        { "CByte(True) is -1", u"en_US", true, Byte, {}, Overflow },
        { "CLng(2147483646.5)", u"en_US", 2147483646.5, Long, Variant(int32_t(2147483646)) },
        { "CLng(2147483647.5)", u"en_US", 2147483647.5, Long, {}, Overflow },
        { "CLng(-2147483648.5) rounds to even", u"en_US", -2147483648.5, Long,
            Variant(std::numeric_limits<int32_t>::min()) },
        { "CLng(NaN)", u"en_US", std::nan(""), Long, {}, Overflow },
        { "CInt(CCur(2.5)) exact half", u"en_US", currency(25000), Integer, integer(2) },
        { "CInt(CCur(-3.5))", u"en_US", currency(-35000), Integer, integer(-4) },
        { "CInt(CCur(2.5001))", u"en_US", currency(25001), Integer, integer(3) },
        { "CInt(True) is -1", u"en_US", true, Integer, integer(-1) },
        { "CInt(Empty) is 0", u"en_US", Variant(), Integer, integer(0) },
        { "CLng(date) is its day number", u"en_US", date(oleDate(2026, 12, 4, 18)), Long,
            Variant(int32_t(oleDate(2026, 12, 5))) },
        { "CInt of text rounds too", u"en_US", text(u" 2.5 "), Integer, integer(2) },
        { "CInt(\"1E400\") overflows", u"en_US", text(u"1E400"), Integer, {}, Overflow },
        { "CByte(\"&HFF\")", u"en_US", text(u"&HFF"), Byte, byte(255) },
        { "CInt(\"&HFFFF\") is -1 like the literal", u"en_US", text(u"&HFFFF"), Integer,
            integer(-1) },
        { "CLng(\"&H10000\")", u"en_US", text(u"&H10000"), Long, Variant(int32_t(65536)) },
        { "CInt(\"&O17\")", u"en_US", text(u"&O17"), Integer, integer(15) },
    });
}

TEST(VariantConversion, UnconvertibleValuesRaiseTheirBasicErrors)
{
    auto object = std::make_shared<core::Dictionary>();
    checkConversions({
        { "CInt(Null)", u"en_US", Variant::null(), Integer, {}, InvalidUseOfNull },
        { "CStr(Null)", u"en_US", Variant::null(), String, {}, InvalidUseOfNull },
        { "CDate(Null)", u"en_US", Variant::null(), Date, {}, InvalidUseOfNull },
        { "CBool(Null)", u"en_US", Variant::null(), Boolean, {}, InvalidUseOfNull },
        { "CInt(\"abc\")", u"en_US", text(u"abc"), Integer, {}, TypeMismatch },
        { "CDbl(\"\")", u"en_US", text(u""), Double, {}, TypeMismatch },
        { "CDbl(\"   \")", u"en_US", text(u"   "), Double, {}, TypeMismatch },
        { "CDbl(\"1.2.3\")", u"en_US", text(u"1.2.3"), Double, {}, TypeMismatch },
        { "CDbl(\"-\")", u"en_US", text(u"-"), Double, {}, TypeMismatch },
        { "CDbl(\"&H\")", u"en_US", text(u"&H"), Double, {}, TypeMismatch },
        { "CDbl(\"&HFFFFFFFFF\")", u"en_US", text(u"&HFFFFFFFFF"), Double, {}, Overflow },
        { "CBool(\"yes\")", u"en_US", text(u"yes"), Boolean, {}, TypeMismatch },
        { "CDate(\"abc\")", u"en_US", text(u"abc"), Date, {}, TypeMismatch },
        { "CDate(\"5\")", u"en_US", text(u"5"), Date, {}, TypeMismatch },
        { "CDate(\"31.02.2026\")", u"et_EE", text(u"31.02.2026"), Date, {}, TypeMismatch },
        { "CDate(\"12/4/2026 25:00\")", u"en_US", text(u"12/4/2026 25:00"), Date, {},
            TypeMismatch },
        { "CDate(3000000) beyond 9999", u"en_US", 3000000.0, Date, {}, Overflow },
        { "CDate(-657435) before year 100", u"en_US", -657435.0, Date, {}, Overflow },
        { "CInt(Nothing)", u"en_US", Variant(core::ObjectPtr()), Integer, {},
            ObjectVariableNotSet },
        { "CStr(object) has no default member", u"en_US", Variant(object), String, {},
            ObjectDoesNotSupport },
        { "CLng(array)", u"en_US", Variant(VariantArray::fromList({ 1.0 })), Long, {},
            TypeMismatch },
        { "CDbl(error value)", u"en_US", Variant::error(5), Double, {}, TypeMismatch },
        { "CSng(1E39)", u"en_US", 1e39, Single, {}, Overflow },
        { "CCur(1E15)", u"en_US", 1e15, Cur, {}, Overflow },
    });
}

TEST(VariantConversion, OtherTypesFollowBasic)
{
    checkConversions({
        { "CDbl(True) is -1", u"en_US", true, Double, Variant(-1.0) },
        { "CDbl(Empty) is 0", u"en_US", Variant(), Double, Variant(0.0) },
        { "CDbl(CCur)", u"en_US", currency(12345), Double, Variant(1.2345) },
        { "CSng(0.1)", u"en_US", 0.1, Single, Variant(0.1f) },
        { "CSng(3.4028235E+38) is the largest Single", u"en_US", 3.4028235e38, Single,
            Variant(std::numeric_limits<float>::max()) },
        { "CBool(\"True\")", u"en_US", text(u"True"), Boolean, Variant(true) },
        { "CBool(\"false\") ignores case", u"en_US", text(u" false "), Boolean, Variant(false) },
        { "CBool(\"0\")", u"en_US", text(u"0"), Boolean, Variant(false) },
        { "CBool(\"-2\")", u"en_US", text(u"-2"), Boolean, Variant(true) },
        { "CBool(0.1)", u"en_US", 0.1, Boolean, Variant(true) },
        { "CBool(Empty)", u"en_US", Variant(), Boolean, Variant(false) },
        { "CDate(Empty) is day 0", u"en_US", Variant(), Date, date(0) },
        { "CDate(True) is 29 December 1899", u"en_US", true, Date, date(-1) },
        { "CCur(Empty)", u"en_US", Variant(), Cur, currency(0) },
        { "CCur(True)", u"en_US", true, Cur, currency(-10000) },
        { "CCur(1.23456) rounds to 4 decimals", u"en_US", 1.23456, Cur, currency(12346) },
        { "CStr(Empty)", u"en_US", Variant(), String, text(u"") },
        { "CStr(True)", u"en_US", true, String, text(u"True") },
        { "CStr(False)", u"en_US", false, String, text(u"False") },
        { "CStr(Byte)", u"en_US", byte(255), String, text(u"255") },
        { "CStr(-32768)", u"en_US", integer(-32768), String, text(u"-32768") },
    });
}

TEST(VariantConversion, CurrencyKeepsItsFullRangeThroughText)
{
    checkConversions({
        { "largest currency", u"en_US", text(u"922337203685477.5807"), Cur,
            currency(std::numeric_limits<int64_t>::max()) },
        { "smallest currency", u"en_US", text(u"-922337203685477.5808"), Cur,
            currency(std::numeric_limits<int64_t>::min()) },
        { "one above the largest", u"en_US", text(u"922337203685477.5808"), Cur, {}, Overflow },
        { "half of the last digit rounds to even (down)", u"en_US", text(u"0.00005"), Cur,
            currency(0) },
        { "half of the last digit rounds to even (up)", u"en_US", text(u"0.00015"), Cur,
            currency(2) },
        { "above half rounds up", u"en_US", text(u"0.000050001"), Cur, currency(1) },
        { "exponent", u"en_US", text(u"1.5E3"), Cur, currency(15000000) },
        { "tiny exponent", u"en_US", text(u"1E-30"), Cur, currency(0) },
        { "huge exponent", u"en_US", text(u"1E30"), Cur, {}, Overflow },
        { "Estonian decimal comma", u"et_EE", text(u"12,5"), Cur, currency(125000) },
        { "CStr drops trailing zeros", u"en_US", currency(15000), String, text(u"1.5") },
        { "CStr of a whole amount", u"en_US", currency(-20000), String, text(u"-2") },
        { "CStr with the locale's comma", u"et_EE", currency(12345), String, text(u"1,2345") },
        { "CStr of the smallest", u"en_US", currency(std::numeric_limits<int64_t>::min()), String,
            text(u"-922337203685477.5808") },
    });
}

TEST(VariantConversion, TextToNumberFollowsTheLocale)
{
    checkConversions({
        { "US decimal point", u"en_US", text(u"1,234.5"), Double, Variant(1234.5) },
        { "US comma is a group separator", u"en_US", text(u"1,5"), Double, Variant(15.0) },
        { "Estonian decimal comma", u"et_EE", text(u"1,5"), Double, Variant(1.5) },
        { "Estonian groups with a typed space", u"et_EE", text(u"1 234,5"), Double,
            Variant(1234.5) },
        { "Estonian groups with a no-break space", u"et_EE", text(u"1\u00a0234,5"), Double,
            Variant(1234.5) },
        { "Estonian has no decimal point", u"et_EE", text(u"1.5"), Double, {}, TypeMismatch },
        { "German point groups", u"de_DE", text(u"1.234,5"), Double, Variant(1234.5) },
        { "Estonian minus sign", u"et_EE", text(u"\u22125,5"), Double, Variant(-5.5) },
        { "ASCII minus in Estonian", u"et_EE", text(u"-5,5"), Double, Variant(-5.5) },
        { "parentheses are negative", u"en_US", text(u"(5)"), Double, Variant(-5.0) },
        { "trailing minus", u"en_US", text(u"5-"), Double, Variant(-5.0) },
        { "currency symbol", u"en_US", text(u"$ 1,000.25"), Double, Variant(1000.25) },
        { "euro after the amount", u"et_EE", text(u"12,50 €"), Double, Variant(12.5) },
        { "exponent", u"en_US", text(u"1.5e3"), Double, Variant(1500.0) },
        { "leading point", u"en_US", text(u".5"), Double, Variant(0.5) },
        { "underflow is zero", u"en_US", text(u"1e-400"), Double, Variant(0.0) },
        { "overflow", u"en_US", text(u"1e400"), Double, {}, Overflow },
        { "two signs", u"en_US", text(u"--5"), Double, {}, TypeMismatch },
    });
}

TEST(VariantConversion, DoublesPrintLikeBasic)
{
    checkConversions({
        { "0.1 without binary noise", u"en_US", 0.1, String, text(u"0.1") },
        { "15 significant digits", u"en_US", 1.0 / 3.0, String, text(u"0.333333333333333") },
        { "large whole number", u"en_US", 123456789012345.0, String, text(u"123456789012345") },
        { "16 digits go to exponent form", u"en_US", 1234567890123456.0, String,
            text(u"1.23456789012346E+15") },
        { "1E+20", u"en_US", 1e20, String, text(u"1E+20") },
        { "0.0001 is still plain", u"en_US", 0.0001, String, text(u"0.0001") },
        { "0.00001 is 1E-05", u"en_US", 0.00001, String, text(u"1E-05") },
        { "negative zero has no sign", u"en_US", -0.0, String, text(u"0") },
        { "Single keeps 7 digits", u"en_US", Variant(0.1f), String, text(u"0.1") },
        { "Single 1/3", u"en_US", Variant(1.0f / 3.0f), String, text(u"0.3333333") },
        { "Estonian decimal comma", u"et_EE", 5.5, String, text(u"5,5") },
        { "Estonian negative uses ASCII minus", u"et_EE", -5.5, String, text(u"-5,5") },
    });
    const LocaleScope estonian(QStringLiteral("et_EE"));
    EXPECT_EQ(Variant(5.5).toInvariantText(), u"5.5");
    EXPECT_EQ(Variant(Currency { 55000 }).toInvariantText(), u"5.5");
    EXPECT_EQ(Variant(1e20).toInvariantText(), u"1E+20");
}

TEST(VariantConversion, TextToDateFollowsTheLocale)
{
    const int thisYear = QDate::currentDate().year();
    checkConversions({
        { "Estonian day.month.year", u"et_EE", text(u"04.12.2026"), Date,
            date(oleDate(2026, 12, 4)) },
        { "US month/day/year", u"en_US", text(u"12/4/2026"), Date, date(oleDate(2026, 12, 4)) },
        { "US with a day above 12 swaps", u"en_US", text(u"13/4/2026"), Date,
            date(oleDate(2026, 4, 13)) },
        { "British day first", u"en_GB", text(u"4/12/2026"), Date, date(oleDate(2026, 12, 4)) },
        { "ISO in Estonian", u"et_EE", text(u"2026-12-06"), Date, date(oleDate(2026, 12, 6)) },
        { "ISO in US", u"en_US", text(u"2026-12-06 14:30:00"), Date,
            date(oleDate(2026, 12, 6, 14, 30)) },
        { "Estonian with time", u"et_EE", text(u"4.12.2026 22:48:31"), Date,
            date(oleDate(2026, 12, 4, 22, 48, 31)) },
        { "US with PM", u"en_US", text(u"12/4/2026 10:48:31 PM"), Date,
            date(oleDate(2026, 12, 4, 22, 48, 31)) },
        { "12 AM is midnight", u"en_US", text(u"12/4/2026 12:15 AM"), Date,
            date(oleDate(2026, 12, 4, 0, 15)) },
        { "month name first", u"en_US", text(u"December 4, 2026"), Date,
            date(oleDate(2026, 12, 4)) },
        { "short month name", u"et_EE", text(u"4 Dec 2026"), Date, date(oleDate(2026, 12, 4)) },
        { "weekday names are ignored", u"en_US", text(u"Friday, December 4, 2026"), Date,
            date(oleDate(2026, 12, 4)) },
        { "two-digit year 29 is 2029", u"et_EE", text(u"4.12.29"), Date,
            date(oleDate(2029, 12, 4)) },
        { "two-digit year 30 is 1930", u"et_EE", text(u"4.12.30"), Date,
            date(oleDate(1930, 12, 4)) },
        { "day and month only take this year", u"et_EE", text(u"1.5"), Date,
            date(oleDate(thisYear, 5, 1)) },
        { "time only is day 0", u"en_US", text(u"14:30"), Date,
            date(oleDate(1899, 12, 30, 14, 30)) },
        { "Finnish time with points", u"fi_FI", text(u"4.12.2026 14.30.15"), Date,
            date(oleDate(2026, 12, 4, 14, 30, 15)) },
    });
}

TEST(VariantConversion, DatesPrintInTheLocaleAndRoundTrip)
{
    const double evening = oleDate(2026, 12, 4, 22, 48, 31);
    checkConversions({
        { "Estonian date and time", u"et_EE", date(evening), String, text(u"04.12.2026 22:48:31") },
        { "US date and time", u"en_US", date(evening), String, text(u"12/4/2026 10:48:31 PM") },
        { "date only at midnight", u"et_EE", date(oleDate(2026, 12, 4)), String,
            text(u"04.12.2026") },
        { "time only on day 0", u"et_EE", date(oleDate(1899, 12, 30, 9, 5)), String,
            text(u"09:05:00") },
        { "four-digit year although the locale says yy", u"de_DE", date(oleDate(1930, 1, 2)),
            String, text(u"02.01.1930") },
    });
    const char* locales[] = { "et_EE", "en_US", "lv_LV", "de_DE", "fi_FI", "sv_SE", "ko_KR",
        "ja_JP", "hu_HU", "en_GB", "bg_BG" };
    for (const char* name : locales) {
        SCOPED_TRACE(name);
        const LocaleScope locale(QString::fromLatin1(name));
        for (const double value : { evening, oleDate(2026, 12, 4), oleDate(1899, 12, 30, 9, 5) }) {
            const QString shown = Variant::fromDate(value).toText();
            EXPECT_TRUE(Variant(shown).isDate()) << shown.toStdString();
            EXPECT_DOUBLE_EQ(Variant(shown).toDate(), value) << shown.toStdString();
        }
    }
}

TEST(VariantConversion, InvariantTextIsTheSameInEveryLocale)
{
    for (const char* name : { "et_EE", "en_US", "ar_EG" }) {
        SCOPED_TRACE(name);
        const LocaleScope locale(QString::fromLatin1(name));
        EXPECT_EQ(Variant::fromDate(oleDate(2026, 12, 6)).toInvariantText(), u"2026-12-06");
        EXPECT_EQ(Variant::fromDate(oleDate(2026, 12, 6, 14, 30)).toInvariantText(),
            u"2026-12-06 14:30:00");
        EXPECT_EQ(Variant(-1234.5).toInvariantText(), u"-1234.5");
        EXPECT_EQ(Variant(true).toInvariantText(), u"True");
        // The invariant date form reads back in any locale.
        EXPECT_DOUBLE_EQ(Variant(u"2026-12-06 14:30:00").toDate(), oleDate(2026, 12, 6, 14, 30));
    }
}

TEST(VariantDate, NegativeDatesCountTheTimeForwardWithinTheirDay)
{
    // -1.25 is one day before the base date, a quarter of a day into it.
    const QDateTime morning(QDate(1899, 12, 29), QTime(6, 0));
    EXPECT_EQ(Variant::fromDate(-1.25).toDateTime(), morning);
    EXPECT_DOUBLE_EQ(Variant::fromDateTime(morning).toDate(), -1.25);
    EXPECT_EQ(Variant::fromDate(-0.5).toDateTime(), QDateTime(QDate(1899, 12, 30), QTime(12, 0)));
    EXPECT_EQ(Variant::fromDate(-657434.0).toDateTime(), QDateTime(QDate(100, 1, 1), QTime(0, 0)));
    // A time that rounds up to midnight belongs to the next day, whatever the sign.
    EXPECT_EQ(
        Variant::fromDate(-1.9999999999).toDateTime(), QDateTime(QDate(1899, 12, 30), QTime(0, 0)));
    EXPECT_EQ(
        Variant::fromDate(1.9999999999).toDateTime(), QDateTime(QDate(1900, 1, 1), QTime(0, 0)));
    EXPECT_TRUE(Variant::fromDateTime(QDateTime()).isNull());
    EXPECT_TRUE(Variant::fromDate(QDate()).isNull());
    EXPECT_EQ(errorOf([] { Variant::fromDate(2958466.0); }), Overflow);
}

TEST(VariantPredicates, IsNumericAndIsDate)
{
    struct Case {
        const char* name;
        const char16_t* locale;
        Variant value;
        bool numeric;
        bool isDate;
    };
    const Case cases[] = {
        { "Empty is numeric", u"en_US", Variant(), true, false },
        { "Null is neither", u"en_US", Variant::null(), false, false },
        { "Boolean is numeric", u"en_US", true, true, false },
        { "a date is not numeric", u"en_US", date(45000), false, true },
        { "a number is not a date", u"en_US", 45000.0, true, false },
        { "empty text", u"en_US", text(u""), false, false },
        { "decimal comma in Estonian", u"et_EE", text(u"1,5"), true, false },
        { "decimal point in Estonian is a date", u"et_EE", text(u"1.5"), false, true },
        { "digits only are no date", u"et_EE", text(u"45000"), true, false },
        { "Estonian date", u"et_EE", text(u"31.12.2026"), false, true },
        { "ISO date", u"en_US", text(u"2026-12-31"), false, true },
        { "impossible date", u"en_US", text(u"2026-13-31"), false, false },
        { "words", u"en_US", text(u"abc"), false, false },
        { "hex literal", u"en_US", text(u"&H1F"), true, false },
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(row.name);
        const LocaleScope locale(QString::fromUtf16(row.locale));
        EXPECT_EQ(row.value.isNumeric(), row.numeric);
        EXPECT_EQ(row.value.isDate(), row.isDate);
    }
}

TEST(VariantEquality, ComparesLikeBasicEquals)
{
    EXPECT_EQ(integer(1), Variant(1.0));
    EXPECT_EQ(Variant(true), integer(-1));
    EXPECT_EQ(Variant(), integer(0));
    EXPECT_EQ(Variant(), text(u""));
    EXPECT_EQ(currency(10000), Variant(int32_t(1)));
    EXPECT_NE(text(u"1"), integer(1));
    EXPECT_NE(text(u"a"), text(u"A"));
    EXPECT_NE(Variant(), Variant::null());
    EXPECT_EQ(Variant::null(), Variant::null());
    EXPECT_TRUE(Variant::missing().isMissing());
    EXPECT_FALSE(Variant::error(5).isMissing());
}

TEST(VariantArrays, BoundsAndIndexing)
{
    VariantArray list = VariantArray::fromList({ text(u"a"), text(u"b"), text(u"c") }, 1);
    EXPECT_EQ(list.lbound(), 1);
    EXPECT_EQ(list.ubound(), 3);
    EXPECT_EQ(list.at(1), text(u"a"));
    EXPECT_EQ(list.at(3), text(u"c"));
    EXPECT_EQ(errorOf([&] { list.at(0); }), SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { list.at(4); }), SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { list.at({ 1, 1 }); }), SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { list.ubound(2); }), SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { list.lbound(0); }), SubscriptOutOfRange);

    // (1 To 2, 0 To 3): the first index varies fastest in storage.
    VariantArray grid({ { 1, 2 }, { 0, 3 } });
    ASSERT_EQ(grid.dimensions(), 2);
    EXPECT_EQ(grid.size(), 8u);
    EXPECT_EQ(grid.lbound(2), 0);
    EXPECT_EQ(grid.ubound(2), 3);
    grid.at({ 2, 0 }) = text(u"second");
    grid.at({ 1, 1 }) = text(u"third");
    grid.at({ 2, 3 }) = text(u"last");
    EXPECT_EQ(grid.values()[1], text(u"second"));
    EXPECT_EQ(grid.values()[2], text(u"third"));
    EXPECT_EQ(grid.values()[7], text(u"last"));
    EXPECT_EQ(errorOf([&] { grid.at({ 0, 0 }); }), SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { grid.at({ 1, 4 }); }), SubscriptOutOfRange);
    EXPECT_EQ(errorOf([&] { grid.at(1); }), SubscriptOutOfRange);

    const VariantArray none;
    EXPECT_EQ(none.size(), 0u);
    EXPECT_EQ(none.ubound(), -1);
    EXPECT_EQ(
        errorOf([] { VariantArray(std::vector<VariantArray::Bound>()); }), InvalidProcedureCall);
    EXPECT_EQ(errorOf([] { VariantArray({ { 0, 1 << 20 }, { 0, 1 << 20 } }); }), OutOfMemory);
}

TEST(VariantArrays, TypedElementsStartWithTheirTypesDefault)
{
    const VariantArray names({ { 0, 1 } }, VariantType::String);
    EXPECT_EQ(names.at(0).type(), VariantType::String);
    const VariantArray amounts({ { 0, 1 } }, VariantType::Currency);
    EXPECT_EQ(amounts.at(1).type(), VariantType::Currency);
    EXPECT_EQ(Variant(names).varType(), 0x2000 | 8);
    EXPECT_EQ(Variant(VariantArray()).varType(), 0x2000 | 12);
}

TEST(VariantArrays, CopiesAreIndependent)
{
    const Variant original(VariantArray::fromList({ 1.0, 2.0 }));
    Variant copy = original;
    copy.array().at(0) = text(u"changed");
    EXPECT_EQ(original.array().at(0), Variant(1.0));
    EXPECT_EQ(copy.array().at(0), text(u"changed"));
    EXPECT_NE(original, copy);
    EXPECT_EQ(errorOf([] { Variant(1.0).array(); }), TypeMismatch);
}

TEST(ComErrorText, BasicDescriptionsAndLastErrorFormat)
{
    const std::pair<int32_t, const char16_t*> descriptions[] = {
        { 5, u"Invalid procedure call or argument" },
        { 6, u"Overflow" },
        { 9, u"Subscript out of range" },
        { 13, u"Type mismatch" },
        { 53, u"File not found" },
        { 91, u"Object variable or With block variable not set" },
        { 94, u"Invalid use of Null" },
        { 438, u"Object doesn't support this property or method" },
        { 457, u"This key is already associated with an element of this collection" },
        { 32811, u"Element not found" },
    };
    for (const auto& [number, description] : descriptions) {
        const core::ComError error = core::ComError::basic(number);
        EXPECT_EQ(error.description(), QString::fromUtf16(description)) << number;
        EXPECT_TRUE(error.source().isEmpty());
    }
    const core::ComError cancelled(core::ErrorNumber::UserCancelled,
        QStringLiteral("LUD Crystal Engine"), QStringLiteral("User Cancelled"));
    // The number is shown as the signed 32-bit value hosts see.
    EXPECT_EQ(cancelled.lastErrorText(), u"-2147221351, LUD Crystal Engine, User Cancelled");
    EXPECT_STREQ(cancelled.what(), "-2147221351, LUD Crystal Engine, User Cancelled");
    EXPECT_EQ(core::ComError::basic(6, QStringLiteral("MoxEngine")).lastErrorText(),
        u"6, MoxEngine, Overflow");
}
