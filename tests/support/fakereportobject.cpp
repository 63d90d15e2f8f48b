#include "fakereportobject.h"

#include "fakereport.h"
#include "fakesection.h"

#include <algorithm>

namespace fakeruntime {

namespace {
const QString oleType = QStringLiteral("ICROleObject");
const QString blobType = QStringLiteral("IBlobFieldObject");
const QString fieldType = QStringLiteral("IFieldObject");
const QString subreportType = QStringLiteral("ISubreportObject");

QString size(const QImage& picture)
{
    return picture.isNull() ? QStringLiteral("null")
                            : QStringLiteral("%1x%2").arg(picture.width()).arg(picture.height());
}
} // namespace

FakeReportObject::FakeReportObject(
    std::weak_ptr<Script> script, State initial, std::weak_ptr<FakeSection> section)
    : FakeObject(std::move(script), QStringLiteral("Object"))
    , state(std::move(initial))
    , m_section(std::move(section))
{ }

QString FakeReportObject::typeName() const
{
    recordQuery(QStringLiteral("typeName"));
    return state.typeName;
}

QString FakeReportObject::name() const
{
    recordQuery(QStringLiteral("name"));
    return state.name;
}

std::shared_ptr<runtime::Section> FakeReportObject::section() const
{
    recordQuery(QStringLiteral("section"));
    return m_section.lock();
}

int32_t FakeReportObject::left() const
{
    recordQuery(QStringLiteral("left"));
    return state.left;
}

int32_t FakeReportObject::top() const
{
    recordQuery(QStringLiteral("top"));
    return state.top;
}

int32_t FakeReportObject::width() const
{
    recordQuery(QStringLiteral("width"));
    return state.width;
}

int32_t FakeReportObject::height() const
{
    recordQuery(QStringLiteral("height"));
    return state.height;
}

void FakeReportObject::setLeft(int32_t twips)
{
    record(QStringLiteral("setLeft"), { arg(twips) });
    state.left = twips;
}

void FakeReportObject::setTop(int32_t twips)
{
    record(QStringLiteral("setTop"), { arg(twips) });
    state.top = twips;
}

void FakeReportObject::setWidth(int32_t twips)
{
    record(QStringLiteral("setWidth"), { arg(twips) });
    state.width = twips;
}

void FakeReportObject::setHeight(int32_t twips)
{
    record(QStringLiteral("setHeight"), { arg(twips) });
    state.height = twips;
}

std::shared_ptr<runtime::Report> FakeReportObject::openSubreport()
{
    record(QStringLiteral("openSubreport"));
    if (!isOneOf({ subreportType }) || !state.subreport)
        return ReportObject::openSubreport();
    return state.subreport;
}

QImage FakeReportObject::picture() const
{
    recordQuery(QStringLiteral("picture"));
    if (!isOneOf({ oleType }))
        return ReportObject::picture();
    return state.picture;
}

void FakeReportObject::setPicture(const QImage& picture)
{
    record(QStringLiteral("setPicture"), { size(picture) });
    if (!isOneOf({ oleType }))
        ReportObject::setPicture(picture);
    state.picture = picture;
}

QString FakeReportObject::fieldName() const
{
    recordQuery(QStringLiteral("fieldName"));
    if (!isOneOf({ blobType, fieldType }))
        return ReportObject::fieldName();
    return state.fieldName;
}

core::Variant FakeReportObject::value() const
{
    recordQuery(QStringLiteral("value"));
    if (!isOneOf({ fieldType }))
        return ReportObject::value();
    return state.value;
}

bool FakeReportObject::isOneOf(std::initializer_list<QStringView> typeNames) const
{
    return std::find(typeNames.begin(), typeNames.end(), QStringView(state.typeName))
        != typeNames.end();
}

} // namespace fakeruntime
