#include "reportrt/mail/mimemessage.h"

#include <QHash>
#include <QRandomGenerator>
#include <QSet>

namespace reportrt::mail {

namespace {

constexpr qsizetype maxLine = 76;
// 39 UTF-8 bytes make 52 base64 characters, so an encoded-word ("=?UTF-8?B?...?=", 64
// characters) fits on a line even after the longest header name this class writes.
constexpr qsizetype encodedWordBytes = 39;
// A longer ASCII word could not be folded onto a line of its own, so the text is encoded.
constexpr qsizetype maxPlainWord = 60;
// With " filename*10*=" or " filename*0*=UTF-8''" in front, a segment stays within a line.
constexpr qsizetype maxParameterSegment = 50;

const QByteArray crlf("\r\n");

QString randomHex(int words)
{
    QString result;
    for (int i = 0; i < words; ++i)
        result += QStringLiteral("%1").arg(
            QRandomGenerator::system()->generate(), 8, 16, QLatin1Char('0'));
    return result;
}

bool isPlainAscii(const QString& text)
{
    for (QChar c : text) {
        if (c.unicode() < 0x20 || c.unicode() > 0x7e)
            return false;
    }
    return true;
}

QString oneLine(const QString& text)
{
    QString result = text;
    for (QChar& c : result) {
        if (c.category() == QChar::Other_Control)
            c = u' ';
    }
    return result;
}

// Encoded-words for the whole text, each holding whole UTF-8 sequences.
QList<QByteArray> encodedWords(const QString& text)
{
    const QByteArray utf8 = text.toUtf8();
    QList<QByteArray> words;
    qsizetype start = 0;
    while (start < utf8.size()) {
        qsizetype end = std::min(start + encodedWordBytes, utf8.size());
        // Never split a sequence: back up to the start of a character.
        while (end < utf8.size() && end > start
            && (static_cast<unsigned char>(utf8.at(end)) & 0xC0) == 0x80)
            --end;
        words.append("=?UTF-8?B?" + utf8.mid(start, end - start).toBase64() + "?=");
        start = end;
    }
    return words;
}

bool needsEncoding(const QString& text)
{
    if (!isPlainAscii(text) || text.contains(QStringLiteral("=?")))
        return true;
    for (const QString& word : text.split(u' ')) {
        if (word.size() > maxPlainWord)
            return true;
    }
    return false;
}

// The words of an unstructured header text, to be joined by single blanks.
QList<QByteArray> textWords(const QString& text)
{
    if (needsEncoding(text))
        return encodedWords(text);
    QList<QByteArray> words;
    for (const QString& word : text.split(u' '))
        words.append(word.toLatin1());
    return words;
}

bool isAtextOrBlank(QChar c)
{
    return c.isLetterOrNumber() || c == u' ' || QStringLiteral("!#$%&'*+-/=?^_`{|}~").contains(c);
}

QList<QByteArray> displayNameWords(const QString& name)
{
    if (needsEncoding(name))
        return encodedWords(name);
    bool atoms = true;
    for (QChar c : name)
        atoms = atoms && isAtextOrBlank(c);
    QString text = name;
    if (!atoms) {
        text.replace(u'\\', QStringLiteral("\\\\"));
        text.replace(u'"', QStringLiteral("\\\""));
        text = u'"' + text + u'"';
    }
    QList<QByteArray> words;
    for (const QString& word : text.split(u' '))
        words.append(word.toLatin1());
    return words;
}

QList<QByteArray> mailboxWords(const MailAddress& mailbox)
{
    const QByteArray address = mailbox.address().toLatin1();
    if (mailbox.displayName().isEmpty())
        return { address };
    QList<QByteArray> words = displayNameWords(mailbox.displayName());
    words.append('<' + address + '>');
    return words;
}

// "Name: word word ...", folded at blanks so lines stay within maxLine where a word allows.
QByteArray foldedHeader(const QByteArray& name, const QList<QByteArray>& words)
{
    QByteArray result = name + ':';
    qsizetype lineLength = result.size();
    for (const QByteArray& word : words) {
        if (lineLength + 1 + word.size() > maxLine && lineLength > name.size() + 1
            && !word.isEmpty()) {
            result += crlf;
            lineLength = 0;
        }
        result += ' ' + word;
        lineLength += 1 + word.size();
    }
    return result + crlf;
}

QByteArray addressHeader(const QByteArray& name, const QList<MailAddress>& list)
{
    QList<QByteArray> words;
    for (qsizetype i = 0; i < list.size(); ++i) {
        QList<QByteArray> mailbox = mailboxWords(list.at(i));
        if (i + 1 < list.size())
            mailbox.last() += ',';
        words.append(mailbox);
    }
    return foldedHeader(name, words);
}

bool isAttrChar(char c)
{
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9')
        || QByteArrayView("!#$&+-.^_`|~").contains(c);
}

// A MIME parameter: quoted when short plain ASCII, else RFC 2231 UTF-8 continuations so
// that no line outgrows the limit whatever the name's length.
QList<QByteArray> parameter(const QByteArray& name, const QString& value)
{
    if (isPlainAscii(value)) {
        QString quoted = value;
        quoted.replace(u'\\', QStringLiteral("\\\\"));
        quoted.replace(u'"', QStringLiteral("\\\""));
        if (quoted.size() <= maxParameterSegment)
            return { name + "=\"" + quoted.toLatin1() + '"' };
    }
    QList<QByteArray> segments(1);
    for (char c : value.toUtf8()) {
        const QByteArray piece = isAttrChar(c) ? QByteArray(1, c)
                                               : '%'
                + QByteArray::number(static_cast<unsigned char>(c), 16)
                      .rightJustified(2, '0')
                      .toUpper();
        if (segments.last().size() + piece.size() > maxParameterSegment)
            segments.append(QByteArray());
        segments.last() += piece;
    }
    if (segments.size() == 1)
        return { name + "*=UTF-8''" + segments.first() };
    QList<QByteArray> result;
    for (qsizetype i = 0; i < segments.size(); ++i) {
        result.append(name + '*' + QByteArray::number(i)
            + "*=" + (i == 0 ? QByteArray("UTF-8''") : QByteArray()) + segments.at(i));
    }
    return result;
}

// "Name: value; p1; p2", each parameter on its own line.
QByteArray parameterHeader(
    const QByteArray& name, const QByteArray& value, const QList<QByteArray>& parameters)
{
    QByteArray result = name + ": " + value;
    for (const QByteArray& p : parameters)
        result += ';' + crlf + ' ' + p;
    return result + crlf;
}

char hexDigit(int value)
{
    return "0123456789ABCDEF"[value & 0xF];
}

QByteArray quotedPrintableLine(const QByteArray& line)
{
    QByteArray out;
    qsizetype lineLength = 0;
    for (qsizetype i = 0; i < line.size(); ++i) {
        const auto c = static_cast<unsigned char>(line.at(i));
        const bool atEnd = i + 1 == line.size();
        // Encoded: "=", bytes outside printable ASCII, blanks at the line end (transports
        // strip them), and the "F" of a leading "From " (mbox files quote such lines).
        const bool literal
            = (c >= 33 && c <= 126 && c != '=') || ((c == ' ' || c == '\t') && !atEnd);
        const bool leadingFrom = i == 0 && line.startsWith("From ");
        QByteArray piece;
        if (literal && !leadingFrom) {
            piece = QByteArray(1, static_cast<char>(c));
        } else {
            const char escaped[] = { '=', hexDigit(c >> 4), hexDigit(c) };
            piece = QByteArray(escaped, sizeof(escaped));
        }
        // Room for the soft break's "=" unless this is the line's last piece.
        const qsizetype limit = atEnd ? maxLine : maxLine - 1;
        if (lineLength + piece.size() > limit) {
            out += '=' + crlf;
            lineLength = 0;
        }
        out += piece;
        lineLength += piece.size();
    }
    return out;
}

QByteArray quotedPrintable(const QString& text)
{
    QString normalised = text;
    normalised.replace(QStringLiteral("\r\n"), QStringLiteral("\n"));
    normalised.replace(u'\r', u'\n');
    QByteArray out;
    const QStringList lines = normalised.split(u'\n');
    for (const QString& line : lines)
        out += quotedPrintableLine(line.toUtf8()) + crlf;
    return out;
}

QByteArray base64Lines(const QByteArray& data)
{
    const QByteArray encoded = data.toBase64();
    QByteArray out;
    out.reserve(encoded.size() + encoded.size() / maxLine * 2 + 2);
    for (qsizetype i = 0; i < encoded.size(); i += maxLine)
        out += encoded.mid(i, maxLine) + crlf;
    return out;
}

QString lastPathComponent(const QString& fileName)
{
    QString name = oneLine(fileName);
    const qsizetype slash = std::max(name.lastIndexOf(u'/'), name.lastIndexOf(u'\\'));
    name = name.mid(slash + 1).trimmed();
    return name.isEmpty() ? QStringLiteral("attachment") : name;
}

} // namespace

MimeMessage::MimeMessage()
    : m_date(QDateTime::currentDateTime())
{ }

void MimeMessage::setAttachment(
    const QByteArray& data, const QString& fileName, const QString& contentType)
{
    m_attachment = data;
    m_attachmentName = lastPathComponent(fileName);
    m_attachmentType = contentType.isEmpty() ? contentTypeFor(m_attachmentName) : contentType;
    m_hasAttachment = true;
}

QList<MailAddress> MimeMessage::recipients() const
{
    QList<MailAddress> result;
    QSet<QString> seen;
    for (const QList<MailAddress>* list : { &m_to, &m_cc, &m_bcc }) {
        for (const MailAddress& mailbox : *list) {
            if (!seen.contains(mailbox.address().toLower())) {
                seen.insert(mailbox.address().toLower());
                result.append(mailbox);
            }
        }
    }
    return result;
}

QString MimeMessage::contentTypeFor(const QString& fileName)
{
    static const QHash<QString, QString> types {
        { QStringLiteral("pdf"), QStringLiteral("application/pdf") },
        { QStringLiteral("xlsx"),
            QStringLiteral("application/vnd.openxmlformats-officedocument.spreadsheetml.sheet") },
        { QStringLiteral("xls"), QStringLiteral("application/vnd.ms-excel") },
        { QStringLiteral("html"), QStringLiteral("text/html") },
        { QStringLiteral("htm"), QStringLiteral("text/html") },
        { QStringLiteral("csv"), QStringLiteral("text/csv") },
        { QStringLiteral("txt"), QStringLiteral("text/plain") },
        { QStringLiteral("rtf"), QStringLiteral("application/rtf") },
        { QStringLiteral("xml"), QStringLiteral("application/xml") },
        { QStringLiteral("doc"), QStringLiteral("application/msword") },
        { QStringLiteral("docx"),
            QStringLiteral(
                "application/vnd.openxmlformats-officedocument.wordprocessingml.document") },
        { QStringLiteral("zip"), QStringLiteral("application/zip") },
        { QStringLiteral("png"), QStringLiteral("image/png") },
        { QStringLiteral("jpg"), QStringLiteral("image/jpeg") },
        { QStringLiteral("jpeg"), QStringLiteral("image/jpeg") },
    };
    const qsizetype dot = fileName.lastIndexOf(u'.');
    if (dot < 0)
        return QStringLiteral("application/octet-stream");
    return types.value(fileName.mid(dot + 1).toLower(), QStringLiteral("application/octet-stream"));
}

QByteArray MimeMessage::toBytes() const
{
    QByteArray out;
    out += addressHeader("From", { m_from });
    if (m_to.isEmpty() && m_cc.isEmpty())
        out += "To: undisclosed-recipients:;" + crlf;
    if (!m_to.isEmpty())
        out += addressHeader("To", m_to);
    if (!m_cc.isEmpty())
        out += addressHeader("Cc", m_cc);
    if (m_draft && !m_bcc.isEmpty())
        out += addressHeader("Bcc", m_bcc);
    out += foldedHeader("Subject", textWords(oneLine(m_subject)));
    out += "Date: " + m_date.toString(Qt::RFC2822Date).toLatin1() + crlf;
    QString id = m_messageId;
    if (id.isEmpty()) {
        const QString address = m_from.address();
        const QString domain = address.contains(u'@') ? address.mid(address.lastIndexOf(u'@') + 1)
                                                      : QStringLiteral("ludmox.invalid");
        id = randomHex(4) + u'@' + domain;
    }
    out += "Message-ID: <" + id.toLatin1() + '>' + crlf;
    out += "MIME-Version: 1.0" + crlf;
    if (m_draft)
        out += "X-Unsent: 1" + crlf;

    const QByteArray textHeaders = "Content-Type: text/plain; charset=UTF-8" + crlf
        + "Content-Transfer-Encoding: quoted-printable" + crlf + crlf;
    if (!m_hasAttachment) {
        out += textHeaders + quotedPrintable(m_text);
        return out;
    }
    // "=_" never occurs in quoted-printable or base64 output, so the boundary cannot either.
    const QByteArray boundary = "=_ludmox_" + randomHex(4).toLatin1();
    out += parameterHeader("Content-Type", "multipart/mixed", { "boundary=\"" + boundary + '"' });
    out += crlf + "This is a multi-part message in MIME format." + crlf;
    out += "--" + boundary + crlf + textHeaders + quotedPrintable(m_text);
    out += "--" + boundary + crlf;
    out += parameterHeader(
        "Content-Type", m_attachmentType.toLatin1(), parameter("name", m_attachmentName));
    out += parameterHeader(
        "Content-Disposition", "attachment", parameter("filename", m_attachmentName));
    out += "Content-Transfer-Encoding: base64" + crlf + crlf;
    out += base64Lines(m_attachment);
    out += "--" + boundary + "--" + crlf;
    return out;
}

} // namespace reportrt::mail
