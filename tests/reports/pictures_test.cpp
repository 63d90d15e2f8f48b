// The picture fields of a report over the scriptable fake runtime: the host's picture in the
// report's OLE object, picture files named by the data in "LUDPICTURE_" objects, and stored
// images of the file store sized into their box.

#include "platform/twips.h"
#include "reportfixture.h"

#include <QBuffer>
#include <QFile>
#include <QImage>
#include <QImageReader>
#include <QTemporaryDir>

namespace {

using namespace reporttest;
using fakeruntime::FakeReportObject;
using fakeruntime::FakeSection;

QByteArray encoded(const QImage& image, const char* format)
{
    QByteArray bytes;
    QBuffer buffer(&bytes);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, format);
    return bytes;
}

QImage filled(int width, int height, QColor color = Qt::red)
{
    QImage image(width, height, QImage::Format_RGB32);
    image.fill(color);
    return image;
}

core::VariantArray byteArray(const QByteArray& bytes)
{
    std::vector<core::Variant> values;
    for (const char byte : bytes)
        values.emplace_back(static_cast<uint8_t>(byte));
    return core::VariantArray::fromList(values);
}

class ReportPictures : public ReportTest {
protected:
    void SetUp() override
    {
        ReportTest::SetUp();
        ASSERT_TRUE(m_folder.isValid());
    }

    /// A file in the test's folder with `bytes` in it.
    QString file(const QString& name, const QByteArray& bytes)
    {
        const QString path = m_folder.filePath(name);
        QFile out(path);
        EXPECT_TRUE(out.open(QIODevice::WriteOnly));
        out.write(bytes);
        return path;
    }

    /// A report whose page header holds the OLE object "Logo" with a designed picture.
    std::shared_ptr<FakeReportObject> addLogoReport()
    {
        auto report = addOrdersReport();
        m_section = report->addSection(u"PH"_s);
        FakeReportObject::State logo;
        logo.typeName = u"ICROleObject"_s;
        logo.name = u"Logo"_s;
        logo.picture = designed();
        return m_section->addObject(logo);
    }

    static QImage designed() { return filled(3, 3, Qt::blue); }

    QTemporaryDir m_folder;
    std::shared_ptr<FakeSection> m_section;
};

TEST_F(ReportPictures, TheHostsPictureFillsTheOleObject)
{
    const QString png = file(u"logo.png"_s, encoded(filled(40, 20), "PNG"));
    const QString broken = file(u"broken.png"_s, "not a picture");
    const QByteArray gif = QByteArray::fromHex(
        "47494638396101000100800000000000ffffff21f90401000000002c00000000010001000002024401003b");
    struct Case {
        const char* name;
        QString olePath;
        QByteArray bytes; // empty: PictureBytes stays as it started
        QSize expected; // invalid: the designed picture stays
    };
    std::vector<Case> cases {
        { "a picture file", png, {}, QSize(40, 20) },
        { "the file wins over the bytes", png, encoded(filled(7, 5), "PNG"), QSize(40, 20) },
        { "PNG bytes", {}, encoded(filled(7, 5), "PNG"), QSize(7, 5) },
        { "JPEG bytes", {}, encoded(filled(8, 6), "JPEG"), QSize(8, 6) },
        { "BMP bytes", {}, encoded(filled(9, 4), "BMP"), QSize(9, 4) },
        { "GIF bytes", {}, gif, QSize(1, 1) },
        { "one byte is no picture", {}, QByteArray(1, 'x'), {} },
        { "bytes that are not a picture", {}, "neither PNG nor JPEG", {} },
        { "a missing file", m_folder.filePath(u"missing.png"_s), {}, {} },
        { "a file that is not a picture", broken, {}, {} },
        { "a folder", m_folder.path(), {}, {} },
        { "nothing set", {}, {}, {} },
    };
    if (QImageReader::supportedImageFormats().contains("svg"))
        cases.push_back({ "SVG bytes", {},
            "<svg xmlns='http://www.w3.org/2000/svg' width='12' height='6'>"
            "<rect width='12' height='6' fill='red'/></svg>",
            QSize(12, 6) });
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        auto report = local.addReport(u"orders.rpt"_s);
        report->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        auto section = report->addSection(u"PH"_s);
        FakeReportObject::State state;
        state.typeName = u"ICROleObject"_s;
        state.name = u"Logo"_s;
        state.picture = designed();
        auto logo = section->addObject(state);
        const auto moxReport = open();
        moxReport->OlePath(c.olePath);
        if (!c.bytes.isEmpty())
            moxReport->PictureBytes(byteArray(c.bytes));
        ASSERT_TRUE(load(*moxReport));

        section->fireFormat();
        if (c.expected.isValid())
            EXPECT_EQ(logo->state.picture.size(), c.expected);
        else
            EXPECT_EQ(logo->state.picture, designed());
    }
}

