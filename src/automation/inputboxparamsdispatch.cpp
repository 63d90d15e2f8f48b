#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "dialogs/inputboxparams.h"
#include "dialogs/inputboxparamsitem.h"

namespace automation {

using dialogs::InputBoxParams;
using dialogs::InputBoxParamsItem;

// The input dialog's field list reaches hosts in the parameter-dialog event, and hosts
// change it by member name; the classes are not in the type library. Public fields are
// numbered as public variables of a class are (0x4003xxxx in declaration order).
void registerInputBoxParams(Registry& registry)
{
    ClassBuilder<InputBoxParams> c(
        QStringLiteral("InputBoxParams"), QStringLiteral("_InputBoxParams"));
    c.outsideTypeLibrary();
    c.field(QStringLiteral("NoIco"), 0x40030000, &InputBoxParams::NoIco);
    c.field(QStringLiteral("LabelAutoSize"), 0x40030001, &InputBoxParams::LabelAutoSize);
    c.field(QStringLiteral("InputHeight"), 0x40030002, &InputBoxParams::InputHeight);
    c.field(QStringLiteral("InputWidth"), 0x40030003, &InputBoxParams::InputWidth);
    c.field(QStringLiteral("LabelLeftAlign"), 0x40030004, &InputBoxParams::LabelLeftAlign);
    c.field(QStringLiteral("HelpId"), 0x40030005, &InputBoxParams::HelpId);
    c.field(QStringLiteral("ValidateOnOK"), 0x40030006, &InputBoxParams::ValidateOnOK);
    c.field(QStringLiteral("NoDefault"), 0x40030007, &InputBoxParams::NoDefault);
    c.field(QStringLiteral("NoCancel"), 0x40030008, &InputBoxParams::NoCancel);
    c.field(QStringLiteral("WideControls"), 0x40030009, &InputBoxParams::WideControls);
    c.get(QStringLiteral("Item"), 0x6803000a, &InputBoxParams::Item,
        { param(QStringLiteral("key")) }, { .returns = QStringLiteral("InputBoxParamsItem") });
    c.get(QStringLiteral("Count"), 0x6803000b, &InputBoxParams::Count);
    c.enumerator(QStringLiteral("NewEnum"), &InputBoxParams::NewEnum);
    registry.add(c.take());
}

void registerInputBoxParamsItem(Registry& registry)
{
    using Item = InputBoxParamsItem;
    ClassBuilder<Item> c(
        QStringLiteral("InputBoxParamsItem"), QStringLiteral("_InputBoxParamsItem"));
    c.outsideTypeLibrary();
    c.field(QStringLiteral("Name"), 0x40030000, &Item::Name);
    c.field(QStringLiteral("Value"), 0x40030001, &Item::Value);
    c.field(QStringLiteral("LabelToolTip"), 0x40030002, &Item::LabelToolTip);
    c.field(QStringLiteral("Label"), 0x40030003, &Item::Label);
    c.field(QStringLiteral("DefaultValue"), 0x40030004, &Item::DefaultValue);
    c.field(QStringLiteral("MultiSelect"), 0x40030005, &Item::MultiSelect);
    c.field(QStringLiteral("SelectOnly"), 0x40030006, &Item::SelectOnly);
    c.field(QStringLiteral("IsCheck"), 0x40030007, &Item::IsCheck);
    c.field(QStringLiteral("IsMemo"), 0x40030008, &Item::IsMemo);
    c.field(QStringLiteral("DateFormat"), 0x40030009, &Item::DateFormat);
    c.field(QStringLiteral("MustExist"), 0x4003000a, &Item::MustExist);
    c.field(QStringLiteral("NumericFormat"), 0x4003000b, &Item::NumericFormat);
    c.field(QStringLiteral("SelectionCount"), 0x4003000c, &Item::SelectionCount);
    c.field(QStringLiteral("IsColor"), 0x4003000d, &Item::IsColor);
    c.field(QStringLiteral("IsFileDialog"), 0x4003000e, &Item::IsFileDialog);
    c.field(QStringLiteral("Reload"), 0x4003000f, &Item::Reload);
    c.field(QStringLiteral("ReadOnly"), 0x40030010, &Item::ReadOnly);
    c.field(QStringLiteral("SetFocus"), 0x40030011, &Item::SetFocus);
    c.field(QStringLiteral("AskFolder"), 0x40030012, &Item::AskFolder);
    c.field(QStringLiteral("Index"), 0x40030013, &Item::Index);
    c.field(QStringLiteral("Caption"), 0x40030014, &Item::Caption);
    c.field(QStringLiteral("Password"), 0x40030015, &Item::Password);
    registry.add(c.take());
}

} // namespace automation
