// An SVG picture of a trip's tracks for checking the optimisation levels by eye: each track's
// line in the track's own colour, every point a dot coloured by its level, the start and the end
// marked, the trip's name and times as the title, a scale bar and a key underneath.
#pragma once

#include <string>

class BLOG_ITEM_INFO;

namespace navmisc {

struct TrackPlotOptions {
  long size = 800;      // pixels: the picture's width and height
  long margin = 20;     // pixels around the drawing
  double radius = 1.5;  // pixels of a point's dot
};

// The SVG document (UTF-8) of all tracks of `trip`, north up, scaled to fill the drawing area
// (the same scale both ways). The frame holds every point except the revised ones (level -2), so
// that one wild fix cannot shrink the drawing; a revised point outside the frame is not drawn,
// and the lines leave revised points out. Points with no level information (level 0 on
// never-optimised tracks) are drawn like level-0 points. A trip without points gives a picture
// with only the title and the key.
std::string RenderTrackPlotSvg(BLOG_ITEM_INFO& trip, const TrackPlotOptions& options = {});

}  // namespace navmisc
