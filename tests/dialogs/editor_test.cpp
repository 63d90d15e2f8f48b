#include "dialogs/editorlayout.h"
#include "dialogs/frmeditor.h"
#include "platform/settingsstore.h"
#include "widgetfixture.h"

#include <QFontDatabase>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QScreen>

using namespace dialogs;
using namespace widgettest;
using namespace Qt::StringLiterals;

namespace {

const QString App = u"Orvel LUD 6.0"_s;
const QString Section = u"Default"_s;

class EditorTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        engine::gLanguage = 3;
        store.deleteSetting(App, Section);
    }
    void TearDown() override { store.deleteSetting(App, Section); }

    void storeWindow(int left, int top, int width, int height)
    {
        store.saveSetting(App, Section, u"MELeft"_s, QString::number(left));
        store.saveSetting(App, Section, u"METop"_s, QString::number(top));
        store.saveSetting(App, Section, u"MEWidth"_s, QString::number(width));
        store.saveSetting(App, Section, u"MEHeight"_s, QString::number(height));
    }
    std::unique_ptr<frmEditor> open()
    {
        auto editor = std::make_unique<frmEditor>();
        editor->show();
        QApplication::setActiveWindow(editor.get());
        if (!QTest::qWaitForWindowActive(editor.get()))
            ADD_FAILURE() << "the editor did not become active";
        return editor;
    }

    GlobalsGuard guard;
    platform::SettingsStore store;
};

QSize screenTwips()
{
    const QSize pixels = QGuiApplication::primaryScreen()->geometry().size();
    return { pixels.width() * 15, pixels.height() * 15 };
}

} // namespace

struct PlaceCase {
    const char* name;
    QRect stored;
    QRect placed;
};

class EditorPlacementTest : public ::testing::TestWithParam<PlaceCase> { };

TEST_P(EditorPlacementTest, StaysOnTheScreenAndAboveTheMinimum)
{
    EXPECT_EQ(placeEditorWindow(GetParam().stored, QSize(12000, 9000)), GetParam().placed);
}

INSTANTIATE_TEST_SUITE_P(Places, EditorPlacementTest,
    ::testing::Values(
        PlaceCase { "AsStored", QRect(300, 200, 5000, 4000), QRect(300, 200, 5000, 4000) },
        PlaceCase { "TooSmall", QRect(300, 200, 1000, 500), QRect(300, 200, 3285, 1800) },
        PlaceCase { "LargerThanTheScreen", QRect(0, 0, 20000, 10000), QRect(0, 0, 12000, 9000) },
        PlaceCase {
            "OffTheRightEdge", QRect(10000, 200, 5000, 4000), QRect(7000, 200, 5000, 4000) },
        PlaceCase {
            "OffTheBottomEdge", QRect(300, 8000, 5000, 4000), QRect(300, 5000, 5000, 4000) }),
    [](const auto& row) { return std::string(row.param.name); });

TEST(EditorLayout, TextAboveTwoButtonsAtTheRight)
{
    const EditorGeometry g = editorGeometry(QSize(4596, 3000), 15);
    EXPECT_EQ(g.memo, QRect(105, 105, 4596 - 210, 3000 - 315 - 345 - 15));
    EXPECT_EQ(g.ok, QRect(4596 - 210 - 2190, 3000 - 105 - 345 + 15, 1095, 345));
    EXPECT_EQ(g.cancel, QRect(4596 - 105 - 1095, 3000 - 105 - 345 + 15, 1095, 345));
    // Below the minimum the controls are placed as for the minimum size.
    EXPECT_EQ(editorGeometry(QSize(100, 100), 15).cancel.left(), 3285 - 105 - 1095);
}

TEST_F(EditorTest, TooSmallStoredSizeOpensAtTheMinimum)
{
    storeWindow(300, 300, 1000, 500);
    auto editor = open();
    EXPECT_EQ(editor->size(), QSize(3285 / 15, 1800 / 15));
    EXPECT_EQ(editor->pos(), QPoint(20, 20));
}

