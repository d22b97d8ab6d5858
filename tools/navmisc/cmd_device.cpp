// `navmisc device ...`: the logger, through the data-control process (docs/logger-folder.md).
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <cstdio>
#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "cli.h"
#include "device_channel.h"
#include "listing.h"
#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/device_commands.h"
#include "navmisc/datactrl/device_fields.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/navi_points.h"
#include "navmisc/datactrl/reply_dialog.h"
#include "navmisc/datactrl/wiz_config_sheet.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/read_track_file.h"
#include "navmisc/platform/files.h"
#include "navmisc/records/trip.h"
#include "navmisc/util/device_identity.h"
#include "terminal_view.h"

namespace navmisc::cli {
namespace {

using datactrl::IsKV11Model;

constexpr const char* kNoLogger =
    "no logger is connected (give --logger DIR, set [DEVICE] Path in GpsDataControl.ini of the "
    "data root, or mount one)";

// Asks on the terminal; without one the answer is no.
bool Confirm(const std::string& question) {
  if (!::isatty(0)) return false;
  std::fprintf(stderr, "%s [y/N] ", question.c_str());
  std::string answer;
  std::getline(std::cin, answer);
  return answer == "y" || answer == "Y" || answer == "yes";
}

// The wizard's sheet and pages on the terminal.
class TerminalSheetView : public IWizConfigSheetView {
 public:
  explicit TerminalSheetView(bool assumeYes) : assumeYes_(assumeYes) {}
  void ShowMessageBox(const CString& text, Icon, bool) override {
    std::fprintf(stderr, "%s\n", text.ToUtf8().c_str());
  }
  int RunModal(CWizConfigSheet&) override { return CWizConfigSheet::kIdCancel; }
  void EndSheet(int result) override { ended = result; }
  void EnableSheetButton(int, bool) override {}
  bool AskYesNo(const CString& text, bool) override { return assumeYes_ || Confirm(text.ToUtf8()); }
  void StepProgress() override {}
  void ShowWriteResult(int32_t, int32_t error) override { result = error; }

  int ended = 0;
  int32_t result = -1;

