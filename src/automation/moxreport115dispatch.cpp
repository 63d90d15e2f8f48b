#include "automation/classbuilder.h"
#include "automation/registry.h"
#include "automation/tables_p.h"
#include "core/collection.h"
#include "core/dictionary.h"
#include "reports/moxevents115.h"
#include "reports/moxreport115.h"
#include "reports/moxstatus115.h"
#include "runtime/report.h"

namespace automation {

using reports::MoxReport115;

// Dispatch ids follow the class's declaration order, properties 0x6803xxxx and methods
// 0x6003xxxx, numbered once for the whole interface so that members added later keep
// their places:
//
// clang-format off
//   0x00 IgnoreNoDataCheck     0x0b MoxEvents         0x16 ReplaceEdited
//   0x01 UnloadRequest         0x0c Status            0x17 SetParams
//   0x02 PreviewActive         0x0d C_Report          0x18 SetParameters
//   0x03 DefaultPrinter        0x0e CheckOLEDB        0x19 GetParamsCollection
//   0x04 DefaultPaperSize      0x0f CloseReport       0x1a GetParamsDictionary
//   0x05 UseOldCrystal         0x10 CloseReport8      0x1b ShowLUDInputBox
//   0x06 ValidMail             0x11 PrintReport       0x1c SaveAsPDF
//   0x07 SendMailError         0x12 PrinterSetup      0x1d SaveAsXLS
//   0x08 SaveAsPDFError        0x13 SetSelection      0x1e SaveAsHTML
//   0x09 SaveAsXLSError        0x14 SaveReport        0x1f SendReport
//   0x0a TopNGroups            0x15 CheckEditedSelection  0x20 OlePath
//                                                     0x21 PictureBytes
// clang-format on
void registerMoxReport115(Registry& registry)
{
    ClassBuilder<MoxReport115> c(QStringLiteral("MoxReport115"), QStringLiteral("_MoxReport115"));
    c.property<bool>(QStringLiteral("IgnoreNoDataCheck"), 0x68030000,
        &MoxReport115::IgnoreNoDataCheck, &MoxReport115::IgnoreNoDataCheck);
    c.property<bool>(QStringLiteral("UnloadRequest"), 0x68030001, &MoxReport115::UnloadRequest,
        &MoxReport115::UnloadRequest);
    c.property<bool>(QStringLiteral("PreviewActive"), 0x68030002, &MoxReport115::PreviewActive,
        &MoxReport115::PreviewActive);
    c.property<QString>(QStringLiteral("DefaultPrinter"), 0x68030003, &MoxReport115::DefaultPrinter,
        &MoxReport115::DefaultPrinter);
    c.property<int16_t>(QStringLiteral("DefaultPaperSize"), 0x68030004,
        &MoxReport115::DefaultPaperSize, &MoxReport115::DefaultPaperSize);
    c.property<bool>(QStringLiteral("UseOldCrystal"), 0x68030005, &MoxReport115::UseOldCrystal,
        &MoxReport115::UseOldCrystal);
    c.property<bool>(QStringLiteral("ValidMail"), 0x68030006, &MoxReport115::ValidMail,
        &MoxReport115::ValidMail);
    c.get(QStringLiteral("SendMailError"), 0x68030007, &MoxReport115::SendMailError);
    c.get(QStringLiteral("SaveAsPDFError"), 0x68030008, &MoxReport115::SaveAsPDFError);
    c.get(QStringLiteral("SaveAsXLSError"), 0x68030009, &MoxReport115::SaveAsXLSError);
    c.property<int32_t>(QStringLiteral("TopNGroups"), 0x6803000a, &MoxReport115::TopNGroups,
        &MoxReport115::TopNGroups);
    c.get(QStringLiteral("MoxEvents"), 0x6803000b, &MoxReport115::MoxEvents, {},
        { .returns = QStringLiteral("MoxEvents115") });
    c.get(QStringLiteral("Status"), 0x6803000c, &MoxReport115::Status, {},
        { .returns = QStringLiteral("MoxStatus115") });
    c.get(QStringLiteral("C_Report"), 0x6803000d, &MoxReport115::C_Report);
    c.method(QStringLiteral("CheckOLEDB"), 0x6003000e, &MoxReport115::CheckOLEDB);
    c.method(QStringLiteral("CloseReport"), 0x6003000f,
        [](MoxReport115& report, bool& DontResetParameters) {
            return report.CloseReport(DontResetParameters);
        },
        { optionalParam(QStringLiteral("DontResetParameters"), false) });
    c.method(QStringLiteral("CloseReport8"), 0x60030010, &MoxReport115::CloseReport8);

    c.method(QStringLiteral("PrintReport"), 0x60030011, &MoxReport115::PrintReport,
        { param(QStringLiteral("ShowDialog")), optionalParam(QStringLiteral("Copies"), int16_t(1)),
            optionalParam(QStringLiteral("Collate"), true),
            optionalParam(QStringLiteral("StartPage"), int16_t(0)),
            optionalParam(QStringLiteral("StopPage"), int16_t(0)),
            optionalParam(QStringLiteral("UseDefaultPrinter"), false),
            optionalParam(QStringLiteral("DrillDownPrint"), false) });
    c.method(QStringLiteral("PrinterSetup"), 0x60030012, &MoxReport115::PrinterSetup,
        { optionalParam(QStringLiteral("hWndParent"), int32_t(0)) });

    c.method(QStringLiteral("SetSelection"), 0x60030013, &MoxReport115::SetSelection,
        { param(QStringLiteral("TableName")), param(QStringLiteral("Selection")),
            optionalParam(QStringLiteral("SpecialSelection")) });
    c.method(QStringLiteral("SaveReport"), 0x60030014, &MoxReport115::SaveReport,
        { param(QStringLiteral("FileName")) });
    c.method(QStringLiteral("CheckEditedSelection"), 0x60030015,
        &MoxReport115::CheckEditedSelection,
        { param(QStringLiteral("FileName")), param(QStringLiteral("OriginalSel")),
            param(QStringLiteral("SavedSel")), param(QStringLiteral("EditedSel")) });
    c.method(QStringLiteral("ReplaceEdited"), 0x60030016, &MoxReport115::ReplaceEdited,
        { param(QStringLiteral("FileName")), optionalParam(QStringLiteral("Selection")) });

    c.method(QStringLiteral("SetParams"), 0x60030017, &MoxReport115::SetParams,
        { param(QStringLiteral("Parameters"), QStringLiteral("Scripting.Dictionary")) });
    c.method(QStringLiteral("SetParameters"), 0x60030018, &MoxReport115::SetParameters,
        { optionalParam(QStringLiteral("Cancelled"), false),
            byVal(optionalParam(QStringLiteral("NoDialog"), false)) });
    c.method(QStringLiteral("GetParamsCollection"), 0x60030019, &MoxReport115::GetParamsCollection,
        {}, { .returns = QStringLiteral("Collection") });
    c.method(QStringLiteral("GetParamsDictionary"), 0x6003001a, &MoxReport115::GetParamsDictionary,
        {}, { .returns = QStringLiteral("Scripting.Dictionary") });
    c.method(QStringLiteral("ShowLUDInputBox"), 0x6003001b, &MoxReport115::ShowLUDInputBox,
        { optionalParam(
              QStringLiteral("Params"), core::Variant::missing(), QStringLiteral("Object")),
            optionalParam(QStringLiteral("Buttons")), optionalParam(QStringLiteral("Title")),
            optionalParam(QStringLiteral("Result")) });

    c.property<QString>(
        QStringLiteral("OlePath"), 0x68030020, &MoxReport115::OlePath, &MoxReport115::OlePath);
    c.property<core::VariantArray>(QStringLiteral("PictureBytes"), 0x68030021,
        &MoxReport115::PictureBytes, &MoxReport115::PictureBytes);

    c.method(QStringLiteral("SaveAsPDF"), 0x6003001c, &MoxReport115::SaveAsPDF,
        { param(QStringLiteral("FileName")), optionalParam(QStringLiteral("FirstSave"), false),
            optionalParam(QStringLiteral("TempFileOnly"), false),
            optionalParam(QStringLiteral("ForceSave"), false) });
    c.method(QStringLiteral("SaveAsXLS"), 0x6003001d, &MoxReport115::SaveAsXLS,
        { param(QStringLiteral("FileName")), optionalParam(QStringLiteral("TempFileOnly"), false),
            optionalParam(QStringLiteral("ForceSave"), false) });
    c.method(QStringLiteral("SaveAsHTML"), 0x6003001e, &MoxReport115::SaveAsHTML,
        { param(QStringLiteral("FileName")), optionalParam(QStringLiteral("TempFileOnly"), false),
            optionalParam(QStringLiteral("ForceSave"), false),
            optionalParam(QStringLiteral("SeparatePages"), true),
            optionalParam(QStringLiteral("HTMLNavigator"), true) });
    c.method(QStringLiteral("SendReport"), 0x6003001f, &MoxReport115::SendReport,
        { param(QStringLiteral("Address")), optionalParam(QStringLiteral("MailSubject"), QString()),
            optionalParam(QStringLiteral("MailMessage"), QString()),
            byVal(optionalParam(QStringLiteral("AttachmentType"), int32_t(31))),
            optionalParam(QStringLiteral("ShowDialog"), false),
            optionalParam(QStringLiteral("FirstMail"), false),
            optionalParam(QStringLiteral("CarbonCopy"), QString()),
            optionalParam(QStringLiteral("BlindCarbonCopy"), QString()),
            optionalParam(QStringLiteral("Attachment"), QString()) });
    registry.add(c.take());
}

} // namespace automation
