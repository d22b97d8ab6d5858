// Front functions for the data-control process's file commands. Each sends one file block; the
// answer arrives later as a file reply (message 1127), after progress blocks.
#pragma once

#include <cstdint>

#include "navmisc/platform/datetime.h"

// Asks for the import of the track file `path` (GPX, TCX, NMEA 0183, or any format gpsbabel
// reads) as a new trip of application `appType` (1 trip, 22 sport, 55 tracker; 0: the current
// product, g_nProductId). `format` names the file's format ("gpx", "tcx", "nmea" or a gpsbabel
// format; empty: recognised from the file). Only points between `start` and `end` are kept (a
// date-time of zero leaves that end open). `timeZone` is the zone, in seconds east of UTC, in
// which the file's times are written; it is taken off every time. `tripName` (may be null)
// names the trip; else the file's own name or its title does.
//
// The reply (docs/track-import.md) has nLastError 0 or one of DC_ERR_IMPORT_*
// (navmisc/import/import_errors.h); on success its track record names the new trip
// (szTrackId), its name (szSubject), first and last point (ptStart, ptEnd) and a summary
// (szMetaInfo), on failure szMetaInfo says why. Progress blocks (source 1) come every thousand
// points.
void DC_FILE_ImportFile(const wchar_t* path, int32_t appType = 0, const wchar_t* format = L"",
                        COleDateTime start = {}, COleDateTime end = {}, int32_t timeZone = 0,
                        const wchar_t* tripName = nullptr);
