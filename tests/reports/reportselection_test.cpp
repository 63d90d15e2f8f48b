#include "core/collection.h"
#include "reportfixture.h"

namespace {

using namespace reporttest;

class ReportSelection : public ReportTest { };

TEST_F(ReportSelection, TheMarkedFormulaIsWrittenIntoTheReport)
{
    struct Case {
        const char* name;
        QString authorsFormula;
        core::Variant selection;
        QString expected;
    };
    const Case cases[] = {
        { "author's formula and an id", u"{Orders.Status} = 'open'"_s, int32_t(5),
            lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'open'"_s, u")//LUD#2"_s,
                u"//LUDSELECTION"_s, u"AND ({Orders.ID}=5)"_s }) },
        { "comment-only author's formula", u"// all records"_s, int32_t(5),
            lines({ u"// all records"_s, u"//LUDSELECTION"_s, u"{Orders.ID}=5"_s }) },
        { "no author's formula", QString(), int32_t(5),
            lines({ u"(//LUDSELECTIONONLY"_s, u"{Orders.ID}=5)"_s, u"//USERSELECTION"_s }) },
        // Blank lines around the author's formula go; spaces inside its lines stay.
        { "blank lines around the author's formula",
            u"  \r\n\r\n{Orders.Status}  =  'open'\r\n  \r\n"_s, int32_t(5),
            lines({ u"(//LUD#1"_s, u"{Orders.Status}  =  'open'"_s, u")//LUD#2"_s,
                u"//LUDSELECTION"_s, u"AND ({Orders.ID}=5)"_s }) },
        { "a formula clause of the host", QString(), u"{Orders.Kind} = 'B'"_s,
            lines({ u"(//LUDSELECTIONONLY"_s, u"{Orders.Kind} = 'B')"_s, u"//USERSELECTION"_s }) },
        // Numbers go into the formula in their invariant form whatever the user's locale.
        { "a fractional id", u"// x"_s, 5.5,
            lines({ u"// x"_s, u"//LUDSELECTION"_s, u"{Orders.ID}=5.5"_s }) },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        auto file = addOrdersReport();
        file->state.selectionFormula = c.authorsFormula;
        file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
        const auto report = open();
        ASSERT_TRUE(report->SetSelection(u"Orders"_s, c.selection));
        fake.clearLog();

        ASSERT_EQ(report->C_Report(), file);
        EXPECT_EQ(file->state.selectionFormula, c.expected);
        EXPECT_TRUE(callsOf(u"Report(orders.rpt).setSqlQueryString"_s).isEmpty())
            << "a formula selection leaves the statement to the runtime";
        EXPECT_EQ(file->state.sqlQuery, u"SELECT Orders.ID FROM Orders"_s);
    }
}

TEST_F(ReportSelection, ASelectionOnALoadedReportAppliesAtOnceAndOncePerRequest)
{
    auto file = addOrdersReport();
    file->state.selectionFormula = u"{Orders.Status} = 'open'"_s;
    const auto report = open();
    ASSERT_TRUE(load(*report));

    ASSERT_TRUE(report->SetSelection(u"Orders"_s, int32_t(7)));
    EXPECT_TRUE(file->state.selectionFormula.endsWith(u"AND ({Orders.ID}=7)"_s));
    fake.clearLog();
    ASSERT_TRUE(load(*report));
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).setRecordSelectionFormula"_s).isEmpty());

    // The author's part was captured once: a new request replaces only the clause.
    ASSERT_TRUE(report->SetSelection(u"Orders"_s, int32_t(8)));
    EXPECT_EQ(file->state.selectionFormula,
        lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'open'"_s, u")//LUD#2"_s, u"//LUDSELECTION"_s,
            u"AND ({Orders.ID}=8)"_s }));
}

