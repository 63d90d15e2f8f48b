#include "core/collection.h"
#include "dialogs/dateentrysettings.h"
#include "reportfixture.h"

#include <QLocale>

namespace {

using namespace reporttest;
using fakeruntime::FakeParameterField;

/// Type and invariant text, so that a Long 5 and a String "5" differ.
QString typed(const core::Variant& value)
{
    return QString::number(value.varType()) + u':' + value.toInvariantText();
}

QStringList typed(const std::vector<core::Variant>& values)
{
    QStringList result;
    for (const auto& value : values)
        result << typed(value);
    return result;
}

/// A two-dimensional QueryParameters answer: row 0 values, row 1 descriptions.
core::Variant answerTable(const std::vector<std::pair<core::Variant, QString>>& columns)
{
    core::VariantArray table(
        { { 0, 1 }, { 0, static_cast<int32_t>(columns.size()) - 1 } }, core::VariantType::Variant);
    for (int32_t i = 0; i < static_cast<int32_t>(columns.size()); ++i) {
        table.at({ 0, i }) = columns[static_cast<size_t>(i)].first;
        table.at({ 1, i }) = columns[static_cast<size_t>(i)].second;
    }
    return table;
}

class ReportParameters : public ReportTest {
protected:
    void SetUp() override
    {
        ReportTest::SetUp();
        file = addOrdersReport();
        report = open();
    }

    std::shared_ptr<FakeParameterField> parameter(FakeParameterField::State state)
    {
        return addParameter(*file, std::move(state));
    }

    /// Answers the dialog by item name; items not named keep their value.
    void answerDialog(
        std::map<QString, core::Variant> values, std::map<QString, int32_t> counts = {})
    {
        dialog.answer = [values, counts](dialogs::InputBoxParams& model) {
            for (const auto& item : model.NewEnum()) {
                if (const auto found = values.find(item->Name); found != values.end())
                    item->Value = found->second;
                if (const auto found = counts.find(item->Name); found != counts.end())
                    item->SelectionCount = found->second;
            }
            return true;
        };
    }

    void runSetParameters(bool noDialog = false)
    {
        bool cancelled = false;
        report->SetParameters(cancelled, noDialog);
    }

