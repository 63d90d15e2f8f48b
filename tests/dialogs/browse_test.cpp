#include "dialogs/frmcalendar.h"
#include "dialogs/frmeditor.h"
#include "platform/scripteddialogservice.h"
#include "widgetfixture.h"

#include <QPlainTextEdit>
#include <QPushButton>

using namespace dialogs;
using namespace widgettest;
using namespace Qt::StringLiterals;
using core::Variant;
using platform::ScriptedDialogService;

namespace {

class BrowseTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        QLocale::setDefault(QLocale(QLocale::Estonian, QLocale::Estonia));
        setDateEntrySettings(DateEntrySettings::fromShortDate(u"31.12.1899"_s, u"."_s));
        engine::gLanguage = 3;
        engine::gXPStyle = false;
        platform::DialogService::setActive(service);
    }
    void TearDown() override { platform::DialogService::setActive(nullptr); }

    std::shared_ptr<InputBoxParamsItem> item(const QString& name) { return params->Item(name); }
    template <typename T> T* control(const QString& name) { return child<T>(box.get(), name); }
    void clickBrowse(int index)
    {
        QTest::mouseClick(control<QPushButton>(u"cmdBrowse_%1"_s.arg(index)), Qt::LeftButton);
    }
    void clickOK() { QTest::mouseClick(control<QPushButton>(u"cmdOK"_s), Qt::LeftButton); }

    GlobalsGuard guard;
    std::shared_ptr<ScriptedDialogService> service = std::make_shared<ScriptedDialogService>();
    std::shared_ptr<InputBoxParams> params = std::make_shared<InputBoxParams>();
    std::unique_ptr<frmInputBox> box;
};

} // namespace

TEST_F(BrowseTest, ColourPickerSetsTheSwatchAndCancellingKeepsIt)
{
    auto colour = item(u"Colour"_s);
    colour->IsColor = true;
    colour->Value = Variant(int32_t(0x00FF00));
    box = showBox(params);
    auto* swatch = control<QLineEdit>(u"txMData_1"_s);
    EXPECT_EQ(swatch->text(), u"65280"_s);
    EXPECT_EQ(swatch->palette().color(QPalette::Base), QColor(0, 255, 0));

    service->cancel();
    clickBrowse(1);
    EXPECT_EQ(swatch->text(), u"65280"_s);
    ASSERT_EQ(service->calls().size(), 1);
    EXPECT_EQ(service->calls()[0].initialColor, 0x00FF00);
    EXPECT_NE(service->calls()[0].ownerWindow, 0);

    // The colour number is 0x00BBGGRR: 255 is red.
    service->answerColor(255);
    clickBrowse(1);
    EXPECT_EQ(swatch->text(), u"255"_s);
    EXPECT_EQ(swatch->palette().color(QPalette::Base), QColor(255, 0, 0));
    EXPECT_EQ(box->focusWidget(), swatch);
    clickOK();
    EXPECT_EQ(colour->Value, Variant(u"255"_s));
}

TEST_F(BrowseTest, TypedColourNumbersColourTheSwatchWhenLeft)
{
    item(u"Colour"_s)->IsColor = true;
    item(u"Note"_s);
    box = showBox(params);
    auto* swatch = control<QLineEdit>(u"txMData_1"_s);
    QTest::keyClicks(swatch, u"16x711680"_s);
    EXPECT_EQ(swatch->text(), u"16711680"_s);
    QTest::keyClick(swatch, Qt::Key_Tab);
    EXPECT_EQ(swatch->palette().color(QPalette::Base), QColor(0, 0, 255));
    clickOK();
    EXPECT_EQ(item(u"Colour"_s)->Value, Variant(u"16711680"_s));
}

struct FileCase {
    const char* name;
    QString text;
    QString folder;
    QString fileName;
};

class FilePickerTest : public BrowseTest, public ::testing::WithParamInterface<FileCase> { };

TEST_P(FilePickerTest, OpensInTheFieldsFolderWithItsName)
{
    item(u"Report"_s)->IsFileDialog = true;
    item(u"Report"_s)->Value = Variant(GetParam().text);
    box = showBox(params);
    service->answerPath(u"/srv/out/chosen.rpt"_s);
    clickBrowse(1);
    ASSERT_EQ(service->calls().size(), 1);
    const ScriptedDialogService::Call call = service->calls()[0];
    EXPECT_EQ(call.picker, ScriptedDialogService::Picker::OpenFile);
    EXPECT_EQ(call.initialDirectory, GetParam().folder);
    EXPECT_EQ(call.fileName, GetParam().fileName);
    EXPECT_EQ(call.flags, 4100);
    EXPECT_TRUE(call.title.isEmpty());
    EXPECT_TRUE(call.filter.isEmpty());
    EXPECT_EQ(control<QLineEdit>(u"txMData_1"_s)->text(), u"/srv/out/chosen.rpt"_s);
    clickOK();
    EXPECT_EQ(item(u"Report"_s)->Value, Variant(u"/srv/out/chosen.rpt"_s));
}

