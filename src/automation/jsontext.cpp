#include "jsontext.h"

#include <QCborArray>
#include <QCborMap>
#include <QStringDecoder>
#include <cmath>
#include <limits>

namespace automation {

namespace {
// Deeper nesting than any request needs; it bounds the parser's recursion on hostile
// input.
constexpr int maxDepth = 512;

class Parser {
public:
    explicit Parser(QByteArrayView text)
        : m_text(text)
    { }

    std::optional<QCborValue> document(QString* error)
    {
        skipSpace();
        std::optional<QCborValue> result = value(0);
        if (result) {
            skipSpace();
            if (m_pos != m_text.size())
                fail("unexpected text after the value");
        }
        if (!m_error.isEmpty()) {
            if (error)
                *error = QStringLiteral("%1 at offset %2").arg(m_error).arg(m_pos);
            return std::nullopt;
        }
        return result;
    }

private:
    std::optional<QCborValue> fail(const char* message)
    {
        if (m_error.isEmpty())
            m_error = QString::fromLatin1(message);
        return std::nullopt;
    }

    bool atEnd() const { return m_pos >= m_text.size(); }
    char peek() const { return atEnd() ? '\0' : m_text[m_pos]; }

    void skipSpace()
    {
        while (!atEnd()) {
            const char c = m_text[m_pos];
            if (c != ' ' && c != '\t' && c != '\n' && c != '\r')
                break;
            ++m_pos;
        }
    }

    bool literal(QByteArrayView word)
    {
        if (m_text.sliced(m_pos).startsWith(word)) {
            m_pos += word.size();
            return true;
        }
        return false;
    }

    std::optional<QCborValue> value(int depth)
    {
        if (depth > maxDepth)
            return fail("nesting too deep");
        switch (peek()) {
        case '{':
            return object(depth);
        case '[':
            return array(depth);
        case '"': {
            std::optional<QString> text = string();
            if (!text)
                return std::nullopt;
            return QCborValue(*text);
        }
        case 't':
            if (literal("true"))
                return QCborValue(true);
            break;
        case 'f':
            if (literal("false"))
                return QCborValue(false);
            break;
        case 'n':
            if (literal("null"))
                return QCborValue(nullptr);
            break;
        default:
            if (peek() == '-' || (peek() >= '0' && peek() <= '9'))
                return number();
            break;
        }
        return fail(atEnd() ? "unexpected end of text" : "unexpected character");
    }

    std::optional<QCborValue> object(int depth)
    {
        QCborMap map;
        ++m_pos; // {
        skipSpace();
        if (peek() == '}') {
            ++m_pos;
            return QCborValue(map);
        }
        while (true) {
            skipSpace();
            if (peek() != '"')
                return fail("expected a member name");
            std::optional<QString> key = string();
            if (!key)
                return std::nullopt;
            skipSpace();
            if (peek() != ':')
                return fail("expected ':'");
            ++m_pos;
            skipSpace();
            std::optional<QCborValue> member = value(depth + 1);
            if (!member)
                return std::nullopt;
            map.insert(*key, *member);
            skipSpace();
            if (peek() == ',') {
                ++m_pos;
                continue;
            }
            if (peek() == '}') {
                ++m_pos;
                return QCborValue(map);
            }
            return fail("expected ',' or '}'");
        }
    }

    std::optional<QCborValue> array(int depth)
    {
        QCborArray list;
        ++m_pos; // [
        skipSpace();
        if (peek() == ']') {
            ++m_pos;
            return QCborValue(list);
        }
        while (true) {
            skipSpace();
            std::optional<QCborValue> element = value(depth + 1);
            if (!element)
                return std::nullopt;
            list.append(*element);
            skipSpace();
            if (peek() == ',') {
                ++m_pos;
                continue;
            }
            if (peek() == ']') {
                ++m_pos;
                return QCborValue(list);
            }
            return fail("expected ',' or ']'");
        }
    }

    std::optional<int> hexDigit(char c) const
    {
        if (c >= '0' && c <= '9')
            return c - '0';
        if (c >= 'a' && c <= 'f')
            return c - 'a' + 10;
        if (c >= 'A' && c <= 'F')
            return c - 'A' + 10;
        return std::nullopt;
    }

    std::optional<QString> string()
    {
        ++m_pos; // opening quote
        QString result;
        QByteArray run; // raw UTF-8 since the last escape
        auto flush = [&]() -> bool {
            if (run.isEmpty())
                return true;
            QStringDecoder decoder(QStringDecoder::Utf8);
            result += decoder.decode(run);
            run.clear();
            return !decoder.hasError();
        };
        while (true) {
            if (atEnd()) {
                fail("unterminated string");
                return std::nullopt;
            }
            const char c = m_text[m_pos++];
            if (c == '"')
                break;
            if (static_cast<unsigned char>(c) < 0x20) {
                fail("control character in a string");
                return std::nullopt;
            }
            if (c != '\\') {
                run.append(c);
                continue;
            }
            if (!flush()) {
                fail("invalid UTF-8 in a string");
                return std::nullopt;
            }
            if (atEnd()) {
                fail("unterminated string");
                return std::nullopt;
            }
            const char escape = m_text[m_pos++];
            switch (escape) {
            case '"':
            case '\\':
            case '/':
                result += QLatin1Char(escape);
                break;
            case 'b':
                result += u'\b';
                break;
            case 'f':
                result += u'\f';
                break;
            case 'n':
                result += u'\n';
                break;
            case 'r':
                result += u'\r';
                break;
            case 't':
                result += u'\t';
                break;
            case 'u': {
                if (m_pos + 4 > m_text.size()) {
                    fail("short \\u escape");
                    return std::nullopt;
                }
                char16_t unit = 0;
                for (int i = 0; i < 4; ++i) {
                    const std::optional<int> digit = hexDigit(m_text[m_pos++]);
                    if (!digit) {
                        fail("bad \\u escape");
                        return std::nullopt;
                    }
                    unit = static_cast<char16_t>(unit * 16 + *digit);
                }
                // Surrogates pass as they are: a QString holds UTF-16 units, as the
                // component's strings do.
                result += QChar(unit);
                break;
            }
            default:
                fail("unknown escape");
                return std::nullopt;
            }
        }
        if (!flush()) {
            fail("invalid UTF-8 in a string");
            return std::nullopt;
        }
        return result;
    }

