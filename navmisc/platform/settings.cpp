// Settings files: the reader, the writer and the handle tables behind RD_* and WR_*.
// docs/settings-format.md describes the file format; the rules below implement it.

#include "navmisc/platform/settings.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <climits>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

#include "navmisc/platform/atomic_file.h"
#include "navmisc/platform/detail/unique_fd.h"
#include "navmisc/platform/detail/utf8.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/textconv.h"

namespace {

// ---- limits and character classes shared by reader and writer ------------------------------

// Longest value (UTF-8 bytes, after unescaping) that is stored. Settings hold short texts; the
// limit keeps a damaged file from costing unbounded memory.
constexpr size_t kMaxValueBytes = 1024 * 1024;
// Longest section or key name (UTF-8 bytes).
constexpr size_t kMaxNameBytes = 4096;
// Longest line the reader keeps: room for a maximal name and a maximal value written with
// the widest escape ("\xHH" for one byte). Longer lines are skipped without being stored.
constexpr size_t kMaxLineBytes = kMaxNameBytes + 1 + 4 * kMaxValueBytes + 2;
constexpr size_t kReadChunk = 256 * 1024;

bool IsBlank(char c) { return c == ' ' || c == '\t'; }
bool IsControl(unsigned char c) { return c < 0x20 || c == 0x7F; }

std::string_view TrimLeft(std::string_view s) {
  while (!s.empty() && IsBlank(s.front())) s.remove_prefix(1);
  return s;
}
std::string_view TrimRight(std::string_view s) {
  while (!s.empty() && IsBlank(s.back())) s.remove_suffix(1);
  return s;
}
std::string_view Trim(std::string_view s) { return TrimRight(TrimLeft(s)); }

bool HasControl(std::string_view s) {
  for (char c : s) {
    if (IsControl(static_cast<unsigned char>(c))) return true;
  }
  return false;
}

// Names match without regard to ASCII case. Folding the UTF-8 bytes is safe: bytes below 0x80
// never occur inside a multi-byte sequence. Other letters match only as written, so that the
// result never depends on the process locale.
void FoldInto(std::string& out, std::string_view s) {
  const size_t start = out.size();
  out.append(s);
  for (size_t i = start; i < out.size(); ++i) {
    if (out[i] >= 'A' && out[i] <= 'Z') out[i] = static_cast<char>(out[i] - 'A' + 'a');
  }
}

// Index key of one entry. Names never hold control characters, so NUL cannot be part of
// either name and the pair maps to one string without ambiguity.
std::string EntryKey(std::string_view section, std::string_view key) {
  std::string out;
  out.reserve(section.size() + key.size() + 1);
  FoldInto(out, section);
  out.push_back('\0');
  FoldInto(out, key);
  return out;
}

// A name as the file may carry it: no control characters, no blanks at either end, not too
// long. Keys moreover are not empty, hold no "=" and do not start like a comment or a section
// header. The reader only produces such names, and the writer refuses any other.
bool IsValidSectionName(std::string_view s) {
  return s.size() <= kMaxNameBytes && !HasControl(s) && Trim(s).size() == s.size();
}
bool IsValidKeyName(std::string_view s) {
  return !s.empty() && IsValidSectionName(s) && s.find('=') == std::string_view::npos &&
         s.front() != '[' && s.front() != ';' && s.front() != '#';
}

// A caller's wide name in UTF-8; false when it cannot be valid UTF-8 (surrogates, values beyond
// U+10FFFF), as such a name can be neither written nor found.
bool NameToUtf8(const wchar_t* name, std::string& out) {
  out.clear();
  return name && navmisc::WideToUtf8(name, out);
}

// ---- reading ---------------------------------------------------------------------------------

// The parsed file: values (UTF-8, escapes undone) by EntryKey, and the folded names of every
// section that has a header (also sections without keys).
using Index = std::unordered_map<std::string, std::string>;
// The section names of a file in the order they first appear, each once, and their folded
// forms for lookups.
struct SectionList {
  std::vector<std::string> names;
  std::unordered_set<std::string> folded;

