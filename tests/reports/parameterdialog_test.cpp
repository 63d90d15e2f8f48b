// The report's parameter dialog shown for real (offscreen) and answered with the mouse.

#include "dialogs/frminputbox.h"
#include "platform/display.h"
#include "reportfixture.h"

#include <QApplication>
#include <QCheckBox>
#include <QComboBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QTest>
#include <QTimer>

namespace {

using namespace reporttest;

/// Runs `action` on the parameter dialog once its modal loop shows it; a dialog that never
/// shows fails the test instead of hanging it.
void whenDialogShows(std::function<void(dialogs::frmInputBox&)> action)
{
    auto* timer = new QTimer;
    auto ticks = std::make_shared<int>(0);
    timer->setInterval(10);
    QObject::connect(timer, &QTimer::timeout, [timer, ticks, action] {
        if (auto* box = qobject_cast<dialogs::frmInputBox*>(QApplication::activeModalWidget())) {
            timer->stop();
            timer->deleteLater();
            action(*box);
        } else if (++*ticks > 3000) {
            timer->stop();
            timer->deleteLater();
            ADD_FAILURE() << "the parameter dialog never showed";
        }
    });
    timer->start();
}

template <class Widget> Widget& child(dialogs::frmInputBox& box, const QString& name)
{
    auto* widget = box.findChild<Widget*>(name);
    if (!widget)
        throw std::runtime_error("no control " + name.toStdString());
    return *widget;
}

class ParameterDialogWidget : public ReportTest {
protected:
    void SetUp() override
    {
        ReportTest::SetUp();
        // The real dialog, not the scripted one, answered offscreen by simulated input.
        reports::SetInputBoxPresenter(nullptr);
        previousDisplay = platform::Display::setInteractiveOverride(true);
        file = addOrdersReport();
        customer = addParameter(*file, Param(u"Customer"_s).prompt(u"Which customer?"_s));
        size = addParameter(*file,
            Param(u"Size"_s)
                .type(5)
                .listedOnly()
                .entry(int32_t(1), u"Small"_s)
                .entry(int32_t(3), u"Large"_s));
        paid = addParameter(*file, Param(u"Paid"_s).type(9));
        report = open();
    }
    void TearDown() override
    {
        platform::Display::setInteractiveOverride(previousDisplay);
        ReportTest::TearDown();
    }

    std::optional<bool> previousDisplay;
    std::shared_ptr<fakeruntime::FakeReport> file;
    std::shared_ptr<fakeruntime::FakeParameterField> customer;
    std::shared_ptr<fakeruntime::FakeParameterField> size;
    std::shared_ptr<fakeruntime::FakeParameterField> paid;
    std::shared_ptr<reports::MoxReport115> report;
};

TEST_F(ParameterDialogWidget, TheUsersAnswersBecomeTheParametersValues)
{
    QString title;
    QString tooltip;
    whenDialogShows([&](dialogs::frmInputBox& box) {
        title = box.windowTitle();
        tooltip = child<QLabel>(box, u"lblPrompt_1"_s).toolTip();
        child<QLineEdit>(box, u"txData_1"_s).setText(u"ACME"_s);
        auto& sizes = child<QComboBox>(box, u"cmbSData_2"_s);
        sizes.setCurrentIndex(sizes.findText(u"Large"_s));
        child<QCheckBox>(box, u"chkData_3"_s).setChecked(true);
        QTest::mouseClick(&child<QPushButton>(box, u"cmdOK"_s), Qt::LeftButton);
    });

    ASSERT_EQ(report->C_Report(), file);
    EXPECT_EQ(title, u"Enter parameter values"_s);
    EXPECT_EQ(tooltip, u"Which customer?"_s);
    EXPECT_EQ(customer->state.currentValues, std::vector<core::Variant> { u"ACME"_s });
    EXPECT_EQ(size->state.currentValues, std::vector<core::Variant> { int32_t(3) })
        << "the chosen description stands for its value";
    EXPECT_EQ(paid->state.currentValues, std::vector<core::Variant> { true });
    EXPECT_FALSE(report->UnloadRequest());
}

TEST_F(ParameterDialogWidget, CancelRaisesUserCancelled)
{
    whenDialogShows([](dialogs::frmInputBox& box) {
        QTest::mouseClick(&child<QPushButton>(box, u"cmdCancel"_s), Qt::LeftButton);
    });
    try {
        report->C_Report();
        FAIL() << "expected User Cancelled";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
        EXPECT_EQ(error.description(), u"User Cancelled"_s);
    }
    EXPECT_TRUE(report->UnloadRequest());
    EXPECT_TRUE(customer->state.currentValues.empty());
}

TEST_F(ParameterDialogWidget, WithoutADisplayOrAHostItCountsAsCancelled)
{
    // What the platform finds out for itself: these tests run offscreen, where nobody could
    // answer a modal dialog.
    platform::Display::setInteractiveOverride(std::nullopt);
    ASSERT_FALSE(platform::Display::isInteractive());
    // Lives only as long as this test: a dialog that shows is closed, so the test fails
    // instead of hanging.
    bool shown = false;
    QTimer watchdog;
    watchdog.setInterval(10);
    QObject::connect(&watchdog, &QTimer::timeout, [&shown] {
        if (auto* box = qobject_cast<dialogs::frmInputBox*>(QApplication::activeModalWidget())) {
            shown = true;
            box->reject();
        }
    });
    watchdog.start();
    try {
        report->C_Report();
        FAIL() << "expected User Cancelled";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
        EXPECT_EQ(error.description(), u"User Cancelled"_s);
    }
    EXPECT_FALSE(shown) << "a dialog nobody can see was shown";
    EXPECT_TRUE(report->UnloadRequest());
    EXPECT_TRUE(customer->state.currentValues.empty());
}

} // namespace
