#include "xml_reader.h"

#include <expat.h>

#include <algorithm>
#include <memory>
#include <vector>

namespace gpsdc {
namespace {

struct State {
  const XmlHandlers* handlers;
  XML_Parser parser;
  std::string* root;
  bool first = true;
  bool refused = false;
  std::vector<std::string> text;  // character data of each open element
};

void OnStart(void* data, const XML_Char* name, const XML_Char** attrs) {
  auto& s = *static_cast<State*>(data);
  if (s.first && s.root) *s.root = name;
  s.first = false;
  s.text.emplace_back();
  if (!s.handlers->start) return;
  XmlAttributes attributes;
  for (int i = 0; attrs[i] && attrs[i + 1]; i += 2) attributes[attrs[i]] = attrs[i + 1];
  s.handlers->start(name, attributes);
}

void OnEnd(void* data, const XML_Char* name) {
  auto& s = *static_cast<State*>(data);
  std::string text = std::move(s.text.back());
  s.text.pop_back();
  if (s.handlers->end) s.handlers->end(name, text);
}

void OnText(void* data, const XML_Char* chars, int len) {
  auto& s = *static_cast<State*>(data);
  if (!s.text.empty()) s.text.back().append(chars, static_cast<size_t>(len));
}

void OnDoctype(void* data, const XML_Char*, const XML_Char*, const XML_Char*, int) {
  auto& s = *static_cast<State*>(data);
  s.refused = true;
  XML_StopParser(s.parser, XML_FALSE);
}

}  // namespace

bool ReadXml(std::string_view document, const XmlHandlers& handlers, std::string* root) {
  std::unique_ptr<XML_ParserStruct, decltype(&XML_ParserFree)> parser(XML_ParserCreate("UTF-8"),
                                                                       &XML_ParserFree);
  if (!parser) return false;
  if (root) root->clear();
  State state{&handlers, parser.get(), root, true, false, {}};
  XML_SetUserData(parser.get(), &state);
  XML_SetElementHandler(parser.get(), OnStart, OnEnd);
  XML_SetCharacterDataHandler(parser.get(), OnText);
  XML_SetStartDoctypeDeclHandler(parser.get(), OnDoctype);
  // Fed in slices: expat takes an int length.
  constexpr size_t kSlice = 1 << 20;
  do {
    const size_t n = std::min(kSlice, document.size());
    const bool last = n == document.size();
    if (XML_Parse(parser.get(), document.data(), static_cast<int>(n), last) != XML_STATUS_OK)
      return false;
    document.remove_prefix(n);
  } while (!document.empty());
  return !state.refused && !state.first;
}

}  // namespace gpsdc