 private:
  bool assumeYes_;
};

void RequireLogger(const DeviceChannel& channel) {
  if (!channel.connected()) Fail(kNoLogger);
}

void FailOnError(int32_t error, const std::string& what) {
  if (error != 0) Fail(what + ": " + DeviceErrorMessage(error));
}

GPS_APP_PROG_TYPE ParseTripApp(const std::string& app) {
  if (app == "trip") return GPS_APP_TRIP;
  if (app == "sport") return GPS_APP_SPORT;
  if (app == "tracker") return GPS_APP_TRACKER;
  Usage("--app must be trip, sport or tracker");
}

void ShowStatus(const std::string& logger) {
  DeviceChannel channel(GPS_APP_TRIP, logger);
  RequireLogger(channel);
  std::printf("Logger:     connected\n");
  std::printf("Model:      %s (code %d)\n", GetCurrentModelDspName().ToUtf8().c_str(),
              g_wDeviceModelID);
  std::printf("Identity:   %s\n", g_szDeviceId);
  std::printf("Serial:     %d\n", g_wDeviceSerialID);
  std::printf("Firmware:   %g\n", g_dDeviceVersion);
  std::printf("Memory:     %d KiB used of %d KiB\n", g_lUsedMemory, g_lTotolMemory);
  std::printf("Clock:      %+d min from UTC\n", g_nDeviceTimeZone);
}

// The ids of the trips in an application's data folder.
std::vector<CString> TripFolders(GPS_APP_PROG_TYPE app) {
  std::vector<CString> ids;
  CStringList names;
  GetContent(GetAppDataFolder(app), L"*", names);
  for (POSITION pos = names.GetHeadPosition(); pos;) {
    const CString& name = names.GetNext(pos);
    if (IsDirectory(PathJoin(GetAppDataFolder(app), name))) ids.push_back(name);
  }
  return ids;
}

void ReadLog(const std::string& logger, const std::string& appName, bool clear) {
  const GPS_APP_PROG_TYPE app = ParseTripApp(appName);
  g_bClearLog = clear;
  DeviceChannel channel(app, logger);
  RequireLogger(channel);
  const std::vector<CString> before = TripFolders(app);
  channel.Request(DC_DEVICE_READ_LOG, [] { DC_KVDEVICE_ReadLogData(); });
  ProgressBar bar("Reading the logger");
  bool cancelled = false;
  for (;;) {
    bool interrupted = false;
    if (channel.WaitFor([&] { return channel.replied() || channel.ended(); }, 100, &interrupted)) break;
    if (interrupted && !cancelled) {
      // Ctrl-C: the process stops between two points and removes what it made.
      cancelled = true;
      DC_KVDEVICE_CancelRead();
    }
    bar.Show(channel.progressDone(), channel.progressTotal());
  }
  bar.Finish(cancelled ? "stopped" : "done");
  if (!channel.replied()) Fail("the data-control process ended");
  FailOnError(channel.lastError(), cancelled ? "read stopped" : "cannot read the log");
  const CDataControlCmdBlkKVDevice& reply = channel.deviceReply();
  std::vector<CString> made;
  for (const CString& id : TripFolders(app))
    if (std::find(before.begin(), before.end(), id) == before.end()) made.push_back(id);
  if (made.empty()) {
    std::printf("The logger holds no points.\n");
  } else {
    std::printf("Read %zu trip%s, points from %s to %s:\n", made.size(), made.size() == 1 ? "" : "s",
                TimeText(CovertOleDateTimeToTimeT(reply.tPointStartTime)).c_str(),
                TimeText(CovertOleDateTimeToTimeT(reply.tPointEndTime)).c_str());
    PrintTripHeader(stdout);
    for (const CString& id : made) {
      BLOG_ITEM_INFO trip(app, id, 0);
      if (trip.ReadInfo() != 1) continue;
      trip.ReadAllWaypoint(1);
      PrintTripLine(stdout, "", trip);
    }
  }
  if (clear) std::printf("The logs read were cleared from the logger.\n");
}

void ClearLog(const std::string& logger, bool yes) {
  DeviceChannel channel(GPS_APP_TRIP, logger);
  RequireLogger(channel);
  if (!yes && !Confirm("Erase every log on the logger?"))
    Fail("the log was not cleared (answer yes, or give --yes)");
  TerminalDialogView view;
  CWaitDataCtrlProcDlg dialog(view);
  channel.SetListener(&dialog);
  // The dialog sends the clear itself, on its first tick.
  channel.Request(DC_DEVICE_CLEAR_LOG, [] {});
  dialog.OnInitDialog();
  channel.WaitDeviceReply();
  channel.WaitFor([&] { return dialog.done(); }, 5000);
  channel.SetListener(nullptr);
  FailOnError(channel.lastError(), "cannot clear the log");
}

// The last page of the configuration wizard writes g_devConfig, or resets the logger.
int32_t RunWizardLastPage(DeviceChannel& channel, bool reset, bool assumeYes) {
  TerminalSheetView view(assumeYes);
  CWizConfigSheet sheet(view);
  sheet.bResetRequest = reset;
  sheet.bResetConfirm = reset;
  CWizConfigFinishPage page(sheet);
  channel.SetListener(&page);
  page.OnSetActive();
  // Done when the logger has answered, or when the sheet was left on a "no".
  channel.WaitFor([&] { return view.result != -1 || view.ended != 0 || channel.ended(); }, 60000);
  channel.SetListener(nullptr);
  if (view.ended == CWizConfigSheet::kIdCancel) Fail("the logger was not reset (answer yes, or give --yes)");
  if (view.result == -1) Fail("the data-control process did not answer in time");
  return view.result;
}

void PrintSettings(const CDataControlCmdBlkKVDevice& plain, const CDataControlCmdBlkKVDevice11* kv11) {
  datactrl::ForEachSetting(plain, [](const char* key, const std::string& value) {
    std::printf("%s=%s\n", key, value.c_str());
  });
  if (!kv11) return;
  std::printf("\n[KV-11]\n");
  datactrl::ForEachSetting(*kv11, [](const char* key, const std::string& value) {
    std::printf("%s=%s\n", key, value.c_str());
  });
}

void Settings(const std::string& logger, const std::vector<std::string>& assignments) {
  DeviceChannel channel(GPS_APP_TRIP, logger);
  RequireLogger(channel);
  channel.Request(DC_DEVICE_READ_SETTING, [] { DC_KVDEVICE_ReadSetting(); });
  channel.WaitDeviceReply();
  FailOnError(channel.lastError(), "cannot read the settings");
  const bool family = IsKV11Model(g_wDeviceModelID);
  // The process keeps the plain settings in g_devConfig for every model.
  CDataControlCmdBlkKVDevice plain = family ? g_devConfig : channel.deviceReply();
  auto kv11 = std::make_unique<CDataControlCmdBlkKVDevice11>(channel.kv11Reply());
  if (assignments.empty()) {
    PrintSettings(plain, family ? kv11.get() : nullptr);
    return;
  }
  bool plainChanged = false, kv11Changed = false;
  for (const std::string& a : assignments) {
    const size_t eq = a.find('=');
    if (eq == std::string::npos) Usage("--set takes KEY=VALUE, not '" + a + "'");
    const std::string key = a.substr(0, eq), value = a.substr(eq + 1);
    std::string why;
    if (datactrl::IsDeviceSetting(key)) {
      why = datactrl::SetSetting(plain, key, value);
      plainChanged = true;
    } else if (datactrl::IsKV11Setting(key)) {
      if (!family) Usage("'" + key + "' is a setting of the KV-11 family; this logger has none");
      why = datactrl::SetSetting(*kv11, key, value);
      kv11Changed = true;
    } else {
      Fail("no setting '" + key + "' (see navmisc device settings)", 2);
    }
    if (!why.empty()) Usage(key + ": '" + value + "' is " + why);
  }
  if (plainChanged) {
    g_devConfig = plain;
    FailOnError(RunWizardLastPage(channel, false, true), "cannot write the settings");
  }
  if (kv11Changed) {
    kv11->nDeviceCmd = DC_DEVICE_WRITE_SETTING;
    channel.Request(DC_DEVICE_WRITE_SETTING, [&] { DC_KVDEVICE_WriteSetting(*kv11); });
    channel.WaitDeviceReply();
    FailOnError(channel.lastError(), "cannot write the settings");
  }
  std::printf("Settings written.\n");
}

void Reset(const std::string& logger, bool yes) {
  DeviceChannel channel(GPS_APP_TRIP, logger);
  RequireLogger(channel);
  FailOnError(RunWizardLastPage(channel, true, yes), "cannot reset the logger");
  std::printf("The logger's settings are back to their factory values.\n");
}

void Modes(const std::string& logger) {
  DeviceChannel channel(GPS_APP_TRIP, logger);
  RequireLogger(channel);
  TerminalSheetView view(false);
  CWizConfigSheet sheet(view);
  sheet.settingFile = CWizConfigSheet::GetSettingFilePath();
  const bool read = sheet.LoadSettingFile() == 1;
  std::printf("Settings file: %s%s\n\n", sheet.settingFile.ToUtf8().c_str(),
              read ? "" : " (not written yet: the defaults)");
  std::printf("%-4s %-16s %8s %7s %7s %9s %6s %4s\n", "MODE", "NAME", "INTERVAL", "TRICKLE",
              "SMART", "SMART INT", "SPEED", "UNIT");
  for (int i = 0; i < CWizConfigSheet::kModes; ++i) {
    const WIZ_MODE_INFO& m = sheet.modes[i];
    std::printf("%-4d %-16s %7ds %7s %7s %8ds %6d %4d\n", i, m.szName.ToUtf8().c_str(), m.nInterval,
                m.bTricklePower ? "on" : "off", m.bSmartTracking ? "on" : "off",
                m.nSmartTrackingInterval, m.nSmartTrackingSpeed, m.nUnit);
  }
  std::printf("\nTime zone %d, daylight %d, begin time %d; trickle power %d, dual mode %d, cycle %d,\n"
              "auto interval %d, unit %d, speed scale %d, accelerometer %d, motion detection %d\n",
              sheet.nTimeZone, sheet.nDayLight, sheet.nBeginTime, sheet.bTricklePower, sheet.nDualMode,
              sheet.nCycle, sheet.bEnableAutoChangeInterval, sheet.nUnitSel, sheet.nVScale, sheet.bAccOn,
              sheet.bMotionDetect);
}

// The navigation points of a GPX file: its waypoints and route points, in document order.
class NaviPoints : public import::ImportSink {
 public:
  bool BeginTrack(const import::ImportTrack& track) override {
    inRoute_ = track.kind == import::TrackKind::kRoute;
    name_ = track.name;
    return true;
  }
  bool BeginSegment() override { return true; }
  bool Point(const import::ImportPoint& p) override {
    if (inRoute_ && p.hasPosition) Add(p.latitude, p.longitude, p.hasAltitude ? p.altitude : 0, name_);
    return true;
  }
  bool EndTrack() override {
    inRoute_ = false;
    return true;
  }
  bool Marker(const import::ImportMarker& m) override {
    Add(m.latitude, m.longitude, m.hasAltitude ? m.altitude : 0, m.name);
    return true;
  }
  std::vector<NAVI_POINT_INFO> points;

