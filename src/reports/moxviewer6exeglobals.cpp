#include "reports/moxviewer6exeglobals.h"

#include "core/comerror.h"
#include "core/text.h"
#include "core/variant.h"
#include "dialogs/dateentrysettings.h"
#include "dialogs/frminputbox.h"
#include "dialogs/inputboxparams.h"
#include "dialogs/uistrings.h"
#include "engine/moxengine115.h"
#include "platform/display.h"
#include "platform/windowhandles.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/moxreports115.h"
#include "reports/reportslogging_p.h"
#include "runtime/parameterfield.h"
#include "runtime/parametervaluetype.h"

#include <QDateTime>
#include <QWidget>
#include <QWindow>
#include <optional>
#include <utility>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

/// The reserved item that carries the dialog's owner window.
const QString ownerItem = u"MDIHandle"_s;
/// Buttons value of the parameter dialog: OK and Cancel.
constexpr int32_t okCancel = 1;

InputBoxPresenter& installedPresenter()
{
    static InputBoxPresenter presenter;
    return presenter;
}

bool isNumericCode(int16_t code)
{
    using runtime::ParameterValueType;
    return code >= static_cast<int16_t>(ParameterValueType::SignedByte)
        && code <= static_cast<int16_t>(ParameterValueType::Currency);
}

bool isDateCode(int16_t code)
{
    using runtime::ParameterValueType;
    const auto type = static_cast<ParameterValueType>(code);
    return type == ParameterValueType::Date || type == ParameterValueType::Time
        || type == ParameterValueType::DateTime;
}

/// The parameter's name as the dialog shows it: "{?Customer}" becomes "Customer".
QString fieldName(const runtime::ParameterField& parameter)
{
    QString name = core::text::trimSpaces(parameter.formulaName());
    if (name.startsWith(u'{'))
        name.remove(0, 1);
    if (name.startsWith(u'?'))
        name.remove(0, 1);
    if (name.endsWith(u'}'))
        name.chop(1);
    return name;
}

/// The text a default-list entry is shown with: its description, or its value.
QString shownText(const runtime::ParameterField& parameter, int32_t entry)
{
    // The choices are shown and compared as Unicode text; there is no narrower code page
    // for them to pass through.
    const QString description = parameter.defaultValueDescription(entry);
    if (!core::text::trimSpaces(description).isEmpty())
        return description;
    return parameter.defaultValueAt(entry).toText();
}

core::Variant currentTime()
{
    const int seconds = QTime::currentTime().msecsSinceStartOfDay() / 1000;
    return core::Variant::fromDate(seconds / 86400.0);
}

/// What a date field starts with when the parameter has no default value.
core::Variant initialDate(int16_t code)
{
    if (code == 16)
        return core::Variant::fromDateTime(QDateTime::currentDateTime());
    if (code == 11)
        return currentTime();
    return core::Variant::fromDate(QDate::currentDate());
}

void describeChoices(
    const runtime::ParameterField& parameter, dialogs::InputBoxParamsItem& item, int32_t count)
{
    const bool multi = parameter.allowsMultipleValues();
    core::VariantArray list = multi
        ? core::VariantArray({ { 0, count - 1 }, { 0, 1 } })
        : core::VariantArray({ { 0, count - 1 } }, core::VariantType::String);
    for (int32_t j = 0; j < count; ++j) {
        ignoringErrors([&] {
            const QString description = parameter.defaultValueDescription(j + 1);
            const bool described = !core::text::trimSpaces(description).isEmpty();
            if (multi)
                list.at({ j, 0 })
                    = described ? core::Variant(description) : parameter.defaultValueAt(j + 1);
            else
                list.at(j) = shownText(parameter, j + 1);
        });
        ignoringErrors([&] {
            if (parameter.hasDefaultValue()
                && parameter.defaultValue() == parameter.defaultValueAt(j + 1)) {
                if (multi)
                    list.at({ j, 1 }) = true;
                else
                    item.DefaultValue = list.at(j);
            }
        });
    }
    item.Value = list;
    if (multi)
        item.MultiSelect = true;
    ignoringErrors([&] {
        if (parameter.onlyListedValues())
            item.SelectOnly = true;
    });
}

