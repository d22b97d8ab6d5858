// The TCX reader on arbitrary bytes, whole, in pieces and in two parts at once (see reader_fuzz.h).
#include "reader_fuzz.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return navmisc::import::fuzzing::Fuzz([](navmisc::import::ImportSink& sink) { return navmisc::import::MakeTcxReader(sink); },
                                        data, size, navmisc::import::detail::NewTcxReader);
}
