#include "core/comerror.h"
#include "layoutfixture.h"
#include "reportrt/base/runtimeerror.h"
#include "reportrt/layout/fonttable.h"
#include "reportrt/layout/layoutengine.h"
#include "reportrt/layout/textshaper.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"
#include "runtime/reportobject.h"
#include "runtime/section.h"

#include <QBuffer>
#include <QSqlDatabase>
#include <QSqlQuery>
#include <gtest/gtest.h>

using namespace Qt::StringLiterals;

namespace reportrt::layouttest {
namespace {

// A4 with 720-twip margins: 16838 - 1440 twips from the top margin to the bottom one
// (QPageSize gives 16837.8).
constexpr double bodyHeight = 16837.8 - 1440;

QJsonArray pageBands(const QJsonArray& details, int detailHeight = 300)
{
    return QJsonArray {
        section(u"PH"_s, 500, { textObject(u"Heading"_s, 0, 0) }),
        section(u"D"_s, detailHeight, details),
        section(u"PF"_s, 400,
            { textObject(u"Page"_s, 0, 0, 800),
                QJsonObject { { u"kind"_s, u"special"_s }, { u"special"_s, u"pageNumber"_s },
                    { u"left"_s, 900 }, { u"width"_s, 800 }, { u"height"_s, 240 } } }),
    };
}

QJsonArray nameDetail()
{
    return { fieldObject(u"{Items.Name}"_s, 0, 0) };
}

/// The first "Item n" text of each page.
QStringList firstItems(const std::vector<Page>& pages)
{
    QStringList result;
    for (const Page& page : pages) {
        QString first;
        for (const QString& t : texts(page)) {
            if (t.startsWith(u"Item "_s)) {
                first = t;
                break;
            }
        }
        result << first;
    }
    return result;
}

std::shared_ptr<Report> itemsReportFile(
    const QTemporaryDir& dir, int records, const QJsonObject& document, int perGroup = 5)
{
    const QString database = itemsDatabase(dir, records, perGroup);
    return openReport(writeReport(dir, document), database);
}

QByteArray png(const QSize& size, const QColor& color)
{
    QImage image(size, QImage::Format_RGB32);
    image.fill(color);
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "PNG");
    return bytes;
}

template <typename Case> std::string caseName(const testing::TestParamInfo<Case>& info)
{
    return info.param.name;
}

struct PaginationCase {
    const char* name;
    int records;
    int reportHeight; // report header, 0: none
    int footerHeight; // report footer, 0: none
    int pages;
    QStringList firstItems;
};

class Pagination : public testing::TestWithParam<PaginationCase> { };

TEST_P(Pagination, BreaksPagesWhereTheNextInstanceNoLongerFits)
{
    const PaginationCase& c = GetParam();
    QJsonArray bands = pageBands(nameDetail());
    if (c.reportHeight > 0)
        bands.append(section(u"RH"_s, c.reportHeight, { textObject(u"Title"_s, 0, 0) }));
    if (c.footerHeight > 0)
        bands.append(section(u"RF"_s, c.footerHeight, { textObject(u"The end"_s, 0, 0) }));
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, c.records, itemsReport(bands));
    const auto pages = layOut(*report);

    ASSERT_EQ(static_cast<int>(pages.size()), c.pages);
    EXPECT_EQ(firstItems(pages), c.firstItems);
    for (size_t i = 0; i < pages.size(); ++i) {
        const QStringList t = texts(pages[i]);
        // Every page has its header and its footer with its own number.
        EXPECT_TRUE(t.contains(u"Heading"_s)) << "page " << i + 1;
        EXPECT_EQ(t.last(), QString::number(i + 1)) << "page " << i + 1;
        for (const Page::Text& text : pages[i].texts)
            EXPECT_LT(text.origin.y(), pages[i].size.height() - 720) << "page " << i + 1;
    }
    const QStringList all = allTexts(pages);
    EXPECT_EQ(all.count(u"Title"_s), c.reportHeight > 0 ? 1 : 0);
    EXPECT_EQ(all.count(u"The end"_s), c.footerHeight > 0 ? 1 : 0);
    if (c.reportHeight > 0) {
        EXPECT_EQ(texts(pages.front()).indexOf(u"Title"_s), 0) << "the report header comes first";
    }
    if (c.footerHeight > 0) {
        EXPECT_TRUE(texts(pages.back()).contains(u"The end"_s));
    }
    EXPECT_EQ(all.count(u"Heading"_s), c.pages);
}