  void Add(const std::string& name) {
    std::string key;
    FoldInto(key, name);
    if (folded.insert(std::move(key)).second) names.push_back(name);
  }
};

struct Document {
  Index index;
  SectionList sections;
};

// Undoes the quoting of a value that starts with '"'. False when the closing quote is missing.
// Text after the closing quote is ignored.
bool Unquote(std::string_view raw, std::string& out) {
  auto hex = [](char c) -> int {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
  };
  out.clear();
  for (size_t i = 1; i < raw.size();) {
    const char c = raw[i];
    if (c == '"') return true;
    if (c != '\\') {
      out.push_back(c);
      ++i;
      continue;
    }
    if (i + 1 >= raw.size()) return false;
    const char e = raw[i + 1];
    switch (e) {
      case '\\': out.push_back('\\'); i += 2; continue;
      case '"': out.push_back('"'); i += 2; continue;
      case 'n': out.push_back('\n'); i += 2; continue;
      case 'r': out.push_back('\r'); i += 2; continue;
      case 't': out.push_back('\t'); i += 2; continue;
      case 'x':
        if (i + 3 < raw.size() && hex(raw[i + 2]) >= 0 && hex(raw[i + 3]) >= 0) {
          const unsigned cp = static_cast<unsigned>(hex(raw[i + 2]) * 16 + hex(raw[i + 3]));
          if (cp < 0x80) {
            out.push_back(static_cast<char>(cp));
          } else {  // U+0080..U+00FF in UTF-8
            out.push_back(static_cast<char>(0xC0 | (cp >> 6)));
            out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
          }
          i += 4;
          continue;
        }
        break;
      default:
        break;
    }
    // An unknown escape stands for itself.
    out.push_back('\\');
    out.push_back(e);
    i += 2;
  }
  return false;
}

// Names read from a file are made valid UTF-8 the way RD_STRING decodes values, so that a
// caller can name what it was given.
std::string CleanName(std::string_view s) {
  std::wstring wide;
  if (navmisc::Utf8ToWide(s, wide)) return std::string(s);
  return navmisc::ToUtf8Lossy(navmisc::FromUtf8Lossy(s));
}

// Splits a byte stream into lines and indexes them. Fed in pieces, so that the whole file never
// has to be in memory and an absurdly long line costs time in proportion to its length only.
class Parser {
 public:
  explicit Parser(Document& doc) : doc_(doc) {}

  void Feed(std::string_view bytes) {
    while (!bytes.empty()) {
      const size_t lf = bytes.find('\n');
      const std::string_view piece = bytes.substr(0, lf);
      if (lf != std::string_view::npos && pending_.empty() && !overlong_) {
        Line(piece);  // the common case: a whole line inside the chunk, no copy
      } else {
        Append(piece);
        if (lf != std::string_view::npos) EndLine();
      }
      if (lf == std::string_view::npos) break;
      bytes.remove_prefix(lf + 1);
    }
  }

  void Finish() { EndLine(); }

 private:
  void Append(std::string_view piece) {
    if (overlong_) return;
    if (pending_.size() + piece.size() > kMaxLineBytes) {
      overlong_ = true;
      pending_.clear();
      pending_.shrink_to_fit();
      return;
    }
    pending_.append(piece);
  }

  void EndLine() {
    if (!overlong_) Line(pending_);
    pending_.clear();
    overlong_ = false;
  }

  void Line(std::string_view line) {
    if (line.size() > kMaxLineBytes) return;
    if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
    line = Trim(line);
    if (line.empty() || line.front() == ';' || line.front() == '#') return;
    if (line.front() == '[') {
      // A header that cannot be used puts the keys below it out of reach rather than into the
      // section above it.
      section_ok_ = false;
      if (line.size() < 2 || line.back() != ']') return;
      const std::string_view name = Trim(line.substr(1, line.size() - 2));
      if (!IsValidSectionName(name)) return;
      section_ = CleanName(name);
      section_ok_ = true;
      doc_.sections.Add(section_);
      return;
    }
    const size_t eq = line.find('=');
    if (eq == std::string_view::npos || !section_ok_) return;
    const std::string_view key = TrimRight(line.substr(0, eq));
    if (!IsValidKeyName(key)) return;
    const std::string_view raw = TrimLeft(line.substr(eq + 1));
    std::string value;
    if (raw.empty() || raw.front() != '"' || !Unquote(raw, value)) value.assign(raw);
    // Text travels through the interface as NUL-terminated strings, so a NUL ends the value:
    // what a caller reads is then always something it can write back.
    if (const size_t nul = value.find('\0'); nul != std::string::npos) value.resize(nul);
    if (value.size() > kMaxValueBytes) return;
    // The first occurrence of a key wins; later ones are ignored.
    doc_.index.try_emplace(EntryKey(section_, CleanName(key)), std::move(value));
  }