    std::shared_ptr<fakeruntime::FakeReport> file;
    std::shared_ptr<reports::MoxReport115> report;
};

TEST_F(ReportParameters, HostValuesAreConvertedByValueType)
{
    struct Case {
        const char* name;
        int16_t valueType;
        core::Variant hostValue;
        QStringList expected;
    };
    const Case cases[] = {
        { "digits for a Long", 5, u"42"_s, { u"3:42"_s } },
        // The runtime may refuse it; the component passes it on as it is.
        { "letters for a Long", 5, u"abc"_s, { u"8:abc"_s } },
        { "too big for an Integer", 3, int32_t(70000), { u"3:70000"_s } },
        { "a number for a byte", 1, int32_t(200), { u"17:200"_s } },
        { "a Long for a number", 7, int32_t(3), { u"5:3"_s } },
        { "a number for a Boolean", 9, int32_t(1), { u"11:True"_s } },
        { "a number for a text", 12, int32_t(5), { u"8:5"_s } },
        { "anything for the other type", 15, int32_t(5), { u"3:5"_s } },
        { "several values are not converted", 5,
            core::VariantArray::fromList({ u"1"_s, u"2"_s, u"3"_s }),
            { u"8:1"_s, u"8:2"_s, u"8:3"_s } },
        // Counting from 0 skips nothing of an array that starts at 1.
        { "an array starting at 1", 12, core::VariantArray::fromList({ u"a"_s, u"b"_s }, 1),
            { u"8:a"_s, u"8:b"_s } },
    };
    auto values = std::make_shared<core::Dictionary>();
    std::vector<std::shared_ptr<FakeParameterField>> fields;
    int index = 0;
    for (const Case& c : cases) {
        const QString name = u"P"_s + QString::number(index++);
        fields.push_back(parameter(Param(name).type(c.valueType)));
        values->add(name, c.hostValue);
    }
    report->SetParams(values);
    ASSERT_TRUE(load(*report));
    for (size_t i = 0; i < fields.size(); ++i)
        EXPECT_EQ(typed(fields[i]->state.currentValues), cases[i].expected) << cases[i].name;
    EXPECT_EQ(dialog.shown, 0);
}

TEST_F(ReportParameters, AValueTheRuntimeRefusesIsSkippedAndAskedFor)
{
    // Without the helper's hook: a refused value leaves the parameter needing one.
    file->addParameter(Param(u"Year"_s).type(5));
    fake.failOn(u"Param(Year).addCurrentValue"_s, runtimeError(RuntimeFailure));
    report->SetParams(dictionary({ { u"Year"_s, u"2026"_s } }));
    std::vector<QString> asked;
    dialog.answer = [&](dialogs::InputBoxParams& model) {
        for (const auto& item : model.NewEnum())
            asked.push_back(item->Name);
        return true;
    };
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(asked, std::vector<QString> { u"Year"_s });
}

TEST_F(ReportParameters, TheHostsDictionaryComparesKeysItsOwnWay)
{
    auto customer = parameter(Param(u"Customer"_s));
    answerDialog({ { u"Customer"_s, u"from dialog"_s } });

    report->SetParams(dictionary({ { u"CUSTOMER"_s, u"exact"_s } }));
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(customer->state.currentValues, std::vector<core::Variant> { u"from dialog"_s })
        << "a binary dictionary does not know Customer as CUSTOMER";

    report->CloseReport();
    customer->state.currentValues.clear();
    customer->state.needsCurrentValue = true;
    report->SetParams(
        dictionary({ { u"CUSTOMER"_s, u"any case"_s } }, core::Dictionary::TextCompare));
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(customer->state.currentValues, std::vector<core::Variant> { u"any case"_s });
}

TEST_F(ReportParameters, ValuesEnteredInTheDialogAreNotAskedForAgain)
{
    auto customer = parameter(Param(u"Customer"_s));
    auto years
        = parameter(Param(u"Years"_s).type(5).multiple().entry(int32_t(2025)).entry(int32_t(2026)));
    auto year = parameter(Param(u"Year"_s).type(5));
    report->SetParams(dictionary({ { u"Year"_s, int32_t(2026) } }));
    answerDialog({ { u"Customer"_s, u"ACME"_s },
                     { u"Years"_s, core::VariantArray::fromList({ u"2025"_s, u"2026"_s }) } },
        { { u"Years"_s, 2 } });
    ASSERT_TRUE(load(*report));
    ASSERT_EQ(dialog.shown, 1);

    // The runtime forgets the values with the report; the dialog's answers come back from
    // the report object, case-insensitively, multiple values as an array.
    bool keepParameters = true;
    report->CloseReport(keepParameters);
    for (const auto& field : { customer, years, year }) {
        field->state.currentValues.clear();
        field->state.needsCurrentValue = true;
    }
    fake.clearLog();
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(dialog.shown, 1);
    EXPECT_EQ(typed(customer->state.currentValues), QStringList { u"8:ACME"_s });
    EXPECT_EQ(typed(years->state.currentValues), (QStringList { u"3:2025"_s, u"3:2026"_s }));
    EXPECT_EQ(typed(year->state.currentValues), QStringList { u"3:2026"_s });

    // New host values start the collection afresh.
    customer->state.needsCurrentValue = true;
    ASSERT_TRUE(report->SetParams(dictionary({ { u"Year"_s, int32_t(2026) } })));
    EXPECT_EQ(dialog.shown, 2);
}

TEST_F(ReportParameters, DialogAnswersAreKeptEvenWithoutHostValues)
{
    auto customer = parameter(Param(u"Customer"_s));
    answerDialog({ { u"Customer"_s, u"ACME"_s } });
    ASSERT_TRUE(load(*report));

    report->CloseReport();
    customer->state.currentValues.clear();
    customer->state.needsCurrentValue = true;
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(dialog.shown, 2) << "closing without keeping drops the answers";
    runSetParameters();
    EXPECT_EQ(dialog.shown, 2);
    EXPECT_EQ(customer->state.currentValues.size(), 2u) << "the kept answer is added again";
}

TEST_F(ReportParameters, QueryParametersIsRaisedForLudPromptsOnly)
{
    struct Case {
        QString prompt;
        bool raised;
    };
    const Case cases[] = {
        { u"LUD#Customers"_s, true },
        { u"lud#x"_s, true },
        { u"LUD#"_s, false },
        { u"Customer"_s, false },
        { u" LUD#Customers"_s, false },
    };
    int index = 0;
    for (const Case& c : cases)
        parameter(Param(u"P"_s + QString::number(index++)).prompt(c.prompt));
    recordEvents(*report);
    // Without the dialog the parameters stay without values, so only the applied flag
    // keeps the host from being asked again.
    bool noDialog = true;
    ASSERT_TRUE(report->LoadReport(false, noDialog));

    QStringList raisedFor;
    for (const auto& event : events) {
        EXPECT_EQ(event.name, u"QueryParameters"_s);
        raisedFor << event.args[0].toText();
    }
    QStringList expected;
    for (const Case& c : cases) {
        if (c.raised)
            expected << c.prompt;
    }
    EXPECT_EQ(raisedFor, expected);

    // Once applied, a second run asks the host no more.
    events.clear();
    runSetParameters(true);
    EXPECT_TRUE(events.empty());
}

TEST_F(ReportParameters, AnAnswerTableReplacesTheOfferedValues)
{
    auto region = parameter(Param(u"Region"_s).prompt(u"LUD#Regions"_s).entry(u"old"_s, u"Old"_s));
    // The last column of an answer is never read.
    recordEvents(*report, [](const QString&, std::span<core::Variant> args) {
        args[1] = answerTable({ { u"N"_s, u"North"_s }, { u"S"_s, u"South"_s },
            { u"E"_s, u"East"_s }, { u"W"_s, u"West"_s } });
    });
    ASSERT_TRUE(load(*report));
    ASSERT_EQ(region->state.defaults.size(), 3u);
    EXPECT_EQ(region->state.defaults[0].value, core::Variant(u"N"_s));
    EXPECT_EQ(region->state.defaults[0].description, u"North"_s);
    EXPECT_EQ(region->state.defaults[2].value, core::Variant(u"E"_s));
    EXPECT_EQ(region->state.defaults[2].description, u"East"_s);
}

TEST_F(ReportParameters, AOneColumnAnswerEmptiesTheOfferedValues)
{
    auto region
        = parameter(Param(u"Region"_s).prompt(u"LUD#Regions"_s).entry(u"a"_s).entry(u"b"_s));
    recordEvents(*report, [](const QString&, std::span<core::Variant> args) {
        args[1] = answerTable({ { u"only"_s, u"Only"_s } });
    });
    ASSERT_TRUE(load(*report));
    EXPECT_TRUE(region->state.defaults.empty());
}

TEST_F(ReportParameters, AnUnchangedAnswerIsHandedOnToTheNextPrompt)
{
    auto first = parameter(Param(u"First"_s).prompt(u"LUD#First"_s));
    auto second = parameter(Param(u"Second"_s).prompt(u"LUD#Second"_s));
    recordEvents(*report, [](const QString&, std::span<core::Variant> args) {
        if (args[0].toText() == u"LUD#First")
            args[1] = answerTable({ { int32_t(1), u"One"_s }, { int32_t(2), u"Two"_s },
                { core::Variant(), QString() } });
    });
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(first->state.defaults.size(), 2u);
    EXPECT_EQ(second->state.defaults.size(), 2u);
    ASSERT_EQ(events.size(), 2u);
    EXPECT_TRUE(events[1].args[1].isArray()) << "the second prompt saw the first answer";
}

TEST_F(ReportParameters, TextAnswersShowTheirMessages)
{
    struct Case {
        QString answer;
        QString message; // empty: none
    };
    const Case cases[] = {
        { u"Invalid Filter"_s, u"Vale filter!"_s },
        { u"INVALID TABLE"_s, u"Vale tabeli nimi!"_s },
        { u"something else"_s, {} },
    };
    int index = 0;
    for (const Case& c : cases) {
        Q_UNUSED(c);
        parameter(
            Param(u"P"_s + QString::number(index)).prompt(u"LUD#"_s + QString::number(index)));
        ++index;
    }
    recordEvents(*report, [&](const QString&, std::span<core::Variant> args) {
        const int which = args[0].toText().mid(4).toInt();
        args[1] = cases[which].answer;
    });
    ASSERT_TRUE(load(*report));
    ASSERT_EQ(messages->shown.size(), 2u);
    EXPECT_EQ(messages->shown[0].text, u"Vale filter!"_s);
    EXPECT_EQ(messages->shown[1].text, u"Vale tabeli nimi!"_s);
    for (const auto& message : messages->shown) {
        EXPECT_EQ(message.buttons, platform::MessageBoxService::OKOnly);
        EXPECT_TRUE(message.title.isEmpty());
    }
}

TEST_F(ReportParameters, AOneDimensionalAnswerFailsWithSubscriptOutOfRange)
{
    parameter(Param(u"Region"_s).prompt(u"LUD#Regions"_s));
    recordEvents(*report, [](const QString&, std::span<core::Variant> args) {
        args[1] = core::VariantArray::fromList({ u"N"_s, u"S"_s });
    });
    try {
        load(*report);
        FAIL() << "expected error 9";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), core::ErrorNumber::SubscriptOutOfRange);
    }
    EXPECT_TRUE(report->UnloadRequest());
}

