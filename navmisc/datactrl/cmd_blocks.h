// Command blocks of the data-control channel (layout placeholder, completed with the channel).
#pragma once

#include <cstdint>

struct CDataControlCmdBlkKVDevice {
  int32_t nCmdType;
};
struct CDataControlCmdBlkKVDevice11 {
  int32_t nCmdType;
};
