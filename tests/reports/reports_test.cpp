#include "core/comerror.h"
#include "core/variant.h"
#include "engine/moxengine115.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"

#include <gtest/gtest.h>
#include <memory>
#include <vector>

using namespace Qt::StringLiterals;

namespace {

using reports::MoxReport115;
using reports::MoxReports115;

QStringList fileNames(const MoxReports115& collection)
{
    QStringList names;
    for (const auto& report : collection.NewEnum())
        names.append(report->FileName());
    return names;
}

class ReportsCollection : public ::testing::Test {
protected:
    std::shared_ptr<engine::MoxEngine115> m_engine = std::make_shared<engine::MoxEngine115>();
    std::shared_ptr<MoxReports115> m_reports = m_engine->GetReports();
};

TEST_F(ReportsCollection, ItemFindsANameInAnyLetterCaseAndKeepsTheFirstSpelling)
{
    const auto first = m_reports->Item(u"C:/Reports/Sales.rpt"_s);
    ASSERT_TRUE(first);
    EXPECT_EQ(m_reports->Item(u"c:/reports/SALES.RPT"_s), first);
    EXPECT_EQ(first->FileName(), u"C:/Reports/Sales.rpt"_s);
    EXPECT_EQ(first->GetParent(), m_reports);
    EXPECT_EQ(fileNames(*m_reports), QStringList { u"C:/Reports/Sales.rpt"_s });
}

TEST_F(ReportsCollection, EveryNameIsAKeyIncludingTheEmptyOne)
{
    const auto unnamed = m_reports->Item(QString());
    ASSERT_TRUE(unnamed);
    EXPECT_EQ(m_reports->Item(u""_s), unnamed);
    EXPECT_NE(m_reports->Item(u" "_s), unnamed) << "names are not trimmed";
    EXPECT_EQ(m_reports->NewEnum().size(), 2u);
}

TEST_F(ReportsCollection, EnumerationFollowsInsertionOrderAcrossRemovals)
{
    for (const QString& name : { u"b.rpt"_s, u"a.rpt"_s, u"c.rpt"_s, u"d.rpt"_s })
        m_reports->Item(name);
    m_reports->Remove(u"A.RPT"_s);
    m_reports->Item(u"a.rpt"_s);
    EXPECT_EQ(
        fileNames(*m_reports), (QStringList { u"b.rpt"_s, u"c.rpt"_s, u"d.rpt"_s, u"a.rpt"_s }));
}

TEST_F(ReportsCollection, RemoveDetachesTheReportAndTheNextItemCreatesAnother)
{
    const auto removed = m_reports->Item(u"Invoice.rpt"_s);
    m_reports->Remove(u"INVOICE.rpt"_s);

    EXPECT_EQ(removed->GetParent(), nullptr);
    EXPECT_EQ(removed->FileName(), u"Invoice.rpt"_s) << "the report lives on as the host holds it";
    EXPECT_TRUE(m_reports->NewEnum().empty());

    const auto recreated = m_reports->Item(u"invoice.rpt"_s);
    ASSERT_TRUE(recreated);
    EXPECT_NE(recreated, removed);
    EXPECT_EQ(recreated->FileName(), u"invoice.rpt"_s);
    EXPECT_EQ(recreated->GetParent(), m_reports);
}

TEST_F(ReportsCollection, RemoveOfAnUnknownNameChangesNothing)
{
    const auto kept = m_reports->Item(u"kept.rpt"_s);
    EXPECT_NO_THROW(m_reports->Remove(u"absent.rpt"_s));
    EXPECT_NO_THROW(m_reports->Remove(QString()));
    EXPECT_EQ(fileNames(*m_reports), QStringList { u"kept.rpt"_s });
    EXPECT_EQ(kept->GetParent(), m_reports);
}

TEST_F(ReportsCollection, DestroyLeavesAnInertCollection)
{
    const auto report = m_reports->Item(u"a.rpt"_s);
    const std::weak_ptr<engine::MoxEngine115> engine = m_engine;
    m_engine.reset();
    ASSERT_FALSE(engine.expired()) << "the collection holds its engine";

    m_reports->Destroy();

    EXPECT_TRUE(engine.expired()) << "Destroy drops the engine";
    EXPECT_EQ(m_reports->GetEngine(), nullptr);
    EXPECT_EQ(report->GetParent(), nullptr);
    EXPECT_EQ(m_reports->Item(u"a.rpt"_s), nullptr);
    EXPECT_EQ(m_reports->Item(u"new.rpt"_s), nullptr);
    EXPECT_NO_THROW(m_reports->Remove(u"a.rpt"_s));
    try {
        m_reports->NewEnum();
        FAIL() << "NewEnum after Destroy must raise";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 91);
    }
    EXPECT_NO_THROW(m_reports->Destroy()) << "a second Destroy";
}