TEST_F(ReportParameters, WithoutAnEventObjectNoHostIsAsked)
{
    auto region = parameter(Param(u"Region"_s).prompt(u"LUD#Regions"_s).entry(u"a"_s));
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(region->state.defaults.size(), 1u);
}

TEST_F(ReportParameters, NoDialogAppliesWhatThereIsAndShowsNothing)
{
    parameter(Param(u"Customer"_s).prompt(u"LUD#Customers"_s));
    recordEvents(*report);
    bool noDialog = true;
    ASSERT_TRUE(report->LoadReport(false, noDialog));
    EXPECT_EQ(dialog.shown, 0);
    EXPECT_EQ(events.size(), 1u);

    runSetParameters(true);
    EXPECT_EQ(events.size(), 1u) << "applied counts, with or without a dialog";
}

TEST_F(ReportParameters, CancellingTheDialogRaisesUserCancelled)
{
    parameter(Param(u"Customer"_s).prompt(u"LUD#Customers"_s));
    recordEvents(*report);
    dialog.answer = [](dialogs::InputBoxParams&) { return false; };
    try {
        report->C_Report();
        FAIL() << "expected User Cancelled";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
        EXPECT_EQ(error.number(), -2147221351);
        EXPECT_EQ(error.description(), u"User Cancelled"_s);
        EXPECT_EQ(error.source(), u"LUD Crystal Engine"_s);
    }
    EXPECT_TRUE(report->UnloadRequest());

    // Not applied: the host is asked again on the next run.
    dialog.answer = [](dialogs::InputBoxParams&) { return true; };
    ASSERT_NE(report->C_Report(), nullptr);
    EXPECT_EQ(events.size(), 2u);
    EXPECT_FALSE(report->UnloadRequest());
}

