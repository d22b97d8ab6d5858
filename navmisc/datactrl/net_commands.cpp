#include "navmisc/datactrl/net_commands.h"

#include <string>

#include "navmisc/datactrl/request_queue.h"

bool g_bLogon = false;

namespace {

constexpr int kUserTextChars = 255;
constexpr int kTrackIdChars = 254;

// Every front function that builds its own block starts from an empty one (all texts and
// lists empty, no error); the block, with everything it owns, goes once it is sent.
CDataControlCmdBlkNet Fresh(int32_t netCmd) {
  CDataControlCmdBlkNet block;
  block.nNetCmd = netCmd;
  return block;
}

void SendForTrack(int32_t netCmd, const CString& trackId) {
  CDataControlCmdBlkNet block = Fresh(netCmd);
  block.trackInfo.szTrackId = trackId.Left(kTrackIdChars);
  InsertRequestMessage(block);
}

}  // namespace

void DC_NET_QueryNetStatus() {
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = DC_SOURCE_NET;
  InsertRequestMessage(status);
}

void DC_NET_UserLogin(const CString& userName, const CString& password) {
  CDataControlCmdBlkNet block = Fresh(DC_NET_CMD_LOGIN);
  block.userInfo.szUserName = userName.Left(kUserTextChars);
  block.userInfo.szPassword = password.Left(kUserTextChars);
  InsertRequestMessage(block);
}

void DC_NET_GetUserData() { InsertRequestMessage(Fresh(DC_NET_CMD_GETUSERDATA)); }

void DC_NET_QueryTrackList(int n) {
  CDataControlCmdBlkNet block = Fresh(DC_NET_CMD_QUERY_TRACK_LIST);
  block.trackInfo.nPageId = n;
  InsertRequestMessage(block);
}

void DC_NET_DelAllTrkFiles(const CString& trackId) {
  SendForTrack(DC_NET_CMD_DEL_ALL_TRACK_FILES, trackId);
}

void DC_NET_DelAllTrkMarkers(const CString& trackId) {
  SendForTrack(DC_NET_CMD_DEL_ALL_TRACK_MARKERS, trackId);
}

void DC_NET_QueryGpsOffset(double latitude, double longitude) {
  CDataControlCmdBlkNet block = Fresh(DC_NET_CMD_QUERY_GPS_OFFSET);
  block.trackInfo.ptStart.dLatitude = latitude;
  block.trackInfo.ptStart.dLongitude = longitude;
  InsertRequestMessage(block);
}

void DC_NET_QueryPositionByCellId(CxStringList& cells) {
  CDataControlCmdBlkNet block = Fresh(DC_NET_CMD_QUERY_POSITION_BY_CELLID);
  block.cellInfo.CellInfo.assign(cells.begin(), cells.end());
  InsertRequestMessage(block);
}

