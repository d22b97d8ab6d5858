#include "navmisc/import/read_track_file.h"

#include <algorithm>
#include <cctype>
#include <cstring>
#include <memory>
#include <thread>
#include <vector>

#include "navmisc/import/detail/split_read.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/input_file.h"
#include "navmisc/platform/process.h"

namespace navmisc::import {
namespace {

// How often a converter that has not written anything yet is asked whether to go on.
constexpr int kConverterPollMs = 250;

std::string Lower(std::string_view s) {
  std::string out(s);
  for (char& c : out) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return out;
}

bool StartsWith(std::string_view s, std::string_view prefix) {
  return s.size() >= prefix.size() && s.substr(0, prefix.size()) == prefix;
}

// The local name of the root element of an XML document's first bytes, "" when not found.
std::string_view RootElement(std::string_view s) {
  size_t pos = 0;
  for (;;) {
    while (pos < s.size() && std::isspace(static_cast<unsigned char>(s[pos]))) ++pos;
    if (pos >= s.size() || s[pos] != '<') return {};
    const std::string_view rest = s.substr(pos);
    size_t end;
    if (StartsWith(rest, "<?")) {
      end = rest.find("?>");
      if (end == std::string_view::npos) return {};
      pos += end + 2;
    } else if (StartsWith(rest, "<!--")) {
      end = rest.find("-->");
      if (end == std::string_view::npos) return {};
      pos += end + 3;
    } else if (StartsWith(rest, "<!")) {
      end = rest.find('>');
      if (end == std::string_view::npos) return {};
      pos += end + 1;
    } else {
      size_t n = 1;
      while (n < rest.size() && !std::isspace(static_cast<unsigned char>(rest[n])) && rest[n] != '>' &&
             rest[n] != '/')
        ++n;
      std::string_view name = rest.substr(1, n - 1);
      if (const size_t colon = name.rfind(':'); colon != std::string_view::npos) name.remove_prefix(colon + 1);
      return name;
    }
  }
}

// A line that begins like an NMEA sentence: "$" (or "!"), five letters or digits, a comma.
bool LooksLikeNmea(std::string_view head) {
  int lines = 0;
  while (!head.empty() && lines < 16) {
    const size_t nl = head.find('\n');
    std::string_view line = head.substr(0, nl);
    while (!line.empty() && std::isspace(static_cast<unsigned char>(line.front()))) line.remove_prefix(1);
    if (!line.empty()) {
      ++lines;
      if (line.size() >= 7 && (line[0] == '$' || line[0] == '!') && line[6] == ',' &&
          std::all_of(line.begin() + 1, line.begin() + 6,
                      [](char c) { return std::isupper(static_cast<unsigned char>(c)) || std::isdigit(static_cast<unsigned char>(c)); }))
        return true;
    }
    if (nl == std::string_view::npos) break;
    head.remove_prefix(nl + 1);
  }
  return false;
}

FileFormat FromExtension(std::string_view fileName) {
  const size_t dot = fileName.rfind('.');
  if (dot == std::string_view::npos) return {};
  const std::string ext = Lower(fileName.substr(dot + 1));
  if (ext == "gpx") return {Format::kGpx, {}};
  if (ext == "tcx") return {Format::kTcx, {}};
  if (ext == "nmea" || ext == "nma" || ext == "nme") return {Format::kNmea, {}};
  static const struct {
    const char* ext;
    const char* format;
  } kConverted[] = {{"kml", "kml"},   {"fit", "garmin_fit"}, {"csv", "unicsv"}, {"igc", "igc"},
                    {"plt", "ozi"},   {"loc", "geo"},        {"gdb", "gdb"},    {"ov2", "tomtom"},
                    {"osm", "osm"},   {"gtm", "gtm"}};
  for (const auto& c : kConverted) {
    if (ext == c.ext) return {Format::kConverter, c.format};
  }
  return {};
}

// Counts the points on their way to the caller's sink, reports progress and stops on request.
class ProgressSink final : public ImportSink {
 public:
  ProgressSink(ImportSink& next, const ReadFileOptions& options, ReadProgress& progress)
      : next_(next), options_(options), progress_(progress) {}
  bool Document(const std::string& n, const std::string& d) override { return next_.Document(n, d); }
  bool BeginTrack(const ImportTrack& t) override { return next_.BeginTrack(t); }
  bool BeginSegment() override { return next_.BeginSegment(); }
  bool EndTrack() override { return next_.EndTrack(); }
  bool Marker(const ImportMarker& m) override { return GoOn() && next_.Marker(m); }
  bool Point(const ImportPoint& p) override {
    if (!GoOn() || !next_.Point(p)) return false;
    if (++progress_.points % kProgressPoints == 0) return Report();
    return true;
  }
  bool GoOn() const { return !options_.keepGoing || *options_.keepGoing; }
  bool Report() { return !options_.progress || options_.progress(progress_); }