void describeField(const runtime::ParameterField& parameter, dialogs::InputBoxParamsItem& item)
{
    const int16_t code = parameter.valueType();
    switch (code) {
    case 9:
        item.IsCheck = true;
        break;
    case 10:
    case 11:
    case 16:
        item.DateFormat = true;
        item.IsMemo = true;
        item.MustExist = true;
        break;
    case 1:
    case 2:
    case 3:
    case 4:
    case 5:
    case 6:
    case 7:
        item.NumericFormat = true;
        break;
    default:
        break;
    }
    // The designer's default value is what the field starts with.
    if (parameter.hasDefaultValue()) {
        item.Value = parameter.defaultValue();
        return;
    }
    if (isDateCode(code))
        item.Value = initialDate(code);
    else if (code >= 1 && code <= 7)
        item.Value = int16_t(0);
    else if (code >= 12 && code <= 14)
        item.Value = QString();
}

std::shared_ptr<runtime::ParameterField> parameterNamed(
    const std::vector<std::shared_ptr<runtime::ParameterField>>& parameters, const QString& name)
{
    for (const auto& parameter : parameters) {
        if (core::text::equalsText(fieldName(*parameter), name))
            return parameter;
    }
    throw core::ComError::basic(core::ErrorNumber::SubscriptOutOfRange);
}

/// The typed value of an answer; a blank answer gives the type's zero (today for dates).
core::Variant answerValue(const core::Variant& value, int16_t code)
{
    const bool blank
        = !value.isArray() && !value.isObject() && !value.isNull() && value.toText().isEmpty();
    if (blank) {
        if (isNumericCode(code))
            return ConvertParameterValue(int16_t(0), code);
        if (code == 9)
            return false;
        if (isDateCode(code))
            return core::Variant::fromDate(QDate::currentDate());
    }
    return ConvertParameterValue(value, code);
}

void writeBack(runtime::ParameterField& parameter, const dialogs::InputBoxParamsItem& item)
{
    core::Variant value = item.Value;
    const int32_t count = parameter.defaultValueCount();
    if (count > 0) {
        if (parameter.allowsMultipleValues() && item.MultiSelect) {
            if (item.SelectionCount == 0) {
                parameter.addCurrentValue(QString());
                return;
            }
            for (int32_t k = 0; k < item.SelectionCount; ++k) {
                ignoringErrors([&] {
                    const QString selected = value.array().at(k).toText();
                    for (int32_t j = 1; j <= count; ++j) {
                        if (shownText(parameter, j) == selected) {
                            parameter.addCurrentValue(parameter.defaultValueAt(j));
                            break;
                        }
                    }
                });
            }
            return;
        }
        // A choice shown by its description stands for its value.
        for (int32_t j = 1; j <= count; ++j) {
            ignoringErrors([&] {
                const QString description = parameter.defaultValueDescription(j);
                if (!core::text::trimSpaces(description).isEmpty()
                    && core::Variant(description) == value)
                    value = parameter.defaultValueAt(j);
            });
        }
    }
    core::Variant converted = value;
    ignoringErrors([&] { converted = answerValue(value, parameter.valueType()); });
    parameter.addCurrentValue(converted);
}

void writeBackAll(const std::vector<std::shared_ptr<runtime::ParameterField>>& parameters,
    const dialogs::InputBoxParams& answers)
{
    for (const auto& item : answers.NewEnum()) {
        ignoringErrors([&] { writeBack(*parameterNamed(parameters, item->Name), *item); });
    }
}

struct HostAnswer {
    std::shared_ptr<dialogs::InputBoxParams> params;
    bool cancelled = false;
};

/// Raises ShowParametersDialogEvent when the host handles it: the host answers in place of
/// the dialog, through the items' values (as the dialog leaves them after OK) and Cancelled.
/// Nothing when no handler takes the event.
std::optional<HostAnswer> askHost(
    const std::shared_ptr<dialogs::InputBoxParams>& model, MoxReport115* report)
{
    if (!report)
        return std::nullopt;
    // Held here: a handler may close the report, which releases its event object.
    const auto events = report->MoxEvents();
    if (!events->hasHandlerFor(MoxEvents115::ShowParametersDialogEvent))
        return std::nullopt;
    core::Variant params { core::ObjectPtr(model) };
    bool cancelled = false;
    try {
        events->ShowParametersDialog(params, cancelled);
    } catch (const core::ComError& error) {
        // A handler that fails gave no answer; nothing of the model can be trusted.
        qCWarning(lcReports) << "the host's parameter dialog failed:" << error.description();
        return HostAnswer { model, true };
    }
    // The host may hand back a field list of its own; anything else leaves the model.
    std::shared_ptr<dialogs::InputBoxParams> answers = model;
    ignoringErrors([&] {
        if (auto own = params.objectAs<dialogs::InputBoxParams>())
            answers = std::move(own);
    });
    return HostAnswer { std::move(answers), cancelled };
}

