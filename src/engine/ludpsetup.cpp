#include "engine/ludpsetup.h"

#include "platform/currentprinter.h"
#include "platform/printdialogservice.h"
#include "platform/printers.h"

#include <QByteArray>
#include <algorithm>
#include <cstddef>
#include <cstring>
#include <functional>
#include <map>
#include <new>
#include <sys/mman.h>

namespace engine {

namespace {
/// The two records whose addresses hosts may be given. They live in the low 4 GB of the
/// address space where the system allows it, so that the address fits a 32-bit Long.
struct AddressedRecords {
    PrintDlgRecord printDialog;
    DevModeRecord devMode;
};

AddressedRecords& addressedRecords()
{
    static AddressedRecords* records = [] {
        void* memory = nullptr;
#ifdef MAP_32BIT
        memory = mmap(nullptr, sizeof(AddressedRecords), PROT_READ | PROT_WRITE,
            MAP_PRIVATE | MAP_ANONYMOUS | MAP_32BIT, -1, 0);
        if (memory == MAP_FAILED)
            memory = nullptr;
#endif
        static AddressedRecords fallback;
        return memory ? new (memory) AddressedRecords {} : &fallback;
    }();
    return *records;
}

/// Movable memory blocks of the device settings and names, by handle; a stand-in for the
/// system's global memory handles that the dialog record carries.
class MemoryBlocks {
public:
    static MemoryBlocks& instance()
    {
        static MemoryBlocks blocks;
        return blocks;
    }

