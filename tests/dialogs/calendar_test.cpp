#include "dialogs/calendarlayout.h"
#include "dialogs/frmcalendar.h"
#include "platform/settingsstore.h"
#include "widgetfixture.h"

#include <QCalendarWidget>
#include <QLabel>
#include <QPushButton>

using namespace dialogs;
using namespace widgettest;
using namespace Qt::StringLiterals;

namespace {

const QString App = u"Orvel LUD 6.0"_s;
const QString Section = u"Default"_s;

class CalendarTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        QLocale::setDefault(QLocale(QLocale::Estonian, QLocale::Estonia));
        engine::gLanguage = 3;
        store.deleteSetting(App, Section);
    }
    void TearDown() override { store.deleteSetting(App, Section); }

    std::unique_ptr<frmCalendar> open(const QDate& value)
    {
        auto calendar = std::make_unique<frmCalendar>();
        calendar->Value(value);
        calendar->show();
        QApplication::setActiveWindow(calendar.get());
        if (!QTest::qWaitForWindowActive(calendar.get()))
            ADD_FAILURE() << "the calendar did not become active";
        return calendar;
    }
    static bool isBold(const frmCalendar& calendar, const QDate& date)
    {
        return calendar.monthCalendar(0)->dateTextFormat(date).fontWeight() == QFont::Bold;
    }

    GlobalsGuard guard;
    platform::SettingsStore store;
};

} // namespace

struct MonthCountCase {
    const char* name;
    QString stored;
    int shown;
};

class MonthCountTest : public CalendarTest,
                       public ::testing::WithParamInterface<MonthCountCase> { };

TEST_P(MonthCountTest, StoredCountIsClampedToOneToFive)
{
    if (!GetParam().stored.isNull())
        store.saveSetting(App, Section, u"NumberOfMonths"_s, GetParam().stored);
    frmCalendar calendar;
    EXPECT_EQ(calendar.NumberOfMonths(), GetParam().shown);
    EXPECT_NE(calendar.monthCalendar(GetParam().shown - 1), nullptr);
    EXPECT_EQ(calendar.monthCalendar(GetParam().shown), nullptr);
}

