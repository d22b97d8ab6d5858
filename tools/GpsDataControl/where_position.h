// The live position on the where-am-I map page: the where-am-I store's trip (in
// "WhereRes/MAP_HTML") receives the map script of the profile's template and the position
// script "track_data.js" for each position, through the store (docs/dongle.md).
#pragma once

#include <memory>

#include "navmisc/activity/where_store.h"

namespace gpsdc {

class WherePosition {
 public:
  // Reads the where-am-I store and makes sure it holds a trip, making one when it holds none.
  // False, with nothing written, when the store names a trip that cannot be read (its folder
  // stays as it is) or the store cannot be written.
  bool Prepare();
  // Writes the position (speed in metres per hour) into the trip's "track_data.js", with a copy
  // of the map script template. False when the script could not be written.
  bool Write(long time, double longitude, double latitude, double altitude, double speed);

 private:
  std::unique_ptr<WHEREIAM_DATA_NODE> store_;
};

}  // namespace gpsdc