TEST_F(ReportSelection, EmptyTurnsTheSelectionOffForGood)
{
    auto file = addOrdersReport();
    file->state.selectionFormula = u"{Orders.Status} = 'open'"_s;
    file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
    const auto report = open();
    ASSERT_TRUE(report->SetSelection(u"Orders"_s, core::Variant()));
    ASSERT_TRUE(load(*report));
    ASSERT_TRUE(report->SetSelection(u"Orders"_s, int32_t(5)));

    EXPECT_TRUE(callsOf(u"Report(orders.rpt).setRecordSelectionFormula"_s).isEmpty());
    EXPECT_TRUE(callsOf(u"Report(orders.rpt).setSqlQueryString"_s).isEmpty());
    EXPECT_EQ(file->state.selectionFormula, u"{Orders.Status} = 'open'"_s);
}

TEST_F(ReportSelection, CollectionsAndArraysBecomeAnInList)
{
    auto file = addOrdersReport();
    file->state.sqlQuery = u"SELECT Orders.ID FROM Orders"_s;
    const auto report = open();
    ASSERT_TRUE(load(*report));
    auto ids = std::make_shared<core::Collection>();
    ids->add(int32_t(3));
    ids->add(u"7"_s);
    ids->add(u"O'Brien"_s);

    ASSERT_TRUE(report->SetSelection(u"Orders"_s, core::Variant(core::ObjectPtr(ids))));
    // Text that is not a number is quoted, so it can neither break nor extend the statement.
    EXPECT_EQ(file->state.sqlQuery,
        u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    Orders.ID IN (3,7,'O''Brien')"_s);
}

class SavingForEditing : public ReportTest {
protected:
    void SetUp() override
    {
        ReportTest::SetUp();
        file = addOrdersReport();
        file->state.selectionFormula = u"{Orders.Status} = 'open'"_s;
        file->state.sqlQuery = baseSql;
        edited = fake.addReport(u"edit.rpt"_s);
        edited->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        report = open();
    }

    const QString baseSql = u"SELECT Orders.ID FROM Orders"_s;
    const QString markedFormula = lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'open'"_s,
        u")//LUD#2"_s, u"//LUDSELECTION"_s, u"AND ({Orders.ID}=5)"_s });
    std::shared_ptr<fakeruntime::FakeReport> file;
    std::shared_ptr<fakeruntime::FakeReport> edited;
    std::shared_ptr<reports::MoxReport115> report;
};

TEST_F(SavingForEditing, SaveReportPutsTheAuthorsStatementBackAndKeepsTheMarkers)
{
    report->SetSelection(u"Orders"_s, core::VariantArray::fromList({ int32_t(3) }));
    ASSERT_TRUE(load(*report));
    ASSERT_NE(file->state.sqlQuery, baseSql);
    fake.clearLog();

    ASSERT_TRUE(report->SaveReport(u"/tmp/scratch.rpt"_s));
    EXPECT_EQ(fake.calls(u"Report(orders.rpt)."_s),
        (QStringList { u"Report(orders.rpt).setSqlQueryString(\"SELECT Orders.ID FROM Orders\")"_s,
            u"Report(orders.rpt).setRecordSelectionFormula(\"{Orders.Status} = 'open'\")"_s,
            u"Report(orders.rpt).saveAs(\"/tmp/scratch.rpt\",2048)"_s }));
}

TEST_F(SavingForEditing, SaveReportWithAFormulaSelectionSavesTheReportAsItIs)
{
    report->SetSelection(u"Orders"_s, int32_t(5));
    ASSERT_TRUE(load(*report));
    fake.clearLog();

    ASSERT_TRUE(report->SaveReport(u"/tmp/scratch.rpt"_s));
    EXPECT_EQ(fake.calls(u"Report(orders.rpt)."_s),
        QStringList { u"Report(orders.rpt).saveAs(\"/tmp/scratch.rpt\",2048)"_s });
}

