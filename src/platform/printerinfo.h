#pragma once

#include "core/ludmoxexport.h"

#include <QString>

namespace platform {

/// One installed printer as hosts see it: device name (its identity), driver name and port.
class LUDMOX_EXPORT PrinterInfo {
public:
    PrinterInfo() = default;
    PrinterInfo(QString deviceName, QString driverName, QString port);

    const QString& deviceName() const { return m_deviceName; }
    const QString& driverName() const { return m_driverName; }
    const QString& port() const { return m_port; }

    bool isNull() const { return m_deviceName.isEmpty(); }
    /// Whether this is the component's own PDF printer (see Printers::virtualPdfPrinter).
    bool isVirtualPdf() const;

    friend bool operator==(const PrinterInfo&, const PrinterInfo&) = default;

private:
    QString m_deviceName;
    QString m_driverName;
    QString m_port;
};

} // namespace platform
