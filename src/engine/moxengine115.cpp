#include "engine/moxengine115.h"

#include "core/comerror.h"
#include "engine/luderrorhandler.h"
#include "engine/ludpsetup.h"
#include "engine/moxglobals.h"
#include "platform/currentprinter.h"
#include "platform/printers.h"
#include "platform/tempfolder.h"
#include "reports/moxreports115.h"
#include "runtime/application.h"
#include "runtime/databasetable.h"
#include "runtime/parameterfield.h"
#include "runtime/report.h"
#include "runtime/reportobject.h"
#include "runtime/section.h"

#include <QRandomGenerator>
#include <functional>

namespace engine {

namespace {
const QString oleDbDriver = QStringLiteral("PDSOLEDB.DLL");
const QString applicationTitle = QStringLiteral("LUDMoxViewer115");
const QString passwordMask = QStringLiteral("********");

/// Object handles only name engines in trace texts; a counter is unique for the process.
int32_t nextHandle()
{
    static int32_t last = 0;
    return ++last;
}

/// Runs one step whose failure must not stop the next one.
void ignoringErrors(const std::function<void()>& step)
{
    try {
        step();
    } catch (...) {
        // The step is optional; what follows works without it.
    }
}
} // namespace

MoxEngine115::MoxEngine115()
{
    TraceWrite(QStringLiteral("+\r\nMoxEngine_Initialize"), QString(), false);
    ++gEngineCount;
    ignoringErrors([] {
        gInstanceLogFile
            = platform::TempFolder::systemPath() + QStringLiteral("LUDMoxViewer115Log.txt");
    });
    mHandle = nextHandle();
    ignoringErrors([] { InitPrinterSetup(); });
    TraceWrite(QStringLiteral("LUDMoxViewer115.MoxEngine115 Class_Initialize. Handle:")
            + QString::number(mHandle) + QStringLiteral(", RefCount=")
            + QString::number(gEngineCount),
        gInstanceLogFile, false);
}

MoxEngine115::~MoxEngine115()
{
    ReleaseApplication();
    TraceWrite(QStringLiteral("MoxEngine_Terminate"), QString(), false);
    --gEngineCount;
    TraceWrite(QStringLiteral("LUDMoxViewer115.MoxEngine115 Class_Terminate. Handle:")
            + QString::number(mHandle) + QStringLiteral(", RefCount=")
            + QString::number(gEngineCount),
        gInstanceLogFile, false);
}

void MoxEngine115::Init(int16_t Language, bool XPStyle, int32_t BackColor, int32_t MDIHwnd)
{
    gLanguage = Language;
    gXPStyle = XPStyle;
    gBackColor = BackColor;
    mMDIHwnd = MDIHwnd;
}

void MoxEngine115::MainWindowHandle(int32_t value)
{
    mMDIHwnd = value;
}

QString MoxEngine115::LastError() const
{
    return mLastError;
}

bool MoxEngine115::ConnectionFailed() const
{
    return mConnectionFailed;
}

void MoxEngine115::ConnectionFailed(bool value)
{
    mConnectionFailed = value;
}

bool MoxEngine115::SetLogonInfo(MoxServerTypes ServerType, const QString& ServerName,
    const QString& BaseName, const QString& UserID, const QString& Info)
{
    if (ServerType != mServerType) {
        mServerType = ServerType;
        gServerType = ServerType;
        mLoggedOn = false;
    }
    // Server, database and user names are not case-sensitive on the servers the component
    // serves, so a change of case alone keeps the logon and the stored spelling.
    const auto update = [this](QString& field, const QString& value) {
        if (field.compare(value, Qt::CaseInsensitive) != 0) {
            field = value;
            mLoggedOn = false;
        }
    };
    update(mServerName, ServerName);
    update(mBaseName, BaseName);
    update(mUserID, UserID);
    // Passwords are case-sensitive: a password that differs only in case is another
    // password and must reach the server.
    if (mInfo != Info) {
        mInfo = Info;
        mLoggedOn = false;
    }
    mIntegratedSecurity = mUserID.isEmpty() || mUserID.contains(u'\\');
    return true;
}

std::shared_ptr<reports::MoxReports115> MoxEngine115::GetReports()
{
    try {
        auto collection = std::make_shared<reports::MoxReports115>();
        collection->SetEngine(std::static_pointer_cast<MoxEngine115>(shared_from_this()));
        return collection;
    } catch (...) {
        return nullptr;
    }
}

void MoxEngine115::SetDialogParentWindow(int32_t hWnd)
{
    mDialogParentHwnd = hWnd;
}

bool MoxEngine115::PrinterSetup(int32_t hWndParent, int16_t NumPages, int16_t Copies)
{
    return ShowPrintDialog(hWndParent, NumPages, Copies);
}

core::Variant MoxEngine115::SetProperties(const QString& PropName, const core::Variant& Value)
{
    const auto is
        = [&](QStringView key) { return PropName.compare(key, Qt::CaseInsensitive) == 0; };
    try {
        platform::CurrentPrinter& printer = platform::CurrentPrinter::instance();
        if (is(u"DeviceName")) {
            const QString name = Value.toText();
            if (printer.deviceName().compare(name, Qt::CaseInsensitive) == 0)
                return {};
            for (const auto& installed : platform::Printers::installed()) {
                if (installed.deviceName().compare(name, Qt::CaseInsensitive) == 0) {
                    printer.select(installed);
                    break;
                }
            }
        } else if (is(u"Color")) {
            printer.setColorMode(Value.toInteger());
        } else if (is(u"Copies")) {
            printer.setCopies(Value.toInteger());
        } else if (is(u"PaperBin")) {
            printer.setPaperBin(Value.toInteger());
        } else if (is(u"Orientation")) {
            printer.setOrientation(Value.toInteger());
        } else if (is(u"Duplex")) {
            // The copy follows the printer only when the printer took the value, so the two
            // never disagree.
            const int16_t duplex = Value.toInteger();
            printer.setDuplex(duplex);
            DevMode().dmDuplex = duplex;
        } else if (is(u"PaperSize")) {
            const int16_t paperSize = Value.toInteger();
            printer.setPaperSize(paperSize);
            DevMode().dmPaperSize = paperSize;
        } else if (is(u"PrintQuality")) {
            printer.setPrintQuality(Value.toInteger());
        } else if (is(u"LUDTempPath")) {
            mTempPath = Value.toText();
        }
    } catch (...) {
        // A property the host cannot set is no reason to fail its caller.
    }
    return {};
}

core::Variant MoxEngine115::Properties(const QString& PropName)
{
    const auto is
        = [&](QStringView key) { return PropName.compare(key, Qt::CaseInsensitive) == 0; };
    const auto address = [](const void* record) {
        const auto value = RecordAddress(record);
        return value ? core::Variant(*value) : core::Variant();
    };
    try {
        const platform::CurrentPrinter& printer = platform::CurrentPrinter::instance();
        if (is(u"Printer.DriverName"))
            return printer.driverName();
        if (is(u"Printer.DeviceName"))
            return printer.deviceName();
        if (is(u"Printer.Port"))
            return printer.port();
        if (is(u"PDEVMODE_PTR"))
            return address(&DevMode());
        if (is(u"PTPRINTDLG_PTR"))
            return address(&PrintDialog());
        if (is(u"GetLUDTempPath"))
            return GetTempFolder();
        if (is(u"DialogParentHwnd"))
            return mDialogParentHwnd;
        if (is(u"MDIHandle"))
            return mMDIHwnd;
    } catch (...) {
        // Callers treat Empty as "not available".
    }
    return {};
}

QString MoxEngine115::GetTempFolder() const
{
    QString path = mTempPath.isEmpty() ? platform::TempFolder::systemPath() : mTempPath;
    // A host may still give a folder in the original platform's notation.
    if (!path.endsWith(u'/') && !path.endsWith(u'\\'))
        path += u'/';
    return path;
}

void MoxEngine115::Logoff()
{
    const auto step = [this](const std::function<void()>& action) {
        try {
            action();
        } catch (...) {
            mLogoffFailed = true;
        }
    };
    step([] { InstallExceptionFilter(); });
    step([this] {
        if (!mLoggedOn)
            return;
        mLoggedOn = false;
        // Taken outside the guarded call: a crash unwinds it without running destructors,
        // and the application must not be left referenced.
        const auto application = GetApplication();
        GuardedCall([&] {
            application->logOffServer(oleDbDriver, mServerName, mBaseName, mUserID, mInfo);
        });
    });
    step([] { RemoveExceptionFilter(); });
}

bool MoxEngine115::CanUnload()
{
    if (mLogoffFailed)
        return true;
    try {
        return GetApplication()->canClose();
    } catch (const core::ComError&) {
        // A runtime that cannot answer may still hold reports or a logon.
        return false;
    }
}

bool MoxEngine115::LogOn()
{
    mLastError.clear();
    mConnectionFailed = false;
    try {
        if (mLoggedOn)
            return true;
        if (mServerType == ecstNone)
            throw core::ComError(0, QString(), QString());
        const auto application = GetApplication();
        application->setMatchLogOnInfo(true);
        application->logOnServer(oleDbDriver, mServerName, mBaseName, mUserID, mInfo,
            QStringLiteral("SQLOLEDB"), connectionString());
        mLoggedOn = true;
        return true;
    } catch (const core::ComError& error) {
        mLastError = withoutPassword(error.lastErrorText());
        if (error.number() == core::ErrorNumber::LogOnFailed)
            mConnectionFailed = true;
        return false;
    }
}

QString MoxEngine115::connectionString() const
{
    // A random suffix tells the server's session list apart per process.
    const QString applicationName
        = applicationTitle + u'.' + QString::number(QRandomGenerator::global()->bounded(10000));
    return QStringLiteral("Provider=SQLOLEDB;Server=") + mServerName + QStringLiteral(";Database=")
        + mBaseName + QStringLiteral(";App=") + applicationName + QStringLiteral(";UID=") + mUserID
        + QStringLiteral(";PWD=") + mInfo
        + (mIntegratedSecurity
                ? QStringLiteral(";Integrated Security=True;Persist Security Info=False;")
                : QStringLiteral(";Persist Security Info=False;"));
}

QString MoxEngine115::withoutPassword(const QString& text) const
{
    if (mInfo.isEmpty())
        return text;
    QString masked = text;
    return masked.replace(mInfo, passwordMask);
}

bool MoxEngine115::SetLocation(const std::shared_ptr<runtime::Report>& report,
    std::shared_ptr<runtime::ReportObject>& oleObject,
    std::shared_ptr<runtime::ReportObject>& pictureObject,
    std::shared_ptr<runtime::ReportObject>& blobObject)
{
    mLastError.clear();
    mConnectionFailed = false;
    bool relocated = false;
    bool oleFound = false;
    if (!report) {
        mLastError = core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet).lastErrorText();
        return false;
    }

