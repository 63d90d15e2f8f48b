#include "reportrt/mail/smtptransport.h"

#include "reportrt/mail/mailerror.h"
#include "reportrt/mail/maillogging_p.h"

#include <QUrl>
#include <algorithm>
#include <cstring>
#include <curl/curl.h>
#include <memory>

namespace reportrt::mail {

namespace {

using Kind = MailError::Kind;

struct CurlDeleter {
    void operator()(CURL* handle) const { curl_easy_cleanup(handle); }
};
struct SlistDeleter {
    void operator()(curl_slist* list) const { curl_slist_free_all(list); }
};

void initialiseCurl()
{
    static const CURLcode initialised = curl_global_init(CURL_GLOBAL_DEFAULT);
    if (initialised != CURLE_OK)
        throw MailError(Kind::Delivery,
            QStringLiteral("The mail library could not be initialised: %1.")
                .arg(QString::fromUtf8(curl_easy_strerror(initialised))));
}

struct Upload {
    const QByteArray* data = nullptr;
    qsizetype offset = 0;
};

size_t readMessage(char* buffer, size_t size, size_t count, void* userData)
{
    auto* upload = static_cast<Upload*>(userData);
    const qsizetype room = static_cast<qsizetype>(size * count);
    const qsizetype n = std::min(room, upload->data->size() - upload->offset);
    std::memcpy(buffer, upload->data->constData() + upload->offset, static_cast<size_t>(n));
    upload->offset += n;
    return static_cast<size_t>(n);
}

// What the conversation had reached when it failed. Only command names, recipient addresses
// and the server's replies are kept: the lines a client sends while authenticating carry the
// password.
struct Conversation {
    QByteArray command;
    QString recipient;
    QString reply;
    // After a failure curl says QUIT; the server's goodbye must not hide the reply that
    // mattered.
    bool quitting = false;
};

int traceConversation(CURL*, curl_infotype type, char* data, size_t size, void* userData)
{
    auto* conversation = static_cast<Conversation*>(userData);
    if (conversation->quitting)
        return 0;
    const QByteArray line = QByteArray(data, static_cast<qsizetype>(size)).trimmed();
    if (type == CURLINFO_HEADER_IN) {
        // A multi-line reply ends with its most telling line.
        const QList<QByteArray> lines = line.split('\n');
        conversation->reply = QString::fromUtf8(lines.last().trimmed());
    } else if (type == CURLINFO_HEADER_OUT) {
        const QByteArray upper = line.left(10).toUpper();
        if (upper.startsWith("QUIT")) {
            conversation->quitting = true;
        } else if (upper.startsWith("RCPT TO:")) {
            conversation->command = "RCPT";
            conversation->recipient = QString::fromUtf8(line.mid(8).trimmed());
        } else {
            for (const char* verb : { "MAIL", "AUTH", "DATA", "EHLO", "HELO", "STARTTLS" }) {
                if (upper.startsWith(verb))
                    conversation->command = verb;
            }
        }
    }
    return 0;
}

bool isLoopback(const QString& host)
{
    return host.compare(QStringLiteral("localhost"), Qt::CaseInsensitive) == 0
        || host == QStringLiteral("::1")
        || (host.startsWith(QStringLiteral("127."))
            && std::all_of(
                host.begin(), host.end(), [](QChar c) { return c.isDigit() || c == u'.'; }));
}

QString scrubbed(QString text, const QString& password)
{
    if (!password.isEmpty())
        text.replace(password, QStringLiteral("********"));
    return text;
}

// A server's reply may quote what it was sent; the password must not travel on in it.
[[noreturn]] void raiseFailure(
    Kind kind, const QString& server, const QString& password, const QString& cause)
{
    throw MailError(kind,
        scrubbed(QStringLiteral("Mail to the server %1 failed: %2.").arg(server, cause), password));
}

int replyCode(const QString& reply)
{
    return reply.left(3).toInt();
}

} // namespace

SmtpTransport::SmtpTransport(MailSettings settings)
    : m_settings(std::move(settings))
{ }

QString SmtpTransport::serverName(const QString& url)
{
    const QUrl parsed(url.trimmed());
    const bool secure = parsed.scheme().compare(QStringLiteral("smtps"), Qt::CaseInsensitive) == 0;
    const int port = parsed.port(secure ? 465 : 25);
    QString host = parsed.host();
    if (host.contains(u':'))
        host = u'[' + host + u']';
    return host + u':' + QString::number(port);
}

void SmtpTransport::send(const MailAddress& sender, const QList<MailAddress>& recipients,
    const QByteArray& message) const
{
    const QString server = serverName(m_settings.url);
    const QString& password = m_settings.password;
    const auto fail = [&server, &password](Kind kind, const QString& cause) {
        raiseFailure(kind, server, password, cause);
    };

    const QUrl url(m_settings.url.trimmed(), QUrl::StrictMode);
    const QString scheme = url.scheme().toLower();
    if (!url.isValid() || url.host().isEmpty()
        || (scheme != QStringLiteral("smtp") && scheme != QStringLiteral("smtps")))
        throw MailError(Kind::InvalidSettings,
            QStringLiteral("The mail server setting (%1) is not an \"smtp://host:port\" or "
                           "\"smtps://host:port\" address.")
                .arg(server));
    if (!url.userInfo().isEmpty())
        throw MailError(Kind::InvalidSettings,
            QStringLiteral("The mail server address %1 must not carry a user name or password; "
                           "give them as the mail user and password settings.")
                .arg(server));
    if (recipients.isEmpty())
        throw MailError(Kind::NoRecipient, QStringLiteral("The mail has no recipient."));

    initialiseCurl();
    std::unique_ptr<CURL, CurlDeleter> curl(curl_easy_init());
    if (!curl)
        fail(Kind::Delivery, QStringLiteral("the mail library could not start a transfer"));
    CURL* handle = curl.get();

    std::unique_ptr<curl_slist, SlistDeleter> rcpt;
    for (const MailAddress& recipient : recipients) {
        const QByteArray address = '<' + recipient.address().toLatin1() + '>';
        curl_slist* extended = curl_slist_append(rcpt.get(), address.constData());
        if (!extended)
            fail(Kind::Delivery, QStringLiteral("out of memory"));
        (void)rcpt.release();
        rcpt.reset(extended);
    }

    const bool secure = scheme == QStringLiteral("smtps");
    const bool credentials = !m_settings.user.isEmpty() || !m_settings.password.isEmpty();
    const QByteArray urlBytes = QUrl(url).toString(QUrl::FullyEncoded).toUtf8();
    const QByteArray from = '<' + sender.address().toLatin1() + '>';
    const QByteArray user = m_settings.user.toUtf8();
    const QByteArray passwordBytes = m_settings.password.toUtf8();
    Upload upload { &message, 0 };
    Conversation conversation;
    char errorBuffer[CURL_ERROR_SIZE] = {};

    curl_easy_setopt(handle, CURLOPT_URL, urlBytes.constData());
    curl_easy_setopt(handle, CURLOPT_PROTOCOLS_STR, "smtp,smtps");
    curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L);
    curl_easy_setopt(handle, CURLOPT_ERRORBUFFER, errorBuffer);
    curl_easy_setopt(
        handle, CURLOPT_CONNECTTIMEOUT, static_cast<long>(m_settings.connectTimeoutSeconds));
    curl_easy_setopt(handle, CURLOPT_TIMEOUT, static_cast<long>(m_settings.timeoutSeconds));
    if (!secure) {
        // Plain SMTP: upgrade when the server offers STARTTLS. Credentials bound for another
        // machine insist on it, so they never cross the network readable.
        curl_easy_setopt(handle, CURLOPT_USE_SSL,
            static_cast<long>(
                credentials && !isLoopback(url.host()) ? CURLUSESSL_ALL : CURLUSESSL_TRY));
    }
    if (credentials) {
        curl_easy_setopt(handle, CURLOPT_USERNAME, user.constData());
        curl_easy_setopt(handle, CURLOPT_PASSWORD, passwordBytes.constData());
    }
    curl_easy_setopt(handle, CURLOPT_MAIL_FROM, from.constData());
    curl_easy_setopt(handle, CURLOPT_MAIL_RCPT, rcpt.get());
    curl_easy_setopt(handle, CURLOPT_UPLOAD, 1L);
    curl_easy_setopt(handle, CURLOPT_READFUNCTION, readMessage);
    curl_easy_setopt(handle, CURLOPT_READDATA, &upload);
    curl_easy_setopt(handle, CURLOPT_INFILESIZE_LARGE, static_cast<curl_off_t>(message.size()));
    // The trace callback only keeps what the error needs; nothing is printed.
    curl_easy_setopt(handle, CURLOPT_DEBUGFUNCTION, traceConversation);
    curl_easy_setopt(handle, CURLOPT_DEBUGDATA, &conversation);
    curl_easy_setopt(handle, CURLOPT_VERBOSE, 1L);

