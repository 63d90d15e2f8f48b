#include "showinputdialog.h"

#include "core/comerror.h"
#include "dateentrysettings.h"
#include "dialogslogging_p.h"
#include "frminputbox.h"
#include "platform/windowhandles.h"

namespace dialogs {

bool ShowInputDialog(
    const std::shared_ptr<InputBoxParams>& params, int32_t buttons, const QString& title)
{
    const QString ownerKey = QStringLiteral("MDIHandle");
    try {
        setDateEntrySettings(DateEntrySettings::fromSystem());
        frmInputBox form;
        form.HelpContextID = params ? params->HelpId : 0;
        int32_t owner = 0;
        if (params && params->Exists(ownerKey)) {
            try {
                owner = params->Item(ownerKey)->Value.toLong();
            } catch (const core::ComError&) {
                owner = 0;
            }
            params->Remove(ownerKey);
        }
        form.ShowBox(params, buttons, title);
        if (owner != 0)
            platform::WindowHandles::setOwner(&form, owner);
        form.exec();
        return form.Result;
    } catch (const core::ComError& error) {
        qCWarning(lcDialogs) << "parameter dialog failed:" << error.description();
        return false;
    }
}

} // namespace dialogs
