#include "reportrt/formula/formulaparser.h"

#include "reportrt/base/invarianttext.h"

#include <QRegularExpression>
#include <utility>

namespace reportrt {

QString FormulaError::describe() const
{
    return QStringLiteral("Error in formula %1 at line %2, column %3: %4")
        .arg(formulaName)
        .arg(position.line)
        .arg(position.column)
        .arg(message);
}

namespace {

bool isDigit(QChar c)
{
    return c >= u'0' && c <= u'9';
}

struct Token {
    enum class Kind {
        End,
        Number,
        String,
        DateLiteral,
        Field, // {Table.Field}
        Parameter, // {?Name}
        Formula, // {@Name}
        Identifier,
        Symbol, // + - * / & = <> < <= > >= ( ) [ ] ,
    };
    Kind kind = Kind::End;
    TextPosition position;
    QString text; // symbol, identifier, string contents, brace contents
    double number = 0;
    Value date;
};

class Lexer {
public:
    Lexer(const QString& text, QString formulaName)
        : m_text(text)
        , m_formulaName(std::move(formulaName))
    { }

    Token next()
    {
        skipBlanks();
        Token token;
        token.position = position();
        if (atEnd())
            return token;
        const QChar c = m_text.at(m_index);
        if (isDigit(c)
            || (c == u'.' && m_index + 1 < m_text.size() && isDigit(m_text.at(m_index + 1))))
            return number(token);
        if (c == u'\'' || c == u'"')
            return string(token, c);
        if (c == u'#')
            return dateLiteral(token);
        if (c == u'{')
            return braces(token);
        if (c.isLetter() || c == u'_') {
            token.kind = Token::Kind::Identifier;
            const qsizetype start = m_index;
            while (
                !atEnd() && (m_text.at(m_index).isLetterOrNumber() || m_text.at(m_index) == u'_'))
                ++m_index;
            token.text = m_text.mid(start, m_index - start);
            return token;
        }
        token.kind = Token::Kind::Symbol;
        static const QString twoCharacter[]
            = { QStringLiteral("<>"), QStringLiteral("<="), QStringLiteral(">=") };
        for (const QString& symbol : twoCharacter) {
            if (QStringView(m_text).mid(m_index, 2) == symbol) {
                token.text = symbol;
                m_index += 2;
                return token;
            }
        }
        if (QStringLiteral("+-*/&=<>()[],").contains(c)) {
            token.text = QString(c);
            ++m_index;
            return token;
        }
        fail(token.position, QStringLiteral("unexpected character '%1'").arg(c));
    }

    [[noreturn]] void fail(TextPosition where, const QString& message) const
    {
        throw FormulaException({ m_formulaName, where, message });
    }

private:
    bool atEnd() const { return m_index >= m_text.size(); }
    TextPosition position() const
    {
        return { m_line, static_cast<int>(m_index - m_lineStart) + 1 };
    }

    void newLineAt(qsizetype index)
    {
        ++m_line;
        m_lineStart = index + 1;
    }

    void skipBlanks()
    {
        while (!atEnd()) {
            const QChar c = m_text.at(m_index);
            if (c == u'\r') {
                // CR LF is one line break, so is a lone CR.
                if (m_index + 1 < m_text.size() && m_text.at(m_index + 1) == u'\n')
                    ++m_index;
                newLineAt(m_index);
                ++m_index;
            } else if (c == u'\n') {
                newLineAt(m_index);
                ++m_index;
            } else if (c == u' ' || c == u'\t' || c == u'\f' || c == u'\v' || c == QChar(0xA0)) {
                ++m_index;
            } else if (c == u'/' && m_index + 1 < m_text.size() && m_text.at(m_index + 1) == u'/') {
                while (!atEnd() && m_text.at(m_index) != u'\r' && m_text.at(m_index) != u'\n')
                    ++m_index;
            } else {
                break;
            }
        }
    }

    Token number(Token& token)
    {
        const qsizetype start = m_index;
        while (!atEnd() && isDigit(m_text.at(m_index)))
            ++m_index;
        if (!atEnd() && m_text.at(m_index) == u'.') {
            ++m_index;
            while (!atEnd() && isDigit(m_text.at(m_index)))
                ++m_index;
        }
        if (!atEnd() && (m_text.at(m_index) == u'e' || m_text.at(m_index) == u'E')) {
            qsizetype look = m_index + 1;
            if (look < m_text.size() && (m_text.at(look) == u'+' || m_text.at(look) == u'-'))
                ++look;
            if (look < m_text.size() && isDigit(m_text.at(look))) {
                m_index = look;
                while (!atEnd() && isDigit(m_text.at(m_index)))
                    ++m_index;
            }
        }
        const auto value = invarianttext::parseNumber(m_text.mid(start, m_index - start));
        if (!value)
            fail(token.position, QStringLiteral("number out of range"));
        token.kind = Token::Kind::Number;
        token.number = *value;
        return token;
    }

