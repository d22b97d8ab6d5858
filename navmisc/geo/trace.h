// Diagnostic trace of the geometry code. The cleaning and mapping passes describe each decision
// in a line of text; by default those lines go nowhere. A debugging session (or a test) can
// install a sink to see them. Formatting only happens while a sink is installed, so the passes
// pay nothing for their trace in normal use.
#pragma once

namespace navmisc {

// Receives one formatted trace line (UTF-8, with the line breaks the pass put into it).
using GeoTraceSink = void (*)(const char* line, void* context);

// Installs `sink` (null restores the discarding default) for the calling thread; returns the
// previous one. `context` is handed back to the sink unchanged.
GeoTraceSink SetGeoTraceSink(GeoTraceSink sink, void* context = nullptr);

// True when a sink is installed on the calling thread.
bool GeoTraceEnabled();

// Formats a line (printf rules, "C" locale) and passes it to the calling thread's sink.
void GeoTrace(const char* fmt, ...) __attribute__((format(printf, 1, 2)));

}  // namespace navmisc
