// `navmisc net ...`: the web service through the data-control process, as the suite's
// applications reach it: the channel's command thread, the net front functions and their replies.
#include <termios.h>
#include <unistd.h>

#include <CLI/CLI.hpp>

#include <chrono>
#include <cstdio>
#include <fstream>
#include <functional>
#include <iostream>
#include <memory>
#include <optional>

#include "channel_session.h"
#include "cli.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/login_dialog.h"
#include "navmisc/datactrl/net_commands.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/export/gpx_export.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"
#include "navmisc/records/user_profile.h"
#include "terminal_view.h"

namespace navmisc::cli {
namespace {

// The process bounds every exchange (two for a download); this only guards against a channel
// that stopped answering altogether.
constexpr auto kReplyWait = std::chrono::minutes(20);
constexpr size_t kMaxTokenBytes = 4096;

// What a failed command's code means, for the line on stderr.
std::string ErrorMeaning(int32_t e) {
  switch (e) {
    case 401: return "the service did not accept the access token (HTTP 401)";
    case 403: return "the service refused the request (HTTP 403)";
    case 404: return "the service has no such trace (HTTP 404)";
    case DC_ERR_NET_NOT_OFFERED: return "the web service does not offer this";
    case DC_ERR_NET_NOT_LOGGED_ON: return "not logged on";
    case DC_ERR_NET_WRONG_USER: return "the access token belongs to another user";
    case DC_ERR_NET_BAD_REQUEST: return "the request lacks what the command needs";
    case DC_ERR_NET_BAD_GPX: return "the trip's GPX document is not well-formed (is there a \"&\" or \"<\" in a title?)";
    case DC_ERR_NET_BAD_ADDRESS: return "the service address is not usable (https, or http to 127.0.0.1 only)";
    case DC_ERR_NET_UNREACHABLE: return "the service cannot be reached";
    case DC_ERR_NET_TLS: return "the service's certificate could not be verified";
    case DC_ERR_NET_TIMEOUT: return "the service did not answer in time";
    case DC_ERR_NET_TRANSFER: return "the connection to the service broke";
    case DC_ERR_NET_TOO_LARGE: return "the answer or the file is too large";
    case DC_ERR_NET_BAD_REPLY: return "the service's answer could not be read";
    case DC_ERR_NET_BUSY: return "the data-control process is busy";
    default:
      if (e >= 300 && e <= 599) return "the service answered HTTP " + std::to_string(e);
      return "error " + std::to_string(e);
  }
}

// A log text as a terminal line: CR LF pairs become line ends.
void PrintLog(const CString& text) {
  CString line = text;
  line.Replace(L"\r\n", L"\n");
  if (!line.IsEmpty()) std::printf("%s\n", line.ToUtf8().c_str());
}

// The login dialog on a terminal: the fields are what the command line gave.
class TerminalLoginView : public ILoginView {
 public:
  CString GetUserName() override { return name; }
  CString GetPassword() override { return password; }
  bool GetKeepPassword() override { return keep; }
  void SetUserName(const CString& s) override { name = s; }
  void SetPassword(const CString& s) override { password = s; }
  void SetKeepPassword(bool k) override { keep = k; }
  void EnableOk(bool) override {}
  void EnableOtherControls(bool) override {}
  void EndDialog(int r) override { result = r; }
  void ShowMessageBox(const CString& text, Icon icon, bool rightToLeft) override {
    boxes_.ShowMessageBox(text, icon, rightToLeft);
  }

  CString name, password;
  bool keep = true;
  int result = 0;

 private:
  TerminalDialogView boxes_;
};

// The channel's owner window: the login dialog, which also keeps every web-service reply.
class NetWindow : public CLoginDlg {
 public:
  NetWindow(TerminalLoginView& view, USER_MAP_INFO& user) : CLoginDlg(view, user) {}
  long ProcessNet(CDataControlCmdBlk* block) override {
    replies.push_back(*static_cast<CDataControlCmdBlkNet*>(block));
    // The dialog takes replies only while it is open, as a dialog window does.
    return dialogOpen ? CLoginDlg::ProcessNet(block) : 1;
  }
  std::vector<CDataControlCmdBlkNet> replies;
  bool dialogOpen = false;
};

// The channel for one command, with the login dialog as its window.
class NetSession {
 public:
  NetSession() : window_(view_, g_TripMapInfo) { g_TripMapInfo.ReadInfo(); }

