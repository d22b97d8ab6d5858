// Outcomes of reading a track file, as the data-control process reports them in nLastError of
// its file replies (docs/track-import.md, "Error codes"). 0 is success. The device side uses the
// same codes for the logger's files.
#pragma once

#include <cstdint>

enum : int32_t {
  DC_ERR_IMPORT_OPEN = 9301,          // the file cannot be opened (missing, no permission)
  DC_ERR_IMPORT_NOT_A_FILE = 9302,    // a folder, FIFO, device or socket, not a regular file
  DC_ERR_IMPORT_EMPTY = 9303,         // the file holds no bytes
  DC_ERR_IMPORT_FORMAT = 9304,        // the format is unknown or not the one named
  DC_ERR_IMPORT_MALFORMED = 9305,     // broken XML, a required attribute missing, no NMEA at all
  DC_ERR_IMPORT_DTD = 9306,           // a document type or entity declaration (refused)
  DC_ERR_IMPORT_VALUE = 9307,         // a number or time that does not read or is out of range
  DC_ERR_IMPORT_TOO_LONG = 9308,      // a single line, name or tag beyond the reader's limit
  DC_ERR_IMPORT_CHECKSUM = 9309,      // NMEA whose every sentence fails its checksum
  DC_ERR_IMPORT_NO_POINTS = 9310,     // nothing to import (no fix, or nothing in the time range)
  DC_ERR_IMPORT_NO_DATE = 9311,       // NMEA times without any date
  DC_ERR_IMPORT_CONVERTER = 9312,     // gpsbabel failed on the file
  DC_ERR_IMPORT_NO_CONVERTER = 9313,  // the format needs gpsbabel, which is not installed
  DC_ERR_IMPORT_CANCELLED = 9314,     // stopped on request
  DC_ERR_IMPORT_WRITE = 9315,         // the trip could not be written into the data root
  DC_ERR_IMPORT_APP = 9316,           // not an application type that takes imports
  DC_ERR_IMPORT_READ = 9317,          // the file failed while being read (an I/O error)
  DC_ERR_IMPORT_TOO_MANY = 9318,      // more tracks or markers than one trip takes
};

namespace navmisc::import {

// A short English text for each code above ("not a regular file"); "" for other codes.
const char* ImportErrorText(int32_t code);

}  // namespace navmisc::import
