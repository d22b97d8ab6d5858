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

// The CRC register is linear, so the register after A followed by B is the register after A
// moved past |B| zero bytes, xor the register of B alone. "Moving past n zero bytes" is a
// 32 x 32 matrix over GF(2); squaring the matrix for one zero bit log(n) times gives it for n
// bytes (n a power of two), and four tables of 256 turn it into four lookups.
using Matrix = std::array<uint32_t, 32>;

constexpr uint32_t Times(const Matrix& m, uint32_t v) {
  uint32_t sum = 0;
  for (int i = 0; v; ++i, v >>= 1)
    if (v & 1) sum ^= m[i];
  return sum;
}

constexpr Matrix Square(const Matrix& m) {
  Matrix s{};
  for (int i = 0; i < 32; ++i) s[i] = Times(m, m[i]);
  return s;
}

// The matrix that moves a register past `bytes` zero bytes (a power of two).
constexpr Matrix ZeroBytes(size_t bytes) {
  Matrix m{};
  m[0] = kPolynomial;  // one zero bit
  for (int i = 1; i < 32; ++i) m[i] = 1u << (i - 1);
  for (int i = 0; i < 3; ++i) m = Square(m);  // one zero byte
  for (; bytes > 1; bytes >>= 1) m = Square(m);
  return m;
}

struct Shift {
  std::array<std::array<uint32_t, 256>, 4> table;
  constexpr explicit Shift(size_t bytes) : table{} {
    const Matrix m = ZeroBytes(bytes);
    for (uint32_t b = 0; b < 256; ++b)
      for (int k = 0; k < 4; ++k) table[k][b] = Times(m, b << (8 * k));
  }
  uint32_t operator()(uint32_t crc) const {
    return table[0][crc & 0xFF] ^ table[1][(crc >> 8) & 0xFF] ^ table[2][(crc >> 16) & 0xFF] ^
           table[3][crc >> 24];
  }
};

// The three streams of the hardware path work on blocks of these sizes.
constexpr size_t kLong = 8192;
constexpr size_t kShort = 256;
constexpr Shift kShiftLong(kLong);
constexpr Shift kShiftShort(kShort);

uint32_t Portable(const uint8_t* p, size_t n, uint32_t crc) {
  while (n--) crc = kTable[(crc ^ *p++) & 0xFF] ^ (crc >> 8);
  return crc;
}

#if defined(__x86_64__)
__attribute__((target("sse4.2"))) uint64_t Word(uint64_t crc, const uint8_t* p) {
  uint64_t word;
  std::memcpy(&word, p, 8);
  return __builtin_ia32_crc32di(crc, word);
}

// The CRC32 instruction takes three cycles to give its result but can start one each cycle:
// three independent streams over three adjacent blocks keep it busy, and the block registers
// are joined with the shift tables.
__attribute__((target("sse4.2"))) uint32_t Hardware(const uint8_t* p, size_t n, uint32_t crc) {
  uint64_t c0 = crc;
  for (size_t block : {kLong, kShort}) {
    const Shift& shift = block == kLong ? kShiftLong : kShiftShort;
    while (n >= 3 * block) {
      uint64_t c1 = 0, c2 = 0;
      for (const uint8_t* end = p + block; p < end; p += 8) {
        c0 = Word(c0, p);
        c1 = Word(c1, p + block);
        c2 = Word(c2, p + 2 * block);
      }
      c0 = shift(static_cast<uint32_t>(c0)) ^ c1;
      c0 = shift(static_cast<uint32_t>(c0)) ^ c2;
      p += 2 * block;
      n -= 3 * block;
    }
  }
  for (; n >= 8; n -= 8, p += 8) c0 = Word(c0, p);
  uint32_t c32 = static_cast<uint32_t>(c0);
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

uint32_t Crc32cPortable(const void* data, size_t size, uint32_t crc) {
  return ~Portable(static_cast<const uint8_t*>(data), size, ~crc);
}

uint32_t Crc32c(const void* data, size_t size, uint32_t crc) {
#if defined(__x86_64__)
  if (kHaveHardware) return ~Hardware(static_cast<const uint8_t*>(data), size, ~crc);
#endif
  return Crc32cPortable(data, size, crc);
}

}  // namespace navmisc::detail