  Document& doc_;
  std::string pending_;
  bool overlong_ = false;
  std::string section_;  // keys above the first header belong to the section ""
  bool section_ok_ = true;
};

// Decodes UTF-16 (either byte order) to UTF-8 in pieces. Unpaired surrogates become U+FFFD.
class Utf16Decoder {
 public:
  explicit Utf16Decoder(bool big_endian) : big_endian_(big_endian) {}

  void Feed(std::string_view bytes, std::string& out) {
    for (unsigned char b : bytes) {
      if (odd_ < 0) {
        odd_ = b;
        continue;
      }
      const unsigned unit = big_endian_ ? (static_cast<unsigned>(odd_) << 8 | b)
                                        : (static_cast<unsigned>(b) << 8 | static_cast<unsigned>(odd_));
      odd_ = -1;
      Unit(unit, out);
    }
  }

  void Finish(std::string& out) {
    if (high_ || odd_ >= 0) Put(0xFFFD, out);
    high_ = 0;
    odd_ = -1;
  }

 private:
  void Unit(unsigned unit, std::string& out) {
    if (unit >= 0xDC00 && unit <= 0xDFFF && high_) {
      Put(0x10000 + ((high_ - 0xD800) << 10) + (unit - 0xDC00), out);
      high_ = 0;
      return;
    }
    if (high_) Put(0xFFFD, out);
    high_ = 0;
    if (unit >= 0xD800 && unit <= 0xDBFF) {
      high_ = unit;
    } else if (unit >= 0xDC00 && unit <= 0xDFFF) {
      Put(0xFFFD, out);
    } else {
      Put(unit, out);
    }
  }

  static void Put(unsigned cp, std::string& out) { navmisc::detail::AppendUtf8(out, cp); }

  bool big_endian_;
  int odd_ = -1;       // first byte of an incomplete code unit
  unsigned high_ = 0;  // a high surrogate waiting for its partner
};

using Fd = navmisc::detail::UniqueFd;

// Reads up to `size` bytes, fewer only at the end of the file. -1 on error.
ssize_t ReadFull(int fd, char* buf, size_t size) {
  size_t done = 0;
  while (done < size) {
    const ssize_t n = ::read(fd, buf + done, size - done);
    if (n < 0) {
      if (errno == EINTR) continue;
      return -1;
    }
    if (n == 0) break;
    done += static_cast<size_t>(n);
  }
  return static_cast<ssize_t>(done);
}

// Turns the bytes of a settings document, in any of its encodings, into entries. Fed in pieces;
// the encoding is recognised from the start of the first piece.
class Loader {
 public:
  explicit Loader(Document& doc) : parser_(doc) {}

  void Feed(std::string_view bytes) {
    if (first_) {
      first_ = false;
      if (bytes.starts_with("\xEF\xBB\xBF")) {
        bytes.remove_prefix(3);
      } else if (bytes.starts_with("\xFF\xFE")) {
        encoding_ = Encoding::kUtf16Le;
        bytes.remove_prefix(2);
      } else if (bytes.starts_with("\xFE\xFF")) {
        encoding_ = Encoding::kUtf16Be;
        bytes.remove_prefix(2);
      } else if (bytes.size() >= 2 && (bytes[0] == '\0') != (bytes[1] == '\0')) {
        // Text never holds NUL, so one in the first two bytes can only be half of a UTF-16 code
        // unit: a file saved as UTF-16 without a byte-order mark.
        encoding_ = bytes[0] == '\0' ? Encoding::kUtf16Be : Encoding::kUtf16Le;
      }
      utf16_ = Utf16Decoder(encoding_ == Encoding::kUtf16Be);
    }
    if (encoding_ == Encoding::kUtf8) {
      parser_.Feed(bytes);
    } else {
      decoded_.clear();
      utf16_.Feed(bytes, decoded_);
      parser_.Feed(decoded_);
    }
  }

