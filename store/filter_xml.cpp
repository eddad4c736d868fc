#include "store/filter_xml.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

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

// What each ASCII character becomes: itself (null) or its escape. Text
// escapes '<', '>', '&' and the carriage return; an attribute value also
// the quote, the tab and the line feed, which would otherwise be read back
// as a space. Names are written as they stand.
struct EscapeTable {
  const char* none[128] = {};
  const char* text[128] = {};
  const char* attribute[128] = {};
  constexpr EscapeTable() {
    text[L'<'] = attribute[L'<'] = "&lt;";
    text[L'>'] = attribute[L'>'] = "&gt;";
    text[L'&'] = attribute[L'&'] = "&amp;";
    text[L'\r'] = attribute[L'\r'] = "&#xD;";
    attribute[L'"'] = "&quot;";
    attribute[L'\t'] = "&#x9;";
    attribute[L'\n'] = "&#xA;";
  }
  const char* const* Of(Escape escape) const {
    return escape == Escape::kText ? text : escape == Escape::kAttribute ? attribute : none;
  }
};

constexpr EscapeTable kEscapes;

constexpr bool NoEscapeFrom(std::size_t first) {
  for (std::size_t c = first; c < 128; ++c) {
    if (kEscapes.text[c] || kEscapes.attribute[c]) return false;
  }
  return true;
}
static_assert(NoEscapeFrom(0x40), "the writer copies '@' to DEL without looking them up");

// The longest text one UTF-16 or UTF-32 unit can become: an escape of six
// bytes, or four bytes of UTF-8 (a surrogate pair, two units, gives four).
constexpr std::size_t kMaxBytesPerUnit = 6;

// Writes into `out` through a pointer, making room once per text rather
// than checking for it at every byte: nearly every name and value is ASCII
// that needs no escape, which then costs a compare and a store per
// character.
class Writer {
 public:
  explicit Writer(std::string* out) : out_(out) { out_->resize(4096); }
  // Cuts the text to what was written.
  void Finish() { out_->resize(used_); }

  void Literal(const char* text, std::size_t length) {
    char* to = Room(length);
    std::memcpy(to, text, length);
    used_ += length;
  }
  template <std::size_t N>
  void Literal(const char (&text)[N]) {
    Literal(text, N - 1);
  }
  // Writes again the `length` bytes written from `offset` on.
  void Repeat(std::size_t offset, std::size_t length) {
    char* to = Room(length);
    std::memcpy(to, out_->data() + offset, length);
    used_ += length;
  }
  std::size_t Written() const { return used_; }

  bool Text(const wxString& text, Escape escape) {
    const char* const* escapes = kEscapes.Of(escape);
    const wchar_t* c = text.wc_str();
    const wchar_t* const end = c + text.length();
    char* const start = Room(text.length() * kMaxBytesPerUnit);
    char* to = start;
    for (; c != end; ++c) {
      std::uint32_t code = static_cast<std::uint32_t>(*c);
      // Letters and most punctuation need no look-up.
      if (code - 0x40 < 0x40) {
        *to++ = static_cast<char>(code);
        continue;
      }
      if (code < 0x40) {
        const char* replacement = escapes[code];
        if (!replacement) {
          *to++ = static_cast<char>(code);
          continue;
        }
        const std::size_t length = std::strlen(replacement);
        std::memcpy(to, replacement, length);
        to += length;
        continue;
      }
      // Where wchar_t is UTF-16 a pair of surrogates is one code point.
      if (sizeof(wchar_t) == 2 && code >= 0xD800 && code <= 0xDBFF && c + 1 != end) {
        std::uint32_t low = static_cast<std::uint32_t>(c[1]);
        if (low >= 0xDC00 && low <= 0xDFFF) {
          code = 0x10000 + ((code - 0xD800) << 10) + (low - 0xDC00);
          ++c;
        }
      }
      if (code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) return false;
      to = WriteUtf8(code, to);
    }
    used_ += static_cast<std::size_t>(to - start);
    return true;
  }

 private:
  // At least `length` bytes past what was written, which then starts there.
  char* Room(std::size_t length) {
    if (out_->size() - used_ < length) out_->resize(2 * out_->size() + length);
    return &(*out_)[used_];
  }

  std::string* out_;
  std::size_t used_ = 0;
};

bool AppendNode(const wxXmlNode& node, Writer* out);

bool AppendElement(const wxXmlNode& node, Writer* out) {
  out->Literal("<");
  const std::size_t name = out->Written();
  if (!out->Text(node.GetName(), Escape::kNone)) return false;
  const std::size_t name_length = out->Written() - name;
  for (const wxXmlAttribute* a = node.GetAttributes(); a; a = a->GetNext()) {
    out->Literal(" ");
    if (!out->Text(a->GetName(), Escape::kNone)) return false;
    out->Literal("=\"");
    if (!out->Text(a->GetValue(), Escape::kAttribute)) return false;
    out->Literal("\"");
  }
  if (!node.GetChildren()) {
    out->Literal("/>");
    return true;
  }
  out->Literal(">");
  for (const wxXmlNode* child = node.GetChildren(); child; child = child->GetNext()) {
    if (!AppendNode(*child, out)) return false;
  }
  out->Literal("</");
  out->Repeat(name, name_length);
  out->Literal(">");
  return true;
}

bool AppendNode(const wxXmlNode& node, Writer* out) {
  switch (node.GetType()) {
    case wxXML_ELEMENT_NODE:
      return AppendElement(node, out);
    case wxXML_TEXT_NODE:
      return out->Text(node.GetContent(), node.GetNoConversion() ? Escape::kNone : Escape::kText);
    case wxXML_CDATA_SECTION_NODE:
      out->Literal("<![CDATA[");
      if (!out->Text(node.GetContent(), Escape::kNone)) return false;
      out->Literal("]]>");
      return true;
    case wxXML_COMMENT_NODE:
      out->Literal("<!--");
      if (!out->Text(node.GetContent(), Escape::kNone)) return false;
      out->Literal("-->");
      return true;
    case wxXML_PI_NODE:
      out->Literal("<?");
      if (!out->Text(node.GetName(), Escape::kNone)) return false;
      out->Literal(" ");
      if (!out->Text(node.GetContent(), Escape::kNone)) return false;
      out->Literal("?>");
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
  if (root.GetType() != wxXML_ELEMENT_NODE) return false;
  Writer writer(text);
  if (!AppendElement(root, &writer)) {
    text->clear();
    return false;
  }
  writer.Finish();
  return true;
}

}  // namespace db
