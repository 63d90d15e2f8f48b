#pragma once

#include "core/ludmoxexport.h"

#include <QColor>
#include <cstdint>

namespace platform {

/// OLE colours as hosts pass them: 0x00BBGGRR for a colour, 0x800000nn for the system colour
/// nn (5 window background, 8 window text, 15 button face, ...), taken from the
/// application's palette. An invalid QColor for a system colour number that has no meaning
/// and for any other high byte.
LUDMOX_EXPORT QColor colorFromOle(int32_t oleColor);

/// The OLE colour 0x00BBGGRR of color; alpha is dropped.
int32_t oleFromColor(const QColor& color);

} // namespace platform
