#include "navmisc/import/detail/xml_stream.h"

#include <expat.h>

#include <algorithm>
#include <cstring>

#include "navmisc/import/import_errors.h"

namespace navmisc::import::detail {
namespace {

// Separates a namespace from the local name in the names expat reports.
constexpr char kNsSeparator = '\x01';
// The most bytes handed to expat in one call.
constexpr size_t kPiece = 1u << 20;

std::string_view LocalName(const char* name) {
  const char* sep = std::strrchr(name, kNsSeparator);
  return sep ? std::string_view(sep + 1) : std::string_view(name);
}

// Single-byte encodings that Windows programs declare and expat does not know itself; -1 marks
// a byte the encoding leaves undefined.
constexpr int kCp1252High[32] = {
    0x20AC, -1,     0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021, 0x02C6, 0x2030, 0x0160,
    0x2039, 0x0152, -1,     0x017D, -1,     -1,     0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, -1,     0x017E, 0x0178};

bool SameName(const char* a, const char* b) {
  for (; *a && *b; ++a, ++b) {
    char x = *a, y = *b;
    if (x >= 'A' && x <= 'Z') x = static_cast<char>(x - 'A' + 'a');
    if (y >= 'A' && y <= 'Z') y = static_cast<char>(y - 'A' + 'a');
    if (x != y) return false;
  }
  return *a == *b;
}

}  // namespace

const char* FindAttribute(const char** attributes, std::string_view name) {
  for (const char** a = attributes; a && a[0]; a += 2) {
    if (LocalName(a[0]) == name) return a[1];
  }
  return nullptr;
}

XmlStream::XmlStream(XmlHandler& handler)
    : parser_(XML_ParserCreateNS(nullptr, kNsSeparator)), handler_(handler) {
  if (!parser_) {
    status_ = {DC_ERR_IMPORT_READ, "out of memory for the XML parser"};
    return;
  }
  XML_SetUserData(parser_, this);
  XML_SetElementHandler(parser_, OnStart, OnEnd);
  XML_SetCharacterDataHandler(parser_, OnText);
  XML_SetCommentHandler(parser_, OnOther);
  XML_SetProcessingInstructionHandler(
      parser_, [](void* self, const char*, const char*) { static_cast<XmlStream*>(self)->Touched(); });
  XML_SetXmlDeclHandler(parser_, [](void* self, const char*, const char*, int) {
    static_cast<XmlStream*>(self)->Touched();
  });
  XML_SetCdataSectionHandler(
      parser_, [](void* self) { static_cast<XmlStream*>(self)->Touched(); },
      [](void* self) { static_cast<XmlStream*>(self)->Touched(); });
  // Track files never need a document type; refusing it shuts out every entity trick at once.
  XML_SetStartDoctypeDeclHandler(parser_, OnDoctype);
  XML_SetParamEntityParsing(parser_, XML_PARAM_ENTITY_PARSING_NEVER);
  XML_SetExternalEntityRefHandler(parser_, [](XML_Parser, const char*, const char*, const char*,
                                              const char*) { return int{XML_STATUS_ERROR}; });
  XML_SetUnknownEncodingHandler(parser_, OnUnknownEncoding, nullptr);
}

XmlStream::~XmlStream() {
  if (parser_) XML_ParserFree(parser_);
}

void XmlStream::Touched() { lastEvent_ = static_cast<uint64_t>(XML_GetCurrentByteIndex(parser_)); }

std::string XmlStream::Where() const {
  return "line " + std::to_string(parser_ ? XML_GetCurrentLineNumber(parser_) : 0) + ": ";
}

void XmlStream::Stop(int32_t code, std::string message) {
  if (status_.ok()) status_ = {code, std::move(message)};
  XML_StopParser(parser_, XML_FALSE);
}

void XmlStream::OnStart(void* p, const char* name, const char** attributes) {
  auto* self = static_cast<XmlStream*>(p);
  self->Touched();
  if (++self->depth_ > kMaxDepth) {
    self->Stop(DC_ERR_IMPORT_MALFORMED,
               self->Where() + "elements nested more than " + std::to_string(kMaxDepth) + " deep");
    return;
  }
  self->handler_.StartElement(LocalName(name), attributes);
}

void XmlStream::OnEnd(void* p, const char* name) {
  auto* self = static_cast<XmlStream*>(p);
  self->Touched();
  --self->depth_;
  self->handler_.EndElement(LocalName(name));
}

void XmlStream::OnText(void* p, const char* text, int length) {
  auto* self = static_cast<XmlStream*>(p);
  self->Touched();
  self->handler_.Text(std::string_view(text, static_cast<size_t>(length)));
}

void XmlStream::OnOther(void* p, const char*) { static_cast<XmlStream*>(p)->Touched(); }

void XmlStream::OnDoctype(void* p, const char*, const char*, const char*, int) {
  auto* self = static_cast<XmlStream*>(p);
  self->Stop(DC_ERR_IMPORT_DTD, self->Where() +
                                    "the document declares a document type; track files have "
                                    "none, and its entities are refused");
}

int XmlStream::OnUnknownEncoding(void*, const char* name, XML_Encoding* info) {
  const bool cp1252 = SameName(name, "windows-1252") || SameName(name, "cp1252");
  const bool latin9 = SameName(name, "iso-8859-15") || SameName(name, "latin-9");
  if (!cp1252 && !latin9) return XML_STATUS_ERROR;
  for (int i = 0; i < 256; ++i) info->map[i] = i;
  if (cp1252) {
    for (int i = 0; i < 32; ++i) info->map[0x80 + i] = kCp1252High[i];
  } else {
    const struct { int byte, code; } diffs[] = {{0xA4, 0x20AC}, {0xA6, 0x0160}, {0xA8, 0x0161},
                                                {0xB4, 0x017D}, {0xB8, 0x017E}, {0xBC, 0x0152},
                                                {0xBD, 0x0153}, {0xBE, 0x0178}};
    for (const auto& d : diffs) info->map[d.byte] = d.code;
  }
  info->data = nullptr;
  info->convert = nullptr;
  info->release = nullptr;
  return XML_STATUS_OK;
}

bool XmlStream::Parse(const char* data, size_t size, bool final) {
  if (!status_.ok() || finished_) return status_.ok();
  if (XML_Parse(parser_, data, static_cast<int>(size), final ? XML_TRUE : XML_FALSE) ==
      XML_STATUS_ERROR) {
    if (status_.ok()) {
      const XML_Error err = XML_GetErrorCode(parser_);
      if (err == XML_ERROR_NO_ELEMENTS && fed_ == 0) {
        status_ = {DC_ERR_IMPORT_EMPTY, "the file is empty"};
      } else {
        status_ = {DC_ERR_IMPORT_MALFORMED,
                   Where() + "not well-formed XML (" + XML_ErrorString(err) + ")"};
      }
    }
    return false;
  }
  if (!status_.ok()) return false;
  if (fed_ - std::min(fed_, lastEvent_) > kMaxPending) {
    status_ = {DC_ERR_IMPORT_TOO_LONG,
               Where() + "a single tag, comment or name runs over more than " +
                   std::to_string(kMaxPending >> 20) + " MiB"};
    return false;
  }
  return true;
}

bool XmlStream::Feed(const char* data, size_t size) {
  while (size > 0) {
    const size_t n = std::min(size, kPiece);
    fed_ += n;
    if (!Parse(data, n, false)) return false;
    data += n;
    size -= n;
  }
  return status_.ok();
}

bool XmlStream::Finish() {
  const bool ok = Parse(nullptr, 0, true);
  finished_ = true;
  return ok;
}

}  // namespace navmisc::import::detail
