#include "reportfixture.h"

namespace {

using namespace reporttest;

class ReportSql : public ReportTest {
protected:
    void TearDown() override
    {
        engine::gServerType = engine::ecstMSSQL;
        ReportTest::TearDown();
    }
};

core::Variant ids(std::initializer_list<int32_t> values)
{
    std::vector<core::Variant> elements;
    for (int32_t value : values)
        elements.emplace_back(value);
    return core::VariantArray::fromList(elements);
}

TEST_F(ReportSql, TheSelectionIsSplicedIntoTheStatementAfterTheLastFrom)
{
    struct Case {
        const char* name;
        QString statement;
        core::Variant selection;
        QString specialSelection;
        QString expected;
        engine::MoxServerTypes serverType = engine::ecstMSSQL;
    };
    const QString orderedByIds
        = u"SELECT Orders.ID, Orders.Total FROM Orders\r\nWHERE\r\n    Orders.Open = 1\r\n"
          u"ORDER BY Orders.ID"_s;
    const Case cases[] = {
        { "worked example", orderedByIds, ids({ 3, 7 }), QString(),
            u"SELECT Orders.ID, Orders.Total FROM Orders\r\nWHERE\r\n    Orders.Open = 1 AND "
            u"(Orders.ID IN (3,7))\r\nORDER BY Orders.ID"_s },
        { "an existing condition with OR is wrapped",
            u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    A = 1 OR B = 2\r\nORDER BY Orders.ID"_s,
            ids({ 3, 7 }), QString(),
            u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    (A = 1 OR B = 2) AND (Orders.ID IN "
            u"(3,7))\r\nORDER BY Orders.ID"_s },
        { "a statement without WHERE", u"SELECT Orders.ID FROM Orders"_s, ids({ 3 }), QString(),
            u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    Orders.ID IN (3)"_s },
        { "an empty list", u"SELECT Orders.ID FROM Orders"_s, ids({}), QString(),
            u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    Orders.ID IN ()"_s },
        { "the only WHERE belongs to a sub-query",
            u"SELECT Orders.ID, (SELECT COUNT(*) FROM Lines WHERE Lines.OrderID = Orders.ID) "
            u"AS N\r\nFROM Orders"_s,
            ids({ 3 }), QString(),
            u"SELECT Orders.ID, (SELECT COUNT(*) FROM Lines WHERE Lines.OrderID = Orders.ID) "
            u"AS N\r\nFROM Orders\r\nWHERE\r\n    Orders.ID IN (3)"_s },
        { "GROUP BY and ORDER BY stay at the end in their order",
            u"SELECT Orders.Kind, COUNT(*) FROM Orders\r\nWHERE\r\n    Orders.Open = 1\r\n"
            u"GROUP BY Orders.Kind\r\nORDER BY Orders.Kind"_s,
            ids({ 3 }), QString(),
            u"SELECT Orders.Kind, COUNT(*) FROM Orders\r\nWHERE\r\n    Orders.Open = 1 AND "
            u"(Orders.ID IN (3))\r\nGROUP BY Orders.Kind\r\nORDER BY Orders.Kind"_s },
        { "a host's SQL condition", orderedByIds, u"Orders.Total > 100"_s, QString(),
            u"SELECT Orders.ID, Orders.Total FROM Orders\r\nWHERE\r\n    Orders.Open = 1 AND "
            u"(Orders.Total > 100)\r\nORDER BY Orders.ID"_s },
        { "an unqualified special condition is qualified with the table", orderedByIds,
            core::Variant::null(), u"Total > 100"_s,
            u"SELECT Orders.ID, Orders.Total FROM Orders\r\nWHERE\r\n    Orders.Open = 1 AND "
            u"(((Orders.Total > 100)))\r\nORDER BY Orders.ID"_s },
        { "a special condition on a table the report lacks adds nothing", orderedByIds,
            core::Variant::null(), u"Customers.Country = 'DE'"_s, orderedByIds },
        { "list and special conditions together", u"SELECT Orders.ID FROM Orders"_s, ids({ 3, 7 }),
            u"Orders.Total > 100; EXISTS (SELECT 1 FROM Lines WHERE Lines.OrderID = Orders.ID)"_s,
            u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    (Orders.ID IN (3,7)) AND (((Orders."
            u"Total > 100) AND (EXISTS (SELECT 1 FROM Lines WHERE Lines.OrderID = Orders.ID))))"_s },
        // With special conditions the id clause goes into the statement as well, without its
        // braces and glued to the condition.
        { "an id with special conditions", u"SELECT Orders.ID FROM Orders"_s, int32_t(5),
            u"Total > 100"_s,
            u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    ((Orders.Total > 100))AND "
            u"(Orders.ID=5)"_s },
        { "Jet quotes identifiers with grave accents",
            u"SELECT \"Orders\".\"ID\" FROM \"Orders\""_s, ids({ 3 }), QString(),
            u"SELECT `Orders`.`ID` FROM `Orders`\r\nWHERE\r\n    Orders.ID IN (3)"_s,
            engine::ecstMSJET },
        { "Jet 4.0 likewise", u"SELECT \"Orders\".\"ID\" FROM \"Orders\""_s, ids({ 3 }), QString(),
            u"SELECT `Orders`.`ID` FROM `Orders`\r\nWHERE\r\n    Orders.ID IN (3)"_s,
            engine::ecstMSJET40 },
        { "SQL Server quotes with double quotes", u"SELECT `Orders`.`ID` FROM `Orders`"_s,
            ids({ 3 }), QString(),
            u"SELECT \"Orders\".\"ID\" FROM \"Orders\"\r\nWHERE\r\n    Orders.ID IN (3)"_s },
        { "other server types keep the quotes", u"SELECT \"A\".`B` FROM Orders"_s, ids({ 3 }),
            QString(), u"SELECT \"A\".`B` FROM Orders\r\nWHERE\r\n    Orders.ID IN (3)"_s,
            engine::ecstNone },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        auto file = addOrdersReport();
        file->state.sqlQuery = c.statement;
        engine::gServerType = c.serverType;
        const auto report = open();
        ASSERT_TRUE(report->SetSelection(u"Orders"_s, c.selection, c.specialSelection));

        ASSERT_EQ(report->C_Report(), file);
        EXPECT_EQ(file->state.sqlQuery, c.expected);
        EXPECT_FALSE(report->UnloadRequest());
    }
}

TEST_F(ReportSql, AListSelectionPutsTheAuthorsFormulaBack)
{
    auto file = addOrdersReport();
    file->state.selectionFormula = u"{Orders.Open} = 1"_s;
    file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
    const auto report = open();
    report->SetSelection(u"Orders"_s, int32_t(5));
    ASSERT_TRUE(load(*report));
    ASSERT_NE(file->state.selectionFormula, u"{Orders.Open} = 1"_s);

    ASSERT_TRUE(report->SetSelection(u"Orders"_s, ids({ 3 })));
    EXPECT_EQ(file->state.selectionFormula, u"{Orders.Open} = 1"_s)
        << "the component's earlier clause leaves the formula";
    EXPECT_EQ(
        file->state.sqlQuery, u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    Orders.ID IN (3)"_s);

    // Back to a formula selection: the statement captured first is restored.
    ASSERT_TRUE(report->SetSelection(u"Orders"_s, int32_t(6)));
    EXPECT_EQ(file->state.sqlQuery, u"SELECT Orders.ID FROM Orders"_s);
    EXPECT_TRUE(file->state.selectionFormula.endsWith(u"AND ({Orders.ID}=6)"_s));
}

TEST_F(ReportSql, SettingTheStatementDoesNotChangeTheFormula)
{
    auto file = addOrdersReport();
    file->state.selectionFormula = u"{Orders.Open} = 1"_s;
    file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
    // This runtime derives its formula from a statement that is set.
    fake.onCall(u"Report(orders.rpt).setSqlQueryString"_s,
        [&] { file->state.selectionFormula = u"{Orders.ID} in [3]"_s; });
    const auto report = open();
    report->SetSelection(u"Orders"_s, ids({ 3 }));

    ASSERT_TRUE(load(*report));
    EXPECT_EQ(file->state.selectionFormula, u"{Orders.Open} = 1"_s);
}

TEST_F(ReportSql, AFailureLeavesTheReportUnprintableWithoutRaising)
{
    struct Case {
        const char* name;
        QString failingCall;
        int occurrence; // 0: every call
        core::Variant selection;
        QString specialSelection;
    };
    const Case cases[] = {
        { "statement refused", u"Report(orders.rpt).setSqlQueryString"_s, 0, ids({ 3 }), {} },
        // The loader reads the tables twice before the selection is applied.
        { "tables unreadable", u"Report(orders.rpt).databaseTables"_s, 3, ids({ 3 }),
            u"Total > 1"_s },
        { "formula refused", u"Report(orders.rpt).setRecordSelectionFormula"_s, 0, int32_t(5), {} },
        // Nothing to restrict: running the report unfiltered would show too much.
        { "statement unreadable", u"Report(orders.rpt).sqlQueryString"_s, 0, ids({ 3 }), {} },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        engine::ReleaseApplication();
        fakeruntime::FakeRuntime local;
        auto file = local.addReport(u"orders.rpt"_s);
        file->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
        local.failOn(c.failingCall, runtimeError(RuntimeFailure), c.occurrence);
        collection->Remove(u"orders.rpt"_s);
        const auto report = open();
        ASSERT_TRUE(report->SetSelection(u"Orders"_s, c.selection, c.specialSelection));

        EXPECT_TRUE(load(*report)) << "the error is not passed on";
        EXPECT_TRUE(report->UnloadRequest());
        EXPECT_FALSE(file->state.sqlQuery.contains(u"WHERE"_s));
        // Applied (and failed) once per request; the next load does not try again.
        ASSERT_TRUE(load(*report));
        EXPECT_FALSE(report->UnloadRequest());
        collection->Remove(u"orders.rpt"_s);
    }
}

TEST_F(ReportSql, AnUnreadableStatementIsNoFailureForAFormulaSelection)
{
    auto file = addOrdersReport();
    fake.failAlways(u"Report(orders.rpt).sqlQueryString"_s, runtimeError(RuntimeFailure));
    const auto report = open();
    report->SetSelection(u"Orders"_s, int32_t(5));
    ASSERT_TRUE(load(*report));
    EXPECT_FALSE(report->UnloadRequest());
    EXPECT_EQ(file->state.selectionFormula,
        lines({ u"(//LUDSELECTIONONLY"_s, u"{Orders.ID}=5)"_s, u"//USERSELECTION"_s }));

    // With nothing to splice in, nothing is set: an empty statement is no statement.
    ASSERT_TRUE(report->SetSelection(u"Orders"_s, core::Variant::null()));
    EXPECT_FALSE(report->UnloadRequest());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).setSqlQueryString"_s).isEmpty());
}

} // namespace
