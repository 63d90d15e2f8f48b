#include "core/comerror.h"
#include "layoutfixture.h"
#include "mailfixture.h"
#include "platform/tempfolder.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/exportoptions.h"

#include <QDir>
#include <QFile>
#include <QJsonArray>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::mail::test {
namespace {

using namespace reportrt::layouttest;

// Sets an environment variable for the lifetime of the object.
class ScopedVariable {
public:
    ScopedVariable(const char* name, const QString& value)
        : m_name(name)
        , m_old(qgetenv(name))
        , m_had(qEnvironmentVariableIsSet(name))
    {
        qputenv(name, value.toUtf8());
    }
    ~ScopedVariable()
    {
        if (m_had)
            qputenv(m_name, m_old);
        else
            qunsetenv(m_name);
    }

private:
    const char* m_name;
    QByteArray m_old;
    bool m_had;
};

class MailExport : public testing::Test {
protected:
    void SetUp() override
    {
        m_report = openReport(
            writeReport(m_dir,
                itemsReport({ section(u"D"_s, 300, { fieldObject(u"{Items.Name}"_s, 0, 0) }) }),
                u"Sales ülevaade.rpt"_s),
            itemsDatabase(m_dir, 7));
        const auto options = m_report->exportOptions();
        options->reset();
        options->setFormatType(31);
        options->setMailToList(u"anna@example.com"_s);
        options->setMailSubject(u"Items"_s);
        options->setMailMessage(u"See attachment."_s);
        options->setMailBccList(u"boss@example.com"_s);
        options->setDestinationType(2);
        m_scratchBefore = scratchFiles();
    }

    // The mail attachments waiting in the private temporary folder.
    static QStringList scratchFiles()
    {
        return QDir(platform::TempFolder::systemPath())
            .entryList({ u"mail-*"_s }, QDir::Files | QDir::Hidden);
    }

    QTemporaryDir m_dir;
    std::shared_ptr<Report> m_report;
    QStringList m_scratchBefore;
};

TEST_F(MailExport, MailsTheReportAsPdf)
{
    SmtpServer server;
    const ScopedVariable url("LUDMOX_SMTP_URL", server.url());
    const ScopedVariable from("LUDMOX_SMTP_FROM", u"reports@example.com"_s);
    m_report->exportReport(false);

    EXPECT_EQ(m_report->printingStatus().progress, 3);
    EXPECT_EQ(scratchFiles(), m_scratchBefore);
    const QStringList messages = server.messages();
    ASSERT_EQ(messages.size(), 1);
    EXPECT_EQ(server.envelope(messages.first())[u"rcpt_tos"_s].toArray(),
        QJsonArray({ u"anna@example.com"_s, u"boss@example.com"_s }));
    const QJsonObject parsed = parseMessage(messages.first());
    EXPECT_EQ(parsed[u"subject"_s].toString(), u"Items"_s);
    EXPECT_EQ(parsed[u"body"_s].toString(), u"See attachment."_s);
    const QJsonObject attachment = parsed[u"attachments"_s].toArray().first().toObject();
    EXPECT_EQ(attachment[u"filename"_s].toString(), u"Sales ülevaade.pdf"_s);
    EXPECT_EQ(attachment[u"content_type"_s].toString(), u"application/pdf"_s);

    // The attachment is the report as a disk export writes it.
    QFile mailed(m_dir.filePath(u"mailed.pdf"_s));
    ASSERT_TRUE(mailed.open(QIODevice::WriteOnly));
    mailed.write(QByteArray::fromBase64(attachment[u"data"_s].toString().toLatin1()));
    mailed.close();
    const auto options = m_report->exportOptions();
    options->setDestinationType(1);
    options->setDiskFileName(m_dir.filePath(u"disk.pdf"_s));
    m_report->exportReport(false);
    EXPECT_EQ(pdfPageCount(mailed.fileName()), pdfPageCount(options->diskFileName()));
    EXPECT_EQ(pdfText(mailed.fileName()), pdfText(options->diskFileName()));
    EXPECT_TRUE(qpdfCheck(mailed.fileName()));
}

TEST_F(MailExport, WithoutServerGoesToTheOutbox)
{
    const ScopedVariable url("LUDMOX_SMTP_URL", QString());
    const ScopedVariable outbox("LUDMOX_OUTBOX", m_dir.filePath(u"outbox"_s));
    // The test-mode settings store has no Mail section.
    m_report->exportReport(false);
    const QStringList files = entries(m_dir.filePath(u"outbox"_s));
    ASSERT_EQ(files.size(), 1);
    const QJsonObject parsed = parseMessage(m_dir.filePath(u"outbox/"_s + files.first()));
    EXPECT_EQ(parsed[u"defects"_s].toArray(), QJsonArray());
    EXPECT_EQ(parsed[u"attachments"_s].toArray().size(), 1);
    EXPECT_EQ(scratchFiles(), m_scratchBefore);
}

struct ExportFailureCase {
    const char* name;
    QString to;
    const char* cause;
};

class MailExportFailures : public MailExport,
                           public testing::WithParamInterface<ExportFailureCase> { };

TEST_P(MailExportFailures, RaiseMailFailedAndLeaveNoFile)
{
    const ExportFailureCase& c = GetParam();
    SmtpServer server({ u"refused"_s, {}, {} });
    const ScopedVariable url("LUDMOX_SMTP_URL", server.url());
    m_report->exportOptions()->setMailToList(c.to);
    m_report->exportOptions()->setMailBccList(QString());
    try {
        m_report->exportReport(false);
        FAIL() << "mailed";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::MailFailed);
        EXPECT_EQ(error.source(), errorSource());
        EXPECT_TRUE(error.description().contains(QString::fromUtf8(c.cause)))
            << error.description().toStdString();
    }
    EXPECT_TRUE(server.messages().isEmpty());
    EXPECT_EQ(scratchFiles(), m_scratchBefore);
}

INSTANTIATE_TEST_SUITE_P(Mail, MailExportFailures,
    testing::Values(ExportFailureCase { "RefusedRecipient", u"refused@example.com"_s,
                        "refused the recipient <refused@example.com>" },
        ExportFailureCase { "InvalidAddress", u"anna(at)example.com"_s, "is not a mail address" },
        ExportFailureCase { "NoRecipient", u";"_s, "no recipient" }),
    [](const testing::TestParamInfo<ExportFailureCase>& param) { return param.param.name; });

} // namespace
} // namespace reportrt::mail::test
