#pragma once

#include "reportrt/base/value.h"

#include <vector>

namespace reportrt {

/// Records of a fixed number of columns, stored in blocks of chunkRecords records: a
/// million records cost a few hundred allocations, not a million, and growing never moves
/// the records already read (a single array would copy them all at every doubling, and
/// hold old and new copy at once).
class RecordSet {
public:
    static constexpr qsizetype chunkRecords = 2048; // a power of two: indexes split by shifts

    explicit RecordSet(int columnCount = 0)
        : m_columns(columnCount)
    { }

    int columnCount() const { return m_columns; }
    qsizetype size() const { return m_count; }
    const Value* record(qsizetype index) const
    {
        return m_chunks[static_cast<size_t>(index / chunkRecords)].data()
            + (index % chunkRecords) * m_columns;
    }
    Value* record(qsizetype index)
    {
        return m_chunks[static_cast<size_t>(index / chunkRecords)].data()
            + (index % chunkRecords) * m_columns;
    }

    /// Appends a record of Null values and returns it; the pointers of the other records
    /// stay valid.
    Value* append()
    {
        if (m_count % chunkRecords == 0 && m_count / chunkRecords == qsizetype(m_chunks.size())) {
            // Reserved, not filled: memory the chunk does not use yet is never touched.
            m_chunks.emplace_back();
            m_chunks.back().reserve(static_cast<size_t>(chunkRecords * m_columns));
        }
        std::vector<Value>& chunk = m_chunks[static_cast<size_t>(m_count / chunkRecords)];
        chunk.resize(chunk.size() + static_cast<size_t>(m_columns));
        ++m_count;
        return record(m_count - 1);
    }
    void removeLast()
    {
        --m_count;
        std::vector<Value>& chunk = m_chunks[static_cast<size_t>(m_count / chunkRecords)];
        chunk.resize(chunk.size() - static_cast<size_t>(m_columns));
    }
    void reserve(qsizetype records)
    {
        m_chunks.reserve(static_cast<size_t>(records / chunkRecords + 1));
    }
    /// Gives back the room of records not read: empty blocks, and the unused end of the
    /// last one.
    void shrinkToFit()
    {
        while (!m_chunks.empty() && m_chunks.back().empty())
            m_chunks.pop_back();
        if (!m_chunks.empty())
            m_chunks.back().shrink_to_fit();
    }

private:
    int m_columns;
    qsizetype m_count = 0;
    std::vector<std::vector<Value>> m_chunks;
};

} // namespace reportrt
