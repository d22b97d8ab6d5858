// Web-service commands (kind 2), served by OpenStreetMap's API 0.6 (docs/web-service.md).
//
// They run on a worker thread of their own, one after the other in the order they came, so
// that an exchange with a slow service never holds up the process's loop: status queries are
// still answered, and the exit block ends the process at once (a running exchange is cut
// short). The reply is the request's block as the command leaves it, the password always
// emptied, with the outcome in nLastError.
#include <sodium.h>

#include <algorithm>
#include <cctype>
#include <charconv>
#include <condition_variable>
#include <deque>
#include <filesystem>
#include <fstream>
#include <memory>
#include <mutex>
#include <thread>

#include "geolocate.h"
#include "handlers.h"
#include "http_client.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_state.h"
#include "navmisc/datactrl/net_commands.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "osm_api.h"

namespace gpsdc {
namespace {

// Commands that may wait for the worker; more are answered DC_ERR_NET_BUSY at once.
constexpr size_t kMaxWaiting = 16;
// The largest GPX file that is uploaded.
constexpr uintmax_t kMaxUploadBytes = 50u << 20;

// What the process last learned about reaching the service: unknown until an exchange was
// tried.
enum class Reach { kUnknown, kYes, kNo };
std::atomic<Reach> g_reach{Reach::kUnknown};

void NoteReach(int32_t outcome) {
  Reach reach;
  if (outcome == DC_ERR_NET_UNREACHABLE || outcome == DC_ERR_NET_TIMEOUT || outcome == DC_ERR_NET_TLS)
    reach = Reach::kNo;
  else if (outcome == 0 || (outcome >= 100 && outcome <= 599) || outcome == DC_ERR_NET_BAD_REPLY)
    reach = Reach::kYes;
  else
    return;  // no answer was asked for, or the process is ending
  g_reach = reach;
  g_bNetConnected = reach == Reach::kYes;
}

CString Wide(const std::string& utf8) { return CString::FromUtf8(utf8); }

std::string Join(const std::vector<std::string>& items) {
  std::string out;
  for (const std::string& item : items) out += (out.empty() ? "" : ", ") + item;
  return out;
}

COleDateTime UploadTime(const std::string& timestamp) {
  const long t = ConvertStdStringTimeT(Wide(timestamp));
  return t == -1 ? COleDateTime() : CovertTimeTToOleDateTime(t);
}

// A short fingerprint of the token, so that a log can tell which token is in use without
// holding it: the first 6 bytes of its BLAKE2b hash, in hexadecimal.
CString TokenFingerprint(const std::string& token) {
  unsigned char hash[crypto_generichash_BYTES];
  crypto_generichash(hash, sizeof hash, reinterpret_cast<const unsigned char*>(token.data()),
                     token.size(), nullptr, 0);
  char hex[13];
  sodium_bin2hex(hex, sizeof hex, hash, 6);
  return Wide(hex);
}

// The file name the service shows: the letters, digits, ".", "-" and "_" of `name`, ending in
// ".gpx".
std::string UploadFileName(const CString& name) {
  std::string out;
  for (char c : name.ToUtf8())
    out += (std::isalnum(static_cast<unsigned char>(c)) || c == '.' || c == '-' || c == '_') ? c : '_';
  if (out.empty() || out == "." || out == "..") out = "track";
  if (out.size() < 4 || out.compare(out.size() - 4, 4, ".gpx") != 0) out += ".gpx";
  return out;
}

// Reads the GPX file to upload.
int32_t ReadUploadFile(const CString& path, std::string& gpx) {
  std::error_code ec;
  const std::filesystem::path file(path.ToUtf8());
  if (!std::filesystem::is_regular_file(file, ec)) return DC_ERR_NET_BAD_GPX;
  const uintmax_t size = std::filesystem::file_size(file, ec);
  if (ec) return DC_ERR_NET_BAD_GPX;
  if (size > kMaxUploadBytes) return DC_ERR_NET_TOO_LARGE;
  std::ifstream in(file, std::ios::binary);
  gpx.assign(static_cast<size_t>(size), '\0');
  if (!in.read(gpx.data(), static_cast<std::streamsize>(size))) return DC_ERR_NET_BAD_GPX;
  return IsGpxDocument(gpx) ? 0 : DC_ERR_NET_BAD_GPX;
}

void FillTrack(const OsmTrace& t, DC_NET_TRACK_INFO& track) {
  track.szTrackId = Wide(t.id);
  track.szSubject = Wide(t.name);
  track.szDesc = Wide(t.description);
  track.szTag = Wide(Join(t.tags));
  track.szOwnerId = Wide(t.owner);
  track.szMetaInfo = Wide(t.visibility);
  track.bListed = t.visibility == "public" || t.visibility == "identifiable";
  track.nMode = t.pending ? 1 : 0;
  track.tUploadTime = UploadTime(t.timestamp);
  if (t.hasPosition) {
    track.ptStart.dLatitude = t.lat;
    track.ptStart.dLongitude = t.lon;
  }
}

// The user's traces as entries of the reply's marker list (docs/web-service.md).
DC_NET_POI_INFO ListEntry(const OsmTrace& t) {
  DC_NET_POI_INFO e;
  e.szPoiId = Wide(t.id);
  e.szTrackId = Wide(t.id);
  e.szTitle = Wide(t.name);
  e.szDesc = Wide(t.description);
  e.szIcon = Wide(t.visibility);
  e.sEmbeddedCode = Wide(Join(t.tags));
  e.dLatitude = t.lat;
  e.dLongitude = t.lon;
  e.nSegment = t.pending ? 1 : 0;
  e.tTime = UploadTime(t.timestamp);
  return e;
}

CString Decimal(double value, int digits) {
  char buf[64];
  const auto r = std::to_chars(buf, buf + sizeof buf, value, std::chars_format::fixed, digits);
  return Wide(std::string(buf, r.ptr));
}

// The session and the commands.
class NetService {
 public:
  NetService(const Config& config, const std::atomic<bool>& cancel)
      : http_(std::chrono::seconds(config.timeoutSeconds), cancel),
        api_(http_, config.serviceUrl.ToUtf8()),
        geolocateUrl_(config.geolocateUrl.ToUtf8()) {}
  ~NetService() { Logout(); }

