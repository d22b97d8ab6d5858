// Write, read, compare: records built from the input are written as a point file of one kind,
// read back in memory, and must equal what was written, as far as the format keeps it: integers
// exactly, doubles to the six decimals written, sample lists up to their terminator; names hold
// neither commas nor line breaks, and lines longer than the reader's 255 characters are out of
// scope (the reader cuts them, as the format says). Writing the records read back must then
// give the very same text.
//
// Run: point_roundtrip_fuzz -max_len=2048

#include <fuzzer/FuzzedDataProvider.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>

#include "navmisc/platform/format.h"
#include "navmisc/platform/line_reader.h"
#include "navmisc/records/point_file_format.h"
#include "navmisc/records/point_lists.h"
#include "navmisc/records/track.h"

namespace pf = navmisc::point_file;
using navmisc::Items;

namespace {

[[noreturn]] void Fail(const char* what, size_t record) {
  std::fprintf(stderr, "point write-read: %s (record %zu)\n", what, record);
  std::abort();
}

// Doubles from every corner: coordinates, tiny and large values, signed zeros, the terminator
// -1.0 and its neighbours, NaN, infinities and raw bit patterns.
double Real(FuzzedDataProvider& in) {
  switch (in.ConsumeIntegralInRange(0, 5)) {
    case 0: return in.ConsumeFloatingPointInRange(-180.0, 180.0);
    case 1: return std::nextafter(-1.0, in.ConsumeBool() ? 0.0 : -2.0);
    case 2: {
      static constexpr double kEdges[] = {0.0, -0.0, -1.0, 0.0000005, -0.0000005, 1e-7, 9.9999995, NAN, -NAN, INFINITY, -INFINITY};
      return in.PickValueInArray(kEdges);
    }
    case 3: return static_cast<double>(in.ConsumeIntegral<int32_t>()) / 1e6;
    case 4: return in.ConsumeFloatingPointInRange(-1e12, 1e12);
    default: {
      const uint64_t bits = in.ConsumeIntegral<uint64_t>();
      double d;
      std::memcpy(&d, &bits, sizeof d);
      return d;
    }
  }
}

// A name of any characters but the separator, line breaks and NUL.
CString Name(FuzzedDataProvider& in) {
  std::wstring out;
  const size_t length = in.ConsumeIntegralInRange<size_t>(0, 12);
  for (size_t i = 0; i < length; ++i) {
    wchar_t c = static_cast<wchar_t>(in.ConsumeIntegralInRange<uint32_t>(1, 0x10FFFF));
    if (c == L',' || c == L'\n' || (c >= 0xD800 && c <= 0xDFFF)) c = L'_';
    out += c;
  }
  return CString(std::move(out));
}

bool SameReal(double written, double read) {
  if (std::isnan(written)) return std::isnan(read);
  if (std::isinf(written)) return read == written;
  return std::fabs(read - written) <= 5e-7 + std::fabs(written) * 1e-15;
}

template <class T>
T* Add(CPtrList& list) {
  auto* rec = new T(static_cast<const T*>(nullptr));
  list.AddTail(rec);
  return rec;
}

void Build(pf::Kind kind, FuzzedDataProvider& in, TRACK_ITEM_INFO& t) {
  const int count = in.ConsumeIntegralInRange(0, 8);
  for (int n = 0; n < count; ++n) {
    switch (kind) {
      case pf::Kind::kPoints:
      case pf::Kind::kHelpPoints: {
        auto* p = Add<WAYPOINT_ITEM_INFO>(kind == pf::Kind::kPoints ? t.points : t.helpPoints);
        p->time = in.ConsumeIntegral<int32_t>();
        if (kind == pf::Kind::kHelpPoints) p->name = Name(in);
        p->latitude = Real(in);
        p->longitude = Real(in);
        p->altitude = Real(in);
        p->speed = in.ConsumeIntegral<int32_t>();
        p->type = in.ConsumeIntegral<int32_t>();
        p->course = in.ConsumeIntegral<int32_t>();
        p->extraA = in.ConsumeIntegral<int32_t>();
        if (kind == pf::Kind::kPoints) p->extraB = in.ConsumeIntegral<int32_t>();
        break;
      }
      case pf::Kind::kCellFixes: {
        auto* c = Add<BASE_ITEM_INFO>(t.cellFixes);
        c->time = in.ConsumeIntegral<int32_t>();
        c->name = Name(in);
        c->latitude = Real(in);
        c->longitude = Real(in);
        break;
      }
      case pf::Kind::kHeartRate:
      case pf::Kind::kCadence: {
        CPtrList& list = kind == pf::Kind::kHeartRate ? t.heartRates : t.cadences;
        uint8_t* values;
        if (kind == pf::Kind::kHeartRate) {
          auto* r = Add<HEARTRATE_ITEM_INFO>(list);
          r->time = in.ConsumeIntegral<int32_t>();
          values = r->values;
        } else {
          auto* r = Add<CYCLING_CADENCE_RPM_ITEM_INFO>(list);
          r->time = in.ConsumeIntegral<int32_t>();
          values = r->values;
        }
        for (int i = 0; i < HEARTRATE_ITEM_INFO::kValues; ++i) values[i] = in.ConsumeIntegral<uint8_t>();
        break;
      }
      case pf::Kind::kWheelSpeed: {
        auto* w = Add<WHEEL_SPEED_ITEM_INFO>(t.wheelSpeeds);
        w->time = in.ConsumeIntegral<int32_t>();
        for (double& v : w->values) v = Real(in);
        break;
      }
    }
  }
}

std::string Encode(pf::Kind kind, const TRACK_ITEM_INFO& t) {
  std::string out;
  pf::EncodeList(kind, t, [&](std::string_view piece) { out.append(piece); }, nullptr, nullptr);
  return out;
}

// Compares the byte samples up to the terminator 255 (written, then the rest reads as 255).
template <class T>
void CompareBytes(CPtrList& written, CPtrList& read) {
  POSITION a = written.GetHeadPosition(), b = read.GetHeadPosition();
  for (size_t n = 0; a && b; ++n) {
    const T* w = static_cast<const T*>(written.GetNext(a));
    const T* r = static_cast<const T*>(read.GetNext(b));
    if (w->time != r->time) Fail("time changed", n);
    bool ended = false;
    for (int i = 0; i < T::kValues; ++i) {
      if (r->values[i] != (ended ? 255 : w->values[i])) Fail("sample changed", n);
      ended = ended || w->values[i] == 255;
    }
  }
}

void Compare(pf::Kind kind, TRACK_ITEM_INFO& w, TRACK_ITEM_INFO& r) {
  auto count = [&](TRACK_ITEM_INFO& t) {
    switch (kind) {
      case pf::Kind::kPoints: return t.points.GetCount();
      case pf::Kind::kCellFixes: return t.cellFixes.GetCount();
      case pf::Kind::kHelpPoints: return t.helpPoints.GetCount();
      case pf::Kind::kHeartRate: return t.heartRates.GetCount();
      case pf::Kind::kCadence: return t.cadences.GetCount();
      case pf::Kind::kWheelSpeed: return t.wheelSpeeds.GetCount();
    }
    return 0;
  };
  if (count(w) != count(r)) Fail("record count changed", 0);
  size_t n = 0;
  switch (kind) {
    case pf::Kind::kPoints:
    case pf::Kind::kHelpPoints: {
      CPtrList& wl = kind == pf::Kind::kPoints ? w.points : w.helpPoints;
      CPtrList& rl = kind == pf::Kind::kPoints ? r.points : r.helpPoints;
      POSITION b = rl.GetHeadPosition();
      for (const WAYPOINT_ITEM_INFO* p : Items<WAYPOINT_ITEM_INFO>(wl)) {
        const auto* q = static_cast<const WAYPOINT_ITEM_INFO*>(rl.GetNext(b));
        if (p->time != q->time || p->speed != q->speed || p->type != q->type || p->course != q->course ||
            p->extraA != q->extraA || (kind == pf::Kind::kPoints && p->extraB != q->extraB)) {
          Fail("integer changed", n);
        }
        if (!SameReal(p->latitude, q->latitude) || !SameReal(p->longitude, q->longitude) ||
            !SameReal(p->altitude, q->altitude)) {
          Fail("double changed", n);
        }
        if (kind == pf::Kind::kHelpPoints && p->name != q->name) Fail("name changed", n);
        ++n;
      }
      break;
    }
    case pf::Kind::kCellFixes: {
      POSITION b = r.cellFixes.GetHeadPosition();
      for (const BASE_ITEM_INFO* c : Items<BASE_ITEM_INFO>(w.cellFixes)) {
        const auto* d = static_cast<const BASE_ITEM_INFO*>(r.cellFixes.GetNext(b));
        if (c->time != d->time || c->name != d->name) Fail("time or name changed", n);
        if (!SameReal(c->latitude, d->latitude) || !SameReal(c->longitude, d->longitude)) Fail("double changed", n);
        ++n;
      }
      break;
    }
    case pf::Kind::kHeartRate: return CompareBytes<HEARTRATE_ITEM_INFO>(w.heartRates, r.heartRates);
    case pf::Kind::kCadence: return CompareBytes<CYCLING_CADENCE_RPM_ITEM_INFO>(w.cadences, r.cadences);
    case pf::Kind::kWheelSpeed: {
      POSITION b = r.wheelSpeeds.GetHeadPosition();
      for (const WHEEL_SPEED_ITEM_INFO* s : Items<WHEEL_SPEED_ITEM_INFO>(w.wheelSpeeds)) {
        const auto* t = static_cast<const WHEEL_SPEED_ITEM_INFO*>(r.wheelSpeeds.GetNext(b));
        if (s->time != t->time) Fail("time changed", n);
        // The list is written up to the first value that is exactly -1.0; the rest reads as -1.0.
        bool ended = false;
        for (int i = 0; i < WHEEL_SPEED_ITEM_INFO::kValues; ++i) {
          if (!SameReal(ended ? -1.0 : s->values[i], t->values[i])) Fail("speed changed", n);
          ended = ended || s->values[i] == -1.0;
        }
        ++n;
      }
      break;
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider in(data, size);
  const pf::Kind kind = in.PickValueInArray(pf::kAllKinds);
  TRACK_ITEM_INFO written(nullptr);
  Build(kind, in, written);
  const std::string text = Encode(kind, written);
  for (size_t start = 0; start < text.size();) {
    const size_t end = text.find("\r\n", start);
    if (end - start > pf::kMaxLine) return 0;  // the reader would cut this line
    start = end + 2;
  }
  TRACK_ITEM_INFO read(nullptr);
  navmisc::LineReader lines(pf::kMaxLine);
  lines.OpenMemory(text);
  pf::ReadList(kind, lines, read, 0);
  Compare(kind, written, read);
  // A wheel speed printed as -1.000000 without being exactly -1.0 does not end its list when
  // written, but does once read back: the one case where writing again shortens the text.
  for (const WHEEL_SPEED_ITEM_INFO* w : Items<WHEEL_SPEED_ITEM_INFO>(written.wheelSpeeds)) {
    for (double v : w->values) {
      std::string printed;
      navmisc::AppendFixed(printed, v, pf::kDecimals);
      if (v != -1.0 && printed == "-1.000000") return 0;
    }
  }
  if (Encode(kind, read) != text) Fail("the text written again differs", 0);
  return 0;
}
