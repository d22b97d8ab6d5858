// File commands (kind 3): the import of a track file into a trip (docs/track-import.md, "The
// import command"). The reply is the request's block with the outcome in nLastError and in its
// track record.
#include <algorithm>
#include <cmath>
#include <cstdio>

#include "handlers.h"
#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/trip_import.h"
#include "navmisc/platform/shared_globals.h"
#include "navmisc/records/user_profile.h"
#include "progress.h"

namespace gpsdc {
namespace {

using namespace navmisc::import;

// A date-time of the block as seconds since 1970; kNoTime when unset (zero) or not valid.
int64_t CutTime(const COleDateTime& t) {
  if (t.m_dt == 0.0 || t.GetStatus() != COleDateTime::valid) return kNoTime;
  const long s = CovertOleDateTimeToTimeT(t);
  return s < 0 ? kNoTime : s;
}

DC_NET_POINT_INFO ReplyPoint(const ImportPoint& p) {
  DC_NET_POINT_INFO out;
  if (p.time != kNoTime) out.oleTime = CovertTimeTToOleDateTime(static_cast<long>(p.time));
  out.dLatitude = p.latitude;
  out.dLongitude = p.longitude;
  out.dAltitude = p.hasAltitude ? p.altitude : 0.0;
  out.nSpeed = p.speed >= 0 ? static_cast<int32_t>(std::llround(p.speed * 3600.0)) : 0;
  return out;
}

// KiB, for counters that must fit 32 bits whatever the file's size.
int32_t KiB(uint64_t bytes) { return static_cast<int32_t>(std::min<uint64_t>((bytes + 1023) / 1024, INT32_MAX)); }

int32_t Import(CDataControlCmdBlkFile& block, RequestContext& ctx) {
  DC_NET_TRACK_INFO& info = block.trackInfo;
  TripImportOptions options;
  options.appType = static_cast<GPS_APP_PROG_TYPE>(info.nMode != 0 ? info.nMode : static_cast<int32_t>(g_nProductId));
  options.name = info.szSubject;
  options.description = info.szDesc;
  options.timeZone = block.nTimeZone;
  options.cutStart = CutTime(block.tPointStartTime);
  options.cutEnd = CutTime(block.tPointEndTime);
  ReadFileOptions read;
  const std::string format = info.szTrackData.ToUtf8();
  // The reply keeps the request's texts apart from what the import fills in.
  info = DC_NET_TRACK_INFO{};
  info.nMode = options.appType;
  if (!ParseFormatName(format, read.format)) {
    info.szMetaInfo = CString::FromUtf8("\"" + format + "\" is not a file format name");
    return DC_ERR_IMPORT_FORMAT;
  }

  // A new trip takes its page template from its application's profile: read it as it is now.
  if (USER_MAP_INFO* profile = GetUserMapInfo(options.appType)) profile->ReadInfo();
  TripImporter importer(options);
  ProgressReporter progress(ctx.replies, DC_SOURCE_DEVICE, std::chrono::milliseconds(0));
  ReadProgress last;
  read.progress = [&](const ReadProgress& p) {
    last = p;
    progress.Report(KiB(p.bytesTotal), KiB(p.bytesRead), 0, static_cast<int32_t>(importer.keptPoints()));
    return !ctx.stopRequested();
  };
  ReadStatus status = importer.Begin();
  ReadFileResult result;
  if (status.ok()) {
    result = importer.AddFile(block.szFilePath, read);
    status = result.status;
  }
  if (status.ok()) status = importer.Commit();
  if (!status.ok()) {
    info.szMetaInfo = CString::FromUtf8(status.message);
    return status.code;
  }
  const int32_t points = static_cast<int32_t>(std::min<uint64_t>(importer.keptPoints(), INT32_MAX));
  progress.Report(KiB(last.bytesTotal), KiB(last.bytesTotal), points, points);
  info.szTrackId = importer.tripId();
  info.szSubject = importer.tripName();
  info.ptStart = ReplyPoint(importer.firstPoint());
  info.ptEnd = ReplyPoint(importer.lastPoint());
  char summary[200];
  std::snprintf(summary, sizeof summary, "format=%s tracks=%d points=%llu markers=%llu cut=%llu skipped=%llu",
                FormatName(result.format).c_str(), importer.tracks(),
                static_cast<unsigned long long>(importer.keptPoints()),
                static_cast<unsigned long long>(importer.keptMarkers()),
                static_cast<unsigned long long>(importer.cutAway()),
                static_cast<unsigned long long>(result.counts.skipped));
  info.szMetaInfo = CString::FromUtf8(summary);
  return DC_ERR_NONE;
}

int32_t RunFileCommand(CDataControlCmdBlkFile& block, RequestContext& ctx) {
  switch (block.nFileCmd) {
    case DC_FILE_IMPORT:
      return Import(block, ctx);
    default:
      return DC_ERR_UNKNOWN_COMMAND;
  }
}

}  // namespace

void RegisterFileHandlers(HandlerTable& table) {
  table.Set(DC_CMD_FILE, [](RequestContext& ctx) {
    CDataControlCmdBlkFile file;
    AnswerInPlace(ctx, file, RunFileCommand);
  });
}

}  // namespace gpsdc
