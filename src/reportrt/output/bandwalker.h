#pragma once

#include "reportrt/base/value.h"

#include <QDateTime>
#include <QString>
#include <functional>
#include <memory>
#include <vector>

namespace reportrt {

class Report;
class ReportObject;
class Section;

/// Walks the section instances of a report in print order for the exports that write
/// rows rather than painted pages (Excel, HTML), and gives the typed value of each object
/// of the instance being visited.
///
/// Pages are counted with each section's designed height (can-grow text is not measured
/// and subreports are not laid out), with the page header and footer on every page, the
/// report header on the first, "new page before" and "new page after", and a group
/// header kept with the first detail of its group, as the printed layout does. Suppressed
/// sections are not visited. Each instance raises its section's format event before it
/// is visited, and what the handlers changed is put back after the visit.
class BandWalker {
public:
    enum class Band {
        ReportHeader,
        PageHeader,
        GroupHeader,
        Detail,
        GroupFooter,
        ReportFooter,
        PageFooter
    };
    struct Instance {
        Section* section = nullptr;
        Band band = Band::Detail;
        int level = 0; // group level (1 = outermost) of a group header or footer
        qsizetype position = -1; // the record in print order; -1: none
        int page = 1; // 1-based
    };
    using Visitor = std::function<void(const Instance&)>;

    /// Reads the records first when the report has not read them.
    explicit BandWalker(Report& report);
    ~BandWalker();
    BandWalker(const BandWalker&) = delete;
    BandWalker& operator=(const BandWalker&) = delete;

    /// Visits every instance; returns the number of pages. The first call also counts the
    /// pages so page-count fields show the total. Raises the report's errors (a formula
    /// failing on a record).
    int run(const Visitor& visit);

    /// The value an object shows for the instance being visited: fields, summaries and
    /// special fields typed; text objects as strings; Null for other objects.
    Value value(const ReportObject& object);
    /// The text the object shows, formatted with its display pattern.
    QString text(const ReportObject& object);

    /// The report's sections by role; null when the report has none.
    Section* section(Band band, int level = 0) const;
    int groupLevels() const;
    int totalPages() const { return m_totalPages; }
    /// Detail records in print order.
    qsizetype recordCount() const;
    /// For a group footer being visited: the first and last record position of its group.
    std::pair<qsizetype, qsizetype> groupRange(int level) const;

private:
    struct Private;
    int walk(const Visitor* visit);

    std::unique_ptr<Private> d;
    int m_totalPages = 0;
};

} // namespace reportrt
