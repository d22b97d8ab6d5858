// The NMEA reader on arbitrary bytes, whole and in pieces (see reader_fuzz.h); every other input
// reads with a default day, so that undated logs are read through as well.
#include "reader_fuzz.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  navmisc::import::NmeaOptions options;
  if (size > 0 && data[0] & 1) options.defaultDate = 1700006400;
  return navmisc::import::fuzzing::Fuzz(
      [&](navmisc::import::ImportSink& sink) { return navmisc::import::MakeNmeaReader(sink, options); }, data, size);
}
