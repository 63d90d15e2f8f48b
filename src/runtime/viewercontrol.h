#pragma once

#include "core/ludmoxexport.h"
#include "core/object.h"

#include <QString>
#include <cstdint>
#include <memory>

class QWidget;

namespace runtime {

class Report;
class ViewerNotifications;

/// The report runtime's preview control: shows the laid-out pages of a report as they print.
/// The control lives on the GUI thread; layout runs there in slices, so the window keeps
/// answering while a large report is still being laid out.
class LUDMOX_EXPORT ViewerControl : public core::Object {
public:
    /// Where layout of the shown report stands; a wait for the last page ends on anything
    /// but Running.
    enum class LayoutState { Idle, Running, Complete, Failed };

    QString className() const override { return QStringLiteral("ViewerControl"); }

    /// The control's widget, owned by the control object; the container re-parents it.
    virtual QWidget* widget() = 0;
    /// Not owned; null for none. Raised on the GUI thread, possibly re-entrantly from a
    /// message-loop yield.
    virtual void setNotifications(ViewerNotifications* notifications) = 0;

    virtual std::shared_ptr<Report> reportSource() const = 0;
    virtual void setReportSource(std::shared_ptr<Report> report) = 0;
    /// Percent, 25 to 400; 1 fits the page width, 2 the whole page.
    virtual int32_t zoom() const = 0;
    virtual void setZoom(int32_t percent) = 0;
    /// Shows the report source from its first page, laying it out (and reading its records
    /// when it has none) progressively. Failures arrive as reportSourceError.
    virtual void viewReport() = 0;
    /// Lays the shown view out again; rereadData reads the records again first.
    virtual void refreshView(bool rereadData) = 0;

    virtual int32_t currentPageNumber() const = 0;
    /// The pages laid out so far, and whether that is all of them.
    virtual int32_t pageCount() const = 0;
    virtual LayoutState layoutState() const = 0;
    virtual bool isBusy() const = 0;
    virtual void showFirstPage() = 0;
    virtual void showLastPage() = 0;
    virtual void showNextPage() = 0;
    virtual void showPreviousPage() = 0;
    virtual void showNthPage(int32_t pageNumber) = 0;
    virtual int32_t activeViewIndex() const = 0;

    /// The control's own print operation: the report through the runtime's printing.
    virtual void printReport() = 0;
    /// Searches the whole document of the active view; returns the number of hits and
    /// shows the first one after the current position.
    virtual int32_t searchForText(const QString& text) = 0;
    virtual void takeFocus() = 0;
};

} // namespace runtime
