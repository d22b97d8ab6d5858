// What the GPX and TCX readers share: the XML stream, the sink with its counts, the capture of
// an element's text, and the checked reading of numbers and times.
#pragma once

#include <string>
#include <utility>
#include <string_view>

#include "navmisc/import/detail/xml_stream.h"
#include "navmisc/import/track_reader.h"

namespace navmisc::import::detail {

// The element kind of local name `name` in a reader's table (most frequent names first), or
// `other`.
template <class E, size_t N>
E ElementOf(std::string_view name, const std::pair<std::string_view, E> (&table)[N], E other) {
  for (const auto& [n, e] : table) {
    if (n == name) return e;
  }
  return other;
}

class XmlTrackReader : public TrackReader, protected XmlHandler {
 public:
  explicit XmlTrackReader(ImportSink& sink) : sink_(sink), xml_(*this) {}
  bool Feed(const char* data, size_t size) override;
  bool Finish() override;

 protected:
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
  bool ReadCoordinate(const char** attributes, const char* name, const char* element,
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
  static constexpr int kNoField = -1;
  XmlStream xml_;
  std::string text_;
  int field_ = kNoField;
  size_t fieldDepth_ = 0;
};

}  // namespace navmisc::import::detail
