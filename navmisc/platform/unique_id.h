#pragma once

#include <cstdint>

// A value that strictly increases within the process, also across threads: the millisecond
// tick count when it has moved past the last value handed out, otherwise the last value + 1.
uint32_t GetUniqueID();
