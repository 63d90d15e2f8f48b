#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QImage>
#include <QString>
#include <cstdint>
#include <memory>

namespace core {
class Collection;
class Dictionary;
} // namespace core

namespace engine {
class MoxEngine115;
}

namespace runtime {
class ParameterField;
class Report;
} // namespace runtime

namespace reports {

class MoxEvents115;
class MoxReports115;
class MoxStatus115;
struct MoxReport115Private;
struct SectionBinding;

/// One report file of a collection. The collection creates it, names it and points it back
/// at itself; the file is opened only when an operation first needs it (LoadReport), and
/// every operation that needs the open report loads it first.
///
/// The report does not keep its collection alive: once the host has released the
/// collection, GetParent returns nothing and the report can no longer reach its engine, so
/// it can no longer be loaded (error 91).
///
/// Members that report through a Boolean result never raise; CheckOLEDB, C_Report,
/// CheckEditedSelection, SetParameters, GetParamsCollection and GetParamsDictionary pass
/// the runtime's errors on to the caller.
class LUDMOX_EXPORT MoxReport115 : public core::Object {
public:
    MoxReport115();
    ~MoxReport115() override;
    MoxReport115(const MoxReport115&) = delete;
    MoxReport115& operator=(const MoxReport115&) = delete;

    QString className() const override;

    /// The report file name exactly as the host passed it to the collection's Item.
    QString FileName() const;

    // Flags and settings a host reads and writes.

    /// True: a print or export that selects no record still counts as having data.
    bool IgnoreNoDataCheck() const;
    void IgnoreNoDataCheck(bool value);
    /// Set when a load fails or the user cancels the parameter dialog.
    bool UnloadRequest() const;
    void UnloadRequest(bool value);
    /// The viewer shows this report.
    bool PreviewActive() const;
    void PreviewActive(bool value);
    /// Device name of the printer to print on.
    QString DefaultPrinter() const;
    void DefaultPrinter(const QString& value);
    /// Paper size code to use with DefaultPrinter; 0 leaves the paper as it is.
    int16_t DefaultPaperSize() const;
    void DefaultPaperSize(int16_t value);
    /// Stored for hosts; saving for editing is refused while it is true.
    bool UseOldCrystal() const;
    void UseOldCrystal(bool value);
    /// Stored for hosts; mail is sent only while it is true.
    bool ValidMail() const;
    void ValidMail(bool value);
    bool SendMailError() const;
    bool SaveAsPDFError() const;
    bool SaveAsXLSError() const;

    /// The number of top groups in effect: -1 when none was requested or the report does
    /// not sort its first group by top N.
    int32_t TopNGroups() const;
    /// Requests N top groups (0 or less: all groups); applied at once to an open report.
    void TopNGroups(int32_t N);

    /// The report's event source, created on first use.
    std::shared_ptr<MoxEvents115> MoxEvents();
    /// A snapshot of print progress: Progress 0 while the report is not open; nothing when
    /// the runtime cannot tell.
    std::shared_ptr<MoxStatus115> Status();
    /// Loads the report and returns the runtime's report object itself; nothing when the
    /// load fails without an error (for example a report not read through OLE DB).
    std::shared_ptr<runtime::Report> C_Report();
    /// Opens the file when needed and tells whether its first table is read through the
    /// OLE DB driver; a report that is not stays closed. Runtime errors reach the caller.
    bool CheckOLEDB();
    /// Closes the runtime report; names, selection, top N, printer settings and error flags
    /// stay, so the next operation reopens the same file with the same settings. The host's
    /// parameter values are dropped unless DontResetParameters. Always true.
    bool CloseReport(bool& DontResetParameters);
    bool CloseReport();
    /// Kept for hosts of an earlier version; does nothing.
    void CloseReport8();

    // Record selection.

    /// Restricts the report to records of TableName: an array or collection of ids, one
    /// numeric id, a formula clause (text starting with "{"), or an SQL condition;
    /// Empty clears the request for good, Null builds nothing. SpecialSelection holds
    /// further SQL conditions separated by ";". Applied at once to an open report.
    /// False on a runtime error.
    bool SetSelection(const QString& TableName, const core::Variant& Selection,
        const QString& SpecialSelection = QString());
    /// Saves the open report for editing, with the author's selection and statement back in
    /// place and the component's clause between its markers. False on any failure, when
    /// the report is not open or with UseOldCrystal.
    bool SaveReport(const QString& FileName);
    /// Reads the selection formula of an edited copy: EditedSel becomes the author's part
    /// when the markers are intact (true); false when they were damaged. OriginalSel and
    /// SavedSel receive the stored texts. Runtime errors reach the caller.
    bool CheckEditedSelection(
        QString& FileName, QString& OriginalSel, QString& SavedSel, QString& EditedSel);
    /// Puts an edited copy in place of this report's file, with Selection (or the stored
    /// author's formula) as its selection formula; the next operation opens the new file.
    /// False on any failure or with UseOldCrystal.
    bool ReplaceEdited(
        const QString& FileName, const core::Variant& Selection = core::Variant::missing());

