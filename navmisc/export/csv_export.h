// CSV export of track points, one point a line, for spreadsheets.
#pragma once

#include "navmisc/export/export_control.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

class BLOG_ITEM_INFO;

// Writes the points of `tracks` (TRACK_ITEM_INFO*) that have a time as comma-separated lines
// ended by a lone CR, under the header "Date, Time, Latitude, Longitude, Altitude, Speed,
// Course, Type, Distance, Essential". `path` is cleared first.
//
// Columns: date and time of the point's time plus the trip's time shift; latitude, longitude;
// altitude; speed; course (the stored one, or the whole-degree bearing from the previous point
// when unknown, 0 for a track's first point); type (0, -2 for the first point of a track's
// list, -4 for the last, one less when a photo of `photos` (PHOTO_ITEM_INFO*) has exactly the
// point's time); distance from the previous point measured along the parallel of that point;
// "1" unless the trip's point filter treats the point as an exception. `trip` may be null (no
// shift, every point essential).
//
// Units: imperial (feet, miles per hour, distance in metres times 0.621371) unless `metric`,
// which gives metres, the stored metres per hour and metres.
//
// With 65534 points or more in all (points without a time count too) the lines go to numbered
// files "<folder>/<title>_1.csv", "<title>_2.csv", ... of 65534 lines each, each started anew;
// later files begin with a header ending in "Exception" instead of "Essential". A total of
// exactly 65534 therefore gives a second file holding only that header.
//
// Returns 1 when written, 0 when a file cannot be opened. Write errors after opening do not
// change the result.
int ExportCsv(CString path, CPtrList& tracks, CPtrList& photos, BLOG_ITEM_INFO* trip, bool metric);

// The name of numbered file `number` (from 1) of a split export to `path`:
// "<folder>/<title>_<number>.csv".
CString CsvSplitFileName(const wchar_t* path, int number);

// The same under `control`: progress (one step per track point), stopping (the files written
// so far are deleted), points read from the point files, and the reason when a file could not be
// opened or a write failed (a write error leaves the result at 1).
int ExportCsv(CString path, CPtrList& tracks, CPtrList& photos, BLOG_ITEM_INFO* trip, bool metric,
              ExportControl& control);
