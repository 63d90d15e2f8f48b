#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QString>

namespace runtime {

/// Where and how Report::exportReport writes. Format codes: 31 PDF, 38 Excel (XLSX),
/// 32 HTML; destination codes: 1 disk file, 2 mail.
class LUDMOX_EXPORT ExportOptions : public core::Object {
public:
    QString className() const override { return QStringLiteral("ExportOptions"); }

    virtual void reset() = 0;

    virtual int32_t formatType() const = 0;
    virtual void setFormatType(int32_t code) = 0;
    virtual int32_t destinationType() const = 0;
    virtual void setDestinationType(int32_t code) = 0;
    virtual QString diskFileName() const = 0;
    virtual void setDiskFileName(const QString& path) = 0;

    virtual void setHtmlFileName(const QString& path) = 0;
    virtual void setHtmlSeparatePages(bool value) = 0;
    virtual void setHtmlNavigator(bool value) = 0;

    /// The Excel options, set in this order by the exports.
    virtual void setExcelAreaType(int16_t value) = 0;
    virtual void setExcelConstantColumnWidth(bool value) = 0;
    virtual void setExcelTabHasColumnHeadings(bool value) = 0;
    virtual void setExcelUseWorksheetFunctions(bool value) = 0;
    virtual void setExcelPageBreaks(bool value) = 0;
    virtual void setExcelExportAllPages(bool value) = 0;

    virtual void setMailToList(const QString& value) = 0;
    virtual void setMailSubject(const QString& value) = 0;
    virtual void setMailMessage(const QString& value) = 0;
    virtual void setMailCcList(const QString& value) = 0;
    virtual void setMailBccList(const QString& value) = 0;
};

} // namespace runtime
