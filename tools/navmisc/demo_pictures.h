// Small pictures for the demo's photos, made on the spot so that the demo needs no files.
#pragma once

#include <cstdint>
#include <string>

namespace navmisc::cli {

// A PNG picture of `width` x `height` pixels (an evening sky over a hill, its colours drawn from
// `seed`).
std::string DemoPicturePng(int width, int height, uint32_t seed);

}  // namespace navmisc::cli
