#pragma once

#include "reportfixture.h"

#include <QDateTime>
#include <QDir>
#include <QFile>
#include <QRegularExpression>
#include <QTemporaryDir>

namespace reporttest {

/// A report whose exports and mails write placeholder files: the engine's temporary folder
/// and the caller's target folder are folders of the test.
class ExportTest : public ReportTest {
protected:
    void SetUp() override
    {
        ReportTest::SetUp();
        ASSERT_TRUE(m_temp.isValid() && m_out.isValid());
        moxEngine->SetProperties(u"LUDTempPath"_s, m_temp.path());
        file = addOrdersReport();
        file->state.writeOutputFiles = true;
        completed(5);
        report = open();
    }

    /// The printing status the runtime reports after a read of `records` records.
    void completed(int32_t records)
    {
        file->state.printingStatus.progress = 3;
        file->state.printingStatus.recordsRead = records;
        file->state.printingStatus.recordsPrinted = records;
    }

    /// The engine's temporary folder, with its trailing separator.
    QString tempFolder() const { return m_temp.path() + u'/'; }
    QString target(const QString& name) const { return m_out.filePath(name); }
    /// Every entry of a folder, hidden ones included.
    static QStringList entries(const QString& folder)
    {
        return QDir(folder).entryList(
            QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot, QDir::Name);
    }
    QStringList tempEntries() const { return entries(m_temp.path()); }
    QStringList outEntries() const { return entries(m_out.path()); }

    static QByteArray contents(const QString& path)
    {
        QFile f(path);
        return f.open(QIODevice::ReadOnly) ? f.readAll() : QByteArray();
    }
    static void write(const QString& path, const QByteArray& data)
    {
        QFile f(path);
        ASSERT_TRUE(f.open(QIODevice::WriteOnly | QIODevice::Truncate));
        f.write(data);
    }

    // The members take every argument by reference, as the type library declares them.
    bool saveAsPdf(
        QString fileName, bool firstSave = false, bool tempFileOnly = false, bool forceSave = false)
    {
        return report->SaveAsPDF(fileName, firstSave, tempFileOnly, forceSave);
    }
    bool saveAsXls(QString fileName, bool tempFileOnly = false, bool forceSave = false)
    {
        return report->SaveAsXLS(fileName, tempFileOnly, forceSave);
    }
    bool saveAsHtml(QString fileName, bool tempFileOnly = false, bool forceSave = false,
        bool separatePages = true, bool navigator = true)
    {
        return report->SaveAsHTML(fileName, tempFileOnly, forceSave, separatePages, navigator);
    }

    struct Mail {
        QString address = u"ann@example.com"_s;
        QString subject = u"Orders"_s;
        QString message = u"See the attachment."_s;
        int32_t attachmentType = 31;
        bool showDialog = false;
        bool firstMail = false;
        QString cc;
        QString bcc;
        QString attachment;
    };
    bool sendReport(Mail mail)
    {
        return report->SendReport(mail.address, mail.subject, mail.message, mail.attachmentType,
            mail.showDialog, mail.firstMail, mail.cc, mail.bcc, mail.attachment);
    }

    /// Whether `path` is a scratch name `base` + a DDYYMMHHNNSS stamp of a time between
    /// `from` and now + `extension`.
    static bool isScratchName(const QString& path, const QString& folder, const QString& base,
        const QString& extension, const QDateTime& from)
    {
        const QRegularExpression pattern(
            QRegularExpression::anchoredPattern(QRegularExpression::escape(folder + base)
                + u"(\\d{12})"_s + QRegularExpression::escape(extension)));
        const auto match = pattern.match(path);
        if (!match.hasMatch())
            return false;
        // Day, year, month: the order the component has always used.
        const QString stamp = match.captured(1);
        const QDateTime to = QDateTime::currentDateTime();
        for (QDateTime t = from.addSecs(-1); t <= to.addSecs(1); t = t.addSecs(1)) {
            if (t.toString(u"ddyyMMHHmmss"_s) == stamp)
                return true;
        }
        return false;
    }

    std::shared_ptr<fakeruntime::FakeReport> file;
    std::shared_ptr<reports::MoxReport115> report;

private:
    QTemporaryDir m_temp;
    QTemporaryDir m_out;
};

} // namespace reporttest