/// The report's parameter dialog event, handled by the host: `answer` sees the field list
/// and may set Cancelled; the handler names the event, as a host that answers it does.
class HostParameterDialog : public ReportParameters {
protected:
    void SetUp() override
    {
        ReportParameters::SetUp();
        customer = parameter(Param(u"Customer"_s));
        size = parameter(Param(u"Size"_s)
                             .type(5)
                             .listedOnly()
                             .entry(int32_t(1), u"Small"_s)
                             .entry(int32_t(3), u"Large"_s));
        paid = parameter(Param(u"Paid"_s).type(9));
        moxEngine->Init(3, false, 0, 4242);
    }

    void handleDialogEvent(
        std::function<void(core::Variant& params, core::Variant& cancelled)> answer)
    {
        report->MoxEvents()->connect(
            [this, answer](int32_t, const QString&, std::span<core::Variant> args) {
                ++raised;
                answer(args[0], args[1]);
            },
            std::vector<int32_t> { reports::MoxEvents115::ShowParametersDialogEvent });
    }

    static void fill(dialogs::InputBoxParams& params)
    {
        params.Item(u"Customer"_s)->Value = u"ACME"_s;
        params.Item(u"Size"_s)->Value = u"Large"_s;
        params.Item(u"Paid"_s)->Value = u"1"_s;
    }

    void expectUserCancelled()
    {
        try {
            report->C_Report();
            ADD_FAILURE() << "expected User Cancelled";
        } catch (const core::ComError& error) {
            EXPECT_EQ(error.number(), UserCancelled);
            EXPECT_EQ(error.description(), u"User Cancelled"_s);
        }
        EXPECT_TRUE(report->UnloadRequest());
        EXPECT_TRUE(customer->state.currentValues.empty());
        EXPECT_TRUE(paid->state.currentValues.empty());
    }

