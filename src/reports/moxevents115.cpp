#include "reports/moxevents115.h"

#include <array>

using namespace Qt::StringLiterals;

namespace reports {

void MoxEvents115::QueryParameters(QString& Prompt, core::Variant& Parameters)
{
    std::array<core::Variant, 2> args { Prompt, Parameters };
    raise(QueryParametersEvent, u"QueryParameters"_s, args);
    // Converted before anything is written back, so a bad Prompt leaves both untouched.
    QString prompt = args[0].toText();
    Prompt = std::move(prompt);
    Parameters = std::move(args[1]);
}

void MoxEvents115::ErrorOccured(const QString& errorMsg)
{
    std::array<core::Variant, 1> args { errorMsg };
    raise(ErrorOccuredEvent, u"ErrorOccured"_s, args);
}

void MoxEvents115::ShowParametersDialog(core::Variant& Parameters, bool& Cancelled)
{
    std::array<core::Variant, 2> args { Parameters, Cancelled };
    raise(ShowParametersDialogEvent, u"ShowParametersDialogEvent"_s, args);
    const bool cancelled = args[1].toBoolean();
    Parameters = std::move(args[0]);
    Cancelled = cancelled;
}

void MoxEvents115::AfterDialogs()
{
    raise(AfterDialogsEvent, u"AfterDialogs"_s, {});
}

} // namespace reports
