// Reading a track file into a sink: the file is checked (a regular file, not empty), its format
// named or recognised, and it streams through the reader of its format. Formats without a
// reader of their own go through gpsbabel, when it is installed, converted to GPX in a pipe.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

#include "navmisc/import/track_reader.h"

namespace navmisc::import {

enum class Format {
  kAuto,       // recognised from the content, then the file name's extension
  kGpx,
  kTcx,
  kNmea,
  kConverter,  // gpsbabel's input format `converterFormat`
};

struct FileFormat {
  Format format = Format::kAuto;
  std::string converterFormat;  // for kConverter: gpsbabel's name ("kml", "garmin_fit", ...)
};

// "gpx", "tcx", "nmea", "" or "auto"; any other name is a gpsbabel input format (letters,
// digits and "_", optionally followed by ",option=value" pairs). False for names that cannot be
// a format.
bool ParseFormatName(std::string_view name, FileFormat& out);
// The name ParseFormatName reads back.
std::string FormatName(const FileFormat& format);

// Recognises the format of a document from its first bytes and its file name: GPX and TCX by
// their root element, NMEA by its first sentence, a KML root or a known extension as a gpsbabel
// format. Format::kAuto when nothing fits.
FileFormat DetectFormat(std::string_view head, std::string_view fileName);

struct ReadProgress {
  uint64_t bytesRead = 0;   // of the file (for a converted file: of gpsbabel's output)
  uint64_t bytesTotal = 0;  // the file's size; 0 when unknown (a converted file)
  uint64_t points = 0;
};

struct ReadFileOptions {
  FileFormat format;
  NmeaOptions nmea;
  // Called after every kProgressPoints points and once at the end; returning false stops the
  // reading between two points (DC_ERR_IMPORT_CANCELLED).
  std::function<bool(const ReadProgress&)> progress;
  // Cleared by another part of the caller: stops the reading between two points.
  const bool* keepGoing = nullptr;
  // The gpsbabel program; empty: "gpsbabel" on PATH.
  std::string converter;
  // GPX and TCX files of at least this many bytes are read in two parts at once, on two cores,
  // when the machine has them and the file has a place to cut (between two track points).
  uint64_t splitFrom = 8u << 20;
};

inline constexpr uint64_t kProgressPoints = 1000;

struct ReadFileResult {
  ReadStatus status;
  ReadCounts counts;
  FileFormat format;  // the format the file was read as
  int parts = 1;      // 2 when the file was read in two parts at once
};

// Reads `path` into `sink`. A file without any point or marker fails with
// DC_ERR_IMPORT_NO_POINTS. On failure the sink may have received part of the file; the caller
// drops it.
ReadFileResult ReadTrackFile(const wchar_t* path, ImportSink& sink, const ReadFileOptions& options);

}  // namespace navmisc::import
