#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QString>
#include <memory>

namespace runtime {

class Report;

/// The report runtime's application object: one per process. Every failure is raised as
/// core::ComError with the runtime's number.
class LUDMOX_EXPORT Application : public core::Object {
public:
    QString className() const override { return QStringLiteral("Application"); }

    /// Opens a report document. openOption 1 opens it for exclusive use by this process.
    virtual std::shared_ptr<Report> openReport(const QString& path, int16_t openOption) = 0;

    /// Switch set before a server logon: later table locations match the logon data.
    virtual void setMatchLogOnInfo(bool value) = 0;
    /// Raises 0x80047E5D when the connection fails.
    virtual void logOnServer(const QString& dllName, const QString& serverName,
        const QString& databaseName, const QString& userId, const QString& password,
        const QString& serverType, const QString& connectionString)
        = 0;
    virtual void logOffServer(const QString& dllName, const QString& serverName,
        const QString& databaseName, const QString& userId, const QString& password)
        = 0;
    /// Whether no report or logon keeps the runtime busy.
    virtual bool canClose() = 0;
};

} // namespace runtime
