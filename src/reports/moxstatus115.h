#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "reports/enuprintprogress.h"

#include <cstdint>

namespace reports {

/// A snapshot of a report's print progress, returned by the report's Status property. A
/// plain record: the report fills it, hosts read and may overwrite every field.
class LUDMOX_EXPORT MoxStatus115 : public core::Object {
public:
    QString className() const override { return QStringLiteral("MoxStatus115"); }

    /// -1 while the page count is not final (printing not completed, or not every record read
    /// was printed).
    int32_t NumberOfPages = 0;
    int32_t NumberOfRecordPrinted = 0;
    int32_t NumberOfRecordRead = 0;
    int32_t NumberOfRecordSelected = 0;
    enuPrintProgress Progress = eppNoReport;
};

} // namespace reports
