#include "core/comerror.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/document/documentreader.h"
#include "reportrt/report.h"
#include "reportrtfixture.h"
#include "runtime/parameterfield.h"
#include "runtime/reportobject.h"
#include "runtime/section.h"
#include "support/fulldisk.h"

#include <QDir>
#include <QFile>
#include <QJsonDocument>
#include <gtest/gtest.h>

using namespace reportrt;
using namespace reportrt::test;
using namespace Qt::StringLiterals;

namespace {

core::ComError openError(const QByteArray& text)
{
    try {
        DocumentReader::parse(text, QStringLiteral("bad.rpt"));
    } catch (const core::ComError& error) {
        return error;
    }
    ADD_FAILURE() << "no error for " << text.left(200).toStdString();
    return core::ComError(0, QString(), QString());
}

QByteArray withReport(const std::function<void(QJsonObject&)>& change)
{
    QJsonObject document = shopReport();
    change(document);
    return QJsonDocument(document).toJson();
}

struct BadDocument {
    const char* name;
    QByteArray text;
    const char16_t* position; // "line L, column C"
    const char16_t* message;
};

class BadDocuments : public testing::TestWithParam<BadDocument> { };

TEST_P(BadDocuments, NameTheFileThePositionAndTheProblem)
{
    const auto& c = GetParam();
    const core::ComError error = openError(c.text);
    EXPECT_EQ(error.number(), Error::InvalidDocument);
    EXPECT_TRUE(error.description().startsWith(u"bad.rpt: ")) << error.description().toStdString();
    EXPECT_TRUE(error.description().contains(QString::fromUtf16(c.position)))
        << error.description().toStdString();
    EXPECT_TRUE(error.description().contains(QString::fromUtf16(c.message)))
        << error.description().toStdString();
}

QJsonObject linkedReport()
{
    QJsonObject document = shopReport();
    QJsonArray tables = document[u"tables"].toArray();
    tables.append(
        QJsonObject { { u"name"_s, u"Customers"_s }, { u"fields"_s, customersFields() } });
    tables.append(QJsonObject { { u"name"_s, u"Regions"_s },
        { u"fields"_s,
            QJsonArray {
                QJsonObject { { u"name"_s, u"CustomerID"_s }, { u"type"_s, u"number"_s } } } } });
    document[u"tables"] = tables;
    return document;
}

QJsonObject link(
    const QString& from, const QString& fromField, const QString& to, const QString& toField)
{
    return QJsonObject { { u"from"_s, from }, { u"fromFields"_s, QJsonArray { fromField } },
        { u"to"_s, to }, { u"toFields"_s, QJsonArray { toField } } };
}

INSTANTIATE_TEST_SUITE_P(Documents, BadDocuments,
    testing::Values(
        BadDocument { "SyntaxError",
            "{\n  \"format\": \"ludmox-report\",\n  \"version\": 1,\n  \"tables\": [ }\n}",
            u"line 4, column 15", u"unexpected character" },
        BadDocument { "TruncatedFile", "{\"format\": \"ludmox-report\", \"tables\": [",
            u"line 1, column 40", u"unexpected end" },
        BadDocument { "NotUtf8",
            "{\"format\": \"ludmox-report\",\n \"summary\": {\"title\": \"ab\xff\"}}",
            u"line 2, column 26", u"not valid UTF-8" },
        BadDocument { "NotAReport", "{\"format\": \"something-else\", \"version\": 1}",
            u"line 1, column 12", u"not a LUD Mox report" },
        BadDocument { "NewerVersion", "{\"format\": \"ludmox-report\", \"version\": 7}",
            u"line 1, column 40", u"version 7" },
        BadDocument { "DuplicateKey",
            "{\"format\": \"ludmox-report\", \"version\": 1, \"version\": 1}", u"line 1, column 43",
            u"duplicate key" },
        BadDocument { "UnknownKey", withReport([](QJsonObject& d) { d[u"colour"] = 1; }), u"line ",
            u"unknown key \"colour\"" },
        BadDocument { "WrongType", withReport([](QJsonObject& d) { d[u"tables"] = u"Orders"_s; }),
            u"line ", u"\"tables\" must be an array, not a string" },
        BadDocument { "UnknownFieldType", withReport([](QJsonObject& d) {
                         QJsonArray tables = d[u"tables"].toArray();
                         QJsonObject table = tables[0].toObject();
                         table[u"fields"] = QJsonArray { QJsonObject {
                             { u"name"_s, u"ID"_s }, { u"type"_s, u"integer"_s } } };
                         tables[0] = table;
                         d[u"tables"] = tables;
                     }),
            u"line ", u"\"type\" must be one of" },
        BadDocument { "UnknownFieldInObject", withReport([](QJsonObject& d) {
                         d[u"sections"] = QJsonArray { QJsonObject { { u"name"_s, u"D"_s },
                             { u"objects"_s,
                                 QJsonArray { QJsonObject { { u"kind"_s, u"field"_s },
                                     { u"field"_s, u"{Orders.Nope}"_s } } } } } };
                     }),
            u"line ", u"unknown field {Orders.Nope}" },
        BadDocument { "UnknownFieldInSelection", withReport([](QJsonObject& d) {
                         d[u"selectionFormula"] = u"{Orders.ID} > 1 And\r\n{Orders.Nope} = 2"_s;
                     }),
            u"line 2, column 1: unknown field {Orders.Nope}", u"Record Selection" },
        BadDocument { "SelectionNotBoolean",
            withReport([](QJsonObject& d) { d[u"selectionFormula"] = u"{Orders.ID} + 1"_s; }),
            u"line ", u"not a Boolean" },
        BadDocument { "FormulaSyntax", withReport([](QJsonObject& d) {
                         d[u"formulas"] = QJsonArray { QJsonObject {
                             { u"name"_s, u"Total"_s }, { u"text"_s, u"{Orders.Amount} * "_s } } };
                     }),
            u"@Total at line 1, column 19", u"ends where a value is expected" },
        BadDocument { "CyclicFormulas", withReport([](QJsonObject& d) {
                         d[u"formulas"] = QJsonArray { QJsonObject { { u"name"_s, u"A"_s },
                                                           { u"text"_s, u"{@B} + 1"_s } },
                             QJsonObject { { u"name"_s, u"B"_s }, { u"text"_s, u"{@A}"_s } } };
                     }),
            u"line ", u"refers to itself" },
        BadDocument { "CyclicLinks",
            [] {
                QJsonObject d = linkedReport();
                d[u"links"]
                    = QJsonArray { link(u"Orders"_s, u"CustomerID"_s, u"Customers"_s, u"ID"_s),
                          link(u"Customers"_s, u"ID"_s, u"Regions"_s, u"CustomerID"_s),
                          link(u"Regions"_s, u"CustomerID"_s, u"Orders"_s, u"CustomerID"_s) };
                return QJsonDocument(d).toJson();
            }(),
            u"line ", u"the links are cyclic" },
        BadDocument { "LinkToUnknownTable",
            [] {
                QJsonObject d = linkedReport();
                d[u"links"]
                    = QJsonArray { link(u"Orders"_s, u"CustomerID"_s, u"Suppliers"_s, u"ID"_s) };
                return QJsonDocument(d).toJson();
            }(),
            u"line ", u"unknown table \"Suppliers\"" },
        BadDocument { "LinkOfDifferentTypes",
            [] {
                QJsonObject d = linkedReport();
                d[u"links"]
                    = QJsonArray { link(u"Orders"_s, u"Customer"_s, u"Customers"_s, u"ID"_s) };
                return QJsonDocument(d).toJson();
            }(),
            u"line ", u"compares Orders.Customer (string) with Customers.ID (number)" },
        BadDocument { "AbsurdSize", withReport([](QJsonObject& d) {
                         d[u"sections"] = QJsonArray { QJsonObject { { u"name"_s, u"D"_s },
                             { u"objects"_s,
                                 QJsonArray { QJsonObject { { u"kind"_s, u"text"_s },
                                     { u"width"_s, 2147483647.0 } } } } } };
                     }),
            u"line ", u"\"width\" is 2.14748e+09; it must be from 0 to 1000000" },
        BadDocument { "NegativeHeight", withReport([](QJsonObject& d) {
                         d[u"sections"] = QJsonArray { QJsonObject {
                             { u"name"_s, u"D"_s }, { u"height"_s, -1 } } };
                     }),
            u"line ", u"\"height\" is -1" },
        BadDocument { "HugeNumber", "{\"format\": \"ludmox-report\", \"version\": 1e999}",
            u"line 1, column 40", u"number out of range" },
        BadDocument { "DeepNesting", QByteArray(100000, '['), u"line 1, column 66",
            u"nested deeper than 64" },
        BadDocument { "GroupSectionWithoutGroup", withReport([](QJsonObject& d) {
                         d[u"sections"] = QJsonArray { QJsonObject { { u"name"_s, u"GH2"_s } } };
                     }),
            u"line ", u"group the report does not have" },
        BadDocument { "SumOfText", withReport([](QJsonObject& d) {
                         d[u"sections"] = QJsonArray { QJsonObject { { u"name"_s, u"RF"_s },
                             { u"objects"_s,
                                 QJsonArray { QJsonObject { { u"kind"_s, u"summary"_s },
                                     { u"operation"_s, u"sum"_s },
                                     { u"field"_s, u"{Orders.Customer}"_s } } } } } };
                     }),
            u"line ", u"this summary needs numbers" },
        BadDocument { "ParameterValueOfWrongType", withReport([](QJsonObject& d) {
                         d[u"parameters"] = QJsonArray { QJsonObject { { u"name"_s, u"From"_s },
                             { u"valueType"_s, 10 },
                             { u"currentValues"_s, QJsonArray { u"06.12.2026"_s } } } };
                     }),
            u"line ", u"expected a date \"yyyy-mm-dd\"" },
        BadDocument { "CommandWithoutStatement", withReport([](QJsonObject& d) {
                         d[u"tables"] = QJsonArray { QJsonObject {
                             { u"name"_s, u"Cmd"_s }, { u"location"_s, u"Command"_s } } };
                     }),
            u"line ", u"has no \"command\" statement" },
        BadDocument { "NestedSubreport", withReport([](QJsonObject& d) {
                         const QJsonObject inner { { u"kind"_s, u"subreport"_s },
                             { u"name"_s, u"Inner"_s }, { u"subreport"_s, QJsonObject {} } };
                         const QJsonObject sub { { u"sections"_s,
                             QJsonArray { QJsonObject { { u"name"_s, u"D"_s },
                                 { u"objects"_s, QJsonArray { inner } } } } } };
                         d[u"sections"] = QJsonArray { QJsonObject { { u"name"_s, u"RH"_s },
                             { u"objects"_s,
                                 QJsonArray { QJsonObject { { u"kind"_s, u"subreport"_s },
                                     { u"name"_s, u"Outer"_s }, { u"subreport"_s, sub } } } } } };
                     }),
            u"line ", u"cannot hold another subreport" }),
    [](const testing::TestParamInfo<BadDocument>& param) { return param.param.name; });

TEST(OpeningFiles, MissingAndOversizedFilesRaiseTheOpenError)
{
    QTemporaryDir dir;
    try {
        Report::open(dir.filePath(QStringLiteral("missing.rpt")));
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::OpenReportFailed);
        EXPECT_TRUE(error.description().contains(u"missing.rpt: the file does not exist"));
    }
    QFile big(dir.filePath(QStringLiteral("big.rpt")));
    ASSERT_TRUE(big.open(QIODevice::WriteOnly));
    ASSERT_TRUE(big.resize(DocumentReader::maxFileSize + 1));
    big.close();
    try {
        Report::open(big.fileName());
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::OpenReportFailed);
    }
}

