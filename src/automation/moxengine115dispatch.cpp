#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "engine/moxengine115.h"
#include "reports/moxreports115.h"

namespace automation {

using engine::MoxEngine115;
using reports::MoxReports115;

void registerMoxEngine115(Registry& registry)
{
    ClassBuilder<MoxEngine115> c(QStringLiteral("MoxEngine115"), QStringLiteral("_MoxEngine115"));
    c.creatable();
    c.method(QStringLiteral("Init"), 0x60030008, &MoxEngine115::Init,
        { param(QStringLiteral("Language")), param(QStringLiteral("XPStyle")),
            param(QStringLiteral("BackColor")), param(QStringLiteral("MDIHwnd")) });
    c.put(QStringLiteral("MainWindowHandle"), 0x68030007, &MoxEngine115::MainWindowHandle);
    c.get(QStringLiteral("LastError"), 0x68030006, &MoxEngine115::LastError);
    c.property<bool>(QStringLiteral("ConnectionFailed"), 0x68030005,
        &MoxEngine115::ConnectionFailed, &MoxEngine115::ConnectionFailed);
    c.method(QStringLiteral("SetLogonInfo"), 0x60030009, &MoxEngine115::SetLogonInfo,
        { param(QStringLiteral("ServerType"), QStringLiteral("MoxServerTypes")),
            param(QStringLiteral("ServerName")), param(QStringLiteral("BaseName")),
            param(QStringLiteral("UserID")), param(QStringLiteral("Info")) });
    c.method(QStringLiteral("GetReports"), 0x6003000a, &MoxEngine115::GetReports, {},
        { .returns = QStringLiteral("MoxReports115") });
    c.method(QStringLiteral("PrinterSetup"), 0x6003000b, &MoxEngine115::PrinterSetup,
        { optionalParam(QStringLiteral("hWndParent"), int32_t(0)),
            optionalParam(QStringLiteral("NumPages"), int16_t(0)),
            optionalParam(QStringLiteral("Copies")) });
    c.method(QStringLiteral("SetProperties"), 0x6003000c, &MoxEngine115::SetProperties,
        { param(QStringLiteral("PropName")), param(QStringLiteral("Value")) });
    c.method(QStringLiteral("Properties"), 0x6003000d, &MoxEngine115::Properties,
        { param(QStringLiteral("PropName")) });
    c.method(QStringLiteral("SetDialogParentWindow"), 0x6003000e,
        &MoxEngine115::SetDialogParentWindow, { param(QStringLiteral("hWnd")) });
    c.method(QStringLiteral("Logoff"), 0x60030014, &MoxEngine115::Logoff);
    c.method(QStringLiteral("CanUnload"), 0x60030015, &MoxEngine115::CanUnload);
    registry.add(c.take());
}

} // namespace automation
