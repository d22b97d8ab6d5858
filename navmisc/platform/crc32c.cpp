#include "navmisc/platform/detail/crc32c.h"

#include <array>
#include <cstring>

namespace navmisc::detail {
namespace {

constexpr uint32_t kPolynomial = 0x82F63B78;  // reflected Castagnoli polynomial

constexpr std::array<uint32_t, 256> MakeTable() {
  std::array<uint32_t, 256> t{};
  for (uint32_t i = 0; i < 256; ++i) {
    uint32_t c = i;
    for (int k = 0; k < 8; ++k) c = (c & 1) ? (c >> 1) ^ kPolynomial : c >> 1;
    t[i] = c;
  }
  return t;
}
constexpr std::array<uint32_t, 256> kTable = MakeTable();

uint32_t Portable(const uint8_t* p, size_t n, uint32_t crc) {
  while (n--) crc = kTable[(crc ^ *p++) & 0xFF] ^ (crc >> 8);
  return crc;
}

#if defined(__x86_64__)
__attribute__((target("sse4.2"))) uint32_t Hardware(const uint8_t* p, size_t n, uint32_t crc) {
  uint64_t c = crc;
  for (; n >= 8; n -= 8, p += 8) {
    uint64_t word;
    std::memcpy(&word, p, 8);
    c = __builtin_ia32_crc32di(c, word);
  }
  uint32_t c32 = static_cast<uint32_t>(c);
  for (; n; --n) c32 = __builtin_ia32_crc32qi(c32, *p++);
  return c32;
}
// The check runs during static initialisation, before the compiler's own set-up of the CPU
// model is guaranteed; asking for that first makes it safe.
const bool kHaveHardware = [] {
  __builtin_cpu_init();
  return __builtin_cpu_supports("sse4.2") != 0;
}();
#endif

}  // namespace

uint32_t Crc32c(const void* data, size_t size, uint32_t crc) {
  const auto* p = static_cast<const uint8_t*>(data);
  crc = ~crc;
#if defined(__x86_64__)
  if (kHaveHardware) return ~Hardware(p, size, crc);
#endif
  return ~Portable(p, size, crc);
}

}  // namespace navmisc::detail
