#include "platform/olecolor.h"

#include <QGuiApplication>
#include <QPalette>
#include <array>

namespace platform {

namespace {

struct SystemColor {
    QPalette::ColorGroup group;
    QPalette::ColorRole role;
};

// The system colour numbers 0..30 in palette terms; 25 is unassigned.
constexpr std::array<SystemColor, 31> systemColors { {
    { QPalette::Active, QPalette::Window }, // scroll bar
    { QPalette::Active, QPalette::Dark }, // desktop
    { QPalette::Active, QPalette::Highlight }, // active caption
    { QPalette::Inactive, QPalette::Mid }, // inactive caption
    { QPalette::Active, QPalette::Window }, // menu
    { QPalette::Active, QPalette::Base }, // window background
    { QPalette::Active, QPalette::Shadow }, // window frame
    { QPalette::Active, QPalette::WindowText }, // menu text
    { QPalette::Active, QPalette::Text }, // window text
    { QPalette::Active, QPalette::HighlightedText }, // caption text
    { QPalette::Active, QPalette::Window }, // active border
    { QPalette::Inactive, QPalette::Window }, // inactive border
    { QPalette::Active, QPalette::Mid }, // application workspace
    { QPalette::Active, QPalette::Highlight }, // highlight
    { QPalette::Active, QPalette::HighlightedText }, // highlighted text
    { QPalette::Active, QPalette::Button }, // button face
    { QPalette::Active, QPalette::Mid }, // button shadow
    { QPalette::Disabled, QPalette::Text }, // grey text
    { QPalette::Active, QPalette::ButtonText }, // button text
    { QPalette::Inactive, QPalette::HighlightedText }, // inactive caption text
    { QPalette::Active, QPalette::Light }, // button highlight
    { QPalette::Active, QPalette::Shadow }, // 3-D dark shadow
    { QPalette::Active, QPalette::Midlight }, // 3-D light
    { QPalette::Active, QPalette::ToolTipText }, // tooltip text
    { QPalette::Active, QPalette::ToolTipBase }, // tooltip background
    { QPalette::Active, QPalette::NoRole }, // unassigned
    { QPalette::Active, QPalette::Link }, // hot-tracked item
    { QPalette::Active, QPalette::Highlight }, // gradient of the active caption
    { QPalette::Inactive, QPalette::Mid }, // gradient of the inactive caption
    { QPalette::Active, QPalette::Highlight }, // highlighted menu item
    { QPalette::Active, QPalette::Window }, // menu bar
} };

} // namespace

QColor colorFromOle(int32_t oleColor)
{
    const auto value = static_cast<uint32_t>(oleColor);
    const uint32_t kind = value >> 24;
    if (kind == 0x00 || kind == 0x02) // 0x02: the nearest palette colour, i.e. the RGB value
        return QColor(value & 0xFF, (value >> 8) & 0xFF, (value >> 16) & 0xFF);
    if (kind != 0x80)
        return QColor();
    const uint32_t index = value & 0xFFFFFF;
    if (index >= systemColors.size() || systemColors[index].role == QPalette::NoRole)
        return QColor();
    const QPalette palette = qGuiApp ? QGuiApplication::palette() : QPalette();
    return palette.color(systemColors[index].group, systemColors[index].role);
}

int32_t oleFromColor(const QColor& color)
{
    const QColor rgb = color.toRgb();
    return static_cast<int32_t>(static_cast<uint32_t>(rgb.red())
        | (static_cast<uint32_t>(rgb.green()) << 8) | (static_cast<uint32_t>(rgb.blue()) << 16));
}

} // namespace platform