TEST_F(EditorTest, WindowPartlyOffTheScreenIsPulledBack)
{
    const QSize screen = screenTwips();
    storeWindow(screen.width() - 1500, screen.height() - 600, 6000, 4500);
    auto editor = open();
    EXPECT_EQ(editor->size(), QSize(400, 300));
    EXPECT_EQ(editor->pos(), QPoint((screen.width() - 6000) / 15, (screen.height() - 4500) / 15));
    const EditorGeometry g = editorGeometry(QSize(6000, 4500), 15);
    EXPECT_EQ(editor->findChild<QPlainTextEdit*>(u"txtMemo"_s)->geometry(),
        QRect(g.memo.x() / 15, g.memo.y() / 15, g.memo.width() / 15, g.memo.height() / 15));
}

TEST_F(EditorTest, OkReturnsTheEditedText)
{
    auto editor = open();
    EXPECT_TRUE(editor->Canceled());
    editor->Text(u"alpha"_s);
    auto* text = child<QPlainTextEdit>(editor.get(), u"txtMemo"_s);
    text->moveCursor(QTextCursor::End);
    QTest::keyClicks(text, u" beta"_s);
    QTest::mouseClick(child<QPushButton>(editor.get(), u"cmdOK"_s), Qt::LeftButton);
    EXPECT_FALSE(editor->isVisible());
    EXPECT_FALSE(editor->Canceled());
    EXPECT_EQ(editor->Text(), u"alpha beta"_s);
}

TEST_F(EditorTest, LockedTextLeavesOnlyCancel)
{
    auto editor = open();
    editor->Text(u"fixed"_s);
    editor->Locked(true);
    auto* text = child<QPlainTextEdit>(editor.get(), u"txtMemo"_s);
    EXPECT_FALSE(child<QPushButton>(editor.get(), u"cmdOK"_s)->isEnabled());
    QTest::keyClicks(text, u"x"_s);
    EXPECT_EQ(editor->Text(), u"fixed"_s);
    QTest::keyClick(text, Qt::Key_Escape);
    EXPECT_FALSE(editor->isVisible());
    EXPECT_TRUE(editor->Canceled());
}

TEST_F(EditorTest, CtrlF4CancelsFromAnyControl)
{
    auto editor = open();
    QTest::keyClick(
        child<QPlainTextEdit>(editor.get(), u"txtMemo"_s), Qt::Key_F4, Qt::ControlModifier);
    EXPECT_FALSE(editor->isVisible());
    EXPECT_TRUE(editor->Canceled());

    editor = open();
    auto* cancel = child<QPushButton>(editor.get(), u"cmdCancel"_s);
    focus(cancel);
    QTest::keyClick(cancel, Qt::Key_F4, Qt::ControlModifier);
    EXPECT_FALSE(editor->isVisible());
}

TEST_F(EditorTest, ClosingKeepsCanceledAndStoresTheWindow)
{
    auto editor = open();
    editor->move(40, 30);
    editor->resize(300, 200);
    QApplication::processEvents();
    const QPoint position = editor->pos();
    editor->close();
    EXPECT_TRUE(editor->Canceled());
    EXPECT_EQ(store.getSetting(App, Section, u"MELeft"_s),
        std::optional(QString::number(position.x() * 15)));
    EXPECT_EQ(store.getSetting(App, Section, u"METop"_s),
        std::optional(QString::number(position.y() * 15)));
    EXPECT_EQ(store.getSetting(App, Section, u"MEWidth"_s), std::optional(u"4500"_s));
    EXPECT_EQ(store.getSetting(App, Section, u"MEHeight"_s), std::optional(u"3000"_s));
}

TEST_F(EditorTest, FixedFontSwitchesTheFamilyAtNinePoints)
{
    frmEditor editor;
    auto* text = child<QPlainTextEdit>(&editor, u"txtMemo"_s);
    editor.FixedFont(true);
    EXPECT_EQ(text->font().family(), QFontDatabase::systemFont(QFontDatabase::FixedFont).family());
    EXPECT_EQ(text->font().pointSize(), 9);
    editor.FixedFont(false);
    EXPECT_EQ(text->font().family(), u"Tahoma"_s);
    EXPECT_EQ(text->font().pointSize(), 9);
    editor.CharSet(186);
    EXPECT_EQ(editor.CharSet(), 186);
}

TEST_F(EditorTest, ButtonsSpeakTheHostsLanguage)
{
    engine::gLanguage = 4;
    frmEditor editor;
    EXPECT_EQ(child<QPushButton>(&editor, u"cmdOK"_s)->text(), u"&OK"_s);
    EXPECT_EQ(child<QPushButton>(&editor, u"cmdCancel"_s)->text(), u"Ka&tkesta"_s);
}
