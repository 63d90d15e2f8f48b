// Records beyond the resident limit live in a nameless scratch file: reports must read,
// group, summarize and lay out exactly as they do with every record in memory, and the
// scratch file must never be seen in the temporary folder nor outlive its report.

#include "core/comerror.h"
#include "layoutfixture.h"
#include "platform/tempfolder.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/recordprocessor.h"
#include "reportrt/data/recordset.h"
#include "reportrt/data/spillfile.h"
#include "reportrt/exportoptions.h"
#include "reportrt/formula/formulaexpr.h"
#include "support/fulldisk.h"

#include <QDir>
#include <QJsonArray>
#include <gtest/gtest.h>
#include <limits>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

/// Sets the resident limit for its lifetime.
class ResidentLimit {
public:
    explicit ResidentLimit(qsizetype records)
        : m_previous(RecordSet::setResidentLimit(records))
    { }
    ~ResidentLimit() { RecordSet::setResidentLimit(m_previous); }

private:
    qsizetype m_previous;
};

/// The descriptors of scratch files this process holds open.
int openScratchFiles()
{
    int count = 0;
    const QDir fds(u"/proc/self/fd"_s);
    for (const QString& fd : fds.entryList(QDir::NoDotAndDotDot | QDir::System | QDir::Files)) {
        const QString target = QFile::symLinkTarget(fds.filePath(fd));
        if (target.startsWith(platform::TempFolder::systemPath())
            && target.endsWith(u"(deleted)"_s))
            ++count;
    }
    return count;
}

QJsonObject summary(const QString& operation, int group, int left)
{
    QJsonObject o { { u"kind"_s, u"summary"_s }, { u"operation"_s, operation },
        { u"field"_s, u"{Items.Amount}"_s }, { u"left"_s, left }, { u"width"_s, 1500 },
        { u"height"_s, 240 } };
    if (group > 0)
        o.insert(u"group"_s, group);
    return o;
}

// Summaries printed before their records, total pages, group and report footers.
QJsonObject groupedReport(const QJsonObject& group)
{
    const QJsonArray sections {
        section(u"PH"_s, 500, { textObject(u"Heading"_s, 0, 0) }),
        section(u"GH1"_s, 300,
            { fieldObject(u"{Items.Grp}"_s, 0, 0), summary(u"sum"_s, 1, 3000),
                summary(u"average"_s, 1, 4600) }),
        section(u"D"_s, 300,
            { fieldObject(u"{Items.Name}"_s, 0, 0), fieldObject(u"{Items.Amount}"_s, 3000, 0),
                fieldObject(u"{Items.Note}"_s, 4600, 0) }),
        section(u"GF1"_s, 300, { summary(u"count"_s, 1, 0), summary(u"maximum"_s, 1, 3000) }),
        section(u"RF"_s, 300, { textObject(u"Total"_s, 0, 0), summary(u"sum"_s, 0, 3000) }),
        section(u"PF"_s, 400,
            { QJsonObject { { u"kind"_s, u"special"_s }, { u"special"_s, u"pageNumber"_s },
                  { u"left"_s, 0 }, { u"width"_s, 800 }, { u"height"_s, 240 } },
                QJsonObject { { u"kind"_s, u"special"_s }, { u"special"_s, u"totalPages"_s },
                    { u"left"_s, 900 }, { u"width"_s, 800 }, { u"height"_s, 240 } } }),
    };
    return itemsReport(sections, { group });
}

struct SpillCase {
    const char* name;
    QJsonObject group;
};

class Spilled : public testing::TestWithParam<SpillCase> { };

TEST_P(Spilled, ReportsLayOutAsTheyDoInMemory)
{
    QTemporaryDir dir;
    // 9,000 records: four and a bit blocks of 2,048, groups of 37 across block borders.
    const QString database = itemsDatabase(dir, 9000, 37);
    const QString path = writeReport(dir, groupedReport(GetParam().group));

    QStringList inMemory;
    {
        auto report = openReport(path, database);
        inMemory = allTexts(layOut(*report));
        ASSERT_FALSE(report->records()->isSpilled());
    }
    const int scratchBefore = openScratchFiles();
    const QStringList visibleBefore = QDir(platform::TempFolder::systemPath()).entryList();
    {
        const ResidentLimit limit(RecordSet::chunkRecords);
        auto report = openReport(path, database);
        const QStringList spilled = allTexts(layOut(*report));
        ASSERT_TRUE(report->records()->isSpilled());
        EXPECT_EQ(openScratchFiles(), scratchBefore + 1);
        EXPECT_EQ(QDir(platform::TempFolder::systemPath()).entryList(), visibleBefore);
        EXPECT_EQ(spilled.size(), inMemory.size());
        EXPECT_EQ(spilled, inMemory);
    }
    EXPECT_EQ(openScratchFiles(), scratchBefore);
}

