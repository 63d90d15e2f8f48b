#include "automation/enumerator.h"

#include <utility>

namespace automation {

Enumerator::Enumerator(std::vector<core::Variant> items)
    : m_items(std::move(items))
{ }

} // namespace automation
