#include "legacy/config_tree.h"

#include <expat.h>
#include <wx/strconv.h>
#include <wx/string.h>

#include <cstring>

// The handlers follow wxXmlDocument::Load's one for one, so that expat sees
// the same set and behaves the same (the default handler, for one, stops
// the expansion of entities the document declares), and the nodes link up
// as wx links them.
struct ConfigTreeBuilder {
  using Id = ConfigTree::Id;
  static constexpr Id kNone = ConfigTree::kNone;

  ConfigTree* tree;
  XML_Parser parser;
  Id node = ConfigTree::kDocument;  // the element (or document) being filled
  Id last_child = kNone;            // its last child so far
  Id last_text = kNone;             // the text or CDATA node character data extends
  Id before_text = kNone;           // last_child when last_text was added

  ConfigTree::Node& At(Id id) { return tree->nodes_[id]; }

  // Offsets are 32-bit: a folder.cfg within kMaxConfigBytes comes nowhere
  // near, but a longer text is refused rather than cut.
  ConfigTree::Span Store(const char* s, std::size_t size) {
    std::string& text = tree->text_;
    if (text.size() + size > UINT32_MAX) {
      XML_StopParser(parser, XML_FALSE);
      return {};
    }
    ConfigTree::Span span{static_cast<std::uint32_t>(text.size()),
                          static_cast<std::uint32_t>(size)};
    text.append(s, size);
    return span;
  }

  Id Append(ConfigTree::Type type) {
    Id id = static_cast<Id>(tree->nodes_.size());
    tree->nodes_.push_back(ConfigTree::Node{type, kNone, kNone, kNone, {}, {}});
    At(id).parent = node;
    if (last_child == kNone) {
      At(node).first_child = id;
    } else {
      At(last_child).next = id;
    }
    last_child = id;
    return id;
  }

  // Ends the text character data was added to. A text node that ends blank
  // is taken out again; it is always the newest node, with its text at the
  // end of the buffer, as nothing else is added while it grows. (Dropping
  // the blank pieces one by one, as wx's default mode does, would turn
  // "\n  value" into "  value".)
  void EndText() {
    if (last_text == kNone) return;
    const ConfigTree::Node& text = At(last_text);
    if (text.type == ConfigTree::Type::kText && IsBlank(tree->Slice(text.content))) {
      if (before_text == kNone) {
        At(node).first_child = kNone;
      } else {
        At(before_text).next = kNone;
      }
      last_child = before_text;
      tree->text_.resize(text.content.at);
      tree->nodes_.pop_back();
    }
    last_text = kNone;
  }

  static bool IsBlank(std::string_view text) {
    return text.find_first_not_of(" \t\n\r") == std::string_view::npos;
  }

  static ConfigTreeBuilder* From(void* data) { return static_cast<ConfigTreeBuilder*>(data); }

  static void XMLCALL OnStart(void* data, const XML_Char* name, const XML_Char**) {
    ConfigTreeBuilder* b = From(data);
    b->EndText();
    Id element = b->Append(ConfigTree::Type::kElement);
    b->At(element).name = b->Store(name, std::strlen(name));
    b->node = element;
    b->last_child = kNone;
  }

  static void XMLCALL OnEnd(void* data, const XML_Char*) {
    ConfigTreeBuilder* b = From(data);
    b->EndText();
    b->last_child = b->node;
    b->node = b->At(b->node).parent;
  }

  static void XMLCALL OnText(void* data, const XML_Char* s, int size) {
    ConfigTreeBuilder* b = From(data);
    if (b->last_text == kNone) {
      b->before_text = b->last_child;
      b->last_text = b->Append(ConfigTree::Type::kText);
      b->At(b->last_text).content = b->Store(s, 0);
    }
    // Nothing else is stored while a text grows (every other handler ends
    // it first), so its pieces lie end to end.
    b->At(b->last_text).content.size += b->Store(s, static_cast<std::size_t>(size)).size;
  }

  static void XMLCALL OnCdataStart(void* data) {
    ConfigTreeBuilder* b = From(data);
    b->EndText();
    b->last_text = b->Append(ConfigTree::Type::kCdata);
    b->At(b->last_text).content = b->Store("", 0);
  }

  static void XMLCALL OnCdataEnd(void* data) { From(data)->last_text = kNone; }

