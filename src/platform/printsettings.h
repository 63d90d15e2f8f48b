#pragma once

#include "core/ludmoxexport.h"

#include <cstdint>

class QPrinter;

namespace platform {

/// The device settings of a printer, in the 16-bit codes of a Windows device mode, which is
/// what hosts and report files carry:
///
/// - colour mode: 1 monochrome, 2 colour
/// - copies: 1 or more
/// - paper bin: 1 upper / only one, 2 lower, 3 middle, 4 manual, 5 envelope, 6 envelope
///   manual, 7 automatic, 8 tractor, 9 small format, 10 large format, 11 large capacity,
///   14 cassette, 15 form source; 256 and above are printer-specific bins
/// - duplex: 1 simplex, 2 vertical (long edge), 3 horizontal (short edge)
/// - orientation: 1 portrait, 2 landscape
/// - paper size: the DMPAPER numbers (1 Letter, 5 Legal, 8 A3, 9 A4, 11 A5, ...), every number
///   QPageSize knows
/// - print quality: -1 draft, -2 low, -3 medium, -4 high (the printer's own resolution), or a
///   positive resolution in dots per inch
///
/// Setters raise ComError 380 (Invalid property value) for a code outside these sets and then
/// leave the setting as it was.
class LUDMOX_EXPORT PrintSettings {
public:
    int16_t colorMode() const { return m_colorMode; }
    int16_t copies() const { return m_copies; }
    int16_t paperBin() const { return m_paperBin; }
    int16_t duplex() const { return m_duplex; }
    int16_t orientation() const { return m_orientation; }
    int16_t paperSize() const { return m_paperSize; }
    int16_t printQuality() const { return m_printQuality; }

    void setColorMode(int16_t value);
    void setCopies(int16_t value);
    void setPaperBin(int16_t value);
    void setDuplex(int16_t value);
    void setOrientation(int16_t value);
    void setPaperSize(int16_t value);
    void setPrintQuality(int16_t value);

    /// Configures printer with these settings; it must not be printing yet.
    void applyTo(QPrinter& printer) const;
    /// These settings changed to what printer holds (after a print dialog); settings the
    /// printer has no code for, and the duplex mode of PDF output, are kept.
    void readFrom(const QPrinter& printer);

    friend bool operator==(const PrintSettings&, const PrintSettings&) = default;

private:
    int16_t m_colorMode = 2;
    int16_t m_copies = 1;
    int16_t m_paperBin = 7;
    int16_t m_duplex = 1;
    int16_t m_orientation = 1;
    int16_t m_paperSize = 9;
    int16_t m_printQuality = -4;
};

} // namespace platform
