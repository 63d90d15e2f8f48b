#pragma once

#include "core/comerror.h"
#include "core/dictionary.h"
#include "core/variant.h"
#include "dialogs/inputboxparams.h"
#include "engine/moxengine115.h"
#include "engine/moxglobals.h"
#include "platform/messageboxservice.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxreports115.h"
#include "reports/moxviewer6exeglobals.h"
#include "support/fakeruntime.h"

#include <functional>
#include <gtest/gtest.h>
#include <memory>
#include <ostream>
#include <vector>

// Readable failure messages for Qt strings.
inline void PrintTo(const QString& text, std::ostream* out)
{
    *out << '"' << text.toStdString() << '"';
}
inline void PrintTo(const QStringList& list, std::ostream* out)
{
    *out << "{\n";
    for (const QString& text : list)
        *out << "  " << text.toStdString() << "\n";
    *out << "}";
}

namespace reporttest {

using namespace Qt::StringLiterals;

constexpr int32_t LogOnFailed = static_cast<int32_t>(0x80047E5D);
constexpr int32_t TableConnectionFailed = static_cast<int32_t>(0x80047E44);
constexpr int32_t OpenReportFailed = static_cast<int32_t>(0x80047689);
constexpr int32_t RuntimeFailure = static_cast<int32_t>(0x80040309);
constexpr int32_t UserCancelled = static_cast<int32_t>(0x80040099);

/// An error as the runtime raises it.
inline core::ComError runtimeError(int32_t number, const QString& description = u"Failed"_s)
{
    return core::ComError(number, u"Crystal Reports"_s, description);
}

/// Lines joined with CR LF, as formulas and statements are.
inline QString lines(const QStringList& parts)
{
    return parts.join(u"\r\n"_s);
}

/// A parameter field description, built up call by call.
class Param {
public:
    explicit Param(const QString& name) { m_state.name = name; }
    Param& prompt(const QString& text)
    {
        m_state.prompt = text;
        return *this;
    }
    Param& type(int16_t valueType)
    {
        m_state.valueType = valueType;
        return *this;
    }
    /// Has its value already: the dialog leaves it out.
    Param& satisfied()
    {
        m_state.needsCurrentValue = false;
        return *this;
    }
    Param& multiple()
    {
        m_state.allowsMultipleValues = true;
        return *this;
    }
    Param& listedOnly()
    {
        m_state.onlyListedValues = true;
        return *this;
    }
    Param& defaultValue(const core::Variant& value)
    {
        m_state.defaultValue = value;
        return *this;
    }
    /// An entry of the default-value list.
    Param& entry(const core::Variant& value, const QString& description = QString())
    {
        m_state.defaults.push_back({ value, description });
        return *this;
    }
    operator fakeruntime::FakeParameterField::State() const { return m_state; }

private:
    fakeruntime::FakeParameterField::State m_state;
};

/// A table read through the given driver.
inline fakeruntime::FakeTable::State tableWithDriver(
    const QString& name, const QString& location, const QString& driver)
{
    fakeruntime::FakeTable::State table;
    table.name = name;
    table.location = location;
    table.driverName = driver;
    return table;
}

/// Message boxes that are only recorded.
class RecordedMessages : public platform::MessageBoxService {
public:
    struct Message {
        QString text;
        int32_t buttons = 0;
        QString title;
    };
    int32_t showMessage(
        int32_t, const QString& text, int32_t buttons, const QString& title) override
    {
        shown.push_back({ text, buttons, title });
        return OK;
    }
    std::vector<Message> shown;
};

/// The parameter dialog as a test answers it: `answer` sees the prepared model and the
/// owner window and returns whether the user confirmed; every call is counted.
struct ScriptedDialog {
    std::function<bool(dialogs::InputBoxParams&)> answer
        = [](dialogs::InputBoxParams&) { return true; };
    int shown = 0;
    QString title;
    int32_t buttons = -1;
    int32_t owner = -1;
};

/// A report object of a collection whose engine has SQL Server logon data, over a fresh
/// fake runtime; message boxes and the parameter dialog are scripted.
class ReportTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        engine::ReleaseApplication();
        platform::MessageBoxService::setActive(messages);
        m_previousPresenter = reports::SetInputBoxPresenter(
            [this](const std::shared_ptr<dialogs::InputBoxParams>& params, int32_t buttons,
                const QString& title, int32_t owner) {
                ++dialog.shown;
                dialog.buttons = buttons;
                dialog.title = title;
                dialog.owner = owner;
                return dialog.answer(*params);
            });
        moxEngine->SetLogonInfo(engine::ecstMSSQL, u"srv"_s, u"Shop"_s, u"sa"_s, u"Secr3t"_s);
        collection->SetEngine(moxEngine);
    }
    void TearDown() override
    {
        reports::SetInputBoxPresenter(std::move(m_previousPresenter));
        platform::MessageBoxService::setActive(nullptr);
        engine::ReleaseApplication();
    }

    /// A report file with one OLE DB table Orders.
    std::shared_ptr<fakeruntime::FakeReport> addOrdersReport(const QString& path = u"orders.rpt"_s)
    {
        auto file = fake.addReport(path);
        file->addTable(u"Orders"_s, u"Shop.dbo.Orders"_s);
        file->addSection(u"D"_s);
        return file;
    }

    /// A parameter that stops needing a value once it has one, as the runtime's do.
    std::shared_ptr<fakeruntime::FakeParameterField> addParameter(
        fakeruntime::FakeReport& file, fakeruntime::FakeParameterField::State state)
    {
        auto parameter = file.addParameter(std::move(state));
        std::weak_ptr<fakeruntime::FakeParameterField> weak = parameter;
        fake.onCall(u"Param("_s + parameter->state.name + u").addCurrentValue"_s, [weak] {
            if (const auto alive = weak.lock())
                alive->state.needsCurrentValue = false;
        });
        return parameter;
    }

    std::shared_ptr<reports::MoxReport115> open(const QString& path = u"orders.rpt"_s)
    {
        return collection->Item(path);
    }

    /// LoadReport with dialogs allowed.
    static bool load(reports::MoxReport115& report, bool refresh = false)
    {
        bool noDialog = false;
        return report.LoadReport(refresh, noDialog);
    }

    /// Records every event the report's event object raises.
    struct RaisedEvent {
        QString name;
        std::vector<core::Variant> args;
    };
    void recordEvents(reports::MoxReport115& report,
        std::function<void(const QString&, std::span<core::Variant>)> handler = {})
    {
        report.MoxEvents()->connect(
            [this, handler](int32_t, const QString& name, std::span<core::Variant> args) {
                events.push_back({ name, { args.begin(), args.end() } });
                if (handler)
                    handler(name, args);
            });
    }

    static std::shared_ptr<core::Dictionary> dictionary(
        std::initializer_list<std::pair<QString, core::Variant>> entries,
        core::Dictionary::CompareMode mode = core::Dictionary::BinaryCompare)
    {
        auto values = std::make_shared<core::Dictionary>(mode);
        for (const auto& [key, value] : entries)
            values->add(key, value);
        return values;
    }

    /// The calls of one method of the fake runtime, in order.
    QStringList callsOf(const QString& prefix) const { return fake.calls(prefix); }

    fakeruntime::FakeRuntime fake;
    std::shared_ptr<RecordedMessages> messages = std::make_shared<RecordedMessages>();
    ScriptedDialog dialog;
    std::shared_ptr<engine::MoxEngine115> moxEngine = std::make_shared<engine::MoxEngine115>();
    std::shared_ptr<reports::MoxReports115> collection = std::make_shared<reports::MoxReports115>();
    std::vector<RaisedEvent> events;

private:
    reports::InputBoxPresenter m_previousPresenter;
};

} // namespace reporttest