    // Parameters.

    /// The host's parameter values (name to value or array of values), held by reference;
    /// re-applied at once to an open report. False on any failure, including a cancelled
    /// parameter dialog.
    bool SetParams(const std::shared_ptr<core::Dictionary>& Parameters);
    /// Gives every parameter of the open report its value: from the host's dictionary,
    /// from the host's answer to QueryParameters ("LUD#" prompts), then from the input
    /// dialog unless NoDialog. Raises "User Cancelled" (0x80040099) after setting
    /// UnloadRequest when the user cancels the dialog; other errors pass on unchanged.
    /// Cancelled is not written.
    void SetParameters(bool& Cancelled, bool NoDialog = false);
    /// One two-element array (name, prompting text) per parameter, in the report's order.
    std::shared_ptr<core::Collection> GetParamsCollection();
    /// The same pairs keyed "0", "1", ... (binary compare).
    std::shared_ptr<core::Dictionary> GetParamsDictionary();
    /// Kept in the interface for hosts; shows nothing and returns Empty.
    core::Variant ShowLUDInputBox(
        core::Variant& Params, int32_t& Buttons, QString& Title, bool& Result);

    // Printing and pictures.

    /// Prints the report: loads it, chooses the printer and paper (a printer chosen in a
    /// dialog stays; "usereportprinter" in the summary comments keeps the report's own;
    /// DefaultPrinter with UseDefaultPrinter or a dialog names one; else the application's
    /// current printer with the shared printer settings), applies parameters and selection,
    /// reads the records and prints, behind the print dialog when ShowDialog. Copies below 1
    /// print one copy; the page range is used only when both ends are non-zero.
    /// DrillDownPrint does everything but print. False only when the report cannot be
    /// loaded; a report not read through OLE DB raises 0x80040099, and every error after the
    /// load reaches the caller (0x80047E52 without "0x80004005" in its text as 0x80047E53).
    bool PrintReport(bool ShowDialog, int16_t Copies = 1, bool Collate = true,
        int16_t StartPage = 0, int16_t StopPage = 0, bool UseDefaultPrinter = false,
        bool DrillDownPrint = false);
    /// Shows the print set-up dialog for this report over hWndParent; what the user chooses
    /// stays with the report. True when shown, false on any runtime error (not raised) or
    /// when the report cannot be loaded; a report not read through OLE DB raises 0x80040099.
    bool PrinterSetup(int32_t hWndParent = 0);

    /// Path of the picture file shown in the report's OLE object; wins over PictureBytes.
    QString OlePath() const;
    void OlePath(const QString& value);
    /// Image file contents shown in the report's OLE object when OlePath is empty; one
    /// element (the initial array) means none. Let copies the array, converting every
    /// element to a byte (errors 6 and 13 leave the bytes as they were).
    core::VariantArray PictureBytes() const;
    void PictureBytes(const core::VariantArray& value);

    // Export and mail.
    //
    // Each export first writes a scratch file (TempExportFile, in the engine's temporary
    // folder), then checks that the report read records, and only then writes FileName: as a
    // hidden file in FileName's folder that replaces an existing (even read-only) target only
    // once complete, so a failed export leaves the old file as it was. Without ForceSave a
    // report without records writes nothing and returns false without an error. The
    // arguments are in/out as the type library declares them; none is changed.

    /// Writes the report as PDF. FileName is written only with ValidMail or ForceSave;
    /// otherwise only the scratch file is made and removed. FirstSave discards the saved
    /// data without keeping parameter values. With TempFileOnly only the scratch file is
    /// written, at FileName (a bare name is placed in the temporary folder), and it becomes
    /// TempExportFile. A failure sets SaveAsPDFError and raises: a failure while the records
    /// are read as 0x80047E52 or 0x80047E44 with the runtime's text, or as error 5; any
    /// other with its own number and source and the description followed by CR LF
    /// "TempFile:" path CR LF "FileName:" FileName.
    bool SaveAsPDF(QString& FileName, bool& FirstSave, bool& TempFileOnly, bool& ForceSave);
    /// Writes the report as an Excel workbook, as SaveAsPDF does without the ValidMail rule;
    /// a failure while the records are read raises error 5. Sets SaveAsXLSError on failure.
    bool SaveAsXLS(QString& FileName, bool& TempFileOnly, bool& ForceSave);
    /// Writes the report as HTML, as SaveAsXLS does; SeparatePages puts every page in its
    /// own file and HTMLNavigator links them.
    bool SaveAsHTML(QString& FileName, bool& TempFileOnly, bool& ForceSave, bool& SeparatePages,
        bool& HTMLNavigator);
    /// Mails the report to Address (";"- or ","-separated, as CarbonCopy and
    /// BlindCarbonCopy) with the export in format AttachmentType (31 PDF, 38 Excel, 32 HTML)
    /// attached, only while ValidMail is true. Attachment, when given, is the base name of the
    /// attached report (a file name only: a path is refused). FirstMail discards the saved
    /// data without keeping parameter values, as the first mail of a mass mailing does.
    /// False without an error, with SendMailError set, on any failure or without ValidMail;
    /// false with SendMailError clear when the report has no records. Only a failure while
    /// the records are read raises (error 5), with SendMailError set.
    bool SendReport(QString& Address, QString& MailSubject, QString& MailMessage,
        int32_t AttachmentType, bool& ShowDialog, bool& FirstMail, QString& CarbonCopy,
        QString& BlindCarbonCopy, QString& Attachment);

