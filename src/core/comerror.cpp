#include "core/comerror.h"

namespace core {

namespace {

QString basicDescription(int32_t number)
{
    switch (number) {
    case 5:
        return QStringLiteral("Invalid procedure call or argument");
    case 6:
        return QStringLiteral("Overflow");
    case 7:
        return QStringLiteral("Out of memory");
    case 9:
        return QStringLiteral("Subscript out of range");
    case 11:
        return QStringLiteral("Division by zero");
    case 13:
        return QStringLiteral("Type mismatch");
    case 53:
        return QStringLiteral("File not found");
    case 91:
        return QStringLiteral("Object variable or With block variable not set");
    case 93:
        return QStringLiteral("Invalid pattern string");
    case 94:
        return QStringLiteral("Invalid use of Null");
    case 438:
        return QStringLiteral("Object doesn't support this property or method");
    case 457:
        return QStringLiteral("This key is already associated with an element of this "
                              "collection");
    case 32811:
        return QStringLiteral("Element not found");
    default:
        return QStringLiteral("Application-defined or object-defined error");
    }
}

} // namespace

ComError::ComError(int32_t number, QString source, QString description)
    : m_number(number)
    , m_source(std::move(source))
    , m_description(std::move(description))
    , m_what(lastErrorText().toStdString())
{ }

ComError ComError::basic(int32_t number, const QString& source)
{
    return ComError(number, source, basicDescription(number));
}

QString ComError::lastErrorText() const
{
    return QString::number(m_number) + u", " + m_source + u", " + m_description;
}

const char* ComError::what() const noexcept
{
    return m_what.c_str();
}

} // namespace core
