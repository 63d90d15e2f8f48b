#include "reportrt/output/writertable.h"

#include <map>

namespace reportrt {

namespace {
std::map<int32_t, WriterTable::Writer>& writers()
{
    static std::map<int32_t, WriterTable::Writer> table;
    return table;
}
} // namespace

void WriterTable::add(runtime::ExportFormat format, Writer writer)
{
    writers()[static_cast<int32_t>(format)] = std::move(writer);
}

const WriterTable::Writer* WriterTable::find(int32_t formatCode)
{
    const auto found = writers().find(formatCode);
    return found == writers().end() ? nullptr : &found->second;
}

} // namespace reportrt