 private:
  ImportSink& next_;
  const ReadFileOptions& options_;
  ReadProgress& progress_;
};

ReadStatus OpenFailure(InputFile::OpenResult r, const InputFile& file) {
  if (r == InputFile::OpenResult::kNotRegular) {
    return {DC_ERR_IMPORT_NOT_A_FILE, "not a regular file (" + file.error() + ")"};
  }
  return {DC_ERR_IMPORT_OPEN, "cannot open the file: " + file.error()};
}

// Streams the converter's GPX output through the GPX reader.
ReadStatus Convert(InputFile& file, const FileFormat& format, ProgressSink& sink,
                   const ReadFileOptions& options, ReadProgress& progress, ReadCounts& counts) {
  const std::string program = FindProgram(options.converter.empty() ? "gpsbabel" : options.converter);
  if (program.empty()) {
    return {DC_ERR_IMPORT_NO_CONVERTER,
            "reading " + format.converterFormat + " files needs gpsbabel, which is not installed"};
  }
  if (!file.Rewind()) return {DC_ERR_IMPORT_READ, "cannot read the file: " + file.error()};
  // The converter reads the very file that was opened and checked here, through its standard
  // input: nothing can be swapped in under the name in between.
  ChildProcess child;
  SpawnOptions spawn;
  spawn.stdinFd = file.descriptor();
  spawn.captureOutput = true;
  if (!child.Start({program, "-i", format.converterFormat, "-f", "/dev/stdin", "-o", "gpx,gpxver=1.1",
                    "-F", "-"},
                   spawn)) {
    return {DC_ERR_IMPORT_NO_CONVERTER, "cannot start gpsbabel: " + child.error()};
  }
  auto reader = MakeGpxReader(sink);
  std::vector<char> buffer(kReadPiece);
  uint64_t produced = 0;
  for (;;) {
    const ssize_t n = child.ReadOutput(buffer.data(), buffer.size(), kConverterPollMs);
    if (n == ChildProcess::kTimedOut) {
      if (!sink.GoOn() || !sink.Report()) return {DC_ERR_IMPORT_CANCELLED, ""};
      continue;
    }
    if (n < 0) return {DC_ERR_IMPORT_CONVERTER, "cannot read gpsbabel's output"};
    if (n == 0) break;
    produced += static_cast<uint64_t>(n);
    progress.bytesRead = produced;
    if (!reader->Feed(buffer.data(), static_cast<size_t>(n))) break;
  }
  if (reader->status().ok()) {
    const int status = child.Wait();
    if (status != 0) {
      std::string why = child.errorOutput();
      why = why.substr(0, why.find('\n'));
      return {DC_ERR_IMPORT_CONVERTER,
              "gpsbabel -i " + format.converterFormat + " failed (exit status " + std::to_string(status) +
                  (why.empty() ? ")" : "): " + why)};
    }
    if (produced == 0) return {DC_ERR_IMPORT_NO_POINTS, "gpsbabel found nothing to import"};
    reader->Finish();
  }
  counts = reader->counts();
  return reader->status();
}

// A long GPX or TCX file on two cores (detail/split_read.h). False when it is to be read in one
// piece; nothing has been read then but `head`, its first bytes.
bool ReadInParts(const InputFile& file, std::string_view head, const ReadFileOptions& options,
                 ProgressSink& counted, ReadProgress& progress, ReadFileResult& result) {
  const Format format = result.format.format;
  if ((format != Format::kGpx && format != Format::kTcx) || file.size() < options.splitFrom ||
      std::thread::hardware_concurrency() < 2)
    return false;
  detail::SplitInput input;
  input.size = file.size();
  input.head = head;
  input.readAt = [&file](uint64_t offset, char* out, size_t size, std::string& error) -> long {
    return file.ReadAt(offset, out, size, error);
  };
  // After a second part that failed, the first reads its bytes again: the count never goes back.
  auto fed = [&progress](uint64_t at) { progress.bytesRead = std::max(progress.bytesRead, at); };
  // The first part's thread also hands every point to the sink: it takes the smaller part (for
  // an import into a trip, 7/16 came out quickest of the cuts tried between 1/3 and 1/2).
  detail::SplitOutcome split;
  if (!detail::ReadInTwoParts(input, file.size() / 16 * 7,
                              format == Format::kGpx ? detail::NewGpxReader : detail::NewTcxReader, counted,
                              fed, split))
    return false;
  result.status = split.status;
  result.counts = split.counts;
  result.parts = split.cut ? 2 : 1;
  return true;
}

// The verdicts every reading ends with.
ReadFileResult Conclude(ReadFileResult result, ProgressSink& counted, const ReadProgress& progress) {
  if (result.status.ok() && result.counts.points == 0 && result.counts.markers == 0)
    result.status = {DC_ERR_IMPORT_NO_POINTS, "the file holds no track point and no waypoint"};
  if (result.status.ok() && !counted.Report()) result.status = {DC_ERR_IMPORT_CANCELLED, ""};
  if (result.status.code == DC_ERR_IMPORT_CANCELLED) {
    result.status.message = "stopped on request after " + std::to_string(progress.points) + " points";
  }
  return result;
}

}  // namespace

bool ParseFormatName(std::string_view name, FileFormat& out) {
  const std::string lower = Lower(name);
  if (lower.empty() || lower == "auto") out = {Format::kAuto, {}};
  else if (lower == "gpx") out = {Format::kGpx, {}};
  else if (lower == "tcx") out = {Format::kTcx, {}};
  else if (lower == "nmea") out = {Format::kNmea, {}};
  else {
    // A gpsbabel format with its options: "kml" or "unicsv,fields=lat+lon". It travels as one
    // argument, so only its own syntax is allowed, never a leading "-".
    if (name.size() > 200 || !std::isalnum(static_cast<unsigned char>(name[0]))) return false;
    for (char c : name) {
      if (!(std::isalnum(static_cast<unsigned char>(c)) || c == '_' || c == ',' || c == '=' || c == '.' ||
            c == '+' || c == '-'))
        return false;
    }
    out = {Format::kConverter, std::string(name)};
  }
  return true;
}

std::string FormatName(const FileFormat& format) {
  switch (format.format) {
    case Format::kAuto: return "auto";
    case Format::kGpx: return "gpx";
    case Format::kTcx: return "tcx";
    case Format::kNmea: return "nmea";
    case Format::kConverter: return format.converterFormat;
  }
  return "auto";
}

FileFormat DetectFormat(std::string_view head, std::string_view fileName) {
  if (StartsWith(head, "\xEF\xBB\xBF")) head.remove_prefix(3);
  const std::string_view root = RootElement(head);
  if (root == "gpx") return {Format::kGpx, {}};
  if (root == "TrainingCenterDatabase") return {Format::kTcx, {}};
  if (root == "kml") return {Format::kConverter, "kml"};
  if (LooksLikeNmea(head)) return {Format::kNmea, {}};
  return FromExtension(fileName);
}

ReadFileResult ReadTrackFile(const wchar_t* path, ImportSink& sink, const ReadFileOptions& options) {
  ReadFileResult result;
  result.format = options.format;
  InputFile file;
  if (const auto r = file.Open(path); r != InputFile::OpenResult::kOk) {
    result.status = OpenFailure(r, file);
    return result;
  }
  ReadProgress progress;
  progress.bytesTotal = file.size();
  std::vector<char> buffer(kReadPiece);
  ssize_t n = file.Read(buffer.data(), buffer.size());
  if (n < 0) {
    result.status = {DC_ERR_IMPORT_READ, "cannot read the file: " + file.error()};
    return result;
  }
  if (n == 0) {
    result.status = {DC_ERR_IMPORT_EMPTY, "the file is empty"};
    return result;
  }
  if (result.format.format == Format::kAuto) {
    result.format = DetectFormat(std::string_view(buffer.data(), static_cast<size_t>(n)),
                                 PathFileName(path).ToUtf8());
    if (result.format.format == Format::kAuto) {
      result.status = {DC_ERR_IMPORT_FORMAT,
                       "cannot tell the format of the file (GPX, TCX, NMEA or a format gpsbabel "
                       "reads); name it"};
      return result;
    }
  }

  ProgressSink counted(sink, options, progress);
  if (result.format.format == Format::kConverter) {
    result.status = Convert(file, result.format, counted, options, progress, result.counts);
  } else {
    if (ReadInParts(file, std::string_view(buffer.data(), static_cast<size_t>(n)), options, counted, progress,
                    result))
      return Conclude(result, counted, progress);
    std::unique_ptr<TrackReader> reader;
    switch (result.format.format) {
      case Format::kGpx: reader = MakeGpxReader(counted); break;
      case Format::kTcx: reader = MakeTcxReader(counted); break;
      default: reader = MakeNmeaReader(counted, options.nmea); break;
    }
    // The bytes read for the format come first, then the rest of the file, in the pieces the
    // reader asks for.
    size_t served = 0;
    bool readFailed = false;
    reader->ReadFrom([&](char* out, size_t size) -> long {
      if (served == static_cast<size_t>(n)) {
        n = file.Read(buffer.data(), buffer.size());
        served = 0;
        if (n < 0) readFailed = true;
        if (n <= 0) return n < 0 ? -1 : 0;
      }
      const size_t take = std::min(size, static_cast<size_t>(n) - served);
      std::memcpy(out, buffer.data() + served, take);
      served += take;
      progress.bytesRead += take;
      return static_cast<long>(take);
    });
    if (readFailed) {
      result.status = {DC_ERR_IMPORT_READ, "cannot read the file: " + file.error()};
      return result;
    }
    result.status = reader->status();
    result.counts = reader->counts();
  }
  return Conclude(result, counted, progress);
}

}  // namespace navmisc::import