    // Internal operations for the component's own objects.

    /// Set once by the collection right after creating the report.
    void SetFileName(const QString& name);
    /// The collection the report was created in; an empty reference detaches the report.
    void SetParent(const std::weak_ptr<MoxReports115>& parent);
    /// The collection, or nothing when the report was removed or the collection has ended.
    std::shared_ptr<MoxReports115> GetParent() const;
    /// The runtime report object without loading it.
    std::shared_ptr<runtime::Report> GetReport() const;
    /// Opens and prepares the report when needed (OLE DB check, logon, table locations,
    /// parameters, selection, top N). False, with UnloadRequest set, when the report cannot
    /// be used; a runtime error or a cancelled parameter dialog is raised after the same
    /// clean-up. A call made while loading is under way returns false at once.
    bool LoadReport(bool Refresh, bool& NoDialog);
    /// Applies N top groups to the open report; the count in effect, or -1.
    int32_t ApplyTopNGroups(int32_t N);
    /// Keeps the first current value of every parameter, discards the saved data and puts
    /// the values back; with KeepNothing only discards. Never raises.
    bool ReloadKeepingParameters(bool KeepNothing);
    /// Gives each parameter its kept value (ReloadKeepingParameters). Never raises.
    bool RestoreParameterValues();
    /// Whether the last read selected no record (the runtime's no-data event), unless
    /// IgnoreNoDataCheck.
    bool NoData() const;

private:
    // Loading.
    /// The collection's engine; raises 91 when the report has none.
    std::shared_ptr<engine::MoxEngine115> owningEngine() const;
    /// Opens FileName into mReport and checks its driver (checkOleDbDriver).
    bool openReportFile();
    /// Whether the first table of mReport is read through OLE DB; releases it when not.
    bool checkOleDbDriver();
    void releaseReport();
    void bindSections();
    void unbindSections();
    static void unbind(SectionBinding& binding);
    void raiseErrorOccured();
    void mReport_NoData(bool& pCancel);
    void mSection_format();
    void mPictureSection_format();
    void mBlobPictureSection_format();
    /// The picture in image file contents (any format Qt reads); null when none.
    static QImage PictureFromBytes(const core::VariantArray& bytes);

    // Selection.
    void ApplySqlSelection();
    void applySelectionFormula();

    // Parameters.
    /// Opens the file for reading its parameter list only, when it is not open yet.
    void openReportForParameters();
    core::Variant LookupParamValue(const QString& name) const;
    static bool IsLUDPrompt(const QString& prompt);
    void applyAnswer(runtime::ParameterField& parameter, const core::Variant& answer);
    static void applyHostValue(runtime::ParameterField& parameter, const core::Variant& value);

    // Export and mail.
    struct ExportRequest;
    bool runExport(const ExportRequest& request);
    /// The engine's temporary folder, ending with a separator; empty when there is none.
    QString GetLUDTempPath() const;
    /// The engine's owner window for the runtime's dialogs; 0 when there is none.
    int32_t DialogParentHwnd() const;
    /// NoData := the last read completed without a record, unless IgnoreNoDataCheck.
    void CheckNoData();
    /// GetLUDTempPath, or the private temporary folder when the engine has none.
    QString scratchFolder() const;
    /// Makes `report` the open report, with its no-data event bound to this object.
    void adoptReport(std::shared_ptr<runtime::Report> report);
    /// Puts the report opened from FileName back after a mail sent from a temporary copy.
    void restoreOwnFile(const QString& temporaryReport);

    // The report's state lives in a private header so that the report's operations, spread
    // over several source files, share it without the public header growing with it.
    std::unique_ptr<MoxReport115Private> d;
};

} // namespace reports