INSTANTIATE_TEST_SUITE_P(Records, Spilled,
    testing::Values(SpillCase { "SortedByTheDatabase", { { u"field"_s, u"{Items.Grp}"_s } } },
        SpillCase {
            "Descending", { { u"field"_s, u"{Items.Grp}"_s }, { u"order"_s, u"descending"_s } } },
        SpillCase { "TopN",
            { { u"field"_s, u"{Items.Grp}"_s },
                { u"topN"_s,
                    QJsonObject { { u"count"_s, 11 },
                        { u"summary"_s,
                            QJsonObject { { u"operation"_s, u"sum"_s },
                                { u"field"_s, u"{Items.Amount}"_s } } } } } } }),
    [](const testing::TestParamInfo<SpillCase>& param) { return std::string(param.param.name); });

TEST(Spilled, AFailedExportLeavesNoScratchFileBehind)
{
    QTemporaryDir dir;
    const QString database = itemsDatabase(dir, 6000, 37);
    const QString path
        = writeReport(dir, groupedReport(QJsonObject { { u"field"_s, u"{Items.Grp}"_s } }));
    const int scratchBefore = openScratchFiles();
    const QStringList visibleBefore = QDir(platform::TempFolder::systemPath()).entryList();
    {
        const ResidentLimit limit(RecordSet::chunkRecords);
        auto report = openReport(path, database);
        report->readRecords();
        ASSERT_TRUE(report->records()->isSpilled());
        const auto options = report->exportOptions();
        options->reset();
        options->setFormatType(31);
        options->setDestinationType(1);
        options->setDiskFileName(dir.filePath(u"missing/folder/out.pdf"_s));
        EXPECT_THROW(report->exportReport(false), core::ComError);
        EXPECT_EQ(QDir(platform::TempFolder::systemPath()).entryList(), visibleBefore);
    }
    EXPECT_EQ(openScratchFiles(), scratchBefore);
}

TEST(Spilled, EveryKindOfValueComesBackAsItWasWritten)
{
    const ResidentLimit limit(1);
    const std::vector<Value> kinds { Value(), Value::number(-2.5), Value::currency(123456789),
        Value::string(QString()), Value::string(u"Zürich 🚀 \u0000 end"_s), Value::boolean(true),
        Value::boolean(false), Value::date(2461016), Value::time(86399999), Value::dateTime(-5),
        Value::binary(QByteArray("\0\x01\xff", 3)) };
    const int columns = static_cast<int>(kinds.size());
    RecordSet records(columns);
    const qsizetype count = 5 * RecordSet::chunkRecords + 17;
    for (qsizetype r = 0; r < count; ++r) {
        Value* record = records.append();
        for (int c = 0; c < columns; ++c)
            record[c] = kinds[static_cast<size_t>((r + c) % columns)];
    }
    ASSERT_TRUE(records.isSpilled());
    // Backwards and strided, so blocks leave the cache and are read again.
    for (qsizetype r = count - 1; r >= 0; r -= 997) {
        const Value* record = records.record(r);
        for (int c = 0; c < columns; ++c)
            ASSERT_EQ(record[c], kinds[static_cast<size_t>((r + c) % columns)]) << r << ' ' << c;
    }
}

TEST(Spilled, RecordsInAndOutOfPrintOrderGroupAlike)
{
    // Keys the database did not sort: the one-pass grouping must notice and sort.
    auto key = std::make_shared<FormulaExpr>();
    key->kind = FormulaExpr::Kind::Field;
    key->column = 0;
    key->type = ValueType::Number;
    auto amount = std::make_shared<FormulaExpr>();
    amount->kind = FormulaExpr::Kind::Field;
    amount->column = 1;
    amount->type = ValueType::Number;
    const std::vector<RecordProcessor::Group> groups { { key, SortOrder::Ascending, 0, -1 } };
    const std::vector<RecordProcessor::Summary> summaries { { SummaryOperation::Sum, amount, 1 },
        { SummaryOperation::Count, amount, 0 } };
    const auto fill = [](RecordSet& records) {
        for (int r = 0; r < 7000; ++r) {
            Value* record = records.append();
            record[0] = Value::number((r * 7919) % 13);
            record[1] = r % 5 == 0 ? Value() : Value::number(r);
        }
    };
    RecordSet inMemory(2);
    fill(inMemory);
    const auto expected = RecordProcessor::process(inMemory, groups, {}, summaries);
    const ResidentLimit limit(1);
    RecordSet spilled(2);
    fill(spilled);
    ASSERT_TRUE(spilled.isSpilled());
    const auto result = RecordProcessor::process(spilled, groups, {}, summaries);
    ASSERT_EQ(result.groups.size(), 13u);
    ASSERT_EQ(result.size(), 7000);
    EXPECT_FALSE(result.order.empty());
    EXPECT_EQ(result.totals, expected.totals);
    for (size_t g = 0; g < result.groups.size(); ++g) {
        EXPECT_EQ(result.groups[g].key, Value::number(static_cast<double>(g)));
        EXPECT_EQ(result.groups[g].summaries, expected.groups[g].summaries);
        EXPECT_EQ(result.groups[g].recordCount, expected.groups[g].recordCount);
    }
    for (qsizetype p = 0; p < result.size(); ++p)
        ASSERT_EQ(result.recordAt(p), expected.recordAt(p));

    // The same records as the database would sort them take the one-pass path and must
    // give the same groups and summaries.
    RecordSet sorted(2);
    for (qsizetype p = 0; p < expected.size(); ++p) {
        const Value* from = inMemory.record(expected.recordAt(p));
        Value* to = sorted.append();
        to[0] = from[0];
        to[1] = from[1];
    }
    const auto streamed = RecordProcessor::process(sorted, groups, {}, summaries);
    EXPECT_TRUE(streamed.order.empty());
    ASSERT_EQ(streamed.groups.size(), expected.groups.size());
    EXPECT_EQ(streamed.totals, expected.totals);
    for (size_t g = 0; g < streamed.groups.size(); ++g) {
        EXPECT_EQ(streamed.groups[g].key, expected.groups[g].key);
        EXPECT_EQ(streamed.groups[g].firstRecord, expected.groups[g].firstRecord);
        EXPECT_EQ(streamed.groups[g].recordCount, expected.groups[g].recordCount);
        EXPECT_EQ(streamed.groups[g].summaries, expected.groups[g].summaries);
    }
}

