// NMEA 0183 logs: one track of the fixes, from GGA (position, altitude, fix quality), RMC
// (position, speed, course, date, status) and VTG (speed, course); ZDA gives the date too, and
// WPL waypoints become markers. Sentences that share a time of day describe one fix and make one
// point.
#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstring>
#include <deque>
#include <string>
#include <string_view>

#include "navmisc/import/detail/values.h"
#include "navmisc/import/import_errors.h"
#include "navmisc/import/track_reader.h"

namespace navmisc::import {
namespace {

constexpr size_t kMaxLine = 256;          // NMEA allows 82; proprietary sentences run longer
constexpr uint64_t kGiveUpAfter = 4u << 20;  // bytes without one sentence before the log fails
constexpr size_t kMaxUndated = 4096;      // fixes held back while the date is not yet known
constexpr int64_t kDayMs = 86400000;
constexpr double kKnot = 1852.0 / 3600.0;  // metres per second

int HexDigit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return -1;
}

bool ParseDouble(std::string_view s, double& out) {
  if (s.empty()) return false;
  const auto [end, ec] = std::from_chars(s.data(), s.data() + s.size(), out);
  return ec == std::errc() && end == s.data() + s.size() && std::isfinite(out);
}

bool ParseDigits(std::string_view s, int& out) {
  if (s.empty() || s.size() > 4) return false;
  int v = 0;
  for (char c : s) {
    if (c < '0' || c > '9') return false;
    v = v * 10 + (c - '0');
  }
  out = v;
  return true;
}

// "hhmmss" or "hhmmss.sss" as milliseconds of the day.
bool ParseTimeOfDay(std::string_view s, int64_t& ms) {
  if (s.size() < 6) return false;
  int h, m, sec;
  if (!ParseDigits(s.substr(0, 2), h) || !ParseDigits(s.substr(2, 2), m) ||
      !ParseDigits(s.substr(4, 2), sec) || h > 23 || m > 59 || sec > 60)
    return false;
  int64_t frac = 0;
  if (s.size() > 6) {
    if (s[6] != '.' || s.size() == 7) return false;
    int64_t scale = 100;
    for (char c : s.substr(7)) {
      if (c < '0' || c > '9') return false;
      frac += (c - '0') * scale;
      scale /= 10;
    }
  }
  ms = (h * 3600 + m * 60 + sec) * 1000LL + frac;
  return true;
}

// "ddmm.mmmm" with "N"/"S" (or "dddmm.mmmm" with "E"/"W") as signed degrees.
enum class Coord { kEmpty, kOk, kBad };
Coord ParseCoordinate(std::string_view value, std::string_view hemi, bool latitude, double& out) {
  if (value.empty() && hemi.empty()) return Coord::kEmpty;
  double raw;
  if (!ParseDouble(value, raw) || raw < 0 || hemi.size() != 1) return Coord::kBad;
  const double degrees = std::floor(raw / 100.0);
  const double minutes = raw - degrees * 100.0;
  if (minutes >= 60.0) return Coord::kBad;
  double v = degrees + minutes / 60.0;
  const char h = hemi[0];
  if (latitude ? (h != 'N' && h != 'S') : (h != 'E' && h != 'W')) return Coord::kBad;
  if (h == 'S' || h == 'W') v = -v;
  if (latitude ? !detail::LatitudeInRange(v) : !detail::LongitudeInRange(v)) return Coord::kBad;
  out = v;
  return Coord::kOk;
}

// The UTC midnight of a day, month and year (two digits: 80..99 are 1980..1999).
bool DayStart(int day, int month, int year, int64_t& seconds) {
  if (year < 100) year += year < 80 ? 2000 : 1900;
  if (month < 1 || month > 12 || day < 1 ||
      static_cast<unsigned>(day) > detail::DaysInMonth(year, static_cast<unsigned>(month)))
    return false;
  seconds = detail::DaysFromCivil(year, static_cast<unsigned>(month), static_cast<unsigned>(day)) * 86400;
  return true;
}

// What the sentences of one time of day say.
struct Fix {
  int64_t tod = -1;       // milliseconds of the day
  int64_t day = kNoTime;  // UTC midnight, seconds; kNoTime while unknown
  bool ggaPos = false, rmcPos = false;
  double ggaLat = 0, ggaLon = 0, rmcLat = 0, rmcLon = 0;
  double altitude = 0;
  bool hasAltitude = false;
  double speed = -1, course = -1;
};

class NmeaReader final : public TrackReader {
 public:
  NmeaReader(ImportSink& sink, const NmeaOptions& options) : sink_(sink), options_(options) {}
  bool Feed(const char* data, size_t size) override;
  bool Finish() override;

