#include "navmisc/geo/trace.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "navmisc/platform/format.h"

namespace navmisc {
namespace {

#ifndef NDEBUG
// In a debug build, NAVMISC_GEO_TRACE=1 sends the trace to standard error unless a sink is set.
void StderrSink(const char* line, void*) { std::fputs(line, stderr); }

GeoTraceSink DefaultSink() {
  const char* env = std::getenv("NAVMISC_GEO_TRACE");
  return env && env[0] == '1' ? &StderrSink : nullptr;
}
#else
GeoTraceSink DefaultSink() { return nullptr; }
#endif

struct SinkState {
  GeoTraceSink sink = DefaultSink();
  void* context = nullptr;
};

SinkState& State() {
  thread_local SinkState state;
  return state;
}

}  // namespace

GeoTraceSink SetGeoTraceSink(GeoTraceSink sink, void* context) {
  SinkState& s = State();
  GeoTraceSink previous = s.sink;
  s.sink = sink;
  s.context = context;
  return previous;
}

bool GeoTraceEnabled() { return State().sink != nullptr; }

void GeoTrace(const char* fmt, ...) {
  SinkState& s = State();
  if (!s.sink) return;
  va_list args;
  va_start(args, fmt);
  std::string line = VFormatA(fmt, args);
  va_end(args);
  s.sink(line.c_str(), s.context);
}

}  // namespace navmisc
