#pragma once

#include "fakeobject.h"
#include "runtime/exportoptions.h"

namespace fakeruntime {

/// The export options of a fake report. Logged as `ExportOptions(<report label>)`.
class FakeExportOptions : public runtime::ExportOptions, public FakeObject {
public:
    struct State {
        int32_t formatType = 0;
        int32_t destinationType = 0;
        QString diskFileName;
        QString htmlFileName;
        bool htmlSeparatePages = false;
        bool htmlNavigator = false;
        int16_t excelAreaType = 0;
        bool excelConstantColumnWidth = false;
        bool excelTabHasColumnHeadings = false;
        bool excelUseWorksheetFunctions = false;
        bool excelPageBreaks = false;
        bool excelExportAllPages = false;
        QString mailToList;
        QString mailSubject;
        QString mailMessage;
        QString mailCcList;
        QString mailBccList;
    };

    FakeExportOptions(std::weak_ptr<Script> script, QString reportLabel);

    QString label() const override { return m_reportLabel; }

    void reset() override;
    int32_t formatType() const override;
    void setFormatType(int32_t code) override;
    int32_t destinationType() const override;
    void setDestinationType(int32_t code) override;
    QString diskFileName() const override;
    void setDiskFileName(const QString& path) override;
    void setHtmlFileName(const QString& path) override;
    void setHtmlSeparatePages(bool value) override;
    void setHtmlNavigator(bool value) override;
    void setExcelAreaType(int16_t value) override;
    void setExcelConstantColumnWidth(bool value) override;
    void setExcelTabHasColumnHeadings(bool value) override;
    void setExcelUseWorksheetFunctions(bool value) override;
    void setExcelPageBreaks(bool value) override;
    void setExcelExportAllPages(bool value) override;
    void setMailToList(const QString& value) override;
    void setMailSubject(const QString& value) override;
    void setMailMessage(const QString& value) override;
    void setMailCcList(const QString& value) override;
    void setMailBccList(const QString& value) override;

    /// Read and change freely: nothing here is logged.
    State state;

private:
    QString m_reportLabel;
};

} // namespace fakeruntime