    Token string(Token& token, QChar quote)
    {
        ++m_index;
        QString text;
        for (;;) {
            if (atEnd())
                fail(token.position, QStringLiteral("the text literal is not closed"));
            const QChar c = m_text.at(m_index);
            if (c == quote) {
                // A doubled quote stands for one quote character.
                if (m_index + 1 < m_text.size() && m_text.at(m_index + 1) == quote) {
                    text.append(quote);
                    m_index += 2;
                    continue;
                }
                ++m_index;
                break;
            }
            if (c == u'\n' || c == u'\r')
                fail(token.position, QStringLiteral("the text literal is not closed on its line"));
            text.append(c);
            ++m_index;
        }
        token.kind = Token::Kind::String;
        token.text = text;
        return token;
    }

    Token dateLiteral(Token& token)
    {
        const qsizetype close = m_text.indexOf(u'#', m_index + 1);
        const qsizetype lineEnd = [&] {
            const qsizetype cr = m_text.indexOf(u'\r', m_index);
            const qsizetype lf = m_text.indexOf(u'\n', m_index);
            if (cr < 0)
                return lf;
            return lf < 0 ? cr : std::min(cr, lf);
        }();
        if (close < 0 || (lineEnd >= 0 && close > lineEnd))
            fail(token.position, QStringLiteral("the date literal is not closed with '#'"));
        const QString content = m_text.mid(m_index + 1, close - m_index - 1).trimmed();
        m_index = close + 1;
        token.kind = Token::Kind::DateLiteral;
        if (const auto day = invarianttext::parseDate(content)) {
            token.date = Value::date(*day);
            return token;
        }
        if (const auto ms = invarianttext::parseDateTime(content)) {
            token.date = Value::dateTime(*ms);
            return token;
        }
        if (const auto time = invarianttext::parseTime(content)) {
            token.date = Value::time(*time);
            return token;
        }
        // Month/day/year, the other form report authors write.
        static const QRegularExpression us(QStringLiteral("^(\\d{1,2})/(\\d{1,2})/(\\d{4})$"));
        const auto match = us.match(content);
        if (match.hasMatch()) {
            const QDate date(
                match.captured(3).toInt(), match.captured(1).toInt(), match.captured(2).toInt());
            if (date.isValid()) {
                token.date = Value::fromDate(date);
                return token;
            }
        }
        fail(token.position,
            QStringLiteral("'%1' is not a date, time or date-time literal").arg(content));
    }

    Token braces(Token& token)
    {
        const qsizetype close = m_text.indexOf(u'}', m_index + 1);
        if (close < 0)
            fail(token.position, QStringLiteral("the field name is not closed with '}'"));
        const QString content = m_text.mid(m_index + 1, close - m_index - 1);
        if (content.contains(u'\n') || content.contains(u'\r') || content.contains(u'{'))
            fail(token.position, QStringLiteral("the field name is not closed with '}'"));
        m_index = close + 1;
        const QString trimmed = content.trimmed();
        if (trimmed.startsWith(u'?')) {
            token.kind = Token::Kind::Parameter;
            token.text = trimmed.mid(1).trimmed();
        } else if (trimmed.startsWith(u'@')) {
            token.kind = Token::Kind::Formula;
            token.text = trimmed.mid(1).trimmed();
        } else {
            token.kind = Token::Kind::Field;
            token.text = trimmed;
        }
        if (token.text.isEmpty())
            fail(token.position, QStringLiteral("empty field name"));
        return token;
    }

