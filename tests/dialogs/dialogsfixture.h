#pragma once

// Readable failure messages for the types the dialog tests compare.

#include "dialogs/combocompletion.h"
#include "dialogs/dateentry.h"

#include <QDate>
#include <QRect>
#include <QString>
#include <ostream>

inline void PrintTo(const QString& text, std::ostream* os)
{
    *os << '"' << text.toStdString() << '"';
}
inline void PrintTo(const QRect& r, std::ostream* os)
{
    *os << "QRect(" << r.x() << ", " << r.y() << ", " << r.width() << ", " << r.height() << ')';
}
inline void PrintTo(const QPoint& p, std::ostream* os)
{
    *os << "QPoint(" << p.x() << ", " << p.y() << ')';
}
inline void PrintTo(const QDate& d, std::ostream* os)
{
    *os << d.toString(Qt::ISODate).toStdString();
}

namespace dialogs {
inline void PrintTo(const TextEdit& e, std::ostream* os)
{
    *os << '{' << '"' << e.text.toStdString() << "\", " << e.selStart << ", " << e.selLength << '}';
}
inline void PrintTo(const ComboEdit& c, std::ostream* os)
{
    PrintTo(c.edit, os);
    *os << " index " << c.listIndex;
}
inline void PrintTo(const DateFieldState& f, std::ostream* os)
{
    *os << '{' << '"' << f.text.toStdString() << "\", " << f.backColor << '}';
}
} // namespace dialogs