    std::optional<QCborValue> number()
    {
        const qsizetype start = m_pos;
        bool isInteger = true;
        if (peek() == '-')
            ++m_pos;
        auto digits = [&]() {
            const qsizetype from = m_pos;
            while (peek() >= '0' && peek() <= '9')
                ++m_pos;
            return m_pos - from;
        };
        const char first = peek();
        const qsizetype integerDigits = digits();
        if (integerDigits == 0)
            return fail("bad number");
        if (first == '0' && integerDigits > 1)
            return fail("leading zero in a number");
        if (peek() == '.') {
            isInteger = false;
            ++m_pos;
            if (digits() == 0)
                return fail("bad number");
        }
        if (peek() == 'e' || peek() == 'E') {
            isInteger = false;
            ++m_pos;
            if (peek() == '+' || peek() == '-')
                ++m_pos;
            if (digits() == 0)
                return fail("bad number");
        }
        const QByteArrayView text = m_text.sliced(start, m_pos - start);
        bool ok = false;
        if (isInteger) {
            const qint64 integer = text.toLongLong(&ok);
            if (ok)
                return QCborValue(integer);
        }
        const double number = text.toDouble(&ok);
        if (!ok || !std::isfinite(number))
            return fail("number out of range");
        return QCborValue(number);
    }

    QByteArrayView m_text;
    qsizetype m_pos = 0;
    QString m_error;
};

void writeText(const QString& text, QByteArray& out)
{
    out += '"';
    QString plain; // characters that go out as UTF-8, surrogate pairs included
    auto flush = [&] {
        out += plain.toUtf8();
        plain.clear();
    };
    for (qsizetype i = 0; i < text.size(); ++i) {
        const QChar c = text.at(i);
        if (c.isHighSurrogate() && i + 1 < text.size() && text.at(i + 1).isLowSurrogate()) {
            plain += c;
            plain += text.at(++i);
            continue;
        }
        const char* escape = nullptr;
        switch (c.unicode()) {
        case u'"':
            escape = "\\\"";
            break;
        case u'\\':
            escape = "\\\\";
            break;
        case u'\n':
            escape = "\\n";
            break;
        case u'\r':
            escape = "\\r";
            break;
        case u'\t':
            escape = "\\t";
            break;
        default:
            break;
        }
        if (escape) {
            flush();
            out += escape;
        } else if (c.unicode() < 0x20 || c.isSurrogate()) {
            // Control characters, and lone surrogates that UTF-8 cannot carry.
            flush();
            out += "\\u";
            out += QByteArray::number(c.unicode(), 16).rightJustified(4, '0');
        } else {
            plain += c;
        }
    }
    flush();
    out += '"';
}

void write(const QCborValue& value, QByteArray& out)
{
    switch (value.type()) {
    case QCborValue::Integer:
        out += QByteArray::number(value.toInteger());
        break;
    case QCborValue::Double: {
        const double number = value.toDouble();
        if (!std::isfinite(number)) {
            out += "null";
            break;
        }
        QByteArray text = QByteArray::number(number, 'g', QLocale::FloatingPointShortest);
        if (!text.contains('.') && !text.contains('e'))
            text += ".0";
        out += text;
        break;
    }
    case QCborValue::String:
        writeText(value.toString(), out);
        break;
    case QCborValue::True:
        out += "true";
        break;
    case QCborValue::False:
        out += "false";
        break;
    case QCborValue::Array: {
        out += '[';
        bool first = true;
        for (const QCborValue& element : value.toArray()) {
            if (!first)
                out += ',';
            first = false;
            write(element, out);
        }
        out += ']';
        break;
    }
    case QCborValue::Map: {
        out += '{';
        bool first = true;
        const QCborMap map = value.toMap();
        for (auto it = map.cbegin(); it != map.cend(); ++it) {
            if (!first)
                out += ',';
            first = false;
            writeText(it.key().toString(), out);
            out += ':';
            write(it.value(), out);
        }
        out += '}';
        break;
    }
    default:
        out += "null";
        break;
    }
}
} // namespace

std::optional<QCborValue> JsonText::parse(QByteArrayView text, QString* error)
{
    return Parser(text).document(error);
}

QByteArray JsonText::serialize(const QCborValue& value)
{
    QByteArray out;
    write(value, out);
    return out;
}

} // namespace automation
