#pragma once

#include "fakeobject.h"
#include "runtime/reportobject.h"

namespace fakeruntime {

class FakeReport;
class FakeSection;

/// A report object of a fake section. Logged as `Object(<name>)`. Like late binding on the
/// real objects, members that the object's type does not have raise 438: the picture is
/// only on "ICROleObject", the field name on "IBlobFieldObject" and "IFieldObject", the
/// value on "IFieldObject", and a subreport opens only on "ISubreportObject".
class FakeReportObject : public runtime::ReportObject, public FakeObject {
public:
    struct State {
        QString typeName;
        QString name;
        int32_t left = 0; // twips
        int32_t top = 0;
        int32_t width = 1440;
        int32_t height = 720;
        QImage picture;
        QString fieldName;
        core::Variant value;
        std::shared_ptr<FakeReport> subreport;
    };

    FakeReportObject(std::weak_ptr<Script> script, State state, std::weak_ptr<FakeSection> section);

    QString label() const override { return state.name; }

    QString typeName() const override;
    QString name() const override;
    std::shared_ptr<runtime::Section> section() const override;
    int32_t left() const override;
    int32_t top() const override;
    int32_t width() const override;
    int32_t height() const override;
    void setLeft(int32_t twips) override;
    void setTop(int32_t twips) override;
    void setWidth(int32_t twips) override;
    void setHeight(int32_t twips) override;
    std::shared_ptr<runtime::Report> openSubreport() override;
    QImage picture() const override;
    void setPicture(const QImage& picture) override;
    QString fieldName() const override;
    core::Variant value() const override;

    /// Read and change freely: nothing here is logged.
    State state;

private:
    bool isOneOf(std::initializer_list<QStringView> typeNames) const;

    std::weak_ptr<FakeSection> m_section;
};

} // namespace fakeruntime