    const QString& m_text;
    QString m_formulaName;
    qsizetype m_index = 0;
    qsizetype m_lineStart = 0;
    int m_line = 1;
};

using ExprPtr = std::unique_ptr<FormulaExpr>;

struct FunctionName {
    const char16_t* name;
    FormulaFunction function;
};

constexpr FunctionName functionNames[] = {
    { u"isnull", FormulaFunction::IsNull },
    { u"trim", FormulaFunction::Trim },
    { u"uppercase", FormulaFunction::UpperCase },
    { u"lowercase", FormulaFunction::LowerCase },
    { u"left", FormulaFunction::Left },
    { u"right", FormulaFunction::Right },
    { u"mid", FormulaFunction::Mid },
    { u"len", FormulaFunction::Len },
    { u"instr", FormulaFunction::InStr },
    { u"totext", FormulaFunction::ToText },
    { u"tonumber", FormulaFunction::ToNumber },
    { u"round", FormulaFunction::Round },
    { u"abs", FormulaFunction::Abs },
    { u"year", FormulaFunction::Year },
    { u"month", FormulaFunction::Month },
    { u"day", FormulaFunction::Day },
    { u"currentdate", FormulaFunction::CurrentDate },
    { u"currentdatetime", FormulaFunction::CurrentDateTime },
    { u"currenttime", FormulaFunction::CurrentTime },
    { u"date", FormulaFunction::Date },
    { u"datetime", FormulaFunction::DateTime },
    { u"time", FormulaFunction::Time },
};

class Parser {
public:
    Parser(const QString& text, const QString& formulaName)
        : m_lexer(text, formulaName)
    {
        m_token = m_lexer.next();
    }

    ExprPtr parseFormula()
    {
        if (m_token.kind == Token::Kind::End)
            return nullptr;
        ExprPtr result = expression();
        if (m_token.kind != Token::Kind::End)
            m_lexer.fail(m_token.position,
                QStringLiteral("unexpected %1 after the end of the formula")
                    .arg(describe(m_token)));
        return result;
    }

private:
    static QString describe(const Token& token)
    {
        switch (token.kind) {
        case Token::Kind::End:
            return QStringLiteral("end of the formula");
        case Token::Kind::Number:
            return QStringLiteral("number");
        case Token::Kind::String:
            return QStringLiteral("text literal");
        case Token::Kind::DateLiteral:
            return QStringLiteral("date literal");
        case Token::Kind::Field:
        case Token::Kind::Parameter:
        case Token::Kind::Formula:
            return QStringLiteral("field");
        case Token::Kind::Identifier:
        case Token::Kind::Symbol:
            return u'\'' + token.text + u'\'';
        }
        return {};
    }

    bool isSymbol(const char16_t* symbol) const
    {
        return m_token.kind == Token::Kind::Symbol && m_token.text == QStringView(symbol);
    }
    bool isKeyword(const char16_t* word) const
    {
        return m_token.kind == Token::Kind::Identifier
            && m_token.text.compare(QStringView(word), Qt::CaseInsensitive) == 0;
    }
    void advance() { m_token = m_lexer.next(); }
    void expectSymbol(const char16_t* symbol)
    {
        if (!isSymbol(symbol))
            m_lexer.fail(m_token.position,
                QStringLiteral("expected '%1' but found %2")
                    .arg(QStringView(symbol))
                    .arg(describe(m_token)));
        advance();
    }

    struct DepthGuard {
        DepthGuard(Parser& parser)
            : m_parser(parser)
        {
            if (++m_parser.m_depth > FormulaParser::maxDepth)
                m_parser.m_lexer.fail(
                    m_parser.m_token.position, QStringLiteral("the formula is nested too deeply"));
        }
        ~DepthGuard() { --m_parser.m_depth; }
        Parser& m_parser;
    };

    /// Left-associative arithmetic and concatenation chains ("a + b + c...") build a tree one
    /// level deeper per operator, so each operator counts as a level of nesting.
    struct ChainGuard {
        ChainGuard(Parser& parser)
            : m_parser(parser)
        { }
        void next()
        {
            ++m_count;
            if (++m_parser.m_depth > FormulaParser::maxDepth)
                m_parser.m_lexer.fail(
                    m_parser.m_token.position, QStringLiteral("the formula is nested too deeply"));
        }
        ~ChainGuard() { m_parser.m_depth -= m_count; }
        Parser& m_parser;
        int m_count = 0;
    };

    static ExprPtr node(FormulaExpr::Kind kind, TextPosition position)
    {
        auto e = std::make_unique<FormulaExpr>();
        e->kind = kind;
        e->position = position;
        return e;
    }
    static ExprPtr binary(
        FormulaExpr::Kind kind, FormulaExpr::Op op, TextPosition position, ExprPtr a, ExprPtr b)
    {
        auto e = node(kind, position);
        e->op = op;
        e->children.push_back(std::move(a));
        e->children.push_back(std::move(b));
        return e;
    }

    ExprPtr expression() { return orExpression(); }

    ExprPtr orExpression()
    {
        DepthGuard guard(*this);
        return logicalChain(FormulaExpr::Kind::Or, u"or", [this] { return andExpression(); });
    }

