// A small element tree of the TCX writer: elements with attributes, text and children, rendered
// to wide text without indentation and without escaping.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace navmisc::exportdetail {

class XmlNode {
 public:
  explicit XmlNode(std::wstring name) : name_(std::move(name)) {}
  virtual ~XmlNode() = default;
  XmlNode(const XmlNode&) = delete;
  XmlNode& operator=(const XmlNode&) = delete;

  // Appends a new empty child and returns it; the node owns it.
  XmlNode* AddChild(std::wstring name);
  void AddAttribute(std::wstring name, std::wstring value);
  // Setting the text again replaces it.
  void SetText(std::wstring text) { text_ = std::move(text); }
  void SetText(int value);     // "%d"
  void SetText(double value);  // "%.7f", "C" locale

  // Appends "<name attrs>", the text, the children and "</name>\n" (no end tag when the name
  // ends with "/"). Nothing is escaped: the values are numbers, times and fixed words.
  virtual void Render(std::wstring& out) const;
  // The two halves of Render around the children, for a caller that produces a long run of
  // children one at a time instead of holding them all: "<name attrs>" and the text, then the
  // end tag.
  void RenderStart(std::wstring& out) const;
  void RenderEnd(std::wstring& out) const;

  const std::vector<std::unique_ptr<XmlNode>>& children() const { return children_; }

 private:
  std::wstring name_;
  std::optional<std::wstring> text_;
  std::vector<std::pair<std::wstring, std::wstring>> attributes_;
  std::vector<std::unique_ptr<XmlNode>> children_;
};

class XmlDocument {
 public:
  // Makes a top-level node from start-tag text: the name up to the first blank, then
  // name="value" attributes (blanks allowed inside a value). An attribute text without "=" is
  // ignored; a missing quote makes the whole text unusable and gives null. The first node made
  // becomes the root.
  XmlNode* CreateNode(std::wstring_view startTag);
  XmlNode* root() const { return root_; }
  // The prologue followed by every top-level node.
  std::wstring Render(std::wstring_view prologue) const;

 private:
  std::vector<std::unique_ptr<XmlNode>> nodes_;
  XmlNode* root_ = nullptr;
};

}  // namespace navmisc::exportdetail