// Below the page header (500) and above the footer (400), 300-twip details: 48 fit a page
// (48 x 300 = 14400 of 14497.8).
INSTANTIATE_TEST_SUITE_P(Layout, Pagination,
    testing::Values(PaginationCase { "OnePage", 10, 0, 0, 1, { u"Item 1"_s } },
        PaginationCase { "TwoFullPages", 96, 0, 0, 2, { u"Item 1"_s, u"Item 49"_s } },
        PaginationCase {
            "OneMoreRecordStartsAPage", 97, 0, 0, 3, { u"Item 1"_s, u"Item 49"_s, u"Item 97"_s } },
        // 3000 twips of report header leave room for 38 details on the first page.
        PaginationCase { "ReportHeaderTakesRoom", 50, 3000, 0, 2, { u"Item 1"_s, u"Item 39"_s } },
        PaginationCase { "ReportFooterMovesOn", 48, 0, 500, 2, { u"Item 1"_s, QString() } },
        PaginationCase { "ReportFooterFits", 47, 0, 300, 1, { u"Item 1"_s } },
        PaginationCase { "NoRecordsStillOnePage", 0, 800, 300, 1, { QString() } }),
    caseName<PaginationCase>);

QJsonArray groupedBands(const QJsonObject& header, const QJsonObject& footer)
{
    QJsonArray bands = pageBands(
        { fieldObject(u"{Items.Name}"_s, 0, 0), fieldObject(u"{Items.Amount}"_s, 3000, 0) });
    bands.append(header);
    bands.append(footer);
    bands.append(section(u"RF"_s, 300,
        { textObject(u"Total"_s, 0, 0),
            QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, u"sum"_s },
                { u"field"_s, u"{Items.Amount}"_s }, { u"left"_s, 3000 }, { u"width"_s, 1500 },
                { u"height"_s, 240 } } }));
    return bands;
}

QJsonObject groupHeader(int height = 300)
{
    return section(u"GH1"_s, height, { fieldObject(u"{Items.Grp}"_s, 0, 0) });
}

QJsonObject groupFooter(int height = 300)
{
    const auto summary = [](const QString& operation, int left) {
        return QJsonObject { { u"kind"_s, u"summary"_s }, { u"operation"_s, operation },
            { u"field"_s, u"{Items.Amount}"_s }, { u"group"_s, 1 }, { u"left"_s, left },
            { u"width"_s, 1500 }, { u"height"_s, 240 } };
    };
    return section(u"GF1"_s, height,
        { textObject(u"Subtotal"_s, 0, 0), summary(u"count"_s, 1600), summary(u"sum"_s, 3000),
            summary(u"maximum"_s, 4600) });
}

QJsonArray byGroup()
{
    return { QJsonObject { { u"field"_s, u"{Items.Grp}"_s } } };
}

TEST(Groups, HeadersDetailsFootersAndSummariesComeInOrder)
{
    QTemporaryDir dir;
    auto report = itemsReportFile(
        dir, 12, itemsReport(groupedBands(groupHeader(), groupFooter()), byGroup()), 5);
    const auto pages = layOut(*report);
    ASSERT_EQ(pages.size(), 1u);
    // Groups of 5, 5 and 2 records; Amount = ID.
    const QStringList expected { u"Heading"_s, u"G01"_s, u"Item 1"_s, u"1"_s, u"Item 2"_s, u"2"_s,
        u"Item 3"_s, u"3"_s, u"Item 4"_s, u"4"_s, u"Item 5"_s, u"5"_s, u"Subtotal"_s, u"5"_s,
        u"15"_s, u"5"_s, u"G02"_s, u"Item 6"_s, u"6"_s, u"Item 7"_s, u"7"_s, u"Item 8"_s, u"8"_s,
        u"Item 9"_s, u"9"_s, u"Item 10"_s, u"10"_s, u"Subtotal"_s, u"5"_s, u"40"_s, u"10"_s,
        u"G03"_s, u"Item 11"_s, u"11"_s, u"Item 12"_s, u"12"_s, u"Subtotal"_s, u"2"_s, u"23"_s,
        u"12"_s, u"Total"_s, u"78"_s, u"Page"_s, u"1"_s };
    EXPECT_EQ(texts(pages.front()), expected);
}

