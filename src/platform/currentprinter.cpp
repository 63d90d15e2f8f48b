#include "platform/currentprinter.h"

#include "platform/printerdevice.h"
#include "platform/printers.h"

namespace platform {

CurrentPrinter::CurrentPrinter()
{
    select(Printers::defaultPrinter());
}

CurrentPrinter& CurrentPrinter::instance()
{
    static CurrentPrinter current;
    return current;
}

bool CurrentPrinter::select(const QString& deviceName)
{
    const std::optional<PrinterInfo> printer = Printers::find(deviceName);
    if (!printer)
        return false;
    select(*printer);
    return true;
}

void CurrentPrinter::select(const PrinterInfo& printer)
{
    m_settings = Printers::defaultSettings(printer);
    m_printer = printer;
}

std::unique_ptr<PrinterDevice> CurrentPrinter::createDevice(const QString& documentName) const
{
    return PrinterDevice::create(m_printer, m_settings, documentName);
}

} // namespace platform
