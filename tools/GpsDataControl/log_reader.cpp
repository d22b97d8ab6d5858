#include "log_reader.h"

#include <algorithm>
#include <chrono>
#include <memory>

#include "navmisc/datactrl/dc_errors.h"
#include "navmisc/datactrl/device_errors.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/trip_import.h"
#include "progress.h"

namespace gpsdc {
namespace {

using namespace navmisc::import;

// KiB, so that the counters fit 32 bits whatever the logs' size.
int32_t KiB(uint64_t bytes) {
  return static_cast<int32_t>(std::min<uint64_t>((bytes + 1023) / 1024, INT32_MAX));
}

}  // namespace

LogReadResult ReadLoggerLogs(const LoggerFolder& logger, GPS_APP_PROG_TYPE app,
                             ReplyChannel& replies, const std::function<bool()>& stopRequested) {
  LogReadResult result;
  const std::vector<LogFile> logs = logger.Logs();
  uint64_t total = 0;
  for (const LogFile& log : logs) total += static_cast<uint64_t>(log.size);
  const int32_t files = static_cast<int32_t>(logs.size());
  // Progress: KiB of the logs read, and logs done. Every block goes (one per log and one per
  // thousand points), so the interval is zero.
  ProgressReporter progress(replies, DC_SOURCE_DEVICE, std::chrono::milliseconds(0));
  // The trips stay uncommitted until every log has been read: destroying an importer removes
  // its trip, so a stop or a failure leaves nothing behind.
  std::vector<std::unique_ptr<TripImporter>> trips;
  uint64_t done = 0;
  bool gone = false;
  for (const LogFile& log : logs) {
    progress.Report(KiB(total), KiB(done), files, static_cast<int32_t>(result.read.size()));
    TripImportOptions options;
    options.appType = app;  // the logs' times are UTC
    auto trip = std::make_unique<TripImporter>(options);
    ReadStatus status = trip->Begin();
    if (status.ok()) {
      ReadFileOptions read;
      read.format.format = log.format == LogFormat::kGpx ? Format::kGpx : Format::kNmea;
      read.progress = [&](const ReadProgress& p) {
        progress.Report(KiB(total), KiB(done + p.bytesRead), files,
                        static_cast<int32_t>(result.read.size()));
        // An unplugged logger leaves the open file readable to its end; the read stops anyway.
        gone = !logger.StillThere();
        return !gone && !stopRequested();
      };
      status = trip->AddFile(log.path, read).status;
    }
    // A log that vanished, or one that cannot be opened any more, may mean the logger is gone.
    if (gone || (!status.ok() && !logger.StillThere()))
      status = {DC_ERR_DEVICE_GONE, "the logger went away"};
    if (status.code == DC_ERR_IMPORT_EMPTY || status.code == DC_ERR_IMPORT_NO_POINTS) {
      status = {};  // nothing to read, nothing lost
      trip.reset();
    }
    if (!status.ok()) {
      result.error = status.code;
      result.message = log.name.ToUtf8() + ": " + status.message;
      result.read.clear();
      return result;  // `trips` removes every trip of this read
    }
    if (trip) {
      for (const ImportPoint* p : {&trip->firstPoint(), &trip->lastPoint()}) {
        if (p->time == kNoTime) continue;
        const long t = static_cast<long>(p->time);
        result.firstTime = result.firstTime < 0 ? t : std::min(result.firstTime, t);
        result.lastTime = std::max(result.lastTime, t);
      }
      trips.push_back(std::move(trip));
    }
    result.read.push_back(log);
    done += static_cast<uint64_t>(log.size);
  }
  for (auto& trip : trips) {
    const ReadStatus status = trip->Commit();
    if (!status.ok()) {
      // The trips committed before stay, each of them whole.
      result.error = status.code;
      result.message = status.message;
      result.read.clear();
      return result;
    }
    ++result.trips;
  }
  if (files > 0) progress.Report(KiB(total), KiB(total), files, files);
  return result;
}

}  // namespace gpsdc
