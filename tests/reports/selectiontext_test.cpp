#include "core/collection.h"
#include "reports/selectiontext.h"

#include <QLocale>
#include <gtest/gtest.h>
#include <limits>

using namespace reports::SelectionText;

namespace {

QString lines(std::initializer_list<const char16_t*> parts)
{
    QStringList list;
    for (const char16_t* part : parts)
        list << QString::fromUtf16(part);
    return list.join(QStringLiteral("\r\n"));
}

TEST(SelectionFormula, ComposesTheMarkedFormulaForEachKindOfAuthorsFormula)
{
    const QString clause = QStringLiteral("{Orders.ID}=5");
    EXPECT_EQ(ComposeSelectionFormula(2, QStringLiteral("{Orders.Status} = 'open'"), clause),
        lines({ u"(//LUD#1", u"{Orders.Status} = 'open'", u")//LUD#2", u"//LUDSELECTION",
            u"AND ({Orders.ID}=5)" }));
    EXPECT_EQ(ComposeSelectionFormula(2, QStringLiteral("// all records"), clause),
        lines({ u"// all records", u"//LUDSELECTION", u"{Orders.ID}=5" }));
    EXPECT_EQ(ComposeSelectionFormula(0, QString(), clause),
        lines({ u"(//LUDSELECTIONONLY", u"{Orders.ID}=5)", u"//USERSELECTION" }));
    EXPECT_EQ(ComposeSelectionFormula(1, QStringLiteral("{A.B} = 1"), QString()),
        QStringLiteral("{A.B} = 1"));
}

TEST(SelectionFormula, ExtractsTheAuthorsPartBackOut)
{
    struct Case {
        const char* name;
        QString formula;
        QString expected;
    };
    const Case cases[] = {
        { "author and clause",
            lines({ u"(//LUD#1", u"{Orders.Status} = 'open'", u")//LUD#2", u"//LUDSELECTION",
                u"AND ({Orders.ID}=5)" }),
            QStringLiteral("{Orders.Status} = 'open'") },
        { "multi-line author part",
            lines({ u"(//LUD#1", u"{A.X} = 1", u"or {A.Y} = 2", u")//LUD#2", u"//LUDSELECTION",
                u"AND ({A.ID}=5)" }),
            lines({ u"{A.X} = 1", u"or {A.Y} = 2" }) },
        { "clause only with user addition",
            lines({ u"(//LUDSELECTIONONLY", u"{Orders.ID}=5)", u"//USERSELECTION",
                u"AND {Orders.Total} > 100" }),
            QStringLiteral("{Orders.Total} > 100") },
        { "user addition without AND",
            lines({ u"(//LUDSELECTIONONLY", u"{Orders.ID}=5)", u"//USERSELECTION",
                u"{Orders.Total} > 100" }),
            QString() },
        { "user addition marker last",
            lines({ u"(//LUDSELECTIONONLY", u"{Orders.ID}=5)", u"//USERSELECTION" }), QString() },
        { "comment-only author", lines({ u"// all records", u"//LUDSELECTION", u"{Orders.ID}=5" }),
            QStringLiteral("// all records") },
        // A marker at the very start has no author's text before it.
        { "marker at the start", lines({ u"//LUDSELECTION", u"{Orders.ID}=5" }), QString() },
        { "marker after one character", QStringLiteral("x//LUDSELECTION"), QString() },
        { "no markers", QStringLiteral("{A.B} = 1"), QString() },
    };
    for (const Case& c : cases)
        EXPECT_EQ(ExtractUserSelection(c.formula), c.expected) << c.name;
}

TEST(SelectionFormula, RecognisesIntactAndDamagedMarkers)
{
    const QString intact = lines({ u"(//LUD#1", u"{Orders.Status} = 'open'", u")//LUD#2",
        u"//LUDSELECTION", u"AND ({Orders.ID}=5)" });
    EXPECT_TRUE(HasSelectionMarkers(intact));
    EXPECT_TRUE(HasSelectionMarkers(intact.toLower()));
    EXPECT_FALSE(HasSelectionMarkers(lines(
        { u"(//LUD#1", u"{Orders.Status} = 'open'", u"//LUDSELECTION", u"AND ({Orders.ID}=5)" })));
    EXPECT_TRUE(HasSelectionMarkers(lines({ u"(//LUDSELECTIONONLY", u"x)" })));
    EXPECT_TRUE(HasSelectionMarkers(lines({ u"// all", u"//LUDSELECTION", u"{A.ID}=1" })));
    EXPECT_FALSE(HasSelectionMarkers(lines({ u"{A.B}=1", u"//LUDSELECTION" })));
    EXPECT_FALSE(HasSelectionMarkers(QString()));
}

TEST(SelectionFormula, CommentOnlyNeedsEveryLineToBeAComment)
{
    EXPECT_TRUE(IsCommentOnly(QStringLiteral("  // all")));
    EXPECT_TRUE(IsCommentOnly(lines({ u"// a", u"  // b" })));
    EXPECT_FALSE(IsCommentOnly(lines({ u"// a", u"", u"// b" })));
    EXPECT_FALSE(IsCommentOnly(lines({ u"// a", u"{A.B} = 1" })));
    EXPECT_FALSE(IsCommentOnly(QString()));
}

TEST(SelectionFormula, CapturedFormulaLosesBlankLinesAtBothEndsOnly)
{
    EXPECT_EQ(CleanCapturedFormula(QStringLiteral("  \r\n\r\n  {A.B} =  1 \r\n  ")),
        QStringLiteral("{A.B} =  1"));
    EXPECT_EQ(CleanCapturedFormula(QStringLiteral("{A.B} = 1\r\n\r\n{A.C} = 2")),
        QStringLiteral("{A.B} = 1\r\n\r\n{A.C} = 2"));
    EXPECT_EQ(CleanCapturedFormula(QStringLiteral("\r\n")), QString());
}

TEST(SelectionRequest, BuildsClausesByKindOfValue)
{
    auto ids = core::VariantArray::fromList({ int32_t(3), int32_t(7), int32_t(9) });
    EXPECT_EQ(BuildRequest(QStringLiteral("Orders"), ids).listClause,
        QStringLiteral("Orders.ID IN (3,7,9)"));
    EXPECT_EQ(BuildRequest(QStringLiteral("Orders"), core::VariantArray::fromList({ int32_t(7) }))
                  .listClause,
        QStringLiteral("Orders.ID IN (7)"));
    EXPECT_EQ(BuildRequest(QStringLiteral("Orders"), core::VariantArray()).listClause,
        QStringLiteral("Orders.ID IN ()"));

    const Request single = BuildRequest(QStringLiteral("Orders"), int32_t(5));
    EXPECT_TRUE(single.formulaSelection);
    EXPECT_EQ(single.formulaClause, QStringLiteral("{Orders.ID}=5"));

    const Request formula
        = BuildRequest(QStringLiteral("Orders"), QStringLiteral("{Orders.X} > 1"));
    EXPECT_TRUE(formula.formulaSelection);
    EXPECT_EQ(formula.formulaClause, QStringLiteral("{Orders.X} > 1"));

    const Request condition
        = BuildRequest(QStringLiteral("Orders"), QStringLiteral("Orders.X > 1"));
    EXPECT_FALSE(condition.formulaSelection);
    EXPECT_EQ(condition.listClause, QStringLiteral("Orders.X > 1"));

    EXPECT_TRUE(BuildRequest(QStringLiteral("Orders"), core::Variant()).noSelection);
    const Request nothing = BuildRequest(QStringLiteral("Orders"), core::Variant::null());
    EXPECT_FALSE(nothing.noSelection);
    EXPECT_TRUE(nothing.listClause.isEmpty() && nothing.formulaClause.isEmpty());
}

TEST(SelectionRequest, TextElementsAreQuotedAndNumbersStayInvariant)
{
    const QLocale saved;
    QLocale::setDefault(QLocale(QLocale::Estonian, QLocale::Estonia));
    const auto values = core::VariantArray::fromList(
        { 5.5, QStringLiteral("12"), QStringLiteral("O'Brien"), QStringLiteral("1) OR (1=1") });
    EXPECT_EQ(BuildRequest(QStringLiteral("T"), values).listClause,
        QStringLiteral("T.ID IN (5.5,12,'O''Brien','1) OR (1=1')"));
    EXPECT_EQ(BuildRequest(QStringLiteral("T"), 2.25).formulaClause, QStringLiteral("{T.ID}=2.25"));
    QLocale::setDefault(saved);
}

TEST(SelectionRequest, ValuesThatAreNotExactlyNumbersCannotLeaveTheList)
{
    const auto values = core::VariantArray::fromList(
        { QStringLiteral("5\n"), std::numeric_limits<double>::infinity(),
            std::numeric_limits<double>::quiet_NaN(), QStringLiteral(" 7 ") });
    EXPECT_EQ(BuildRequest(QStringLiteral("T"), values).listClause,
        QStringLiteral("T.ID IN ('5\n',NULL,NULL,7)"));
}

TEST(SelectionRequest, CollectionsListTheirItems)
{
    auto collection = std::make_shared<core::Collection>();
    collection->add(int32_t(4));
    collection->add(int32_t(8), QStringLiteral("k"));
    EXPECT_EQ(BuildRequest(QStringLiteral("Orders"), core::Variant(collection)).listClause,
        QStringLiteral("Orders.ID IN (4,8)"));
}

TEST(SqlRewrite, SpecialSelectionKeepsOnlyConditionsOnReportTables)
{
    const QStringList tables { QStringLiteral("Orders"), QStringLiteral("Lines") };
    EXPECT_EQ(BuildSqlConditions(QStringLiteral("Orders.Total > 100; EXISTS (SELECT 1 FROM Lines "
                                                "WHERE Lines.OrderID = Orders.ID)"),
                  QStringLiteral("Orders"), tables),
        QStringLiteral("((Orders.Total > 100) AND (EXISTS (SELECT 1 FROM Lines WHERE "
                       "Lines.OrderID = Orders.ID)))"));
    EXPECT_EQ(BuildSqlConditions(
                  QStringLiteral("Customers.Country = 'DE'"), QStringLiteral("Orders"), tables),
        QString());
    EXPECT_EQ(BuildSqlConditions(QStringLiteral("Country = 'DE'"), QStringLiteral("Customers"),
                  { QStringLiteral("customers") }),
        QStringLiteral("((Customers.Country = 'DE'))"));
    EXPECT_EQ(BuildSqlConditions(QStringLiteral("(A.X = 1)"), QStringLiteral("A"), {}),
        QStringLiteral("(((A.X = 1)))"));
}

TEST(SqlRewrite, SplicesTheFilterAfterTheLastFrom)
{
    struct Case {
        const char* name;
        QString sql;
        QString expected;
    };
    const QString filter = QStringLiteral("Orders.ID IN (3,7)");
    const Case cases[] = {
        { "existing condition",
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE", u"    Orders.Open = 1",
                u"ORDER BY Orders.ID" }),
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE",
                u"    Orders.Open = 1 AND (Orders.ID IN (3,7))", u"ORDER BY Orders.ID" }) },
        { "existing OR condition",
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE", u"    A = 1 OR B = 2",
                u"ORDER BY Orders.ID" }),
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE",
                u"    (A = 1 OR B = 2) AND (Orders.ID IN (3,7))", u"ORDER BY Orders.ID" }) },
        { "no WHERE", lines({ u"SELECT Orders.ID FROM Orders", u"ORDER BY Orders.ID" }),
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE", u"    Orders.ID IN (3,7)",
                u"ORDER BY Orders.ID" }) },
        { "no tail", QStringLiteral("SELECT Orders.ID FROM Orders"),
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE", u"    Orders.ID IN (3,7)" }) },
        { "WHERE only inside a sub-query",
            lines({ u"SELECT X.ID FROM (SELECT ID FROM Orders WHERE Open = 1) X", u"FROM Y" }),
            lines({ u"SELECT X.ID FROM (SELECT ID FROM Orders WHERE Open = 1) X", u"FROM Y",
                u"WHERE", u"    Orders.ID IN (3,7)" }) },
        { "GROUP BY and ORDER BY kept in order",
            lines(
                { u"SELECT Orders.ID FROM Orders", u"GROUP BY Orders.ID", u"ORDER BY Orders.ID" }),
            lines({ u"SELECT Orders.ID FROM Orders", u"WHERE", u"    Orders.ID IN (3,7)",
                u"GROUP BY Orders.ID", u"ORDER BY Orders.ID" }) },
        // An author's command on one line keeps its whole condition.
        { "one-line command", QStringLiteral("SELECT * FROM Orders WHERE Open = 1 ORDER BY ID"),
            QStringLiteral("SELECT * FROM Orders\r\nWHERE\r\n    Open = 1 AND (Orders.ID IN "
                           "(3,7)) ORDER BY ID") },
        // Keywords in literals, names and comments are text, not clauses.
        { "keyword inside a literal", QStringLiteral("SELECT a FROM t WHERE n = 'x ORDER BY y'"),
            QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    (n = 'x ORDER BY y') AND (Orders.ID "
                           "IN (3,7))") },
        { "keyword inside a comment and a quoted name",
            lines({ u"SELECT [FROM x] FROM t -- WHERE y", u"" }),
            lines({ u"SELECT [FROM x] FROM t -- WHERE y", u"", u"WHERE",
                u"    Orders.ID IN (3,7)" }) },
        // The outermost query's WHERE takes the filter, not the last sub-query's.
        { "sub-query inside the condition",
            QStringLiteral("SELECT a FROM t WHERE x IN (SELECT b FROM u WHERE c = 1)"),
            QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    x IN (SELECT b FROM u WHERE c = 1) "
                           "AND (Orders.ID IN (3,7))") },
        // A condition ending in a comment would swallow the filter on the same line.
        { "condition ending in a comment",
            QStringLiteral("SELECT a FROM t WHERE x = 1 -- open only"),
            QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    x = 1 -- open only\r\n AND "
                           "(Orders.ID IN (3,7))") },
        { "keyword as part of a name", QStringLiteral("SELECT NOWHERE FROM FROMAGE"),
            lines({ u"SELECT NOWHERE FROM FROMAGE", u"WHERE", u"    Orders.ID IN (3,7)" }) },
    };
    for (const Case& c : cases)
        EXPECT_EQ(SpliceFilter(c.sql, filter, QString(), QString()), c.expected) << c.name;
}

