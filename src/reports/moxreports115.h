#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QString>
#include <memory>
#include <optional>
#include <vector>

namespace engine {
class MoxEngine115;
}

namespace reports {

class MoxReport115;

/// The reports a host opened through one engine, handed out by MoxEngine115::GetReports.
///
/// The collection owns its reports and its engine; each report refers back to the collection
/// without owning it. Report names are compared without regard to case and enumerate in the
/// order they were added. The collection must be owned by a std::shared_ptr, which is how
/// its reports find it again.
class LUDMOX_EXPORT MoxReports115 : public core::Object {
public:
    MoxReports115();
    ~MoxReports115() override;
    MoxReports115(const MoxReports115&) = delete;
    MoxReports115& operator=(const MoxReports115&) = delete;

    QString className() const override;

    /// The report of that name, created (not opened) when absent; its FileName keeps the
    /// letter case of the call that created it. Nothing when no engine is attached or after
    /// Destroy; never raises.
    std::shared_ptr<MoxReport115> Item(const QString& ReportName);
    /// Detaches the named report from the collection and drops it; the report lives on while
    /// the host holds it. Does nothing for an unknown name, without an engine or after
    /// Destroy; never raises.
    void Remove(const QString& ReportName);
    /// Detaches and drops every report and the engine; the collection is inert afterwards.
    void Destroy();
    /// The reports in the order they were added. Raises 91 (object variable not set) after
    /// Destroy.
    std::vector<std::shared_ptr<MoxReport115>> NewEnum() const;

    // Internal operations for the component's own objects.

    /// Attaches the engine that handed the collection out; the collection keeps it alive.
    void SetEngine(std::shared_ptr<engine::MoxEngine115> engine);
    std::shared_ptr<engine::MoxEngine115> GetEngine() const;

private:
    struct Entry {
        QString key;
        std::shared_ptr<MoxReport115> report;
    };

    std::vector<Entry>::iterator find(const QString& ReportName);

    // Nothing after Destroy, which is what NewEnum tells apart from an empty collection.
    std::optional<std::vector<Entry>> mCol;
    std::shared_ptr<engine::MoxEngine115> mEngine;
};

} // namespace reports