TEST(OpeningFiles, ModelCarriesEveryPart)
{
    QJsonObject d = linkedReport();
    d[u"page"] = QJsonObject { { u"paperSize"_s, 1 }, { u"orientation"_s, 2 }, { u"duplex"_s, 2 } };
    d[u"printer"] = QJsonObject { { u"driver"_s, u"winspool"_s }, { u"device"_s, u"Office"_s },
        { u"port"_s, u"LPT1:"_s } };
    d[u"parameters"]
        = QJsonArray { QJsonObject { { u"name"_s, u"Region"_s }, { u"prompt"_s, u"LUD#Region"_s },
            { u"valueType"_s, 12 }, { u"allowsMultipleValues"_s, true },
            { u"defaultValues"_s,
                QJsonArray { QJsonObject {
                    { u"value"_s, u"North"_s }, { u"description"_s, u"The north"_s } } } },
            { u"defaultValue"_s, u"North"_s } } };
    d[u"selectionFormula"] = u"{Orders.Region} = {?Region}"_s;
    QTemporaryDir dir;
    const auto report = Report::open(writeReport(dir, d));
    EXPECT_EQ(report->paperSize(), 1);
    EXPECT_EQ(report->paperOrientation(), 2);
    EXPECT_EQ(report->printerDuplex(), 2);
    EXPECT_EQ(report->printerDeviceName(), u"Office");
    EXPECT_EQ(report->summaryComments(), u"UseReportPrinter");
    ASSERT_EQ(report->databaseTables().size(), 3u);
    EXPECT_EQ(report->databaseTables()[0]->driverName(), u"crdb_ado.dll");
    EXPECT_EQ(report->databaseTables()[0]->location(), u"shop.dbo.Orders");
    ASSERT_EQ(report->parameterFields().size(), 1u);
    const auto parameter = report->parameterFields()[0];
    EXPECT_EQ(parameter->formulaName(), u"{?Region}");
    EXPECT_TRUE(parameter->needsCurrentValue());
    EXPECT_EQ(parameter->defaultValueCount(), 1);
    EXPECT_EQ(parameter->defaultValueDescription(1), u"The north");
    ASSERT_EQ(report->sections().size(), 1u);
    const auto object = report->sections()[0]->reportObjects()[0];
    EXPECT_EQ(object->typeName(), u"IFieldObject");
    EXPECT_EQ(object->fieldName(), u"{Orders.ID}");
    EXPECT_EQ(object->section(), report->sections()[0]);
}

