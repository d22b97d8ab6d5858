// Pieces of the KML writer that the tests check on their own.
#pragma once

#include <ctime>
#include <string>
#include <string_view>

namespace navmisc::exportdetail {

// Escapes item texts: "&", "<", ">", the double quote, and a pair of apostrophes (one entity).
std::wstring KmlEscape(std::wstring_view text);

// The document's Folder name: the local date and time of `now` in the user's date and time
// conventions (LC_TIME of the environment), as UTF-8.
std::string KmlDocumentName(std::time_t now);

// The width and height (pixels) at which a photo of `width` x `height` pixels is shown in its
// balloon: the long side 320, the other in proportion; 320 x 240 when the size is unknown.
struct KmlPictureSize {
  int width;
  int height;
};
KmlPictureSize KmlDisplaySize(int width, int height);

}  // namespace navmisc::exportdetail
