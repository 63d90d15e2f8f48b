#include "dialogs/frmcalendar.h"

#include "core/comerror.h"
#include "core/text.h"
#include "dialogs/calendarlayout.h"
#include "dialogs/dialogslogging_p.h"
#include "dialogs/ludsettings.h"
#include "dialogs/uistrings.h"
#include "engine/moxglobals.h"
#include "platform/olecolor.h"
#include "platform/twips.h"

#include <QCalendarWidget>
#include <QDateTime>
#include <QLabel>
#include <QLocale>
#include <QMouseEvent>
#include <QPushButton>
#include <QTextCharFormat>
#include <QVBoxLayout>

namespace dialogs {

namespace {

QString dateText(const QDate& date)
{
    return core::text::format(QDateTime(date, QTime(12, 0)), core::text::shortDatePattern());
}

// Room for the 225-twip month-step buttons 105 twips below the month view's top.
constexpr int MonthTitleHeight = 435;

QDate withDayKept(int year, int month, int day)
{
    const QDate first(year, month, 1);
    if (!first.isValid())
        return {};
    return QDate(year, month, std::min(day, first.daysInMonth()));
}

} // namespace

frmCalendar::frmCalendar(QWidget* parent)
    : QDialog(parent)
    , MonthView(new QWidget(this))
    , cmdNext(new QPushButton(QStringLiteral(">"), this))
    , cmdPrevious(new QPushButton(QStringLiteral("<"), this))
    , lblToday(new QLabel(this))
    , cmdOK(new QPushButton(QStringLiteral("&OK"), this))
    , cmdCancel(new QPushButton(this))
    , m_viewDate(QDate::currentDate())
{
    setObjectName(QStringLiteral("frmCalendar"));
    MonthView->setObjectName(QStringLiteral("MonthView"));
    cmdNext->setObjectName(QStringLiteral("cmdNext"));
    cmdPrevious->setObjectName(QStringLiteral("cmdPrevious"));
    lblToday->setObjectName(QStringLiteral("lblToday"));
    cmdOK->setObjectName(QStringLiteral("cmdOK"));
    cmdCancel->setObjectName(QStringLiteral("cmdCancel"));
    setWindowTitle(QStringLiteral("Calendar"));
    setFont(QFont(QStringLiteral("Tahoma"), 8));

    const QColor back = platform::colorFromOle(engine::gBackColor);
    if (back.isValid()) {
        QPalette palette = this->palette();
        palette.setColor(QPalette::Window, back);
        setPalette(palette);
        setAutoFillBackground(true);
    }

    QPoint position = pos();
    const int tppX = qRound(platform::twipsPerPixelX(this));
    const int tppY = qRound(platform::twipsPerPixelY(this));
    bool hasPosition = false;
    // Settings that cannot be read leave the defaults: one month, the usual position.
    try {
        const LUDSettings settings;
        const core::Variant left = settings.Value(QStringLiteral("CalendarLeft"));
        const core::Variant top = settings.Value(QStringLiteral("CalendarTop"));
        if (!left.isEmpty() && !top.isEmpty()) {
            position = QPoint(qRound(left.toSingle() / tppX), qRound(top.toSingle() / tppY));
            hasPosition = true;
        }
        m_numberOfMonths = clampMonthCount(
            settings.Value(QStringLiteral("NumberOfMonths"), core::Variant(int16_t(1)))
                .toInteger());
    } catch (const core::ComError& error) {
        qCWarning(lcDialogs) << "calendar settings not read:" << error.description();
    }

    auto* row = new QHBoxLayout(MonthView);
    row->setContentsMargins(0, 0, 0, 0);
    row->setSpacing(0);
    for (int i = 0; i < m_numberOfMonths; ++i) {
        auto* column = new QVBoxLayout;
        column->setSpacing(0);
        auto* title = new QLabel(MonthView);
        title->setAlignment(Qt::AlignCenter);
        // The month steps sit in this row, as they sit in the month view's own header.
        title->setFixedHeight(qRound(MonthTitleHeight / platform::twipsPerPixelY(this)));
        title->setObjectName(QStringLiteral("MonthTitle_%1").arg(i));
        auto* calendar = new QCalendarWidget(MonthView);
        calendar->setObjectName(QStringLiteral("Month_%1").arg(i));
        calendar->setNavigationBarVisible(false);
        calendar->setVerticalHeaderFormat(QCalendarWidget::NoVerticalHeader);
        calendar->setHorizontalHeaderFormat(QCalendarWidget::ShortDayNames);
        column->addWidget(title);
        column->addWidget(calendar);
        row->addLayout(column);
        m_months.push_back(calendar);
        m_monthTitles.push_back(title);

        connect(calendar, &QCalendarWidget::clicked, this, &frmCalendar::selectDate);
        connect(calendar, &QCalendarWidget::selectionChanged, this, [this, calendar] {
            if (!m_syncing)
                selectDate(calendar->selectedDate());
        });
        connect(
            calendar, &QCalendarWidget::currentPageChanged, this, [this, i](int year, int month) {
                // Keyboard navigation can turn one month's page; the others follow it.
                if (!m_syncing)
                    showMonths(QDate(year, month, 1).addMonths(-i));
            });
        connect(calendar, &QCalendarWidget::activated, this, [this](const QDate& date) {
            selectDate(date);
            cmdOK->click();
        });
    }

    lblToday->setText(GetUIString(UIString::Today) + dateText(QDate::currentDate()));
    lblToday->installEventFilter(this);
    cmdCancel->setText(GetUIString(UIString::Cancel));
    for (QPushButton* button : { cmdNext, cmdPrevious, cmdOK, cmdCancel })
        button->setAutoDefault(false);
    cmdOK->setDefault(true);
    cmdNext->setFocusPolicy(Qt::NoFocus);
    cmdPrevious->setFocusPolicy(Qt::NoFocus);

    // The month steps act when the button is let go, not on a click.
    connect(cmdNext, &QPushButton::released, this, [this] { stepMonth(1); });
    connect(cmdPrevious, &QPushButton::released, this, [this] { stepMonth(-1); });
    connect(cmdOK, &QPushButton::clicked, this, [this] {
        m_canceled = false;
        m_value = m_viewDate;
        accept();
    });
    connect(cmdCancel, &QPushButton::clicked, this, [this] {
        m_canceled = true;
        reject();
    });

    showMonths(QDate(m_viewDate.year(), m_viewDate.month(), 1));
    applyGeometry();
    if (hasPosition)
        move(position);
}

frmCalendar::~frmCalendar() = default;

QCalendarWidget* frmCalendar::monthCalendar(int index) const
{
    return index >= 0 && index < static_cast<int>(m_months.size()) ? m_months[index] : nullptr;
}

void frmCalendar::applyGeometry()
{
    const qreal tppX = platform::twipsPerPixelX(this);
    const qreal tppY = platform::twipsPerPixelY(this);
    QSize month;
    for (size_t i = 0; i < m_months.size(); ++i) {
        const QSize hint(
            std::max(m_months[i]->sizeHint().width(), m_monthTitles[i]->sizeHint().width()),
            m_months[i]->sizeHint().height() + m_monthTitles[i]->sizeHint().height());
        month = month.expandedTo(hint);
    }
    const CalendarGeometry g = calendarGeometry(
        m_numberOfMonths, QSize(qRound(month.width() * tppX), qRound(month.height() * tppY)));
    const auto pixels = [tppX, tppY](const QRect& twips) {
        return QRect(qRound(twips.x() / tppX), qRound(twips.y() / tppY),
            qRound(twips.width() / tppX), qRound(twips.height() / tppY));
    };
    MonthView->setGeometry(pixels(g.monthView));
    cmdPrevious->setGeometry(pixels(g.previous));
    cmdNext->setGeometry(pixels(g.next));
    lblToday->setGeometry(pixels(g.today));
    cmdOK->setGeometry(pixels(g.ok));
    cmdCancel->setGeometry(pixels(g.cancel));
    cmdPrevious->raise();
    cmdNext->raise();
    setFixedSize(qRound(g.inner.width() / tppX), qRound(g.inner.height() / tppY));
}

void frmCalendar::showMonths(const QDate& firstMonth)
{
    m_firstMonth = QDate(firstMonth.year(), firstMonth.month(), 1);
    m_syncing = true;
    for (size_t i = 0; i < m_months.size(); ++i) {
        const QDate month = m_firstMonth.addMonths(static_cast<int>(i));
        m_months[i]->setSelectedDate(m_viewDate);
        m_months[i]->setCurrentPage(month.year(), month.month());
        m_monthTitles[i]->setText(QLocale().standaloneMonthName(month.month()) + QLatin1Char(' ')
            + QString::number(month.year()));
    }
    m_syncing = false;
}

void frmCalendar::selectDate(const QDate& date)
{
    if (!date.isValid())
        return;
    setWindowTitle(GetUIString(UIString::Calendar) + QLatin1Char(' ') + dateText(date));
    for (QCalendarWidget* calendar : m_months) {
        if (CurrentDate.isValid() && CurrentDate != date)
            calendar->setDateTextFormat(CurrentDate, QTextCharFormat());
        QTextCharFormat bold;
        bold.setFontWeight(QFont::Bold);
        calendar->setDateTextFormat(date, bold);
    }
    CurrentDate = date;
    m_viewDate = date;
    const QDate lastShown = m_firstMonth.addMonths(m_numberOfMonths);
    if (date < m_firstMonth || date >= lastShown)
        showMonths(date);
    else
        showMonths(m_firstMonth);
}

void frmCalendar::stepMonth(int months)
{
    // addMonths lowers a day the new month lacks to its last day (31 January -> 28 or 29
    // February), and December steps into January of the next year.
    const QDate stepped = m_viewDate.addMonths(months);
    m_firstMonth = m_firstMonth.addMonths(months);
    selectDate(stepped);
}

void frmCalendar::Init()
{
    if (Initialized)
        return;
    CurrentDate = (m_value.isValid() && m_value != zeroDate()) ? m_value : QDate::currentDate();
    m_viewDate = CurrentDate;
    showMonths(CurrentDate);
    selectDate(CurrentDate);
    Initialized = true;
}

int16_t frmCalendar::Week() const
{
    return static_cast<int16_t>(m_viewDate.weekNumber());
}

void frmCalendar::Week(int16_t week)
{
    if (week < 1 || week > 53)
        return;
    selectDate(m_viewDate.addDays(7 * (week - m_viewDate.weekNumber())));
}

int16_t frmCalendar::Year() const
{
    return static_cast<int16_t>(m_viewDate.year());
}

void frmCalendar::Year(int16_t year)
{
    if (year < 100 || year > 9999)
        return;
    selectDate(withDayKept(year, m_viewDate.month(), m_viewDate.day()));
}

int16_t frmCalendar::Month() const
{
    return static_cast<int16_t>(m_viewDate.month());
}

void frmCalendar::Month(int16_t month)
{
    if (month < 1 || month > 12)
        return;
    selectDate(withDayKept(m_viewDate.year(), month, m_viewDate.day()));
}

void frmCalendar::showEvent(QShowEvent* event)
{
    QDialog::showEvent(event);
    Init();
}

void frmCalendar::done(int result)
{
    if (isVisible()) {
        try {
            LUDSettings settings;
            settings.Value(QStringLiteral("CalendarLeft"), {},
                core::Variant(static_cast<float>(pos().x() * platform::twipsPerPixelX(this))));
            settings.Value(QStringLiteral("CalendarTop"), {},
                core::Variant(static_cast<float>(pos().y() * platform::twipsPerPixelY(this))));
        } catch (const core::ComError& error) {
            qCWarning(lcDialogs) << "calendar position not stored:" << error.description();
        }
    }
    QDialog::done(result);
}

bool frmCalendar::eventFilter(QObject* watched, QEvent* event)
{
    if (watched == lblToday && event->type() == QEvent::MouseButtonRelease
        && static_cast<QMouseEvent*>(event)->button() == Qt::LeftButton) {
        selectDate(QDate::currentDate());
        return true;
    }
    return QDialog::eventFilter(watched, event);
}

} // namespace dialogs
