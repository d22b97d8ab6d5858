#include "navmisc/platform/exif.h"

#include <time.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <mutex>
#include <stdexcept>
#include <string>
#include <vector>

#include "navmisc/platform/file_content.h"
#include "navmisc/platform/textconv.h"

// exiv2 0.27 hands out its images as std::auto_ptr, deprecated since C++11.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
#include <exiv2/exiv2.hpp>

namespace navmisc {
namespace {

constexpr const char* kGpsVersion = "Exif.GPSInfo.GPSVersionID";
constexpr const char* kLatitude = "Exif.GPSInfo.GPSLatitude";
constexpr const char* kLatitudeRef = "Exif.GPSInfo.GPSLatitudeRef";
constexpr const char* kLongitude = "Exif.GPSInfo.GPSLongitude";
constexpr const char* kLongitudeRef = "Exif.GPSInfo.GPSLongitudeRef";
constexpr const char* kAltitude = "Exif.GPSInfo.GPSAltitude";
constexpr const char* kAltitudeRef = "Exif.GPSInfo.GPSAltitudeRef";
constexpr const char* kSpeed = "Exif.GPSInfo.GPSSpeed";
constexpr const char* kSpeedRef = "Exif.GPSInfo.GPSSpeedRef";
constexpr const char* kTimeStamp = "Exif.GPSInfo.GPSTimeStamp";
constexpr const char* kDateStamp = "Exif.GPSInfo.GPSDateStamp";
constexpr const char* kUserComment = "Exif.Photo.UserComment";
constexpr const char* kXpComment = "Exif.Image.XPComment";
constexpr const char* kDateTimeOriginal = "Exif.Photo.DateTimeOriginal";
constexpr const char* kOffsetTimeOriginal = "Exif.Photo.OffsetTimeOriginal";
constexpr const char* kDateTime = "Exif.Image.DateTime";

// Bounds beyond which a stored value is taken for damage rather than a measurement.
constexpr double kMaxAltitude = 1e6;  // metres
constexpr double kMaxSpeed = 1e6;     // km/h
// Longest comment kept from a photo (characters): far beyond what a camera or a user writes,
// small enough for the tagging tool's command file.
constexpr size_t kMaxCommentChars = 65536;

// exiv2 keeps a process-wide message level and, for XMP, a parser that must be set up once
// before threads use it.
void InitExiv2() {
  static std::once_flag once;
  std::call_once(once, [] {
    Exiv2::LogMsg::setLevel(Exiv2::LogMsg::mute);
    Exiv2::XmpParser::initialize();
  });
}

Exiv2::Image::AutoPtr OpenImage(std::string_view bytes) {
  InitExiv2();
  const auto* data = reinterpret_cast<const Exiv2::byte*>(bytes.data());
  const auto size = static_cast<long>(bytes.size());
  // exiv2's own message for this case speaks of failing to read input data (a format probe that
  // looks beyond the end of a short file throws).
  bool known = false;
  try {
    known = !bytes.empty() && Exiv2::ImageFactory::getType(data, size) != Exiv2::ImageType::none;
  } catch (const Exiv2::AnyError&) {
  }
  if (!known) throw std::runtime_error("not a photo of a known format");
  Exiv2::Image::AutoPtr image = Exiv2::ImageFactory::open(data, size);
  if (!image.get()) throw std::runtime_error("not a photo of a known format");
  image->readMetadata();
  return image;
}

// The image's whole content after writeMetadata.
std::string ImageBytes(Exiv2::Image& image) {
  Exiv2::BasicIo& io = image.io();
  if (io.open() != 0) throw Exiv2::Error(Exiv2::kerDataSourceOpenFailed, "memory", "");
  io.seek(0, Exiv2::BasicIo::beg);
  const Exiv2::DataBuf buf = io.read(static_cast<long>(io.size()));
  io.close();
  return std::string(reinterpret_cast<const char*>(buf.pData_), static_cast<size_t>(buf.size_));
}

// Runs `work`, turning exiv2's exceptions into an error text.
template <class Work>
bool Guarded(std::string& error, Work work) {
  try {
    return work();
  } catch (const Exiv2::AnyError& e) {
    error = e.what();
  } catch (const std::exception& e) {
    error = e.what();
  } catch (...) {
    error = "unexpected failure";
  }
  if (error.empty()) error = "cannot read the metadata";
  return false;
}

const Exiv2::Exifdatum* Find(const Exiv2::ExifData& exif, const char* key) {
  const auto it = exif.findKey(Exiv2::ExifKey(key));
  return it == exif.end() ? nullptr : &*it;
}

// The first character of an ASCII tag, 0 when absent.
char FirstChar(const Exiv2::ExifData& exif, const char* key) {
  const Exiv2::Exifdatum* d = Find(exif, key);
  if (!d) return 0;
  const std::string s = d->toString();
  return s.empty() ? 0 : s[0];
}

// The n-th component of a numeric tag when it is a finite number; false otherwise (a zero
// denominator, a text where a number belongs). Rationals are divided in double precision:
// exiv2's own conversion gives a float, 7 digits, too few for a latitude written as one
// fraction ("473769123/10000000").
bool Number(const Exiv2::Exifdatum& d, long n, double& out) {
  if (d.count() <= n) return false;
  const Exiv2::Value& v = d.value();
  if (const auto* u = dynamic_cast<const Exiv2::URationalValue*>(&v)) {
    const Exiv2::URational& r = u->value_.at(static_cast<size_t>(n));
    out = r.second == 0 ? NAN : static_cast<double>(r.first) / r.second;
  } else if (const auto* q = dynamic_cast<const Exiv2::RationalValue*>(&v)) {
    const Exiv2::Rational& r = q->value_.at(static_cast<size_t>(n));
    out = r.second == 0 ? NAN : static_cast<double>(r.first) / r.second;
  } else {
    out = static_cast<double>(v.toFloat(n));
    if (!v.ok()) return false;
  }
  return std::isfinite(out);
}

// Degrees from the degrees, minutes and seconds of a GPS coordinate (minutes and seconds may be
// missing); the reference letter `negative` makes it negative.
bool Coordinate(const Exiv2::ExifData& exif, const char* key, const char* refKey, char negative,
                double limit, double& out) {
  const Exiv2::Exifdatum* d = Find(exif, key);
  if (!d || d->count() < 1) return false;
  double sum = 0.0, scale = 1.0;
  for (long i = 0; i < std::min<long>(d->count(), 3); ++i, scale *= 60.0) {
    double part = 0.0;
    if (!Number(*d, i, part) || part < 0.0) return false;
    sum += part / scale;
  }
  if (!std::isfinite(sum) || sum > limit) return false;
  out = FirstChar(exif, refKey) == negative ? -sum : sum;
  return true;
}

// Text from bytes that should be UTF-8 (other bytes become U+FFFD), without the NULs and
// blanks that pad fixed-size fields, cut to the comment limit.
CString CleanText(std::string_view bytes) {
  while (!bytes.empty() && (bytes.back() == '\0' || bytes.back() == ' ')) bytes.remove_suffix(1);
  if (const size_t nul = bytes.find('\0'); nul != std::string_view::npos)
    bytes = bytes.substr(0, nul);
  std::wstring text = FromUtf8Lossy(bytes);
  if (text.size() > kMaxCommentChars) text.resize(kMaxCommentChars);
  return CString(std::move(text));
}

// UTF-16 text in the given byte order; unpaired surrogates become U+FFFD.
CString Utf16Text(std::string_view bytes, bool bigEndian) {
  std::wstring out;
  for (size_t i = 0; i + 1 < bytes.size() && out.size() < kMaxCommentChars; i += 2) {
    const auto b0 = static_cast<unsigned char>(bytes[i]),
               b1 = static_cast<unsigned char>(bytes[i + 1]);
    unsigned unit = bigEndian ? (b0 << 8 | b1) : (b1 << 8 | b0);
    if (unit == 0) break;
    if (unit >= 0xD800 && unit <= 0xDBFF && i + 3 < bytes.size()) {
      const auto c0 = static_cast<unsigned char>(bytes[i + 2]),
                 c1 = static_cast<unsigned char>(bytes[i + 3]);
      const unsigned low = bigEndian ? (c0 << 8 | c1) : (c1 << 8 | c0);
      if (low >= 0xDC00 && low <= 0xDFFF) {
        unit = 0x10000 + ((unit - 0xD800) << 10) + (low - 0xDC00);
        i += 2;
      }
    }
    if (unit >= 0xD800 && unit <= 0xDFFF) unit = 0xFFFD;
    out.push_back(static_cast<wchar_t>(unit));
  }
  while (!out.empty() && out.back() == L' ') out.pop_back();
  return CString(std::move(out));
}

void AppendUtf16(std::string& out, const CString& text, bool bigEndian) {
  auto unit = [&](unsigned u) {
    const char hi = static_cast<char>(u >> 8), lo = static_cast<char>(u & 0xFF);
    out.push_back(bigEndian ? hi : lo);
    out.push_back(bigEndian ? lo : hi);
  };
  for (wchar_t w : text.view()) {
    auto cp = static_cast<uint32_t>(w);
    if (cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) cp = 0xFFFD;
    if (cp >= 0x10000) {
      cp -= 0x10000;
      unit(0xD800 + (cp >> 10));
      unit(0xDC00 + (cp & 0x3FF));
    } else {
      unit(cp);
    }
  }
}

// The bytes of a tag; 16-bit text of a comment value comes in `order`.
std::string RawBytes(const Exiv2::Exifdatum& d, Exiv2::ByteOrder order) {
  std::string raw(static_cast<size_t>(d.size()), '\0');
  if (!raw.empty()) d.copy(reinterpret_cast<Exiv2::byte*>(raw.data()), order);
  return raw;
}

// Exif.Photo.UserComment: an 8-byte character code, then the text ("UNICODE" is UTF-16 in the
// byte order of the EXIF data, anything else is read as UTF-8).
CString UserComment(const Exiv2::ExifData& exif, Exiv2::ByteOrder imageOrder) {
  const Exiv2::Exifdatum* d = Find(exif, kUserComment);
  if (!d) return {};
  // exiv2 reads the tag as a comment value, which hands its UTF-16 out in any order asked for;
  // other values give their bytes as stored.
  const bool converts = dynamic_cast<const Exiv2::CommentValue*>(&d->value()) != nullptr;
  const Exiv2::ByteOrder order =
      converts || imageOrder == Exiv2::invalidByteOrder ? Exiv2::littleEndian : imageOrder;
  const std::string raw = RawBytes(*d, order);
  if (raw.size() < 8) return CleanText(raw);
  const std::string_view code(raw.data(), 8), text(raw.data() + 8, raw.size() - 8);
  if (code == std::string_view("UNICODE\0", 8)) return Utf16Text(text, order == Exiv2::bigEndian);
  return CleanText(text);
}

// Two-digit and four-digit fields of a date-time text "YYYY:MM:DD hh:mm:ss" (also with "-" or
// "/" in the date and "T" before the time). False unless it is a real date and time.
bool ParseDateTime(std::string_view s, int& y, int& mo, int& d, int& h, int& mi, int& se) {
  while (!s.empty() && (s.back() == '\0' || s.back() == ' ')) s.remove_suffix(1);
  if (s.size() != 19) return false;
  auto num = [&](size_t at, size_t len, int& out) {
    out = 0;
    for (size_t i = at; i < at + len; ++i) {
      if (s[i] < '0' || s[i] > '9') return false;
      out = out * 10 + (s[i] - '0');
    }
    return true;
  };
  auto dateSep = [](char c) { return c == ':' || c == '-' || c == '/'; };
  if (!dateSep(s[4]) || !dateSep(s[7]) || (s[10] != ' ' && s[10] != 'T') || s[13] != ':' ||
      s[16] != ':') {
    return false;
  }
  if (!num(0, 4, y) || !num(5, 2, mo) || !num(8, 2, d) || !num(11, 2, h) || !num(14, 2, mi) ||
      !num(17, 2, se)) {
    return false;
  }
  static constexpr int kDays[] = {31, 29, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (y < 1 || mo < 1 || mo > 12 || d < 1 || d > kDays[mo - 1] || h > 23 || mi > 59 || se > 59)
    return false;
  const bool leap = (y % 4 == 0 && y % 100 != 0) || y % 400 == 0;
  return !(mo == 2 && d == 29 && !leap);
}

CString DateTimeText(const Exiv2::ExifData& exif, const char* key) {
  const Exiv2::Exifdatum* d = Find(exif, key);
  int y, mo, day, h, mi, s;
  if (!d || !ParseDateTime(d->toString(), y, mo, day, h, mi, s)) return {};
  return FormatString(L"%04d:%02d:%02d %02d:%02d:%02d", y, mo, day, h, mi, s);
}

// The UTC date and time of the capture: the photo's own offset ("+02:00") when it states one,
// else the computer's zone at that moment. False when the photo has no capture time.
bool CaptureTimeUtc(const Exiv2::ExifData& exif, struct tm& utc) {
  const Exiv2::Exifdatum* d = Find(exif, kDateTimeOriginal);
  if (!d) d = Find(exif, kDateTime);
  struct tm local {};
  if (!d || !ParseDateTime(d->toString(), local.tm_year, local.tm_mon, local.tm_mday, local.tm_hour,
                           local.tm_min, local.tm_sec)) {
    return false;
  }
  local.tm_year -= 1900;
  local.tm_mon -= 1;
  time_t when;
  const Exiv2::Exifdatum* offset = Find(exif, kOffsetTimeOriginal);
  int oh = 0, om = 0;
  char sign = 0;
  if (offset && std::sscanf(offset->toString().c_str(), "%c%2d:%2d", &sign, &oh, &om) == 3 &&
      (sign == '+' || sign == '-') && oh <= 14 && om <= 59) {
    when = ::timegm(&local) - (sign == '-' ? -1 : 1) * (oh * 3600 + om * 60);
  } else {
    local.tm_isdst = -1;
    when = ::mktime(&local);
  }
  return when != static_cast<time_t>(-1) && ::gmtime_r(&when, &utc) != nullptr;
}

Exiv2::URationalValue Rationals(std::initializer_list<std::pair<uint32_t, uint32_t>> parts) {
  Exiv2::URationalValue v;
  for (const auto& p : parts) v.value_.push_back(p);
  return v;
}

void SetAscii(Exiv2::ExifData& exif, const char* key, const std::string& text) {
  exif[key].setValue(text);
}

void SetBytes(Exiv2::ExifData& exif, const char* key, Exiv2::TypeId type,
              const std::string& bytes) {
  Exiv2::DataValue v(reinterpret_cast<const Exiv2::byte*>(bytes.data()),
                     static_cast<long>(bytes.size()), Exiv2::invalidByteOrder, type);
  exif[key].setValue(&v);
}

// Degrees as degrees, minutes and seconds with six decimals of a second (3e-10 degrees).
void SetCoordinate(Exiv2::ExifData& exif, const char* key, const char* refKey, double degrees,
                   char positive, char negative) {
  constexpr uint64_t kMicroPerDegree = 3600ull * 1000000ull;
  const uint64_t total = static_cast<uint64_t>(std::llround(std::fabs(degrees) * kMicroPerDegree));
  const auto d = static_cast<uint32_t>(total / kMicroPerDegree);
  const auto m = static_cast<uint32_t>(total % kMicroPerDegree / 60000000ull);
  const auto s = static_cast<uint32_t>(total % 60000000ull);
  const Exiv2::URationalValue v = Rationals({{d, 1}, {m, 1}, {s, 1000000}});
  exif[key].setValue(&v);
  SetAscii(exif, refKey, std::string(1, degrees < 0 ? negative : positive));
}

// A non-negative amount with three decimals.
void SetMillis(Exiv2::ExifData& exif, const char* key, double value) {
  const Exiv2::URationalValue v =
      Rationals({{static_cast<uint32_t>(std::llround(std::fabs(value) * 1000.0)), 1000}});
  exif[key].setValue(&v);
}

void EraseGps(Exiv2::ExifData& exif) {
  for (auto it = exif.begin(); it != exif.end();) {
    it = it->groupName() == "GPSInfo" ? exif.erase(it) : std::next(it);
  }
}

void EraseKey(Exiv2::ExifData& exif, const char* key) {
  const auto it = exif.findKey(Exiv2::ExifKey(key));
  if (it != exif.end()) exif.erase(it);
}

// The byte order exiv2 writes the EXIF data in: the photo's own, little-endian for a photo that
// has none yet.
Exiv2::ByteOrder WriteOrder(const Exiv2::Image& image) {
  const Exiv2::ByteOrder order = image.byteOrder();
  return order == Exiv2::invalidByteOrder ? Exiv2::littleEndian : order;
}

bool IsAscii(const CString& text) {
  for (wchar_t w : text.view()) {
    if (static_cast<uint32_t>(w) >= 0x80) return false;
  }
  return true;
}

void SetComment(Exiv2::Image& image, const CString& comment) {
  Exiv2::ExifData& exif = image.exifData();
  const bool big = WriteOrder(image) == Exiv2::bigEndian;
  std::string user = IsAscii(comment) ? std::string("ASCII\0\0\0", 8) + comment.ToUtf8()
                                      : std::string("UNICODE\0", 8);
  if (!IsAscii(comment)) AppendUtf16(user, comment, big);
  SetBytes(exif, kUserComment, Exiv2::undefined, user);
  // Windows' comment tag is UTF-16 little-endian whatever the order of the rest.
  std::string xp;
  AppendUtf16(xp, comment, false);
  xp.append(2, '\0');
  SetBytes(exif, kXpComment, Exiv2::unsignedByte, xp);
  if (image.supportsMetadata(Exiv2::mdComment)) image.setComment(comment.ToUtf8());
}

bool ValidTag(const ExifGeoTag& tag, std::string& error) {
  if (!std::isfinite(tag.latitude) || std::fabs(tag.latitude) > 90.0 ||
      !std::isfinite(tag.longitude) || std::fabs(tag.longitude) > 180.0) {
    error = "latitude or longitude out of range";
    return false;
  }
  if (!std::isfinite(tag.altitude) || std::fabs(tag.altitude) >= kMaxAltitude ||
      !std::isfinite(tag.speed) || tag.speed < 0.0 || tag.speed >= kMaxSpeed) {
    error = "altitude or speed out of range";
    return false;
  }
  return true;
}

}  // namespace

bool ReadExif(std::string_view photo, ExifInfo& info, std::string& error) {
  info = ExifInfo();
  error.clear();
  return Guarded(error, [&] {
    Exiv2::Image::AutoPtr image = OpenImage(photo);
    const Exiv2::ExifData& exif = image->exifData();
    info.width = std::max(0, image->pixelWidth());
    info.height = std::max(0, image->pixelHeight());
    double lat = 0.0, lon = 0.0;
    if (Coordinate(exif, kLatitude, kLatitudeRef, 'S', 90.0, lat) &&
        Coordinate(exif, kLongitude, kLongitudeRef, 'W', 180.0, lon)) {
      info.hasPosition = true;
      info.latitude = lat;
      info.longitude = lon;
    }
    double value = 0.0;
    if (const Exiv2::Exifdatum* d = Find(exif, kAltitude);
        d && Number(*d, 0, value) && std::fabs(value) < kMaxAltitude) {
      info.hasAltitude = true;
      info.altitude = FirstChar(exif, kAltitudeRef) == '1' ? -value : value;  // 1 = below sea level
    }
    if (const Exiv2::Exifdatum* d = Find(exif, kSpeed); d && Number(*d, 0, value) && value >= 0.0) {
      const char unit = FirstChar(exif, kSpeedRef);
      const double kmh = unit == 'M' ? value * 1.609344 : unit == 'N' ? value * 1.852 : value;
      if (kmh < kMaxSpeed) {
        info.hasSpeed = true;
        info.speed = kmh;
      }
    }
    info.comment = CleanText(image->comment());
    if (const Exiv2::Exifdatum* d = Find(exif, kXpComment))
      info.xpComment = Utf16Text(RawBytes(*d, Exiv2::littleEndian), false);
    info.userComment = UserComment(exif, image->byteOrder());
    info.dateTimeOriginal = DateTimeText(exif, kDateTimeOriginal);
    info.dateTime = DateTimeText(exif, kDateTime);
    return true;
  });
}

bool WriteExifGeoTag(std::string& photo, const ExifGeoTag& tag, std::string& error) {
  error.clear();
  if (!ValidTag(tag, error)) return false;
  return Guarded(error, [&] {
    Exiv2::Image::AutoPtr image = OpenImage(photo);
    Exiv2::ExifData& exif = image->exifData();
    if (tag.latitude == 0.0 && tag.longitude == 0.0) {
      EraseGps(exif);
    } else {
      SetBytes(exif, kGpsVersion, Exiv2::unsignedByte, std::string("\x02\x03\x00\x00", 4));
      SetCoordinate(exif, kLatitude, kLatitudeRef, tag.latitude, 'N', 'S');
      SetCoordinate(exif, kLongitude, kLongitudeRef, tag.longitude, 'E', 'W');
      SetBytes(exif, kAltitudeRef, Exiv2::unsignedByte,
               std::string(1, tag.altitude < 0.0 ? '\1' : '\0'));
      SetMillis(exif, kAltitude, tag.altitude);
      SetAscii(exif, kSpeedRef, "K");
      SetMillis(exif, kSpeed, tag.speed);
      struct tm utc {};
      if (CaptureTimeUtc(exif, utc)) {
        const Exiv2::URationalValue stamp = Rationals({{static_cast<uint32_t>(utc.tm_hour), 1},
                                                       {static_cast<uint32_t>(utc.tm_min), 1},
                                                       {static_cast<uint32_t>(utc.tm_sec), 1}});
        exif[kTimeStamp].setValue(&stamp);
        SetAscii(exif, kDateStamp,
                 FormatString(L"%04d:%02d:%02d", utc.tm_year + 1900, utc.tm_mon + 1, utc.tm_mday)
                     .ToUtf8());
      } else {
        // A stamp left from an earlier tag would contradict the new position.
        EraseKey(exif, kTimeStamp);
        EraseKey(exif, kDateStamp);
      }
    }
    if (!tag.comment.IsEmpty()) SetComment(*image, tag.comment);
    image->writeMetadata();
    photo = ImageBytes(*image);
    return true;
  });
}

bool CopyExifGps(std::string_view from, std::string& to, std::string& error) {
  error.clear();
  return Guarded(error, [&] {
    Exiv2::Image::AutoPtr source = OpenImage(from);
    std::vector<Exiv2::Exifdatum> gps;
    for (const Exiv2::Exifdatum& d : source->exifData()) {
      if (d.groupName() == "GPSInfo") gps.push_back(d);
    }
    if (gps.empty()) {
      error = "the source photo has no GPS tags";
      return false;
    }
    Exiv2::Image::AutoPtr target = OpenImage(to);
    Exiv2::ExifData& exif = target->exifData();
    EraseGps(exif);
    for (const Exiv2::Exifdatum& d : gps) exif.add(d);
    target->writeMetadata();
    to = ImageBytes(*target);
    return true;
  });
}

bool WriteExifCaptureTime(std::string& photo, const CString& dateTime, std::string& error) {
  error.clear();
  int y, mo, d, h, mi, s;
  const std::string text = dateTime.ToUtf8();
  if (!ParseDateTime(text, y, mo, d, h, mi, s)) {
    error = "not a date and time: " + text;
    return false;
  }
  return Guarded(error, [&] {
    Exiv2::Image::AutoPtr image = OpenImage(photo);
    SetAscii(image->exifData(), kDateTimeOriginal, text);
    SetAscii(image->exifData(), kDateTime, text);
    image->writeMetadata();
    photo = ImageBytes(*image);
    return true;
  });
}

}  // namespace navmisc

#pragma GCC diagnostic pop

template <class Change>
bool CExif2::Stage(const wchar_t* path, navmisc::FileReplaceBatch& batch, Change change) {
  navmisc::FileContent file;
  if (!file.Load(path, navmisc::kMaxPhotoBytes)) {
    error_ = file.error();
    return false;
  }
  if (!file.IsWritable()) {
    error_ = "the file is read-only";
    return false;
  }
  std::string bytes = file.bytes();
  return change(bytes) && batch.Stage(file, bytes, error_);
}

template <class Change>
bool CExif2::Rewrite(const wchar_t* path, Change change) {
  navmisc::FileReplaceBatch batch;
  if (!Stage(path, batch, change)) return false;
  error_ = batch.Commit().front();
  return error_.empty();
}

bool CExif2::GetExif(const wchar_t* path, navmisc::ExifInfo& info) {
  navmisc::FileContent file;
  if (!file.Load(path, navmisc::kMaxPhotoBytes)) {
    info = navmisc::ExifInfo();
    error_ = file.error();
    return false;
  }
  return navmisc::ReadExif(file.bytes(), info, error_);
}

bool CExif2::SetExif(const wchar_t* path, const navmisc::ExifGeoTag& tag) {
  return Rewrite(path,
                 [&](std::string& bytes) { return navmisc::WriteExifGeoTag(bytes, tag, error_); });
}

bool CExif2::StageExif(const wchar_t* path, const navmisc::ExifGeoTag& tag) {
  return Stage(path, staged_,
               [&](std::string& bytes) { return navmisc::WriteExifGeoTag(bytes, tag, error_); });
}

bool CExif2::StageCopyGps(const wchar_t* from, const wchar_t* to) {
  navmisc::FileContent source;
  if (!source.Load(from, navmisc::kMaxPhotoBytes)) {
    error_ = source.error();
    return false;
  }
  return Stage(to, staged_, [&](std::string& bytes) {
    return navmisc::CopyExifGps(source.bytes(), bytes, error_);
  });
}

std::vector<std::string> CExif2::CommitStaged() {
  return staged_.Commit();
}

bool CExif2::SetCaptureTime(const wchar_t* path, const CString& dateTime) {
  return Rewrite(path, [&](std::string& bytes) {
    return navmisc::WriteExifCaptureTime(bytes, dateTime, error_);
  });
}
