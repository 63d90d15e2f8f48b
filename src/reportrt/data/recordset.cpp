#include "reportrt/data/recordset.h"

#include "reportrt/base/runtimeerror.h"
#include "reportrt/data/spillfile.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <utility>

namespace reportrt {

namespace {
// 16 blocks, about 32,000 records (some 15 MB): small reports never touch the disk, and a
// large one costs one encoding and a decoding per pass, far less than laying it out.
std::atomic<qsizetype> residentLimit { 16 * RecordSet::chunkRecords };

// A spilled value is a tag byte and its payload: eight bytes for numbers and dates, a
// length and the UTF-16 units for text, a length and the bytes for binary values.
enum Tag : uint8_t { Null, Number, Currency, Text, False, True, Date, Time, DateTime, Bytes };

template <typename T> void put(QByteArray& out, const T& value)
{
    out.append(reinterpret_cast<const char*>(&value), sizeof value);
}

template <typename T> T take(const char*& in, const char* end)
{
    T value;
    if (end - in < static_cast<std::ptrdiff_t>(sizeof value))
        raiseError(Error::RuntimeFailure, QStringLiteral("The records' scratch file is damaged."));
    std::memcpy(&value, in, sizeof value);
    in += sizeof value;
    return value;
}

void encode(QByteArray& out, const Value& v)
{
    switch (v.type()) {
    case ValueType::Null:
        out.append(char(Null));
        return;
    case ValueType::Number:
        out.append(char(Number));
        put(out, v.toNumber());
        return;
    case ValueType::Currency:
        out.append(char(Currency));
        put(out, v.currencyScaled());
        return;
    case ValueType::String:
        out.append(char(Text));
        put(out, static_cast<uint32_t>(v.text().size()));
        out.append(reinterpret_cast<const char*>(v.text().utf16()), v.text().size() * 2);
        return;
    case ValueType::Boolean:
        out.append(char(v.toBoolean() ? True : False));
        return;
    case ValueType::Date:
        out.append(char(Date));
        put(out, v.julianDay());
        return;
    case ValueType::Time:
        out.append(char(Time));
        put(out, v.msecsOfDay());
        return;
    case ValueType::DateTime:
        out.append(char(DateTime));
        put(out, v.dateTimeMsecs());
        return;
    case ValueType::Binary:
        out.append(char(Bytes));
        put(out, static_cast<uint32_t>(v.bytes().size()));
        out.append(v.bytes());
        return;
    }
}

Value decode(const char*& in, const char* end)
{
    switch (take<uint8_t>(in, end)) {
    case Null:
        return {};
    case Number:
        return Value::number(take<double>(in, end));
    case Currency:
        return Value::currency(take<int64_t>(in, end));
    case Text: {
        const auto length = take<uint32_t>(in, end);
        if (end - in < static_cast<std::ptrdiff_t>(length) * 2)
            break;
        QString text(static_cast<qsizetype>(length), Qt::Uninitialized);
        std::memcpy(text.data(), in, size_t(length) * 2);
        in += size_t(length) * 2;
        return Value::string(text);
    }
    case False:
        return Value::boolean(false);
    case True:
        return Value::boolean(true);
    case Date:
        return Value::date(take<int64_t>(in, end));
    case Time:
        return Value::time(take<int32_t>(in, end));
    case DateTime:
        return Value::dateTime(take<int64_t>(in, end));
    case Bytes: {
        const auto length = take<uint32_t>(in, end);
        if (end - in < static_cast<std::ptrdiff_t>(length))
            break;
        QByteArray bytes(in, static_cast<qsizetype>(length));
        in += length;
        return Value::binary(bytes);
    }
    }
    raiseError(Error::RuntimeFailure, QStringLiteral("The records' scratch file is damaged."));
}
} // namespace

RecordSet::RecordSet(int columnCount)
    : m_columns(columnCount)
    , m_residentChunks(static_cast<size_t>(
          std::max<qsizetype>(1, (residentLimit + chunkRecords - 1) / chunkRecords)))
{ }

RecordSet::~RecordSet() = default;
RecordSet::RecordSet(RecordSet&& other) noexcept = default;
RecordSet& RecordSet::operator=(RecordSet&& other) noexcept = default;

qsizetype RecordSet::setResidentLimit(qsizetype records)
{
    return residentLimit.exchange(records);
}

Value* RecordSet::append()
{
    if (m_count % chunkRecords == 0 && m_count / chunkRecords == qsizetype(m_chunks.size())) {
        if (m_chunks.size() - m_spilledChunks >= m_residentChunks)
            spillOldest();
        // Reserved, not filled: memory the chunk does not use yet is never touched.
        m_chunks.emplace_back();
        m_chunks.back().reserve(static_cast<size_t>(chunkRecords * m_columns));
    }
    std::vector<Value>& chunk = m_chunks[static_cast<size_t>(m_count / chunkRecords)];
    chunk.resize(chunk.size() + static_cast<size_t>(m_columns));
    ++m_count;
    return chunk.data() + chunk.size() - m_columns;
}

void RecordSet::removeLast()
{
    --m_count;
    std::vector<Value>& chunk = m_chunks[static_cast<size_t>(m_count / chunkRecords)];
    chunk.resize(chunk.size() - static_cast<size_t>(m_columns));
}

void RecordSet::reserve(qsizetype records)
{
    m_chunks.reserve(static_cast<size_t>(records / chunkRecords + 1));
}

void RecordSet::shrinkToFit()
{
    while (m_chunks.size() > m_spilledChunks && m_chunks.back().empty())
        m_chunks.pop_back();
    if (m_chunks.size() > m_spilledChunks)
        m_chunks.back().shrink_to_fit();
}

void RecordSet::spillOldest()
{
    if (!m_spill)
        m_spill = std::make_unique<SpillFile>();
    std::vector<Value>& chunk = m_chunks[m_spilledChunks];
    QByteArray bytes;
    bytes.reserve(static_cast<qsizetype>(chunk.size()) * 12);
    for (const Value& v : chunk)
        encode(bytes, v);
    const int64_t offset = m_spill->append(bytes);
    m_extents.push_back({ offset, bytes.size() });
    std::vector<Value>().swap(chunk);
    ++m_spilledChunks;
}

const Value* RecordSet::spilledRecord(qsizetype index) const
{
    const auto chunk = static_cast<size_t>(index / chunkRecords);
    const qsizetype offset = (index % chunkRecords) * m_columns;
    CachedChunk* slot = &m_cache[0];
    for (CachedChunk& c : m_cache) {
        if (c.chunk == chunk) {
            c.lastUse = ++m_uses;
            return c.values.data() + offset;
        }
        if (c.lastUse < slot->lastUse)
            slot = &c;
    }
    const Extent& extent = m_extents[chunk];
    QByteArray bytes;
    m_spill->read(extent.offset, extent.size, bytes);
    slot->chunk = SIZE_MAX;
    slot->values.clear();
    slot->values.reserve(static_cast<size_t>(chunkRecords * m_columns));
    const char* in = bytes.constData();
    const char* end = in + bytes.size();
    while (in < end)
        slot->values.push_back(decode(in, end));
    if (slot->values.size() != static_cast<size_t>(chunkRecords * m_columns))
        raiseError(Error::RuntimeFailure, QStringLiteral("The records' scratch file is damaged."));
    slot->chunk = chunk;
    slot->lastUse = ++m_uses;
    return slot->values.data() + offset;
}

} // namespace reportrt
