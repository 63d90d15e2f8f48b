#pragma once

#include "runtime/report.h"

#include <cstdint>
#include <memory>
#include <optional>

namespace reportrt {

class ExportOptions;
class Report;

/// What the report model hands its printing and export members to.
///
/// The output layer installs it when the runtime is registered, so the model, which comes
/// before layout and output, names no writer and no printer.
class ReportOutput {
public:
    virtual ~ReportOutput() = default;

    virtual void exportReport(Report& report, const ExportOptions& options, bool promptUser) = 0;
    virtual void printOut(Report& report, bool promptUser, int16_t copies, bool collated,
        std::optional<runtime::PageRange> pages)
        = 0;
    virtual void printerSetup(Report& report, int32_t parentWindow) = 0;

    /// Replaces the installed output (the process keeps one).
    static void install(std::unique_ptr<ReportOutput> output);
    /// The installed output; raises Error::RuntimeFailure when there is none.
    static ReportOutput& installed();
};

} // namespace reportrt