TEST(SavingFiles, RoundTripKeepsTheDocumentAndDropsPasswords)
{
    QTemporaryDir dir;
    const QString db = createShopDatabase(dir.filePath(QStringLiteral("shop.db")));
    QJsonObject d = shopReport();
    d[u"selectionFormula"] = u"{Orders.Amount} >= 100"_s;
    const auto report = Report::open(writeReport(dir, d));
    relocate(*report, db);
    report->databaseTables()[0]->addConnectionProperty(
        QStringLiteral("Password"), core::Variant(QStringLiteral("s3cret")));
    report->sections()[0]->reportObjects()[0]->setLeft(720);
    report->readRecords();
    ASSERT_TRUE(report->hasSavedData());

    const QString withData = dir.filePath(QStringLiteral("with.rpt"));
    const QString withoutData = dir.filePath(QStringLiteral("without.rpt"));
    report->saveAs(withData, 2048);
    report->saveAs(withoutData, 0);
    QFile file(withData);
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    EXPECT_FALSE(file.readAll().contains("s3cret"));

    const auto reopened = Report::open(withData);
    EXPECT_TRUE(reopened->hasSavedData());
    EXPECT_EQ(reopened->databaseTables()[0]->location(), u"Orders");
    EXPECT_EQ(reopened->sections()[0]->reportObjects()[0]->left(), 720);
    EXPECT_EQ(reopened->recordSelectionFormula(), u"{Orders.Amount} >= 100");
    EXPECT_FALSE(Report::open(withoutData)->hasSavedData());

    // The saved records serve a read with unchanged inputs, even without the database.
    QFile::remove(db);
    reopened->databaseTables()[0]->addConnectionProperty(
        QStringLiteral("Password"), core::Variant(QStringLiteral("s3cret")));
    reopened->readRecords();
    EXPECT_EQ(selectedIds(*reopened), (std::vector<int> { 1, 2, 3, 6, 7 }));
    EXPECT_EQ(reopened->printingStatus().recordsRead, 5); // the database gave only these
}

