// The where-am-I store: one trip of the where-am-I application with the kind of the item, kept
// in "WhereRes/WHERERES_INFO.INI", and the position script "track_data.js" that its map page
// loads (see docs/activity-stores.md).
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"
#include "navmisc/records/resource_cleanup.h"

class BLOG_ITEM_INFO;

// The kind of the held item; the where-am-I application gives the values their meaning.
enum WHERE_ITEM_TYPE : int32_t { WHERE_ITEM_DEFAULT = 0 };

class WHEREIAM_DATA_NODE {
 public:
  WHEREIAM_DATA_NODE() = default;
  // Deletes the held trip.
  ~WHEREIAM_DATA_NODE();
  WHEREIAM_DATA_NODE(const WHEREIAM_DATA_NODE&) = delete;
  // Copies the item type. A store owns its trip, so this one gets a record of its own of the
  // same trip, read from the trip's settings file (none when that cannot be read).
  WHEREIAM_DATA_NODE& operator=(const WHEREIAM_DATA_NODE& other);

  // Takes `trip` (a where-am-I trip), deleting the one held before; stores `type`.
  void AddWhereItem(WHERE_ITEM_TYPE type, BLOG_ITEM_INFO* trip);
  // A bare position for the held trip's map page: stores `type`, copies the map script
  // template into the trip's folder ("js/gmap.js", replaced) and writes "track_data.js" there.
  // Longitude comes before latitude; `speed` is in metres per hour, `altitude` in metres,
  // `time` in seconds since 1970. False when no trip is held or "track_data.js" could not be
  // written (a missing template only leaves "js/gmap.js" out).
  bool AddWhereItem(WHERE_ITEM_TYPE type, long time, double longitude, double latitude, double altitude,
                    double speed);

  // Reads the store; a null handle opens the store's own file (section "SECTION"). 0 when the
  // file cannot be opened; a trip that cannot be read leaves the store without one and is no
  // failure (but the read is then not complete).
  int ReadInfo(unsigned long handle, const wchar_t* section);
  // Writes the store; a null handle opens, writes and closes the store's own file. With no trip
  // held no keys are written. With `writeTrip` the trip saves its own settings too. False when
  // the file could not be written.
  bool WriteInfo(bool writeTrip, unsigned long handle, const wchar_t* section);

  // Deletes every folder of "WhereRes" that the store does not use, unless the last read was
  // incomplete. The folder holding the held trip (a where-am-I trip lives in "MAP_HTML",
  // whatever its id) always stays. The number removed, -1 when the guard refused.
  int RemoveAllUnusedResource();

  // "WhereRes/WHERERES_INFO.INI" under the data root.
  static CString GetStorePathName();
  // The map script template of the where-am-I profile's template style and mode, in the
  // program folder's "Templates".
  static CString GetMapScriptTemplatePathName();
  // The position script of the held trip, empty when none is held.
  CString GetTrackDataPathName() const;

  WHERE_ITEM_TYPE itemType = WHERE_ITEM_DEFAULT;
  BLOG_ITEM_INFO* item = nullptr;  // owned
  navmisc::CompleteReadGuard readGuard;

 protected:
  // Empties `ids` and adds the held trip's id.
  void _FindAllUsedResource(CStringList& ids);
};

namespace navmisc::activity {
// The text of "track_data.js" for a position (speed in metres per hour).
std::string TrackDataScript(long time, double latitude, double longitude, double altitude, double speed);

enum class WhereStoreOpen { kReady, kUnreadable, kUnwritable };
// Reads the where-am-I store into `store` and, when it holds no trip, gives it a fresh one
// ("Where am I", of item kind `type`, or of the kind the store's file gives) and saves it. kUnreadable when the trip the store names does
// not read: replacing it would leave that trip's folder to the next clean-up, so the store is
// left for the user to repair. kUnwritable when the new trip could not be saved.
WhereStoreOpen OpenWhereStore(WHEREIAM_DATA_NODE& store, std::optional<WHERE_ITEM_TYPE> type = std::nullopt);
}  // namespace navmisc::activity