  // Sends a request and waits for the reply with `netCmd`.
  CDataControlCmdBlkNet Ask(int32_t netCmd, const std::function<void()>& send) {
    const size_t before = window_.replies.size();
    send();
    std::optional<CDataControlCmdBlkNet> reply;
    PumpUntil(
        [&] {
          for (size_t i = before; i < window_.replies.size() && !reply; ++i)
            if (window_.replies[i].nNetCmd == netCmd) reply = window_.replies[i];
          return reply.has_value() || channel_.ended();
        },
        kReplyWait);
    if (!reply) Fail("the data-control process did not answer");
    return *reply;
  }

  // Logs on with the name and token the profile keeps.
  void LogInStored() {
    const USER_MAP_INFO& user = g_TripMapInfo;
    if (!user.keepPassword || user.password.IsEmpty()) Fail("not logged on: run `navmisc net login` first");
    const CDataControlCmdBlkNet reply =
        Ask(DC_NET_CMD_LOGIN, [&] { DC_NET_UserLogin(user.userAccount, user.password); });
    Check(reply);
  }

  // The dialog's way: fields filled, OK pressed, the reply taken.
  CDataControlCmdBlkNet LogInWith(const CString& name, const CString& token) {
    window_.dialogOpen = true;
    window_.OnInitDialog();
    view_.name = name;
    view_.password = token;
    view_.keep = true;
    window_.OnChangeName();
    const CDataControlCmdBlkNet reply = Ask(DC_NET_CMD_LOGIN, [&] { window_.BeginLogin(); });
    window_.dialogOpen = false;
    if (view_.result != IDOK && reply.nLastError == 0) Fail("the login was not stored");
    return reply;
  }

  // Fails with the reply's log text (when it has one) and the meaning of its code.
  static void Check(const CDataControlCmdBlkNet& reply) {
    if (reply.nLastError == 0) return;
    PrintLog(NetReplyLogText(reply));
    Fail(ErrorMeaning(reply.nLastError));
  }