    std::shared_ptr<FakeParameterField> customer;
    std::shared_ptr<FakeParameterField> size;
    std::shared_ptr<FakeParameterField> paid;
    int raised = 0;
};

TEST_F(HostParameterDialog, TheHostsAnswersBecomeTheParametersValues)
{
    QStringList names;
    handleDialogEvent([&](core::Variant& params, core::Variant&) {
        const auto list = params.objectAs<dialogs::InputBoxParams>();
        ASSERT_NE(list, nullptr);
        for (const auto& item : list->NewEnum())
            names << item->Name;
        fill(*list);
    });

    ASSERT_EQ(report->C_Report(), file);
    EXPECT_EQ(raised, 1);
    EXPECT_EQ(dialog.shown, 0) << "the host answered instead of the dialog";
    // The owner window is the dialog's business and never reaches the host.
    EXPECT_EQ(names, (QStringList { u"Customer"_s, u"Size"_s, u"Paid"_s }));
    EXPECT_EQ(customer->state.currentValues, std::vector<core::Variant> { u"ACME"_s });
    EXPECT_EQ(size->state.currentValues, std::vector<core::Variant> { int32_t(3) })
        << "the chosen description stands for its value";
    EXPECT_EQ(paid->state.currentValues, std::vector<core::Variant> { true });
    EXPECT_FALSE(report->UnloadRequest());

    // Kept like dialog answers: the next run asks nobody.
    bool cancelled = false;
    report->SetParameters(cancelled, false);
    EXPECT_EQ(raised, 1);
}

TEST_F(HostParameterDialog, AListOfTheHostsOwnIsRead)
{
    handleDialogEvent([](core::Variant& params, core::Variant&) {
        auto own = std::make_shared<dialogs::InputBoxParams>();
        fill(*own);
        own->Item(u"Customer"_s)->Value = u"Own"_s;
        params = core::ObjectPtr(own);
    });
    ASSERT_EQ(report->C_Report(), file);
    EXPECT_EQ(customer->state.currentValues, std::vector<core::Variant> { u"Own"_s });
}

TEST_F(HostParameterDialog, AHostThatCancelsOrFailsCancels)
{
    const struct {
        const char* name;
        std::function<void(core::Variant&, core::Variant&)> answer;
    } cases[] = {
        { "Cancelled set",
            [](core::Variant& params, core::Variant& cancelled) {
                fill(*params.objectAs<dialogs::InputBoxParams>());
                cancelled = true;
            } },
        // A failed handler answered nothing; its half-filled list must not become values.
        { "handler raises",
            [](core::Variant& params, core::Variant&) {
                fill(*params.objectAs<dialogs::InputBoxParams>());
                throw core::ComError(5, u"Host"_s, u"broken"_s);
            } },
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        // A fresh report object each time: the last one's events keep their handler.
        collection->Remove(u"orders.rpt"_s);
        report = open();
        raised = 0;
        handleDialogEvent(c.answer);
        expectUserCancelled();
        EXPECT_EQ(raised, 1);
        EXPECT_EQ(dialog.shown, 0);
    }
}

TEST_F(HostParameterDialog, HandlersThatDoNotNameTheEventLeaveItToTheDialog)
{
    // A handler for every event and one for QueryParameters only: neither says it answers
    // the dialog, so the dialog asks and the event is not raised.
    recordEvents(*report);
    int queried = 0;
    report->MoxEvents()->connect(
        [&](int32_t, const QString&, std::span<core::Variant>) { ++queried; },
        std::vector<int32_t> { reports::MoxEvents115::QueryParametersEvent });
    answerDialog({ { u"Customer"_s, u"ACME"_s } });

    ASSERT_EQ(report->C_Report(), file);
    EXPECT_EQ(dialog.shown, 1);
    EXPECT_TRUE(events.empty()) << events.front().name.toStdString();
    EXPECT_EQ(customer->state.currentValues, std::vector<core::Variant> { u"ACME"_s });
}

TEST_F(HostParameterDialog, NoParameterNeedingAValueRaisesNothing)
{
    handleDialogEvent([](core::Variant&, core::Variant&) {});
    report->SetParams(
        dictionary({ { u"Customer"_s, u"A"_s }, { u"Size"_s, int32_t(1) }, { u"Paid"_s, false } }));
    ASSERT_EQ(report->C_Report(), file);
    EXPECT_EQ(raised, 0);
}

