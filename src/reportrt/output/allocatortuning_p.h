#pragma once

namespace reportrt {

/// Sets the C library's allocator thresholds for PDF output, once per process, when the
/// environment variable LUDMOX_TUNE_ALLOCATOR is 1; otherwise does nothing, since the
/// allocator is the host process's.
///
/// QPdfWriter compresses every page through two buffers of 10 MB. With glibc's starting
/// thresholds those are mapped from the system and given back for each page, and with
/// transparent huge pages every first touch clears megabytes: about 0.3 ms a page, a
/// third of a large export. The thresholds set here (32 MB to map, 64 MB kept free) are
/// the ones glibc moves to by itself once a program has freed a block of 32 MB, so the
/// buffers are reused instead; what else the process allocates behaves as it would after
/// such a block.
void tuneAllocatorForPdf();

} // namespace reportrt