  int32_t Run(CDataControlCmdBlkNet& b) {
    switch (b.nNetCmd) {
      case DC_NET_CMD_LOGIN: return Login(b);
      case DC_NET_CMD_GETUSERDATA: return WithSession([&] { return UserData(b); });
      case DC_NET_CMD_UPLOAD_TRACK: return WithSession([&] { return Upload(b); });
      case DC_NET_CMD_REMOVE_TRACK: return WithSession([&] { return Remove(b); });
      case DC_NET_CMD_QUERY_TRACK_LIST: return WithSession([&] { return List(b); });
      case DC_NET_CMD_DWLOAD_TRACK: return WithSession([&] { return Details(b, true); });
      case DC_NET_CMD_TRACK_INFO: return WithSession([&] { return Details(b, false); });
      case DC_NET_CMD_QUERY_POSITION_BY_CELLID: return CellPosition(b);
      case DC_NET_CMD_CREATE_ACCOUNT:
      case DC_NET_CMD_UPLOAD_PHOTO:
      case DC_NET_CMD_REMOVE_PHOTO:
      case DC_NET_CMD_ADD_PHOTO_TO_TRACK:
      case DC_NET_CMD_ADD_POI_TO_TRACK:
      case DC_NET_CMD_ADD_HTML_TO_TRACK:
      case DC_NET_CMD_REMOVE_MARKER:
      case DC_NET_CMD_ADD_FILE_TO_TRACK:
      case DC_NET_CMD_QUERY_PHOTO_LIST:
      case DC_NET_CMD_QUERY_TRACK_PHOTO_LIST:
      case DC_NET_CMD_QUERY_PREDEF_CATEGORY:
      case DC_NET_CMD_QUERY_USERDEF_TAG:
      case DC_NET_CMD_TRACK_MARKER_LIST:
      case DC_NET_CMD_DEL_ALL_TRACK_FILES:
      case DC_NET_CMD_DEL_ALL_TRACK_MARKERS:
      case DC_NET_CMD_GET_FILE:
      case DC_NET_CMD_GET_GMAP_INFO:
      case DC_NET_CMD_QUERY_GPS_OFFSET:
        return DC_ERR_NET_NOT_OFFERED;
      default:
        return DC_ERR_UNKNOWN_COMMAND;
    }
  }

