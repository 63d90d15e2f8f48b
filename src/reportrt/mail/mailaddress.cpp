#include "reportrt/mail/mailaddress.h"

#include "reportrt/mail/mailerror.h"

#include <QUrl>

namespace reportrt::mail {

namespace {

// RFC 5321 limits.
constexpr qsizetype maxLocalPart = 64;
constexpr qsizetype maxDomain = 253;
constexpr qsizetype maxLabel = 63;

[[noreturn]] void raiseInvalid(const QString& text, const QString& listName, const QString& why)
{
    const QString where
        = listName.isEmpty() ? QString() : QStringLiteral(" in the %1 list").arg(listName);
    throw MailError(MailError::Kind::InvalidAddress,
        QStringLiteral("\"%1\"%2 is not a mail address: %3.").arg(text, where, why));
}

bool isAtext(QChar c)
{
    if (c.unicode() > 0x7e || c.unicode() <= 0x20)
        return false;
    if (c.isLetterOrNumber())
        return true;
    return QStringLiteral("!#$%&'*+-/=?^_`{|}~").contains(c);
}

bool isValidLocalPart(const QString& local)
{
    if (local.isEmpty() || local.size() > maxLocalPart || local.startsWith(u'.')
        || local.endsWith(u'.') || local.contains(QStringLiteral("..")))
        return false;
    for (QChar c : local) {
        if (c != u'.' && !isAtext(c))
            return false;
    }
    return true;
}

bool isValidLabel(const QString& label)
{
    if (label.isEmpty() || label.size() > maxLabel || label.startsWith(u'-')
        || label.endsWith(u'-'))
        return false;
    for (QChar c : label) {
        const char16_t u = c.unicode();
        const bool ok = (u >= u'a' && u <= u'z') || (u >= u'A' && u <= u'Z')
            || (u >= u'0' && u <= u'9') || u == u'-';
        if (!ok)
            return false;
    }
    return true;
}

bool isValidDomainLiteral(const QString& domain)
{
    // Only IPv4 literals: "[127.0.0.1]". IPv6 literals need the "IPv6:" tag and are rare in
    // the lists hosts write.
    const QStringList parts = domain.mid(1, domain.size() - 2).split(u'.');
    if (parts.size() != 4)
        return false;
    for (const QString& part : parts) {
        bool ok = false;
        const int value = part.toInt(&ok);
        if (!ok || part.size() > 3 || value < 0 || value > 255)
            return false;
    }
    return true;
}

// The address in the form an SMTP server accepts, or an empty string with why set.
QString normalisedAddress(const QString& address, QString& why)
{
    const qsizetype at = address.lastIndexOf(u'@');
    if (at <= 0 || at == address.size() - 1) {
        why = QStringLiteral("it needs a name, \"@\" and a domain");
        return {};
    }
    const QString local = address.left(at);
    const QString domain = address.mid(at + 1);
    if (!isValidLocalPart(local)) {
        why = QStringLiteral("the part before \"@\" holds characters a mail address cannot have");
        return {};
    }
    if (domain.startsWith(u'[') && domain.endsWith(u']')) {
        if (!isValidDomainLiteral(domain)) {
            why = QStringLiteral("the domain is not a valid address literal");
            return {};
        }
        return local + u'@' + domain;
    }
    const QString ace = QString::fromLatin1(QUrl::toAce(domain));
    const QStringList labels = ace.split(u'.');
    bool valid = !ace.isEmpty() && ace.size() <= maxDomain;
    for (const QString& label : labels)
        valid = valid && isValidLabel(label);
    if (!valid) {
        why = QStringLiteral("the domain is not a valid host name");
        return {};
    }
    return local + u'@' + ace;
}

// Splits at separators outside quoted strings and angle brackets.
QStringList splitList(const QString& text)
{
    QStringList pieces;
    QString current;
    bool inQuotes = false;
    bool inAngle = false;
    for (qsizetype i = 0; i < text.size(); ++i) {
        const QChar c = text.at(i);
        if (inQuotes && c == u'\\' && i + 1 < text.size()) {
            current += c;
            current += text.at(++i);
            continue;
        }
        if (c == u'"' && !inAngle)
            inQuotes = !inQuotes;
        else if (c == u'<' && !inQuotes)
            inAngle = true;
        else if (c == u'>' && !inQuotes)
            inAngle = false;
        else if ((c == u';' || c == u',') && !inQuotes && !inAngle) {
            pieces.append(current);
            current.clear();
            continue;
        }
        current += c;
    }
    pieces.append(current);
    return pieces;
}

QString unquoted(const QString& name)
{
    if (name.size() < 2 || !name.startsWith(u'"') || !name.endsWith(u'"'))
        return name;
    QString result;
    for (qsizetype i = 1; i < name.size() - 1; ++i) {
        if (name.at(i) == u'\\' && i + 1 < name.size() - 1)
            ++i;
        result += name.at(i);
    }
    return result;
}

} // namespace

MailAddress::MailAddress(QString displayName, QString address)
    : m_displayName(std::move(displayName))
    , m_address(std::move(address))
{ }

MailAddress MailAddress::parse(const QString& text, const QString& listName)
{
    const QString trimmed = text.trimmed();
    for (QChar c : trimmed) {
        // A line break in an address would let a host's text start a header of its own.
        if (c.category() == QChar::Other_Control)
            raiseInvalid(trimmed, listName, QStringLiteral("it holds a control character"));
    }
    QString name;
    QString address = trimmed;
    const qsizetype open = trimmed.lastIndexOf(u'<');
    if (open >= 0) {
        const qsizetype close = trimmed.indexOf(u'>', open);
        if (close < 0)
            raiseInvalid(trimmed, listName, QStringLiteral("the \"<\" is not closed"));
        if (!trimmed.mid(close + 1).trimmed().isEmpty())
            raiseInvalid(trimmed, listName, QStringLiteral("there is text after \">\""));
        name = unquoted(trimmed.left(open).trimmed()).trimmed();
        address = trimmed.mid(open + 1, close - open - 1).trimmed();
    }
    if (address.isEmpty())
        raiseInvalid(trimmed, listName, QStringLiteral("there is no address"));
    QString why;
    const QString normalised = normalisedAddress(address, why);
    if (normalised.isEmpty())
        raiseInvalid(trimmed, listName, why);
    return MailAddress(name, normalised);
}

QList<MailAddress> MailAddress::parseList(const QString& text, const QString& listName)
{
    QList<MailAddress> result;
    for (const QString& piece : splitList(text)) {
        if (!piece.trimmed().isEmpty())
            result.append(parse(piece, listName));
    }
    return result;
}

} // namespace reportrt::mail
