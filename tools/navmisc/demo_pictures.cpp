#include "demo_pictures.h"

#include <zlib.h>

#include <cmath>
#include <random>

namespace navmisc::cli {
namespace {

void PutBig32(std::string& out, uint32_t v) {
  for (int shift = 24; shift >= 0; shift -= 8) out += static_cast<char>((v >> shift) & 0xFF);
}

// One PNG chunk: length, type, data, CRC of type and data.
void PutChunk(std::string& out, const char* type, const std::string& data) {
  PutBig32(out, static_cast<uint32_t>(data.size()));
  const std::string body = std::string(type, 4) + data;
  out += body;
  PutBig32(out, static_cast<uint32_t>(crc32(0, reinterpret_cast<const Bytef*>(body.data()), static_cast<uInt>(body.size()))));
}

}  // namespace

std::string DemoPicturePng(int width, int height, uint32_t seed) {
  std::mt19937 rng(seed);
  std::uniform_int_distribution<int> hue(0, 80);
  const int skyRed = 180 + hue(rng), skyBlue = 120 + hue(rng), hillGreen = 90 + hue(rng);
  const double crest = height * (0.55 + 0.1 * std::uniform_real_distribution<double>(-1, 1)(rng));
  // Rows of RGB pixels, each behind a filter byte of 0 (none).
  std::string raw;
  raw.reserve(static_cast<size_t>(height) * (3 * width + 1));
  for (int y = 0; y < height; ++y) {
    raw += '\0';
    for (int x = 0; x < width; ++x) {
      const double hill = crest + height * 0.08 * std::sin(x * 6.0 / width);
      const double t = static_cast<double>(y) / height;
      if (y < hill) {
        raw += static_cast<char>(skyRed - static_cast<int>(60 * t));
        raw += static_cast<char>(110 + static_cast<int>(60 * t));
        raw += static_cast<char>(skyBlue);
      } else {
        raw += static_cast<char>(40);
        raw += static_cast<char>(hillGreen - static_cast<int>(40 * t));
        raw += static_cast<char>(50);
      }
    }
  }
  uLongf packedSize = compressBound(static_cast<uLong>(raw.size()));
  std::string packed(packedSize, '\0');
  compress2(reinterpret_cast<Bytef*>(packed.data()), &packedSize, reinterpret_cast<const Bytef*>(raw.data()),
            static_cast<uLong>(raw.size()), Z_BEST_COMPRESSION);
  packed.resize(packedSize);

  std::string png = "\x89PNG\r\n\x1a\n";
  std::string header;
  PutBig32(header, static_cast<uint32_t>(width));
  PutBig32(header, static_cast<uint32_t>(height));
  header += std::string("\x08\x02\x00\x00\x00", 5);  // 8 bits per channel, RGB, no interlace
  PutChunk(png, "IHDR", header);
  PutChunk(png, "IDAT", packed);
  PutChunk(png, "IEND", "");
  return png;
}

}  // namespace navmisc::cli
