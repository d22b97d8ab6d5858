// The work behind `navmisc photos` and `navmisc geotag`, shared with the demo.
#pragma once

#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include "navmisc/geotag/overwrite_dlg.h"
#include "navmisc/platform/cstring.h"

class BLOG_ITEM_INFO;
class PHOTO_ITEM_INFO;

namespace navmisc::cli {

// How a photo's camera clock becomes track time (see docs/photo-tagging.md): playback time =
// camera time - the trip's time-zone shift + offset.
struct CameraClock {
  long offset = 0;         // seconds added to every photo's time
  std::string offsetFrom;  // "PHOTO=TIME": the offset that puts PHOTO at TIME (UTC)
};

// Where an added photo ended up.
struct AddedPhoto {
  std::string file;                  // as given
  PHOTO_ITEM_INFO* photo = nullptr;  // in the trip (which owns it); null when not added
  std::string problem;               // why it was not added
  long trackTime = -1;               // its time on the track clock (UTC), -1 without a capture time
  enum class Place { kNone, kByTime, kByPosition, kOwnPosition } place = Place::kNone;
};

// Copies the photos into the trip's folder, reads their capture times, positions and comments
// through the tagging tool, places them on the trip's tracks (points loaded) within `tolerance`
// metres, and saves the trip. A file that is not a photo is reported and left out. Fails (see
// Fail) when the clock correction names an unknown photo or the trip cannot be saved.
std::vector<AddedPhoto> AddPhotos(BLOG_ITEM_INFO& trip, const std::vector<std::string>& files,
                                  const CameraClock& clock, double tolerance);
// One line per photo of the list: name, capture and track times, where it landed.
void PrintAddedPhotos(std::FILE* out, const std::vector<AddedPhoto>& added);
// One line per photo of the trip.
void PrintPhotoList(std::FILE* out, BLOG_ITEM_INFO& trip);

struct GeotagOutcome {
  int placed = 0;                   // photos with a position, offered to the tool
  int tagged = 0;                   // trip copies that now hold their position
  int originals = 0;                // originals that now hold it
  int unplaced = 0;                 // photos without a position, left alone
  std::vector<std::string> failed;  // trip copies the tool could not tag
};

// Writes the positions of the trip's placed photos into their copies in the trip and, with
// `originals`, into the files they came from: asking through `view` before each original unless
// `answer` (IDYESTOALL or IDCANCEL) answers for all. Fails when the tagging tool cannot be
// started; a stop by Ctrl-C leaves every photo whole and tags none of the copies.
GeotagOutcome GeotagTrip(BLOG_ITEM_INFO& trip, bool originals, std::optional<int> answer,
                         COverwriteView* view);

// The demo's photo step (demo_photos.cpp): three small JPEGs taken along the trip `tripId`,
// added to it and tagged.
void DemoPhotos(const std::string& tripId);

// The overwrite question in a terminal: the question on stderr, the answer a line on stdin. The
// end of the input answers "no to all".
class TerminalOverwriteView : public COverwriteView {
 public:
  int AskOverwrite(const wchar_t* photoName, bool& noAsk) override;
  bool Confirm(const wchar_t* message) override;
};

}  // namespace navmisc::cli
