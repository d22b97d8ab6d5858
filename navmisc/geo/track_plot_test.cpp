#include "navmisc/geo/track_plot.h"

#include <gtest/gtest.h>

#include <string>

#include "geo_reference.h"
#include "navmisc/geo/optimize.h"
#include "navmisc/records/trip.h"
#include "testutil.h"

namespace {

// The part of `svg` between `from` and the next `to`.
std::string Between(const std::string& svg, const std::string& from, const std::string& to) {
  const size_t a = svg.find(from);
  if (a == std::string::npos) return {};
  return svg.substr(a, svg.find(to, a) - a);
}

size_t Count(const std::string& text, const std::string& what) {
  size_t n = 0;
  for (size_t at = 0; (at = text.find(what, at)) != std::string::npos; at += what.size()) ++n;
  return n;
}

TEST(TrackPlot, FillsThePictureWithTheFramedPointsInTheTracksColours) {
  navmisc::testutil::TempDir root;
  navmisc::testutil::DataRootScope scope(root.path());
  BLOG_ITEM_INFO trip(GPS_APP_TRIP, L"PLOT", 0);
  trip.name = L"Fish & <chips>";
  auto* track = new TRACK_ITEM_INFO(&trip);
  track->color = 0x0000FF;  // red, in the low byte
  navmisc::testing::AppendNoisyTrack(track->points, 7, 300);
  trip.tracks.AddTail(track);

  for (long size : {300L, 800L, 1500L}) {
    navmisc::TrackPlotOptions options;
    options.size = size;
    const std::string svg = navmisc::RenderTrackPlotSvg(trip, options);
    const std::string dims = "width=\"" + std::to_string(size) + "\" height=\"" + std::to_string(size) + "\"";
    EXPECT_NE(svg.find("<svg xmlns=\"http://www.w3.org/2000/svg\" " + dims), std::string::npos) << size;
    EXPECT_NE(svg.find(">Fish &amp; &lt;chips&gt;  \xC2\xB7  2023-11-14 22:13 \xE2\x80\x93 "), std::string::npos) << svg;
    EXPECT_NE(svg.find("stroke=\"#ff0000\""), std::string::npos);
    EXPECT_EQ(Count(Between(svg, "<g id=\"points\">", "</g>"), "<circle"), 300u);
    EXPECT_EQ(Count(svg, "fill=\"#2ca02c\""), 2u) << "the start and its key entry";
  }

  // A wild fix 50 km off, revised: neither the frame, the line nor the dots change for it. Not
  // revised, it squeezes the track into a corner.
  const std::string before = navmisc::RenderTrackPlotSvg(trip);
  auto* wild = new WAYPOINT_ITEM_INFO(static_cast<WAYPOINT_ITEM_INFO*>(track->points.GetTail()));
  wild->latitude += 0.5;
  wild->type = navmisc::kLevelBadFix;
  track->points.AddTail(wild);
  EXPECT_EQ(navmisc::RenderTrackPlotSvg(trip), before);
  wild->type = 0;
  EXPECT_NE(Between(navmisc::RenderTrackPlotSvg(trip), "<polyline", "/>"), Between(before, "<polyline", "/>"));
}

}  // namespace
