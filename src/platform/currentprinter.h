#pragma once

#include "core/ludmoxexport.h"
#include "platform/printerinfo.h"
#include "platform/printsettings.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace platform {

class PrinterDevice;

/// The process's current printer: the printer reports print on unless told otherwise, with
/// its device settings. It starts as the default printer (Printers::defaultPrinter) with
/// that printer's default settings; every caller in the process shares it.
class LUDMOX_EXPORT CurrentPrinter {
public:
    static CurrentPrinter& instance();

    const PrinterInfo& printer() const { return m_printer; }
    const QString& deviceName() const { return m_printer.deviceName(); }
    const QString& driverName() const { return m_printer.driverName(); }
    const QString& port() const { return m_printer.port(); }

    const PrintSettings& settings() const { return m_settings; }
    /// The setters raise ComError 380 for a code the printer settings do not know (see
    /// PrintSettings) and keep the old value.
    void setColorMode(int16_t value) { m_settings.setColorMode(value); }
    void setCopies(int16_t value) { m_settings.setCopies(value); }
    void setPaperBin(int16_t value) { m_settings.setPaperBin(value); }
    void setDuplex(int16_t value) { m_settings.setDuplex(value); }
    void setOrientation(int16_t value) { m_settings.setOrientation(value); }
    void setPaperSize(int16_t value) { m_settings.setPaperSize(value); }
    void setPrintQuality(int16_t value) { m_settings.setPrintQuality(value); }

    /// Makes the installed printer whose device name is exactly deviceName current, with its
    /// default settings; returns false and changes nothing when there is none. Callers that
    /// match names without regard to case pick the name from Printers::installed() first.
    bool select(const QString& deviceName);
    /// Makes printer current with its default settings.
    void select(const PrinterInfo& printer);

    /// A device that prints on the current printer with the current settings (see
    /// PrinterDevice::create).
    std::unique_ptr<PrinterDevice> createDevice(const QString& documentName) const;

private:
    CurrentPrinter();

    PrinterInfo m_printer;
    PrintSettings m_settings;
};

} // namespace platform