TEST(Groups, AHeaderNeverEndsAPage)
{
    // Group = header + 5 details + footer = 7 slots of 300; a 1500-twip report header
    // takes 5 slots, so after six groups (42 slots) the seventh header would take the last
    // of the page's 48 slots: it goes to the next page with its first record.
    QJsonArray bands = groupedBands(groupHeader(), groupFooter());
    bands.append(section(u"RH"_s, 1500, { textObject(u"Title"_s, 0, 0) }));
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, 40, itemsReport(bands, byGroup()), 5);
    const auto pages = layOut(*report);
    ASSERT_EQ(pages.size(), 2u);
    const QStringList first = texts(pages[0]);
    const QStringList second = texts(pages[1]);
    EXPECT_FALSE(first.contains(u"G07"_s));
    EXPECT_EQ(first.at(first.size() - 3), u"30"_s) << "page 1 ends with group 6's footer";
    EXPECT_EQ(second.mid(0, 3), (QStringList { u"Heading"_s, u"G07"_s, u"Item 31"_s }));
}

struct NewPageCase {
    const char* name;
    bool beforeHeader;
    bool afterFooter;
    int footerHeight;
    int pages;
};

class NewPages : public testing::TestWithParam<NewPageCase> { };

TEST_P(NewPages, StartPagesWithoutBlankOnes)
{
    const NewPageCase& c = GetParam();
    QJsonObject header = groupHeader();
    header.insert(u"newPageBefore"_s, c.beforeHeader);
    QJsonObject footer = groupFooter();
    footer.insert(u"newPageAfter"_s, c.afterFooter);
    QJsonArray bands = groupedBands(header, footer);
    bands.replace(bands.size() - 1, section(u"RF"_s, c.footerHeight));
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, 15, itemsReport(bands, byGroup()), 5);
    const auto pages = layOut(*report);
    ASSERT_EQ(static_cast<int>(pages.size()), c.pages);
    for (const Page& page : pages)
        EXPECT_TRUE(texts(page).contains(u"Heading"_s));
    if (c.pages >= 3) {
        EXPECT_EQ(
            firstItems(pages).mid(0, 3), (QStringList { u"Item 1"_s, u"Item 6"_s, u"Item 11"_s }));
    }
}

INSTANTIATE_TEST_SUITE_P(Layout, NewPages,
    testing::Values(NewPageCase { "Neither", false, false, 300, 1 },
        // The first group header is first on its page already.
        NewPageCase { "BeforeEachGroup", true, false, 300, 3 },
        // An empty report footer does not get a page of its own.
        NewPageCase { "AfterEachGroup", false, true, 0, 3 },
        NewPageCase { "AfterEachGroupThenTheFooter", false, true, 300, 4 },
        NewPageCase { "Both", true, true, 0, 3 }),
    caseName<NewPageCase>);

QJsonObject special(const QString& kind, int left, const QString& format = QString())
{
    QJsonObject o { { u"kind"_s, u"special"_s }, { u"special"_s, kind }, { u"left"_s, left },
        { u"width"_s, 1500 }, { u"height"_s, 240 } };
    if (!format.isEmpty())
        o.insert(u"format"_s, format);
    return o;
}

TEST(SpecialFields, PageNumbersRecordNumbersAndThePrintDate)
{
    QJsonArray bands = pageBands(
        { fieldObject(u"{Items.Name}"_s, 0, 0), special(u"recordNumber"_s, 3000) }, 3000);
    bands.replace(2,
        section(u"PF"_s, 400,
            { special(u"pageNumber"_s, 0), special(u"totalPages"_s, 2000, u"#,##0"_s),
                special(u"printDate"_s, 4000, u"dd.mm.yyyy"_s) }));
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, 9, itemsReport(bands));
    FontTable fonts;
    TextShaper shaper(fonts);
    ASSERT_TRUE(LayoutEngine::showsTotalPages(*report));
    const int total = LayoutEngine(*report, shaper).run({});
    // 3000-twip details: 4 per page.
    ASSERT_EQ(total, 3);
    LayoutEngine engine(*report, shaper);
    engine.setTotalPages(total);
    engine.setPrintDate(QDateTime(QDate(2026, 12, 6), QTime(22, 48)));
    std::vector<Page> pages;
    engine.run([&](Page&& page) { pages.push_back(std::move(page)); });
    ASSERT_EQ(pages.size(), 3u);
    EXPECT_EQ(texts(pages[2]),
        (QStringList { u"Heading"_s, u"Item 9"_s, u"9"_s, u"3"_s, u"3"_s, u"06.12.2026"_s }));
    EXPECT_EQ(texts(pages[0]).mid(texts(pages[0]).size() - 3),
        (QStringList { u"1"_s, u"3"_s, u"06.12.2026"_s }));
}

