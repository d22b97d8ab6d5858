// Front functions that ask the data-control process about the web service. Each sends one
// block; the answer arrives later as a reply (message 1127) with the same nNetCmd and the
// outcome in nLastError. docs/web-service.md tells what the process does with each command.
#pragma once

#include <cstdint>

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/lists.h"

// Web-service commands (nNetCmd). The names are those the suite's messages use.
enum : int32_t {
  DC_NET_CMD_LOGIN = 1,
  DC_NET_CMD_GETUSERDATA = 2,
  DC_NET_CMD_CREATE_ACCOUNT = 3,
  DC_NET_CMD_UPLOAD_TRACK = 4,
  DC_NET_CMD_REMOVE_TRACK = 5,
  DC_NET_CMD_UPLOAD_PHOTO = 6,
  DC_NET_CMD_REMOVE_PHOTO = 7,
  DC_NET_CMD_ADD_PHOTO_TO_TRACK = 8,
  DC_NET_CMD_ADD_POI_TO_TRACK = 9,
  DC_NET_CMD_ADD_HTML_TO_TRACK = 10,
  DC_NET_CMD_REMOVE_MARKER = 11,
  DC_NET_CMD_ADD_FILE_TO_TRACK = 12,
  DC_NET_CMD_QUERY_TRACK_LIST = 13,
  DC_NET_CMD_DWLOAD_TRACK = 14,  // also the code of DC_NET_QueryTrack
  DC_NET_CMD_QUERY_PHOTO_LIST = 15,
  DC_NET_CMD_QUERY_TRACK_PHOTO_LIST = 16,
  // Codes for the queries whose block the caller builds.
  DC_NET_CMD_QUERY_PREDEF_CATEGORY = 17,
  DC_NET_CMD_QUERY_USERDEF_TAG = 18,
  DC_NET_CMD_TRACK_MARKER_LIST = 19,
  DC_NET_CMD_DEL_ALL_TRACK_FILES = 20,
  DC_NET_CMD_DEL_ALL_TRACK_MARKERS = 21,
  DC_NET_CMD_GET_FILE = 22,
  DC_NET_CMD_TRACK_INFO = 23,
  DC_NET_CMD_GET_GMAP_INFO = 24,
  DC_NET_CMD_QUERY_GPS_OFFSET = 25,
  DC_NET_CMD_QUERY_POSITION_BY_CELLID = 26,
};

// A user is logged on to the web service (this process only).
extern bool g_bLogon;

// Asks whether the web service can be reached (a connection-status block for source 2).
void DC_NET_QueryNetStatus();

// Logs on with a user name and password (the service's access token), each cut to 255
// characters.
void DC_NET_UserLogin(const CString& userName, const CString& password);
// Asks for the logged-on user's name and display name.
void DC_NET_GetUserData();
// Asks for the user's tracks. `n` travels in the track record's nPageId: at most that many of
// the newest tracks come back, all of them for 0.
void DC_NET_QueryTrackList(int n);
// Removes every file, or every marker, of a track (its identity cut to 254 characters).
void DC_NET_DelAllTrkFiles(const CString& trackId);
void DC_NET_DelAllTrkMarkers(const CString& trackId);
// Asks for the map offset at a position (degrees), carried in the track record's ptStart.
void DC_NET_QueryGpsOffset(double latitude, double longitude);
// Asks where the phone is from the mobile cells it sees: one description per cell,
// "MCC,MNC,LAC,CID[,SIGNAL_DBM[,RADIO]]", sent as the cell list.
void DC_NET_QueryPositionByCellId(CxStringList& cells);

// These send the caller's block as it is, nNetCmd included.
void DC_NET_CreateAccount(CDataControlCmdBlkNet& block);     // 3
void DC_NET_UploadTrack(CDataControlCmdBlkNet& block);       // 4
void DC_NET_RemoveTrack(CDataControlCmdBlkNet& block);       // 5
void DC_NET_UploadPhoto(CDataControlCmdBlkNet& block);       // 6
void DC_NET_RemovePhoto(CDataControlCmdBlkNet& block);       // 7
void DC_NET_AddTrackPhoto(CDataControlCmdBlkNet& block);     // 8
void DC_NET_AddTrackPOI(CDataControlCmdBlkNet& block);       // 9
void DC_NET_AddTrackHtml(CDataControlCmdBlkNet& block);      // 10
void DC_NET_RemoveMarker(CDataControlCmdBlkNet& block);      // 11
void DC_NET_AddTrackFile(CDataControlCmdBlkNet& block);      // 12
void DC_NET_QueryPreDefCategory(CDataControlCmdBlkNet& block);
void DC_NET_QueryUserDefTag(CDataControlCmdBlkNet& block);
void DC_NET_QueryTrack(CDataControlCmdBlkNet& block);
void DC_NET_TrackMarkerList(CDataControlCmdBlkNet& block);
void DC_NET_GetFile(CDataControlCmdBlkNet& block);
void DC_NET_TrackInfo(CDataControlCmdBlkNet& block);
void DC_NET_GetGMapInfo(CDataControlCmdBlkNet& block);

// The text the suite logs for a web-service reply, empty for a reply it does not log.
CString NetReplyLogText(const CDataControlCmdBlkNet& reply);
// Logs a reply: appends its text to `log` and, after a successful login, asks for the user's
// track list (DC_NET_QueryTrackList(0)).
void LogNetReply(const CDataControlCmdBlkNet& reply, CString& log);
