#include "runtime/viewernotifications.h"

namespace runtime {

void ViewerNotifications::printButtonClicked(bool&) { }
void ViewerNotifications::downloadStarted(int32_t) { }
void ViewerNotifications::downloadFinished(int32_t) { }
void ViewerNotifications::viewChanged(int32_t, int32_t) { }
void ViewerNotifications::searchButtonClicked(QString&, bool&) { }
void ViewerNotifications::firstPageButtonClicked(bool&) { }
void ViewerNotifications::lastPageButtonClicked(bool&) { }
void ViewerNotifications::nextPageButtonClicked(bool&) { }
void ViewerNotifications::prevPageButtonClicked(bool&) { }
void ViewerNotifications::goToPageNClicked(bool&, int16_t&) { }
void ViewerNotifications::clicked(int32_t, int32_t, core::Variant&, bool&) { }
void ViewerNotifications::keyDown(int16_t&, int16_t&) { }
void ViewerNotifications::focusChanged(bool) { }
void ViewerNotifications::gotFocus() { }
void ViewerNotifications::lostFocus() { }
void ViewerNotifications::resized() { }
void ViewerNotifications::reportSourceError(QString&, int32_t&, bool&) { }
void ViewerNotifications::refreshButtonClicked(bool&) { }
void ViewerNotifications::databaseLogonFailed(const QString&, const QString&) { }

} // namespace runtime