TEST(ReportsCollectionWithoutEngine, ItemAndRemoveDoNothing)
{
    const auto reports = std::make_shared<MoxReports115>();
    EXPECT_EQ(reports->Item(u"a.rpt"_s), nullptr);
    EXPECT_NO_THROW(reports->Remove(u"a.rpt"_s));
    EXPECT_TRUE(reports->NewEnum().empty()) << "a collection not yet attached is empty, not gone";
}

TEST_F(ReportsCollection, EachGetReportsHandsOutAnIndependentCollection)
{
    const auto other = m_engine->GetReports();
    ASSERT_NE(other, m_reports);
    EXPECT_EQ(other->GetEngine(), m_engine);
    const auto mine = m_reports->Item(u"a.rpt"_s);
    const auto theirs = other->Item(u"a.rpt"_s);
    ASSERT_TRUE(mine && theirs);
    EXPECT_NE(mine, theirs);
    EXPECT_EQ(theirs->GetParent(), other);
    m_reports->Remove(u"a.rpt"_s);
    EXPECT_EQ(other->NewEnum().size(), 1u);
    EXPECT_EQ(theirs->GetParent(), other);
}

TEST_F(ReportsCollection, AReportDoesNotKeepItsCollectionAlive)
{
    const auto report = m_reports->Item(u"a.rpt"_s);
    const std::weak_ptr<MoxReports115> collection = m_reports;
    const std::weak_ptr<engine::MoxEngine115> engine = m_engine;
    m_engine.reset();

    m_reports.reset();

    EXPECT_TRUE(collection.expired());
    EXPECT_TRUE(engine.expired()) << "nothing but the collection held the engine";
    EXPECT_EQ(report->GetParent(), nullptr);
    EXPECT_EQ(report->FileName(), u"a.rpt"_s);
}

// Records what each handler saw and answers with its own values.
struct RecordedEvent {
    int32_t dispid;
    QString name;
    std::vector<core::Variant> arguments;
};

class ReportEvents : public ::testing::Test {
protected:
    // Connects a handler that records the event and overwrites every argument with `answer`
    // at the same position (an Empty answer leaves that argument alone).
    void connectAnswering(std::vector<core::Variant> answer)
    {
        m_events->connect(
            [this, answer](int32_t dispid, const QString& name, std::span<core::Variant> args) {
                m_seen.push_back({ dispid, name, { args.begin(), args.end() } });
                for (size_t i = 0; i < args.size() && i < answer.size(); ++i) {
                    if (!answer[i].isEmpty())
                        args[i] = answer[i];
                }
            });
    }

    std::shared_ptr<reports::MoxEvents115> m_events = std::make_shared<reports::MoxEvents115>();
    std::vector<RecordedEvent> m_seen;
};