  static void XMLCALL OnComment(void* data, const XML_Char* text) {
    ConfigTreeBuilder* b = From(data);
    b->EndText();
    Id comment = b->Append(ConfigTree::Type::kComment);
    b->At(comment).content = b->Store(text, std::strlen(text));
  }

  static void XMLCALL OnPi(void* data, const XML_Char* target, const XML_Char* text) {
    ConfigTreeBuilder* b = From(data);
    b->EndText();
    Id pi = b->Append(ConfigTree::Type::kPi);
    b->At(pi).name = b->Store(target, std::strlen(target));
    b->At(pi).content = b->Store(text, std::strlen(text));
  }

  static void XMLCALL OnDoctypeStart(void*, const XML_Char*, const XML_Char*, const XML_Char*,
                                     int) {}
  static void XMLCALL OnDoctypeEnd(void*) {}
  static void XMLCALL OnDefault(void*, const XML_Char*, int) {}

  // A declared encoding expat does not know is read through wx's table of
  // it, built as wx builds it, quirk included: a byte the conversion
  // refuses is not marked invalid but keeps what the buffer last held, the
  // character of the byte before it. Two faults of wx's are mended: its
  // buffer starts uninitialised (it only matters when byte 1 is refused;
  // 0 then reads as an invalid character), and the byte is handed over in
  // two bytes, which a conversion whose strings end in two or four NULs
  // (UCS-2, UTF-32) reads past, in search of that end, into whatever lies
  // beside it on the stack. Here the NULs it looks for follow the byte.
  static int XMLCALL OnUnknownEncoding(void*, const XML_Char* name, XML_Encoding* info) {
    wxCSConv conv{wxString(name)};  // in the C library's encoding, as wx takes it
    char narrow[8] = {};
    wchar_t wide[10] = {};
    info->map[0] = 0;
    for (int i = 1; i < 256; ++i) {
      narrow[0] = static_cast<char>(i);
      conv.MB2WC(wide, narrow, 2);
      info->map[i] = static_cast<int>(wide[0]);
    }
    info->data = nullptr;
    info->convert = nullptr;
    info->release = nullptr;
    return XML_STATUS_OK;
  }
};

bool ConfigTree::Parse(const std::string& bytes) {
  // Room for what a folder.cfg usually holds, so that the buffers seldom
  // grow while expat hands over the pieces: its names and texts take
  // fewer bytes than its markup, and a node stands for some 30 of them.
  nodes_.clear();
  nodes_.reserve(bytes.size() / 16 + 1);
  nodes_.push_back(Node{Type::kDocument, kNone, kNone, kNone, {}, {}});
  text_.clear();
  text_.reserve(bytes.size());
  XML_Parser parser = XML_ParserCreate(nullptr);
  if (!parser) return false;
  ConfigTreeBuilder builder{this, parser};
  XML_SetUserData(parser, &builder);
  XML_SetElementHandler(parser, ConfigTreeBuilder::OnStart, ConfigTreeBuilder::OnEnd);
  XML_SetCharacterDataHandler(parser, ConfigTreeBuilder::OnText);
  XML_SetCdataSectionHandler(parser, ConfigTreeBuilder::OnCdataStart,
                             ConfigTreeBuilder::OnCdataEnd);
  XML_SetCommentHandler(parser, ConfigTreeBuilder::OnComment);
  XML_SetProcessingInstructionHandler(parser, ConfigTreeBuilder::OnPi);
  XML_SetDoctypeDeclHandler(parser, ConfigTreeBuilder::OnDoctypeStart,
                            ConfigTreeBuilder::OnDoctypeEnd);
  XML_SetDefaultHandler(parser, ConfigTreeBuilder::OnDefault);
  XML_SetUnknownEncodingHandler(parser, ConfigTreeBuilder::OnUnknownEncoding, nullptr);
  bool ok =
      XML_Parse(parser, bytes.data(), static_cast<int>(bytes.size()), XML_TRUE) == XML_STATUS_OK;
  XML_ParserFree(parser);
  if (ok) {
    builder.EndText();
  } else {
    nodes_.clear();
    text_.clear();
  }
  return ok;
}

ConfigTree::Id ConfigTree::Root() const {
  if (nodes_.empty()) return kNone;
  Id node = nodes_[kDocument].first_child;
  while (node != kNone && nodes_[node].type != Type::kElement) node = nodes_[node].next;
  return node;
}
