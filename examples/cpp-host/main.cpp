// A host program: an engine logged on to the sample database, the invoice report for a
// range of orders (its parameters, all given: a host without a display cannot be asked)
// narrowed by a record selection, exported to PDF.
//
//   cpp-host DATABASE REPORTS_FOLDER OUTPUT.pdf

#include <QApplication>
#include <QDir>
#include <QFileInfo>
#include <cstdio>
#include <ludmox/ludmox.h>

int main(int argc, char* argv[])
{
    if (argc != 4) {
        std::fputs("usage: cpp-host DATABASE REPORTS_FOLDER OUTPUT.pdf\n", stderr);
        return 2;
    }
    QApplication application(argc, argv);
    std::printf("LUD Mox %s\n", LUDMOX_VERSION_STRING);
    reportrt::registerRuntime();

    const QString database = QFileInfo(QString::fromLocal8Bit(argv[1])).absoluteFilePath();
    const QString report
        = QDir(QString::fromLocal8Bit(argv[2])).filePath(QStringLiteral("invoice.rpt"));
    QString output = QFileInfo(QString::fromLocal8Bit(argv[3])).absoluteFilePath();
    try {
        const auto moxEngine = std::make_shared<engine::MoxEngine115>();
        moxEngine->Init(3, false, 0, 0);
        // A SQLite file logs on the way a Jet database did: the file is the server.
        moxEngine->SetLogonInfo(
            engine::ecstMSJET, database, QString(), QStringLiteral("admin"), QString());
        // The collection owns its reports: keep it as long as they are used.
        const auto reports = moxEngine->GetReports();
        const auto reportObject = reports->Item(report);

        auto parameters = std::make_shared<core::Dictionary>(core::Dictionary::TextCompare);
        parameters->setItem(core::Variant(QStringLiteral("FromOrder")), core::Variant(100));
        parameters->setItem(core::Variant(QStringLiteral("ToOrder")), core::Variant(110));
        parameters->setItem(core::Variant(QStringLiteral("InvoiceDate")),
            core::Variant(QStringLiteral("2026-12-31")));
        parameters->setItem(core::Variant(QStringLiteral("DueDays")), core::Variant(30));
        parameters->setItem(core::Variant(QStringLiteral("Note")),
            core::Variant(QStringLiteral("Built against the installed LUD Mox.")));
        if (!reportObject->SetParams(parameters)) {
            std::fputs("cpp-host: the parameters do not fit the report\n", stderr);
            return 1;
        }
        if (!reportObject->SetSelection(
                QString(), core::Variant(QStringLiteral("{Orders.OrderID} <= 105")))) {
            std::fputs("cpp-host: the selection cannot be applied\n", stderr);
            return 1;
        }
        bool firstSave = false;
        bool tempFileOnly = false;
        bool forceSave = true;
        if (!reportObject->SaveAsPDF(output, firstSave, tempFileOnly, forceSave)) {
            std::fputs("cpp-host: the report has no records\n", stderr);
            return 1;
        }
        std::printf("wrote %s\n", qPrintable(output));
        reportObject->CloseReport();
        reports->Destroy();
    } catch (const core::ComError& error) {
        std::fprintf(stderr, "cpp-host: error %d from %s: %s\n", error.number(),
            qPrintable(error.source()), qPrintable(error.description()));
        return 1;
    }
    return 0;
}
