#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace reports {
class MoxReport115;
}

namespace viewer {

/// The interface a host sees the preview control through (clsMoxViewer115.CRView). Created
/// on its own it is only the interface: every member does nothing, getters give 0, False
/// or nothing. MoxViewer115 implements each member with its own member of the same name.
class LUDMOX_EXPORT IMoxViewer115 : public core::Object {
public:
    IMoxViewer115() = default;
    IMoxViewer115(const IMoxViewer115&) = delete;
    IMoxViewer115& operator=(const IMoxViewer115&) = delete;

    QString className() const override { return QStringLiteral("IMoxViewer115"); }

    /// The report shown; nothing before one is set.
    virtual std::shared_ptr<reports::MoxReport115> Report() const;
    virtual void Report(const std::shared_ptr<reports::MoxReport115>& value);
    virtual bool IsBusy() const;
    /// Always the same value as IsBusy.
    virtual bool Exporting() const;
    /// Copies for printing.
    virtual int16_t Copies() const;
    virtual void Copies(int16_t Copyes);
    /// 1-based page number of the page shown.
    virtual int32_t GetCurrentPageNumber();
    virtual void ShowFirstPage();
    virtual void ShowLastPage();
    virtual void ShowNextPage();
    virtual void ShowPreviousPage();
    /// 1 for the main view; drill-down views count up from 2.
    virtual int16_t ActiveViewIndex() const;
};

} // namespace viewer