QJsonObject noteObject(bool canGrow, int width)
{
    QJsonObject note = fieldObject(u"{Items.Note}"_s, 2000, 0, width, 240);
    note.insert(u"canGrow"_s, canGrow);
    return note;
}

void setNotes(const QString& database, const QString& note, int id)
{
    QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, u"notes"_s);
    db.setDatabaseName(database);
    ASSERT_TRUE(db.open());
    QSqlQuery query(db);
    query.prepare(u"UPDATE Items SET Note = ? WHERE ID = ?"_s);
    query.addBindValue(note);
    query.addBindValue(id);
    ASSERT_TRUE(query.exec());
    db.close();
    db = QSqlDatabase();
    QSqlDatabase::removeDatabase(u"notes"_s);
}

TEST(CanGrow, TextWrapsAndItsSectionGrows)
{
    const QString note = u"Delivered to the back door. The customer asks that every later "
                         "delivery come before noon, and that invoices go by mail."_s;
    for (const bool canGrow : { true, false }) {
        SCOPED_TRACE(canGrow ? "can grow" : "fixed");
        QTemporaryDir dir;
        const QString database = itemsDatabase(dir, 3);
        setNotes(database, note, 2);
        auto report = openReport(
            writeReport(dir,
                itemsReport(pageBands(
                    { fieldObject(u"{Items.Name}"_s, 0, 0, 1800), noteObject(canGrow, 3000) }))),
            database);
        const auto pages = layOut(*report);
        ASSERT_EQ(pages.size(), 1u);
        std::vector<const Page::Text*> notes;
        double item3 = 0;
        double item2 = 0;
        for (const auto& t : pages[0].texts) {
            if (t.origin.x() >= 720 + 2000 && t.origin.x() < 720 + 5000)
                notes.push_back(&t);
            if (t.text->source == u"Item 3"_s)
                item3 = t.origin.y();
            if (t.text->source == u"Item 2"_s)
                item2 = t.origin.y();
        }
        if (canGrow) {
            ASSERT_GT(notes.size(), 2u);
            QString joined;
            for (const auto* t : notes) {
                EXPECT_EQ(t->glyphCount, t->text->glyphCount()) << "a wrapped line fits";
                EXPECT_LE(t->text->width(), 3000.5);
                joined += (joined.isEmpty() ? u""_s : u" "_s) + t->text->source;
            }
            EXPECT_EQ(joined, note);
            // The next detail moves down by the lines beyond the first.
            const double lineHeight = notes[1]->origin.y() - notes[0]->origin.y();
            EXPECT_GT(lineHeight, 200);
            EXPECT_NEAR(item3 - item2,
                300 + lineHeight * static_cast<double>(notes.size() - 1) - (300 - 240), lineHeight);
        } else {
            ASSERT_EQ(notes.size(), 1u);
            EXPECT_LT(notes[0]->glyphCount, notes[0]->text->glyphCount()) << "cut at the width";
            EXPECT_DOUBLE_EQ(item3 - item2, 300);
        }
    }
}

TEST(Oversize, ASectionTallerThanThePageTakesAPageOfItsOwn)
{
    QTemporaryDir dir;
    QJsonArray bands = pageBands(
        { fieldObject(u"{Items.Name}"_s, 0, 0), fieldObject(u"{Items.Name}"_s, 0, 30000) }, 40000);
    auto report = itemsReportFile(dir, 3, itemsReport(bands));
    const auto pages = layOut(*report);
    ASSERT_EQ(pages.size(), 3u);
    EXPECT_EQ(firstItems(pages), (QStringList { u"Item 1"_s, u"Item 2"_s, u"Item 3"_s }));
    for (const Page& page : pages) {
        // The object 30000 twips down is off the page: not drawn.
        EXPECT_EQ(texts(page).count(u"Item 1"_s) + texts(page).count(u"Item 2"_s)
                + texts(page).count(u"Item 3"_s),
            1);
    }
}