    ExprPtr andExpression()
    {
        return logicalChain(FormulaExpr::Kind::And, u"and", [this] { return notExpression(); });
    }

    /// "a Or b Or c..." as one node with every operand as a child: hosts write selections
    /// of thousands of terms, which a tree of two-operand nodes would make as deep as they
    /// are long. The node sits at the first operator.
    template <typename Operand>
    ExprPtr logicalChain(FormulaExpr::Kind kind, const char16_t* keyword, Operand operand)
    {
        ExprPtr first = operand();
        if (!isKeyword(keyword))
            return first;
        auto chain = node(kind, m_token.position);
        chain->children.push_back(std::move(first));
        while (isKeyword(keyword)) {
            advance();
            chain->children.push_back(operand());
        }
        return chain;
    }

    ExprPtr notExpression()
    {
        DepthGuard guard(*this);
        if (isKeyword(u"not")) {
            auto e = node(FormulaExpr::Kind::Not, m_token.position);
            advance();
            e->children.push_back(notExpression());
            return e;
        }
        return comparison();
    }

    ExprPtr comparison()
    {
        ExprPtr left = concatenation();
        static const std::pair<const char16_t*, FormulaExpr::Op> operators[] = {
            { u"=", FormulaExpr::Op::Equal },
            { u"<>", FormulaExpr::Op::NotEqual },
            { u"<", FormulaExpr::Op::Less },
            { u"<=", FormulaExpr::Op::LessEqual },
            { u">", FormulaExpr::Op::Greater },
            { u">=", FormulaExpr::Op::GreaterEqual },
        };
        for (const auto& [symbol, op] : operators) {
            if (isSymbol(symbol)) {
                const TextPosition where = m_token.position;
                advance();
                return binary(
                    FormulaExpr::Kind::Compare, op, where, std::move(left), concatenation());
            }
        }
        if (isKeyword(u"in")) {
            const TextPosition where = m_token.position;
            advance();
            if (isSymbol(u"[")) {
                auto list = listLiteral();
                return binary(FormulaExpr::Kind::InList, FormulaExpr::Op::None, where,
                    std::move(left), std::move(list));
            }
            ExprPtr low = concatenation();
            if (isKeyword(u"to")) {
                advance();
                auto e = binary(FormulaExpr::Kind::InRange, FormulaExpr::Op::None, where,
                    std::move(left), std::move(low));
                e->children.push_back(concatenation());
                return e;
            }
            // "x In {?Multi}" or "text In text"; the compiler tells them apart by type.
            return binary(FormulaExpr::Kind::InList, FormulaExpr::Op::None, where, std::move(left),
                std::move(low));
        }
        if (isKeyword(u"like")) {
            const TextPosition where = m_token.position;
            advance();
            return binary(FormulaExpr::Kind::Like, FormulaExpr::Op::None, where, std::move(left),
                concatenation());
        }
        if (isKeyword(u"startswith")) {
            const TextPosition where = m_token.position;
            advance();
            return binary(FormulaExpr::Kind::StartsWith, FormulaExpr::Op::None, where,
                std::move(left), concatenation());
        }
        return left;
    }

    ExprPtr listLiteral()
    {
        DepthGuard guard(*this);
        auto list = node(FormulaExpr::Kind::List, m_token.position);
        expectSymbol(u"[");
        if (!isSymbol(u"]")) {
            for (;;) {
                list->children.push_back(concatenation());
                if (isSymbol(u",")) {
                    advance();
                    continue;
                }
                break;
            }
        }
        expectSymbol(u"]");
        return list;
    }

    ExprPtr concatenation()
    {
        ExprPtr left = additive();
        ChainGuard chain(*this);
        while (isSymbol(u"&")) {
            chain.next();
            const TextPosition where = m_token.position;
            advance();
            left = binary(FormulaExpr::Kind::Concat, FormulaExpr::Op::None, where, std::move(left),
                additive());
        }
        return left;
    }

    ExprPtr additive()
    {
        ExprPtr left = term();
        ChainGuard chain(*this);
        for (;;) {
            FormulaExpr::Op op = FormulaExpr::Op::None;
            if (isSymbol(u"+"))
                op = FormulaExpr::Op::Add;
            else if (isSymbol(u"-"))
                op = FormulaExpr::Op::Subtract;
            else
                return left;
            chain.next();
            const TextPosition where = m_token.position;
            advance();
            left = binary(FormulaExpr::Kind::Arithmetic, op, where, std::move(left), term());
        }
    }

