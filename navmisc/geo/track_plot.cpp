#include "navmisc/geo/track_plot.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

#include "navmisc/geo/gps_helper.h"
#include "navmisc/geo/optimize.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"

namespace navmisc {
namespace {

// Dropped points in warm colours, kept points from pale (fine detail, level 0) to dark blue
// (level 100), never-dropped points black.
std::string ColourOf(int level) {
  if (level == kLevelBadFix) return "#d62728";
  if (level == kLevelStop) return "#ff7f0e";
  if (level >= kLevelNeverDropped) return "#000000";
  if (level < 0) return "#7f7f7f";
  const int k = std::min(level, kSmoothSteps);
  const int r = 160 - k * 150 / kSmoothSteps;
  const int g = 200 - k * 150 / kSmoothSteps;
  return FormatA("#%02x%02x%02x", r, g, 230 - k * 80 / kSmoothSteps);
}

// Dropped points a little larger, so that a lone bad fix is seen; kept points grow with their
// level, so that the points that carry the shape stand out.
double RadiusOf(int level, double base) {
  if (level == kLevelBadFix || level == kLevelStop) return base * 1.6;
  if (level >= kLevelNeverDropped) return base * 2.0;
  if (level < 0) return base;
  return base * (0.8 + std::min(level, kSmoothSteps) / static_cast<double>(kSmoothSteps));
}

// A round length (1, 2 or 5 times a power of ten metres) near a quarter of the picture.
double ScaleBarMetres(double metresAcross) {
  const double target = std::max(metresAcross / 4.0, 1.0);
  const double power = std::pow(10.0, std::floor(std::log10(target)));
  for (double m : {5.0, 2.0, 1.0}) {
    if (m * power <= target) return m * power;
  }
  return power;
}

std::string MetresText(double metres) {
  if (metres >= 1000.0) return FormatA("%g km", metres / 1000.0);
  return FormatA("%g m", metres);
}

}  // namespace

std::string RenderTrackPlotSvg(BLOG_ITEM_INFO& trip, const TrackPlotOptions& options) {
  std::vector<sWayPoint> all;
  std::vector<int> levels, trackEnds;
  for (TRACK_ITEM_INFO* track : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    if (!track) continue;
    for (const WAYPOINT_ITEM_INFO* p : Items<const WAYPOINT_ITEM_INFO>(track->points)) {
      if (!p) continue;
      sWayPoint w;
      w.latitude = p->latitude;
      w.longitude = p->longitude;
      w.time = p->time;
      w.valid = 1;
      all.push_back(w);
      levels.push_back(p->type);
    }
    trackEnds.push_back(static_cast<int>(all.size()));
  }
  long size = options.size;
  double scale = 1.0;
  std::vector<CPoint> screen(all.size());
  int count = static_cast<int>(all.size());
  CGPSHelper helper;
  helper.MappingToXY(all.data(), count, screen.data(), size, options.margin, nullptr, &scale);
  // The square is cut to what the tracks use: a track coarsened to fit keeps `size` for its
  // extent alone, with the margins on top, and a wide track leaves the bottom of it empty.
  long used = 0, height = all.empty() ? options.size : 0;
  for (const CPoint& p : screen) {
    used = std::max(used, p.x + options.margin + 1);
    height = std::max(height, p.y + options.margin + 1);
  }
  const long keyHeight = 60;
  const long width = std::max(used, 640L);  // room for the key under a small track
  std::string svg;
  svg += FormatA(
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"%ld\" height=\"%ld\" "
      "viewBox=\"0 0 %ld %ld\">\n<rect width=\"100%%\" height=\"100%%\" fill=\"#ffffff\"/>\n",
      width, height + keyHeight, width, height + keyHeight);
  int begin = 0;
  for (int end : trackEnds) {
    if (end - begin >= 2) {
      svg += "<polyline fill=\"none\" stroke=\"#c8c8c8\" stroke-width=\"0.6\" points=\"";
      for (int i = begin; i < end; ++i) svg += FormatA("%ld,%ld ", screen[i].x, screen[i].y);
      svg += "\"/>\n";
    }
    begin = end;
  }
  // Coarse levels last, so the essential points stay visible on top.
  std::vector<int> order(all.size());
  for (size_t i = 0; i < order.size(); ++i) order[i] = static_cast<int>(i);
  std::stable_sort(order.begin(), order.end(), [&](int a, int b) { return levels[a] < levels[b]; });
  for (int i : order) {
    svg += FormatA("<circle cx=\"%ld\" cy=\"%ld\" r=\"", screen[i].x, screen[i].y);
    AppendFixed(svg, RadiusOf(levels[i], options.radius), 1);
    svg += "\" fill=\"" + ColourOf(levels[i]) + "\"/>\n";
  }

  // Scale bar: `scale` metres per pixel.
  const double barMetres = ScaleBarMetres(static_cast<double>(std::max(used, height)) * scale);
  const long barPixels = std::max(1L, std::lround(barMetres / scale));
  const long y = height + 20;
  svg += FormatA(
      "<g font-family=\"sans-serif\" font-size=\"11\">\n"
      "<line x1=\"10\" y1=\"%ld\" x2=\"%ld\" y2=\"%ld\" stroke=\"#000000\" stroke-width=\"3\"/>\n"
      "<text x=\"10\" y=\"%ld\">%s</text>\n",
      y, 10 + barPixels, y, y + 15, MetresText(barMetres).c_str());
  struct KeyEntry {
    int level;
    const char* text;
  };
  const KeyEntry key[] = {{kLevelBadFix, "bad fix (-2)"}, {kLevelStop, "stop (-1)"},
                          {0, "level 0"},                 {50, "50"},
                          {100, "100"},                   {kLevelNeverDropped, "never dropped"}};
  long x = std::max(100L, 30 + barPixels);
  for (const KeyEntry& e : key) {
    svg += FormatA("<circle cx=\"%ld\" cy=\"%ld\" r=\"4\" fill=\"%s\"/><text x=\"%ld\" y=\"%ld\">%s</text>\n",
                   x, y - 4, ColourOf(e.level).c_str(), x + 7, y, e.text);
    x += 20 + 7 * static_cast<long>(std::strlen(e.text));
  }
  svg += "</g>\n</svg>\n";
  return svg;
}

}  // namespace navmisc