/// A report with a picture object in its details, for format-event tests.
QJsonObject pictureReport(int detailHeight = 1500)
{
    const QJsonObject picture { { u"kind"_s, u"picture"_s }, { u"name"_s, u"Photo"_s },
        { u"left"_s, 2000 }, { u"top"_s, 100 }, { u"width"_s, 1000 }, { u"height"_s, 1000 },
        { u"image"_s, QString::fromLatin1(png(QSize(20, 20), Qt::blue).toBase64()) } };
    return itemsReport(pageBands(
        { fieldObject(u"{Items.Name}"_s, 0, 0), fieldObject(u"{Items.ID}"_s, 0, 300), picture },
        detailHeight));
}

std::shared_ptr<ReportObject> objectNamed(
    Report& report, const QString& section, const QString& name)
{
    for (const auto& s : report.sections()) {
        if (s->name() != section)
            continue;
        for (const auto& o : static_cast<Section*>(s.get())->objects()) {
            if (o->name() == name)
                return o;
        }
    }
    return nullptr;
}

std::shared_ptr<runtime::Section> sectionNamed(Report& report, const QString& name)
{
    for (const auto& s : report.sections()) {
        if (s->name() == name)
            return s;
    }
    return nullptr;
}

TEST(FormatEvents, ChangesApplyToTheirInstanceOnly)
{
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, 4, pictureReport());
    auto picture = objectNamed(*report, u"D"_s, u"Photo"_s);
    ASSERT_TRUE(picture);
    EXPECT_EQ(picture->typeName(), u"ICROleObject"_s);
    const QImage red = [] {
        QImage image(40, 10, QImage::Format_RGB32);
        image.fill(Qt::red);
        return image;
    }();
    std::vector<int> seen;
    auto detail = sectionNamed(*report, u"D"_s);
    detail->addFormatHandler([&] {
        // Handlers see the record being formatted through the field objects.
        int current = 0;
        for (const auto& o : detail->reportObjects()) {
            if (o->typeName() == u"IFieldObject"_s && o->fieldName() == u"{Items.ID}"_s)
                current = o->value().toLong();
        }
        seen.push_back(current);
        if (current == 2) {
            picture->setPicture(red);
            picture->setLeft(1500);
            picture->setWidth(4000);
            picture->setHeight(1000);
        }
    });
    const auto pages = layOut(*report);
    EXPECT_EQ(seen, (std::vector<int> { 1, 2, 3, 4 })) << "one event per instance";
    ASSERT_EQ(pages.size(), 1u);
    ASSERT_EQ(pages[0].pictures.size(), 4u);
    for (size_t i = 0; i < 4; ++i) {
        const Page::Picture& p = pages[0].pictures[i];
        const double top = 720 + 500 + 1500.0 * static_cast<double>(i) + 100;
        if (i == 1) {
            // 40 x 10 fitted into 4000 x 1000 at (1500, top).
            EXPECT_EQ(p.target, QRectF(720 + 1500, top, 4000, 1000));
            EXPECT_EQ(p.image.pixelColor(0, 0), QColor(Qt::red));
        } else {
            EXPECT_EQ(p.target, QRectF(720 + 2000, top, 1000, 1000));
            EXPECT_EQ(p.image.pixelColor(0, 0), QColor(Qt::blue));
        }
    }
    // Back as designed after the layout.
    EXPECT_EQ(picture->left(), 2000);
    EXPECT_EQ(picture->width(), 1000);
    EXPECT_EQ(picture->picture().pixelColor(0, 0), QColor(Qt::blue));
}

TEST(FormatEvents, AHandlerThatGrowsAnObjectGrowsItsSection)
{
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, 3, pictureReport(1500));
    auto picture = objectNamed(*report, u"D"_s, u"Photo"_s);
    auto detail = sectionNamed(*report, u"D"_s);
    int count = 0;
    detail->addFormatHandler([&] {
        if (++count == 1)
            picture->setHeight(3000);
    });
    const auto pages = layOut(*report);
    ASSERT_EQ(pages.size(), 1u);
    const QStringList t = texts(pages[0]);
    double item2 = 0;
    for (const auto& text : pages[0].texts) {
        if (text.text->source == u"Item 2"_s)
            item2 = text.origin.y();
    }
    // The first instance ends below its picture (top 100 + 3000) instead of at 1500.
    double item1 = 0;
    for (const auto& text : pages[0].texts) {
        if (text.text->source == u"Item 1"_s)
            item1 = text.origin.y();
    }
    EXPECT_DOUBLE_EQ(item2 - item1, 3100);
}

