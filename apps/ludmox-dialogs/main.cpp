// Shows the parameter dialog with one field of every kind, so that its layout and its
// editing can be tried by hand, and prints what OK returns.
//
//     ludmox-dialogs [--language 3|4|5] [--xp-style] [--screenshot file.png]

#include "core/variant.h"
#include "dialogs/dateentrysettings.h"
#include "dialogs/frminputbox.h"
#include "dialogs/inputboxparams.h"
#include "dialogs/uistrings.h"
#include "engine/moxglobals.h"

#include <QApplication>
#include <QCommandLineParser>
#include <QDate>
#include <QPixmap>
#include <QTextStream>
#include <cstdio>

using namespace Qt::StringLiterals;
using core::Variant;
using core::VariantArray;

namespace {

Variant choices(const QStringList& texts)
{
    std::vector<Variant> values;
    for (const QString& text : texts)
        values.emplace_back(text);
    return Variant(VariantArray::fromList(values));
}

std::shared_ptr<dialogs::InputBoxParams> everyKindOfField()
{
    auto params = std::make_shared<dialogs::InputBoxParams>();
    params->LabelAutoSize = true;
    params->LabelLeftAlign = true;
    params->InputWidth = Variant(int32_t(600));

    params->Item(u"Customer"_s)->Value = Variant(u"Orvel"_s);
    params->Item(u"Customer"_s)->LabelToolTip = u"A plain text field"_s;
    params->Item(u"Password"_s)->Password = true;
    auto from = params->Item(u"From date"_s);
    from->DateFormat = true;
    from->Value = Variant::fromDate(QDate::currentDate());
    auto amount = params->Item(u"Amount"_s);
    amount->NumericFormat = true;
    amount->Value = Variant(1250.5);
    auto fruit = params->Item(u"Fruit"_s);
    fruit->Value = choices({ u"Apple"_s, u"Apricot"_s, u"Banana"_s });
    auto region = params->Item(u"Region"_s);
    region->Value = choices({ u"North"_s, u"South"_s, u"East"_s, u"West"_s });
    region->SelectOnly = true;
    region->DefaultValue = Variant(u"south"_s);
    auto branches = params->Item(u"Branches"_s);
    VariantArray list({ { 0, 4 }, { 0, 1 } });
    const QStringList names { u"Tallinn"_s, u"Tartu"_s, u"Riga"_s, u"Vilnius"_s, u"Helsinki"_s };
    for (int32_t i = 0; i < 5; ++i) {
        list.at({ i, 0 }) = Variant(names.at(i));
        list.at({ i, 1 }) = Variant(i == 1);
    }
    branches->Value = Variant(list);
    branches->MultiSelect = true;
    branches->MustExist = true;
    auto totals = params->Item(u"Totals"_s);
    totals->IsCheck = true;
    totals->Caption = u"Print totals"_s;
    totals->Value = Variant(true);
    auto colour = params->Item(u"Colour"_s);
    colour->IsColor = true;
    colour->Value = Variant(int32_t(0x00C0FF));
    auto memo = params->Item(u"Remark"_s);
    memo->IsMemo = true;
    memo->Value = Variant(u"A longer text"_s);
    auto until = params->Item(u"Until date"_s);
    until->IsMemo = true;
    until->DateFormat = true;
    until->Value = Variant::fromDate(QDate::currentDate().addDays(30));
    auto file = params->Item(u"Report file"_s);
    file->IsFileDialog = true;
    file->Value = Variant(u"/tmp/report.rpt"_s);
    auto folder = params->Item(u"Export folder"_s);
    folder->IsFileDialog = true;
    folder->AskFolder = true;
    folder->Value = Variant(u"/tmp"_s);
    return params;
}

QString valueText(const Variant& value)
{
    if (!value.isArray())
        return value.toText();
    QStringList texts;
    for (const Variant& element : value.array().values())
        texts << element.toText();
    return u"["_s + texts.join(u", "_s) + u"]"_s;
}

} // namespace

int main(int argc, char** argv)
{
    QApplication app(argc, argv);
    QApplication::setApplicationName(u"ludmox-dialogs"_s);

    QCommandLineParser parser;
    parser.setApplicationDescription(
        u"Shows the LUD Mox parameter dialog with every kind of field."_s);
    parser.addHelpOption();
    const QCommandLineOption language(
        u"language"_s, u"Dialog language: 3 English, 4 Estonian, 5 Latvian."_s, u"code"_s, u"3"_s);
    const QCommandLineOption xpStyle(u"xp-style"_s, u"Use the visual-style look."_s);
    const QCommandLineOption screenshot(
        u"screenshot"_s, u"Save a picture of the dialog to this PNG file and exit."_s, u"file"_s);
    parser.addOptions({ language, xpStyle, screenshot });
    parser.process(app);

    engine::gLanguage = static_cast<int16_t>(parser.value(language).toShort());
    engine::gXPStyle = parser.isSet(xpStyle);
    engine::gBackColor = static_cast<int32_t>(0x8000000F); // the system's button face
    dialogs::setDateEntrySettings(dialogs::DateEntrySettings::fromSystem());

    const auto params = everyKindOfField();
    dialogs::frmInputBox box;
    box.ShowBox(params, 33, dialogs::GetUIString(dialogs::UIString::EnterParameterValues));

    if (parser.isSet(screenshot)) {
        box.show();
        QApplication::processEvents();
        const QString file = parser.value(screenshot);
        if (!box.grab().save(file, "PNG")) {
            std::fprintf(stderr, "cannot write %s\n", qPrintable(file));
            return 1;
        }
        return 0;
    }

    box.exec();
    QTextStream out(stdout);
    out << (box.Result ? "OK" : "Cancelled") << Qt::endl;
    if (box.Result) {
        for (const auto& item : params->NewEnum())
            out << item->Name << " = " << valueText(item->Value) << Qt::endl;
    }
    return 0;
}
