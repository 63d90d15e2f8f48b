// Report parameters: the host's dictionary, the host's answers to QueryParameters and the
// input dialog, applied to the open report.

#include "core/collection.h"
#include "core/comerror.h"
#include "core/dictionary.h"
#include "core/text.h"
#include "platform/messageboxservice.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/moxviewer6exeglobals.h"
#include "runtime/parameterfield.h"
#include "runtime/report.h"

using namespace Qt::StringLiterals;

namespace reports {

namespace {

/// Prompting texts of parameters the host answers through QueryParameters start with it.
const QString ludPromptPrefix = u"LUD#"_s;

void showMessage(const QString& text)
{
    platform::MessageBoxService::active()->showMessage(
        0, text, platform::MessageBoxService::OKOnly, QString());
}

void clearDefaultValues(runtime::ParameterField& parameter)
{
    while (parameter.defaultValueCount() > 0)
        parameter.deleteDefaultValue(1);
}

} // namespace

core::Variant ConvertParameterValue(const core::Variant& value, int16_t valueType)
{
    switch (valueType) {
    case 1:
    case 2:
        return value.toByte();
    case 3:
    case 4:
        return value.toInteger();
    case 5:
    case 6:
        return value.toLong();
    case 7:
    case 8:
        return value.toDouble();
    case 9:
        return value.toBoolean();
    case 10:
    case 11:
    case 16:
        return core::Variant::fromDate(value.toDate());
    case 12:
    case 13:
    case 14:
        return value.toText();
    default:
        return value;
    }
}

bool MoxReport115::SetParams(const std::shared_ptr<core::Dictionary>& Parameters)
{
    try {
        d->Params = Parameters;
        if (!d->CollectedParams)
            d->CollectedParams = std::make_shared<core::Dictionary>(core::Dictionary::TextCompare);
        else
            d->CollectedParams->removeAll();
        d->ParamsApplied = false;
        if (d->Loaded) {
            d->mReport->discardSavedData();
            bool cancelled = false;
            SetParameters(cancelled, false);
        }
        return true;
    } catch (const core::ComError&) {
        return false;
    }
}

void MoxReport115::SetParameters(bool& Cancelled, bool NoDialog)
{
    Q_UNUSED(Cancelled); // kept in the interface; a cancel is raised as an error
    if (!d->mReport)
        throw core::ComError::basic(core::ErrorNumber::ObjectVariableNotSet);
    const auto parameters = d->mReport->parameterFields();

    // One answer serves the whole pass: a handler that leaves it alone hands the previous
    // parameter's answer on to the next one, which hosts rely on to fill several lists.
    core::Variant answer;
    for (const auto& parameter : parameters) {
        const core::Variant value = LookupParamValue(parameter->name());
        if (value.isEmpty()) {
            QString prompt = parameter->prompt();
            if (!IsLUDPrompt(prompt))
                continue;
            // Held here: a handler may close the report, which releases its event object.
            if (const auto events = d->Events; events && !d->ParamsApplied)
                events->QueryParameters(prompt, answer);
            applyAnswer(*parameter, answer);
        } else {
            applyHostValue(*parameter, value);
        }
    }

    if (NoDialog) {
        d->ParamsApplied = true;
        return;
    }
    bool cancelled = false;
    PromptParameters(parameters, cancelled, this);
    if (cancelled) {
        d->UnloadRequest = true;
        throw userCancelledError();
    }

    // Values entered in the dialog are kept, so the next run of this report does not ask
    // for them again.
    if (!d->CollectedParams)
        d->CollectedParams = std::make_shared<core::Dictionary>(core::Dictionary::TextCompare);
    for (const auto& parameter : parameters) {
        const QString name = parameter->name();
        if ((d->Params && d->Params->exists(name)) || d->CollectedParams->exists(name))
            continue;
        if (!parameter->hasCurrentValue())
            continue;
        const int32_t count = parameter->currentValueCount();
        if (count == 1) {
            d->CollectedParams->add(name, parameter->currentValue(1));
        } else {
            std::vector<core::Variant> values;
            for (int32_t i = 1; i <= count; ++i)
                values.push_back(parameter->currentValue(i));
            d->CollectedParams->add(name, core::VariantArray::fromList(values));
        }
    }
    d->ParamsApplied = true;
}

void MoxReport115::applyAnswer(runtime::ParameterField& parameter, const core::Variant& answer)
{
    if (!answer.isArray()) {
        if (answer.isEmpty())
            return;
        const QString text = answer.toText();
        if (core::text::equalsText(text, u"Invalid Filter"_s))
            showMessage(u"Vale filter!"_s);
        else if (core::text::equalsText(text, u"Invalid Table"_s))
            showMessage(u"Vale tabeli nimi!"_s);
        return;
    }
    // answer(0, i) is a value and answer(1, i) its description; the last column is never
    // read. A one-dimensional answer has no second bound and fails here (error 9).
    const core::VariantArray& entries = answer.array();
    const int32_t last = entries.ubound(2);
    if (last < 0)
        return;
    clearDefaultValues(parameter);
    for (int32_t i = 0; i < last; ++i) {
        parameter.addDefaultValue(entries.at({ 0, i }));
        parameter.setDefaultValueDescription(i + 1, entries.at({ 1, i }).toText());
    }
}

void MoxReport115::applyHostValue(runtime::ParameterField& parameter, const core::Variant& value)
{
    // A value the runtime refuses, or one that does not convert, is skipped: the parameter
    // then still needs a value and the dialog asks for it.
    if (value.isArray()) {
        ignoringErrors([&] {
            const core::VariantArray& values = value.array();
            for (int32_t i = 0; i <= values.ubound(1); ++i)
                ignoringErrors([&] { parameter.addCurrentValue(values.at(i)); });
        });
        return;
    }
    core::Variant converted = value;
    ignoringErrors([&] { converted = ConvertParameterValue(value, parameter.valueType()); });
    ignoringErrors([&] { parameter.addCurrentValue(converted); });
}

core::Variant MoxReport115::LookupParamValue(const QString& name) const
{
    try {
        if (d->Params && d->Params->exists(name))
            return d->Params->value(name);
        if (d->CollectedParams && d->CollectedParams->exists(name))
            return d->CollectedParams->value(name);
    } catch (const core::ComError&) {
        // A lookup that fails leaves the parameter to the other sources.
    }
    return {};
}

bool MoxReport115::IsLUDPrompt(const QString& prompt)
{
    return prompt.size() >= 5 && core::text::equalsText(prompt.left(4), ludPromptPrefix);
}

std::shared_ptr<core::Collection> MoxReport115::GetParamsCollection()
{
    openReportForParameters();
    auto pairs = std::make_shared<core::Collection>();
    for (const auto& parameter : d->mReport->parameterFields())
        pairs->add(core::VariantArray::fromList({ parameter->name(), parameter->prompt() }));
    return pairs;
}

std::shared_ptr<core::Dictionary> MoxReport115::GetParamsDictionary()
{
    openReportForParameters();
    auto pairs = std::make_shared<core::Dictionary>();
    int counter = 0;
    for (const auto& parameter : d->mReport->parameterFields()) {
        pairs->add(QString::number(counter++),
            core::VariantArray::fromList({ parameter->name(), parameter->prompt() }));
    }
    return pairs;
}

void MoxReport115::openReportForParameters()
{
    if (d->mReport)
        return;
    if (d->NotOLEDB)
        throw notOleDbError();
    if (d->FileName.isEmpty())
        throw core::ComError::basic(core::ErrorNumber::FileNotFound);
    if (!openReportFile())
        throw notOleDbError();
}

core::Variant MoxReport115::ShowLUDInputBox(
    core::Variant& Params, int32_t& Buttons, QString& Title, bool& Result)
{
    Q_UNUSED(Params);
    Q_UNUSED(Buttons);
    Q_UNUSED(Title);
    Q_UNUSED(Result);
    return {};
}

} // namespace reports