 private:
  enum class Outcome { kUsed, kIgnored, kChecksum, kValue, kGarbage };
  // The line gathered in line_ is complete.
  void EndLine();
  void Line(std::string_view line);
  Outcome Sentence(std::string_view line);
  Outcome Gga(const std::array<std::string_view, 24>& f, size_t n);
  Outcome Rmc(const std::array<std::string_view, 24>& f, size_t n);
  Outcome Vtg(const std::array<std::string_view, 24>& f, size_t n);
  Outcome Zda(const std::array<std::string_view, 24>& f, size_t n);
  Outcome Wpl(const std::array<std::string_view, 24>& f, size_t n);
  // The fix of time of day `tod`, starting a new one (and finishing the last) when it changes.
  Fix& FixAt(int64_t tod);
  void SetDate(int64_t day);
  void Flush();
  void Emit(const Fix& fix);
  bool Deliver(const Fix& fix, int64_t day);
  void ResolveUndated(int64_t dayOfLast, int64_t todOfLast);
  void ResolveUndatedForward(int64_t firstDay);

  ImportSink& sink_;
  NmeaOptions options_;
  std::string line_;
  bool overlong_ = false;
  uint64_t bytes_ = 0;
  uint64_t line_number_ = 0;
  bool stopped_ = false;

  Fix fix_;                     // the fix being gathered
  int64_t day_ = kNoTime;       // the current date (UTC midnight, seconds)
  int64_t last_tod_ = -1;       // time of day of the latest fix
  std::deque<Fix> undated_;     // fixes waiting for a date
  bool track_open_ = false;

