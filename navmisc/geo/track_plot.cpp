#include "navmisc/geo/track_plot.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include "navmisc/geo/optimize.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/format.h"
#include "navmisc/records/trip.h"
#include "navmisc/util/xml_text.h"

namespace navmisc {
namespace {

constexpr double kMetresPerDegree = 111320.0;
constexpr double kPi = 3.14159265358979323846;
// A track shorter than this many metres per pixel is not blown up further.
constexpr double kMostPixelsPerMetre = 20.0;
constexpr long kTitleHeight = 24;
constexpr long kKeyRowHeight = 18;
constexpr double kCharWidth = 6.5;  // of the 11-pixel key font, near enough for laying it out
constexpr const char* kStartColour = "#2ca02c";
constexpr const char* kEndColour = "#333333";

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

// A track's colour is RGB with red in the low byte.
std::string TrackColour(uint32_t rgb) {
  return FormatA("#%02x%02x%02x", rgb & 0xFF, (rgb >> 8) & 0xFF, (rgb >> 16) & 0xFF);
}

// A round length (1, 2 or 5 times a power of ten metres) of at most `metres`.
double RoundMetres(double metres) {
  const double target = std::max(metres, 1.0);
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

// "YYYY-MM-DD hh:mm" (UTC), or only "hh:mm" when `sameDayAs` falls on the same day.
std::string MinuteText(long time, long sameDayAs = -1) {
  std::string text = CString(TimeTToStdStringTime(time)).ToUtf8().substr(0, 16);
  if (text.size() == 16) text[10] = ' ';
  if (sameDayAs >= 0 && time / 86400 == sameDayAs / 86400 && text.size() == 16) return text.substr(11);
  return text;
}

struct Dot {
  double x, y;
  int level;
};

// One entry of the key: what is drawn at (x, y), the baseline of its text.
struct KeyEntry {
  std::string text;
  std::string mark;  // SVG of the entry's symbol, with "%X" and "%Y" for its place
  double width;
};

void Append(std::string& svg, double v) { AppendFixed(svg, v, 1); }

// A key entry's symbol placed at (x, y).
std::string Placed(std::string symbol, double x, double y) {
  for (const auto& [field, v] : {std::pair{"%X", x}, std::pair{"%Y", y}}) {
    std::string number;
    Append(number, v);
    symbol.replace(symbol.find(field), 2, number);
  }
  return symbol + '\n';
}

}  // namespace

std::string RenderTrackPlotSvg(BLOG_ITEM_INFO& trip, const TrackPlotOptions& options) {
  const long size = options.size;
  const double margin = static_cast<double>(options.margin);

  // The frame: every point but the revised ones.
  double minLat = std::numeric_limits<double>::max(), maxLat = -minLat, minLon = minLat, maxLon = -minLat;
  long first = -1, last = -1;
  for (TRACK_ITEM_INFO* track : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    if (!track) continue;
    for (const WAYPOINT_ITEM_INFO* p : Items<const WAYPOINT_ITEM_INFO>(track->points)) {
      if (!p || p->type == kLevelBadFix) continue;
      minLat = std::min(minLat, p->latitude);
      maxLat = std::max(maxLat, p->latitude);
      minLon = std::min(minLon, p->longitude);
      maxLon = std::max(maxLon, p->longitude);
      if (p->time != -1 && (first == -1 || p->time < first)) first = p->time;
      if (p->time != -1 && p->time > last) last = p->time;
    }
  }
  const bool empty = minLat > maxLat;

  // The key under the drawing: the scale bar first, then the symbols, in as many rows as the
  // width needs.
  const double barRoom = std::min(120.0, size / 4.0);
  std::vector<KeyEntry> key;
  const struct {
    int level;
    const char* text;
  } levels[] = {{kLevelBadFix, "bad fix (-2)"}, {kLevelStop, "stop (-1)"}, {0, "level 0"},
                {50, "50"},                     {100, "100"},            {kLevelNeverDropped, "never dropped"}};
  for (const auto& l : levels) {
    key.push_back({l.text, "<circle cx=\"%X\" cy=\"%Y\" r=\"4\" fill=\"" + ColourOf(l.level) + "\"/>", 0});
  }
  key.push_back({"start", std::string("<circle cx=\"%X\" cy=\"%Y\" r=\"5\" fill=\"") + kStartColour + "\"/>", 0});
  key.push_back({"end", std::string("<rect x=\"%X\" y=\"%Y\" width=\"9\" height=\"9\" transform=\"translate(-4.5 -4.5)\" fill=\"") +
                            kEndColour + "\"/>",
                 0});
  for (KeyEntry& e : key) e.width = 14 + kCharWidth * static_cast<double>(e.text.size()) + 12;
  int rows = 1;
  {
    double x = margin + barRoom + 60;
    for (const KeyEntry& e : key) {
      if (x + e.width > size - margin && x > margin) {
        ++rows;
        x = margin;
      }
      x += e.width;
    }
  }
  const double keyHeight = rows * kKeyRowHeight + 6;

  // The drawing area and the scale that fills it.
  const double left = margin, right = std::max(left + 10, size - margin);
  const double top = margin + kTitleHeight, bottom = std::max(top + 10, size - margin - keyHeight);
  const double midLat = empty ? 0.0 : (minLat + maxLat) / 2;
  const double kx = kMetresPerDegree * std::cos(midLat * kPi / 180), ky = kMetresPerDegree;
  const double widthM = empty ? 0 : (maxLon - minLon) * kx, heightM = empty ? 0 : (maxLat - minLat) * ky;
  double pixelsPerMetre = kMostPixelsPerMetre;
  if (widthM > 0) pixelsPerMetre = std::min(pixelsPerMetre, (right - left) / widthM);
  if (heightM > 0) pixelsPerMetre = std::min(pixelsPerMetre, (bottom - top) / heightM);
  const double x0 = left + ((right - left) - widthM * pixelsPerMetre) / 2;
  const double y0 = top + ((bottom - top) - heightM * pixelsPerMetre) / 2;
  const auto project = [&](const WAYPOINT_ITEM_INFO& p) {
    return std::pair<double, double>{x0 + (p.longitude - minLon) * kx * pixelsPerMetre,
                                     y0 + (maxLat - p.latitude) * ky * pixelsPerMetre};
  };
  const auto inside = [&](double x, double y) { return x >= left && x <= right && y >= top && y <= bottom; };

  std::string svg = FormatA(
      "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
      "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"%ld\" height=\"%ld\" viewBox=\"0 0 %ld %ld\">\n"
      "<rect width=\"100%%\" height=\"100%%\" fill=\"#ffffff\"/>\n",
      size, size, size, size);
  std::string title = XmlText(trip.name.IsEmpty() ? trip.tripId : trip.name, static_cast<size_t>(-1)).ToUtf8();
  if (first != -1) title += "  \xC2\xB7  " + MinuteText(first) + " \xE2\x80\x93 " + MinuteText(last, first) + " UTC";
  svg += "<text x=\"";
  Append(svg, margin);
  svg += "\" y=\"";
  Append(svg, margin + 14);
  svg += "\" font-family=\"sans-serif\" font-size=\"15\" font-weight=\"bold\">" + title + "</text>\n";
  svg += "<clipPath id=\"area\"><rect x=\"";
  Append(svg, left);
  svg += "\" y=\"";
  Append(svg, top);
  svg += "\" width=\"";
  Append(svg, right - left);
  svg += "\" height=\"";
  Append(svg, bottom - top);
  svg += "\"/></clipPath>\n<g clip-path=\"url(#area)\">\n";

  // Each track's line through its points but the revised ones, in the track's colour.
  std::vector<Dot> dots;
  const WAYPOINT_ITEM_INFO* start = nullptr;
  const WAYPOINT_ITEM_INFO* end = nullptr;
  for (TRACK_ITEM_INFO* track : Items<TRACK_ITEM_INFO>(trip.tracks)) {
    if (!track) continue;
    std::string line;
    for (const WAYPOINT_ITEM_INFO* p : Items<const WAYPOINT_ITEM_INFO>(track->points)) {
      if (!p) continue;
      const auto [x, y] = project(*p);
      if (p->type == kLevelBadFix) {
        if (inside(x, y)) dots.push_back({x, y, p->type});
        continue;
      }
      if (!start) start = p;
      end = p;
      dots.push_back({x, y, p->type});
      Append(line, x);
      line += ',';
      Append(line, y);
      line += ' ';
    }
    if (line.empty()) continue;
    svg += "<polyline fill=\"none\" stroke=\"" + TrackColour(track->color) +
           "\" stroke-width=\"2\" stroke-opacity=\"0.8\" points=\"" + line + "\"/>\n";
  }
  // The dots, coarse levels last so that the essential points stay visible on top.
  std::stable_sort(dots.begin(), dots.end(), [](const Dot& a, const Dot& b) { return a.level < b.level; });
  svg += "<g id=\"points\">\n";
  for (const Dot& d : dots) {
    svg += "<circle cx=\"";
    Append(svg, d.x);
    svg += "\" cy=\"";
    Append(svg, d.y);
    svg += "\" r=\"";
    Append(svg, RadiusOf(d.level, options.radius));
    svg += "\" fill=\"" + ColourOf(d.level) + "\"/>\n";
  }
  svg += "</g>\n";
  const auto mark = [&svg, &project](const WAYPOINT_ITEM_INFO* p, const std::string& symbol) {
    if (!p) return;
    const auto [x, y] = project(*p);
    svg += Placed(symbol, x, y);
  };
  mark(start, key[key.size() - 2].mark);
  mark(end, key.back().mark);
  svg += "</g>\n";

  // The key: a scale bar of a round length, then the symbols.
  svg += "<g id=\"key\" font-family=\"sans-serif\" font-size=\"11\">\n";
  const double barMetres = RoundMetres(barRoom / pixelsPerMetre);
  double y = size - margin - keyHeight + kKeyRowHeight;
  svg += "<line x1=\"";
  Append(svg, margin);
  svg += "\" y1=\"";
  Append(svg, y - 4);
  svg += "\" x2=\"";
  Append(svg, margin + barMetres * pixelsPerMetre);
  svg += "\" y2=\"";
  Append(svg, y - 4);
  svg += "\" stroke=\"#000000\" stroke-width=\"3\"/>\n<text x=\"";
  Append(svg, margin + barMetres * pixelsPerMetre + 6);
  svg += "\" y=\"";
  Append(svg, y);
  svg += "\">" + MetresText(barMetres) + "</text>\n";
  double x = margin + barRoom + 60;
  for (const KeyEntry& e : key) {
    if (x + e.width > size - margin && x > margin) {
      y += kKeyRowHeight;
      x = margin;
    }
    svg += Placed(e.mark, x + 4, y - 4) + "<text x=\"";
    Append(svg, x + 14);
    svg += "\" y=\"";
    Append(svg, y);
    svg += "\">" + e.text + "</text>\n";
    x += e.width;
  }
  svg += "</g>\n</svg>\n";
  return svg;
}

}  // namespace navmisc
