#include "mailfixture.h"
#include "reportrt/mail/mailaddress.h"
#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/mimemessage.h"

#include <QJsonArray>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::mail::test {
namespace {

template <typename Case> std::string caseName(const testing::TestParamInfo<Case>& info)
{
    return info.param.name;
}

struct AddressCase {
    const char* name;
    QString text;
    QList<MailAddress> expected;
};

class AddressLists : public testing::TestWithParam<AddressCase> { };

TEST_P(AddressLists, ParseAsAHostMeansThem)
{
    const AddressCase& c = GetParam();
    EXPECT_EQ(MailAddress::parseList(c.text), c.expected);
}

INSTANTIATE_TEST_SUITE_P(Mail, AddressLists,
    testing::Values(AddressCase { "Empty", u"  "_s, {} },
        AddressCase { "OnlySeparators", u" ; , ;"_s, {} },
        AddressCase { "Single", u"anna@example.com"_s, { { {}, u"anna@example.com"_s } } },
        AddressCase { "SemicolonsWithBlanks", u" anna@example.com ;bert@example.org;  "_s,
            { { {}, u"anna@example.com"_s }, { {}, u"bert@example.org"_s } } },
        AddressCase { "CommasAndSemicolonsMixed", u"a@x.ee, b@x.ee; c@x.ee"_s,
            { { {}, u"a@x.ee"_s }, { {}, u"b@x.ee"_s }, { {}, u"c@x.ee"_s } } },
        AddressCase { "DisplayName", u"Anna Tamm <anna@example.com>"_s,
            { { u"Anna Tamm"_s, u"anna@example.com"_s } } },
        // The comma inside the quotes belongs to the name, not to the list.
        AddressCase { "QuotedNameWithSeparator",
            u"\"Tamm, Anna\" <anna@example.com>; \"A \\\"B\\\" C\" <b@example.com>"_s,
            { { u"Tamm, Anna"_s, u"anna@example.com"_s },
                { u"A \"B\" C"_s, u"b@example.com"_s } } },
        AddressCase { "AngleOnly", u"<anna@example.com>"_s, { { {}, u"anna@example.com"_s } } },
        AddressCase { "UnicodeName", u"Jüri Õunapuu <jyri@example.ee>"_s,
            { { u"Jüri Õunapuu"_s, u"jyri@example.ee"_s } } },
        // An SMTP server only takes the ASCII form of an internationalised domain.
        AddressCase {
            "UnicodeDomain", u"info@bücher.de"_s, { { {}, u"info@xn--bcher-kva.de"_s } } },
        AddressCase { "AddressLiteralAndLocalhost", u"root@[127.0.0.1]; me@localhost"_s,
            { { {}, u"root@[127.0.0.1]"_s }, { {}, u"me@localhost"_s } } },
        AddressCase { "SpecialsInLocalPart", u"o'brien+tag@example.com"_s,
            { { {}, u"o'brien+tag@example.com"_s } } }),
    caseName<AddressCase>);

struct BadAddressCase {
    const char* name;
    QString text;
    QString named; // what the error must quote
};

class InvalidAddresses : public testing::TestWithParam<BadAddressCase> { };

TEST_P(InvalidAddresses, AreAClearError)
{
    const BadAddressCase& c = GetParam();
    try {
        MailAddress::parseList(c.text, u"Cc"_s);
        FAIL() << "accepted";
    } catch (const MailError& error) {
        EXPECT_EQ(error.kind(), MailError::Kind::InvalidAddress);
        EXPECT_TRUE(error.description().contains(c.named)) << error.what();
        EXPECT_TRUE(error.description().contains(u"Cc list"_s)) << error.what();
    }
}

INSTANTIATE_TEST_SUITE_P(Mail, InvalidAddresses,
    testing::Values(
        BadAddressCase { "NoAt", u"ok@example.com; anna.example.com"_s, u"anna.example.com"_s },
        BadAddressCase { "NoDomain", u"anna@"_s, u"anna@"_s },
        BadAddressCase { "NoLocalPart", u"@example.com"_s, u"@example.com"_s },
        BadAddressCase { "BlankInside", u"anna tamm@example.com"_s, u"anna tamm@example.com"_s },
        BadAddressCase { "DoubleDot", u"anna@example..com"_s, u"anna@example..com"_s },
        BadAddressCase { "BadLabel", u"anna@-example.com"_s, u"anna@-example.com"_s },
        BadAddressCase {
            "UnclosedAngle", u"Anna <anna@example.com"_s, u"Anna <anna@example.com"_s },
        BadAddressCase { "TextAfterAngle", u"<anna@example.com> x"_s, u"<anna@example.com> x"_s },
        BadAddressCase { "NameWithoutAddress", u"Anna Tamm <>"_s, u"Anna Tamm <>"_s },
        BadAddressCase { "UnicodeLocalPart", u"jüri@example.ee"_s, u"jüri@example.ee"_s },
        // A line break would let the list's text start a header of its own.
        BadAddressCase {
            "HeaderInjection", u"a@example.com\r\nBcc: spy@example.com"_s, u"spy@example.com"_s },
        BadAddressCase { "BadLiteral", u"a@[300.1.1.1]"_s, u"a@[300.1.1.1]"_s }),
    caseName<BadAddressCase>);

QByteArray allBytes()
{
    QByteArray data;
    for (int i = 0; i < 4096; ++i)
        data.append(static_cast<char>((i * 7) % 256));
    return data;
}

struct RoundTripCase {
    const char* name;
    QString subject;
    QString toName;
    QString text;
    QString fileName;
};

class MimeRoundTrip : public testing::TestWithParam<RoundTripCase> {
protected:
    static MimeMessage build(const RoundTripCase& c)
    {
        MimeMessage message;
        message.setFrom(MailAddress(u"Müügiosakond"_s, u"sales@example.ee"_s));
        message.setTo({ MailAddress(c.toName, u"anna@example.com"_s),
            MailAddress({}, u"bert@example.org"_s) });
        message.setCc({ MailAddress(u"Ceeli"_s, u"ceeli@example.com"_s) });
        message.setBcc({ MailAddress(u"Hidden One"_s, u"hidden@example.com"_s) });
        message.setSubject(c.subject);
        message.setText(c.text);
        message.setAttachment(allBytes(), c.fileName);
        return message;
    }
};

TEST_P(MimeRoundTrip, ReadsBackAsWritten)
{
    const RoundTripCase& c = GetParam();
    const QByteArray bytes = build(c).toBytes();
    const QJsonObject parsed = parseMessage(bytes);

    EXPECT_EQ(parsed[u"defects"_s].toArray(), QJsonArray()) << bytes.left(2000).toStdString();
    QString subject = c.subject;
    subject.replace(u"\r\n"_s, u"  "_s);
    EXPECT_EQ(parsed[u"subject"_s].toString(), subject);
    EXPECT_EQ(parsed[u"from"_s].toArray(),
        QJsonArray({ QJsonArray { u"Müügiosakond"_s, u"sales@example.ee"_s } }));
    EXPECT_EQ(parsed[u"to"_s].toArray(),
        QJsonArray({ QJsonArray { c.toName, u"anna@example.com"_s },
            QJsonArray { u""_s, u"bert@example.org"_s } }));
    EXPECT_EQ(parsed[u"cc"_s].toArray(),
        QJsonArray({ QJsonArray { u"Ceeli"_s, u"ceeli@example.com"_s } }));
    EXPECT_TRUE(parsed[u"bcc"_s].isNull());
    EXPECT_FALSE(bytes.contains("hidden@example.com"));
    EXPECT_FALSE(bytes.contains("Hidden One"));
    EXPECT_EQ(parsed[u"mime_version"_s].toString(), u"1.0"_s);
    EXPECT_FALSE(parsed[u"date"_s].toString().isEmpty());
    EXPECT_TRUE(parsed[u"message_id"_s].toString().endsWith(u"@example.ee>"_s));

    QString body = c.text;
    body.replace(u"\r\n"_s, u"\n"_s).replace(u'\r', u'\n');
    // The line break before the boundary belongs to the boundary (RFC 2046).
    EXPECT_EQ(parsed[u"body"_s].toString(), body);
    EXPECT_EQ(parsed[u"body_charset"_s].toString(), u"utf-8"_s);

    const QJsonArray attachments = parsed[u"attachments"_s].toArray();
    ASSERT_EQ(attachments.size(), 1);
    const QJsonObject attachment = attachments.first().toObject();
    EXPECT_EQ(attachment[u"filename"_s].toString(), c.fileName);
    EXPECT_EQ(attachment[u"content_type"_s].toString(), MimeMessage::contentTypeFor(c.fileName));
    EXPECT_EQ(QByteArray::fromBase64(attachment[u"data"_s].toString().toLatin1()), allBytes());
}

TEST_P(MimeRoundTrip, KeepsToTheLineRules)
{
    const QByteArray bytes = build(GetParam()).toBytes();
    EXPECT_TRUE(bytes.endsWith("\r\n"));
    const QList<QByteArray> lines = bytes.chopped(1).split('\n');
    bool inHeader = true;
    for (const QByteArray& line : lines) {
        ASSERT_TRUE(line.endsWith('\r')) << "bare LF after: " << line.toStdString();
        const QByteArray content = line.chopped(1);
        EXPECT_FALSE(content.contains('\r')) << content.toStdString();
        EXPECT_LE(content.size(), 998);
        if (content.isEmpty())
            inHeader = false;
        // Encoded text is held to 76; only a header naming a long MIME type may pass it.
        if (!content.startsWith("Content-Type: application/vnd.")) {
            EXPECT_LE(content.size(), 76) << content.toStdString();
        }
        for (char ch : content)
            EXPECT_TRUE(ch == '\t' || (ch >= 0x20 && ch < 0x7f)) << int(ch);
    }
    EXPECT_FALSE(inHeader);
}

INSTANTIATE_TEST_SUITE_P(Mail, MimeRoundTrip,
    testing::Values(RoundTripCase { "PlainAscii", u"Monthly sales"_s, u"Anna Tamm"_s,
                        u"Hello,\nthe report is attached."_s, u"sales.pdf"_s },
        RoundTripCase { "UnicodeEverywhere", u"Müügiaruanne – jaanuar 2024 ✓"_s, u"Jüri Õunapuu"_s,
            u"Tere!\r\nAruanne on lisatud. Ära vasta sellele kirjale.\r\n"_s,
            u"Müügiaruanne jaanuar.xlsx"_s },
        RoundTripCase { "LongCjkSubject", QString(u"報告書の送付について"_s).repeated(20),
            u"山田 太郎"_s, u"本文"_s, u"報告書.pdf"_s },
        RoundTripCase { "LongAsciiSubject",
            QStringList(40, u"word"_s).join(u' ') + u' ' + QString(120, u'x'), u"Anna"_s, u"x"_s,
            u"a.html"_s },
        // A subject is one line: a host's line break must not start a header.
        RoundTripCase { "SubjectWithLineBreak", u"Hi\r\nBcc: spy@example.com"_s, u"Anna"_s, u"x"_s,
            u"a.pdf"_s },
        RoundTripCase { "SpecialsInNames", u"Re: =?not-encoded?= \"quoted\""_s,
            u"Tamm, Anna \"AT\" (sales)"_s, u"x"_s, u"report \"final\" v2.pdf"_s },
        RoundTripCase { "BodyEdges", u"Body"_s, u"Anna"_s,
            u"trailing blanks   \n\tleading tab\n.\n..dots\nFrom here on\n= sign =3D\n"_s
                + QString(300, u'a') + u'\n' + QString(100, u'ü') + u"\r\rend"_s,
            u"body.txt"_s },
        RoundTripCase { "LongUnicodeFileName", u"Attachment"_s, u"Anna"_s, u"x"_s,
            QString(u"Kvartaliaruanne müügipiirkondade kaupa "_s).repeated(4) + u".pdf"_s },
        RoundTripCase { "EmptySubjectAndBody", u""_s, u""_s, u""_s, u"report.pdf"_s }),
    caseName<RoundTripCase>);

TEST(MimeMessage, DraftKeepsBccForTheMailProgram)
{
    MimeMessage message;
    message.setFrom(MailAddress({}, u"me@example.com"_s));
    message.setBcc({ MailAddress(u"Õie"_s, u"hidden@example.com"_s) });
    message.setSubject(u"Only Bcc"_s);
    message.setDraft(true);
    const QJsonObject draft = parseMessage(message.toBytes());
    EXPECT_EQ(draft[u"bcc"_s].toArray(),
        QJsonArray({ QJsonArray { u"Õie"_s, u"hidden@example.com"_s } }));
    EXPECT_TRUE(draft[u"headers"_s].toArray().contains(u"X-Unsent"_s));
    // No To or Cc: the header says so instead of leaving To out.
    EXPECT_EQ(draft[u"to"_s].toArray(), QJsonArray());
    EXPECT_EQ(draft[u"defects"_s].toArray(), QJsonArray());
    EXPECT_TRUE(draft[u"attachments"_s].toArray().isEmpty());
    EXPECT_EQ(draft[u"body"_s].toString(), u"\n"_s);

    message.setDraft(false);
    const QJsonObject sent = parseMessage(message.toBytes());
    EXPECT_TRUE(sent[u"bcc"_s].isNull());
    EXPECT_FALSE(sent[u"headers"_s].toArray().contains(u"X-Unsent"_s));
}

TEST(MimeMessage, RecipientsAreEveryListOnce)
{
    MimeMessage message;
    message.setTo({ MailAddress({}, u"a@x.ee"_s), MailAddress({}, u"b@x.ee"_s) });
    message.setCc({ MailAddress({}, u"A@x.ee"_s), MailAddress({}, u"c@x.ee"_s) });
    message.setBcc({ MailAddress({}, u"d@x.ee"_s), MailAddress({}, u"b@x.ee"_s) });
    QStringList addresses;
    for (const MailAddress& a : message.recipients())
        addresses.append(a.address());
    EXPECT_EQ(addresses, QStringList({ u"a@x.ee"_s, u"b@x.ee"_s, u"c@x.ee"_s, u"d@x.ee"_s }));
}

} // namespace
} // namespace reportrt::mail::test
