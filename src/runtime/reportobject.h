#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"
#include "core/variant.h"

#include <QImage>
#include <QString>
#include <memory>

namespace runtime {

class Report;
class Section;

/// A report object placed in a section. Members that an object's kind does not have raise
/// ComError 438 ("Object doesn't support this property or method"), as late binding would.
class LUDMOX_EXPORT ReportObject : public core::Object {
public:
    QString className() const override { return typeName(); }

    /// "ISubreportObject", "ICROleObject", "IBlobFieldObject", "IFieldObject",
    /// "ITextObject", "ILineObject", "IBoxObject", "IFieldHeadingObject"...
    virtual QString typeName() const = 0;
    virtual QString name() const = 0;
    /// The section that holds the object.
    virtual std::shared_ptr<Section> section() const = 0;

    // Position and size in twips.
    virtual int32_t left() const = 0;
    virtual int32_t top() const = 0;
    virtual int32_t width() const = 0;
    virtual int32_t height() const = 0;
    virtual void setLeft(int32_t twips) = 0;
    virtual void setTop(int32_t twips) = 0;
    virtual void setWidth(int32_t twips) = 0;
    virtual void setHeight(int32_t twips) = 0;

    /// Subreport objects: opens the subreport.
    virtual std::shared_ptr<Report> openSubreport();
    /// OLE objects: the picture shown (null image = none).
    virtual QImage picture() const;
    virtual void setPicture(const QImage& picture);
    /// Blob field and field objects: the name of the bound field ("{LUDFile.Filedata}").
    virtual QString fieldName() const;
    /// Field objects: the value for the record being formatted.
    virtual core::Variant value() const;
};

} // namespace runtime