INSTANTIATE_TEST_SUITE_P(Counts, MonthCountTest,
    ::testing::Values(MonthCountCase { "NotStored", QString(), 1 },
        MonthCountCase { "Zero", u"0"_s, 1 }, MonthCountCase { "Three", u"3"_s, 3 },
        MonthCountCase { "Nine", u"9"_s, 5 }, MonthCountCase { "NotANumber", u"many"_s, 1 }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(CalendarLayout, MonthsSetTheWidthAndTheRightHandButtons)
{
    const CalendarGeometry one = calendarGeometry(1, QSize(0, 0));
    EXPECT_EQ(one.monthView, QRect(120, 120, 2220, 2328));
    EXPECT_EQ(one.inner.width(), 2220 + 4 * 120);
    EXPECT_EQ(one.ok.left(), 2700 - 2 * 1215 - 120 - 105);
    EXPECT_EQ(one.cancel.left(), one.ok.left() + 1215 + 105);
    EXPECT_EQ(one.next, QRect(120 + 2220 - 105 - 300 + 30, 225, 300, 230));
    EXPECT_EQ(one.previous, QRect(195, 225, 300, 225));

    const CalendarGeometry three = calendarGeometry(3, QSize(3000, 2500));
    EXPECT_EQ(three.monthView, QRect(120, 120, 9000, 2500));
    EXPECT_EQ(three.cancel.right() + 1, three.inner.width() - 120);
    EXPECT_EQ(calendarGeometry(9, QSize()).monthView.width(), 5 * 2220);
}

TEST_F(CalendarTest, ZeroDateOpensOnTodayMarkedBold)
{
    auto calendar = open(frmCalendar::zeroDate());
    EXPECT_EQ(calendar->selectedDate(), QDate::currentDate());
    EXPECT_TRUE(isBold(*calendar, QDate::currentDate()));
    EXPECT_TRUE(calendar->Canceled());
}

TEST_F(CalendarTest, TitleAndBoldMarkFollowTheSelection)
{
    auto calendar = open(QDate(2021, 3, 10));
    EXPECT_EQ(calendar->windowTitle(), u"Calendar 10.03.2021"_s);
    EXPECT_TRUE(isBold(*calendar, QDate(2021, 3, 10)));
    QCalendarWidget* month = calendar->monthCalendar(0);
    focus(month);
    QTest::keyClick(month->findChild<QWidget*>(u"qt_calendar_calendarview"_s), Qt::Key_Right);
    EXPECT_EQ(calendar->selectedDate(), QDate(2021, 3, 11));
    EXPECT_EQ(calendar->windowTitle(), u"Calendar 11.03.2021"_s);
    EXPECT_TRUE(isBold(*calendar, QDate(2021, 3, 11)));
    EXPECT_FALSE(isBold(*calendar, QDate(2021, 3, 10)));
}

struct StepCase {
    const char* name;
    QDate from;
    const char* button;
    QDate to;
};

class MonthStepTest : public CalendarTest, public ::testing::WithParamInterface<StepCase> { };

TEST_P(MonthStepTest, StepsAMonthKeepingTheDayWhereItExists)
{
    auto calendar = open(GetParam().from);
    QTest::mouseClick(
        child<QPushButton>(calendar.get(), QString::fromLatin1(GetParam().button)), Qt::LeftButton);
    EXPECT_EQ(calendar->selectedDate(), GetParam().to);
    EXPECT_EQ(calendar->monthCalendar(0)->monthShown(), GetParam().to.month());
    EXPECT_EQ(calendar->monthCalendar(0)->yearShown(), GetParam().to.year());
}

INSTANTIATE_TEST_SUITE_P(Steps, MonthStepTest,
    ::testing::Values(
        StepCase { "JanuaryEndToFebruary", QDate(2021, 1, 31), "cmdNext", QDate(2021, 2, 28) },
        StepCase { "JanuaryEndToLeapFebruary", QDate(2024, 1, 31), "cmdNext", QDate(2024, 2, 29) },
        StepCase {
            "MarchEndBackToFebruary", QDate(2021, 3, 31), "cmdPrevious", QDate(2021, 2, 28) },
        StepCase {
            "MarchEndBackToLeapFebruary", QDate(2024, 3, 31), "cmdPrevious", QDate(2024, 2, 29) },
        StepCase { "DecemberToJanuary", QDate(2021, 12, 15), "cmdNext", QDate(2022, 1, 15) },
        StepCase {
            "JanuaryBackToDecember", QDate(2022, 1, 15), "cmdPrevious", QDate(2021, 12, 15) }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(CalendarTest, OkReturnsTheSelectedDate)
{
    auto calendar = open(QDate(2021, 3, 10));
    QTest::mouseClick(child<QPushButton>(calendar.get(), u"cmdNext"_s), Qt::LeftButton);
    QTest::mouseClick(child<QPushButton>(calendar.get(), u"cmdOK"_s), Qt::LeftButton);
    EXPECT_FALSE(calendar->isVisible());
    EXPECT_FALSE(calendar->Canceled());
    EXPECT_EQ(calendar->Value(), QDate(2021, 4, 10));
}

TEST_F(CalendarTest, CancelKeepsTheGivenValue)
{
    auto calendar = open(QDate(2021, 3, 10));
    QTest::mouseClick(child<QPushButton>(calendar.get(), u"cmdNext"_s), Qt::LeftButton);
    QTest::mouseClick(child<QPushButton>(calendar.get(), u"cmdCancel"_s), Qt::LeftButton);
    EXPECT_TRUE(calendar->Canceled());
    EXPECT_EQ(calendar->Value(), QDate(2021, 3, 10));
}

TEST_F(CalendarTest, TodayLabelSelectsToday)
{
    auto calendar = open(QDate(2001, 5, 5));
    QTest::mouseClick(child<QLabel>(calendar.get(), u"lblToday"_s), Qt::LeftButton);
    EXPECT_EQ(calendar->selectedDate(), QDate::currentDate());
    EXPECT_FALSE(isBold(*calendar, QDate(2001, 5, 5)));
}

TEST_F(CalendarTest, ClosingKeepsCanceledAndStoresThePosition)
{
    auto calendar = open(QDate(2021, 3, 10));
    calendar->move(100, 50);
    QApplication::processEvents();
    const QPoint position = calendar->pos();
    calendar->close();
    EXPECT_TRUE(calendar->Canceled());
    EXPECT_EQ(store.getSetting(App, Section, u"CalendarLeft"_s),
        std::optional(QString::number(position.x() * 15)));
    EXPECT_EQ(store.getSetting(App, Section, u"CalendarTop"_s),
        std::optional(QString::number(position.y() * 15)));

    // The next calendar opens where this one was.
    frmCalendar next;
    EXPECT_EQ(next.pos(), position);
}

TEST_F(CalendarTest, WeekYearAndMonthMoveTheSelection)
{
    auto calendar = open(QDate(2024, 1, 31));
    calendar->Month(2);
    EXPECT_EQ(calendar->selectedDate(), QDate(2024, 2, 29));
    calendar->Month(13);
    calendar->Year(int16_t(20000 - 10001));
    EXPECT_EQ(calendar->selectedDate(), QDate(9999, 2, 28));
    calendar->Year(2024);
    calendar->Week(1);
    EXPECT_EQ(calendar->Week(), 1);
    EXPECT_EQ(calendar->Year(), 2024);
}

struct LanguageCase {
    const char* name;
    int16_t language;
    QString title;
    QString cancel;
    QString today;
};

class CalendarLanguageTest : public CalendarTest,
                             public ::testing::WithParamInterface<LanguageCase> { };

TEST_P(CalendarLanguageTest, TextsSpeakTheHostsLanguage)
{
    engine::gLanguage = GetParam().language;
    auto calendar = open(QDate(2021, 3, 10));
    EXPECT_EQ(calendar->windowTitle(), GetParam().title + u" 10.03.2021"_s);
    EXPECT_EQ(child<QPushButton>(calendar.get(), u"cmdCancel"_s)->text(), GetParam().cancel);
    EXPECT_TRUE(child<QLabel>(calendar.get(), u"lblToday"_s)->text().startsWith(GetParam().today));
}

INSTANTIATE_TEST_SUITE_P(Languages, CalendarLanguageTest,
    ::testing::Values(LanguageCase { "English", 3, u"Calendar"_s, u"&Cancel"_s, u"Today: "_s },
        LanguageCase {
            "Estonian", 4, u"Kalender"_s, u"Ka&tkesta"_s, QString::fromUtf16(u"T\u00e4na: ") },
        LanguageCase { "Latvian", 5, QString::fromUtf16(u"Kalend\u0101rs"), u"Atcelt"_s,
            QString::fromUtf16(u"\u0160odien: ") }),
    [](const auto& row) { return std::string(row.param.name); });
