#pragma once

#include "value.h"

#include <vector>

namespace reportrt {

/// Records of a fixed number of columns in one flat array: a million records cost one
/// allocation, not a million.
class RecordSet {
public:
    explicit RecordSet(int columnCount = 0)
        : m_columns(columnCount)
    { }

    int columnCount() const { return m_columns; }
    qsizetype size() const
    {
        return m_columns ? static_cast<qsizetype>(m_values.size()) / m_columns : m_count;
    }
    const Value* record(qsizetype index) const { return m_values.data() + index * m_columns; }
    Value* record(qsizetype index) { return m_values.data() + index * m_columns; }

    /// Appends a record of Null values and returns it; valid until the next append.
    Value* append()
    {
        ++m_count;
        m_values.resize(m_values.size() + static_cast<size_t>(m_columns));
        return m_values.data() + (m_values.size() - static_cast<size_t>(m_columns));
    }
    void removeLast()
    {
        --m_count;
        m_values.resize(m_values.size() - static_cast<size_t>(m_columns));
    }
    void reserve(qsizetype records) { m_values.reserve(static_cast<size_t>(records * m_columns)); }
    void shrinkToFit() { m_values.shrink_to_fit(); }

private:
    int m_columns;
    qsizetype m_count = 0; // records of a set without columns
    std::vector<Value> m_values;
};

} // namespace reportrt
