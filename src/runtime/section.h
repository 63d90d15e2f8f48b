#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QString>
#include <functional>
#include <memory>
#include <vector>

namespace runtime {

class ReportObject;

/// A section of a report ("PH", "D", "GH1"...). Its format event is raised for every
/// instance of the section before the instance is placed on the page; handlers may change
/// the section's objects.
class LUDMOX_EXPORT Section : public core::Object {
public:
    using FormatHandler = std::function<void()>;

    QString className() const override { return QStringLiteral("Section"); }

    virtual QString name() const = 0;
    virtual std::vector<std::shared_ptr<ReportObject>> reportObjects() const = 0;

    /// Returns a cookie for removeFormatHandler.
    virtual int addFormatHandler(FormatHandler handler) = 0;
    virtual void removeFormatHandler(int cookie) = 0;
};

} // namespace runtime