 private:
  template <class F>
  int32_t WithSession(F command) {
    if (token_.empty()) return DC_ERR_NET_NOT_LOGGED_ON;
    const int32_t outcome = command();
    NoteReach(outcome);
    return outcome;
  }

  void Logout() {
    sodium_memzero(token_.data(), token_.size());
    token_.clear();
  }

  void FillUser(const OsmUser& user, DC_NET_USER_INFO& info) const {
    info.szUid = Wide(user.id);
    info.szOwnerId = Wide(user.id);
    info.szUserName = Wide(user.displayName);
    info.szDisplayName = Wide(user.displayName);
    info.szToken = TokenFingerprint(token_);
  }

  // The token is the password; the name, when given, must be the account's display name.
  int32_t Login(CDataControlCmdBlkNet& b) {
    Logout();
    std::string token = b.userInfo.szPassword.ToUtf8();
    if (token.empty()) return DC_ERR_NET_BAD_REQUEST;
    OsmUser user;
    const int32_t outcome = api_.UserDetails(token, user);
    NoteReach(outcome);
    if (outcome == 0 && !b.userInfo.szUserName.IsEmpty() &&
        b.userInfo.szUserName.CompareNoCase(Wide(user.displayName)) != 0) {
      sodium_memzero(token.data(), token.size());
      return DC_ERR_NET_WRONG_USER;
    }
    if (outcome != 0) {
      sodium_memzero(token.data(), token.size());
      return outcome;
    }
    token_ = std::move(token);
    FillUser(user, b.userInfo);
    return 0;
  }

  int32_t UserData(CDataControlCmdBlkNet& b) {
    OsmUser user;
    const int32_t outcome = api_.UserDetails(token_, user);
    if (outcome == 0) FillUser(user, b.userInfo);
    return outcome;
  }

  int32_t Upload(CDataControlCmdBlkNet& b) {
    if (b.fileInfo.sFilePath.IsEmpty()) return DC_ERR_NET_BAD_REQUEST;
    OsmUpload upload;
    if (const int32_t e = ReadUploadFile(b.fileInfo.sFilePath, upload.gpx)) return e;
    const DC_NET_TRACK_INFO& t = b.trackInfo;
    upload.fileName = UploadFileName(b.fileInfo.sName.IsEmpty()
                                         ? PathFileName(b.fileInfo.sFilePath)
                                         : b.fileInfo.sName);
    // The service insists on a description.
    upload.description = (!t.szDesc.IsEmpty() ? t.szDesc : !t.szSubject.IsEmpty() ? t.szSubject
                                                                                 : Wide(upload.fileName))
                             .ToUtf8();
    upload.tags = t.szTag.ToUtf8();
    upload.visibility = t.bListed ? "public" : "private";
    std::string id;
    const int32_t outcome = api_.Upload(token_, upload, id);
    if (outcome == 0) b.trackInfo.szTrackId = Wide(id);
    return outcome;
  }

  int32_t Remove(CDataControlCmdBlkNet& b) {
    const std::string id = b.trackInfo.szTrackId.ToUtf8();
    if (!IsTraceId(id)) return DC_ERR_NET_BAD_REQUEST;
    return api_.Delete(token_, id);
  }

  // Newest first; nPageId > 0 keeps that many.
  int32_t List(CDataControlCmdBlkNet& b) {
    std::vector<OsmTrace> traces;
    if (const int32_t e = api_.ListTraces(token_, traces)) return e;
    std::stable_sort(traces.begin(), traces.end(), [](const OsmTrace& a, const OsmTrace& c) {
      return a.timestamp != c.timestamp ? a.timestamp > c.timestamp
                                        : std::stoull(a.id) > std::stoull(c.id);
    });
    const int32_t keep = b.trackInfo.nPageId;
    if (keep > 0 && traces.size() > static_cast<size_t>(keep)) traces.resize(static_cast<size_t>(keep));
    b.trackInfo.ptrPOIList.clear();
    for (const OsmTrace& t : traces) b.trackInfo.ptrPOIList.push_back(ListEntry(t));
    return 0;
  }

