#pragma once

namespace reportrt {

struct PageSetup;

/// The paper and its margins, in twips.
struct PageGeometry {
    double width = 0;
    double height = 0;
    double left = 0;
    double top = 0;
    double right = 0;
    double bottom = 0;

    /// Paper codes Qt does not know fall back to A4, with a warning: the report still
    /// prints, on the most common paper.
    static PageGeometry of(const PageSetup& setup);
};

} // namespace reportrt
