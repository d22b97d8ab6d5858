// The fixture and point builder shared by the record tests.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/records/items.h"
#include "navmisc/records/user_profile.h"
#include "testutil.h"

namespace navmisc::testutil {

// A fresh data root for every test; the four application profiles start and end at their
// defaults and injected write failures end with the test.
class RecordTest : public ::testing::Test {
 protected:
  RecordTest() { ResetProfiles(); }
  ~RecordTest() override {
    ResetProfiles();
    navmisc::testing::FailAtomicWritesAfter(-1);
  }
  static void ResetProfiles() {
    for (auto* p : {&g_TripMapInfo, &g_SportMapInfo, &g_TrackerMapInfo, &g_WhereMapInfo})
      p->Reset();
  }

  TempDir root_;
  DataRootScope scope_{root_.path()};
};

inline WAYPOINT_ITEM_INFO* NewPoint(int32_t time, double lat, double lon, int32_t type = 0) {
  auto* p = new WAYPOINT_ITEM_INFO(nullptr);
  p->time = time;
  p->latitude = lat;
  p->longitude = lon;
  p->type = type;
  return p;
}

}  // namespace navmisc::testutil
