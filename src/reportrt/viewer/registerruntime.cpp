#include "reportrt/viewer/registerruntime.h"

#include "reportrt/application.h"
#include "reportrt/base/reportoutput.h"
#include "reportrt/exportoptions.h"
#include "reportrt/output/htmlexporter.h"
#include "reportrt/output/pdfexporter.h"
#include "reportrt/output/reportexporter.h"
#include "reportrt/output/reportprinter.h"
#include "reportrt/output/writertable.h"
#include "reportrt/output/xlsxexporter.h"
#include "reportrt/viewer/reportviewer.h"
#include "runtime/applicationfactory.h"
#include "runtime/viewercontrolfactory.h"

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
    WriterTable::add(runtime::ExportFormat::Excel,
        [](Report& report, const ExportOptions& options, const QString& path) {
            return XlsxExporter::exportTo(report, options, path);
        });
    // The disk file name is where an export goes (a scratch file first, then the caller's);
    // the HTML file name only stands in when none was set.
    WriterTable::add(runtime::ExportFormat::HTML,
        [](Report& report, const ExportOptions& options, const QString& path) {
            return HtmlExporter::exportTo(
                report, options, path.isEmpty() ? options.htmlFileName() : path);
        });
    ReportOutput::install(std::make_unique<RuntimeOutput>());
    runtime::ViewerControlFactory::install([]() -> std::unique_ptr<runtime::ViewerControl> {
        return std::make_unique<ReportViewer>();
    });
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
