#include "core/jsonreader.h"

#include <cmath>

namespace core {

namespace {

struct ParseError {
    TextPosition position;
    QString message;
};

class Parser {
public:
    Parser(const QString& text, const JsonReader::Limits& limits)
        : m_text(text)
        , m_limits(limits)
    { }

    void parseDocument(JsonNode& root)
    {
        skipWhitespace();
        parseValue(root, 0);
        skipWhitespace();
        if (m_index < m_text.size())
            fail(QStringLiteral("unexpected content after the end of the document"));
    }

private:
    [[noreturn]] void fail(const QString& message) const
    {
        throw ParseError { position(), message };
    }

    TextPosition position() const
    {
        return { m_line, static_cast<int>(m_index - m_lineStart) + 1 };
    }

    bool atEnd() const { return m_index >= m_text.size(); }
    QChar peek() const { return atEnd() ? QChar() : m_text.at(m_index); }

    void advance()
    {
        if (m_text.at(m_index) == u'\n') {
            ++m_line;
            m_lineStart = m_index + 1;
        }
        ++m_index;
    }

    void skipWhitespace()
    {
        while (!atEnd()) {
            const QChar c = peek();
            if (c == u' ' || c == u'\t' || c == u'\n' || c == u'\r')
                advance();
            else
                break;
        }
    }

    void expectWord(const QString& word)
    {
        if (m_text.mid(m_index, word.size()) != word)
            fail(QStringLiteral("unexpected character '%1'").arg(peek()));
        m_index += word.size();
    }

    void parseValue(JsonNode& node, int depth)
    {
        if (depth > m_limits.maxDepth)
            fail(QStringLiteral("values are nested deeper than %1 levels").arg(m_limits.maxDepth));
        node.position = position();
        if (atEnd())
            fail(QStringLiteral("unexpected end of the document"));
        const QChar c = peek();
        if (c == u'{') {
            parseObject(node, depth);
        } else if (c == u'[') {
            parseArray(node, depth);
        } else if (c == u'"') {
            node.kind = JsonNode::Kind::String;
            node.text = parseString();
        } else if (c == u't') {
            expectWord(QStringLiteral("true"));
            node.kind = JsonNode::Kind::Boolean;
            node.boolean = true;
        } else if (c == u'f') {
            expectWord(QStringLiteral("false"));
            node.kind = JsonNode::Kind::Boolean;
        } else if (c == u'n') {
            expectWord(QStringLiteral("null"));
            node.kind = JsonNode::Kind::Null;
        } else if (c == u'-' || (c >= u'0' && c <= u'9')) {
            parseNumber(node);
        } else {
            fail(QStringLiteral("unexpected character '%1'").arg(c));
        }
    }

    void parseObject(JsonNode& node, int depth)
    {
        node.kind = JsonNode::Kind::Object;
        advance(); // {
        skipWhitespace();
        if (peek() == u'}') {
            advance();
            return;
        }
        for (;;) {
            skipWhitespace();
            if (peek() != u'"')
                fail(QStringLiteral("expected a key in double quotes"));
            const TextPosition keyPosition = position();
            QString key = parseString();
            if (!m_limits.allowDuplicateKeys && node.member(key))
                throw ParseError { keyPosition, QStringLiteral("duplicate key \"%1\"").arg(key) };
            skipWhitespace();
            if (peek() != u':')
                fail(QStringLiteral("expected ':' after the key"));
            advance();
            skipWhitespace();
            node.members.emplace_back(std::move(key), JsonNode {});
            parseValue(node.members.back().second, depth + 1);
            skipWhitespace();
            if (peek() == u',') {
                advance();
                continue;
            }
            if (peek() == u'}') {
                advance();
                return;
            }
            fail(QStringLiteral("expected ',' or '}'"));
        }
    }

    void parseArray(JsonNode& node, int depth)
    {
        node.kind = JsonNode::Kind::Array;
        advance(); // [
        skipWhitespace();
        if (peek() == u']') {
            advance();
            return;
        }
        for (;;) {
            skipWhitespace();
            node.items.emplace_back();
            parseValue(node.items.back(), depth + 1);
            skipWhitespace();
            if (peek() == u',') {
                advance();
                continue;
            }
            if (peek() == u']') {
                advance();
                return;
            }
            fail(QStringLiteral("expected ',' or ']'"));
        }
    }

    int hexDigit()
    {
        if (atEnd())
            fail(QStringLiteral("unexpected end of the document in a \\u escape"));
        const char16_t c = peek().unicode();
        advance();
        if (c >= u'0' && c <= u'9')
            return c - u'0';
        if (c >= u'a' && c <= u'f')
            return c - u'a' + 10;
        if (c >= u'A' && c <= u'F')
            return c - u'A' + 10;
        fail(QStringLiteral("invalid hexadecimal digit in a \\u escape"));
    }

    char16_t unicodeEscape()
    {
        int value = 0;
        for (int i = 0; i < 4; ++i)
            value = value * 16 + hexDigit();
        return static_cast<char16_t>(value);
    }

