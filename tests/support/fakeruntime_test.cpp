#include "fakeruntime.h"
#include "runtime/applicationfactory.h"

#include <QFile>
#include <QTemporaryDir>
#include <gtest/gtest.h>
#include <ostream>

inline void PrintTo(const QString& text, std::ostream* out)
{
    *out << '"' << text.toStdString() << '"';
}
inline void PrintTo(const QStringList& list, std::ostream* out)
{
    for (const QString& text : list)
        *out << "\n  " << text.toStdString();
}

namespace fakeruntime {
namespace {

using namespace Qt::StringLiterals;

const core::ComError failure(-2147220727, u"Runtime"_s, u"Broken"_s);

TEST(FakeRuntime, RuleFailsTheNthMatchingCallAfterItWasAdded)
{
    FakeRuntime fake;
    auto report = fake.newReport(u"r"_s);
    auto orders = report->addTable(u"Orders"_s, u"Orders"_s);
    auto items = report->addTable(u"Items"_s, u"Items"_s);
    orders->setLocation(u"before"_s, {}, {});
    fake.failOn(u"Table.setLocation"_s, failure, 2);

    orders->setLocation(u"A"_s, {}, {});
    EXPECT_THROW(items->setLocation(u"B"_s, {}, {}), core::ComError);
    orders->setLocation(u"C"_s, {}, {});

    // A failing call changes nothing but is logged, marked as raised.
    EXPECT_EQ(items->state.location, u"Items"_s);
    EXPECT_EQ(orders->state.location, u"C"_s);
    ASSERT_EQ(fake.log().size(), 4u);
    EXPECT_TRUE(fake.log()[2].raised);
    EXPECT_FALSE(fake.log()[3].raised);
}

TEST(FakeRuntime, ObjectRulesAndHooksReachOnlyThatObject)
{
    FakeRuntime fake;
    auto report = fake.newReport(u"r"_s);
    auto orders = report->addTable(u"Orders"_s, u"Orders"_s);
    auto items = report->addTable(u"Items"_s, u"Items"_s);
    orders->failAlways(u"location"_s, failure);
    int hooked = 0;
    fake.onCall(u"Table(Items).*"_s, [&] { ++hooked; });

    EXPECT_THROW(orders->location(), core::ComError);
    EXPECT_THROW(orders->location(), core::ComError);
    EXPECT_EQ(items->location(), u"Items"_s);
    items->deleteConnectionProperties();
    EXPECT_EQ(hooked, 2);
    EXPECT_THROW(fake.failOn(u"not a call"_s, failure), std::invalid_argument);
}

TEST(FakeRuntime, LogShowsArgumentsInOrderAndLeavesQueriesOutOfCalls)
{
    FakeRuntime fake;
    auto report = fake.newReport(u"r"_s);
    auto table = report->addTable(u"Orders"_s, u"Orders"_s);
    table->location();
    table->addConnectionProperty(u"Provider"_s, u"SQLOLEDB"_s);
    table->addConnectionProperty(u"Integrated Security"_s, true);
    table->addConnectionProperty(u"Timeout"_s, int32_t { 30 });
    table->addConnectionProperty(u"Nothing"_s, core::Variant());
    report->printOut(false, 2, true, runtime::PageRange { 3, 4 });

    EXPECT_EQ(fake.calls(),
        (QStringList { uR"(Table(Orders).addConnectionProperty("Provider","SQLOLEDB"))"_s,
            uR"(Table(Orders).addConnectionProperty("Integrated Security",True))"_s,
            uR"(Table(Orders).addConnectionProperty("Timeout",30))"_s,
            uR"(Table(Orders).addConnectionProperty("Nothing",Empty))"_s,
            u"Report(r).printOut(False,2,True,3,4)"_s }));
    EXPECT_EQ(fake.calls(u"Report("_s), QStringList { u"Report(r).printOut(False,2,True,3,4)"_s });
    EXPECT_EQ(fake.allCalls().front(), u"Table(Orders).location()"_s);
    EXPECT_TRUE(fake.dump().contains(u"Table(Orders).location()   [query]"_s));
}

TEST(FakeRuntime, ApplicationOpensRegisteredReportsOnly)
{
    FakeRuntime fake;
    auto registered = fake.addReport(u"/r/orders.rpt"_s);
    auto application = runtime::ApplicationFactory::create();

    EXPECT_EQ(application->openReport(u"/r/orders.rpt"_s, 1), registered);
    try {
        application->openReport(u"/r/missing.rpt"_s, 1);
        FAIL() << "expected an error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), static_cast<int32_t>(0x80047689));
    }
    EXPECT_EQ(fake.calls(),
        (QStringList { u"ApplicationFactory.create()"_s,
            uR"(Application.openReport("/r/orders.rpt",1))"_s,
            uR"(Application.openReport("/r/missing.rpt",1))"_s }));
    EXPECT_EQ(fake.applicationsCreated(), 1);
}

TEST(FakeRuntime, DestructionPutsThePreviousFactoryBack)
{
    FakeRuntime outer;
    {
        FakeRuntime inner;
        runtime::ApplicationFactory::create();
        EXPECT_EQ(inner.applicationsCreated(), 1);
    }
    runtime::ApplicationFactory::create();
    EXPECT_EQ(outer.applicationsCreated(), 1);
}

TEST(FakeRuntime, MembersAnObjectTypeLacksRaise438)
{
    FakeRuntime fake;
    auto section = fake.newReport(u"r"_s)->addSection(u"D"_s);
    auto field = section->addObject(u"IFieldObject"_s, u"Amount"_s);
    auto ole = section->addObject(u"ICROleObject"_s, u"Logo"_s);
    auto sub = section->addSubreport(u"Sub"_s);

    const auto number = [](const auto& call) {
        try {
            call();
        } catch (const core::ComError& error) {
            return error.number();
        }
        return 0;
    };
    EXPECT_EQ(number([&] { field->picture(); }), 438);
    EXPECT_EQ(number([&] { ole->fieldName(); }), 438);
    EXPECT_EQ(number([&] { ole->openSubreport(); }), 438);
    EXPECT_EQ(number([&] { ole->setPicture(QImage(2, 3, QImage::Format_RGB32)); }), 0);
    EXPECT_EQ(ole->state.picture.size(), QSize(2, 3));
    EXPECT_EQ(section->state.objects.back()->openSubreport(), sub);
    EXPECT_EQ(field->section(), section);
}

TEST(FakeRuntime, EventsReachTheComponentsHandlers)
{
    FakeRuntime fake;
    auto report = fake.newReport(u"r"_s);
    auto section = report->addSection(u"D"_s);
    int formatted = 0;
    const int kept = section->addFormatHandler([&] { ++formatted; });
    const int removed = section->addFormatHandler([&] { formatted += 100; });
    section->removeFormatHandler(removed);
    section->fireFormat();
    EXPECT_EQ(formatted, 1);
    EXPECT_EQ(section->formatHandlerCount(), 1);
    section->removeFormatHandler(kept);

    report->state.selectsNoRecords = true;
    report->setNoDataHandler([](bool& cancel) { cancel = true; });
    report->readRecords();
    EXPECT_TRUE(report->state.noDataCancelled);
}

TEST(FakeRuntime, WritesPlaceholderOutputWhenAsked)
{
    QTemporaryDir folder;
    FakeRuntime fake;
    auto report = fake.newReport(u"r"_s);
    auto options = report->exportOptions();
    options->setDestinationType(1);
    options->setDiskFileName(folder.filePath(u"out.pdf"_s));

    report->exportReport(false);
    EXPECT_FALSE(QFile::exists(folder.filePath(u"out.pdf"_s)));
    report->state.writeOutputFiles = true;
    report->exportReport(false);
    report->saveAs(folder.filePath(u"copy.rpt"_s), 2048);
    EXPECT_TRUE(QFile::exists(folder.filePath(u"out.pdf"_s)));
    EXPECT_TRUE(QFile::exists(folder.filePath(u"copy.rpt"_s)));
}

} // namespace
} // namespace fakeruntime