void DC_NET_CreateAccount(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_UploadTrack(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_RemoveTrack(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_UploadPhoto(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_RemovePhoto(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_AddTrackPhoto(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_AddTrackPOI(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_AddTrackHtml(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_RemoveMarker(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_AddTrackFile(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_QueryPreDefCategory(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_QueryUserDefTag(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_QueryTrack(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_TrackMarkerList(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_GetFile(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_TrackInfo(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }
void DC_NET_GetGMapInfo(CDataControlCmdBlkNet& block) { InsertRequestMessage(block); }

namespace {

// "NAME OK" or "NAME Failed (Error=%d)", the form most replies are logged in.
CString OkOrFailed(const wchar_t* name, int32_t error) {
  if (error == 0) return CString(name) + L" OK";
  return CString(name) + L" Failed (Error=" + std::to_wstring(error).c_str() + L")";
}

CString FailedText(const wchar_t* prefix, int32_t error, const wchar_t* suffix = L")") {
  return CString(prefix) + std::to_wstring(error).c_str() + suffix;
}

}  // namespace

CString NetReplyLogText(const CDataControlCmdBlkNet& r) {
  const int32_t e = r.nLastError;
  const DC_NET_USER_INFO& user = r.userInfo;
  switch (r.nNetCmd) {
    case DC_NET_CMD_LOGIN:
      if (e) return FailedText(L"Failed to DC_NET_CMD_LOGIN. (Error=", e);
      return L"\nUid = " + user.szUid + L", Token = " + user.szToken;
    case DC_NET_CMD_GETUSERDATA:
      if (e) return OkOrFailed(L"DC_NET_CMD_GETUSERDATA", e);
      return L"UserName = [" + user.szUserName + L"]\r\nDisplayName = [" + user.szDisplayName + L"]";
    case DC_NET_CMD_CREATE_ACCOUNT:
      if (e) return OkOrFailed(L"DC_NET_CMD_CREATE_ACCOUNT", e);
      return L"DC_NET_CMD_CREATE_ACCOUNT OK\r\nUserName = [" + user.szUserName +
             L"]\r\nDisplayName = [" + user.szDisplayName + L"]";
    case DC_NET_CMD_UPLOAD_TRACK: return OkOrFailed(L"DC_NET_CMD_UPLOAD_TRACK", e);
    case DC_NET_CMD_REMOVE_TRACK: return OkOrFailed(L"DC_NET_CMD_REMOVE_TRACK", e);
    case DC_NET_CMD_UPLOAD_PHOTO: return OkOrFailed(L"DC_NET_CMD_UPLOAD_PHOTO", e);
    case DC_NET_CMD_REMOVE_PHOTO: return e ? CString() : CString(L"DC_NET_CMD_REMOVE_PHOTO OK");
    case DC_NET_CMD_ADD_PHOTO_TO_TRACK: {
      // A failure is logged with the upload's text; the suite has always done so.
      if (e) return OkOrFailed(L"DC_NET_CMD_UPLOAD_PHOTO", e);
      CString text = L"DC_NET_CMD_ADD_PHOTO_TO_TRACK OK";
      for (const DC_NET_PHOTO_INFO& photo : r.photoInfo)
        text += L"\r\n Add To Track [" + photo.szTrackId + L"], Id = [" + photo.szTrackPhotoId + L"]";
      return text;
    }
    case DC_NET_CMD_ADD_POI_TO_TRACK: return OkOrFailed(L"DC_NET_CMD_ADD_POI_TO_TRACK", e);
    case DC_NET_CMD_ADD_HTML_TO_TRACK: return OkOrFailed(L"DC_NET_CMD_ADD_HTML_TO_TRACK", e);
    case DC_NET_CMD_REMOVE_MARKER: return OkOrFailed(L"DC_NET_CMD_REMOVE_MARKER", e);
    case DC_NET_CMD_ADD_FILE_TO_TRACK: return OkOrFailed(L"DC_NET_CMD_ADD_FILE_TO_TRACK", e);
    case DC_NET_CMD_DWLOAD_TRACK:
      return e ? OkOrFailed(L"DC_NET_CMD_DWLOAD_TRACK", e) : CString();
    case DC_NET_CMD_QUERY_PHOTO_LIST:
      // Both texts begin with a blank, and the failure names no command: kept as the suite
      // logs them.
      return e ? FailedText(L" Failed (Error=", e) : CString(L" DC_NET_CMD_QUERY_PHOTO_LIST OK");
    case DC_NET_CMD_QUERY_TRACK_PHOTO_LIST:
      return OkOrFailed(L"DC_NET_CMD_QUERY_TRACK_PHOTO_LIST", e);
    default:
      return CString();
  }
}

void LogNetReply(const CDataControlCmdBlkNet& reply, CString& log) {
  log += NetReplyLogText(reply);
  if (reply.nNetCmd == DC_NET_CMD_LOGIN && reply.nLastError == 0) DC_NET_QueryTrackList(0);
}