TEST_F(ReportPictures, PictureBytesAreCopiedAndChecked)
{
    const auto report = open();
    const core::VariantArray initial = report->PictureBytes();
    EXPECT_EQ(initial.size(), 1u) << "one element until the host gives bytes";
    EXPECT_EQ(initial.ubound(), 0);

    core::VariantArray given = byteArray("\x89PNG");
    report->PictureBytes(given);
    given.at(0) = core::Variant(uint8_t(0));
    EXPECT_EQ(report->PictureBytes().at(0).toByte(), 0x89) << "Let copies the host's array";
    EXPECT_EQ(report->PictureBytes().at(0).type(), core::VariantType::Byte);

    // Numbers from a host that has no byte type are taken when they fit.
    report->PictureBytes(core::VariantArray::fromList({ int32_t(1), 2.0, u"3"_s }));
    EXPECT_EQ(report->PictureBytes().size(), 3u);

    struct Case {
        const char* name;
        core::VariantArray value;
        int32_t error;
    };
    const Case cases[] = {
        { "a value above a byte", core::VariantArray::fromList({ int32_t(1), int32_t(256) }), 6 },
        { "text that is no number", core::VariantArray::fromList({ u"x"_s }), 13 },
        { "a table of bytes", core::VariantArray({ { 0, 1 }, { 0, 1 } }, core::VariantType::Byte),
            13 },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        try {
            report->PictureBytes(c.value);
            ADD_FAILURE() << "expected an error";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), c.error);
        }
        EXPECT_EQ(report->PictureBytes().size(), 3u) << "the bytes stay as they were";
    }
}

TEST_F(ReportPictures, APictureFileNamedByTheDataKeepsItsProportions)
{
    const QString wide = file(u"wide.png"_s, encoded(filled(200, 100), "PNG"));
    const QString odd = file(u"odd.png"_s, encoded(filled(3, 1), "PNG"));
    const QString junk = file(u"junk.png"_s, "junk");
    struct Case {
        const char* name;
        QString objectName;
        QString fieldObject;
        core::Variant value;
        int32_t expectedHeight; // 0: the object stays as designed
    };
    const Case cases[] = {
        { "a picture at the object's width", u"LUDPICTURE_LogoPath"_s, u"LogoPath"_s, wide, 500 },
        { "names compared without regard to case", u"ludpicture_logopath"_s, u"LOGOPATH"_s, wide,
            500 },
        // 1 × 1000 ÷ 3 = 333.33...
        { "a height rounded to a whole twip", u"LUDPICTURE_LogoPath"_s, u"LogoPath"_s, odd, 333 },
        { "an empty field", u"LUDPICTURE_LogoPath"_s, u"LogoPath"_s, u""_s, 0 },
        { "a Null field", u"LUDPICTURE_LogoPath"_s, u"LogoPath"_s, core::Variant::null(), 0 },
        { "a path that is no picture", u"LUDPICTURE_LogoPath"_s, u"LogoPath"_s, junk, 0 },
        { "a path to a folder", u"LUDPICTURE_LogoPath"_s, u"LogoPath"_s, m_folder.path(), 0 },
        { "no field of that name", u"LUDPICTURE_LogoPath"_s, u"Other"_s, wide, 0 },
        { "an object without the prefix", u"LUDPICTUREX"_s, u"X"_s, wide, 0 },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        auto report = local.addReport(u"orders.rpt"_s);
        report->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        auto section = report->addSection(u"D"_s);
        FakeReportObject::State field;
        field.typeName = u"IFieldObject"_s;
        field.name = c.fieldObject;
        field.fieldName = u"{Customers.LogoPath}"_s;
        field.value = c.value;
        section->addObject(field);
        FakeReportObject::State picture;
        picture.typeName = u"ICROleObject"_s;
        picture.name = c.objectName;
        picture.width = 1000;
        picture.height = 700;
        picture.picture = designed();
        auto object = section->addObject(picture);
        const auto moxReport = open();
        ASSERT_TRUE(load(*moxReport));

        section->fireFormat();
        if (c.expectedHeight == 0) {
            EXPECT_EQ(object->state.picture, designed());
            EXPECT_EQ(object->state.height, 700);
        } else {
            EXPECT_FALSE(object->state.picture == designed());
            EXPECT_EQ(object->state.height, c.expectedHeight);
        }
        EXPECT_EQ(object->state.width, 1000);
    }
}

