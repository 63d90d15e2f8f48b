#include "reportrt/document/reportdocument.h"
#include "reportrt/layout/fonttable.h"
#include "reportrt/layout/textshaper.h"
#include "reportrt/layout/valueformatter.h"

#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt {
namespace {

struct FormatCase {
    const char* name;
    Value value;
    QString pattern;
    QString expected;
};

class Formats : public testing::TestWithParam<FormatCase> { };

TEST_P(Formats, ShowValuesAsTheDesignerAsked)
{
    // The C locale: "." decimals, "," thousands, "d MMM yyyy" short dates.
    ValueFormatter formatter(QLocale::c());
    EXPECT_EQ(formatter.format(GetParam().value, GetParam().pattern), GetParam().expected);
}

std::string formatName(const testing::TestParamInfo<FormatCase>& info)
{
    return info.param.name;
}

INSTANTIATE_TEST_SUITE_P(Display, Formats,
    testing::Values(FormatCase { "WholeNumberDefault", Value::number(1234567), {}, u"1,234,567"_s },
        FormatCase { "FractionDefault", Value::number(-1234.5), {}, u"-1,234.50"_s },
        FormatCase { "CurrencyDefault", Value::currency(12345000), {}, u"1,234.50"_s },
        FormatCase { "NoGrouping", Value::number(1234567.891), u"0.00"_s, u"1234567.89"_s },
        // Halves round away from zero on the digits a user sees (2.675 is a hair less in
        // binary), as a calculator or a spreadsheet does.
        FormatCase { "HalfOfTheShownDigits", Value::number(2.675), u"0.00"_s, u"2.68"_s },
        FormatCase { "HalfNegative", Value::number(-0.125), u"0.00"_s, u"-0.13"_s },
        FormatCase {
            "CarryIntoTheWholePart", Value::number(999.995), u"#,##0.00"_s, u"1,000.00"_s },
        FormatCase { "TinyNumber", Value::number(1e-9), u"0.00"_s, u"0.00"_s },
        FormatCase { "NegativeZeroShowsNoSign", Value::number(-0.001), u"0.00"_s, u"0.00"_s },
        FormatCase {
            "PrefixAndSuffix", Value::number(12.5), u"€ #,##0.00 net"_s, u"€ 12.50 net"_s },
        FormatCase { "Percent", Value::number(7.25), u"0.0 %"_s, u"7.3 %"_s },
        FormatCase { "Huge", Value::number(1e20), u"#,##0"_s, u"100,000,000,000,000,000,000"_s },
        FormatCase { "DateDefault", Value::fromDate(QDate(2026, 12, 6)), {}, u"6 Dec 2026"_s },
        FormatCase {
            "DatePattern", Value::fromDate(QDate(2026, 1, 5)), u"dd.mm.yyyy"_s, u"05.01.2026"_s },
        FormatCase {
            "MonthNames", Value::fromDate(QDate(2026, 1, 5)), u"d mmmm yy"_s, u"5 January 26"_s },
        FormatCase { "DateTimeMinutes",
            Value::fromDateTime(QDateTime(QDate(2026, 1, 5), QTime(8, 7, 6))),
            u"yyyy-mm-dd hh:nn"_s, u"2026-01-05 08:07"_s },
        FormatCase { "TimeDefault", Value::fromTime(QTime(23, 59, 1)), {}, u"23:59:01"_s },
        FormatCase { "NumberPatternOnADateIsIgnored", Value::fromDate(QDate(2026, 12, 6)),
            u"#,##0"_s, u"6 Dec 2026"_s },
        FormatCase { "DatePatternOnANumberIsIgnored", Value::number(3), u"dd.mm"_s, u"3"_s },
        FormatCase { "Text", Value::string(u"as is"_s), u"0.00"_s, u"as is"_s },
        FormatCase { "Boolean", Value::boolean(true), {}, u"True"_s },
        FormatCase { "Null", Value(), u"0.00"_s, QString() },
        FormatCase { "Binary", Value::binary("\x89PNG"), {}, QString() }),
    formatName);

TEST(Shaping, WrapsAtSpacesAndBreaksOnlyOverlongWords)
{
    FontTable fonts;
    TextShaper shaper(fonts);
    const int id = shaper.font(Font());
    struct Case {
        QString text;
        QString widest; // the line width is this text's
        std::vector<QString> lines;
    };
    const Case cases[] = {
        { u"abcde abcde abcde"_s, u"abcde abcde"_s, { u"abcde abcde"_s, u"abcde"_s } },
        { u"abcdefghijabcdefghijab"_s, u"abcdefghij"_s,
            { u"abcdefghij"_s, u"abcdefghij"_s, u"ab"_s } },
        { u"first\nsecond line"_s, u"second line"_s, { u"first"_s, u"second line"_s } },
        { u"  spaced   out  "_s, u"spaced   out"_s, { u"spaced   out"_s } },
        { u"a a"_s, u"a"_s, { u"a"_s, u"a"_s } },
        { u"\n"_s, u"a"_s, { QString(), QString() } },
    };
    for (const Case& c : cases) {
        const double width = shaper.shape(c.widest, id)->width();
        const auto lines = shaper.wrap(c.text, id, width);
        EXPECT_EQ(lines, c.lines) << c.text.toStdString();
        for (const QString& line : lines)
            EXPECT_LE(shaper.shape(line, id)->width(), width + 0.5) << line.toStdString();
    }
}

TEST(Shaping, ScriptsAndMissingCharactersStillGiveGlyphs)
{
    FontTable fonts;
    TextShaper shaper(fonts);
    const int id = shaper.font(Font());
    for (const QString& text : { u"Liepāja Gdańsk Pärnu"_s, u"Ελλάδα Россия"_s, u"e\u0301clair"_s,
             u"שלום"_s, u"中文"_s, u"tab\there"_s }) {
        const auto shaped = shaper.shape(text, id);
        EXPECT_GT(shaped->glyphCount(), 0) << text.toStdString();
        EXPECT_GT(shaped->width(), 0) << text.toStdString();
        EXPECT_EQ(shaped->source, text == u"tab\there"_s ? u"tab here"_s : text);
        int glyphs = 0;
        for (const auto& run : shaped->runs)
            glyphs += run.count;
        EXPECT_EQ(glyphs, shaped->glyphCount());
    }
    // Same text, same font: shaped once.
    EXPECT_EQ(shaper.shape(u"repeat"_s, id).get(), shaper.shape(u"repeat"_s, id).get());
    EXPECT_EQ(shaper.shape(u"repeat"_s, id)->fittingGlyphs(0), 0);
    EXPECT_EQ(shaper.shape(u"repeat"_s, id)->fittingGlyphs(1e9), 6);
}

} // namespace
} // namespace reportrt