TEST_F(ReportParameters, SetParamsReappliesToAnOpenReport)
{
    auto customer = parameter(Param(u"Customer"_s));
    answerDialog({ { u"Customer"_s, u"typed"_s } });
    ASSERT_TRUE(load(*report));
    fake.clearLog();

    EXPECT_TRUE(report->SetParams(dictionary({ { u"Customer"_s, u"ACME"_s } })));
    EXPECT_EQ(fake.calls(u"Report(orders.rpt)."_s),
        QStringList { u"Report(orders.rpt).discardSavedData()"_s });
    EXPECT_EQ(customer->state.currentValues.back(), core::Variant(u"ACME"_s));

    customer->state.needsCurrentValue = true;
    dialog.answer = [](dialogs::InputBoxParams&) { return false; };
    EXPECT_FALSE(report->SetParams(dictionary({})));
    EXPECT_TRUE(report->UnloadRequest());
}

class ParameterDialog : public ReportParameters {
protected:
    /// Shows the dialog for the report and returns the items it was given.
    std::vector<std::shared_ptr<dialogs::InputBoxParamsItem>> shownItems()
    {
        std::vector<std::shared_ptr<dialogs::InputBoxParamsItem>> items;
        dialog.answer = [&](dialogs::InputBoxParams& model) {
            options = { model.NoIco, model.LabelAutoSize, model.LabelLeftAlign, model.NoDefault };
            inputSize = { model.InputHeight.toLong(), model.InputWidth.toLong() };
            items = model.NewEnum();
            return true;
        };
        EXPECT_TRUE(load(*report));
        return items;
    }

    std::vector<bool> options;
    std::vector<int32_t> inputSize;
};

TEST_F(ParameterDialog, TheModelDescribesEveryParameterThatNeedsAValue)
{
    parameter(Param(u"Customer"_s).prompt(u"Enter the customer"_s));
    parameter(Param(u"due date:"_s).prompt(u"   "_s).type(10));
    parameter(Param(u"Count"_s).type(5));
    parameter(Param(u"Limit"_s).type(5).defaultValue(int32_t(7)));
    parameter(Param(u"Paid"_s).type(9));
    parameter(Param(u"Amount"_s).type(8));
    parameter(Param(u"Done"_s).satisfied());
    moxEngine->Init(3, false, 0, 4242);

    const auto items = shownItems();
    ASSERT_EQ(items.size(), 6u);
    EXPECT_EQ(options, (std::vector<bool> { true, true, true, true }));
    EXPECT_EQ(inputSize, (std::vector<int32_t> { 2000, 1000 }));
    EXPECT_EQ(dialog.owner, 4242) << "the host's main window owns the dialog";
    EXPECT_EQ(dialog.buttons, 1);
    EXPECT_EQ(dialog.title, u"Enter parameter values"_s);

    const auto& customer = *items[0];
    EXPECT_EQ(customer.Name, u"Customer"_s);
    EXPECT_EQ(customer.Label, u"Customer: "_s);
    EXPECT_EQ(customer.LabelToolTip, u"Enter the customer"_s);
    EXPECT_EQ(customer.Value, core::Variant(QString()));

    const auto& due = *items[1];
    EXPECT_EQ(due.Name, u"due date:"_s);
    EXPECT_EQ(due.Label, u"Due date: "_s);
    EXPECT_EQ(due.LabelToolTip, u"due date:"_s) << "a blank prompt shows the name";
    EXPECT_TRUE(due.DateFormat && due.IsMemo && due.MustExist);
    EXPECT_EQ(due.Value.type(), core::VariantType::Date);
    EXPECT_EQ(due.Value.toDateTime().date(), QDate::currentDate());

    EXPECT_TRUE(items[2]->NumericFormat);
    EXPECT_EQ(items[2]->Value, core::Variant(int16_t(0)));
    EXPECT_EQ(items[3]->Value, core::Variant(int32_t(7))) << "the designer's default shows";
    EXPECT_TRUE(items[4]->IsCheck);
    EXPECT_FALSE(items[5]->NumericFormat) << "currency is entered as plain text";
    EXPECT_TRUE(items[5]->Value.isEmpty());
}

