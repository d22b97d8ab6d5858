// Read-only views of what the library keeps besides trips: user profiles, the page template
// catalogue and the system's time zone.
#include <cstdio>

#include "cli.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/templates.h"
#include "navmisc/records/user_profile.h"
#include "navmisc/util/timezone.h"

namespace navmisc::cli {
namespace {

GPS_APP_PROG_TYPE ParseApp(const std::string& app) {
  if (app == "trip") return GPS_APP_TRIP;
  if (app == "sport") return GPS_APP_SPORT;
  if (app == "tracker") return GPS_APP_TRACKER;
  if (app == "where") return GPS_APP_WHEREAMI;
  Usage("--app must be trip, sport, tracker or where");
}

const char* YesNo(bool b) { return b ? "yes" : "no"; }

// "MM/DD/YYYY", the order the weight history keeps its dates in.
void ParseDate(const std::string& text, int& month, int& day, int& year) {
  if (std::sscanf(text.c_str(), "%d/%d/%d", &month, &day, &year) != 3 || month < 1 || month > 12 ||
      day < 1 || day > 31) {
    Usage("'" + text + "' is not a date (MM/DD/YYYY)");
  }
}

}  // namespace

int CmdProfile(Args& args) {
  if (args.Flag("help")) {
    std::puts("Usage: navmisc profile [--app trip|sport|tracker|where] [--on MM/DD/YYYY]\n\n"
              "Shows an application's user profile (default: trip) as the library reads it,\n"
              "defaults filled in. With --on, also the weight and height in force on that date.");
    return 0;
  }
  const GPS_APP_PROG_TYPE type = ParseApp(args.Option("app").value_or("trip"));
  const auto on = args.Option("on");
  if (!args.Positionals().empty()) Usage("profile takes no arguments");
  USER_MAP_INFO& p = *GetUserMapInfo(type);  // read when the data root was set
  std::printf("File:            %s\n", p.GetProfilePathName().ToUtf8().c_str());
  std::printf("Name:            %s (%s)\n", p.name.ToUtf8().c_str(), p.male ? "male" : "female");
  std::printf("Born:            %04d-%02d-%02d\n", p.year, p.month, p.day);
  std::printf("Height, weight:  %g cm, %g kg\n", p.height, p.weight);
  std::printf("Account:         %s (password kept: %s)\n", p.userAccount.ToUtf8().c_str(),
              YesNo(p.keepPassword));
  std::printf("Units, language: %s, %s\n", p.metric ? "metric" : "imperial", p.localize.ToUtf8().c_str());
  std::printf("Written by:      %d.%d.%d.%d\n", p.version[0], p.version[1], p.version[2], p.version[3]);
  std::printf("Time shift:      %s (%d s, daylight %s)\n", p.timeZoneShiftOn ? "applied" : "off",
              p.timeZoneShift, YesNo(p.dayLight));
  std::printf("Version check:   %s, every %d s, last %s\n", p.verEnableCheck ? "on" : "off",
              p.verCheckPeriodTime, TimeText(p.verLastCheckTime ? p.verLastCheckTime : -1).c_str());
  std::printf("Templates:       mode %d, style %d\n", p.tempMode, p.tempStyle);
  std::printf("Lists:           %d markers, %d runners, %d weight entries\n", p.markers.GetCount(),
              p.runners.GetCount(), p.weightHeights.GetCount());
  if (on) {
    int month = 0, day = 0, year = 0;
    ParseDate(*on, month, day, year);
    double weight = 0, height = 0;
    if (!p.GetWeightHeight(month, day, year, weight, height)) Fail("the profile has no weight history");
    std::printf("On %s:   %g kg, %g cm\n", on->c_str(), weight, height);
  }
  return 0;
}

int CmdTemplates(Args& args) {
  if (args.Flag("help")) {
    std::puts("Usage: navmisc templates [--language CODE]\n\n"
              "Lists the page templates of the catalogue Templates/TEMP.INI in the program's\n"
              "folder, with names and descriptions in the language CODE (for example \"fr\"),\n"
              "falling back to the default texts.");
    return 0;
  }
  const std::string language = args.Option("language").value_or("");
  if (!args.Positionals().empty()) Usage("templates takes no arguments");
  FreeTemplateInfo();
  // The catalogue ships beside the program in the build tree and in the shared data folder of
  // an installed program (like the resource texts).
  const CString program = g_szExecProgPath;
  if (ReadTemplateInfo(CString::FromUtf8(language)) == 0) {
    SetSharedText(g_szExecProgPath, PathJoin(program, L"../share/navmisc"));
    ReadTemplateInfo(CString::FromUtf8(language));
    SetSharedText(g_szExecProgPath, program);
  }
  if (g_plTemplateItemList.IsEmpty()) Fail("no templates in " + program.ToUtf8() + "/Templates/TEMP.INI");
  for (auto* t : Items<TEMPLATE_ITEM_INFO>(g_plTemplateItemList)) {
    std::printf("%-24s mode %d style %3d%s  %s\n", t->name.ToUtf8().c_str(), t->mode, t->style,
                t->wideStyle ? " (wide)" : "", t->description.ToUtf8().c_str());
    std::printf("%-24s thumbnail %s\n", "", t->thumbnailPath.ToUtf8().c_str());
  }
  FreeTemplateInfo();
  return 0;
}

int CmdTimeZone(Args& args) {
  if (args.Flag("help")) {
    std::puts("Usage: navmisc timezone\n\n"
              "Shows the offset of local time from UTC now (seconds) and whether the time zone\n"
              "observes daylight saving, as the library sees them (TZ is honoured).");
    return 0;
  }
  if (!args.Positionals().empty()) Usage("timezone takes no arguments");
  const long shift = GetOSTimeZomeShift();
  std::printf("Offset from UTC: %ld s (%+.2f h)\n", shift, shift / 3600.0);
  std::printf("Daylight saving: %s\n", System_DayLight() ? "yes" : "no");
  return 0;
}

}  // namespace navmisc::cli
