#pragma once

#include <QString>
#include <cstdint>
#include <optional>

// The process-wide printer settings: the print-dialog record and copies of the device
// settings and device names the last print dialog returned. Hosts may read the records
// through their addresses (MoxEngine115::Properties), so both keep the Windows layouts.

namespace engine {

// Print-dialog flags.
constexpr uint32_t PD_SELECTION = 0x1;
constexpr uint32_t PD_PAGENUMS = 0x2;
constexpr uint32_t PD_NOSELECTION = 0x4;
constexpr uint32_t PD_NOPAGENUMS = 0x8;
constexpr uint32_t PD_COLLATE = 0x10;
constexpr uint32_t PD_RETURNDEFAULT = 0x400;
constexpr uint32_t PD_DISABLEPRINTTOFILE = 0x80000;

// Device-settings members present (dmFields).
constexpr uint32_t DM_ORIENTATION = 0x1;
constexpr uint32_t DM_PAPERSIZE = 0x2;
constexpr uint32_t DM_SCALE = 0x10;
constexpr uint32_t DM_COPIES = 0x100;
constexpr uint32_t DM_DEFAULTSOURCE = 0x200;
constexpr uint32_t DM_PRINTQUALITY = 0x400;
constexpr uint32_t DM_COLOR = 0x800;
constexpr uint32_t DM_DUPLEX = 0x1000;
constexpr uint32_t DM_YRESOLUTION = 0x2000;
constexpr uint32_t DM_COLLATE = 0x8000;

#pragma pack(push, 2)
/// The print-dialog record: PRINTDLGA packed to 2-byte boundaries, handles 32-bit. It is
/// reused from dialog to dialog: the device handles one dialog returned seed the next.
struct PrintDlgRecord {
    uint32_t lStructSize;
    uint32_t hwndOwner;
    uint32_t hDevMode;
    uint32_t hDevNames;
    uint32_t hDC;
    uint32_t Flags;
    uint16_t nFromPage;
    uint16_t nToPage;
    uint16_t nMinPage;
    uint16_t nMaxPage;
    uint16_t nCopies;
    uint32_t hInstance;
    uint32_t lCustData;
    uint32_t lpfnPrintHook;
    uint32_t lpfnSetupHook;
    uint32_t lpPrintTemplateName;
    uint32_t lpSetupTemplateName;
    uint32_t hPrintTemplate;
    uint32_t hSetupTemplate;
};
#pragma pack(pop)
static_assert(sizeof(PrintDlgRecord) == 66);

#pragma pack(push, 1)
/// Device settings laid out as DEVMODEA. The copy kept here fills only the members the
/// component uses (ReadDevMode); the rest stays zero.
struct DevModeRecord {
    uint8_t dmDeviceName[32];
    uint16_t dmSpecVersion;
    uint16_t dmDriverVersion;
    uint16_t dmSize;
    uint16_t dmDriverExtra;
    uint32_t dmFields;
    int16_t dmOrientation;
    int16_t dmPaperSize;
    int16_t dmPaperLength;
    int16_t dmPaperWidth;
    int16_t dmScale;
    int16_t dmCopies;
    int16_t dmDefaultSource;
    int16_t dmPrintQuality;
    int16_t dmColor;
    int16_t dmDuplex;
    int16_t dmYResolution;
    int16_t dmTTOption;
    int16_t dmCollate;
    uint8_t dmFormName[32];
    uint16_t dmLogPixels;
    uint32_t dmBitsPerPel;
    uint32_t dmPelsWidth;
    uint32_t dmPelsHeight;
    uint32_t dmDisplayFlags;
    uint32_t dmDisplayFrequency;
    uint32_t dmICMMethod;
    uint32_t dmICMIntent;
    uint32_t dmMediaType;
    uint32_t dmDitherType;
    uint32_t dmReserved1;
    uint32_t dmReserved2;
    uint32_t dmPanningWidth;
    uint32_t dmPanningHeight;
};
#pragma pack(pop)
static_assert(sizeof(DevModeRecord) == 156);

/// The device names of the last dialog: the DEVNAMES offsets and the three texts.
struct DevNamesRecord {
    uint16_t wDriverOffset = 0;
    uint16_t wDeviceOffset = 0;
    uint16_t wOutputOffset = 0;
    uint16_t wDefault = 0;
    QString driverName;
    QString deviceName;
    QString outputPort;
};

PrintDlgRecord& PrintDialog();
DevModeRecord& DevMode();
DevNamesRecord& DevNames();

/// Fills the records with the default printer's settings when they hold no device yet
/// (as the system's "return default" query, which refuses to run over existing handles).
/// Never raises.
void InitPrinterSetup();
/// Shows the print dialog through platform::PrintDialogService: page range only when
/// NumPages is not 0 (then pages 1 to NumPages), selection only when NumPages is above 1,
/// Copies preset when above 0. On confirmation copies the choice into the records and makes
/// the chosen printer current with its settings, and returns true. False when cancelled or
/// on any failure, with the records as they were.
bool ShowPrintDialog(int32_t hWndParent, int16_t NumPages, int16_t Copies);
/// Copies the used members of the device settings block of the record into DevMode().
void ReadDevMode();
/// Copies the device names block of the record into DevNames().
void ReadDevNames();
/// Makes the dialog's printer current (when it is another) and applies DevMode() to it.
void ApplySelectedPrinter();

/// Readers of a 16-bit and a 32-bit value at an address.
int16_t ReadInteger(const void* address);
int32_t ReadLong(const void* address);

/// The 32-bit address value hosts are given for a record, or nothing when its address does
/// not fit in 32 bits.
std::optional<int32_t> RecordAddress(const void* record);

} // namespace engine