    // Resetting first keeps no parent from an earlier engine when this one has none.
    ignoringErrors([&] { report->setDialogParentWindow(0); });
    if (mDialogParentHwnd != 0)
        ignoringErrors([&] { report->setDialogParentWindow(mDialogParentHwnd); });

    const auto pictureTest = [&](const std::shared_ptr<runtime::ReportObject>& object) {
        const QString type = object->typeName();
        if (type == u"ICROleObject") {
            if (object->name().contains(u"LUDPICTURE", Qt::CaseInsensitive)) {
                pictureObject = object;
            } else if (!oleFound) {
                oleObject = object;
                oleFound = true;
            }
        } else if (type == u"IBlobFieldObject") {
            blobObject = object;
        }
    };

    try {
        for (const auto& table : report->databaseTables()) {
            applyConnectionProperties(*table);
            if (table->location().compare(u"Command", Qt::CaseInsensitive) != 0) {
                SetTableLocation(table);
                relocated = true;
            }
        }
        for (const auto& section : report->sections()) {
            for (const auto& object : section->reportObjects()) {
                if (object->typeName() != u"ISubreportObject") {
                    pictureTest(object);
                    continue;
                }
                const auto subreport = object->openSubreport();
                for (const auto& table : subreport->databaseTables()) {
                    applyConnectionProperties(*table);
                    const QString location = table->location();
                    if (location.compare(u"Command", Qt::CaseInsensitive) == 0)
                        continue;
                    if (!location.endsWith(u";1")) {
                        SetTableLocation(table);
                        relocated = true;
                        continue;
                    }
                    // A stored procedure: its parameters would otherwise prompt the user
                    // when the subreport runs.
                    SetTableLocation(table);
                    for (const auto& parameter : subreport->parameterFields()) {
                        if (parameter->kind() == 2 && !parameter->hasCurrentValue()
                            && parameter->hasDefaultValue() && parameter->needsCurrentValue())
                            parameter->addCurrentValue(parameter->defaultValueAt(1));
                    }
                    subreport->setEnableParameterPrompting(false);
                }
                for (const auto& subSection : subreport->sections()) {
                    for (const auto& subObject : subSection->reportObjects())
                        pictureTest(subObject);
                }
            }
        }
        return true;
    } catch (const core::ComError& error) {
        if (error.number() == core::ErrorNumber::TableConnectionFailed && !relocated) {
            mConnectionFailed = true;
            throw core::ComError(error.number(), withoutPassword(error.source()),
                withoutPassword(error.description()));
        }
        mLastError = withoutPassword(error.lastErrorText());
        return false;
    }
}

