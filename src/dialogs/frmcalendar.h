#pragma once

#include <QDate>
#include <QDialog>
#include <cstdint>
#include <vector>

class QCalendarWidget;
class QLabel;
class QPushButton;

namespace dialogs {

/// The date picker the parameter dialog opens for date fields: one to five months side by
/// side, the selected day in bold and in the title, a today label, and month steps.
///
/// The caller sets Value (the zero date opens on today), shows the window modally and
/// reads Value and Canceled afterwards. The window position ("CalendarLeft",
/// "CalendarTop") is kept per user; the month count comes from "NumberOfMonths".
class frmCalendar : public QDialog {
    Q_OBJECT

public:
    /// The zero date of the date type: no date given.
    static QDate zeroDate() { return QDate(1899, 12, 30); }

    explicit frmCalendar(QWidget* parent = nullptr);
    ~frmCalendar() override;

    /// The date given before showing; after OK the chosen date.
    QDate Value() const { return m_value; }
    void Value(const QDate& value) { m_value = value; }
    /// True until OK is pressed.
    bool Canceled() const { return m_canceled; }
    void Canceled(bool canceled) { m_canceled = canceled; }
    /// The selected date's week, year and month; setting one moves the selection (a day
    /// that the new month lacks becomes its last day). Invalid values are ignored.
    int16_t Week() const;
    void Week(int16_t week);
    int16_t Year() const;
    void Year(int16_t year);
    int16_t Month() const;
    void Month(int16_t month);
    /// Selects Value (today for the zero date); runs once, when the window is first shown.
    void Init();

    int NumberOfMonths() const { return m_numberOfMonths; }
    /// The date currently selected in the month view.
    QDate selectedDate() const { return m_viewDate; }
    /// The calendar of month `index` (0 = the leftmost).
    QCalendarWidget* monthCalendar(int index) const;

    void done(int result) override;

protected:
    void showEvent(QShowEvent* event) override;
    bool eventFilter(QObject* watched, QEvent* event) override;

private:
    void selectDate(const QDate& date);
    void showMonths(const QDate& firstMonth);
    void stepMonth(int months);
    void applyGeometry();

    std::vector<QCalendarWidget*> m_months;
    std::vector<QLabel*> m_monthTitles;
    QWidget* MonthView;
    QPushButton* cmdNext;
    QPushButton* cmdPrevious;
    QLabel* lblToday;
    QPushButton* cmdOK;
    QPushButton* cmdCancel;
    int m_numberOfMonths = 1;
    bool m_canceled = true;
    QDate m_value = zeroDate();
    QDate m_viewDate;
    QDate CurrentDate;
    QDate m_firstMonth;
    bool Initialized = false;
    bool m_syncing = false;
};

} // namespace dialogs