  void Finish() {
    if (encoding_ != Encoding::kUtf8) {
      decoded_.clear();
      utf16_.Finish(decoded_);
      parser_.Feed(decoded_);
    }
    parser_.Finish();
  }

 private:
  enum class Encoding { kUtf8, kUtf16Le, kUtf16Be };
  Parser parser_;
  bool first_ = true;
  Encoding encoding_ = Encoding::kUtf8;
  Utf16Decoder utf16_{false};
  std::string decoded_;
};

// Reads and indexes the file. False when it cannot be opened or read, or is not a regular file
// (a pipe or a device could block or never end).
bool LoadFile(const std::string& path, Document& doc) {
  Fd fd(navmisc::OpenRegularFile(path));
  if (fd.get() < 0) return false;

  Loader loader(doc);
  std::string chunk(kReadChunk, '\0');
  for (;;) {
    const ssize_t n = ReadFull(fd.get(), chunk.data(), chunk.size());
    if (n < 0) return false;
    loader.Feed(std::string_view(chunk.data(), static_cast<size_t>(n)));
    if (static_cast<size_t>(n) < chunk.size()) break;
  }
  loader.Finish();
  return true;
}

// Splits a folded name at its last run of digits: "section_tk(12)" into "section_tk(", 12 and
// ")". False when there is none, or the digits are not an int in plain decimal (no leading
// zero), the form a list's writer gives them.
bool SplitAtLastNumber(std::string_view name, std::string_view& before, int& number, std::string_view& after) {
  auto digit = [](char c) { return c >= '0' && c <= '9'; };
  size_t end = name.size();
  while (end > 0 && !digit(name[end - 1])) --end;
  if (end == 0) return false;
  size_t begin = end;
  while (begin > 0 && digit(name[begin - 1])) --begin;
  const std::string_view digits = name.substr(begin, end - begin);
  if (digits.size() > 10 || (digits.size() > 1 && digits[0] == '0')) return false;
  long long value = 0;
  for (char c : digits) value = value * 10 + (c - '0');
  if (value > INT_MAX) return false;
  before = name.substr(0, begin);
  number = static_cast<int>(value);
  after = name.substr(end);
  return true;
}

struct Reader {
  Document doc;

  // The stored value of section/key, or null. Lookups are the hot path of reading a trip, so
  // the key is built in buffers that the thread keeps.
  const std::string* Find(const wchar_t* section, const wchar_t* key) const {
    thread_local std::string name, entry;
    entry.clear();
    if (!NameToUtf8(section, name)) return nullptr;
    FoldInto(entry, name);
    entry.push_back('\0');
    if (!NameToUtf8(key, name)) return nullptr;
    FoldInto(entry, name);
    const auto it = doc.index.find(entry);
    return it == doc.index.end() ? nullptr : &it->second;
  }

  // The numbers n < count, ascending, for which a section (when `section` is null) or a key of
  // `section` is named `pattern` with n in place of its "%d".
  std::vector<int> Indices(const wchar_t* section, const wchar_t* pattern, int count) const {
    const std::wstring_view p = pattern ? std::wstring_view(pattern) : std::wstring_view();
    const size_t at = p.find(L"%d");
    std::string before, after, s;
    if (count <= 0 || at == std::wstring_view::npos ||
        !navmisc::WideToUtf8(p.substr(0, at), before) || !navmisc::WideToUtf8(p.substr(at + 2), after) ||
        (section && !NameToUtf8(section, s))) {
      return {};
    }
    std::string id = section ? "k" : "s";
    if (section) {
      id.push_back('\0');
      FoldInto(id, s);
    }
    id.push_back('\0');
    FoldInto(id, before);
    id.push_back('\0');
    FoldInto(id, after);
    std::call_once(lists_built_, [this] { BuildLists(); });
    const auto it = lists_.find(id);
    if (it == lists_.end()) return {};
    const std::vector<int>& all = it->second;
    return std::vector<int>(all.begin(), std::lower_bound(all.begin(), all.end(), count));
  }

