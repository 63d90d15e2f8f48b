#pragma once

#include "platform/printdialogservice.h"

namespace platform {

/// The print dialog of the desktop session (QPrintDialog). The dialog's PDF entry stands for
/// the component's PDF printer: choosing it selects that printer, which writes into its own
/// folder whatever file name the dialog shows.
class QtPrintDialogService : public PrintDialogService {
public:
    Result show(const Request& request) override;
};

} // namespace platform