 private:
  TerminalLoginView view_;
  NetWindow window_;
  ChannelSession channel_{window_};
};

// The token: from a file (its first line), else from the terminal without echo, else the first
// line of standard input. Never from the command line.
CString ReadToken(const std::string& file) {
  std::string token;
  if (!file.empty()) {
    const CString path = CString::FromUtf8(file);
    if (!FileExists(path) || IsDirectory(path)) Fail(file + " is not a file");
    std::ifstream in(file);
    std::getline(in, token);
  } else if (::isatty(STDIN_FILENO)) {
    std::fprintf(stderr, "Access token: ");
    std::fflush(stderr);
    termios old{};
    const bool quiet = ::tcgetattr(STDIN_FILENO, &old) == 0;
    if (quiet) {
      termios silent = old;
      silent.c_lflag &= ~static_cast<tcflag_t>(ECHO);
      ::tcsetattr(STDIN_FILENO, TCSAFLUSH, &silent);
    }
    std::getline(std::cin, token);
    if (quiet) ::tcsetattr(STDIN_FILENO, TCSAFLUSH, &old);
    std::fprintf(stderr, "\n");
  } else {
    std::getline(std::cin, token);
  }
  while (!token.empty() && (token.back() == '\r' || token.back() == ' ' || token.back() == '\t')) token.pop_back();
  if (token.empty()) Fail("no access token");
  if (token.size() > kMaxTokenBytes) Fail("the access token is too long");
  return CString::FromUtf8(token);
}

void Login(const std::optional<std::string>& user, const std::string& tokenFile) {
  NetSession session;
  const CString name = user ? CString::FromUtf8(*user) : g_TripMapInfo.userAccount;
  if (name.IsEmpty()) Fail("no user name: give it as `navmisc net login USER`");
  const CDataControlCmdBlkNet reply = session.LogInWith(name, ReadToken(tokenFile));
  NetSession::Check(reply);
  CString log;
  LogNetReply(reply, log);  // asks for the track list, as the suite does after a login
  PrintLog(log);
  const CDataControlCmdBlkNet list = session.Ask(DC_NET_CMD_QUERY_TRACK_LIST, [] {});
  if (list.nLastError == 0)
    std::printf("%zu traces on the service\n", list.trackInfo.ptrPOIList.size());
}

void WhoAmI() {
  NetSession session;
  session.LogInStored();
  const CDataControlCmdBlkNet reply = session.Ask(DC_NET_CMD_GETUSERDATA, [] { DC_NET_GetUserData(); });
  NetSession::Check(reply);
  PrintLog(NetReplyLogText(reply));
}

struct UploadOptions {
  std::string trip;
  bool isPrivate = false;
  std::string description;
  std::string tags;
};

void Upload(const UploadOptions& o) {
  auto trip = OpenTrip(o.trip);
  ScopedTempFolder temp(L"navmisc-upload");
  if (temp.path().IsEmpty()) Fail("no temporary folder for the GPX document");
  const CString gpx = PathJoin(temp.path(), L"trip.gpx");
  ExportRequest exportRequest;
  exportRequest.trip = o.trip;
  exportRequest.out = gpx.ToUtf8();
  exportRequest.format = "gpx";
  RunExport(exportRequest);

  NetSession session;
  session.LogInStored();
  CDataControlCmdBlkNet block;
  block.nNetCmd = DC_NET_CMD_UPLOAD_TRACK;
  block.fileInfo.sFilePath = gpx;
  block.fileInfo.sName = CString::FromUtf8(o.trip) + L".gpx";
  block.trackInfo.szSubject = trip->name;
  block.trackInfo.szDesc = o.description.empty()
                               ? (trip->description.IsEmpty() ? trip->name : trip->description)
                               : CString::FromUtf8(o.description);
  block.trackInfo.szTag = CString::FromUtf8(o.tags);
  block.trackInfo.bListed = o.isPrivate ? 0 : 1;
  const CDataControlCmdBlkNet reply = session.Ask(DC_NET_CMD_UPLOAD_TRACK, [&] { DC_NET_UploadTrack(block); });
  NetSession::Check(reply);
  PrintLog(NetReplyLogText(reply));
  std::printf("Id = %s\n", reply.trackInfo.szTrackId.ToUtf8().c_str());
}

void Tracks() {
  NetSession session;
  session.LogInStored();
  const CDataControlCmdBlkNet reply = session.Ask(DC_NET_CMD_QUERY_TRACK_LIST, [] { DC_NET_QueryTrackList(0); });
  NetSession::Check(reply);
  std::printf("%-12s %-20s %-12s %s\n", "ID", "UPLOADED", "VISIBILITY", "NAME / DESCRIPTION");
  for (const DC_NET_POI_INFO& t : reply.trackInfo.ptrPOIList) {
    std::printf("%-12s %-20s %-12s %s / %s\n", t.szTrackId.ToUtf8().c_str(),
                TimeText(CovertOleDateTimeToTimeT(t.tTime)).c_str(), t.szIcon.ToUtf8().c_str(),
                t.szTitle.ToUtf8().c_str(), t.szDesc.ToUtf8().c_str());
  }
}

// Logs on and sends command `netCmd` about the trace `id` with `send`; prints the reply's log
// text, or fails with it.
CDataControlCmdBlkNet TraceCommand(int32_t netCmd, const std::string& id,
                                   void (*send)(CDataControlCmdBlkNet&)) {
  NetSession session;
  session.LogInStored();
  const CDataControlCmdBlkNet reply = session.Ask(netCmd, [&] {
    CDataControlCmdBlkNet block;
    block.nNetCmd = netCmd;
    block.trackInfo.szTrackId = CString::FromUtf8(id);
    send(block);
  });
  NetSession::Check(reply);
  PrintLog(NetReplyLogText(reply));
  return reply;
}

void Download(const std::string& id, std::string out) {
  if (out.empty()) out = id + ".gpx";
  if (IsDirectory(CString::FromUtf8(out))) Fail(out + " is a folder");
  const CDataControlCmdBlkNet reply = TraceCommand(DC_NET_CMD_DWLOAD_TRACK, id, DC_NET_QueryTrack);

  // The points as a track of no trip, written by the GPX export. Its name goes in unescaped,
  // so the characters XML reserves are left out of it.
  TRACK_ITEM_INFO track(nullptr);
  for (wchar_t c : reply.trackInfo.szSubject.str())
    if (c != L'&' && c != L'<' && c != L'>') track.description += c;
  for (const DC_NET_POINT_INFO& p : reply.trackInfo.ptrPtList) {
    auto* point = new WAYPOINT_ITEM_INFO();
    point->time = static_cast<int32_t>(CovertOleDateTimeToTimeT(p.oleTime));
    point->latitude = p.dLatitude;
    point->longitude = p.dLongitude;
    point->altitude = p.dAltitude;
    point->speed = p.nSpeed;
    track.points.AddTail(point);
  }
  CPtrList tracks, items;
  tracks.AddTail(&track);
  if (!ExportGpx(CString::FromUtf8(out), tracks, items)) Fail("cannot write " + out);
  std::printf("%s: %d points\n", out.c_str(), track.points.GetCount());
}

void Remove(const std::string& id) { TraceCommand(DC_NET_CMD_REMOVE_TRACK, id, DC_NET_RemoveTrack); }

constexpr const char* kNetHelp =
    "The web service (OpenStreetMap's GPS traces; the address is the Url of [WEBSERVICE] in\n"
    "GpsDataControl.ini in the data root). `login` stores the user name and the access token,\n"
    "sealed, in the trip application's profile; the other commands log on with them. Each prints\n"
    "the log text of its reply and exits non-zero on failure. See docs/web-service.md.";

}  // namespace

void AddNetCommand(CLI::App& app) {
  CLI::App* net = app.add_subcommand("net", "the web service: log on, upload, list, download, remove traces");
  net->footer(kNetHelp);
  net->require_subcommand(1);

  auto user = std::make_shared<std::optional<std::string>>();
  auto tokenFile = std::make_shared<std::string>();
  CLI::App* login = AddCommand(*net, "login", "log on and keep the access token",
                               "Logs on as USER (default: the stored account) with an OAuth 2 access token,\n"
                               "read from --token-file, else from the terminal without echo, else from\n"
                               "standard input. The token is kept sealed in the profile.",
                               [user, tokenFile] { Login(*user, *tokenFile); });
  login->add_option("USER", *user, "the account's display name");
  login->add_option("--token-file", *tokenFile, "a file whose first line is the access token");

  AddCommand(*net, "whoami", "show the logged-on user", "Prints the user name and display name.", [] { WhoAmI(); });

  auto upload = std::make_shared<UploadOptions>();
  CLI::App* up = AddCommand(*net, "upload", "upload a trip as a GPX trace",
                            "Uploads the trip's tracks and photos as one GPX document; prints its trace id.",
                            [upload] { Upload(*upload); });
  up->add_option("TRIP", upload->trip, "the trip: its id, the start of its id, or its name")->required();
  up->add_flag("--private", upload->isPrivate, "upload as a private trace (default public)");
  up->add_option("--description", upload->description, "the trace's description (default the trip's)");
  up->add_option("--tags", upload->tags, "comma-separated tags");

  AddCommand(*net, "tracks", "list the user's traces", "Lists the traces, newest first.", [] { Tracks(); });

  auto id = std::make_shared<std::string>();
  auto out = std::make_shared<std::string>();
  CLI::App* down = AddCommand(*net, "download", "download a trace as GPX",
                              "Writes the trace's points as a GPX document (default ID.gpx).",
                              [id, out] { Download(*id, *out); });
  down->add_option("ID", *id, "the trace's id")->required();
  down->add_option("-o,--out", *out, "the file to write");

  auto removeId = std::make_shared<std::string>();
  CLI::App* remove = AddCommand(*net, "remove", "delete a trace", "Deletes the trace from the service.",
                                [removeId] { Remove(*removeId); });
  remove->add_option("ID", *removeId, "the trace's id")->required();
}

}  // namespace navmisc::cli