 private:
  // Groups every section name, and every key name per section, that ends in a number by what
  // stands around that number, so that a list of any count is found in one lookup.
  void BuildLists() const {
    auto add = [this](std::string id, std::string_view name) {
      std::string_view before, after;
      int n;
      if (!SplitAtLastNumber(name, before, n, after)) return;
      id.append(before);
      id.push_back('\0');
      id.append(after);
      lists_[id].push_back(n);
    };
    for (const std::string& section : doc.sections.folded) add(std::string("s", 2), section);
    for (const auto& [entry, value] : doc.index) {
      const size_t nul = entry.find('\0');
      add("k" + std::string(1, '\0') + entry.substr(0, nul + 1), std::string_view(entry).substr(nul + 1));
    }
    for (auto& [id, numbers] : lists_) {
      std::sort(numbers.begin(), numbers.end());
      numbers.erase(std::unique(numbers.begin(), numbers.end()), numbers.end());
    }
  }

  mutable std::once_flag lists_built_;
  mutable std::unordered_map<std::string, std::vector<int>> lists_;
};

// ---- writing ---------------------------------------------------------------------------------

// Appends `value` as it stands after "key=": plain when a plain line keeps it intact, otherwise
// in double quotes with escapes. Code points that are not Unicode scalar values (lone
// surrogates, values beyond U+10FFFF) cannot be stored in UTF-8 and are written as U+FFFD.
// Returns the number of UTF-8 bytes the reader will get back.
size_t AppendValue(std::string& out, std::wstring_view value) {
  bool quote = !value.empty() && (value.front() == L' ' || value.front() == L'"' || value.back() == L' ');
  std::wstring clean(value);
  for (wchar_t& w : clean) {
    const auto cp = static_cast<uint32_t>(w);
    if (cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) w = static_cast<wchar_t>(0xFFFD);
    if (cp == '\\' || cp < 0x20 || cp == 0x7F) quote = true;
  }
  const std::string text = navmisc::ToUtf8Lossy(clean);
  if (!quote) {
    out += text;
    return text.size();
  }
  static constexpr char kHex[] = "0123456789ABCDEF";
  out.push_back('"');
  for (char c : text) {
    switch (c) {
      case '\\': out += "\\\\"; break;
      case '"': out += "\\\""; break;
      case '\n': out += "\\n"; break;
      case '\r': out += "\\r"; break;
      case '\t': out += "\\t"; break;
      default:
        if (IsControl(static_cast<unsigned char>(c))) {
          out += "\\x";
          out.push_back(kHex[(static_cast<unsigned char>(c) >> 4) & 0xF]);
          out.push_back(kHex[static_cast<unsigned char>(c) & 0xF]);
        } else {
          out.push_back(c);
        }
    }
  }
  out.push_back('"');
  return text.size();
}

struct Writer {
  struct Section {
    std::string name;  // as first written
    std::vector<std::pair<std::string, std::string>> entries;  // key, value as written
    std::unordered_map<std::string, size_t> by_key;             // folded key -> entries index
  };

  std::mutex mu;
  CString path;
  std::vector<Section> sections;
  std::unordered_map<std::string, size_t> by_section;  // folded name -> sections index

  // Stores key=text. A key written again keeps its place and takes the new value; section and
  // key keep the spelling of their first use.
  void Put(const wchar_t* section, const wchar_t* key, std::string text) {
    std::string s, k;
    if (!NameToUtf8(section, s) || !NameToUtf8(key, k)) return;
    if (!IsValidSectionName(s) || !IsValidKeyName(k)) return;
    std::string folded;
    FoldInto(folded, s);
    auto [sit, new_section] = by_section.try_emplace(std::move(folded), sections.size());
    if (new_section) sections.push_back(Section{s, {}, {}});
    Section& sec = sections[sit->second];
    folded.clear();
    FoldInto(folded, k);
    auto [kit, new_key] = sec.by_key.try_emplace(std::move(folded), sec.entries.size());
    if (new_key) {
      sec.entries.emplace_back(std::move(k), std::move(text));
    } else {
      sec.entries[kit->second].second = std::move(text);
    }
  }