std::shared_ptr<FormulaExpr> column(int index, ValueType type)
{
    auto e = std::make_shared<FormulaExpr>();
    e->kind = FormulaExpr::Kind::Field;
    e->column = index;
    e->type = type;
    return e;
}

TEST(Summaries, EveryLevelInOneWalkMatchesEachGroupSummarizedAlone)
{
    // Two group levels, every operation, Null values, spilled records.
    const ResidentLimit limit(1);
    RecordSet records(3);
    for (int r = 0; r < 9000; ++r) {
        Value* record = records.append();
        record[0] = Value::number(r / 3000);
        record[1] = Value::number((r / 300) % 10);
        record[2] = r % 7 == 0 ? Value() : Value::number((r * 37) % 1001 - 500);
    }
    const auto amount = column(2, ValueType::Number);
    const std::vector<RecordProcessor::Group> groups { { column(0, ValueType::Number) },
        { column(1, ValueType::Number) } };
    std::vector<RecordProcessor::Summary> summaries;
    for (const auto operation : { SummaryOperation::Sum, SummaryOperation::Average,
             SummaryOperation::Count, SummaryOperation::Minimum, SummaryOperation::Maximum }) {
        for (int level = 0; level <= 2; ++level)
            summaries.push_back({ operation, amount, level });
    }
    const auto result = RecordProcessor::process(records, groups, {}, summaries);
    ASSERT_EQ(result.groups.size(), 3u + 30u);
    for (size_t s = 0; s < summaries.size(); ++s) {
        const auto& summary = summaries[s];
        if (summary.level == 0) {
            EXPECT_EQ(result.totals[s],
                RecordProcessor::summarize(
                    summary.operation, *amount, records, nullptr, 0, result.size()));
            continue;
        }
        for (const auto& node : result.groups) {
            if (node.level != summary.level)
                continue;
            EXPECT_EQ(node.summaries[s],
                RecordProcessor::summarize(summary.operation, *amount, records, nullptr,
                    node.firstRecord, node.recordCount))
                << s << " at " << node.firstRecord;
        }
    }

    // A currency sum that overflows fails as the formula it came from.
    RecordSet money(2);
    for (int r = 0; r < 4; ++r) {
        Value* record = money.append();
        record[0] = Value::number(0);
        record[1] = Value::currency(std::numeric_limits<int64_t>::max() / 3);
    }
    EXPECT_THROW(RecordProcessor::process(money, { { column(0, ValueType::Number) } }, {},
                     { { SummaryOperation::Sum, column(1, ValueType::Currency), 1 } }),
        FormulaException);
}

TEST(Spilled, AFullDiskFailsTheReadWithTheReasonAndLeavesNothing)
{
    QTemporaryDir dir;
    for (const auto kind :
        { testsupport::FullDisk::Kind::Tmpfs, testsupport::FullDisk::Kind::SizeLimit }) {
        testsupport::FullDisk disk(kind, dir.path());
        if (!disk.isReady())
            continue;
        disk.fill();
        SpillFile file(dir.path());
        try {
            for (int i = 0; i < 64; ++i)
                file.append(QByteArray(64 * 1024, 'x'));
            ADD_FAILURE() << "writing 4 MB to a full disk succeeded";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), Error::RuntimeFailure);
            EXPECT_TRUE(error.description().contains(u"No space left on device"_s)
                || error.description().contains(u"File too large"_s))
                << error.description().toStdString();
        }
    }
    EXPECT_TRUE(QDir(dir.path()).entryList(QDir::NoDotAndDotDot | QDir::AllEntries).isEmpty());
}

} // namespace
} // namespace reportrt::layouttest
