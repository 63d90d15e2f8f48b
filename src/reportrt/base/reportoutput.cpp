#include "reportrt/base/reportoutput.h"

#include "reportrt/base/runtimeerror.h"

namespace reportrt {

namespace {
std::unique_ptr<ReportOutput>& current()
{
    static std::unique_ptr<ReportOutput> output;
    return output;
}
} // namespace

void ReportOutput::install(std::unique_ptr<ReportOutput> output)
{
    current() = std::move(output);
}

ReportOutput& ReportOutput::installed()
{
    if (!current())
        raiseError(Error::RuntimeFailure,
            QStringLiteral("The report runtime has no output: register it before printing or "
                           "exporting."));
    return *current();
}

} // namespace reportrt
