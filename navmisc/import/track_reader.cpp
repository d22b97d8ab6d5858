#include "navmisc/import/track_reader.h"

#include <vector>

#include "navmisc/import/import_errors.h"

namespace navmisc::import {

bool TrackReader::ReadFrom(const Source& source) {
  std::vector<char> buffer(kReadPiece);
  for (;;) {
    const long n = source(buffer.data(), buffer.size());
    if (n < 0) return Fail(DC_ERR_IMPORT_READ, "the file could not be read");
    if (n == 0) break;
    if (!Feed(buffer.data(), static_cast<size_t>(n))) return false;
  }
  return Finish();
}

bool TrackReader::Fail(int32_t code, std::string message) {
  if (status_.ok()) status_ = {code, std::move(message)};
  return false;
}

const char* ImportErrorText(int32_t code) {
  switch (code) {
    case DC_ERR_IMPORT_OPEN: return "cannot open the file";
    case DC_ERR_IMPORT_NOT_A_FILE: return "not a regular file";
    case DC_ERR_IMPORT_EMPTY: return "the file is empty";
    case DC_ERR_IMPORT_FORMAT: return "unknown or unexpected file format";
    case DC_ERR_IMPORT_MALFORMED: return "the file is malformed";
    case DC_ERR_IMPORT_DTD: return "document type declarations and entities are refused";
    case DC_ERR_IMPORT_VALUE: return "a number or time is unreadable or out of range";
    case DC_ERR_IMPORT_TOO_LONG: return "a line or element is too long";
    case DC_ERR_IMPORT_CHECKSUM: return "no NMEA sentence with a good checksum";
    case DC_ERR_IMPORT_NO_POINTS: return "nothing to import";
    case DC_ERR_IMPORT_NO_DATE: return "NMEA times without a date";
    case DC_ERR_IMPORT_CONVERTER: return "gpsbabel could not convert the file";
    case DC_ERR_IMPORT_NO_CONVERTER: return "the format needs gpsbabel, which is not installed";
    case DC_ERR_IMPORT_CANCELLED: return "cancelled";
    case DC_ERR_IMPORT_WRITE: return "the trip could not be written";
    case DC_ERR_IMPORT_APP: return "this application does not take imports";
    case DC_ERR_IMPORT_READ: return "the file could not be read";
    case DC_ERR_IMPORT_TOO_MANY: return "more tracks or markers than a trip takes";
    default: return "";
  }
}

}  // namespace navmisc::import