TEST_F(ParameterDialog, ChoiceListsShowDescriptionsAndTheDefault)
{
    parameter(Param(u"Size"_s)
                  .type(5)
                  .listedOnly()
                  .defaultValue(int32_t(2))
                  .entry(int32_t(1), u"Small"_s)
                  .entry(int32_t(2), u" "_s)
                  .entry(int32_t(3), u"Large"_s));
    parameter(
        Param(u"Colours"_s).multiple().defaultValue(u"g"_s).entry(u"r"_s, u"Red"_s).entry(u"g"_s));

    const auto items = shownItems();
    ASSERT_EQ(items.size(), 2u);
    const auto& size = *items[0];
    ASSERT_TRUE(size.Value.isArray());
    EXPECT_EQ(size.Value.array().values(),
        (std::vector<core::Variant> { u"Small"_s, u"2"_s, u"Large"_s }));
    EXPECT_EQ(size.DefaultValue, core::Variant(u"2"_s));
    EXPECT_TRUE(size.SelectOnly);
    EXPECT_FALSE(size.MultiSelect);

    const auto& colours = *items[1];
    EXPECT_TRUE(colours.MultiSelect);
    const core::VariantArray& list = colours.Value.array();
    ASSERT_EQ(list.dimensions(), 2);
    EXPECT_EQ(list.ubound(1), 1);
    EXPECT_EQ(list.at({ 0, 0 }), core::Variant(u"Red"_s));
    EXPECT_EQ(list.at({ 1, 0 }), core::Variant(u"g"_s));
    EXPECT_TRUE(list.at({ 0, 1 }).isEmpty());
    EXPECT_EQ(list.at({ 1, 1 }), core::Variant(true)) << "the default is pre-selected";
}

TEST_F(ParameterDialog, AnswersAreWrittenBackByValueType)
{
    struct Case {
        const char* name;
        FakeParameterField::State parameter;
        core::Variant answer;
        int32_t selectionCount;
        QStringList expected;
    };
    const QString today = core::Variant::fromDate(QDate::currentDate()).toInvariantText();
    const Case cases[] = {
        { "digits", Param(u"A"_s).type(5), u"42"_s, 0, { u"3:42"_s } },
        { "blank number", Param(u"B"_s).type(3), u""_s, 0, { u"2:0"_s } },
        { "checked", Param(u"C"_s).type(9), u"1"_s, 0, { u"11:True"_s } },
        { "blank Boolean", Param(u"D"_s).type(9), u""_s, 0, { u"11:False"_s } },
        { "blank date", Param(u"E"_s).type(10), u""_s, 0, { u"7:"_s + today } },
        { "text", Param(u"F"_s), u"x y"_s, 0, { u"8:x y"_s } },
        { "description stands for its value",
            Param(u"G"_s).type(5).entry(int32_t(1), u"Small"_s).entry(int32_t(3), u"Large"_s),
            u"Large"_s, 0, { u"3:3"_s } },
        { "selected entries",
            Param(u"H"_s).multiple().entry(u"r"_s, u"Red"_s).entry(u"g"_s).entry(u"b"_s, u"Blue"_s),
            core::VariantArray::fromList({ u"Red"_s, u"g"_s }), 2, { u"8:r"_s, u"8:g"_s } },
        { "nothing selected", Param(u"I"_s).multiple().entry(u"r"_s, u"Red"_s),
            core::VariantArray::fromList({ u""_s }), 0, { u"8:"_s } },
    };
    std::map<QString, core::Variant> answers;
    std::map<QString, int32_t> counts;
    std::vector<std::shared_ptr<FakeParameterField>> fields;
    for (const Case& c : cases) {
        fields.push_back(parameter(c.parameter));
        answers[c.parameter.name] = c.answer;
        counts[c.parameter.name] = c.selectionCount;
    }
    answerDialog(answers, counts);
    ASSERT_TRUE(load(*report));
    for (size_t i = 0; i < fields.size(); ++i)
        EXPECT_EQ(typed(fields[i]->state.currentValues), cases[i].expected) << cases[i].name;
}

TEST_F(ParameterDialog, NoParameterNeedingAValueShowsNoDialog)
{
    parameter(Param(u"Done"_s).satisfied());
    ASSERT_TRUE(load(*report));
    EXPECT_EQ(dialog.shown, 0);
}