  uint64_t sentences_ = 0;      // sentences with a good (or no) checksum
  uint64_t bad_checksum_ = 0;
  uint64_t bad_value_ = 0;
  uint64_t garbage_ = 0;
  uint64_t overlong_lines_ = 0;
  uint64_t undated_fixes_ = 0;  // fixes dropped for want of a date
  uint64_t first_bad_line_ = 0;
};

bool NmeaReader::Feed(const char* data, size_t size) {
  if (failed()) return false;
  const char* end = data + size;
  while (data < end) {
    const char* nl = static_cast<const char*>(std::memchr(data, '\n', static_cast<size_t>(end - data)));
    const char* stop = nl ? nl : end;
    const size_t n = static_cast<size_t>(stop - data);
    // A line longer than any sentence is dropped as it streams past, never held.
    if (!overlong_) {
      if (line_.size() + n > kMaxLine) {
        overlong_ = true;
        line_.clear();
      } else {
        line_.append(data, n);
      }
    }
    bytes_ += n + (nl ? 1 : 0);
    data = nl ? nl + 1 : end;
    if (!nl) break;
    EndLine();
    if (stopped_) return Fail(DC_ERR_IMPORT_CANCELLED, "stopped");
    if (failed()) return false;
  }
  if (sentences_ == 0 && bytes_ > kGiveUpAfter) {
    Finish();
    return false;
  }
  return true;
}

void NmeaReader::EndLine() {
  ++line_number_;
  if (overlong_) {
    ++overlong_lines_;
    ++counts_.skipped;
    if (!first_bad_line_) first_bad_line_ = line_number_;
    overlong_ = false;
  } else {
    Line(line_);
  }
  line_.clear();
}

void NmeaReader::Line(std::string_view line) {
  while (!line.empty() && (line.back() == '\r' || line.back() == ' ' || line.back() == '\t'))
    line.remove_suffix(1);
  while (!line.empty() && (line.front() == ' ' || line.front() == '\t' || line.front() == '\r'))
    line.remove_prefix(1);
  if (line.empty()) return;
  const Outcome o = Sentence(line);
  switch (o) {
    case Outcome::kUsed:
    case Outcome::kIgnored: ++sentences_; return;
    case Outcome::kChecksum: ++bad_checksum_; break;
    case Outcome::kValue: ++bad_value_; break;
    case Outcome::kGarbage: ++garbage_; break;
  }
  ++counts_.skipped;
  if (!first_bad_line_) first_bad_line_ = line_number_;
}

NmeaReader::Outcome NmeaReader::Sentence(std::string_view line) {
  const size_t dollar = line.find_first_of("$!");
  if (dollar == std::string_view::npos) return Outcome::kGarbage;
  std::string_view body = line.substr(dollar + 1);
  const size_t star = body.find('*');
  if (star != std::string_view::npos) {
    if (body.size() != star + 3) return Outcome::kGarbage;
    const int hi = HexDigit(body[star + 1]), lo = HexDigit(body[star + 2]);
    if (hi < 0 || lo < 0) return Outcome::kGarbage;
    uint8_t sum = 0;
    for (size_t i = 0; i < star; ++i) sum ^= static_cast<uint8_t>(body[i]);
    if (sum != hi * 16 + lo) return Outcome::kChecksum;
    body = body.substr(0, star);
  }
  for (char c : body) {
    if (static_cast<unsigned char>(c) < 0x20 || static_cast<unsigned char>(c) > 0x7E) return Outcome::kGarbage;
  }
  std::array<std::string_view, 24> f;
  size_t n = 0;
  for (;;) {
    const size_t comma = body.find(',');
    if (n == f.size()) return Outcome::kIgnored;  // longer than any sentence read here
    f[n++] = body.substr(0, comma);
    if (comma == std::string_view::npos) break;
    body.remove_prefix(comma + 1);
  }
  const std::string_view address = f[0];
  if (address.size() < 2 || address.size() > 6) return Outcome::kGarbage;
  for (char c : address) {
    if (!((c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9'))) return Outcome::kGarbage;
  }
  if (address.size() != 5 || address[0] == 'P') return Outcome::kIgnored;
  const std::string_view type = address.substr(2);
  if (type == "GGA") return Gga(f, n);
  if (type == "RMC") return Rmc(f, n);
  if (type == "VTG") return Vtg(f, n);
  if (type == "ZDA") return Zda(f, n);
  if (type == "WPL") return Wpl(f, n);
  return Outcome::kIgnored;
}

NmeaReader::Outcome NmeaReader::Gga(const std::array<std::string_view, 24>& f, size_t n) {
  // $--GGA,time,lat,N,lon,E,quality,satellites,hdop,altitude,M,...
  if (n < 11) return Outcome::kValue;
  int64_t tod;
  if (f[1].empty()) return Outcome::kIgnored;  // no time: nothing to place it at
  if (!ParseTimeOfDay(f[1], tod)) return Outcome::kValue;
  int quality = 0;
  if (!f[6].empty() && !ParseDigits(f[6], quality)) return Outcome::kValue;
  double lat = 0, lon = 0;
  const Coord a = ParseCoordinate(f[2], f[3], true, lat);
  const Coord b = ParseCoordinate(f[4], f[5], false, lon);
  if (a == Coord::kBad || b == Coord::kBad) return Outcome::kValue;
  double altitude = 0;
  const bool hasAltitude = !f[9].empty();
  if (hasAltitude && (!ParseDouble(f[9], altitude) || !detail::AltitudeInRange(altitude)))
    return Outcome::kValue;
  Fix& fix = FixAt(tod);
  if (quality > 0 && a == Coord::kOk && b == Coord::kOk) {
    fix.ggaPos = true;
    fix.ggaLat = lat;
    fix.ggaLon = lon;
    if (hasAltitude) {
      fix.altitude = altitude;
      fix.hasAltitude = true;
    }
  }
  return Outcome::kUsed;
}

NmeaReader::Outcome NmeaReader::Rmc(const std::array<std::string_view, 24>& f, size_t n) {
  // $--RMC,time,status,lat,N,lon,E,knots,course,ddmmyy,variation,E[,mode[,nav status]]
  if (n < 10) return Outcome::kValue;
  if (f[1].empty()) return Outcome::kIgnored;
  int64_t tod;
  if (!ParseTimeOfDay(f[1], tod)) return Outcome::kValue;
  double lat = 0, lon = 0, knots = -1, course = -1;
  const Coord a = ParseCoordinate(f[3], f[4], true, lat);
  const Coord b = ParseCoordinate(f[5], f[6], false, lon);
  if (a == Coord::kBad || b == Coord::kBad) return Outcome::kValue;
  if (!f[7].empty() && (!ParseDouble(f[7], knots) || !detail::SpeedInRange(knots * kKnot)))
    return Outcome::kValue;
  if (!f[8].empty() && (!ParseDouble(f[8], course) || !detail::CourseInRange(course)))
    return Outcome::kValue;
  int64_t day = kNoTime;
  if (!f[9].empty()) {
    int d, m, y;
    if (f[9].size() != 6 || !ParseDigits(f[9].substr(0, 2), d) || !ParseDigits(f[9].substr(2, 2), m) ||
        !ParseDigits(f[9].substr(4, 2), y) || !DayStart(d, m, y, day))
      return Outcome::kValue;
  }
  Fix& fix = FixAt(tod);
  if (day != kNoTime) SetDate(day);
  if (f[2] == "A" && a == Coord::kOk && b == Coord::kOk) {
    fix.rmcPos = true;
    fix.rmcLat = lat;
    fix.rmcLon = lon;
    if (knots >= 0) fix.speed = knots * kKnot;
    if (course >= 0) fix.course = course;
  }
  return Outcome::kUsed;
}

NmeaReader::Outcome NmeaReader::Vtg(const std::array<std::string_view, 24>& f, size_t n) {
  // $--VTG,course,T,magnetic,M,knots,N,km/h,K[,mode]: belongs to the fix being gathered.
  if (n < 9) return Outcome::kValue;
  double course = -1, knots = -1, kmh = -1;
  if (!f[1].empty() && (!ParseDouble(f[1], course) || !detail::CourseInRange(course))) return Outcome::kValue;
  if (!f[5].empty() && (!ParseDouble(f[5], knots) || knots < 0)) return Outcome::kValue;
  if (!f[7].empty() && (!ParseDouble(f[7], kmh) || kmh < 0)) return Outcome::kValue;
  const double speed = kmh >= 0 ? kmh / 3.6 : knots >= 0 ? knots * kKnot : -1;
  if (speed >= 0 && !detail::SpeedInRange(speed)) return Outcome::kValue;
  if (fix_.tod < 0) return Outcome::kIgnored;
  if (fix_.speed < 0 && speed >= 0) fix_.speed = speed;
  if (fix_.course < 0 && course >= 0) fix_.course = course;
  return Outcome::kUsed;
}

NmeaReader::Outcome NmeaReader::Zda(const std::array<std::string_view, 24>& f, size_t n) {
  // $--ZDA,time,dd,mm,yyyy,zone hours,zone minutes
  if (n < 5 || f[1].empty() || f[2].empty()) return Outcome::kIgnored;
  int64_t tod, day;
  int d, m, y;
  if (!ParseTimeOfDay(f[1], tod) || !ParseDigits(f[2], d) || !ParseDigits(f[3], m) ||
      !ParseDigits(f[4], y) || f[4].size() != 4 || !DayStart(d, m, y, day))
    return Outcome::kValue;
  FixAt(tod);
  SetDate(day);
  return Outcome::kUsed;
}

NmeaReader::Outcome NmeaReader::Wpl(const std::array<std::string_view, 24>& f, size_t n) {
  // $--WPL,lat,N,lon,E,name
  if (n < 6) return Outcome::kValue;
  ImportMarker m;
  if (ParseCoordinate(f[1], f[2], true, m.latitude) != Coord::kOk ||
      ParseCoordinate(f[3], f[4], false, m.longitude) != Coord::kOk)
    return Outcome::kValue;
  m.name = f[5];
  ++counts_.markers;
  if (!sink_.Marker(m)) stopped_ = true;
  return Outcome::kUsed;
}

Fix& NmeaReader::FixAt(int64_t tod) {
  if (fix_.tod == tod) return fix_;
  Flush();
  // Time running backwards by more than half a day is the next day.
  if (day_ != kNoTime && last_tod_ >= 0 && tod < last_tod_ - kDayMs / 2) day_ += 86400;
  last_tod_ = tod;
  fix_ = Fix{};
  fix_.tod = tod;
  fix_.day = day_;
  return fix_;
}

void NmeaReader::SetDate(int64_t day) {
  day_ = day;
  fix_.day = day;
  if (!undated_.empty()) ResolveUndated(day, fix_.tod);
}

void NmeaReader::Flush() {
  if (fix_.tod < 0 || !(fix_.ggaPos || fix_.rmcPos)) return;
  if (fix_.day != kNoTime) {
    Emit(fix_);
    return;
  }
  if (undated_.size() < kMaxUndated) {
    undated_.push_back(fix_);
    return;
  }
  if (options_.defaultDate != kNoTime) {
    ResolveUndatedForward(options_.defaultDate);
    Flush();  // now dated
    return;
  }
  Fail(DC_ERR_IMPORT_NO_DATE, "no date (RMC or ZDA sentence) in the first " +
                                  std::to_string(kMaxUndated) + " fixes of the log");
}

// The held-back fixes end just before a fix on `dayOfLast` at `todOfLast`: walking back, a time
// of day that jumps forward by more than half a day belongs to the day before.
void NmeaReader::ResolveUndated(int64_t dayOfLast, int64_t todOfLast) {
  int64_t day = dayOfLast, next = todOfLast;
  for (auto it = undated_.rbegin(); it != undated_.rend(); ++it) {
    if (next >= 0 && it->tod > next + kDayMs / 2) day -= 86400;
    it->day = day;
    next = it->tod;
  }
  std::deque<Fix> ready;
  ready.swap(undated_);
  for (const Fix& f : ready) Emit(f);
}

void NmeaReader::ResolveUndatedForward(int64_t firstDay) {
  int64_t day = firstDay, previous = -1;
  for (Fix& f : undated_) {
    if (previous >= 0 && f.tod < previous - kDayMs / 2) day += 86400;
    f.day = day;
    previous = f.tod;
  }
  day_ = day;
  if (fix_.tod >= 0) {
    if (fix_.tod < previous - kDayMs / 2) day_ += 86400;
    fix_.day = day_;
  }
  std::deque<Fix> ready;
  ready.swap(undated_);
  for (const Fix& f : ready) Emit(f);
}

void NmeaReader::Emit(const Fix& fix) {
  if (stopped_ || failed()) return;
  const int64_t time = fix.day + fix.tod / 1000;
  if (!detail::TimeInRange(time)) {
    ++bad_value_;
    ++counts_.skipped;
    return;
  }
  stopped_ = !Deliver(fix, time);
}

bool NmeaReader::Deliver(const Fix& fix, int64_t time) {
  if (!track_open_) {
    track_open_ = true;
    ++counts_.tracks;
    if (!sink_.BeginTrack(ImportTrack{TrackKind::kLog, {}, {}}) || !sink_.BeginSegment()) return false;
  }
  ImportPoint p;
  p.time = time;
  p.hasPosition = true;
  p.latitude = fix.ggaPos ? fix.ggaLat : fix.rmcLat;
  p.longitude = fix.ggaPos ? fix.ggaLon : fix.rmcLon;
  p.altitude = fix.altitude;
  p.hasAltitude = fix.hasAltitude;
  p.speed = fix.speed;
  p.course = fix.course;
  ++counts_.points;
  return sink_.Point(p);
}

bool NmeaReader::Finish() {
  if (failed()) return false;
  if (!line_.empty() || overlong_) EndLine();
  Flush();
  fix_ = Fix{};
  if (!undated_.empty()) {
    if (options_.defaultDate != kNoTime) {
      ResolveUndatedForward(options_.defaultDate);
    } else {
      undated_fixes_ = undated_.size();
      undated_.clear();
    }
  }
  if (stopped_) return Fail(DC_ERR_IMPORT_CANCELLED, "stopped");
  if (failed()) return false;
  if (track_open_ && !sink_.EndTrack()) return Fail(DC_ERR_IMPORT_CANCELLED, "stopped");
  if (track_open_ || counts_.markers > 0) return true;
  // No point at all: say why, naming what was wrong most often.
  const std::string where = first_bad_line_ ? " (first at line " + std::to_string(first_bad_line_) + ")" : "";
  if (bytes_ == 0) return Fail(DC_ERR_IMPORT_EMPTY, "the file is empty");
  if (undated_fixes_ > 0) {
    return Fail(DC_ERR_IMPORT_NO_DATE, std::to_string(undated_fixes_) +
                                           " fixes but no date (no RMC or ZDA sentence)");
  }
  if (sentences_ > 0) return Fail(DC_ERR_IMPORT_NO_POINTS, "the log holds no position fix");
  if (bad_checksum_ > 0 && bad_checksum_ >= bad_value_) {
    return Fail(DC_ERR_IMPORT_CHECKSUM, std::to_string(bad_checksum_) +
                                            " sentences with a bad checksum and none good" + where);
  }
  if (bad_value_ > 0) {
    return Fail(DC_ERR_IMPORT_VALUE, std::to_string(bad_value_) +
                                         " sentences with unreadable or out-of-range values" + where);
  }
  if (overlong_lines_ > 0 && garbage_ == 0) {
    return Fail(DC_ERR_IMPORT_TOO_LONG, "lines longer than " + std::to_string(kMaxLine) +
                                            " bytes and no NMEA sentence" + where);
  }
  return Fail(DC_ERR_IMPORT_MALFORMED, "no NMEA sentence" + where);
}

}  // namespace

std::unique_ptr<TrackReader> MakeNmeaReader(ImportSink& sink, const NmeaOptions& options) {
  return std::make_unique<NmeaReader>(sink, options);
}

}  // namespace navmisc::import
