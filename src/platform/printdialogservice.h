#pragma once

#include "core/ludmoxexport.h"
#include "platform/printerinfo.h"
#include "platform/printsettings.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace platform {

/// Shows the system print dialog for the engine. The process has one active service: Qt's
/// dialog unless a test or a host installs another.
class LUDMOX_EXPORT PrintDialogService {
public:
    /// What the dialog is asked to show.
    struct Request {
        /// Native handle of the owner window; 0 for none.
        int32_t ownerWindow = 0;
        bool pageRangeAllowed = false;
        bool selectionAllowed = false;
        /// Hides the "print to file" choice. The component's PDF printer is a printer, not
        /// print-to-file, and stays selectable.
        bool printToFileDisabled = false;
        bool collate = false;
        /// Page numbers are 1..65535; 0 means not given.
        int minPage = 0;
        int maxPage = 0;
        int fromPage = 0;
        int toPage = 0;
        /// 0 leaves the number of copies at the device settings' value.
        int copies = 0;
        /// The printer the dialog opens on and its current settings.
        PrinterInfo printer;
        PrintSettings settings;
    };

    enum class PageRange { All, Pages, Selection, CurrentPage };

    /// What the user chose; only meaningful when accepted.
    struct Result {
        bool accepted = false;
        PrinterInfo printer;
        /// Copies, orientation, paper size, duplex, colour, paper source and print quality.
        PrintSettings settings;
        bool collate = false;
        PageRange range = PageRange::All;
        int fromPage = 0;
        int toPage = 0;
    };

    virtual ~PrintDialogService() = default;

    /// Shows the dialog modally and returns the user's choice; a cancelled dialog gives a
    /// result that is not accepted. May raise ComError when the dialog cannot be shown.
    virtual Result show(const Request& request) = 0;

    /// The active service; never null.
    static std::shared_ptr<PrintDialogService> active();
    /// Installs service as the active one; null restores Qt's dialog.
    static void setActive(std::shared_ptr<PrintDialogService> service);

protected:
    PrintDialogService() = default;
    PrintDialogService(const PrintDialogService&) = default;
    PrintDialogService& operator=(const PrintDialogService&) = default;
};

} // namespace platform
