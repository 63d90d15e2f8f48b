#pragma once

#include "runtime/exportoptions.h"

namespace reportrt {

/// The export settings of a report.
class ExportOptions : public runtime::ExportOptions {
public:
    void reset() override { *this = ExportOptions(); }

    int32_t formatType() const override { return m_formatType; }
    void setFormatType(int32_t code) override { m_formatType = code; }
    int32_t destinationType() const override { return m_destinationType; }
    void setDestinationType(int32_t code) override { m_destinationType = code; }
    QString diskFileName() const override { return m_diskFileName; }
    void setDiskFileName(const QString& path) override { m_diskFileName = path; }

    void setHtmlFileName(const QString& path) override { m_htmlFileName = path; }
    void setHtmlSeparatePages(bool value) override { m_htmlSeparatePages = value; }
    void setHtmlNavigator(bool value) override { m_htmlNavigator = value; }

    void setExcelAreaType(int16_t value) override { m_excelAreaType = value; }
    void setExcelConstantColumnWidth(bool value) override { m_excelConstantColumnWidth = value; }
    void setExcelTabHasColumnHeadings(bool value) override { m_excelTabHasColumnHeadings = value; }
    void setExcelUseWorksheetFunctions(bool value) override
    {
        m_excelUseWorksheetFunctions = value;
    }
    void setExcelPageBreaks(bool value) override { m_excelPageBreaks = value; }
    void setExcelExportAllPages(bool value) override { m_excelExportAllPages = value; }

    void setMailToList(const QString& value) override { m_mailTo = value; }
    void setMailSubject(const QString& value) override { m_mailSubject = value; }
    void setMailMessage(const QString& value) override { m_mailMessage = value; }
    void setMailCcList(const QString& value) override { m_mailCc = value; }
    void setMailBccList(const QString& value) override { m_mailBcc = value; }

    // Read by the exports.
    QString htmlFileName() const { return m_htmlFileName; }
    bool htmlSeparatePages() const { return m_htmlSeparatePages; }
    bool htmlNavigator() const { return m_htmlNavigator; }
    int16_t excelAreaType() const { return m_excelAreaType; }
    bool excelConstantColumnWidth() const { return m_excelConstantColumnWidth; }
    bool excelTabHasColumnHeadings() const { return m_excelTabHasColumnHeadings; }
    bool excelUseWorksheetFunctions() const { return m_excelUseWorksheetFunctions; }
    bool excelPageBreaks() const { return m_excelPageBreaks; }
    bool excelExportAllPages() const { return m_excelExportAllPages; }
    QString mailToList() const { return m_mailTo; }
    QString mailSubject() const { return m_mailSubject; }
    QString mailMessage() const { return m_mailMessage; }
    QString mailCcList() const { return m_mailCc; }
    QString mailBccList() const { return m_mailBcc; }

private:
    int32_t m_formatType = 0;
    int32_t m_destinationType = 0;
    QString m_diskFileName;
    QString m_htmlFileName;
    bool m_htmlSeparatePages = false;
    bool m_htmlNavigator = false;
    int16_t m_excelAreaType = 0;
    bool m_excelConstantColumnWidth = false;
    bool m_excelTabHasColumnHeadings = false;
    bool m_excelUseWorksheetFunctions = false;
    bool m_excelPageBreaks = false;
    bool m_excelExportAllPages = false;
    QString m_mailTo;
    QString m_mailSubject;
    QString m_mailMessage;
    QString m_mailCc;
    QString m_mailBcc;
};

} // namespace reportrt
