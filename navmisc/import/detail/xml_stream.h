// The XML layer of the GPX and TCX readers: libxml2's SAX parser, pushed in pieces or pulling
// the document itself, with everything that could make a document cost more than its size
// refused. No
// document type declarations (so no entities, internal or external, and no entity expansion), no
// network, a bounded nesting depth, and a bound on how much the parser may buffer for one
// unfinished token (a 1 GB attribute or tag).
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "navmisc/import/track_reader.h"

struct _xmlParserCtxt;
struct _xmlError;

namespace navmisc::import::detail {

// A start tag's attributes as the parser reports them: five pointers for each (local name,
// prefix, namespace, start of the value, end of the value).
class XmlAttributes {
 public:
  XmlAttributes() = default;
  XmlAttributes(const unsigned char** list, int count) : list_(list), count_(count) {}
  // The value of the attribute with local name `name`, if the tag has one.
  std::optional<std::string_view> Find(std::string_view name) const;

 private:
  const unsigned char** list_ = nullptr;
  int count_ = 0;
};

// An element's local name (the namespace dropped: GPX 1.0 and 1.1, and the extension schemas of
// many vendors, use the same local names). It points into the parser's dictionary: the same name
// comes at the same address for the whole document, and no other name ever takes that address,
// so the address identifies the name.
class XmlName {
 public:
  explicit XmlName(const unsigned char* text) : text_(reinterpret_cast<const char*>(text)) {}
  const char* key() const { return text_; }
  std::string_view view() const { return text_; }

 private:
  const char* text_;
};

class XmlHandler {
 public:
  virtual ~XmlHandler() = default;
  virtual void StartElement(XmlName name, const XmlAttributes& attributes) = 0;
  virtual void EndElement() = 0;
  // Character data, in pieces of any size.
  virtual void Text(std::string_view text) = 0;
};

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
  // The whole document from `source`, pulled by the parser (which is quicker than pushing the
  // same bytes); instead of Feed and Finish.
  bool ReadAll(const TrackReader::Source& source);
  // Called by the handler: stops the parsing with this outcome.
  void Stop(int32_t code, std::string message);
  // "line N: " for messages about the current place.
  std::string Where() const;
  const ReadStatus& status() const { return status_; }
  uint64_t bytesFed() const { return fed_; }
  // Where a document fed in pieces stands after the latest Feed, for cutting it in two: when the
  // parser has taken in every byte so far but white space, stands in element content and
  // converts no encoding, the open elements and the namespaces in scope, written out; "" when
  // not. Bytes that follow read the same after any prefix that leaves the same context.
  std::string ContentContext() const;

 private:
  static void OnStart(void* ctx, const unsigned char* localName, const unsigned char* prefix,
                      const unsigned char* uri, int namespaceCount, const unsigned char** namespaces,
                      int attributeCount, int defaultedCount, const unsigned char** attributes);
  static void OnEnd(void* ctx, const unsigned char* localName, const unsigned char* prefix,
                    const unsigned char* uri);
  static void OnText(void* ctx, const unsigned char* text, int length);
  static void OnOther(void* ctx, const unsigned char* a, const unsigned char* b);
  static void OnDoctype(void* ctx, const unsigned char* name, const unsigned char* externalId,
                        const unsigned char* systemId);
  static void OnError(void* ctx, _xmlError* error);
  static int OnRead(void* ctx, char* buffer, int size);
  static XmlStream& Self(void* ctx);
  bool MakeParser(bool pull);
  // After the end of the input: false unless the root element has ended (and nothing failed).
  bool Closed();
  // What a document that ends too early lacks, in words.
  std::string EarlyEnd() const;
  bool Parse(const char* data, size_t size, bool final);
  // After `size` more bytes went to the parser: false when too many came without an event.
  bool Bound(size_t size);

  _xmlParserCtxt* parser_ = nullptr;
  bool pull_ = false;
  XmlHandler& handler_;
  const TrackReader::Source* source_ = nullptr;  // while ReadAll runs
  ReadStatus status_;
  int depth_ = 0;
  uint64_t fed_ = 0;
  uint64_t pending_ = 0;   // bytes fed since the latest event
  bool touched_ = false;   // an event since the latest piece was fed
  bool started_ = false;   // the root element has begun
  bool finished_ = false;
  // The namespace prefix of each open element (the parser's own table keeps only local names).
  const unsigned char* prefixes_[kMaxDepth + 1] = {};
};

}  // namespace navmisc::import::detail
