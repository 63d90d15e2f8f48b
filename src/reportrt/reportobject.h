#pragma once

#include "reportrt/document/reportdocument.h"
#include "runtime/reportobject.h"

#include <QImage>
#include <memory>

namespace reportrt {

class Report;
class Section;

/// A report object of an opened report. Type names: "ITextObject", "IFieldObject"
/// (database, formula and parameter fields, special fields, summaries), "ILineObject",
/// "IBoxObject", "ICROleObject" (pictures), "IBlobFieldObject", "ISubreportObject".
class ReportObject : public runtime::ReportObject {
public:
    ReportObject(ObjectDefinition definition, std::weak_ptr<Section> section);

    QString typeName() const override;
    QString name() const override { return m_definition.name; }
    std::shared_ptr<runtime::Section> section() const override;

    int32_t left() const override { return m_definition.left; }
    int32_t top() const override { return m_definition.top; }
    int32_t width() const override { return m_definition.width; }
    int32_t height() const override { return m_definition.height; }
    /// Positions and sizes are 0 to 1,000,000 twips; others raise Error::RuntimeFailure.
    void setLeft(int32_t twips) override;
    void setTop(int32_t twips) override;
    void setWidth(int32_t twips) override;
    void setHeight(int32_t twips) override;

    std::shared_ptr<runtime::Report> openSubreport() override;
    QImage picture() const override;
    void setPicture(const QImage& picture) override;
    QString fieldName() const override;
    /// The field's value for the record being formatted; Empty outside formatting.
    core::Variant value() const override;

    /// The object as a document stores it (the picture as PNG when it was changed).
    ObjectDefinition definition() const;
    ObjectDefinition::Kind kind() const { return m_definition.kind; }
    /// The object as it is now, without encoding a changed picture; for the layout.
    const ObjectDefinition& current() const { return m_definition; }

    /// What a section's format handlers may change on an object. The layout keeps it
    /// before an instance is formatted and puts it back once the instance is placed, so
    /// a change made for one record never shows on the next.
    struct FormatState {
        int left = 0;
        int top = 0;
        int width = 0;
        int height = 0;
        QImage picture;
        bool pictureLoaded = false;
        bool pictureChanged = false;
    };
    FormatState formatState() const;
    void restoreFormatState(const FormatState& state);

private:
    ObjectDefinition m_definition;
    std::weak_ptr<Section> m_section;
    mutable QImage m_picture;
    mutable bool m_pictureLoaded = false;
    bool m_pictureChanged = false;
    std::shared_ptr<Report> m_subreport;
};

} // namespace reportrt
