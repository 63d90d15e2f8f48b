#pragma once

#include "fakeobject.h"
#include "runtime/application.h"

namespace fakeruntime {

/// The fake runtime's application object. Logged as `Application`. Opens the reports that
/// FakeRuntime::addReport registered, by exact path; any other path raises 0x80047689.
class FakeApplication : public runtime::Application, public FakeObject {
public:
    struct State {
        bool matchLogOnInfo = false;
        bool loggedOn = false;
    };

    explicit FakeApplication(std::weak_ptr<Script> script);

    QString label() const override { return {}; }

    std::shared_ptr<runtime::Report> openReport(const QString& path, int16_t openOption) override;
    void setMatchLogOnInfo(bool value) override;
    void logOnServer(const QString& dllName, const QString& serverName, const QString& databaseName,
        const QString& userId, const QString& password, const QString& serverType,
        const QString& connectionString) override;
    void logOffServer(const QString& dllName, const QString& serverName,
        const QString& databaseName, const QString& userId, const QString& password) override;
    bool canClose() override;

    /// Read and change freely: nothing here is logged.
    State state;
};

} // namespace fakeruntime
