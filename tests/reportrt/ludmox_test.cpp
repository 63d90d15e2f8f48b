#include "layouttest.h"

#include <QDir>
#include <QProcess>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

struct Outcome {
    int exitCode = -1;
    QString output;
    QString errors;
};

Outcome ludmox(const QStringList& arguments)
{
    QProcess process;
    process.start(qEnvironmentVariable("LUDMOX_CLI"), arguments);
    process.waitForFinished(300000);
    return { process.exitStatus() == QProcess::NormalExit ? process.exitCode() : -1,
        QString::fromUtf8(process.readAllStandardOutput()),
        QString::fromUtf8(process.readAllStandardError()) };
}

TEST(Ludmox, ExportsEverySampleReport)
{
    QTemporaryDir out;
    const Outcome result = ludmox({ u"export"_s, u"--database"_s, sampleDatabase(), u"--output"_s,
        out.path(), u"--reports"_s, examplesFolder() + u"/reports"_s });
    ASSERT_EQ(result.exitCode, 0) << result.errors.toStdString();
    const QStringList pdfs = QDir(out.path()).entryList({ u"*.pdf"_s }, QDir::Files, QDir::Name);
    EXPECT_EQ(pdfs,
        (QStringList { u"customer-orders.pdf"_s, u"invoice.pdf"_s, u"orders-by-customer.pdf"_s,
            u"sales-by-country.pdf"_s }));
    for (const QString& pdf : pdfs) {
        EXPECT_TRUE(qpdfCheck(QDir(out.path()).filePath(pdf))) << pdf.toStdString();
        EXPECT_TRUE(result.output.contains(pdf)) << result.output.toStdString();
    }
}

TEST(Ludmox, TakesParametersAndReportsBadInput)
{
    QTemporaryDir out;
    const QString invoice = examplesFolder() + u"/reports/invoice.rpt"_s;
    const Outcome ok = ludmox({ u"export"_s, u"--database"_s, sampleDatabase(), u"--output"_s,
        out.path(), u"--param"_s, u"FromOrder=20"_s, u"--param"_s, u"ToOrder=21"_s, invoice });
    ASSERT_EQ(ok.exitCode, 0) << ok.errors.toStdString();
    EXPECT_EQ(pdfPageCount(QDir(out.path()).filePath(u"invoice.pdf"_s)), 2);

    struct Case {
        QStringList arguments;
        int exitCode;
        QString message;
    };
    const Case cases[] = {
        { { u"frobnicate"_s }, 2, u"unknown command"_s },
        { { u"export"_s, u"--database"_s, out.filePath(u"none.db"_s), u"--output"_s, out.path() },
            2, u"does not exist"_s },
        { { u"export"_s, u"--database"_s, sampleDatabase(), u"--output"_s, out.path(), u"--param"_s,
              u"Nope=1"_s, invoice },
            1, u"no parameter Nope"_s },
        { { u"export"_s, u"--database"_s, sampleDatabase(), u"--output"_s, out.path(),
              out.filePath(u"missing.rpt"_s) },
            1, u"does not exist"_s },
    };
    for (const Case& c : cases) {
        const Outcome result = ludmox(c.arguments);
        EXPECT_EQ(result.exitCode, c.exitCode) << c.arguments.join(u' ').toStdString();
        EXPECT_TRUE(result.errors.contains(c.message)) << result.errors.toStdString();
    }
}

} // namespace
} // namespace reportrt::layouttest
