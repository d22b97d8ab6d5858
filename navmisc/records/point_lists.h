// The record lists of a track's point files, apart from the files themselves: one step reads the
// lines of a point file into its list and one encodes the list back into lines, so that files and
// memory (tests, fuzzing) go through the same code. Line formats in point_file_format.h.
#pragma once

#include <functional>
#include <string_view>

class TRACK_ITEM_INFO;

namespace navmisc {
class LineReader;
}

namespace navmisc::point_file {

// The six files of a track, by the list each one holds.
enum class Kind { kPoints, kCellFixes, kHelpPoints, kHeartRate, kCadence, kWheelSpeed };
inline constexpr Kind kAllKinds[] = {Kind::kPoints,    Kind::kCellFixes, Kind::kHelpPoints,
                                     Kind::kHeartRate, Kind::kCadence,   Kind::kWheelSpeed};

// Empties the list of `track` that a file of `kind` holds, then appends one record per line of
// `lines`. Points get `shift` seconds added to their times.
void ReadList(Kind kind, LineReader& lines, TRACK_ITEM_INFO& track, long shift);
// Encodes that list, one line per record, handing the text to `flush` in pieces of about 64 KiB.
// Stops before a record once *keepGoing is false; advances *counter by one per record.
void EncodeList(Kind kind, const TRACK_ITEM_INFO& track, const std::function<void(std::string_view)>& flush,
                int* counter, bool* keepGoing);
// Whether that list of `track` is empty.
bool ListIsEmpty(Kind kind, const TRACK_ITEM_INFO& track);

}  // namespace navmisc::point_file
