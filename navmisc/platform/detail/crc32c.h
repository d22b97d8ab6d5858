// CRC-32C (Castagnoli), the checksum of the queue's frames.
#pragma once

#include <cstddef>
#include <cstdint>

namespace navmisc::detail {

// The CRC-32C of `size` bytes, continuing from `crc` (0 to start). Uses the processor's CRC32
// instruction where there is one.
uint32_t Crc32c(const void* data, size_t size, uint32_t crc = 0);
// The same, a byte at a time from a table (the reference the fast path is checked against).
uint32_t Crc32cPortable(const void* data, size_t size, uint32_t crc = 0);

}  // namespace navmisc::detail
