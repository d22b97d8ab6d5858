// The live position on the where-am-I map page: the where-am-I store's trip (in
// "WhereRes/MAP_HTML") receives the map script of the profile's template and the position
// script "track_data.js" for each position (docs/dongle.md).
//
// This step does what the where-am-I store's AddWhereItem does for a bare position, until that
// store is part of the library; then Write becomes a call to it.
#pragma once

#include <string>

#include "navmisc/platform/cstring.h"

namespace gpsdc {

class WherePosition {
 public:
  // Makes sure the where-am-I store ("WhereRes/WHERERES_INFO.INI") holds a trip, making one
  // when it holds none or one that cannot be read. False when that fails.
  bool Prepare();
  // Copies the map script template ("Templates/<style>_<mode>/js/gmap.js" in the program folder)
  // into the trip's "js" folder and replaces "track_data.js". `speed` is in metres per hour.
  // False when the script could not be written.
  bool Write(long time, double longitude, double latitude, double altitude, double speed);

  const CString& trackDataPath() const { return trackData_; }

 private:
  CString folder_;     // the trip's resource folder
  CString trackData_;  // its "track_data.js"
  CString mapScript_;  // the template to copy
};

// The text of "track_data.js" for one position (speed in metres per hour).
std::string TrackDataScript(long time, double latitude, double longitude, double altitude,
                            double speed);

}  // namespace gpsdc