TEST_F(ReportEvents, QueryParametersReturnsWhatTheLastHandlerLeft)
{
    struct Row {
        const char* name;
        std::vector<std::vector<core::Variant>> handlers;
        QString expectedPrompt;
        core::Variant expectedParameters;
    };
    const std::vector<Row> rows {
        { "no handler", {}, u"LUD#Customer"_s, core::Variant(int32_t(7)) },
        { "one handler answers", { { u"answered"_s, u"42"_s } }, u"answered"_s, u"42"_s },
        { "second handler sees and overrides the first",
            { { u"first"_s, u"1"_s }, { u"second"_s, core::Variant() } }, u"second"_s, u"1"_s },
        // A host that writes a number into the String argument gets it as text.
        { "number into the prompt", { { core::Variant(int32_t(5)) } }, u"5"_s,
            core::Variant(int32_t(7)) },
    };
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        m_events = std::make_shared<reports::MoxEvents115>();
        m_seen.clear();
        for (const auto& answer : row.handlers)
            connectAnswering(answer);

        QString prompt = u"LUD#Customer"_s;
        core::Variant parameters(int32_t(7));
        m_events->QueryParameters(prompt, parameters);

        EXPECT_EQ(prompt, row.expectedPrompt);
        EXPECT_EQ(parameters, row.expectedParameters);
        ASSERT_EQ(m_seen.size(), row.handlers.size());
        for (const RecordedEvent& event : m_seen) {
            EXPECT_EQ(event.dispid, 1);
            EXPECT_EQ(event.name, u"QueryParameters"_s);
        }
        if (m_seen.size() == 2) {
            EXPECT_EQ(m_seen[1].arguments[0], core::Variant(u"first"_s));
        }
    }
}

TEST_F(ReportEvents, ShowParametersDialogPassesTheListAndTheCancelFlagBack)
{
    const auto list = std::make_shared<reports::MoxEvents115>(); // any object stands in
    const auto replacement = std::make_shared<reports::MoxEvents115>();
    connectAnswering({ core::Variant(), core::Variant(true) });
    connectAnswering({ core::Variant(core::ObjectPtr(replacement)) });

    core::Variant parameters { core::ObjectPtr(list) };
    bool cancelled = false;
    m_events->ShowParametersDialog(parameters, cancelled);

    EXPECT_TRUE(cancelled);
    EXPECT_EQ(parameters.toObject(), replacement);
    ASSERT_EQ(m_seen.size(), 2u);
    EXPECT_EQ(m_seen[0].dispid, 3);
    EXPECT_EQ(m_seen[0].name, u"ShowParametersDialogEvent"_s);
    EXPECT_EQ(m_seen[0].arguments[0].toObject(), list);
    EXPECT_EQ(m_seen[1].arguments[1], core::Variant(true));
}

TEST_F(ReportEvents, ErrorOccuredAndAfterDialogsReachEveryHandler)
{
    connectAnswering({});
    connectAnswering({});

    m_events->ErrorOccured(u"-2147189155, Crystal, Logon failed"_s);
    m_events->AfterDialogs();

    ASSERT_EQ(m_seen.size(), 4u);
    for (int i : { 0, 1 }) {
        EXPECT_EQ(m_seen[i].dispid, 2);
        EXPECT_EQ(m_seen[i].name, u"ErrorOccured"_s);
        ASSERT_EQ(m_seen[i].arguments.size(), 1u);
        EXPECT_EQ(m_seen[i].arguments[0], core::Variant(u"-2147189155, Crystal, Logon failed"_s));
    }
    for (int i : { 2, 3 }) {
        EXPECT_EQ(m_seen[i].dispid, 4);
        EXPECT_EQ(m_seen[i].name, u"AfterDialogs"_s);
        EXPECT_TRUE(m_seen[i].arguments.empty());
    }
}

TEST_F(ReportEvents, AHandlerErrorReachesTheCallerAndLeavesTheArgumentsAlone)
{
    m_events->connect([](int32_t, const QString&, std::span<core::Variant> args) {
        args[1] = u"half-done"_s;
        throw core::ComError(5, u"Host"_s, u"Handler failed"_s);
    });
    QString prompt = u"LUD#Date"_s;
    core::Variant parameters;
    EXPECT_THROW(m_events->QueryParameters(prompt, parameters), core::ComError);
    EXPECT_EQ(prompt, u"LUD#Date"_s);
    EXPECT_TRUE(parameters.isEmpty());
}

TEST_F(ReportEvents, ANullPromptRaisesInvalidUseOfNullAndChangesNothing)
{
    connectAnswering({ core::Variant::null(), u"answer"_s });
    QString prompt = u"LUD#Date"_s;
    core::Variant parameters;
    try {
        m_events->QueryParameters(prompt, parameters);
        FAIL() << "a Null String argument must raise";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 94);
    }
    EXPECT_EQ(prompt, u"LUD#Date"_s);
    EXPECT_TRUE(parameters.isEmpty());
}

} // namespace
