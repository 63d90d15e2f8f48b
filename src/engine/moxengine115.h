#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"
#include "engine/moxservertypes.h"

#include <QString>
#include <cstdint>
#include <memory>

namespace runtime {
class DatabaseTable;
class Report;
class ReportObject;
} // namespace runtime

namespace reports {
class MoxReports115;
}

namespace engine {

/// The object a host creates first: the user-interface settings every dialog reads, the
/// database logon and its state, the shared printer settings, and the source of report
/// collections. Shared through std::shared_ptr; report collections hold it strongly, the
/// engine holds none of them.
///
/// Creation and destruction update the process-wide state of MoxGlobals: destroying any
/// engine drops the shared runtime application object, so the other engines' next runtime
/// use creates a fresh one. Destruction does not log off; a host calls Logoff first.
class LUDMOX_EXPORT MoxEngine115 : public core::Object {
public:
    MoxEngine115();
    ~MoxEngine115() override;
    MoxEngine115(const MoxEngine115&) = delete;
    MoxEngine115& operator=(const MoxEngine115&) = delete;

    QString className() const override { return QStringLiteral("MoxEngine115"); }

    /// Stores the language, style and colour process-wide and the host's main window here.
    void Init(int16_t Language, bool XPStyle, int32_t BackColor, int32_t MDIHwnd);
    /// Put-only: the host's main window (the same field Init sets).
    void MainWindowHandle(int32_t value);
    /// "number, source, description" of the last logon or table-location failure; never
    /// carries the password.
    QString LastError() const;
    bool ConnectionFailed() const;
    void ConnectionFailed(bool value);

    /// Stores the logon data. The logon is dropped (without logging off) when the server
    /// type changes, when server, database or user id change other than in letter case, or
    /// when the password changes at all. Integrated security is used when the user id is
    /// empty or domain-qualified ("DOMAIN\user"). Always returns true.
    bool SetLogonInfo(MoxServerTypes ServerType, const QString& ServerName, const QString& BaseName,
        const QString& UserID, const QString& Info);

    /// Shows the print dialog for the process-wide printer settings: page range only when
    /// NumPages is not 0 (pages 1 to NumPages), selection only when NumPages is above 1,
    /// copies preset when Copies is above 0. True when the user confirmed; the chosen printer
    /// and settings are then the current printer's.
    bool PrinterSetup(int32_t hWndParent = 0, int16_t NumPages = 0, int16_t Copies = 0);
    /// Sets a printer property ("DeviceName", "Color", "Copies", "PaperBin", "Orientation",
    /// "Duplex", "PaperSize", "PrintQuality") or the temporary folder ("LUDTempPath"); keys
    /// without regard to case. A value the printer refuses or that does not convert is
    /// ignored. Always returns Empty.
    core::Variant SetProperties(const QString& PropName, const core::Variant& Value);
    /// Reads "Printer.DriverName", "Printer.DeviceName", "Printer.Port", "PDEVMODE_PTR",
    /// "PTPRINTDLG_PTR", "GetLUDTempPath", "DialogParentHwnd" or "MDIHandle" (keys without
    /// regard to case); Empty for any other key and on any failure. Also used internally by
    /// the report objects.
    core::Variant Properties(const QString& PropName);

    /// A new, empty report collection that keeps this engine alive; every call gives another
    /// one. Nothing when the collection cannot be made (also when the engine is not owned by
    /// a std::shared_ptr).
    std::shared_ptr<reports::MoxReports115> GetReports();

    void SetDialogParentWindow(int32_t hWnd);

    /// Logs the runtime off the server when logged on, under the crash guard. Never raises:
    /// a failure is remembered and makes CanUnload answer true from then on.
    void Logoff();
    /// True after a failed Logoff; otherwise whether the runtime application can close.
    /// False when the runtime cannot be asked.
    bool CanUnload();

    // Internal operations for the component's own report objects; not part of the dispatch
    // interface.

    /// Logs the runtime on to the server once per set of logon data. False on failure, with
    /// LastError set and ConnectionFailed when the server could not be reached.
    bool LogOn();
    /// Points every table of `report` and of its subreports at the logon's database and
    /// finds the picture objects: the first OLE object whose name lacks "LUDPICTURE"
    /// (oleObject), the last whose name has it (pictureObject) and the last blob field
    /// object (blobObject); slots with no match keep what the caller passed. Returns false
    /// with LastError set on a failure, except that a connection failure (0x80047E44) before
    /// any table was relocated sets ConnectionFailed and is raised to the caller.
    bool SetLocation(const std::shared_ptr<runtime::Report>& report,
        std::shared_ptr<runtime::ReportObject>& oleObject,
        std::shared_ptr<runtime::ReportObject>& pictureObject,
        std::shared_ptr<runtime::ReportObject>& blobObject);

private:
    /// The host's temporary folder, or the system's; always ends with a separator.
    QString GetTempFolder() const;
    void SetTableLocation(const std::shared_ptr<runtime::DatabaseTable>& table);
    void applyConnectionProperties(runtime::DatabaseTable& table) const;
    /// The connection string of the server logon; carries the password.
    QString connectionString() const;
    /// `text` with every occurrence of the password masked.
    QString withoutPassword(const QString& text) const;

    int32_t mHandle = 0;
    MoxServerTypes mServerType = ecstNone;
    QString mServerName;
    QString mBaseName;
    QString mUserID;
    QString mInfo;
    bool mLoggedOn = false;
    bool mLogoffFailed = false;
    QString mLastError;
    bool mConnectionFailed = false;
    int32_t mDialogParentHwnd = 0;
    int32_t mMDIHwnd = 0;
    bool mIntegratedSecurity = false;
    QString mTempPath;
};

} // namespace engine
