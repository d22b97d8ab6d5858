// Pieces of the KML writer that the tests check on their own.
#pragma once

#include <string>
#include <string_view>

class PHOTO_ITEM_INFO;

namespace navmisc::exportdetail {

// Escapes item texts: "&", "<", ">", the double quote, and a pair of apostrophes (one entity).
std::wstring KmlEscape(std::wstring_view text);

// The date-time text of a photo's placemark ("YYYY-MM-DDThh:mm:ss", UTC, no "Z"): its time on
// the track, else (when that is -1) the camera's time less the trip's time shift, else (both -1)
// empty.
std::string KmlPhotoTimeText(const PHOTO_ITEM_INFO& photo);

// The width and height (pixels) at which a photo of `width` x `height` pixels is shown in its
// balloon: the long side 320, the other in proportion; 320 x 240 when the size is unknown.
struct KmlPictureSize {
  int width;
  int height;
};
KmlPictureSize KmlDisplaySize(int width, int height);

}  // namespace navmisc::exportdetail
