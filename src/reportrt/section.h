#pragma once

#include "reportrt/document/reportdocument.h"
#include "runtime/section.h"

#include <map>
#include <memory>

namespace reportrt {

class Report;
class ReportObject;

/// A section of an opened report with its report objects.
class Section : public runtime::Section {
public:
    Section(const SectionDefinition& definition, std::weak_ptr<Report> report);
    /// Creates the section's objects; they refer back to it.
    void createObjects(const SectionDefinition& definition);

    QString name() const override { return m_name; }
    std::vector<std::shared_ptr<runtime::ReportObject>> reportObjects() const override;
    int addFormatHandler(FormatHandler handler) override;
    void removeFormatHandler(int cookie) override;

    /// Runs the format handlers, in the order they were added, before an instance of the
    /// section is placed. A handler may remove handlers while they run.
    void raiseFormat();

    std::shared_ptr<Report> report() const { return m_report.lock(); }
    int height() const { return m_height; } // twips
    bool isSuppressed() const { return m_suppressed; }
    bool newPageBefore() const { return m_newPageBefore; }
    bool newPageAfter() const { return m_newPageAfter; }
    bool hasFormatHandlers() const { return !m_handlers.empty(); }
    const std::vector<std::shared_ptr<ReportObject>>& objects() const { return m_objects; }
    /// The section as a document stores it, with the objects' current state.
    SectionDefinition definition() const;

private:
    QString m_name;
    int m_height;
    bool m_suppressed;
    bool m_newPageBefore;
    bool m_newPageAfter;
    std::weak_ptr<Report> m_report;
    std::vector<std::shared_ptr<ReportObject>> m_objects;
    std::map<int, FormatHandler> m_handlers;
    int m_nextCookie = 1;
};

} // namespace reportrt
