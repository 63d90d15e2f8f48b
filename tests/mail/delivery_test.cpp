#include "mailfixture.h"
#include "platform/sitesettings.h"
#include "reportrt/mail/maildelivery.h"
#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/mailrequest.h"
#include "reportrt/mail/mailsettings.h"

#include <QDir>
#include <QFile>
#include <QJsonArray>
#include <QRandomGenerator>
#include <QSettings>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::mail::test {
namespace {

const QString secret = u"s3cr3t-Pa55"_s;

template <typename Case> std::string caseName(const testing::TestParamInfo<Case>& info)
{
    return info.param.name;
}

QByteArray randomBytes(int size)
{
    QByteArray data(size, Qt::Uninitialized);
    for (char& c : data)
        c = static_cast<char>(QRandomGenerator::global()->bounded(256));
    return data;
}

QString writeFile(const QTemporaryDir& dir, const QString& name, const QByteArray& data)
{
    QFile file(dir.filePath(name));
    if (!file.open(QIODevice::WriteOnly) || file.write(data) != data.size())
        throw std::runtime_error("cannot write a test file");
    return file.fileName();
}

MailSettings serverSettings(const QString& url)
{
    MailSettings settings;
    settings.url = url;
    settings.from = u"Aruanded <reports@example.com>"_s;
    return settings;
}

MailRequest request(const QString& attachment = QString())
{
    MailRequest r;
    r.to = u"Anna Tamm <anna@example.com>; bert@example.org"_s;
    r.cc = u"\"Ceeli, C\" <ceeli@example.com>"_s;
    r.bcc = u"hidden@example.com"_s;
    r.subject = u"Müügiaruanne"_s;
    r.message = u"Tere,\naruanne on lisatud."_s;
    r.attachmentPath = attachment;
    r.attachmentName = u"Müük jaanuar.pdf"_s;
    return r;
}

TEST(SmtpDelivery, ReachesEveryRecipientWithTheFileUnchanged)
{
    SmtpServer server;
    QTemporaryDir dir;
    const QByteArray pdf = "%PDF-1.4\n" + randomBytes(200000);
    const QString path = writeFile(dir, u"scratch.pdf"_s, pdf);

    const MailDelivery::Result result
        = MailDelivery(serverSettings(server.url()), dir.filePath(u"outbox"_s))
              .deliver(request(path));
    EXPECT_TRUE(result.sent);
    EXPECT_EQ(result.server, u"127.0.0.1:%1"_s.arg(server.port()));
    EXPECT_FALSE(QFileInfo::exists(dir.filePath(u"outbox"_s)));

    const QStringList messages = server.messages();
    ASSERT_EQ(messages.size(), 1);
    const QJsonObject envelope = server.envelope(messages.first());
    EXPECT_EQ(envelope[u"mail_from"_s].toString(), u"reports@example.com"_s);
    // Bcc is an envelope recipient like the others...
    EXPECT_EQ(envelope[u"rcpt_tos"_s].toArray(),
        QJsonArray({ u"anna@example.com"_s, u"bert@example.org"_s, u"ceeli@example.com"_s,
            u"hidden@example.com"_s }));
    // ...but not in the message anyone receives.
    const QJsonObject parsed = parseMessage(messages.first());
    EXPECT_TRUE(parsed[u"bcc"_s].isNull());
    EXPECT_EQ(parsed[u"defects"_s].toArray(), QJsonArray());
    EXPECT_EQ(parsed[u"subject"_s].toString(), u"Müügiaruanne"_s);
    EXPECT_EQ(parsed[u"from"_s].toArray(),
        QJsonArray({ QJsonArray { u"Aruanded"_s, u"reports@example.com"_s } }));
    EXPECT_EQ(parsed[u"cc"_s].toArray(),
        QJsonArray({ QJsonArray { u"Ceeli, C"_s, u"ceeli@example.com"_s } }));
    EXPECT_EQ(parsed[u"body"_s].toString(), u"Tere,\naruanne on lisatud."_s);
    const QJsonObject attachment = parsed[u"attachments"_s].toArray().first().toObject();
    EXPECT_EQ(attachment[u"filename"_s].toString(), u"Müük jaanuar.pdf"_s);
    EXPECT_EQ(attachment[u"content_type"_s].toString(), u"application/pdf"_s);
    EXPECT_EQ(QByteArray::fromBase64(attachment[u"data"_s].toString().toLatin1()), pdf);
}

TEST(SmtpDelivery, LogsInWithTheRightPassword)
{
    SmtpServer server({ {}, u"reporter"_s, secret });
    MailSettings settings = serverSettings(server.url());
    settings.user = u"reporter"_s;
    settings.password = secret;
    QTemporaryDir dir;
    EXPECT_TRUE(MailDelivery(settings, dir.path()).deliver(request()).sent);
    EXPECT_EQ(server.messages().size(), 1);
}

enum class Failure {
    ClosedPort,
    RefusedRecipient,
    BadPassword,
    NoLogin,
    Silent,
    HttpUrl,
    UrlWithLogin
};

struct FailureCase {
    const char* name;
    Failure failure;
    MailError::Kind kind;
    const char* cause;
};

class DeliveryFailures : public testing::TestWithParam<FailureCase> { };

TEST_P(DeliveryFailures, AreErrorsThatSendNothing)
{
    const FailureCase& c = GetParam();
    SmtpServer server({ u"refused"_s,
        c.failure == Failure::BadPassword || c.failure == Failure::NoLogin ? u"reporter"_s
                                                                           : QString(),
        secret });
    SilentListener silent;
    MailSettings settings = serverSettings(server.url());
    MailRequest r = request();
    int port = server.port();
    switch (c.failure) {
    case Failure::ClosedPort:
        port = closedPort();
        settings.url = u"smtp://127.0.0.1:%1"_s.arg(port);
        break;
    case Failure::RefusedRecipient:
        // The refused address comes after accepted ones: they must not get the mail either.
        r.bcc = u"hidden@example.com; refused@example.com"_s;
        break;
    case Failure::BadPassword:
        settings.user = u"reporter"_s;
        settings.password = secret + u'x';
        break;
    case Failure::NoLogin:
        break;
    case Failure::Silent:
        port = silent.port();
        settings.url = u"smtp://127.0.0.1:%1"_s.arg(port);
        settings.timeoutSeconds = 2;
        settings.connectTimeoutSeconds = 2;
        break;
    case Failure::HttpUrl:
        settings.url = u"http://127.0.0.1:%1"_s.arg(port);
        break;
    case Failure::UrlWithLogin:
        settings.url = u"smtp://reporter:%1@127.0.0.1:%2"_s.arg(secret).arg(port);
        break;
    }
    if (c.failure != Failure::BadPassword && c.failure != Failure::NoLogin)
        settings.password = secret; // never needed here, and must not show either

    QList<QString> logged;
    static QList<QString>* log = nullptr;
    log = &logged;
    const QtMessageHandler previous = qInstallMessageHandler(
        [](QtMsgType, const QMessageLogContext&, const QString& text) { log->append(text); });
    QTemporaryDir dir;
    try {
        MailDelivery(settings, dir.filePath(u"outbox"_s)).deliver(r);
        qInstallMessageHandler(previous);
        FAIL() << "delivered";
    } catch (const MailError& error) {
        qInstallMessageHandler(previous);
        EXPECT_EQ(error.kind(), c.kind) << error.what();
        EXPECT_TRUE(error.description().contains(QString::fromUtf8(c.cause))) << error.what();
        EXPECT_TRUE(error.description().contains(u"127.0.0.1:%1"_s.arg(port))) << error.what();
        EXPECT_FALSE(error.description().contains(secret)) << error.what();
    }
    for (const QString& line : logged)
        EXPECT_FALSE(line.contains(secret)) << line.toStdString();
    EXPECT_TRUE(server.messages().isEmpty());
    // A failed delivery is an error, not a message quietly parked in the outbox.
    EXPECT_FALSE(QFileInfo::exists(dir.filePath(u"outbox"_s)));
}

INSTANTIATE_TEST_SUITE_P(Mail, DeliveryFailures,
    testing::Values(FailureCase { "ClosedPort", Failure::ClosedPort, MailError::Kind::Unreachable,
                        "no connection" },
        FailureCase { "RefusedRecipient", Failure::RefusedRecipient,
            MailError::Kind::RecipientRefused, "refused the recipient <refused@example.com> (550" },
        FailureCase { "BadPassword", Failure::BadPassword, MailError::Kind::Authentication,
            "refused the user name or password" },
        FailureCase { "LoginRequired", Failure::NoLogin, MailError::Kind::Authentication,
            "requires a valid user name and password" },
        FailureCase { "SilentServer", Failure::Silent, MailError::Kind::Timeout,
            "no answer within 2 seconds" },
        FailureCase {
            "NotSmtpUrl", Failure::HttpUrl, MailError::Kind::InvalidSettings, "smtp://host:port" },
        FailureCase { "LoginInUrl", Failure::UrlWithLogin, MailError::Kind::InvalidSettings,
            "must not carry a user name or password" }),
    caseName<FailureCase>);

struct RequestCase {
    const char* name;
    MailRequest request;
    MailError::Kind kind;
    const char* cause;
};

class BadRequests : public testing::TestWithParam<RequestCase> { };

TEST_P(BadRequests, FailBeforeAnythingIsSent)
{
    const RequestCase& c = GetParam();
    SmtpServer server;
    QTemporaryDir dir;
    try {
        MailDelivery(serverSettings(server.url()), dir.path()).deliver(c.request);
        FAIL() << "delivered";
    } catch (const MailError& error) {
        EXPECT_EQ(error.kind(), c.kind);
        EXPECT_TRUE(error.description().contains(QString::fromUtf8(c.cause))) << error.what();
    }
    EXPECT_TRUE(server.messages().isEmpty());
    EXPECT_TRUE(entries(dir.path()).isEmpty());
}

INSTANTIATE_TEST_SUITE_P(Mail, BadRequests,
    testing::Values(RequestCase { "InvalidCc",
                        { u"anna@example.com"_s, u"bert; ceeli@example.com"_s, {}, {}, {}, {}, {} },
                        MailError::Kind::InvalidAddress, "\"bert\" in the Cc list" },
        RequestCase { "InvalidBcc", { u"anna@example.com"_s, {}, u"x@@y"_s, {}, {}, {}, {} },
            MailError::Kind::InvalidAddress, "Bcc list" },
        RequestCase { "NoRecipient", { u" ; "_s, {}, {}, u"s"_s, {}, {}, {} },
            MailError::Kind::NoRecipient, "no recipient" },
        RequestCase { "MissingAttachment",
            { u"anna@example.com"_s, {}, {}, {}, {}, u"/nonexistent/ludmox/report.pdf"_s, {} },
            MailError::Kind::Attachment, "/nonexistent/ludmox/report.pdf" }),
    caseName<RequestCase>);

TEST(Outbox, KeepsTheMessageWhenNoServerIsConfigured)
{
    QTemporaryDir dir;
    const QByteArray data = randomBytes(5000);
    const QString path = writeFile(dir, u"scratch.pdf"_s, data);
    const QString outbox = dir.filePath(u"deep/outbox"_s);

    const MailDelivery::Result result = MailDelivery(MailSettings(), outbox).deliver(request(path));
    EXPECT_FALSE(result.sent);
    const QStringList files = entries(outbox);
    ASSERT_EQ(files.size(), 1) << files.join(u' ').toStdString();
    EXPECT_EQ(QDir(outbox).filePath(files.first()), result.outboxPath);
    EXPECT_TRUE(result.outboxPath.endsWith(u".eml"_s));
    EXPECT_EQ(QFileInfo(outbox).permissions() & (QFile::ReadGroup | QFile::ReadOther), 0);

    const QJsonObject parsed = parseMessage(result.outboxPath);
    EXPECT_EQ(parsed[u"defects"_s].toArray(), QJsonArray());
    EXPECT_EQ(parsed[u"subject"_s].toString(), u"Müügiaruanne"_s);
    // A draft keeps its Bcc, or that recipient would be lost when the user sends it.
    EXPECT_EQ(
        parsed[u"bcc"_s].toArray(), QJsonArray({ QJsonArray { u""_s, u"hidden@example.com"_s } }));
    EXPECT_TRUE(parsed[u"headers"_s].toArray().contains(u"X-Unsent"_s));
    const QJsonObject attachment = parsed[u"attachments"_s].toArray().first().toObject();
    EXPECT_EQ(QByteArray::fromBase64(attachment[u"data"_s].toString().toLatin1()), data);

    // A second message is a second file, never a replacement.
    MailDelivery(MailSettings(), outbox).deliver(request(path));
    EXPECT_EQ(entries(outbox).size(), 2);
}

TEST(Outbox, ThatCannotBeWrittenIsAnError)
{
    QTemporaryDir dir;
    const QString blocker = writeFile(dir, u"file"_s, "x");
    try {
        MailDelivery(MailSettings(), blocker + u"/outbox"_s).deliver(request());
        FAIL() << "written";
    } catch (const MailError& error) {
        EXPECT_EQ(error.kind(), MailError::Kind::Outbox);
        EXPECT_TRUE(error.description().contains(blocker)) << error.what();
    }
    EXPECT_EQ(entries(dir.path()), QStringList { u"file"_s });
}

struct SettingsCase {
    const char* name;
    QStringList stored; // Url, User, Password, From, Timeout
    QStringList environment;
    QStringList expected; // url, user, password, from, timeout, connect timeout
};

class SettingsSources : public testing::TestWithParam<SettingsCase> { };

TEST_P(SettingsSources, EnvironmentWinsOverTheFile)
{
    const SettingsCase& c = GetParam();
    QTemporaryDir dir;
    const QString file = dir.filePath(u"ludmox.conf"_s);
    QSettings stored(file, QSettings::IniFormat);
    const QStringList keys { u"Url"_s, u"User"_s, u"Password"_s, u"From"_s, u"Timeout"_s };
    const QStringList variables { u"LUDMOX_SMTP_URL"_s, u"LUDMOX_SMTP_USER"_s,
        u"LUDMOX_SMTP_PASSWORD"_s, u"LUDMOX_SMTP_FROM"_s, u"LUDMOX_SMTP_TIMEOUT"_s };
    QProcessEnvironment environment;
    for (int i = 0; i < keys.size(); ++i) {
        if (!c.stored.value(i).isEmpty())
            stored.setValue(u"Mail/"_s + keys.at(i), c.stored.at(i));
        if (i < c.environment.size())
            environment.insert(variables.at(i), c.environment.at(i));
    }
    stored.sync();
    const MailSettings settings = MailSettings::load(platform::SiteSettings(environment, { file }));
    EXPECT_EQ(QStringList({ settings.url, settings.user, settings.password, settings.from,
                  QString::number(settings.timeoutSeconds),
                  QString::number(settings.connectTimeoutSeconds) }),
        c.expected);
}

INSTANTIATE_TEST_SUITE_P(Mail, SettingsSources,
    testing::Values(SettingsCase { "NothingMeansOutbox", {}, {},
                        { u""_s, u""_s, u""_s, u""_s, u"300"_s, u"15"_s } },
        SettingsCase { "StoreOnly",
            { u" smtp://mail.example.com:587 "_s, u"u"_s, u"p"_s, u"a@b.ee"_s, u"60"_s }, {},
            { u"smtp://mail.example.com:587"_s, u"u"_s, u"p"_s, u"a@b.ee"_s, u"60"_s, u"15"_s } },
        SettingsCase { "EnvironmentOverStore",
            { u"smtp://store:25"_s, u"su"_s, u"sp"_s, u"s@b.ee"_s, u"60"_s },
            { u"smtps://env:465"_s, u"eu"_s, u"ep"_s, u"e@b.ee"_s, u"5"_s },
            { u"smtps://env:465"_s, u"eu"_s, u"ep"_s, u"e@b.ee"_s, u"5"_s, u"5"_s } },
        // An empty variable does not blank a stored value.
        SettingsCase { "EmptyVariableKeepsStored", { u"smtp://store:25"_s, u"su"_s },
            { u""_s, u""_s }, { u"smtp://store:25"_s, u"su"_s, u""_s, u""_s, u"300"_s, u"15"_s } },
        SettingsCase { "BadTimeoutKeepsDefault", {}, { {}, {}, {}, {}, u"-3"_s },
            { u""_s, u""_s, u""_s, u""_s, u"300"_s, u"15"_s } }),
    caseName<SettingsCase>);

} // namespace
} // namespace reportrt::mail::test