 private:
  void Add(double lat, double lon, double alt, const std::string& text) {
    NAVI_POINT_INFO p;
    p.dLatitude = lat;
    p.dLongitude = lon;
    p.dAltitude = alt;
    // The text as bytes, terminated, cut at a whole character.
    size_t n = std::min(text.size(), sizeof p.szText - 1);
    while (n > 0 && n < text.size() && (static_cast<unsigned char>(text[n]) & 0xC0) == 0x80) --n;
    std::memcpy(p.szText, text.data(), n);
    points.push_back(p);
  }
  bool inRoute_ = false;
  std::string name_;
};

void WriteNavi(const std::string& logger, const std::string& file) {
  NaviPoints sink;
  import::ReadFileOptions options;
  options.format.format = import::Format::kGpx;
  const import::ReadFileResult read = import::ReadTrackFile(CString::FromUtf8(file), sink, options);
  if (!read.status.ok() && read.status.code != DC_ERR_IMPORT_NO_POINTS) Fail(file + ": " + read.status.message);
  if (sink.points.empty()) Fail(file + ": no waypoints or route points");
  const size_t kept = std::min<size_t>(sink.points.size(), datactrl::kNaviMaxEntries);
  if (kept < sink.points.size())
    std::fprintf(stderr, "navmisc device navi: only the first %zu of %zu points go to the logger\n", kept,
                 sink.points.size());
  DeviceChannel channel(GPS_APP_TRIP, logger);
  RequireLogger(channel);
  CxPtrList list;
  for (NAVI_POINT_INFO& p : sink.points) list.AddTail(&p);
  channel.Request(DC_DEVICE_WRITE_NAVI, [&] { DC_KVDEVICE_WriteNaviData(list); });
  channel.WaitDeviceReply();
  FailOnError(channel.lastError(), "cannot write the navigation points");
  std::printf("%zu navigation point%s written.\n", kept, kept == 1 ? "" : "s");
}

}  // namespace

void AddDeviceCommand(CLI::App& app) {
  CLI::App* group = app.add_subcommand("device", "read, clear and set up the GPS logger");
  group->require_subcommand(1);
  group->fallthrough();
  group->footer(
      "The logger is a folder (a logger that mounts as USB storage): --logger DIR, else\n"
      "[DEVICE] Path in GpsDataControl.ini of the data root, else the first mounted volume that\n"
      "holds GPSLOGGER.INI. Every command goes through the data-control process.\n"
      "Global options: --data-root DIR (see navmisc --help)");
  auto logger = std::make_shared<std::string>();
  group->add_option("--logger", *logger, "the logger's folder")->option_text("DIR");

  AddCommand(*group, "status", "the connected logger: model, identity, memory", "",
             [logger] { ShowStatus(*logger); });

  auto app_ = std::make_shared<std::string>("trip");
  auto clear = std::make_shared<bool>(false);
  CLI::App* read = AddCommand(
      *group, "read", "turn the logger's logs into trips",
      "One trip per log file; Ctrl-C stops the read and leaves no trip behind.",
      [logger, app_, clear] { ReadLog(*logger, *app_, *clear); });
  read->add_option("--app", *app_, "the application the trips are for: trip, sport or tracker")
      ->option_text("APP");
  read->add_flag("--clear", *clear, "erase the logs once every one has become a trip");

  auto yes = std::make_shared<bool>(false);
  CLI::App* clearCmd = AddCommand(*group, "clear", "erase the logger's logs", "",
                                  [logger, yes] { ClearLog(*logger, *yes); });
  clearCmd->add_flag("--yes", *yes, "do not ask");

  auto sets = std::make_shared<std::vector<std::string>>();
  CLI::App* settings = AddCommand(
      *group, "settings", "show the logger's settings, or change some",
      "Names are those shown; --set may be given more than once.",
      [logger, sets] { Settings(*logger, *sets); });
  settings->add_option("--set", *sets, "change a setting")->option_text("KEY=VALUE");

  CLI::App* reset = AddCommand(*group, "reset", "put the logger's settings back to factory values",
                               "", [logger, yes] { Reset(*logger, *yes); });
  reset->add_flag("--yes", *yes, "do not ask");

  AddCommand(*group, "modes",
             "the configuration wizard's six logging modes and time-zone choices for this logger",
             "", [logger] { Modes(*logger); });

  auto file = std::make_shared<std::string>();
  CLI::App* navi = AddCommand(
      *group, "navi", "send a GPX file's waypoints and route points to the logger as navigation points",
      "At most 100 points; loggers of the KV-11 family (models 8, 9, 18, 20, 21, 22) take them.",
      [logger, file] { WriteNavi(*logger, *file); });
  navi->add_option("FILE", *file, "a GPX file")->required();
}

}  // namespace navmisc::cli
