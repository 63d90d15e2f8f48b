#include "reportrt/layout/fonttable.h"

namespace reportrt {

int FontTable::add(const FontFace& face)
{
    const QMutexLocker lock(&m_mutex);
    for (size_t i = 0; i < m_faces.size(); ++i) {
        if (m_faces[i] == face)
            return static_cast<int>(i);
    }
    m_faces.push_back(face);
    return static_cast<int>(m_faces.size()) - 1;
}

FontFace FontTable::face(int id) const
{
    const QMutexLocker lock(&m_mutex);
    return m_faces.at(static_cast<size_t>(id));
}

int FontTable::size() const
{
    const QMutexLocker lock(&m_mutex);
    return static_cast<int>(m_faces.size());
}

} // namespace reportrt
