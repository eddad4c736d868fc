#include "store/filter_xml.h"

#include <gtest/gtest.h>
#include <wx/init.h>
#include <wx/log.h>
#include <wx/mstream.h>

#include <functional>
#include <memory>
#include <string>

namespace {

// What wxXmlDocument writes for the same tree without indentation, with its
// declaration and final line break taken off: the text the store kept
// before it wrote the tree itself, and must keep byte for byte.
bool SavedByWx(const wxXmlNode& root, std::string* text) {
  wxLogNull quiet;
  wxXmlDocument document;
  document.SetRoot(new wxXmlNode(root));
  wxMemoryOutputStream out;
  if (!document.Save(out, wxXML_NO_INDENTATION)) return false;
  std::string saved(out.GetLength(), '\0');
  out.CopyTo(saved.data(), saved.size());
  std::string::size_type start = saved.find("?>");
  start = start == std::string::npos ? 0 : saved.find_first_not_of("\r\n", start + 2);
  *text = saved.substr(start == std::string::npos ? saved.size() : start);
  while (!text->empty() && (text->back() == '\n' || text->back() == '\r')) text->pop_back();
  return true;
}

wxXmlNode* Element(const wxString& name, wxXmlNode* parent = nullptr) {
  auto* node = new wxXmlNode(wxXML_ELEMENT_NODE, name);
  if (parent) parent->AddChild(node);
  return node;
}

void Text(wxXmlNode* parent, const wxString& text, wxXmlNodeType type = wxXML_TEXT_NODE) {
  parent->AddChild(new wxXmlNode(type, wxString(), text));
}

// A filter tree as registration builds it: FilterSetting / Filter name= / UI
// with one element per setting.
wxXmlNode* FilterTree(const wxString& key, const wxString& value, const wxString& identifier) {
  wxXmlNode* root = Element("FilterSetting");
  wxXmlNode* filter = Element("Filter", root);
  filter->AddAttribute("name", identifier);
  wxXmlNode* ui = Element("UI", filter);
  Text(Element(key, ui), value);
  Text(Element("RESOLUTION", ui), "600");
  Element("UI", Element("Filter", root))->GetParent()->AddAttribute("name", "KYR.VDP.1");
  return root;
}

struct Case {
  const char* name;
  std::function<wxXmlNode*()> tree;
  bool writable;
};

const Case kCases[] = {
    {"default chain", [] { return FilterTree("ERRORPATH", "C:\\Server", "KYR.PDF.1"); }, true},
    {"markup in text",
     [] { return FilterTree("FILENAMESTRUCTURE", "<a> & \"b\" 'c' %J_%C.tif", "KYR.1BIT.1"); },
     true},
    {"white space kept",
     [] { return FilterTree("V", "  two\tlines\nand\r\na return  ", "KYR.PS.1"); }, true},
    {"markup in attribute", [] { return FilterTree("V", "x", "a<b>&\"c\"\t\n\r'd'"); }, true},
    {"beyond ASCII",
     [] {
       return FilterTree("MENU", wxString::FromUTF8("Caf\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80"),
                         "KYR.PDF.1");
     },
     true},
    {"empty value", [] { return FilterTree("SELECTEDDISTILLERPROFILE", "", "KYR.PS.1"); }, true},
    {"lone element", [] { return Element("FilterSetting"); }, true},
    {"other node kinds",
     [] {
       wxXmlNode* root = Element("FilterSetting");
       Text(root, "raw <cdata> & text", wxXML_CDATA_SECTION_NODE);
       Text(root, " a note ", wxXML_COMMENT_NODE);
       root->AddChild(new wxXmlNode(wxXML_PI_NODE, "target", "data"));
       wxXmlNode* plain = new wxXmlNode(wxXML_TEXT_NODE, wxString(), "<kept as is>");
       plain->SetNoConversion(true);
       root->AddChild(plain);
       return root;
     },
     true},
    {"lone surrogate",
     [] {
       wxString bad;
       bad.append(1, static_cast<wchar_t>(0xD800));
       return FilterTree("V", bad, "KYR.PDF.1");
     },
     false},
};

class FilterXmlTest : public ::testing::Test {
 protected:
  wxInitializer init_;
};

TEST_F(FilterXmlTest, WritesWhatTheXmlLibraryWrites) {
  for (const Case& c : kCases) {
    SCOPED_TRACE(c.name);
    std::unique_ptr<wxXmlNode> tree(c.tree());
    std::string expected;
    std::string written = "stale";
    bool saved = SavedByWx(*tree, &expected);
    bool ok = db::FilterXmlText(*tree, &written);
    EXPECT_EQ(ok, c.writable);
    EXPECT_EQ(saved, c.writable);
    EXPECT_EQ(written, ok ? expected : "");
  }
}

TEST_F(FilterXmlTest, NoTreeIsEmptyText) {
  wxXmlNode none;
  std::string written = "stale";
  EXPECT_TRUE(db::FilterXmlText(none, &written));
  EXPECT_EQ(written, "");
}

}  // namespace