  // A trace's details, and with `points` its track points.
  int32_t Details(CDataControlCmdBlkNet& b, bool points) {
    const std::string id = b.trackInfo.szTrackId.ToUtf8();
    if (!IsTraceId(id)) return DC_ERR_NET_BAD_REQUEST;
    OsmTrace trace;
    if (const int32_t e = api_.TraceDetails(token_, id, trace)) return e;
    if (trace.id != id) return DC_ERR_NET_BAD_REPLY;
    DC_NET_TRACK_INFO& track = b.trackInfo;
    FillTrack(trace, track);
    if (!points) return 0;
    if (const int32_t e = api_.TracePoints(token_, id, track.ptrPtList)) return e;
    if (!track.ptrPtList.empty()) {
      track.ptStart = track.ptrPtList.front();
      track.ptEnd = track.ptrPtList.back();
    }
    return 0;
  }

  // Needs no session: the cell database is another service, and the token never goes there.
  int32_t CellPosition(CDataControlCmdBlkNet& b) {
    gpsdc::CellPosition position;
    const int32_t outcome = Geolocate(http_, geolocateUrl_, b.cellInfo.CellInfo, position);
    if (outcome != 0) return outcome;
    b.cellInfo.GpsInfo = {Decimal(position.lat, 7) + L"," + Decimal(position.lon, 7) + L"," +
                          Decimal(position.accuracy, 0)};
    return 0;
  }

  HttpClient http_;
  OsmApi api_;
  std::string geolocateUrl_;
  std::string token_;  // the logged-on user's access token; empty when nobody is logged on
};

class NetWorker {
 public:
  NetWorker(ReplyChannel& replies, const Config& config)
      : replies_(replies), service_(config, cancel_), thread_([this] { Loop(); }) {}

  // Cuts a running exchange short; requests still waiting get no reply (the channel is
  // closing).
  ~NetWorker() {
    {
      std::lock_guard lock(mutex_);
      stop_ = true;
    }
    cancel_ = true;
    wake_.notify_all();
    thread_.join();
  }

  // False, with the block left alone, when too many commands wait already.
  bool Submit(CDataControlCmdBlkNet& block) {
    {
      std::lock_guard lock(mutex_);
      if (waiting_.size() >= kMaxWaiting) return false;
      waiting_.push_back(std::move(block));
    }
    wake_.notify_all();
    return true;
  }

 private:
  void Loop() {
    for (;;) {
      CDataControlCmdBlkNet block;
      {
        std::unique_lock lock(mutex_);
        wake_.wait(lock, [this] { return stop_ || !waiting_.empty(); });
        if (stop_) return;
        block = std::move(waiting_.front());
        waiting_.pop_front();
      }
      block.nLastError = service_.Run(block);
      block.userInfo.szPassword.Empty();
      if (!cancel_) replies_.Send(block);
    }
  }

  ReplyChannel& replies_;
  std::atomic<bool> cancel_{false};
  NetService service_;
  std::mutex mutex_;
  std::condition_variable wake_;
  std::deque<CDataControlCmdBlkNet> waiting_;
  bool stop_ = false;
  std::thread thread_;  // last: starts once everything it uses is made
};

}  // namespace

bool WebServiceConnected(const Config& config) {
  if (!IsUsableServiceUrl(config.serviceUrl.ToUtf8())) return false;
  return g_reach.load() != Reach::kNo;
}

void RegisterNetHandlers(HandlerTable& table) {
  InitHttp();
  // Picks the fastest code; the hash and the wiping used here work without it too.
  [[maybe_unused]] const int sodium = sodium_init();
  // Made with the first request, ended (and joined) with the table.
  auto worker = std::make_shared<std::unique_ptr<NetWorker>>();
  table.Set(DC_CMD_NET, [worker](RequestContext& ctx) {
    CDataControlCmdBlkNet net;
    navmisc::datactrl::UnpackBlock(ctx.request, net);
    if (!*worker) *worker = std::make_unique<NetWorker>(ctx.replies, ctx.config);
    if ((*worker)->Submit(net)) return;
    net.nLastError = DC_ERR_NET_BUSY;
    net.userInfo.szPassword.Empty();
    ctx.replies.Send(net);
  });
}

}  // namespace gpsdc