    const CURLcode result = curl_easy_perform(handle);
    if (result == CURLE_OK) {
        qCInfo(lcMail) << "Mail sent through" << server << "to" << recipients.size()
                       << "recipients";
        return;
    }

    const QString detail = errorBuffer[0] ? QString::fromUtf8(errorBuffer)
                                          : QString::fromUtf8(curl_easy_strerror(result));
    const QString reply = conversation.reply;
    const int code = replyCode(reply);
    qCWarning(lcMail) << "Mail through" << server << "failed:" << scrubbed(detail, password);
    switch (result) {
    case CURLE_COULDNT_RESOLVE_HOST:
        raiseFailure(
            Kind::Unreachable, server, password, QStringLiteral("the host name is not known"));
    case CURLE_COULDNT_CONNECT:
        raiseFailure(Kind::Unreachable, server, password,
            QStringLiteral("no connection could be made (the server is down, unreachable or "
                           "does not listen on that port)"));
    case CURLE_OPERATION_TIMEDOUT:
        raiseFailure(Kind::Timeout, server, password,
            QStringLiteral("no answer within %1 seconds")
                .arg(conversation.command.isEmpty() ? m_settings.connectTimeoutSeconds
                                                    : m_settings.timeoutSeconds));
    case CURLE_LOGIN_DENIED:
        raiseFailure(Kind::Authentication, server, password,
            QStringLiteral("the server refused the user name or password (%1)").arg(reply));
    case CURLE_AUTH_ERROR:
        raiseFailure(Kind::Authentication, server, password,
            QStringLiteral("no authentication method the server offers could be used (%1)")
                .arg(detail));
    case CURLE_USE_SSL_FAILED:
        raiseFailure(Kind::Security, server, password,
            QStringLiteral("the server does not offer STARTTLS, and the user name and password "
                           "are not sent without it"));
    case CURLE_SSL_CONNECT_ERROR:
    case CURLE_PEER_FAILED_VERIFICATION:
    case CURLE_SSL_CACERT_BADFILE:
    case CURLE_SSL_CERTPROBLEM:
    case CURLE_SSL_CIPHER:
        raiseFailure(Kind::Security, server, password,
            QStringLiteral("a secure connection could not be made (%1)").arg(detail));
    default:
        break;
    }
    if (code == 530 || code == 535)
        fail(Kind::Authentication,
            QStringLiteral("the server requires a valid user name and password (%1)").arg(reply));
    if (conversation.command == "RCPT" && code >= 400)
        fail(Kind::RecipientRefused,
            QStringLiteral("the server refused the recipient %1 (%2); the mail was not sent to "
                           "anyone")
                .arg(conversation.recipient, reply));
    if (conversation.command == "MAIL" && code >= 400)
        fail(Kind::SenderRefused,
            QStringLiteral("the server refused the sender <%1> (%2); the mail was not sent")
                .arg(sender.address(), reply));
    if (conversation.command == "DATA" && code >= 400)
        fail(Kind::Delivery, QStringLiteral("the server refused the message (%1)").arg(reply));
    fail(Kind::Delivery, reply.isEmpty() ? detail : QStringLiteral("%1 (%2)").arg(detail, reply));
}

} // namespace reportrt::mail
