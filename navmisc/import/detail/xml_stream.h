// The XML layer of the GPX and TCX readers: expat, fed in pieces, with everything that could
// make a document cost more than its size refused. No document type declarations (so no
// entities, internal or external, and no entity expansion), a bounded nesting depth, and a
// bound on how much expat may buffer for one unfinished token (a 1 GB attribute or tag).
#pragma once

#include <expat.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "navmisc/import/track_reader.h"

namespace navmisc::import::detail {

// Element names arrive as their local part (the namespace dropped: GPX 1.0 and 1.1, and the
// extension schemas of many vendors, use the same local names).
class XmlHandler {
 public:
  virtual ~XmlHandler() = default;
  // `attributes` is expat's list: name, value, name, value, ..., null; names are local.
  virtual void StartElement(std::string_view name, const char** attributes) = 0;
  virtual void EndElement(std::string_view name) = 0;
  // Character data, in pieces of any size.
  virtual void Text(std::string_view text) = 0;
};

// The value of attribute `name` (local name) in an expat attribute list, or null.
const char* FindAttribute(const char** attributes, std::string_view name);

class XmlStream {
 public:
  static constexpr int kMaxDepth = 256;
  // Bytes fed without any event (start, end, text, comment) before the document fails as
  // DC_ERR_IMPORT_TOO_LONG.
  static constexpr uint64_t kMaxPending = 4u << 20;

  explicit XmlStream(XmlHandler& handler);
  ~XmlStream();
  XmlStream(const XmlStream&) = delete;
  XmlStream& operator=(const XmlStream&) = delete;

  // False once the document has failed (status()).
  bool Feed(const char* data, size_t size);
  bool Finish();
  // Called by the handler: stops the parsing with this outcome.
  void Stop(int32_t code, std::string message);
  // "line N: " for messages about the current place.
  std::string Where() const;
  const ReadStatus& status() const { return status_; }
  uint64_t bytesFed() const { return fed_; }

 private:
  static void OnStart(void* self, const char* name, const char** attributes);
  static void OnEnd(void* self, const char* name);
  static void OnText(void* self, const char* text, int length);
  static void OnOther(void* self, const char* data);
  static void OnDoctype(void* self, const char* name, const char* sysid, const char* pubid,
                        int hasInternalSubset);
  static int OnUnknownEncoding(void* data, const char* name, XML_Encoding* info);
  bool Parse(const char* data, size_t size, bool final);
  void Touched();

  XML_Parser parser_;
  XmlHandler& handler_;
  ReadStatus status_;
  int depth_ = 0;
  uint64_t fed_ = 0;
  uint64_t lastEvent_ = 0;  // byte offset of the latest event
  bool finished_ = false;
};

}  // namespace navmisc::import::detail