TEST(SavingFiles, UnknownFormatAndUnwritablePathLeaveNothingBehind)
{
    QTemporaryDir dir;
    const auto report = Report::open(writeReport(dir, shopReport()));
    try {
        report->saveAs(dir.filePath(QStringLiteral("x.rpt")), 7);
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::RuntimeFailure);
    }
    EXPECT_FALSE(QFile::exists(dir.filePath(QStringLiteral("x.rpt"))));
    try {
        report->saveAs(dir.filePath(QStringLiteral("no/such/folder/x.rpt")), 2048);
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::SaveFailed);
    }
}

struct FullDiskCase {
    const char* name;
    testsupport::FullDisk::Kind kind;
    qsizetype commentLength; // makes the document larger than the writer's buffer or not
    const char16_t* cause; // what the error names, in the C library's words
};

class SavingToAFullDisk : public testing::TestWithParam<FullDiskCase> { };

TEST_P(SavingToAFullDisk, FailsAndLeavesTheOldFileAndNoTemporaryFile)
{
    QTemporaryDir source;
    QTemporaryDir target;
    testsupport::FullDisk disk(GetParam().kind, target.path());
    if (!disk.isReady())
        GTEST_SKIP() << "this process may not mount a file system";
    const QString path = target.filePath(QStringLiteral("orders.rpt"));
    QJsonObject old = shopReport();
    old[u"selectionFormula"] = u"{Orders.ID} = 1"_s;
    const QByteArray oldBytes = QJsonDocument(old).toJson();
    {
        QFile file(path);
        ASSERT_TRUE(file.open(QIODevice::WriteOnly));
        ASSERT_EQ(file.write(oldBytes), oldBytes.size());
    }
    QJsonObject changed = shopReport();
    changed[u"summary"]
        = QJsonObject { { u"comments"_s, QString(GetParam().commentLength, u'c') } };
    const auto report = Report::open(writeReport(source, changed));
    const QStringList before = QDir(target.path()).entryList(QDir::Files | QDir::Hidden);

    disk.fill();
    try {
        report->saveAs(path, 2048);
        ADD_FAILURE() << "the save reported success";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::SaveFailed);
        EXPECT_TRUE(error.description().contains(path)) << error.description().toStdString();
        EXPECT_TRUE(error.description().contains(QStringView(GetParam().cause)))
            << error.description().toStdString();
    }

    QFile file(path);
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    EXPECT_EQ(file.readAll(), oldBytes);
    QStringList after = QDir(target.path()).entryList(QDir::Files | QDir::Hidden);
    after.removeAll(QStringLiteral("filler"));
    EXPECT_EQ(after, QStringList { QStringLiteral("orders.rpt") }) << "a temporary file is left";
    EXPECT_EQ(before, QStringList { QStringLiteral("orders.rpt") });
}

