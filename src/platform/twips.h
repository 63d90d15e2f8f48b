#pragma once

#include "core/ludmoxexport.h"

#include <QtGlobal>

class QPaintDevice;

namespace platform {

/// Twips per pixel at a logical resolution: 1440 / dpi, so 15 at 96 DPI. A resolution that
/// is not positive counts as 96 DPI.
LUDMOX_EXPORT qreal twipsPerPixel(qreal logicalDpi);

/// Twips per pixel across and down on device (a widget, an image), or on the primary screen
/// when device is null; 15 when there is no screen.
LUDMOX_EXPORT qreal twipsPerPixelX(const QPaintDevice* device = nullptr);
LUDMOX_EXPORT qreal twipsPerPixelY(const QPaintDevice* device = nullptr);

} // namespace platform
