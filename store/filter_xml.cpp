#include "store/filter_xml.h"

#include <cstdint>

#include "store/utf8.h"

namespace db {

namespace {

// Written here rather than through wxXmlDocument::Save, which converts every
// name and text through iconv and, with the copy of the tree it needs, cost
// more than the rest of a folder's registration together. The output is the
// one wxXmlDocument writes without indentation, byte for byte: the same
// escapes, "<name/>" for an element without children, and failure for text
// that has no UTF-8 form (a lone surrogate, a code point past U+10FFFF).

enum class Escape { kNone, kText, kAttribute };

struct Replacement {
  wchar_t c;
  const char* text;
  bool attribute_only;
};

const Replacement kReplacements[] = {
    {L'<', "&lt;", false},  {L'>', "&gt;", false},  {L'&', "&amp;", false}, {L'\r', "&#xD;", false},
    {L'"', "&quot;", true}, {L'\t', "&#x9;", true}, {L'\n', "&#xA;", true},
};

const char* Replace(wchar_t c, Escape escape) {
  if (escape == Escape::kNone || c > L'>') return nullptr;  // '>' is the highest escaped
  for (const Replacement& r : kReplacements) {
    if (r.c == c && (!r.attribute_only || escape == Escape::kAttribute)) return r.text;
  }
  return nullptr;
}

bool AppendCodePoint(std::uint32_t code, std::string* out) {
  if (code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) return false;
  AppendUtf8(code, out);
  return true;
}

// Where wchar_t is UTF-16 a pair of surrogates is one code point.
bool Append(const wxString& text, Escape escape, std::string* out) {
  const wchar_t* c = text.wc_str();
  const wchar_t* end = c + text.length();
  for (; c != end; ++c) {
    if (const char* replacement = Replace(*c, escape)) {
      out->append(replacement);
      continue;
    }
    std::uint32_t code = static_cast<std::uint32_t>(*c);
    if (code < 0x80) {
      out->push_back(static_cast<char>(code));
      continue;
    }
    if (sizeof(wchar_t) == 2 && code >= 0xD800 && code <= 0xDBFF && c + 1 != end) {
      std::uint32_t low = static_cast<std::uint32_t>(c[1]);
      if (low >= 0xDC00 && low <= 0xDFFF) {
        code = 0x10000 + ((code - 0xD800) << 10) + (low - 0xDC00);
        ++c;
      }
    }
    if (!AppendCodePoint(code, out)) return false;
  }
  return true;
}

bool AppendNode(const wxXmlNode& node, std::string* out);

bool AppendElement(const wxXmlNode& node, std::string* out) {
  out->push_back('<');
  if (!Append(node.GetName(), Escape::kNone, out)) return false;
  for (const wxXmlAttribute* a = node.GetAttributes(); a; a = a->GetNext()) {
    out->push_back(' ');
    if (!Append(a->GetName(), Escape::kNone, out)) return false;
    out->append("=\"");
    if (!Append(a->GetValue(), Escape::kAttribute, out)) return false;
    out->push_back('"');
  }
  if (!node.GetChildren()) {
    out->append("/>");
    return true;
  }
  out->push_back('>');
  for (const wxXmlNode* child = node.GetChildren(); child; child = child->GetNext()) {
    if (!AppendNode(*child, out)) return false;
  }
  out->append("</");
  if (!Append(node.GetName(), Escape::kNone, out)) return false;
  out->push_back('>');
  return true;
}

bool AppendNode(const wxXmlNode& node, std::string* out) {
  switch (node.GetType()) {
    case wxXML_ELEMENT_NODE:
      return AppendElement(node, out);
    case wxXML_TEXT_NODE:
      return Append(node.GetContent(), node.GetNoConversion() ? Escape::kNone : Escape::kText, out);
    case wxXML_CDATA_SECTION_NODE:
      out->append("<![CDATA[");
      if (!Append(node.GetContent(), Escape::kNone, out)) return false;
      out->append("]]>");
      return true;
    case wxXML_COMMENT_NODE:
      out->append("<!--");
      if (!Append(node.GetContent(), Escape::kNone, out)) return false;
      out->append("-->");
      return true;
    case wxXML_PI_NODE:
      out->append("<?");
      if (!Append(node.GetName(), Escape::kNone, out)) return false;
      out->push_back(' ');
      if (!Append(node.GetContent(), Escape::kNone, out)) return false;
      out->append("?>");
      return true;
    default:
      return false;  // no other kind of node has a written form
  }
}

}  // namespace

bool FilterXmlText(const wxXmlNode& root, std::string* text) {
  text->clear();
  // A default-constructed node has no defined type, so it must not be
  // asked for one; it stands for "no tree".
  if (root.GetName().empty() && root.GetChildren() == nullptr && root.GetAttributes() == nullptr) {
    return true;
  }
  // The root is what a document would hold as its root element.
  if (root.GetType() != wxXML_ELEMENT_NODE || !AppendElement(root, text)) {
    text->clear();
    return false;
  }
  return true;
}

}  // namespace db
