#include "navmisc/export/detail/xml_tree.h"

#include "navmisc/platform/format.h"

namespace navmisc::exportdetail {

XmlNode* XmlNode::AddChild(std::wstring name) {
  children_.push_back(std::make_unique<XmlNode>(std::move(name)));
  return children_.back().get();
}

void XmlNode::AddAttribute(std::wstring name, std::wstring value) {
  attributes_.emplace_back(std::move(name), std::move(value));
}

void XmlNode::SetText(int value) {
  std::wstring s;
  navmisc::AppendInt(s, value);
  text_ = std::move(s);
}

void XmlNode::SetText(double value) {
  std::wstring s;
  navmisc::AppendFixed(s, value, 7);
  text_ = std::move(s);
}

void XmlNode::Render(std::wstring& out) const {
  RenderStart(out);
  for (const auto& child : children_) child->Render(out);
  RenderEnd(out);
}

void XmlNode::RenderStart(std::wstring& out) const {
  out += L'<';
  out += name_;
  for (size_t i = 0; i < attributes_.size(); ++i) {
    out += L' ';
    out += attributes_[i].first;
    out += L"=\"";
    out += attributes_[i].second;
    out += L'"';
  }
  out += L'>';
  if (text_) out += *text_;
}

void XmlNode::RenderEnd(std::wstring& out) const {
  if (name_.empty() || name_.back() != L'/') {
    out += L"</";
    out += name_;
    out += L">\n";
  }
}

XmlNode* XmlDocument::CreateNode(std::wstring_view startTag) {
  size_t blank = startTag.find(L' ');
  auto node = std::make_unique<XmlNode>(std::wstring(startTag.substr(0, blank)));
  if (blank != std::wstring_view::npos) {
    size_t pos = blank + 1;
    while (pos < startTag.size()) {
      size_t eq = startTag.find(L'=', pos);
      if (eq == std::wstring_view::npos) break;  // trailing text without "=": ignored
      size_t open = startTag.find(L'"', eq);
      if (open == std::wstring_view::npos) return nullptr;
      size_t close = startTag.find(L'"', open + 1);
      if (close == std::wstring_view::npos) return nullptr;
      node->AddAttribute(std::wstring(startTag.substr(pos, eq - pos)),
                         std::wstring(startTag.substr(open + 1, close - open - 1)));
      size_t next = startTag.find(L' ', close + 1);
      if (next == std::wstring_view::npos) break;
      pos = next + 1;
    }
  }
  nodes_.push_back(std::move(node));
  if (!root_) root_ = nodes_.back().get();
  return nodes_.back().get();
}

std::wstring XmlDocument::Render(std::wstring_view prologue) const {
  std::wstring out(prologue);
  for (const auto& node : nodes_) node->Render(out);
  return out;
}

}  // namespace navmisc::exportdetail
