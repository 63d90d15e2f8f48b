#include "dialogs/calendarlayout.h"

#include <algorithm>

namespace dialogs {

namespace {
constexpr int MonthViewLeft = 120;
constexpr int MonthViewTop = 120;
constexpr QSize DesignedMonth(2220, 2328);
constexpr QRect PreviousButton(195, 225, 300, 225);
constexpr int NextTop = 225;
constexpr QSize NextSize(300, 230);
constexpr int NextInset = 105;
constexpr int NextOverlap = 30;
constexpr int TodayLeft = 480;
constexpr int TodayHeight = 230;
constexpr QSize ButtonSize(1215, 345);
constexpr int ButtonGap = 105;
constexpr int RowGap = 120;
// Below the buttons, as in the designed window (3096 - 2640 - 345).
constexpr int BottomMargin = 111;
} // namespace

int clampMonthCount(int stored)
{
    return std::clamp(stored, 1, 5);
}

CalendarGeometry calendarGeometry(int months, const QSize& monthSize)
{
    const int count = clampMonthCount(months);
    const QSize month = monthSize.expandedTo(DesignedMonth);
    CalendarGeometry g;
    g.monthView = QRect(MonthViewLeft, MonthViewTop, count * month.width(), month.height());
    const int innerWidth = g.monthView.width() + 4 * MonthViewLeft;
    g.previous = PreviousButton;
    g.next = QRect(
        QPoint(MonthViewLeft + g.monthView.width() - NextInset - NextSize.width() + NextOverlap,
            NextTop),
        NextSize);

    const int todayTop = g.monthView.bottom() + 1 + RowGap;
    g.today = QRect(TodayLeft, todayTop, innerWidth - 2 * TodayLeft, TodayHeight);
    const int buttonTop = todayTop + TodayHeight + RowGap;
    const int okLeft = innerWidth - 2 * ButtonSize.width() - MonthViewLeft - ButtonGap;
    g.ok = QRect(QPoint(okLeft, buttonTop), ButtonSize);
    g.cancel = QRect(QPoint(okLeft + ButtonSize.width() + ButtonGap, buttonTop), ButtonSize);
    g.inner = QSize(innerWidth, buttonTop + ButtonSize.height() + BottomMargin);
    return g;
}

} // namespace dialogs