INSTANTIATE_TEST_SUITE_P(Paths, FilePickerTest,
    ::testing::Values(FileCase { "UnixPath", u"/data/reports/report.txt"_s, u"/data/reports/"_s,
                          u"report.txt"_s },
        FileCase { "BackslashPath", u"C:\\Data\\report.txt"_s, u"C:\\Data\\"_s, u"report.txt"_s },
        FileCase { "NameOnly", u"report.txt"_s, QString(), u"report.txt"_s }),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(BrowseTest, CancelledFilePickerKeepsTheText)
{
    item(u"Report"_s)->IsFileDialog = true;
    item(u"Report"_s)->Value = Variant(u"/data/a.txt"_s);
    box = showBox(params);
    service->cancel();
    QTest::keyClick(control<QLineEdit>(u"txMData_1"_s), Qt::Key_F4);
    EXPECT_EQ(service->calls().size(), 1);
    EXPECT_EQ(control<QLineEdit>(u"txMData_1"_s)->text(), u"/data/a.txt"_s);
}

TEST_F(BrowseTest, FolderPickerStartsInTheFieldsFolder)
{
    item(u"Folder"_s)->IsFileDialog = true;
    item(u"Folder"_s)->AskFolder = true;
    item(u"Folder"_s)->Value = Variant(u"/data/exports"_s);
    box = showBox(params);
    service->answerPath(u"/data/archive"_s);
    // F4 acts as the browse button.
    QTest::keyClick(control<QLineEdit>(u"txMData_1"_s), Qt::Key_F4);
    ASSERT_EQ(service->calls().size(), 1);
    EXPECT_EQ(service->calls()[0].picker, ScriptedDialogService::Picker::Folder);
    EXPECT_EQ(service->calls()[0].initialDirectory, u"/data/exports"_s);
    EXPECT_TRUE(service->calls()[0].title.isEmpty());
    clickOK();
    EXPECT_EQ(item(u"Folder"_s)->Value, Variant(u"/data/archive"_s));
}

TEST_F(BrowseTest, CalendarPicksADateForTheField)
{
    auto day = item(u"Day"_s);
    day->IsMemo = true;
    day->DateFormat = true;
    day->Value = Variant::fromDate(QDate(2021, 1, 31));
    box = showBox(params);
    auto* edit = control<QLineEdit>(u"txMData_1"_s);
    EXPECT_EQ(edit->text(), u"31.01.2021"_s);

    QDate opened;
    whenShown<frmCalendar>([&opened](frmCalendar* calendar) {
        opened = calendar->selectedDate();
        QTest::mouseClick(calendar->findChild<QPushButton*>(u"cmdNext"_s), Qt::LeftButton);
        QTest::mouseClick(calendar->findChild<QPushButton*>(u"cmdOK"_s), Qt::LeftButton);
    });
    clickBrowse(1);
    EXPECT_EQ(opened, QDate(2021, 1, 31));
    // A month on from 31 January is the last day of February.
    EXPECT_EQ(edit->text(), u"28.02.2021"_s);
    EXPECT_EQ(box->focusWidget(), edit);
    clickOK();
    EXPECT_EQ(day->Value, Variant(u"28.02.2021"_s));
}

TEST_F(BrowseTest, CalendarOpensOnTodayForTextThatIsNoDateAndCancelKeepsIt)
{
    item(u"Day"_s)->IsMemo = true;
    item(u"Day"_s)->DateFormat = true;
    item(u"Day"_s)->Value = Variant(u"soon"_s);
    box = showBox(params);
    QDate opened;
    whenShown<frmCalendar>([&opened](frmCalendar* calendar) {
        opened = calendar->selectedDate();
        QTest::mouseClick(calendar->findChild<QPushButton*>(u"cmdCancel"_s), Qt::LeftButton);
    });
    QTest::keyClick(control<QLineEdit>(u"txMData_1"_s), Qt::Key_F4);
    EXPECT_EQ(opened, QDate::currentDate());
    EXPECT_EQ(control<QLineEdit>(u"txMData_1"_s)->text(), u"soon"_s);
}

TEST_F(BrowseTest, MemoEditorEditsLongTexts)
{
    auto memo = item(u"Memo"_s);
    memo->IsMemo = true;
    memo->Value = Variant(u"first"_s);
    box = showBox(params);
    QString shown;
    whenShown<frmEditor>([&shown](frmEditor* editor) {
        shown = editor->Text();
        auto* text = editor->findChild<QPlainTextEdit*>(u"txtMemo"_s);
        text->moveCursor(QTextCursor::End);
        QTest::keyClick(text, Qt::Key_Return);
        QTest::keyClicks(text, u"second"_s);
        QTest::mouseClick(editor->findChild<QPushButton*>(u"cmdOK"_s), Qt::LeftButton);
    });
    clickBrowse(1);
    EXPECT_EQ(shown, u"first"_s);
    clickOK();
    // Memo fields keep their line breaks.
    EXPECT_EQ(memo->Value, Variant(u"first\nsecond"_s));
}

TEST_F(BrowseTest, BrowseCaptionShowsFocusWithoutTheVisualStyle)
{
    item(u"Memo"_s)->IsMemo = true;
    box = showBox(params);
    auto* browse = control<QPushButton>(u"cmdBrowse_1"_s);
    EXPECT_EQ(browse->text(), u"..."_s);
    focus(browse);
    EXPECT_EQ(browse->text(), u".."_s);
    focus(control<QLineEdit>(u"txMData_1"_s));
    EXPECT_EQ(browse->text(), u"..."_s);
}

TEST_F(BrowseTest, ReadOnlyFieldsCannotBrowse)
{
    item(u"Report"_s)->IsFileDialog = true;
    item(u"Report"_s)->ReadOnly = true;
    box = showBox(params);
    EXPECT_FALSE(control<QLineEdit>(u"txMData_1"_s)->isEnabled());
    EXPECT_FALSE(control<QPushButton>(u"cmdBrowse_1"_s)->isEnabled());
}
