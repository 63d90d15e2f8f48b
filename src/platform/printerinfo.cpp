#include "platform/printerinfo.h"

#include "platform/printers.h"

#include <utility>

namespace platform {

PrinterInfo::PrinterInfo(QString deviceName, QString driverName, QString port)
    : m_deviceName(std::move(deviceName))
    , m_driverName(std::move(driverName))
    , m_port(std::move(port))
{ }

bool PrinterInfo::isVirtualPdf() const
{
    return m_driverName == Printers::virtualPdfDriverName();
}

} // namespace platform