  std::string Serialize() const {
    std::string out;
    for (size_t i = 0; i < sections.size(); ++i) {
      if (i) out.push_back('\n');
      out.push_back('[');
      out += sections[i].name;
      out += "]\n";
      for (const auto& [key, text] : sections[i].entries) {
        out += key;
        out.push_back('=');
        out += text;
        out.push_back('\n');
      }
    }
    return out;
  }
};

// ---- handles ---------------------------------------------------------------------------------

// Live objects by handle. Numbers count up from 1 and are never handed out while in use, so
// a stale or invented handle finds nothing rather than some other caller's file.
template <class T>
class HandleTable {
 public:
  unsigned long Add(std::shared_ptr<T> object) {
    std::lock_guard lock(mu_);
    while (next_ == 0 || live_.count(next_)) ++next_;
    const unsigned long handle = next_++;
    live_.emplace(handle, std::move(object));
    return handle;
  }
  std::shared_ptr<T> Get(unsigned long handle) {
    std::lock_guard lock(mu_);
    const auto it = live_.find(handle);
    return it == live_.end() ? nullptr : it->second;
  }
  std::shared_ptr<T> Take(unsigned long handle) {
    std::lock_guard lock(mu_);
    const auto it = live_.find(handle);
    if (it == live_.end()) return nullptr;
    std::shared_ptr<T> object = std::move(it->second);
    live_.erase(it);
    return object;
  }

 private:
  std::mutex mu_;
  std::unordered_map<unsigned long, std::shared_ptr<T>> live_;
  unsigned long next_ = 1;
};

// Never destroyed: a thread still calling RD_* while the process exits must not meet a dead
// table.
HandleTable<Reader>& Readers() {
  static auto* table = new HandleTable<Reader>;
  return *table;
}
HandleTable<Writer>& Writers() {
  static auto* table = new HandleTable<Writer>;
  return *table;
}

void WriteText(unsigned long handle, const wchar_t* section, const wchar_t* key, std::string text) {
  const auto writer = Writers().Get(handle);
  if (!writer) return;
  std::lock_guard lock(writer->mu);
  writer->Put(section, key, std::move(text));
}

}  // namespace

unsigned long RD_BEGIN(const wchar_t* path) {
  if (!path || !*path) return 0;
  auto reader = std::make_shared<Reader>();
  if (!LoadFile(navmisc::NativePath(path), reader->doc)) return 0;
  return Readers().Add(std::move(reader));
}

int RD_INT(unsigned long handle, const wchar_t* section, const wchar_t* key, int def) {
  const auto reader = Readers().Get(handle);
  const std::string* text = reader ? reader->Find(section, key) : nullptr;
  if (!text) return def;
  // Decimal, optionally signed, the whole value: "12abc", "1.5" or a number beyond the range
  // of int give the default rather than a guess.
  std::string_view s = *text;
  if (s.size() > 1 && s[0] == '+' && s[1] >= '0' && s[1] <= '9') s.remove_prefix(1);
  int value = 0;
  const auto r = std::from_chars(s.data(), s.data() + s.size(), value);
  return (r.ec == std::errc() && r.ptr == s.data() + s.size()) ? value : def;
}

double RD_FLOAT(unsigned long handle, const wchar_t* section, const wchar_t* key, double def) {
  const auto reader = Readers().Get(handle);
  const std::string* text = reader ? reader->Find(section, key) : nullptr;
  if (!text) return def;
  // from_chars never looks at the locale: the decimal separator is always a point.
  std::string_view s = *text;
  if (s.size() > 1 && s[0] == '+' && s[1] != '-' && s[1] != '+') s.remove_prefix(1);
  double value = 0;
  const auto r = std::from_chars(s.data(), s.data() + s.size(), value);
  return (r.ec == std::errc() && r.ptr == s.data() + s.size()) ? value : def;
}

CString RD_STRING(unsigned long handle, const wchar_t* section, const wchar_t* key,
                  const wchar_t* def) {
  const auto reader = Readers().Get(handle);
  const std::string* text = reader ? reader->Find(section, key) : nullptr;
  if (!text) return CString(def);
  return CString(navmisc::FromUtf8Lossy(*text));
}

