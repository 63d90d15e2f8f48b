#include "reportrt/reportobject.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/base/variantvalue.h"
#include "reportrt/report.h"
#include "reportrt/section.h"

#include <QBuffer>

namespace reportrt {

namespace {
constexpr int32_t maxTwips = 1000000;

void checkTwips(int32_t twips)
{
    if (twips < 0 || twips > maxTwips)
        raiseError(Error::RuntimeFailure,
            QStringLiteral("%1 twips is outside the page (0 to %2).").arg(twips).arg(maxTwips));
}
} // namespace

ReportObject::ReportObject(ObjectDefinition definition, std::weak_ptr<Section> section)
    : m_definition(std::move(definition))
    , m_section(std::move(section))
{ }

QString ReportObject::typeName() const
{
    using Kind = ObjectDefinition::Kind;
    switch (m_definition.kind) {
    case Kind::Text:
        return QStringLiteral("ITextObject");
    case Kind::Field:
    case Kind::Special:
    case Kind::Summary:
        return QStringLiteral("IFieldObject");
    case Kind::Line:
        return QStringLiteral("ILineObject");
    case Kind::Box:
        return QStringLiteral("IBoxObject");
    case Kind::Picture:
        return QStringLiteral("ICROleObject");
    case Kind::Blob:
        return QStringLiteral("IBlobFieldObject");
    case Kind::Subreport:
        return QStringLiteral("ISubreportObject");
    }
    return {};
}

std::shared_ptr<runtime::Section> ReportObject::section() const
{
    return m_section.lock();
}

void ReportObject::setLeft(int32_t twips)
{
    checkTwips(twips);
    m_definition.left = twips;
}

void ReportObject::setTop(int32_t twips)
{
    checkTwips(twips);
    m_definition.top = twips;
}

void ReportObject::setWidth(int32_t twips)
{
    checkTwips(twips);
    m_definition.width = twips;
}

void ReportObject::setHeight(int32_t twips)
{
    checkTwips(twips);
    m_definition.height = twips;
}

std::shared_ptr<runtime::Report> ReportObject::openSubreport()
{
    if (m_definition.kind != ObjectDefinition::Kind::Subreport)
        return runtime::ReportObject::openSubreport();
    if (!m_subreport) {
        const auto section = m_section.lock();
        const auto report = section ? section->report() : nullptr;
        m_subreport = Report::fromDocument(*m_definition.subreport,
            report ? report->fileName() + u'#' + m_definition.name : m_definition.name);
    }
    return m_subreport;
}

QImage ReportObject::picture() const
{
    if (m_definition.kind != ObjectDefinition::Kind::Picture)
        return runtime::ReportObject::picture();
    if (!m_pictureLoaded) {
        m_picture = QImage::fromData(m_definition.image);
        m_pictureLoaded = true;
    }
    return m_picture;
}

void ReportObject::setPicture(const QImage& picture)
{
    if (m_definition.kind != ObjectDefinition::Kind::Picture)
        return runtime::ReportObject::setPicture(picture);
    m_picture = picture;
    m_pictureLoaded = true;
    m_pictureChanged = true;
}

QString ReportObject::fieldName() const
{
    using Kind = ObjectDefinition::Kind;
    switch (m_definition.kind) {
    case Kind::Field:
    case Kind::Summary:
    case Kind::Blob:
        return m_definition.field;
    default:
        return runtime::ReportObject::fieldName();
    }
}

core::Variant ReportObject::value() const
{
    if (m_definition.kind != ObjectDefinition::Kind::Field)
        return runtime::ReportObject::value();
    const auto section = m_section.lock();
    const auto report = section ? section->report() : nullptr;
    if (!report)
        return {};
    const Value v = report->fieldValue(m_definition.field);
    return v.isNull() && !report->result() ? core::Variant() : variantvalue::toVariant(v);
}

ReportObject::FormatState ReportObject::formatState() const
{
    return { m_definition.left, m_definition.top, m_definition.width, m_definition.height,
        m_picture, m_pictureLoaded, m_pictureChanged };
}

void ReportObject::restoreFormatState(const FormatState& state)
{
    m_definition.left = state.left;
    m_definition.top = state.top;
    m_definition.width = state.width;
    m_definition.height = state.height;
    m_picture = state.picture;
    m_pictureLoaded = state.pictureLoaded;
    m_pictureChanged = state.pictureChanged;
}

ObjectDefinition ReportObject::definition() const
{
    ObjectDefinition o = m_definition;
    if (m_pictureChanged) {
        QByteArray png;
        if (!m_picture.isNull()) {
            QBuffer buffer(&png);
            buffer.open(QIODevice::WriteOnly);
            m_picture.save(&buffer, "PNG");
        }
        o.image = png;
    }
    if (m_subreport)
        o.subreport = std::make_shared<ReportDocument>(m_subreport->document(false));
    return o;
}

} // namespace reportrt