TEST_F(SavingForEditing, SaveReportRefusesWithoutAnOpenReportOrOnFailure)
{
    EXPECT_FALSE(report->SaveReport(u"/tmp/scratch.rpt"_s)) << "not open";
    ASSERT_TRUE(load(*report));
    report->UseOldCrystal(true);
    EXPECT_FALSE(report->SaveReport(u"/tmp/scratch.rpt"_s));
    report->UseOldCrystal(false);
    fake.failOn(u"Report.saveAs"_s, runtimeError(RuntimeFailure));
    EXPECT_FALSE(report->SaveReport(u"/tmp/scratch.rpt"_s));
    EXPECT_TRUE(report->SaveReport(u"/tmp/scratch.rpt"_s));
}

TEST_F(SavingForEditing, CheckEditedSelectionTellsIntactFromDamagedMarkers)
{
    struct Case {
        const char* name;
        QString editedFormula;
        bool expected;
        QString expectedEditedSel;
    };
    const QString damaged = lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'closed'"_s,
        u"//LUDSELECTION"_s, u"AND ({Orders.ID}=5)"_s });
    const Case cases[] = {
        { "author's part edited",
            lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'closed'"_s, u")//LUD#2"_s,
                u"//LUDSELECTION"_s, u"AND ({Orders.ID}=5)"_s }),
            true, u"{Orders.Status} = 'closed'"_s },
        { "closing marker deleted", damaged, false, damaged },
        { "markers in other letter case",
            lines({ u"(//lud#1"_s, u"{Orders.X} = 1"_s, u")//lud#2"_s, u"//ludselection"_s,
                u"AND ({Orders.ID}=5)"_s }),
            true, u"{Orders.X} = 1"_s },
    };
    report->SetSelection(u"Orders"_s, int32_t(5));
    ASSERT_TRUE(load(*report));
    ASSERT_TRUE(report->SaveReport(u"/tmp/scratch.rpt"_s));
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        edited->state.selectionFormula = c.editedFormula;
        QString fileName = u"edit.rpt"_s;
        QString originalSel;
        QString savedSel;
        QString editedSel;
        EXPECT_EQ(
            report->CheckEditedSelection(fileName, originalSel, savedSel, editedSel), c.expected);
        EXPECT_EQ(editedSel, c.expectedEditedSel);
        EXPECT_EQ(originalSel, u"{Orders.Status} = 'open'"_s);
        EXPECT_EQ(savedSel, markedFormula);
    }
}

TEST_F(SavingForEditing, CheckEditedSelectionWithoutMarkersToCheck)
{
    edited->state.selectionFormula = u"{Orders.Total} > 5"_s;
    QString fileName = u"edit.rpt"_s;
    QString originalSel = u"untouched"_s;
    QString savedSel = u"untouched"_s;
    QString editedSel = u"untouched"_s;

    // The host turned selection off: nothing to check, nothing read.
    report->SetSelection(u"Orders"_s, core::Variant());
    EXPECT_TRUE(report->CheckEditedSelection(fileName, originalSel, savedSel, editedSel));
    EXPECT_EQ(editedSel, u"untouched"_s);
    EXPECT_TRUE(callsOf(u"Application.openReport"_s).isEmpty());

    // A list selection never marks the formula: the edited formula is taken whole.
    collection->Remove(u"orders.rpt"_s);
    report = open();
    report->SetSelection(u"Orders"_s, core::VariantArray::fromList({ int32_t(3) }));
    ASSERT_TRUE(load(*report));
    ASSERT_TRUE(report->SaveReport(u"/tmp/scratch.rpt"_s));
    EXPECT_TRUE(report->CheckEditedSelection(fileName, originalSel, savedSel, editedSel));
    EXPECT_EQ(editedSel, u"{Orders.Total} > 5"_s);
    EXPECT_EQ(originalSel, u"*"_s);

    report->UseOldCrystal(true);
    EXPECT_FALSE(report->CheckEditedSelection(fileName, originalSel, savedSel, editedSel));
}

