// CSV export of track points, one point a line, for spreadsheets.
#pragma once

#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

class BLOG_ITEM_INFO;

// Writes the points of `tracks` (TRACK_ITEM_INFO*) as comma-separated lines ended by a lone CR,
// under the header "Date, Time, Latitude, Longitude, Altitude, Speed, Course, Type, Distance,
// Essential". Dates and times are the points' times plus the trip's time shift; `photos`
// (PHOTO_ITEM_INFO*) mark the points that share a photo's time; the trip's point filter decides
// the last column. `trip` may be null (no shift, every point essential).
//
// With 65534 points or more the lines go to numbered files "<folder>/<title>_1.csv",
// "<title>_2.csv", ... of 65534 lines each (points without a time count too); later files start
// with a header ending in "Exception" instead of "Essential".
//
// Units: imperial (feet, miles per hour) unless `metric`, which gives metres and the stored
// metres per hour. The distance column is metres from the previous point along the parallel of
// that point (metric), or those metres times 0.621371.
//
// Returns 1 when written, 0 when a file cannot be opened.
int ExportCsv(CString path, CPtrList& tracks, CPtrList& photos, BLOG_ITEM_INFO* trip, bool metric);
