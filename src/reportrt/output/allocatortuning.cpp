#include "platform/sitesettings.h"
#include "reportrt/output/allocatortuning_p.h"

#include <QtGlobal>
#include <mutex>

#if defined(__GLIBC__)
#include <malloc.h>
#endif

namespace reportrt {

void tuneAllocatorForPdf()
{
#if defined(__GLIBC__)
    // The allocator belongs to the host process: only a site that asks for it gets it.
    if (!platform::SiteSettings().isOn(platform::SiteSettings::Setting::TuneAllocator))
        return;
    static std::once_flag once;
    std::call_once(once, [] {
        constexpr int mapThreshold = 32 * 1024 * 1024;
        mallopt(M_MMAP_THRESHOLD, mapThreshold);
        mallopt(M_TRIM_THRESHOLD, 2 * mapThreshold);
    });
#endif
}

} // namespace reportrt
