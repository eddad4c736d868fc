// The filter tree's text against what wxXmlDocument writes for the same tree
// without indentation, declaration and final line break: the text the store
// kept before it wrote the tree itself, and must keep byte for byte.
#include "store/filter_xml.h"

#include <gtest/gtest.h>
#include <wx/init.h>
#include <wx/log.h>
#include <wx/sstream.h>

#include <memory>
#include <string>
#include <vector>

namespace {

// False when the library refuses to write the tree.
bool SavedByWx(const wxXmlNode& root, std::string* text) {
  wxLogNull quiet;
  wxXmlDocument document;
  document.SetRoot(new wxXmlNode(root));
  wxStringOutputStream out;  // UTF-8, as the document is written
  if (!document.Save(out, wxXML_NO_INDENTATION)) return false;
  const std::string saved = out.GetString().utf8_string();
  const auto begin = saved.find_first_not_of("\r\n", saved.find("?>") + 2);
  *text = saved.substr(begin, saved.find_last_not_of("\r\n") + 1 - begin);
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
wxXmlNode* FilterTree(const char* key, const wxString& value, const char* identifier) {
  wxXmlNode* root = Element("FilterSetting");
  wxXmlNode* filter = Element("Filter", root);
  filter->AddAttribute("name", wxString::FromUTF8(identifier));
  wxXmlNode* ui = Element("UI", filter);
  Text(Element(key, ui), value);
  Text(Element("RESOLUTION", ui), "600");
  Element("UI", Element("Filter", root))->GetParent()->AddAttribute("name", "KYR.VDP.1");
  return root;
}

TEST(FilterXml, WritesWhatTheXmlLibraryWrites) {
  wxInitializer init;
  const char* settings[][3] = {
      {"ERRORPATH", "C:\\Server", "KYR.PDF.1"},
      {"FILENAMESTRUCTURE", "<a> & \"b\" 'c' %J_%C.tif", "KYR.1BIT.1"},
      {"V", "  two\tlines\nand\r\na return  ", "KYR.PS.1"},
      {"V", "x", "a<b>&\"c\"\t\n\r'd'"},  // markup and white space in an attribute
      {"MENU", "Caf\xC3\xA9 \xE2\x82\xAC \xF0\x9F\x98\x80", "KYR.PDF.1"},
      {"SELECTEDDISTILLERPROFILE", "", "KYR.PS.1"},
  };
  std::vector<std::pair<std::unique_ptr<wxXmlNode>, bool>> trees;  // and whether writable
  for (auto& [key, value, identifier] : settings) {
    trees.emplace_back(FilterTree(key, wxString::FromUTF8(value), identifier), true);
  }
  trees.emplace_back(Element("FilterSetting"), true);
  wxXmlNode* kinds = Element("FilterSetting");
  Text(kinds, "raw <cdata> & text", wxXML_CDATA_SECTION_NODE);
  Text(kinds, " a note ", wxXML_COMMENT_NODE);
  kinds->AddChild(new wxXmlNode(wxXML_PI_NODE, "target", "data"));
  auto* verbatim = new wxXmlNode(wxXML_TEXT_NODE, wxString(), "<kept as is>");
  verbatim->SetNoConversion(true);
  kinds->AddChild(verbatim);
  trees.emplace_back(kinds, true);
  trees.emplace_back(FilterTree("V", wxString(1, static_cast<wchar_t>(0xD800)), "KYR.PDF.1"),
                     false);  // a lone surrogate has no UTF-8 form

  for (std::size_t i = 0; i < trees.size(); ++i) {
    SCOPED_TRACE(i);
    const auto& [tree, writable] = trees[i];
    std::string expected, written = "stale";
    EXPECT_EQ(SavedByWx(*tree, &expected), writable);
    EXPECT_EQ(db::FilterXmlText(*tree, &written), writable);
    EXPECT_EQ(written, writable ? expected : "");
  }
}

}  // namespace