TEST(SqlRewrite, FormulaClauseJoinsTheConditionWhenBothKindsAreGiven)
{
    const QString sql = lines({ u"SELECT Orders.ID FROM Orders", u"ORDER BY Orders.ID" });
    EXPECT_EQ(SpliceFilter(sql, QStringLiteral("(Orders.Total > 100)"),
                  QStringLiteral("Orders.Total > 100"), QStringLiteral("{Orders.ID}=5")),
        lines({ u"SELECT Orders.ID FROM Orders", u"WHERE",
            u"    (Orders.Total > 100)AND (Orders.ID=5)", u"ORDER BY Orders.ID" }));
}

// A host's condition that ends in a line comment would comment out the closing parenthesis
// (the statement fails) or what follows it on the line.
TEST(SqlRewrite, HostConditionsEndingInACommentKeepTheirParentheses)
{
    const QString sql = QStringLiteral("SELECT a FROM t WHERE x = 1");
    EXPECT_EQ(SpliceFilter(sql, QStringLiteral("y = 2 -- host note"), QString(), QString()),
        QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    x = 1 AND (y = 2 -- host note\r\n)"));
    EXPECT_EQ(SpliceFilter(QStringLiteral("SELECT a FROM t"), QStringLiteral("y = 2 -- host note"),
                  QString(), QString()),
        QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    y = 2 -- host note\r\n"));
    EXPECT_EQ(SpliceFilter(sql, QStringLiteral("(y = 2)"), QStringLiteral("y = 2"),
                  QStringLiteral("{t.z} = 3 -- why")),
        QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    x = 1 AND ((y = 2))AND (t.z = 3 -- "
                       "why\r\n)"));
    // A comment marker inside a literal is text: nothing is added.
    EXPECT_EQ(SpliceFilter(sql, QStringLiteral("y = '--'"), QString(), QString()),
        QStringLiteral("SELECT a FROM t\r\nWHERE\r\n    x = 1 AND (y = '--')"));
}

TEST(SqlRewrite, QuotesTheWholeStatementForTheServerType)
{
    const QString sql = QStringLiteral("SELECT \"A\" FROM `B`");
    EXPECT_EQ(QuoteForServer(sql, 2), QStringLiteral("SELECT \"A\" FROM \"B\""));
    EXPECT_EQ(QuoteForServer(sql, 1), QStringLiteral("SELECT `A` FROM `B`"));
    EXPECT_EQ(QuoteForServer(sql, 3), QStringLiteral("SELECT `A` FROM `B`"));
    EXPECT_EQ(QuoteForServer(sql, 0), sql);
}

} // namespace
