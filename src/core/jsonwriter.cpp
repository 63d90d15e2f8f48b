#include "core/jsonwriter.h"

#include <QLocale>
#include <cmath>

namespace core {

namespace {

void writeText(const QString& text, QByteArray& out)
{
    out += '"';
    qsizetype plainStart = 0; // characters from here on go out as UTF-8
    const auto flush = [&](qsizetype end) {
        if (end > plainStart)
            out += QStringView(text).sliced(plainStart, end - plainStart).toUtf8();
    };
    for (qsizetype i = 0; i < text.size(); ++i) {
        const QChar c = text.at(i);
        if (c.isHighSurrogate() && i + 1 < text.size() && text.at(i + 1).isLowSurrogate()) {
            ++i;
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
        if (!escape && c.unicode() >= 0x20 && !c.isSurrogate())
            continue;
        flush(i);
        plainStart = i + 1;
        if (escape) {
            out += escape;
        } else {
            // Control characters, and lone surrogates that UTF-8 cannot carry.
            out += "\\u";
            out += QByteArray::number(c.unicode(), 16).rightJustified(4, '0');
        }
    }
    flush(text.size());
    out += '"';
}

class Writer {
public:
    Writer(QByteArray& out, JsonWriter::Style style)
        : m_out(out)
        , m_indented(style == JsonWriter::Style::Indented)
    { }

    void write(const JsonNode& node, int depth)
    {
        switch (node.kind) {
        case JsonNode::Kind::Null:
            m_out += "null";
            break;
        case JsonNode::Kind::Boolean:
            m_out += node.boolean ? "true" : "false";
            break;
        case JsonNode::Kind::Number:
            writeNumber(node);
            break;
        case JsonNode::Kind::String:
            writeText(node.text, m_out);
            break;
        case JsonNode::Kind::Array:
            m_out += '[';
            for (size_t i = 0; i < node.items.size(); ++i) {
                separate(i, depth + 1);
                write(node.items[i], depth + 1);
            }
            close(node.items.empty(), depth, ']');
            break;
        case JsonNode::Kind::Object:
            m_out += '{';
            for (size_t i = 0; i < node.members.size(); ++i) {
                separate(i, depth + 1);
                writeText(node.members[i].first, m_out);
                m_out += m_indented ? ": " : ":";
                write(node.members[i].second, depth + 1);
            }
            close(node.members.empty(), depth, '}');
            break;
        }
    }

private:
    void writeNumber(const JsonNode& node)
    {
        if (node.isInteger && node.integer) {
            m_out += QByteArray::number(*node.integer);
            return;
        }
        if (!std::isfinite(node.number)) {
            m_out += "null";
            return;
        }
        QByteArray text = QByteArray::number(node.number, 'g', QLocale::FloatingPointShortest);
        if (!node.isInteger && !text.contains('.') && !text.contains('e'))
            text += ".0";
        m_out += text;
    }

    void separate(size_t index, int depth)
    {
        if (index > 0)
            m_out += ',';
        newLine(depth);
    }

    void close(bool empty, int depth, char bracket)
    {
        if (!empty)
            newLine(depth);
        m_out += bracket;
    }

    void newLine(int depth)
    {
        if (!m_indented)
            return;
        m_out += '\n';
        m_out += QByteArray(depth * 4, ' ');
    }

    QByteArray& m_out;
    bool m_indented;
};

} // namespace

QByteArray JsonWriter::write(const JsonNode& node, Style style)
{
    QByteArray out;
    Writer(out, style).write(node, 0);
    if (style == Style::Indented)
        out += '\n';
    return out;
}

} // namespace core