    ExprPtr term()
    {
        ExprPtr left = unary();
        ChainGuard chain(*this);
        for (;;) {
            FormulaExpr::Op op = FormulaExpr::Op::None;
            if (isSymbol(u"*"))
                op = FormulaExpr::Op::Multiply;
            else if (isSymbol(u"/"))
                op = FormulaExpr::Op::Divide;
            else
                return left;
            chain.next();
            const TextPosition where = m_token.position;
            advance();
            left = binary(FormulaExpr::Kind::Arithmetic, op, where, std::move(left), unary());
        }
    }

    ExprPtr unary()
    {
        DepthGuard guard(*this);
        if (isSymbol(u"-")) {
            auto e = node(FormulaExpr::Kind::Negate, m_token.position);
            advance();
            e->children.push_back(unary());
            return e;
        }
        if (isSymbol(u"+")) {
            advance();
            return unary();
        }
        return primary();
    }

    ExprPtr primary()
    {
        const Token token = m_token;
        switch (token.kind) {
        case Token::Kind::End:
            m_lexer.fail(
                token.position, QStringLiteral("the formula ends where a value is expected"));
        case Token::Kind::Number: {
            advance();
            auto e = node(FormulaExpr::Kind::Literal, token.position);
            e->literal = Value::number(token.number);
            return e;
        }
        case Token::Kind::String: {
            advance();
            auto e = node(FormulaExpr::Kind::Literal, token.position);
            e->literal = Value::string(token.text);
            return e;
        }
        case Token::Kind::DateLiteral: {
            advance();
            auto e = node(FormulaExpr::Kind::Literal, token.position);
            e->literal = token.date;
            return e;
        }
        case Token::Kind::Field: {
            advance();
            auto e = node(FormulaExpr::Kind::Field, token.position);
            const qsizetype dot = token.text.indexOf(u'.');
            if (dot <= 0 || dot == token.text.size() - 1)
                m_lexer.fail(token.position,
                    QStringLiteral("{%1} is not a field name: write {Table.Field}")
                        .arg(token.text));
            e->table = token.text.left(dot).trimmed();
            e->name = token.text.mid(dot + 1).trimmed();
            return e;
        }
        case Token::Kind::Parameter:
        case Token::Kind::Formula: {
            advance();
            auto e = node(token.kind == Token::Kind::Parameter ? FormulaExpr::Kind::Parameter
                                                               : FormulaExpr::Kind::Formula,
                token.position);
            e->name = token.text;
            return e;
        }
        case Token::Kind::Symbol:
            if (token.text == u"(") {
                DepthGuard guard(*this);
                advance();
                ExprPtr inner = expression();
                expectSymbol(u")");
                return inner;
            }
            if (token.text == u"[")
                return listLiteral();
            m_lexer.fail(token.position,
                QStringLiteral("unexpected '%1' where a value is expected").arg(token.text));
        case Token::Kind::Identifier:
            return identifier(token);
        }
        m_lexer.fail(token.position, QStringLiteral("unexpected input"));
    }

    ExprPtr identifier(const Token& token)
    {
        if (isKeyword(u"true") || isKeyword(u"false")) {
            const bool value = isKeyword(u"true");
            advance();
            auto e = node(FormulaExpr::Kind::Literal, token.position);
            e->literal = Value::boolean(value);
            return e;
        }
        const FunctionName* found = nullptr;
        for (const auto& entry : functionNames) {
            if (token.text.compare(QStringView(entry.name), Qt::CaseInsensitive) == 0)
                found = &entry;
        }
        if (!found)
            m_lexer.fail(token.position, QStringLiteral("unknown name '%1'").arg(token.text));
        advance();
        auto e = node(FormulaExpr::Kind::Call, token.position);
        e->function = found->function;
        e->name = token.text;
        if (isSymbol(u"(")) {
            DepthGuard guard(*this);
            advance();
            if (!isSymbol(u")")) {
                for (;;) {
                    e->children.push_back(expression());
                    if (isSymbol(u",")) {
                        advance();
                        continue;
                    }
                    break;
                }
            }
            expectSymbol(u")");
        }
        return e;
    }

    Lexer m_lexer;
    Token m_token;
    int m_depth = 0;
};

} // namespace

std::unique_ptr<FormulaExpr> FormulaParser::parse(const QString& text, const QString& formulaName)
{
    Parser parser(text, formulaName);
    return parser.parseFormula();
}

} // namespace reportrt
