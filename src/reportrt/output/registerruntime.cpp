#include "reportrt/output/registerruntime.h"

#include "reportrt/application.h"
#include "reportrt/base/reportoutput.h"
#include "reportrt/output/pdfexporter.h"
#include "reportrt/output/reportexporter.h"
#include "reportrt/output/reportprinter.h"
#include "reportrt/output/writertable.h"
#include "runtime/applicationfactory.h"

namespace reportrt {

namespace {
class RuntimeOutput : public ReportOutput {
public:
    void exportReport(Report& report, const ExportOptions& options, bool promptUser) override
    {
        ReportExporter::exportReport(report, options, promptUser);
    }

    void printOut(Report& report, bool promptUser, int16_t copies, bool collated,
        std::optional<runtime::PageRange> pages) override
    {
        ReportPrinter::printOut(report, promptUser, copies, collated, pages);
    }

    void printerSetup(Report& report, int32_t parentWindow) override
    {
        ReportPrinter::printerSetup(report, parentWindow);
    }
};
} // namespace

void registerRuntime()
{
    WriterTable::add(
        runtime::ExportFormat::PDF, [](Report& report, const ExportOptions&, const QString& path) {
            return PdfExporter::exportTo(report, path);
        });
    ReportOutput::install(std::make_unique<RuntimeOutput>());
    runtime::ApplicationFactory::install([]() -> std::shared_ptr<runtime::Application> {
        static std::weak_ptr<Application> current;
        auto application = current.lock();
        if (!application) {
            application = std::make_shared<Application>();
            current = application;
        }
        return application;
    });
}

} // namespace reportrt
