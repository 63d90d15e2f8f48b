#pragma once

#include "core/ludmoxexport.h"
#include "core/variant.h"

#include <QString>
#include <cstdint>

namespace runtime {

/// What a viewer control tells its container. Every by-reference argument is read back after
/// the call: a "use default" flag left true lets the control do its own action, false means
/// the container handled it. The default implementations leave everything as it is.
class LUDMOX_EXPORT ViewerNotifications {
public:
    virtual ~ViewerNotifications() = default;

    virtual void printButtonClicked(bool& useDefault);
    /// loadingType: 1 while records are read and pages laid out.
    virtual void downloadStarted(int32_t loadingType);
    virtual void downloadFinished(int32_t loadingType);
    /// View indexes count from 1 (the main view); drill-down views from 2.
    virtual void viewChanged(int32_t oldViewIndex, int32_t newViewIndex);
    virtual void searchButtonClicked(QString& searchText, bool& useDefault);
    virtual void firstPageButtonClicked(bool& useDefault);
    virtual void lastPageButtonClicked(bool& useDefault);
    virtual void nextPageButtonClicked(bool& useDefault);
    virtual void prevPageButtonClicked(bool& useDefault);
    virtual void goToPageNClicked(bool& useDefault, int16_t& pageNumber);
    /// x, y in pixels of the page area; eventInfo names the object under the mouse (a
    /// dictionary-like Variant, Empty on blank paper).
    virtual void clicked(int32_t x, int32_t y, core::Variant& eventInfo, bool& useDefault);
    /// Raised before the control handles a key; a keyCode set to 0 makes it skip the key.
    virtual void keyDown(int16_t& keyCode, int16_t& shift);
    virtual void focusChanged(bool hasFocus);
    virtual void gotFocus();
    virtual void lostFocus();
    virtual void resized();
    /// The report cannot be shown (no data source, a failed read or layout); useDefault
    /// left true shows the control's own message.
    virtual void reportSourceError(QString& errorMessage, int32_t& errorCode, bool& useDefault);
    /// The refresh button or F5: useDefault left true re-reads and lays out again.
    virtual void refreshButtonClicked(bool& useDefault);
    /// Reading records failed because the database logon failed; a report-source error with
    /// the connection-failed code follows.
    virtual void databaseLogonFailed(const QString& serverName, const QString& databaseName);
};

} // namespace runtime
