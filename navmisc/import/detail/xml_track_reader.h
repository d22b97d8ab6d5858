// What the GPX and TCX readers share: the XML stream, the sink with its counts, the capture of
// an element's text, and the checked reading of numbers and times.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <string_view>

#include "navmisc/import/detail/xml_stream.h"
#include "navmisc/import/track_reader.h"

namespace navmisc::import::detail {

// Element kinds by local name, from a reader's table (most frequent names first), `other` for the
// rest. Names come from the parser's dictionary (see XmlHandler), so a name is looked up in the
// table once and then known by its address: a document uses a dozen names a million times.
template <class E, size_t N>
class ElementNames {
 public:
  constexpr ElementNames(const std::pair<std::string_view, E> (&table)[N], E other)
      : table_(table), other_(other) {}

  E operator()(XmlName name) {
    // One slot per address, by a hash of it; two names that share a slot take turns.
    const uint64_t hash = static_cast<uint64_t>(reinterpret_cast<uintptr_t>(name.key())) * 0x9E3779B97F4A7C15ull;
    Seen& seen = seen_[hash >> 58];
    if (seen.name == name.key()) return seen.kind;
    E kind = other_;
    for (const auto& [n, e] : table_) {
      if (n == name.view()) {
        kind = e;
        break;
      }
    }
    seen = {name.key(), kind};
    return kind;
  }

 private:
  static constexpr size_t kSeen = 64;  // the hash keeps 6 bits
  struct Seen {
    const char* name = nullptr;
    E kind{};
  };
  const std::pair<std::string_view, E> (&table_)[N];
  E other_;
  Seen seen_[kSeen];
};

class XmlTrackReader : public TrackReader, protected XmlHandler {
 public:
  explicit XmlTrackReader(ImportSink& sink) : sink_(sink), xml_(*this) {}
  bool Feed(const char* data, size_t size) override;
  bool Finish() override;
  bool ReadFrom(const Source& source) override;

  // For reading a document in two parts (split_read.h). The local name of the elements that
  // hold a track's points, as the document's raw bytes open them ("<trkpt").
  virtual std::string_view PointElement() const = 0;
  // After Feed: when the reader stands between two points of a track, with nothing of a point
  // or a text pending, its whole state and the parser's context written out, so that two
  // readers that agree on it read whatever follows alike; "" anywhere else.
  std::string SplitState() const;

 protected:
  // The reader's own part of SplitState: "" when it is not between two points.
  virtual std::string StateBetweenPoints() const = 0;
  // Called by Finish after a well-formed end, before the status is settled.
  virtual void AtEnd() {}

  // The text of the element that starts at `depth` (the element stack's size with it) is
  // collected for `field`, a number of the reader's own, until that element ends (at most
  // kMaxText bytes; the rest is dropped). Elements inside it add their text.
  void CaptureField(int field, size_t depth) {
    field_ = field;
    fieldDepth_ = depth;
    text_.clear();
  }
  bool Capturing() const { return field_ != kNoField; }
  // To be called at the end of every element, at `depth`: false when no field is being
  // collected. Otherwise true; when the field's element ends here, its text goes to StoreField.
  bool EndOfField(size_t depth);
  virtual void StoreField(int field, std::string_view text) = 0;
  void Text(std::string_view text) override;

  // Checked readings of the collected text; on failure the document stops with
  // DC_ERR_IMPORT_VALUE and a message naming `what`.
  bool ReadNumber(std::string_view text, const char* what, bool (*inRange)(double), double& out);
  bool ReadTime(std::string_view text, const char* what, int64_t& out);
  // A required coordinate attribute of a point element.
  bool ReadCoordinate(const XmlAttributes& attributes, const char* name, const char* element,
                      bool (*inRange)(double), double& out);

  // Sink calls that count and stop the document when the sink says stop.
  bool Emit(bool accepted);
  bool EmitTrack(const ImportTrack& track);
  bool EmitSegment();
  bool EmitPoint(const ImportPoint& point);
  bool EmitEndTrack();
  // The marker with its place and time taken from `where`.
  bool EmitMarker(ImportMarker& marker, const ImportPoint& where);
  bool EmitDocument(const std::string& name, const std::string& description);
  // Stops the document with `code`; the message gets the line in front.
  void StopAt(int32_t code, const std::string& message);
  bool Stopped() const { return !xml_.status().ok(); }

  ImportSink& sink_;

 private:
  // The end of the document, reached by Finish or ReadFrom: `ok` is the stream's verdict.
  bool Settle(bool ok);
  static constexpr int kNoField = -1;
  XmlStream xml_;
  std::string text_;
  int field_ = kNoField;
  size_t fieldDepth_ = 0;
};

std::unique_ptr<XmlTrackReader> NewGpxReader(ImportSink& sink);
std::unique_ptr<XmlTrackReader> NewTcxReader(ImportSink& sink);

}  // namespace navmisc::import::detail