TEST_F(ParameterDialog, ADialogThatCannotBeShownCountsAsCancelled)
{
    parameter(Param(u"Customer"_s));
    dialog.answer = [](dialogs::InputBoxParams&) -> bool {
        throw core::ComError::basic(core::ErrorNumber::OutOfMemory);
    };
    try {
        load(*report);
        FAIL() << "expected User Cancelled";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), UserCancelled);
    }
}

TEST_F(ParameterDialog, DateEntryFollowsTheUsersShortDateFormat)
{
    struct Case {
        QLocale locale;
        QString pattern;
        int16_t first;
        int16_t second;
    };
    const Case cases[] = {
        { QLocale(QLocale::German, QLocale::Germany), u"dd.mm.yyyy"_s, 2, 5 },
        { QLocale(QLocale::English, QLocale::UnitedStates), u"mm/dd/yyyy"_s, 2, 5 },
    };
    const QLocale previous;
    parameter(Param(u"Due"_s).type(10));
    for (const Case& c : cases) {
        SCOPED_TRACE(c.locale.name().toStdString());
        QLocale::setDefault(c.locale);
        bool cancelled = false;
        reports::PromptParameters(file->parameterFields(), cancelled, nullptr);
        EXPECT_FALSE(cancelled);
        EXPECT_EQ(dialogs::dateEntrySettings().DatePattern, c.pattern);
        EXPECT_EQ(dialogs::dateEntrySettings().DateSep1Pos, c.first);
        EXPECT_EQ(dialogs::dateEntrySettings().DateSep2Pos, c.second);
        EXPECT_EQ(dialog.owner, 0) << "no report, no owner";
        file->state.parameters.front()->state.needsCurrentValue = true;
    }
    QLocale::setDefault(previous);
}

TEST_F(ReportParameters, TheParameterListIsReadWithoutLoading)
{
    parameter(Param(u"Customer"_s).prompt(u"Which customer?"_s));
    parameter(Param(u"Year"_s).prompt(u"LUD#Years"_s));

    const auto list = report->GetParamsCollection();
    ASSERT_EQ(list->count(), 2);
    EXPECT_EQ(list->item(1),
        core::Variant(core::VariantArray::fromList({ u"Customer"_s, u"Which customer?"_s })));
    const auto pairs = report->GetParamsDictionary();
    EXPECT_EQ(pairs->compareMode(), core::Dictionary::BinaryCompare);
    EXPECT_EQ(pairs->keys(), (std::vector<core::Variant> { u"0"_s, u"1"_s }));
    EXPECT_EQ(pairs->value(u"1"_s),
        core::Variant(core::VariantArray::fromList({ u"Year"_s, u"LUD#Years"_s })));
    EXPECT_TRUE(callsOf(u"Application.logOnServer"_s).isEmpty());
    EXPECT_EQ(callsOf(u"Application.openReport"_s).size(), 1);
}

TEST_F(ReportParameters, TheParameterListFailsForReportsItCannotOpen)
{
    struct Case {
        const char* name;
        QString path;
        int32_t number;
    };
    auto legacy = fake.addReport(u"legacy.rpt"_s);
    legacy->addTable(tableWithDriver(u"T"_s, u"T"_s, u"crdbxml.dll"_s));
    const Case cases[] = {
        { "not OLE DB", u"legacy.rpt"_s, UserCancelled },
        { "no file name", QString(), core::ErrorNumber::FileNotFound },
        { "runtime cannot open it", u"gone.rpt"_s, OpenReportFailed },
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const auto target = open(c.path);
        for (int attempt = 0; attempt < 2; ++attempt) {
            try {
                target->GetParamsDictionary();
                ADD_FAILURE() << "expected an error";
            } catch (const core::ComError& error) {
                EXPECT_EQ(error.number(), c.number);
            }
        }
    }
}

TEST_F(ReportParameters, ShowLudInputBoxDoesNothing)
{
    core::Variant params = u"p"_s;
    int32_t buttons = 3;
    QString title = u"t"_s;
    bool result = true;
    EXPECT_TRUE(report->ShowLUDInputBox(params, buttons, title, result).isEmpty());
    EXPECT_EQ(params, core::Variant(u"p"_s));
    EXPECT_EQ(buttons, 3);
    EXPECT_EQ(title, u"t"_s);
    EXPECT_TRUE(result);
    EXPECT_TRUE(fake.calls().isEmpty());
}

} // namespace
