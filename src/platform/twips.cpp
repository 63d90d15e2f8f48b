#include "platform/twips.h"

#include <QGuiApplication>
#include <QPaintDevice>
#include <QScreen>

namespace platform {

namespace {

constexpr qreal twipsPerInch = 1440.0;
constexpr qreal standardDpi = 96.0;

QScreen* primaryScreen()
{
    return qGuiApp ? QGuiApplication::primaryScreen() : nullptr;
}

} // namespace

qreal twipsPerPixel(qreal logicalDpi)
{
    return twipsPerInch / (logicalDpi > 0 ? logicalDpi : standardDpi);
}

qreal twipsPerPixelX(const QPaintDevice* device)
{
    if (device)
        return twipsPerPixel(device->logicalDpiX());
    const QScreen* screen = primaryScreen();
    return twipsPerPixel(screen ? screen->logicalDotsPerInchX() : standardDpi);
}

qreal twipsPerPixelY(const QPaintDevice* device)
{
    if (device)
        return twipsPerPixel(device->logicalDpiY());
    const QScreen* screen = primaryScreen();
    return twipsPerPixel(screen ? screen->logicalDotsPerInchY() : standardDpi);
}

} // namespace platform
