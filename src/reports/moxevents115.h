#pragma once

#include "core/eventsource.h"
#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>

namespace reports {

/// The event source of one report. The report calls a method; the method raises the event of
/// the same role to every connected handler, in connection order, and returns what the
/// handlers left in the by-reference arguments. With no handler connected the arguments come
/// back unchanged. An error a handler raises reaches the caller.
class LUDMOX_EXPORT MoxEvents115 : public core::Object, public core::EventSource {
public:
    /// Dispatch ids of the outgoing interface.
    enum EventId : int32_t {
        QueryParametersEvent = 1,
        ErrorOccuredEvent = 2,
        ShowParametersDialogEvent = 3,
        AfterDialogsEvent = 4,
    };

    QString className() const override { return QStringLiteral("MoxEvents115"); }

    /// Raises "QueryParameters" (Prompt, Parameters): the host may answer a "LUD#" prompt by
    /// filling Parameters. A Prompt the handler set to a non-text value is converted as a
    /// String argument is (Null raises 94).
    void QueryParameters(QString& Prompt, core::Variant& Parameters);
    /// Raises "ErrorOccured" (errorMsg); the spelling is the one hosts have always bound to.
    void ErrorOccured(const QString& errorMsg);
    /// Raises "ShowParametersDialogEvent" (Parameters, Cancelled): Parameters holds the input
    /// field list object; the host may show its own dialog and set Cancelled.
    void ShowParametersDialog(core::Variant& Parameters, bool& Cancelled);
    /// Raises "AfterDialogs" once the print pipeline's dialogs are closed.
    void AfterDialogs();
};

} // namespace reports