void MoxEngine115::SetTableLocation(const std::shared_ptr<runtime::DatabaseTable>& table)
{
    QString location = table->location();
    // "Shop.dbo.Orders" names the database and owner of the designer's server; the logon's
    // database is meant, so only the table name stays.
    const qsizetype dot = location.lastIndexOf(u'.');
    if (dot >= 0)
        location = location.mid(dot + 1);
    try {
        table->setLocation(location, QString(), QString());
    } catch (const core::ComError& error) {
        if (error.number() == core::ErrorNumber::TableConnectionFailed)
            throw;
        throw core::ComError(core::ErrorNumber::SetLocationFailed,
            QStringLiteral("MoxEngine.SetLocation"),
            QStringLiteral("Setting Table Location for ") + location);
    }
}

void MoxEngine115::applyConnectionProperties(runtime::DatabaseTable& table) const
{
    QString provider;
    switch (mServerType) {
    case ecstMSSQL:
        provider = QStringLiteral("SQLOLEDB");
        break;
    case ecstMSJET:
        provider = QStringLiteral("Microsoft.Jet.OLEDB.3.51");
        break;
    case ecstMSJET40:
        provider = QStringLiteral("Microsoft.Jet.OLEDB.4.0");
        break;
    default:
        // No server type (or one the component does not know): the report keeps its own
        // connection.
        return;
    }
    table.deleteConnectionProperties();
    table.addConnectionProperty(QStringLiteral("Provider"), provider);
    table.addConnectionProperty(QStringLiteral("Data Source"), mServerName);
    table.addConnectionProperty(QStringLiteral("Initial Catalog"), mBaseName);
    if (mServerType == ecstMSSQL && mIntegratedSecurity)
        table.addConnectionProperty(QStringLiteral("Integrated Security"), true);
    table.addConnectionProperty(QStringLiteral("User ID"), mUserID);
    table.addConnectionProperty(QStringLiteral("Password"), mInfo);
    if (mServerType == ecstMSSQL) {
        table.addConnectionProperty(QStringLiteral("Server Name"), mServerName);
        table.addConnectionProperty(QStringLiteral("Server Type"), QStringLiteral("OLEDB"));
        table.addConnectionProperty(QStringLiteral("DataBase"), mBaseName);
    }
}

} // namespace engine