    QString parseString()
    {
        advance(); // "
        QString result;
        for (;;) {
            if (atEnd())
                fail(QStringLiteral("unterminated string"));
            const QChar c = peek();
            if (c == u'"') {
                advance();
                return result;
            }
            if (c.unicode() < 0x20 || c == u'\n')
                fail(QStringLiteral("control character in a string"));
            if (c != u'\\') {
                result.append(c);
                advance();
                continue;
            }
            advance();
            if (atEnd())
                fail(QStringLiteral("unterminated string"));
            const QChar e = peek();
            advance();
            switch (e.unicode()) {
            case u'"':
                result.append(u'"');
                break;
            case u'\\':
                result.append(u'\\');
                break;
            case u'/':
                result.append(u'/');
                break;
            case u'b':
                result.append(u'\b');
                break;
            case u'f':
                result.append(u'\f');
                break;
            case u'n':
                result.append(u'\n');
                break;
            case u'r':
                result.append(u'\r');
                break;
            case u't':
                result.append(u'\t');
                break;
            case u'u':
                result.append(QChar(unicodeEscape()));
                break;
            default:
                fail(QStringLiteral("invalid escape '\\%1'").arg(e));
            }
        }
    }

    void parseNumber(JsonNode& node)
    {
        const qsizetype start = m_index;
        bool integer = true;
        if (peek() == u'-')
            advance();
        if (peek() == u'0') {
            advance();
        } else if (peek() >= u'1' && peek() <= u'9') {
            while (peek() >= u'0' && peek() <= u'9')
                advance();
        } else {
            fail(QStringLiteral("invalid number"));
        }
        if (peek() == u'.') {
            integer = false;
            advance();
            if (!(peek() >= u'0' && peek() <= u'9'))
                fail(QStringLiteral("invalid number"));
            while (peek() >= u'0' && peek() <= u'9')
                advance();
        }
        if (peek() == u'e' || peek() == u'E') {
            integer = false;
            advance();
            if (peek() == u'+' || peek() == u'-')
                advance();
            if (!(peek() >= u'0' && peek() <= u'9'))
                fail(QStringLiteral("invalid number"));
            while (peek() >= u'0' && peek() <= u'9')
                advance();
        }
        bool ok = false;
        node.kind = JsonNode::Kind::Number;
        node.number = QStringView(m_text).mid(start, m_index - start).toDouble(&ok);
        node.isInteger = integer;
        if (integer) {
            bool fits = false;
            const qint64 exact = QStringView(m_text).mid(start, m_index - start).toLongLong(&fits);
            if (fits)
                node.integer = exact;
        }
        if (!ok || !std::isfinite(node.number))
            throw ParseError { node.position, QStringLiteral("number out of range") };
    }

    const QString& m_text;
    const JsonReader::Limits& m_limits;
    qsizetype m_index = 0;
    qsizetype m_lineStart = 0;
    int m_line = 1;
};

/// The line and column of a byte offset, for UTF-8 decoding errors.
TextPosition positionOfByte(QByteArrayView utf8, qsizetype offset)
{
    TextPosition result;
    qsizetype lineStart = 0;
    for (qsizetype i = 0; i < offset && i < utf8.size(); ++i) {
        if (utf8.at(i) == '\n') {
            ++result.line;
            lineStart = i + 1;
        }
    }
    result.column = static_cast<int>(
        QString::fromUtf8(utf8.sliced(lineStart, offset - lineStart)).size() + 1);
    return result;
}

/// The offset of the first byte that does not start a well-formed UTF-8 sequence
/// (overlong forms, surrogates and values above U+10FFFF included), or -1.
qsizetype firstInvalidUtf8(QByteArrayView bytes)
{
    const qsizetype size = bytes.size();
    qsizetype i = 0;
    while (i < size) {
        const auto b = static_cast<unsigned char>(bytes[i]);
        if (b < 0x80) {
            ++i;
            continue;
        }
        int length = 0;
        char32_t value = 0;
        if ((b & 0xE0) == 0xC0) {
            length = 2;
            value = b & 0x1F;
        } else if ((b & 0xF0) == 0xE0) {
            length = 3;
            value = b & 0x0F;
        } else if ((b & 0xF8) == 0xF0) {
            length = 4;
            value = b & 0x07;
        } else {
            return i;
        }
        if (i + length > size)
            return i;
        for (int k = 1; k < length; ++k) {
            const auto c = static_cast<unsigned char>(bytes[i + k]);
            if ((c & 0xC0) != 0x80)
                return i;
            value = (value << 6) | (c & 0x3F);
        }
        static constexpr char32_t smallest[] = { 0, 0, 0x80, 0x800, 0x10000 };
        if (value < smallest[length] || value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF))
            return i;
        i += length;
    }
    return -1;
}

} // namespace

bool JsonReader::parse(QByteArrayView utf8, JsonNode& root, Failure& failure, const Limits& limits)
{
    QByteArrayView bytes(utf8);
    if (bytes.startsWith("\xEF\xBB\xBF"))
        bytes = bytes.sliced(3);
    const qsizetype bad = firstInvalidUtf8(bytes);
    if (bad >= 0) {
        failure = { positionOfByte(bytes, bad), QStringLiteral("the file is not valid UTF-8") };
        return false;
    }
    const QString text = QString::fromUtf8(bytes);
    try {
        Parser parser(text, limits);
        root = JsonNode {};
        parser.parseDocument(root);
        return true;
    } catch (const ParseError& error) {
        failure = { error.position, error.message };
        return false;
    }
}

bool JsonReader::parse(QByteArrayView utf8, JsonNode& root, Failure& failure)
{
    return parse(utf8, root, failure, Limits());
}

} // namespace core
