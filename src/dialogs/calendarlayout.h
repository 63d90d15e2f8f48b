#pragma once

#include <QRect>
#include <QSize>

namespace dialogs {

/// The calendar window's controls, in twips within its client area.
struct CalendarGeometry {
    QRect monthView; // the months side by side
    QRect previous;
    QRect next;
    QRect today;
    QRect ok;
    QRect cancel;
    QSize inner;
};

/// The number of months shown: a stored count clamped to 1..5.
int clampMonthCount(int stored);

/// Places the calendar for `months` months of `monthSize` twips each (at least the
/// designed 2220 x 2328). The window is as wide as the months plus four times their left
/// margin; OK and Cancel (1215 wide, 105 apart) end at the right, the next button at the
/// right end of the months. The today label and the buttons sit in rows below the months.
CalendarGeometry calendarGeometry(int months, const QSize& monthSize);

} // namespace dialogs
