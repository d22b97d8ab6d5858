#include "navmisc/import/detail/xml_stream.h"

#include <libxml/SAX2.h>
#include <libxml/parser.h>
#include <libxml/xmlerror.h>

#include <algorithm>
#include <cstring>
#include <mutex>

#include "navmisc/import/import_errors.h"

namespace navmisc::import::detail {
namespace {

// The parser's own message, one line, without its trailing line break.
std::string OneLine(const char* message) {
  std::string out = message ? message : "";
  while (!out.empty() && (out.back() == '\n' || out.back() == ' ')) out.pop_back();
  std::replace(out.begin(), out.end(), '\n', ' ');
  return out;
}

void Quiet(void*, const char*, ...) {}

constexpr int kOptions = XML_PARSE_NONET;  // no network, no entities substituted, no DTD loaded

}  // namespace

std::optional<std::string_view> XmlAttributes::Find(std::string_view name) const {
  for (int i = 0; i < count_; ++i) {
    const unsigned char** a = list_ + 5 * i;
    const char* local = reinterpret_cast<const char*>(a[0]);
    if (std::strncmp(local, name.data(), name.size()) == 0 && local[name.size()] == '\0') {
      return std::string_view(reinterpret_cast<const char*>(a[3]), static_cast<size_t>(a[4] - a[3]));
    }
  }
  return std::nullopt;
}

XmlStream::XmlStream(XmlHandler& handler) : handler_(handler) {
  static std::once_flag init;
  std::call_once(init, [] { xmlInitParser(); });
}

// The parser is made by the first Feed or by ReadAll, which need different kinds.
bool XmlStream::MakeParser(bool pull) {
  // Some faults (a byte the declared encoding lacks) are also told on the thread's generic error
  // channel, which writes to stderr; every fault already reaches OnError.
  xmlSetGenericErrorFunc(nullptr, Quiet);
  xmlSAXHandler sax;
  std::memset(&sax, 0, sizeof sax);
  sax.initialized = XML_SAX2_MAGIC;
  sax.startElementNs = OnStart;
  sax.endElementNs = OnEnd;
  // CDATA sections arrive as plain text when there is no handler of their own.
  sax.characters = OnText;
  sax.ignorableWhitespace = OnText;
  sax.comment = [](void* ctx, const unsigned char*) { Self(ctx).touched_ = true; };
  sax.processingInstruction = OnOther;
  // Track files never need a document type; refusing it shuts out every entity trick at once.
  sax.internalSubset = OnDoctype;
  sax.serror = OnError;
  pull_ = pull;
  parser_ = pull ? xmlCreateIOParserCtxt(&sax, this, OnRead, nullptr, this, XML_CHAR_ENCODING_NONE)
                 : xmlCreatePushParserCtxt(&sax, this, nullptr, 0, nullptr);
  if (!parser_) {
    status_ = {DC_ERR_IMPORT_READ, "out of memory for the XML parser"};
    return false;
  }
  xmlCtxtUseOptions(parser_, kOptions);
  return true;
}

XmlStream::~XmlStream() {
  if (parser_) xmlFreeParserCtxt(parser_);
}

XmlStream& XmlStream::Self(void* ctx) { return *static_cast<XmlStream*>(ctx); }

std::string XmlStream::Where() const {
  return "line " + std::to_string(parser_ ? xmlSAX2GetLineNumber(parser_) : 0) + ": ";
}

void XmlStream::Stop(int32_t code, std::string message) {
  if (status_.ok()) status_ = {code, std::move(message)};
  if (parser_) xmlStopParser(parser_);
}

void XmlStream::OnStart(void* ctx, const unsigned char* localName, const unsigned char* prefix,
                        const unsigned char*, int, const unsigned char**, int attributeCount, int,
                        const unsigned char** attributes) {
  XmlStream& self = Self(ctx);
  if (!self.status_.ok()) return;
  self.touched_ = self.started_ = true;
  if (++self.depth_ > kMaxDepth) {
    self.Stop(DC_ERR_IMPORT_MALFORMED,
              self.Where() + "elements nested more than " + std::to_string(kMaxDepth) + " deep");
    return;
  }
  self.prefixes_[self.depth_] = prefix;
  self.handler_.StartElement(XmlName(localName), XmlAttributes(attributes, attributeCount));
}

void XmlStream::OnEnd(void* ctx, const unsigned char*, const unsigned char*,
                      const unsigned char*) {
  XmlStream& self = Self(ctx);
  if (!self.status_.ok()) return;
  self.touched_ = true;
  --self.depth_;
  self.handler_.EndElement();
}

void XmlStream::OnText(void* ctx, const unsigned char* text, int length) {
  XmlStream& self = Self(ctx);
  if (!self.status_.ok()) return;
  self.touched_ = true;
  self.handler_.Text(std::string_view(reinterpret_cast<const char*>(text), static_cast<size_t>(length)));
}

void XmlStream::OnOther(void* ctx, const unsigned char*, const unsigned char*) { Self(ctx).touched_ = true; }

void XmlStream::OnDoctype(void* ctx, const unsigned char*, const unsigned char*, const unsigned char*) {
  XmlStream& self = Self(ctx);
  self.Stop(DC_ERR_IMPORT_DTD, self.Where() +
                                   "the document declares a document type; track files have "
                                   "none, and its entities are refused");
}

void XmlStream::OnError(void* ctx, _xmlError* error) {
  XmlStream& self = Self(ctx);
  // Warnings and recoverable errors (an undeclared namespace prefix, say) leave the document
  // readable; only a fatal error ends it.
  if (!error || error->level < XML_ERR_FATAL || !self.status_.ok()) return;
  if (self.fed_ == 0) {
    self.status_ = {DC_ERR_IMPORT_EMPTY, "the file is empty"};
    return;
  }
  std::string what = OneLine(error->message);
  // An early end reads as "extra content" to the push parser; say what is really wrong.
  const bool end = error->code == XML_ERR_DOCUMENT_END || error->code == XML_ERR_TAG_NOT_FINISHED ||
                   error->code == XML_ERR_DOCUMENT_EMPTY;
  if (end && (self.depth_ > 0 || !self.started_)) what = self.EarlyEnd();
  self.status_ = {DC_ERR_IMPORT_MALFORMED,
                  "line " + std::to_string(error->line) + ": not well-formed XML (" + what + ")"};
}

bool XmlStream::Bound(size_t size) {
  // An event in the latest piece may have come at its start: the bound is loose by one piece.
  pending_ = touched_ ? size : pending_ + size;
  touched_ = false;
  if (pending_ <= kMaxPending) return true;
  status_ = {DC_ERR_IMPORT_TOO_LONG, Where() + "a single tag, comment or name runs over more than " +
                                         std::to_string(kMaxPending >> 20) + " MiB"};
  return false;
}

bool XmlStream::Parse(const char* data, size_t size, bool final) {
  if (!status_.ok() || finished_) return status_.ok();
  if (!parser_ && !MakeParser(false)) return false;
  fed_ += size;
  const int rc = xmlParseChunk(parser_, data, static_cast<int>(size), final ? 1 : 0);
  if (!status_.ok()) return false;
  if (rc != 0) {
    status_ = {DC_ERR_IMPORT_MALFORMED, Where() + "not well-formed XML (error " + std::to_string(rc) + ")"};
    return false;
  }
  return final || Bound(size);
}

bool XmlStream::Feed(const char* data, size_t size) {
  while (size > 0) {
    // The most bytes handed to the parser in one call; also the grain of the pending-bytes bound.
    const size_t n = std::min(size, kReadPiece);
    if (!Parse(data, n, false)) return false;
    data += n;
    size -= n;
  }
  return status_.ok();
}

bool XmlStream::Finish() {
  if (fed_ == 0 && status_.ok()) status_ = {DC_ERR_IMPORT_EMPTY, "the file is empty"};
  Parse(nullptr, 0, true);
  finished_ = true;
  return Closed();
}

std::string XmlStream::ContentContext() const {
  if (!parser_ || pull_ || finished_ || !status_.ok() || !started_ || depth_ == 0 ||
      parser_->instate != XML_PARSER_CONTENT || parser_->nameNr != depth_)
    return {};
  const xmlParserInputPtr input = parser_->input;
  if (!input || !input->buf || input->buf->encoder || !input->cur || !input->end) return {};
  for (const unsigned char* p = input->cur; p < input->end; ++p) {
    if (*p != ' ' && *p != '\t' && *p != '\r' && *p != '\n') return {};
  }
  // Strings of the parser never hold a NUL: it separates them here.
  std::string out;
  auto add = [&out](const unsigned char* text) {
    if (text) out += reinterpret_cast<const char*>(text);
    out += '\0';
  };
  for (int i = 0; i < depth_; ++i) {
    add(prefixes_[i + 1]);
    add(parser_->nameTab[i]);
  }
  out += '\n';
  for (int i = 0; i < parser_->nsNr; ++i) add(parser_->nsTab[i]);
  return out;
}

bool XmlStream::Closed() {
  // The parser lets a few faults pass unsaid (bytes its converter gives up on, in some cuts of
  // the input): a document is only whole when its root element has ended.
  if (status_.ok() && (!started_ || depth_ != 0)) {
    status_ = {DC_ERR_IMPORT_MALFORMED, Where() + "not well-formed XML (" + EarlyEnd() + ")"};
  }
  return status_.ok();
}

std::string XmlStream::EarlyEnd() const {
  return started_ ? "the document ends before " + std::to_string(depth_) + " elements are closed"
                  : "no root element";
}

int XmlStream::OnRead(void* ctx, char* buffer, int size) {
  XmlStream& self = Self(ctx);
  if (!self.status_.ok()) return -1;
  // The parser takes a short read for the end of the input (at the start it needs its whole
  // declaration at once), so the buffer is filled as far as the source goes.
  size_t n = 0;
  while (n < static_cast<size_t>(size)) {
    const long got = (*self.source_)(buffer + n, static_cast<size_t>(size) - n);
    if (got < 0) {
      self.status_ = {DC_ERR_IMPORT_READ, "the file could not be read"};
      return -1;
    }
    if (got == 0) break;
    n += static_cast<size_t>(got);
  }
  // A refusal here ends the input; the callbacks stay silent from now on.
  self.fed_ += n;
  return self.Bound(n) ? static_cast<int>(n) : -1;
}

bool XmlStream::ReadAll(const TrackReader::Source& source) {
  if (parser_ || finished_) {
    status_ = {DC_ERR_IMPORT_READ, "the document is already being read"};
    return false;
  }
  finished_ = true;
  if (!MakeParser(true)) return false;
  source_ = &source;
  const int rc = xmlParseDocument(parser_);
  // Pulling, the parser takes a NUL byte for the end of the input: whatever follows the document
  // must still be nothing.
  if (rc == 0 && status_.ok() && parser_->wellFormed) {
    char more = 0;
    const xmlParserInputPtr input = parser_->input;
    const bool unconverted = input && input->buf && input->buf->raw && xmlBufUse(input->buf->raw) > 0;
    if ((input && input->cur && input->cur < input->end) || unconverted || OnRead(this, &more, 1) > 0) {
      status_ = {DC_ERR_IMPORT_MALFORMED, Where() + "not well-formed XML (content after the end of the document)"};
    }
  }
  source_ = nullptr;
  if (!status_.ok()) return false;
  if (fed_ == 0) {
    status_ = {DC_ERR_IMPORT_EMPTY, "the file is empty"};
  } else if (rc != 0 || !parser_->wellFormed) {
    status_ = {DC_ERR_IMPORT_MALFORMED, Where() + "not well-formed XML"};
  }
  return Closed();
}

}  // namespace navmisc::import::detail
