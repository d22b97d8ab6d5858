// Reading the XML documents of the web service (its answers, and GPX files) with expat.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <string_view>

namespace gpsdc {

using XmlAttributes = std::map<std::string, std::string>;

struct XmlHandlers {
  // An element begins: its name (with any namespace prefix as written) and attributes.
  std::function<void(const std::string& name, const XmlAttributes& attributes)> start;
  // An element ends; `text` is the character data directly inside it.
  std::function<void(const std::string& name, const std::string& text)> end;
};

// Reads `document` and calls the handlers in order. False when it is not well-formed XML (or
// holds a document type declaration: the service never sends one, and entity tricks come that
// way). `root` is set to the name of the document's first element.
bool ReadXml(std::string_view document, const XmlHandlers& handlers, std::string* root = nullptr);

}  // namespace gpsdc