TEST_F(ReportPictures, StoredImagesAreFittedIntoTheirBoxAndCentred)
{
    ASSERT_EQ(platform::twipsPerPixelX(), 15.0) << "the sizes below are at 96 DPI";
    ASSERT_EQ(platform::twipsPerPixelY(), 15.0);
    struct Case {
        const char* name;
        QString blobField;
        core::Variant pixelsWide;
        core::Variant pixelsHigh;
        QRect expected; // left, top, width, height in twips, from a 750 × 750 box at 1000, 2000
    };
    const Case cases[] = {
        // 1500 × 750 twips: the width fits the box, the height follows; 375 − 187.5 is 187.5,
        // rounded to the even 188.
        { "a wide image", u"{LUDFile.Filedata}"_s, int32_t(100), int32_t(50),
            QRect(1000, 2188, 750, 375) },
        { "a tall image", u"{LUDFile.Filedata}"_s, int32_t(50), int32_t(100),
            QRect(1188, 2000, 375, 750) },
        { "a small image keeps its size", u"{LUDFile.Filedata}"_s, int32_t(20), int32_t(10),
            QRect(1225, 2300, 300, 150) },
        { "sizes given as text", u"{ludfile.FILEDATA}"_s, u"20"_s, u"10"_s,
            QRect(1225, 2300, 300, 150) },
        { "not the file store's image", u"{Products.Picture}"_s, int32_t(100), int32_t(50),
            QRect(1000, 2000, 750, 750) },
        { "no width", u"{LUDFile.Filedata}"_s, int32_t(0), int32_t(50),
            QRect(1000, 2000, 750, 750) },
        { "an empty height", u"{LUDFile.Filedata}"_s, int32_t(100), core::Variant::null(),
            QRect(1000, 2000, 750, 750) },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        collection->Remove(u"orders.rpt"_s);
        fakeruntime::FakeRuntime local;
        engine::ReleaseApplication();
        auto report = local.addReport(u"orders.rpt"_s);
        report->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        auto section = report->addSection(u"D"_s);
        FakeReportObject::State blob;
        blob.typeName = u"IBlobFieldObject"_s;
        blob.name = u"Picture"_s;
        blob.fieldName = c.blobField;
        blob.left = 1000;
        blob.top = 2000;
        blob.width = 750;
        blob.height = 750;
        auto object = section->addObject(blob);
        section->addObject(u"ITextObject"_s, u"Caption"_s);
        FakeReportObject::State width;
        width.typeName = u"IFieldObject"_s;
        width.name = u"W"_s;
        width.fieldName = u"{LUDFile.Width}"_s;
        width.value = c.pixelsWide;
        section->addObject(width);
        FakeReportObject::State height = width;
        height.name = u"H"_s;
        height.fieldName = u"{LUDFile.Height}"_s;
        height.value = c.pixelsHigh;
        section->addObject(height);
        const auto moxReport = open();
        ASSERT_TRUE(load(*moxReport));

        section->fireFormat();
        EXPECT_EQ(
            QRect(object->state.left, object->state.top, object->state.width, object->state.height),
            c.expected);
    }
}

TEST_F(ReportPictures, RuntimeErrorsInAHandlerStayThere)
{
    auto logo = addLogoReport();
    const QString png = file(u"logo.png"_s, encoded(filled(40, 20), "PNG"));
    fake.failAlways(u"Object(Logo).setPicture"_s, runtimeError(RuntimeFailure));
    const auto report = open();
    report->OlePath(png);
    ASSERT_TRUE(load(*report));

    EXPECT_NO_THROW(m_section->fireFormat());
    EXPECT_EQ(logo->state.picture, designed());
}

} // namespace
