#include "platform/printsettings.h"

#include "platform/platformglobal_p.h"

#include <QPageLayout>
#include <QPageSize>
#include <QPrinter>
#include <algorithm>
#include <array>
#include <utility>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

// Paper bins that QPrinter can name; the bin codes 12 and 13 are unassigned.
constexpr std::array<std::pair<int16_t, QPrinter::PaperSource>, 13> paperBins { {
    { 1, QPrinter::OnlyOne },
    { 2, QPrinter::Lower },
    { 3, QPrinter::Middle },
    { 4, QPrinter::Manual },
    { 5, QPrinter::Envelope },
    { 6, QPrinter::EnvelopeManual },
    { 7, QPrinter::Auto },
    { 8, QPrinter::Tractor },
    { 9, QPrinter::SmallFormat },
    { 10, QPrinter::LargeFormat },
    { 11, QPrinter::LargeCapacity },
    { 14, QPrinter::Cassette },
    { 15, QPrinter::FormSource },
} };

// Printer-specific bins start here; they have no portable meaning.
constexpr int16_t firstUserBin = 256;

[[noreturn]] void raiseInvalid(const QString& what, int16_t value)
{
    detail::raise(detail::PlatformError::InvalidPropertyValue,
        u"Invalid property value: %1 %2"_s.arg(what).arg(value));
}

} // namespace

void PrintSettings::setColorMode(int16_t value)
{
    if (value != 1 && value != 2)
        raiseInvalid(u"colour mode"_s, value);
    m_colorMode = value;
}

void PrintSettings::setCopies(int16_t value)
{
    if (value < 1)
        raiseInvalid(u"copies"_s, value);
    m_copies = value;
}

void PrintSettings::setPaperBin(int16_t value)
{
    const bool known = std::any_of(paperBins.begin(), paperBins.end(),
        [value](const auto& bin) { return bin.first == value; });
    if (!known && value < firstUserBin)
        raiseInvalid(u"paper bin"_s, value);
    m_paperBin = value;
}

void PrintSettings::setDuplex(int16_t value)
{
    if (value < 1 || value > 3)
        raiseInvalid(u"duplex mode"_s, value);
    m_duplex = value;
}

void PrintSettings::setOrientation(int16_t value)
{
    if (value != 1 && value != 2)
        raiseInvalid(u"orientation"_s, value);
    m_orientation = value;
}

void PrintSettings::setPaperSize(int16_t value)
{
    if (QPageSize::id(value) == QPageSize::Custom)
        raiseInvalid(u"paper size"_s, value);
    m_paperSize = value;
}

void PrintSettings::setPrintQuality(int16_t value)
{
    if (value == 0 || value < -4)
        raiseInvalid(u"print quality"_s, value);
    m_printQuality = value;
}

void PrintSettings::applyTo(QPrinter& printer) const
{
    printer.setColorMode(m_colorMode == 1 ? QPrinter::GrayScale : QPrinter::Color);
    printer.setCopyCount(m_copies);
    for (const auto& [code, source] : paperBins) {
        if (code == m_paperBin)
            printer.setPaperSource(source);
    }
    switch (m_duplex) {
    case 2:
        printer.setDuplex(QPrinter::DuplexLongSide);
        break;
    case 3:
        printer.setDuplex(QPrinter::DuplexShortSide);
        break;
    default:
        printer.setDuplex(QPrinter::DuplexNone);
        break;
    }
    printer.setPageSize(QPageSize(QPageSize::id(m_paperSize)));
    printer.setPageOrientation(m_orientation == 2 ? QPageLayout::Landscape : QPageLayout::Portrait);
    // The named qualities leave the resolution to the printer.
    if (m_printQuality > 0)
        printer.setResolution(m_printQuality);
}

void PrintSettings::readFrom(const QPrinter& printer)
{
    m_colorMode = printer.colorMode() == QPrinter::GrayScale ? 1 : 2;
    m_copies = static_cast<int16_t>(qBound(1, printer.copyCount(), 32767));
    for (const auto& [code, source] : paperBins) {
        if (source == printer.paperSource())
            m_paperBin = code;
    }
    // A PDF has no sides: QPrinter forgets the duplex mode there, and the setting is kept
    // for the printer the job may go to later.
    if (printer.outputFormat() != QPrinter::PdfFormat) {
        switch (printer.duplex()) {
        case QPrinter::DuplexNone:
            m_duplex = 1;
            break;
        case QPrinter::DuplexLongSide:
            m_duplex = 2;
            break;
        case QPrinter::DuplexShortSide:
            m_duplex = 3;
            break;
        case QPrinter::DuplexAuto:
            break;
        }
    }
    const QPageLayout layout = printer.pageLayout();
    m_orientation = layout.orientation() == QPageLayout::Landscape ? 2 : 1;
    const int paperCode = layout.pageSize().windowsId();
    if (QPageSize::id(paperCode) != QPageSize::Custom)
        m_paperSize = static_cast<int16_t>(paperCode);
}

} // namespace platform
