#pragma once

#include "core/comerror.h"
#include "core/variant.h"

#include <QDate>
#include <QLocale>
#include <gtest/gtest.h>

namespace coretest {

/// Switches the default locale for one test and restores it afterwards.
class LocaleScope {
public:
    explicit LocaleScope(const QString& name) { QLocale::setDefault(QLocale(name)); }
    ~LocaleScope() { QLocale::setDefault(m_previous); }
    LocaleScope(const LocaleScope&) = delete;
    LocaleScope& operator=(const LocaleScope&) = delete;

private:
    QLocale m_previous;
};

/// The error number `call` raises, or 0 when it returns normally.
template <class F> int32_t errorOf(F&& call)
{
    try {
        call();
    } catch (const core::ComError& error) {
        return error.number();
    }
    return 0;
}

/// An OLE date by its definition: whole days since 1899-12-30 plus the fraction of the day.
inline double oleDate(int year, int month, int day, int hour = 0, int minute = 0, int second = 0)
{
    return static_cast<double>(QDate(1899, 12, 30).daysTo(QDate(year, month, day)))
        + (hour * 3600 + minute * 60 + second) / 86400.0;
}

} // namespace coretest
