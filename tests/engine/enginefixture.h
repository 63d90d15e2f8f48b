#pragma once

#include "engine/moxengine115.h"
#include "engine/moxglobals.h"
#include "platform/printdialogservice.h"
#include "platform/scriptedprintdialogservice.h"
#include "support/fakeruntime.h"

#include <gtest/gtest.h>
#include <memory>
#include <ostream>

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

namespace core {
inline void PrintTo(const Variant& value, std::ostream* out)
{
    *out << "Variant(type " << static_cast<int>(value.type());
    if (!value.isArray() && !value.isObject() && !value.isEmpty() && !value.isNull())
        *out << ", " << value.toInvariantText().toStdString();
    *out << ")";
}
} // namespace core

namespace enginetest {

using namespace Qt::StringLiterals;

constexpr int32_t LogOnFailed = static_cast<int32_t>(0x80047E5D);
constexpr int32_t TableConnectionFailed = static_cast<int32_t>(0x80047E44);
constexpr int32_t RuntimeFailure = static_cast<int32_t>(0x80040309);

/// An error as the runtime raises it.
inline core::ComError runtimeError(int32_t number, const QString& description = u"Failed"_s)
{
    return core::ComError(number, u"Crystal Reports"_s, description);
}

/// Every engine test runs against a fresh fake runtime and a scripted print dialog, with no
/// shared runtime application object left from an earlier test.
class EngineTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        engine::ReleaseApplication();
        platform::PrintDialogService::setActive(printDialog);
    }
    void TearDown() override
    {
        engine::ReleaseApplication();
        platform::PrintDialogService::setActive(nullptr);
    }

    static std::shared_ptr<engine::MoxEngine115> makeEngine()
    {
        return std::make_shared<engine::MoxEngine115>();
    }

    /// An engine with SQL Server logon data.
    static std::shared_ptr<engine::MoxEngine115> loggedOnEngine(const QString& userId = u"sa"_s)
    {
        auto engine = makeEngine();
        engine->SetLogonInfo(engine::ecstMSSQL, u"srv"_s, u"Shop"_s, userId, u"Secr3t"_s);
        return engine;
    }

    fakeruntime::FakeRuntime fake;
    std::shared_ptr<platform::ScriptedPrintDialogService> printDialog
        = std::make_shared<platform::ScriptedPrintDialogService>();
};

} // namespace enginetest
