#pragma once

#include "core/ludmoxexport.h"
#include "core/variant.h"

#include <QWidget>
#include <cstdint>
#include <memory>

namespace reports {
class MoxReport115;
}

namespace viewer {

class MoxViewer115;
class WindowEmbedding;

/// The hidden window that carries one preview control, "CRView", over its whole client area.
/// Closing it while it is shown only hides it; Destroy unloads it. The control may live in
/// another window meanwhile (clsMoxViewer115.ShowReport); the form still sizes it.
class LUDMOX_EXPORT LUDMoxViewerFormSDI : public QWidget {
public:
    /// Loads the form with a new control; raises what MoxViewer115::create raises.
    LUDMoxViewerFormSDI();
    ~LUDMoxViewerFormSDI() override;

    /// Clears the control's report and unloads the form: it closes and stays closed. The
    /// object itself goes with its owner. Errors are ignored.
    core::Variant Destroy();
    /// Sets the control's Report and shows it (MoxViewer115::ShowReport).
    core::Variant ShowReport(const std::shared_ptr<reports::MoxReport115>& Report, int16_t& Copies);
    std::shared_ptr<MoxViewer115> GetCRView() const;
    int32_t GetCRViewHwnd() const;

    /// Where the control's window is when it is not inside the form.
    WindowEmbedding& embedding() const;
    /// Moves the control to the top left with the form's inner size, wherever it lives.
    void placeView();
    bool isUnloaded() const { return m_unloaded; }

protected:
    void resizeEvent(QResizeEvent* event) override;
    void closeEvent(QCloseEvent* event) override;

private:
    std::shared_ptr<MoxViewer115> m_view;
    std::unique_ptr<WindowEmbedding> m_embedding;
    bool m_unloaded = false;
};

} // namespace viewer
