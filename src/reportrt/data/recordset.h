#pragma once

#include "reportrt/base/value.h"

#include <array>
#include <memory>
#include <vector>

namespace reportrt {

class SpillFile;

/// Records of a fixed number of columns, stored in blocks of chunkRecords records: a
/// million records cost a few hundred allocations, not a million, and growing never moves
/// the records already read (a single array would copy them all at every doubling, and
/// hold old and new copy at once).
///
/// Only the newest blocks stay in memory: once more than the resident limit is read, the
/// oldest full blocks go, compactly encoded, to a spill file (SpillFile) and come back
/// through a small cache of decoded blocks when read. So memory stays flat however many
/// records a report reads; reading them in order costs one decoding per block.
class RecordSet {
public:
    static constexpr qsizetype chunkRecords = 2048; // a power of two: indexes split by shifts

    explicit RecordSet(int columnCount = 0);
    ~RecordSet();
    RecordSet(RecordSet&& other) noexcept;
    RecordSet& operator=(RecordSet&& other) noexcept;

    /// How many records stay in memory before blocks are spilled (rounded up to whole
    /// blocks, at least one), for sets made from now on; returns the previous limit.
    static qsizetype setResidentLimit(qsizetype records);

    int columnCount() const { return m_columns; }
    qsizetype size() const { return m_count; }
    /// Whether some records live in the spill file.
    bool isSpilled() const { return m_spilledChunks > 0; }

    /// The record's values. A pointer into a spilled block stays valid until three other
    /// spilled blocks were read; one into memory as long as the set.
    const Value* record(qsizetype index) const
    {
        const auto chunk = static_cast<size_t>(index / chunkRecords);
        if (chunk >= m_spilledChunks)
            return m_chunks[chunk].data() + (index % chunkRecords) * m_columns;
        return spilledRecord(index);
    }

    /// Appends a record of Null values and returns it; the pointers of the other records
    /// stay valid as record() says. Raises Error::RuntimeFailure when a block cannot be
    /// spilled.
    Value* append();
    void removeLast();
    void reserve(qsizetype records);
    /// Gives back the room of records not read: empty blocks, and the unused end of the
    /// last one.
    void shrinkToFit();

private:
    struct Extent {
        int64_t offset = 0;
        qsizetype size = 0;
    };
    struct CachedChunk {
        size_t chunk = SIZE_MAX;
        uint64_t lastUse = 0;
        std::vector<Value> values;
    };

    const Value* spilledRecord(qsizetype index) const;
    void spillOldest();

    int m_columns;
    qsizetype m_count = 0;
    size_t m_residentChunks;
    size_t m_spilledChunks = 0; // the first blocks, in order
    std::vector<std::vector<Value>> m_chunks; // spilled blocks stay as empty vectors
    std::vector<Extent> m_extents;
    std::unique_ptr<SpillFile> m_spill;
    mutable std::array<CachedChunk, 4> m_cache;
    mutable uint64_t m_uses = 0;
};

} // namespace reportrt
