#pragma once

#include "reportrt/layout/fontface.h"

#include <QMutex>
#include <vector>

namespace reportrt {

/// The font faces of one output job, numbered from 0. The layout adds faces while a
/// renderer on another thread reads those of pages already laid out, so access is locked.
class FontTable {
public:
    /// The number of face, added when it is new.
    int add(const FontFace& face);
    FontFace face(int id) const;
    int size() const;

private:
    mutable QMutex m_mutex;
    std::vector<FontFace> m_faces;
};

} // namespace reportrt
