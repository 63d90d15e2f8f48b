#pragma once

#include "core/object.h"

#include <QString>
#include <memory>

namespace reports {

class MoxReports115;
struct MoxReport115Private;

/// One report file of a collection. The collection creates it, names it and points it back
/// at itself; the file is opened only when an operation first needs it.
///
/// The report does not keep its collection alive: once the host has released the
/// collection, GetParent returns nothing and the report can no longer reach its engine.
class MoxReport115 : public core::Object {
public:
    MoxReport115();
    ~MoxReport115() override;
    MoxReport115(const MoxReport115&) = delete;
    MoxReport115& operator=(const MoxReport115&) = delete;

    QString className() const override;

    /// The report file name exactly as the host passed it to the collection's Item.
    QString FileName() const;

    // Internal operations for the component's own objects.

    /// Set once by the collection right after creating the report.
    void SetFileName(const QString& name);
    /// The collection the report was created in; an empty reference detaches the report.
    void SetParent(const std::weak_ptr<MoxReports115>& parent);
    /// The collection, or nothing when the report was removed or the collection has ended.
    std::shared_ptr<MoxReports115> GetParent() const;

private:
    // The report's state lives in a private header so that the report's operations, spread
    // over several source files, share it without the public header growing with it.
    std::unique_ptr<MoxReport115Private> d;
};

} // namespace reports