TEST(FormatEvents, AbsurdSizesAndBadPicturesAreSkippedNotFatal)
{
    QTemporaryDir dir;
    auto report = itemsReportFile(dir, 3, pictureReport());
    auto picture = objectNamed(*report, u"D"_s, u"Photo"_s);
    auto detail = sectionNamed(*report, u"D"_s);
    int count = 0;
    detail->addFormatHandler([&] {
        switch (++count) {
        case 1:
            // Far off the page.
            picture->setLeft(999999);
            picture->setWidth(1000000);
            break;
        case 2:
            // Taller than any page.
            picture->setHeight(1000000);
            break;
        case 3:
            picture->setPicture(QImage());
            break;
        }
    });
    // Positions outside 0..1,000,000 twips are refused with the runtime's error.
    EXPECT_THROW(picture->setWidth(-5), core::ComError);
    EXPECT_THROW(picture->setTop(1000001), core::ComError);
    const auto pages = layOut(*report);
    // Instance 2 needs a page of its own (cut at its end), instance 3 follows.
    ASSERT_EQ(pages.size(), 3u);
    EXPECT_TRUE(pages[0].pictures.empty());
    ASSERT_EQ(pages[1].pictures.size(), 1u);
    EXPECT_LE(pages[1].pictures[0].clip.bottom(), pages[1].size.height());
    EXPECT_TRUE(pages[2].pictures.empty()) << "an empty picture draws nothing";
    EXPECT_EQ(firstItems(pages), (QStringList { u"Item 1"_s, u"Item 2"_s, u"Item 3"_s }));
}

TEST(Pictures, AnEmbeddedFileThatIsNoPictureIsSkipped)
{
    QTemporaryDir dir;
    QJsonObject document = pictureReport();
    QJsonArray sections = document.value(u"sections"_s).toArray();
    QJsonObject detail = sections[1].toObject();
    QJsonArray objects = detail.value(u"objects"_s).toArray();
    QJsonObject broken = objects.last().toObject();
    broken.insert(u"name"_s, u"Broken"_s);
    broken.insert(u"image"_s, QString::fromLatin1(QByteArray("GIF89a, or so it says").toBase64()));
    objects.append(broken);
    detail.insert(u"objects"_s, objects);
    sections.replace(1, detail);
    document.insert(u"sections"_s, sections);
    auto report = itemsReportFile(dir, 2, document);
    EXPECT_TRUE(objectNamed(*report, u"D"_s, u"Broken"_s)->picture().isNull());
    const auto pages = layOut(*report);
    ASSERT_EQ(pages.size(), 1u);
    EXPECT_EQ(pages[0].pictures.size(), 2u) << "only the good picture, once per record";
}

TEST(Margins, ThatLeaveNoRoomAreAnError)
{
    QTemporaryDir dir;
    QJsonObject document = itemsReport(pageBands(nameDetail()));
    document.insert(u"page"_s,
        QJsonObject { { u"paperSize"_s, 9 },
            { u"margins"_s, QJsonObject { { u"left"_s, 6000 }, { u"right"_s, 6000 } } } });
    auto report = itemsReportFile(dir, 2, document);
    try {
        layOut(*report);
        FAIL() << "laid out";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), Error::RuntimeFailure);
        EXPECT_TRUE(error.description().contains(u"margins"_s));
    }
}

TEST(Blobs, PicturesComeFromTheFieldAndNonPicturesAreSkipped)
{
    QTemporaryDir dir;
    const QString database = itemsDatabase(dir, 3);
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, u"blobs"_s);
        db.setDatabaseName(database);
        ASSERT_TRUE(db.open());
        QSqlQuery query(db);
        query.prepare(u"UPDATE Items SET Picture = ? WHERE ID = ?"_s);
        query.addBindValue(png(QSize(100, 50), Qt::green));
        query.addBindValue(1);
        ASSERT_TRUE(query.exec());
        query.addBindValue(QByteArray("this is not a picture at all"));
        query.addBindValue(2);
        ASSERT_TRUE(query.exec());
        db.close();
    }
    QSqlDatabase::removeDatabase(u"blobs"_s);
    const QJsonObject blob { { u"kind"_s, u"blob"_s }, { u"name"_s, u"Stored"_s },
        { u"field"_s, u"{Items.Picture}"_s }, { u"left"_s, 2000 }, { u"top"_s, 0 },
        { u"width"_s, 1000 }, { u"height"_s, 1000 } };
    auto report = openReport(
        writeReport(
            dir, itemsReport(pageBands({ fieldObject(u"{Items.Name}"_s, 0, 0), blob }, 1200))),
        database);
    auto object = objectNamed(*report, u"D"_s, u"Stored"_s);
    EXPECT_EQ(object->typeName(), u"IBlobFieldObject"_s);
    EXPECT_EQ(object->fieldName(), u"{Items.Picture}"_s);
    const auto pages = layOut(*report);
    ASSERT_EQ(pages.size(), 1u);
    // Only record 1 has a picture; 100 x 50 fits the 1000 x 1000 box as 1000 x 500, centred.
    ASSERT_EQ(pages[0].pictures.size(), 1u);
    EXPECT_EQ(pages[0].pictures[0].target, QRectF(720 + 2000, 720 + 500 + 250, 1000, 500));
    EXPECT_EQ(firstItems(pages), QStringList { u"Item 1"_s });
    EXPECT_EQ(allTexts(pages).count(u"Item 2"_s), 1);
}