    uint32_t allocate(QByteArray bytes)
    {
        const uint32_t handle = ++m_lastHandle;
        m_blocks.emplace(handle, std::move(bytes));
        return handle;
    }
    /// Null when the handle names no block.
    const QByteArray* lock(uint32_t handle) const
    {
        const auto found = m_blocks.find(handle);
        return found == m_blocks.end() ? nullptr : &found->second;
    }
    void release(uint32_t handle) { m_blocks.erase(handle); }

private:
    std::map<uint32_t, QByteArray> m_blocks;
    uint32_t m_lastHandle = 0;
};

constexpr int devNamesTextLength = 128;
constexpr int16_t collateTrue = 1;
constexpr uint16_t defaultPrinterFlag = 1;

void ignoringErrors(const std::function<void()>& step)
{
    try {
        step();
    } catch (...) {
        // Each setting stands alone: a value the printer refuses leaves the others.
    }
}

QByteArray devModeBlock(
    const platform::PrinterInfo& printer, const platform::PrintSettings& settings, bool collate)
{
    DevModeRecord mode {};
    const QByteArray name = printer.deviceName().toUtf8().left(sizeof mode.dmDeviceName - 1);
    std::memcpy(mode.dmDeviceName, name.constData(), static_cast<size_t>(name.size()));
    mode.dmSpecVersion = 0x0401;
    mode.dmSize = sizeof(DevModeRecord);
    mode.dmFields = DM_ORIENTATION | DM_PAPERSIZE | DM_SCALE | DM_COPIES | DM_DEFAULTSOURCE
        | DM_PRINTQUALITY | DM_COLOR | DM_DUPLEX | DM_COLLATE;
    mode.dmOrientation = settings.orientation();
    mode.dmPaperSize = settings.paperSize();
    mode.dmScale = 100;
    mode.dmCopies = settings.copies();
    mode.dmDefaultSource = settings.paperBin();
    mode.dmPrintQuality = settings.printQuality();
    if (settings.printQuality() > 0) {
        mode.dmFields |= DM_YRESOLUTION;
        mode.dmYResolution = settings.printQuality();
    }
    mode.dmColor = settings.colorMode();
    mode.dmDuplex = settings.duplex();
    mode.dmCollate = collate ? collateTrue : 0;
    return QByteArray(reinterpret_cast<const char*>(&mode), sizeof mode);
}

/// Four 16-bit character offsets, then the driver, device and port texts, each ending
/// in NUL.
QByteArray devNamesBlock(const platform::PrinterInfo& printer, bool isDefault)
{
    QByteArray texts;
    uint16_t offsets[4] = {};
    const QString parts[3] = { printer.driverName(), printer.deviceName(), printer.port() };
    for (int i = 0; i < 3; ++i) {
        offsets[i] = static_cast<uint16_t>(sizeof offsets + static_cast<size_t>(texts.size()));
        texts += parts[i].toUtf8().left(devNamesTextLength - 1) + '\0';
    }
    offsets[3] = isDefault ? defaultPrinterFlag : 0;
    return QByteArray(reinterpret_cast<const char*>(offsets), sizeof offsets) + texts;
}

/// The zero-terminated text at offset, read as at most 128 characters.
QString blockText(const QByteArray& block, uint16_t offset)
{
    if (offset >= block.size())
        return QString();
    const QByteArray text = block.mid(offset, devNamesTextLength);
    const qsizetype end = text.indexOf('\0');
    return QString::fromUtf8(end < 0 ? text : text.left(end));
}

/// Replaces the record's device blocks; the previous ones are released.
void replaceDeviceBlocks(QByteArray devMode, QByteArray devNames)
{
    MemoryBlocks& blocks = MemoryBlocks::instance();
    PrintDlgRecord& record = PrintDialog();
    const uint32_t oldDevMode = record.hDevMode;
    const uint32_t oldDevNames = record.hDevNames;
    record.hDevMode = blocks.allocate(std::move(devMode));
    record.hDevNames = blocks.allocate(std::move(devNames));
    blocks.release(oldDevMode);
    blocks.release(oldDevNames);
}

/// The dialog opens on the printer and settings of the last dialog (or of the default
/// printer), as the record's device handles would seed it; on the current printer when
/// that printer is no longer installed.
void seedRequest(platform::PrintDialogService::Request& request)
{
    const platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    request.printer = current.printer();
    request.settings = current.settings();
    const auto printer = platform::Printers::find(DevNames().deviceName);
    if (!printer)
        return;
    const DevModeRecord& mode = DevMode();
    platform::PrintSettings settings = platform::Printers::defaultSettings(*printer);
    const auto seed
        = [&](uint32_t field, void (platform::PrintSettings::*setter)(int16_t), int16_t value) {
              if (mode.dmFields & field)
                  ignoringErrors([&] { (settings.*setter)(value); });
          };
    seed(DM_ORIENTATION, &platform::PrintSettings::setOrientation, mode.dmOrientation);
    seed(DM_PAPERSIZE, &platform::PrintSettings::setPaperSize, mode.dmPaperSize);
    seed(DM_COPIES, &platform::PrintSettings::setCopies, mode.dmCopies);
    seed(DM_DEFAULTSOURCE, &platform::PrintSettings::setPaperBin, mode.dmDefaultSource);
    seed(DM_PRINTQUALITY, &platform::PrintSettings::setPrintQuality, mode.dmPrintQuality);
    seed(DM_COLOR, &platform::PrintSettings::setColorMode, mode.dmColor);
    seed(DM_DUPLEX, &platform::PrintSettings::setDuplex, mode.dmDuplex);
    request.printer = *printer;
    request.settings = settings;
}

platform::PrintDialogService::Request dialogRequest()
{
    const PrintDlgRecord& record = PrintDialog();
    platform::PrintDialogService::Request request;
    request.ownerWindow = static_cast<int32_t>(record.hwndOwner);
    request.pageRangeAllowed = !(record.Flags & PD_NOPAGENUMS);
    request.selectionAllowed = !(record.Flags & PD_NOSELECTION);
    request.printToFileDisabled = record.Flags & PD_DISABLEPRINTTOFILE;
    request.collate = record.Flags & PD_COLLATE;
    if (request.pageRangeAllowed && record.nMaxPage >= record.nMinPage) {
        request.minPage = record.nMinPage;
        request.maxPage = record.nMaxPage;
        // The record asks for "to the last page" with 65535; the dialog shows the
        // report's own last page.
        request.fromPage = std::clamp<int>(record.nFromPage, record.nMinPage, record.nMaxPage);
        request.toPage = std::clamp<int>(record.nToPage, record.nMinPage, record.nMaxPage);
    }
    request.copies = record.nCopies;
    seedRequest(request);
    return request;
}

/// What the dialog hands back through the record: the device blocks, copies, the page
/// range and the range and collate flags.
void storeDialogResult(const platform::PrintDialogService::Result& result)
{
    replaceDeviceBlocks(devModeBlock(result.printer, result.settings, result.collate),
        devNamesBlock(result.printer, result.printer == platform::Printers::defaultPrinter()));
    PrintDlgRecord& record = PrintDialog();
    record.nCopies = static_cast<uint16_t>(result.settings.copies());
    record.Flags &= ~(PD_PAGENUMS | PD_SELECTION | PD_COLLATE);
    if (result.collate)
        record.Flags |= PD_COLLATE;
    using PageRange = platform::PrintDialogService::PageRange;
    if (result.range == PageRange::Pages) {
        record.Flags |= PD_PAGENUMS;
        record.nFromPage = static_cast<uint16_t>(result.fromPage);
        record.nToPage = static_cast<uint16_t>(result.toPage);
    } else if (result.range == PageRange::Selection) {
        record.Flags |= PD_SELECTION;
    }
}
} // namespace

PrintDlgRecord& PrintDialog()
{
    return addressedRecords().printDialog;
}

DevModeRecord& DevMode()
{
    return addressedRecords().devMode;
}

DevNamesRecord& DevNames()
{
    static DevNamesRecord names;
    return names;
}

void InitPrinterSetup()
{
    try {
        PrintDlgRecord& record = PrintDialog();
        record.lStructSize = sizeof(PrintDlgRecord);
        record.Flags = PD_RETURNDEFAULT;
        if (record.hDevMode != 0 || record.hDevNames != 0)
            return;
        const platform::PrinterInfo printer = platform::Printers::defaultPrinter();
        replaceDeviceBlocks(
            devModeBlock(printer, platform::Printers::defaultSettings(printer), false),
            devNamesBlock(printer, true));
        ReadDevMode();
        ReadDevNames();
    } catch (...) {
        // Without a default printer the records stay empty until a dialog fills them.
    }
}

bool ShowPrintDialog(int32_t hWndParent, int16_t NumPages, int16_t Copies)
{
    const PrintDlgRecord recordBefore = PrintDialog();
    const DevModeRecord devModeBefore = DevMode();
    const DevNamesRecord devNamesBefore = DevNames();
    const auto restore = [&] {
        MemoryBlocks& blocks = MemoryBlocks::instance();
        if (PrintDialog().hDevMode != recordBefore.hDevMode)
            blocks.release(PrintDialog().hDevMode);
        if (PrintDialog().hDevNames != recordBefore.hDevNames)
            blocks.release(PrintDialog().hDevNames);
        PrintDialog() = recordBefore;
        DevMode() = devModeBefore;
        DevNames() = devNamesBefore;
    };
    try {
        PrintDlgRecord& record = PrintDialog();
        record.lStructSize = sizeof(PrintDlgRecord);
        record.Flags = PD_DISABLEPRINTTOFILE | PD_COLLATE;
        if (NumPages == 0 || NumPages == 1)
            record.Flags |= PD_NOSELECTION;
        if (NumPages == 0)
            record.Flags |= PD_NOPAGENUMS;
        record.hwndOwner = static_cast<uint32_t>(hWndParent);
        if (Copies > 0)
            record.nCopies = static_cast<uint16_t>(Copies);
        if (NumPages != 0) {
            record.nMinPage = 1;
            record.nMaxPage = static_cast<uint16_t>(NumPages);
            record.nFromPage = 1;
            record.nToPage = 65535;
        }
        const auto result = platform::PrintDialogService::active()->show(dialogRequest());
        if (!result.accepted) {
            restore();
            return false;
        }
        storeDialogResult(result);
        ReadDevMode();
        ReadDevNames();
        ApplySelectedPrinter();
        return true;
    } catch (...) {
        restore();
        return false;
    }
}

void ReadDevMode()
{
    const QByteArray* block = MemoryBlocks::instance().lock(PrintDialog().hDevMode);
    if (!block || block->size() < static_cast<qsizetype>(sizeof(DevModeRecord)))
        return;
    const char* base = block->constData();
    DevModeRecord& copy = DevMode();
    copy.dmDriverVersion
        = static_cast<uint16_t>(ReadInteger(base + offsetof(DevModeRecord, dmDriverVersion)));
    copy.dmFields = static_cast<uint32_t>(ReadLong(base + offsetof(DevModeRecord, dmFields)));
    copy.dmOrientation = ReadInteger(base + offsetof(DevModeRecord, dmOrientation));
    copy.dmPaperSize = ReadInteger(base + offsetof(DevModeRecord, dmPaperSize));
    copy.dmPaperLength = ReadInteger(base + offsetof(DevModeRecord, dmPaperLength));
    copy.dmPaperWidth = ReadInteger(base + offsetof(DevModeRecord, dmPaperWidth));
    copy.dmScale = ReadInteger(base + offsetof(DevModeRecord, dmScale));
    copy.dmCopies = ReadInteger(base + offsetof(DevModeRecord, dmCopies));
    copy.dmDefaultSource = ReadInteger(base + offsetof(DevModeRecord, dmDefaultSource));
    copy.dmPrintQuality = ReadInteger(base + offsetof(DevModeRecord, dmPrintQuality));
    copy.dmColor = ReadInteger(base + offsetof(DevModeRecord, dmColor));
    copy.dmDuplex = ReadInteger(base + offsetof(DevModeRecord, dmDuplex));
    copy.dmYResolution = ReadInteger(base + offsetof(DevModeRecord, dmYResolution));
    copy.dmTTOption = ReadInteger(base + offsetof(DevModeRecord, dmTTOption));
    copy.dmCollate = ReadInteger(base + offsetof(DevModeRecord, dmCollate));
}

void ReadDevNames()
{
    const QByteArray* block = MemoryBlocks::instance().lock(PrintDialog().hDevNames);
    if (!block || block->size() < 8)
        return;
    const char* base = block->constData();
    DevNamesRecord& names = DevNames();
    names.wDriverOffset = static_cast<uint16_t>(ReadInteger(base));
    names.wDeviceOffset = static_cast<uint16_t>(ReadInteger(base + 2));
    names.wOutputOffset = static_cast<uint16_t>(ReadInteger(base + 4));
    names.wDefault = static_cast<uint16_t>(ReadInteger(base + 6));
    names.driverName = blockText(*block, names.wDriverOffset);
    names.deviceName = blockText(*block, names.wDeviceOffset);
    names.outputPort = blockText(*block, names.wOutputOffset);
}

void ApplySelectedPrinter()
{
    platform::CurrentPrinter& current = platform::CurrentPrinter::instance();
    const QString& chosen = DevNames().deviceName;
    if (current.deviceName().compare(chosen, Qt::CaseInsensitive) != 0) {
        const auto installed = platform::Printers::installed();
        const auto match
            = std::find_if(installed.begin(), installed.end(), [&](const auto& printer) {
                  return printer.deviceName().compare(chosen, Qt::CaseInsensitive) == 0;
              });
        if (match != installed.end())
            current.select(*match);
    }
    const DevModeRecord& mode = DevMode();
    ignoringErrors([&] { current.setColorMode(mode.dmColor); });
    if (PrintDialog().nCopies > 1)
        ignoringErrors([&] { current.setCopies(mode.dmCopies); });
    ignoringErrors([&] { current.setPaperBin(mode.dmDefaultSource); });
    ignoringErrors([&] { current.setDuplex(mode.dmDuplex); });
    ignoringErrors([&] { current.setOrientation(mode.dmOrientation); });
    ignoringErrors([&] { current.setPaperSize(mode.dmPaperSize); });
    ignoringErrors([&] { current.setPrintQuality(mode.dmPrintQuality); });
}

int16_t ReadInteger(const void* address)
{
    int16_t value = 0;
    std::memcpy(&value, address, sizeof value);
    return value;
}

int32_t ReadLong(const void* address)
{
    int32_t value = 0;
    std::memcpy(&value, address, sizeof value);
    return value;
}

std::optional<int32_t> RecordAddress(const void* record)
{
    const auto address = reinterpret_cast<uintptr_t>(record);
    if (address > UINT32_MAX)
        return std::nullopt;
    // Hosts see addresses as signed Longs, so those above 2 GB are negative.
    return static_cast<int32_t>(static_cast<uint32_t>(address));
}

} // namespace engine
