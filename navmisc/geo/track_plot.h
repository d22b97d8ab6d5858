// An SVG picture of a trip's tracks for checking the optimisation levels by eye: every point is
// drawn, coloured by its level, over a thin line through all points, with a scale bar and a key.
#pragma once

#include <string>

class BLOG_ITEM_INFO;

namespace navmisc {

struct TrackPlotOptions {
  long size = 800;     // pixels of the square drawing area (a smaller track is drawn at 1 m/px)
  long margin = 20;    // pixels around the track
  double radius = 1.5; // pixels of a point's dot
};

// The SVG document (UTF-8) of all tracks of `trip`, projected together through
// CGPSHelper::MappingToXY. Points with no level information (level 0 on never-optimised
// tracks) are drawn like level-0 points. A trip without points gives a drawing with only the key.
std::string RenderTrackPlotSvg(BLOG_ITEM_INFO& trip, const TrackPlotOptions& options = {});

}  // namespace navmisc