bool RD_EXISTS(unsigned long handle, const wchar_t* section, const wchar_t* key) {
  const auto reader = Readers().Get(handle);
  return reader && reader->Find(section, key) != nullptr;
}

int RD_SECTIONS(unsigned long handle, CStringList& names) {
  const auto reader = Readers().Get(handle);
  if (!reader) return 0;
  for (const std::string& name : reader->doc.sections.names) names.AddTail(CString::FromUtf8(name));
  return static_cast<int>(reader->doc.sections.names.size());
}

void RD_END(unsigned long handle) { Readers().Take(handle); }

std::vector<int> navmisc::SectionIndices(unsigned long handle, const wchar_t* pattern, int count) {
  const auto reader = Readers().Get(handle);
  return reader ? reader->Indices(nullptr, pattern, count) : std::vector<int>();
}

std::vector<int> navmisc::SectionIndices(unsigned long handle, const wchar_t* pattern, const wchar_t* parent,
                                         int count) {
  std::wstring own = pattern ? pattern : L"";
  if (const size_t at = own.find(L"%s"); at != std::wstring::npos) own.replace(at, 2, parent ? parent : L"");
  return SectionIndices(handle, own.c_str(), count);
}

std::vector<int> navmisc::KeyIndices(unsigned long handle, const wchar_t* section, const wchar_t* pattern,
                                     int count) {
  const auto reader = Readers().Get(handle);
  return reader && section ? reader->Indices(section, pattern, count) : std::vector<int>();
}

unsigned long navmisc::ReadSettingsFromMemory(std::string_view bytes) {
  auto reader = std::make_shared<Reader>();
  Loader loader(reader->doc);
  loader.Feed(bytes);
  loader.Finish();
  return Readers().Add(std::move(reader));
}

std::vector<navmisc::SettingsEntry> navmisc::SettingsEntries(unsigned long handle) {
  std::vector<SettingsEntry> out;
  const auto reader = Readers().Get(handle);
  if (!reader) return out;
  out.reserve(reader->doc.index.size());
  for (const auto& [entry, value] : reader->doc.index) {
    const std::string_view name = entry;
    const size_t nul = name.find('\0');
    out.push_back({CString(FromUtf8Lossy(name.substr(0, nul))), CString(FromUtf8Lossy(name.substr(nul + 1))),
                   CString(FromUtf8Lossy(value))});
  }
  return out;
}

bool navmisc::EndSettingsToMemory(unsigned long handle, std::string& document) {
  const auto writer = Writers().Take(handle);
  if (!writer) return false;
  std::lock_guard lock(writer->mu);
  document = writer->Serialize();
  return true;
}

unsigned long WR_BEGIN(const wchar_t* path) {
  if (!path || !*path) return 0;
  auto writer = std::make_shared<Writer>();
  writer->path = path;
  return Writers().Add(std::move(writer));
}

void WR_INT(unsigned long handle, const wchar_t* section, const wchar_t* key, int value) {
  std::string text;
  navmisc::AppendInt(text, value);
  WriteText(handle, section, key, std::move(text));
}

void WR_FLOAT(unsigned long handle, const wchar_t* section, const wchar_t* key, double value) {
  WriteText(handle, section, key, navmisc::ShortestDouble(value));
}

void WR_STRING(unsigned long handle, const wchar_t* section, const wchar_t* key,
               const wchar_t* value) {
  std::string text;
  // A value too long for a reader to keep is not written at all, rather than written and then
  // silently lost on the next read.
  if (AppendValue(text, value ? value : L"") > kMaxValueBytes) return;
  WriteText(handle, section, key, std::move(text));
}

void WR_ABANDON(unsigned long handle) { Writers().Take(handle); }

int WR_END(unsigned long handle) {
  const auto writer = Writers().Take(handle);
  if (!writer) return 0;
  std::lock_guard lock(writer->mu);
  navmisc::AtomicFile file;
  if (!file.Open(writer->path)) return 0;
  if (!file.Write(writer->Serialize())) return 0;
  return file.Commit() ? 1 : 0;
}
