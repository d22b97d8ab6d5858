// The geometry commands' pieces that the demo uses as well.
#pragma once

#include <cstdio>
#include <string>

class BLOG_ITEM_INFO;

namespace navmisc::cli {

// Gives every point of the trip (points loaded) its optimisation level, or with `optimise`
// false only chooses the display level again, with a progress bar; then saves the settings and
// point files. Returns false when Ctrl-C stopped the levelling (what was levelled is saved).
// Fails with a message when the trip cannot be saved.
bool OptimizeTrip(BLOG_ITEM_INFO& trip, bool optimise);

// One line per track: points, bad fixes, stop fixes and how many points each level keeps.
void PrintLevelSummary(std::FILE* out, BLOG_ITEM_INFO& trip);

// Writes the trip's plot (see RenderTrackPlotSvg) to `path`, replacing it whole. Fails with a
// message when it cannot.
void WritePlot(BLOG_ITEM_INFO& trip, const std::string& path, long size);

}  // namespace navmisc::cli
