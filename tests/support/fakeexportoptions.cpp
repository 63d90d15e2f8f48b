#include "fakeexportoptions.h"

namespace fakeruntime {

FakeExportOptions::FakeExportOptions(std::weak_ptr<Script> script, QString reportLabel)
    : FakeObject(std::move(script), QStringLiteral("ExportOptions"))
    , m_reportLabel(std::move(reportLabel))
{ }

void FakeExportOptions::reset()
{
    record(QStringLiteral("reset"));
    state = State();
}

int32_t FakeExportOptions::formatType() const
{
    recordQuery(QStringLiteral("formatType"));
    return state.formatType;
}

void FakeExportOptions::setFormatType(int32_t code)
{
    record(QStringLiteral("setFormatType"), { arg(code) });
    state.formatType = code;
}

int32_t FakeExportOptions::destinationType() const
{
    recordQuery(QStringLiteral("destinationType"));
    return state.destinationType;
}

void FakeExportOptions::setDestinationType(int32_t code)
{
    record(QStringLiteral("setDestinationType"), { arg(code) });
    state.destinationType = code;
}

QString FakeExportOptions::diskFileName() const
{
    recordQuery(QStringLiteral("diskFileName"));
    return state.diskFileName;
}

void FakeExportOptions::setDiskFileName(const QString& path)
{
    record(QStringLiteral("setDiskFileName"), { arg(path) });
    state.diskFileName = path;
}

void FakeExportOptions::setHtmlFileName(const QString& path)
{
    record(QStringLiteral("setHtmlFileName"), { arg(path) });
    state.htmlFileName = path;
}

void FakeExportOptions::setHtmlSeparatePages(bool value)
{
    record(QStringLiteral("setHtmlSeparatePages"), { arg(value) });
    state.htmlSeparatePages = value;
}

void FakeExportOptions::setHtmlNavigator(bool value)
{
    record(QStringLiteral("setHtmlNavigator"), { arg(value) });
    state.htmlNavigator = value;
}

void FakeExportOptions::setExcelAreaType(int16_t value)
{
    record(QStringLiteral("setExcelAreaType"), { arg(value) });
    state.excelAreaType = value;
}

void FakeExportOptions::setExcelConstantColumnWidth(bool value)
{
    record(QStringLiteral("setExcelConstantColumnWidth"), { arg(value) });
    state.excelConstantColumnWidth = value;
}

void FakeExportOptions::setExcelTabHasColumnHeadings(bool value)
{
    record(QStringLiteral("setExcelTabHasColumnHeadings"), { arg(value) });
    state.excelTabHasColumnHeadings = value;
}

void FakeExportOptions::setExcelUseWorksheetFunctions(bool value)
{
    record(QStringLiteral("setExcelUseWorksheetFunctions"), { arg(value) });
    state.excelUseWorksheetFunctions = value;
}

void FakeExportOptions::setExcelPageBreaks(bool value)
{
    record(QStringLiteral("setExcelPageBreaks"), { arg(value) });
    state.excelPageBreaks = value;
}

void FakeExportOptions::setExcelExportAllPages(bool value)
{
    record(QStringLiteral("setExcelExportAllPages"), { arg(value) });
    state.excelExportAllPages = value;
}

void FakeExportOptions::setMailToList(const QString& value)
{
    record(QStringLiteral("setMailToList"), { arg(value) });
    state.mailToList = value;
}

void FakeExportOptions::setMailSubject(const QString& value)
{
    record(QStringLiteral("setMailSubject"), { arg(value) });
    state.mailSubject = value;
}

void FakeExportOptions::setMailMessage(const QString& value)
{
    record(QStringLiteral("setMailMessage"), { arg(value) });
    state.mailMessage = value;
}

void FakeExportOptions::setMailCcList(const QString& value)
{
    record(QStringLiteral("setMailCcList"), { arg(value) });
    state.mailCcList = value;
}

void FakeExportOptions::setMailBccList(const QString& value)
{
    record(QStringLiteral("setMailBccList"), { arg(value) });
    state.mailBccList = value;
}

} // namespace fakeruntime