TEST_F(SavingForEditing, CheckEditedSelectionPassesAnUnreadableFileOn)
{
    report->SetSelection(u"Orders"_s, int32_t(5));
    QString fileName = u"gone.rpt"_s;
    QString originalSel;
    QString savedSel;
    QString editedSel;
    try {
        report->CheckEditedSelection(fileName, originalSel, savedSel, editedSel);
        FAIL() << "expected the runtime's error";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), OpenReportFailed);
    }
}

TEST_F(SavingForEditing, ReplaceEditedSavesTheCopyOverTheReportAndTheNextUseOpensIt)
{
    report->SetSelection(u"Orders"_s, int32_t(5));
    ASSERT_TRUE(load(*report));
    edited->state.selectionFormula = markedFormula;
    fake.clearLog();

    ASSERT_TRUE(report->ReplaceEdited(u"edit.rpt"_s, u"{Orders.Status} = 'closed'"_s));
    EXPECT_EQ(fake.calls(u"Report(edit.rpt)."_s),
        (QStringList { u"Report(edit.rpt).setDialogParentWindow(0)"_s,
            u"Report(edit.rpt).setRecordSelectionFormula(\"{Orders.Status} = 'closed'\")"_s,
            u"Report(edit.rpt).discardSavedData()"_s,
            u"Report(edit.rpt).saveAs(\"orders.rpt\",2048)"_s }));
    EXPECT_EQ(callsOf(u"Table(Orders).setLocation"_s).size(), 1) << "the copy was relocated";
    EXPECT_EQ(report->GetReport(), nullptr);

    // The next use opens the replaced file and applies the request with the new author's
    // formula.
    file->state.selectionFormula = u"{Orders.Status} = 'closed'"_s;
    ASSERT_EQ(report->C_Report(), file);
    EXPECT_EQ(callsOf(u"Application.openReport(\"orders.rpt\""_s).size(), 1);
    EXPECT_EQ(file->state.selectionFormula,
        lines({ u"(//LUD#1"_s, u"{Orders.Status} = 'closed'"_s, u")//LUD#2"_s, u"//LUDSELECTION"_s,
            u"AND ({Orders.ID}=5)"_s }));
}

TEST_F(SavingForEditing, ReplaceEditedRecapturesAStatementTheEditChanged)
{
    report->SetSelection(u"Orders"_s, core::VariantArray::fromList({ int32_t(3) }));
    ASSERT_TRUE(load(*report));
    const QString newBase = u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    Orders.Kind = 2"_s;
    edited->state.sqlQuery = newBase;

    ASSERT_TRUE(report->ReplaceEdited(u"edit.rpt"_s));
    EXPECT_TRUE(callsOf(u"Report(edit.rpt).setRecordSelectionFormula"_s).isEmpty())
        << "no author's formula was captured to give the copy";
    file->state.sqlQuery = newBase;
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(file->state.sqlQuery,
        u"SELECT Orders.ID FROM Orders\r\nWHERE\r\n    Orders.Kind = 2 AND (Orders.ID IN (3))"_s);
}

TEST_F(SavingForEditing, ReplaceEditedFailsWithoutChangingTheReport)
{
    report->SetSelection(u"Orders"_s, int32_t(5));
    ASSERT_TRUE(load(*report));
    const auto runtimeReport = report->GetReport();

    report->UseOldCrystal(true);
    EXPECT_FALSE(report->ReplaceEdited(u"edit.rpt"_s));
    report->UseOldCrystal(false);
    EXPECT_TRUE(callsOf(u"Report(edit.rpt)"_s).isEmpty());

    fake.failOn(u"Report(edit.rpt).saveAs"_s, runtimeError(RuntimeFailure));
    EXPECT_FALSE(report->ReplaceEdited(u"edit.rpt"_s));
    EXPECT_FALSE(report->ReplaceEdited(u"gone.rpt"_s));
    EXPECT_EQ(report->GetReport(), runtimeReport);
    fake.clearLog();
    ASSERT_TRUE(load(*report));
    EXPECT_TRUE(callsOf(u"Application.openReport"_s).isEmpty());
}

} // namespace