INSTANTIATE_TEST_SUITE_P(SavingFiles, SavingToAFullDisk,
    testing::Values(
        FullDiskCase { "TmpfsSmallDocument", testsupport::FullDisk::Kind::Tmpfs, 10, u"No space" },
        FullDiskCase {
            "TmpfsLargeDocument", testsupport::FullDisk::Kind::Tmpfs, 200000, u"No space" },
        FullDiskCase {
            "SizeLimitSmallDocument", testsupport::FullDisk::Kind::SizeLimit, 10, u"too large" },
        FullDiskCase { "SizeLimitLargeDocument", testsupport::FullDisk::Kind::SizeLimit, 200000,
            u"too large" }),
    [](const testing::TestParamInfo<FullDiskCase>& param) {
        return std::string(param.param.name);
    });

TEST(Parameters, CurrentValuesConvertReplaceOrJoinAndRespectTheList)
{
    QJsonObject d = shopReport();
    d[u"parameters"] = QJsonArray {
        QJsonObject { { u"name"_s, u"Count"_s }, { u"valueType"_s, 5 } },
        QJsonObject { { u"name"_s, u"Regions"_s }, { u"valueType"_s, 12 },
            { u"allowsMultipleValues"_s, true } },
        QJsonObject { { u"name"_s, u"Pick"_s }, { u"valueType"_s, 12 },
            { u"onlyListedValues"_s, true },
            { u"defaultValues"_s, QJsonArray { QJsonObject { { u"value"_s, u"a"_s } } } } },
        QJsonObject { { u"name"_s, u"Proc"_s }, { u"valueType"_s, 7 }, { u"kind"_s, 2 } },
    };
    QTemporaryDir dir;
    const auto report = Report::open(writeReport(dir, d));
    const auto parameters = report->parameterFields();
    const auto& count = parameters[0];
    count->addCurrentValue(core::Variant(QStringLiteral("42")));
    count->addCurrentValue(core::Variant(7.0));
    EXPECT_EQ(count->currentValueCount(), 1);
    EXPECT_EQ(count->currentValue(1).type(), core::VariantType::Long);
    EXPECT_EQ(count->currentValue(1).toLong(), 7);
    EXPECT_THROW(count->addCurrentValue(core::Variant(QStringLiteral("letters"))), core::ComError);
    EXPECT_THROW(count->currentValue(2), core::ComError);
    EXPECT_FALSE(count->needsCurrentValue()); // it has a value

    const auto& regions = parameters[1];
    for (const char16_t* v : { u"North", u"South", u"North" })
        regions->addCurrentValue(core::Variant(QString::fromUtf16(v)));
    EXPECT_EQ(regions->currentValueCount(), 2); // applying the same values again adds none

    try {
        parameters[2]->addCurrentValue(core::Variant(QStringLiteral("b")));
        FAIL();
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::RuntimeFailure);
    }
    EXPECT_FALSE(parameters[1]->needsCurrentValue());
    EXPECT_FALSE(parameters[0]->needsCurrentValue());
    EXPECT_TRUE(parameters[3]->needsCurrentValue()); // a stored-procedure parameter
}

} // namespace

namespace {

TEST(OpeningFiles, FuzzCorpusSampleUsesEveryPartOfTheFormat)
{
    // The fuzzers start from this file, so it must be valid for them to reach deep code.
    const QString path = qEnvironmentVariable("LUDMOX_TEST_DATA") + u"/fuzz/document/full.rpt";
    const auto report = Report::open(path);
    EXPECT_TRUE(report->hasSavedData());
    EXPECT_EQ(report->topNGroupCount(QStringLiteral("GH1")), 5);
    const auto objects = report->sections()[0]->reportObjects();
    EXPECT_FALSE(objects[1]->picture().isNull());
    const auto sub = objects[2]->openSubreport();
    EXPECT_EQ(sub->databaseTables()[0]->name(), u"Customers");
}

} // namespace
