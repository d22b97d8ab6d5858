// Read-only views of what the library keeps besides trips: user profiles, the page template
// catalogue and the system's time zone.
#include <cstdio>
#include <optional>

#include <CLI/CLI.hpp>

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

void ShowProfile(GPS_APP_PROG_TYPE type, const std::string& on) {
  // A bad date fails before anything is shown.
  const std::optional<Date> date = on.empty() ? std::nullopt : std::optional<Date>(ParseDate(on));
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
  if (date) {
    double weight = 0, height = 0;
    if (!p.GetWeightHeight(date->month, date->day, date->year, weight, height)) {
      Fail("the profile has no weight history");
    }
    std::printf("On %s:   %g kg, %g cm\n", DateText(*date).c_str(), weight, height);
  }
}

void ListTemplates(const std::string& language) {
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
}

void ShowTimeZone() {
  const long shift = GetOSTimeZomeShift();
  std::printf("Offset from UTC: %ld s (%+.2f h)\n", shift, shift / 3600.0);
  std::printf("Daylight saving: %s\n", System_DayLight() ? "yes" : "no");
}

}  // namespace

void AddProfileCommand(CLI::App& app) {
  auto application = std::make_shared<std::string>("trip");
  auto on = std::make_shared<std::string>();
  CLI::App* cmd = AddCommand(app, "profile", "show an application's user profile",
                             "Shows an application's user profile (default: trip) as the library reads it,\n"
                             "defaults filled in. With --on, also the weight and height in force on that date.",
                             [application, on] { ShowProfile(ParseApp(*application), *on); });
  cmd->add_option("--app", *application, "trip, sport, tracker or where (default trip)")
      ->check(CLI::IsMember({"trip", "sport", "tracker", "where"}));
  cmd->add_option("--on", *on, "a date (YYYY-MM-DD)")->option_text("DATE");
}

void AddTemplatesCommand(CLI::App& app) {
  auto language = std::make_shared<std::string>();
  CLI::App* cmd = AddCommand(app, "templates", "list the web-page templates of the program's catalogue",
                             "Lists the page templates of the catalogue Templates/TEMP.INI in the program's\n"
                             "folder, with names and descriptions in the language CODE (for example \"fr\"),\n"
                             "falling back to the default texts.",
                             [language] { ListTemplates(*language); });
  cmd->add_option("--language", *language, "the language of the names")->option_text("CODE");
}

void AddTimeZoneCommand(CLI::App& app) {
  AddCommand(app, "timezone", "the local offset from UTC and whether the zone observes daylight saving",
             "Shows the offset of local time from UTC now (seconds) and whether the time zone\n"
             "observes daylight saving, as the library sees them (TZ is honoured).",
             ShowTimeZone);
}

}  // namespace navmisc::cli