/// The input dialog, owned by the host's window, shown modally. Where nobody can answer it
/// (no display) it is not shown and counts as cancelled, rather than waiting for ever.
bool showInputBox(const std::shared_ptr<dialogs::InputBoxParams>& params, int32_t buttons,
    const QString& title, int32_t owner)
{
    if (!platform::Display::isInteractive()) {
        qCInfo(lcReports) << "no display to show the parameter dialog on: cancelled";
        return false;
    }
    dialogs::frmInputBox form;
    form.HelpContextID = params->HelpId;
    form.ShowBox(params, buttons, title);
    if (owner != 0)
        SetOwnerWindow(platform::WindowHandles::handle(&form), owner);
    form.exec();
    return form.Result;
}

} // namespace

void PromptParameters(const std::vector<std::shared_ptr<runtime::ParameterField>>& Parameters,
    bool& Cancelled, MoxReport115* Report)
{
    auto model = std::make_shared<dialogs::InputBoxParams>();
    model->NoIco = true;
    model->LabelAutoSize = true;
    model->InputHeight = int16_t(2000);
    model->InputWidth = int16_t(1000);
    model->LabelLeftAlign = true;
    model->NoDefault = true;

    bool anyField = false;
    for (const auto& parameter : Parameters) {
        ignoringErrors([&] {
            if (!parameter->needsCurrentValue())
                return;
            anyField = true;
            const QString name = fieldName(*parameter);
            const auto item = model->Item(name);
            ignoringErrors([&] {
                const QString prompt = parameter->prompt();
                item->LabelToolTip = core::text::trimSpaces(prompt).isEmpty() ? name : prompt;
            });
            QString label = name;
            if (!label.isEmpty())
                label[0] = label.at(0).toUpper();
            item->Label = label + (name.endsWith(u':') ? u" "_s : u": "_s);
            const int32_t count = parameter->defaultValueCount();
            if (count > 0)
                describeChoices(*parameter, *item, count);
            else
                describeField(*parameter, *item);
        });
    }
    if (!anyField)
        return;

    if (const auto answered = askHost(model, Report)) {
        Cancelled = answered->cancelled;
        if (!Cancelled)
            writeBackAll(Parameters, *answered->params);
        return;
    }

    if (Report) {
        ignoringErrors([&] {
            const auto parent = Report->GetParent();
            const auto owner = parent ? parent->GetEngine() : nullptr;
            if (owner)
                model->Item(ownerItem)->Value = owner->Properties(ownerItem);
        });
    }

    const bool ok = ShowInputDialog(
        model, okCancel, dialogs::GetUIString(dialogs::UIString::EnterParameterValues));
    Cancelled = !ok;
    if (ok)
        writeBackAll(Parameters, *model);
}

bool ShowInputDialog(
    const std::shared_ptr<dialogs::InputBoxParams>& Params, int32_t Buttons, const QString& Title)
{
    try {
        // The dialog's date fields follow the user's short-date format as it is now.
        dialogs::setDateEntrySettings(dialogs::DateEntrySettings::fromSystem());
        int32_t owner = 0;
        if (Params->Exists(ownerItem)) {
            ignoringErrors([&] { owner = Params->Item(ownerItem)->Value.toLong(); });
            Params->Remove(ownerItem);
        }
        const InputBoxPresenter& presenter = installedPresenter();
        if (presenter)
            return presenter(Params, Buttons, Title, owner);
        return showInputBox(Params, Buttons, Title, owner);
    } catch (const core::ComError&) {
        return false;
    }
}

int32_t SetOwnerWindow(int32_t Hwnd, int32_t OwnerHwnd)
{
    QWidget* widget = platform::WindowHandles::findWidget(Hwnd);
    if (!widget)
        return 0;
    int32_t previous = 0;
    if (const QWindow* window = widget->window()->windowHandle()) {
        if (QWindow* parent = window->transientParent())
            previous = platform::WindowHandles::handle(parent);
    }
    platform::WindowHandles::setOwner(widget, OwnerHwnd);
    return previous;
}

InputBoxPresenter SetInputBoxPresenter(InputBoxPresenter presenter)
{
    return std::exchange(installedPresenter(), std::move(presenter));
}

} // namespace reports