TEST(Subreports, EachInstanceShowsItsLinkedRecords)
{
    auto report = openExample(u"customer-orders.rpt"_s);
    const auto pages = layOut(*report);
    ASSERT_GT(pages.size(), 5u);

    // Orders per customer from the database, to compare with each subreport's count.
    std::map<QString, int> expected;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, u"check"_s);
        db.setDatabaseName(sampleDatabase());
        ASSERT_TRUE(db.open());
        QSqlQuery query(u"SELECT c.Name, COUNT(o.OrderID) FROM Customers c LEFT JOIN Orders o ON "
                        "o.CustomerID = c.CustomerID WHERE c.Country IN ('Estonia', 'Latvia') "
                        "GROUP BY c.CustomerID"_s,
            db);
        while (query.next())
            expected[query.value(0).toString()] += query.value(1).toInt();
        db.close();
    }
    QSqlDatabase::removeDatabase(u"check"_s);

    // Walk the texts: a customer name, then its orders, then "<count>" "orders".
    std::map<QString, int> counted;
    QString customer;
    const QStringList all = allTexts(pages);
    for (qsizetype i = 0; i + 1 < all.size(); ++i) {
        if (expected.count(all[i]) && customer.isEmpty())
            customer = all[i];
        if (all[i + 1] == u"orders"_s && !customer.isEmpty()) {
            counted[customer] += all[i].toInt();
            customer.clear();
        }
    }
    EXPECT_EQ(counted, expected);
    // Long lists of orders continue on the next page, below its page header (a rule).
    int continued = 0;
    for (size_t p = 1; p < pages.size(); ++p) {
        const QStringList t = texts(pages[p]);
        ASSERT_FALSE(pages[p].lines.empty());
        if (!t.isEmpty() && !t.first().isEmpty() && t.first().at(0).isDigit())
            ++continued;
    }
    EXPECT_GE(continued, 1);
}

TEST(TopN, OnlyTheLargestGroupsArePrintedLargestFirst)
{
    QStringList expected;
    {
        QSqlDatabase db = QSqlDatabase::addDatabase(u"QSQLITE"_s, u"top"_s);
        db.setDatabaseName(sampleDatabase());
        ASSERT_TRUE(db.open());
        QSqlQuery query(u"SELECT c.Name FROM Orders o JOIN Customers c ON c.CustomerID = "
                        "o.CustomerID WHERE o.Status <> 'Cancelled' GROUP BY c.Name "
                        "ORDER BY SUM(o.Amount) DESC LIMIT 25"_s,
            db);
        while (query.next())
            expected << query.value(0).toString();
        db.close();
    }
    QSqlDatabase::removeDatabase(u"top"_s);

    auto report = openExample(u"orders-by-customer.rpt"_s);
    const auto pages = layOut(*report);
    // The customer's name in a group header is the dark blue text at the left margin (the
    // title above the first page's header is the other).
    QStringList headers;
    for (const Page& page : pages) {
        for (const auto& t : page.texts) {
            if (t.origin.x() == 720 && t.color == 0xff1f3a5f)
                headers << t.text->source;
        }
    }
    ASSERT_FALSE(headers.isEmpty());
    EXPECT_EQ(headers.takeFirst(), u"Orders by customer"_s);
    EXPECT_EQ(headers, expected);
}

} // namespace
} // namespace reportrt::layouttest
