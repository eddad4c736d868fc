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

#include "tests/cases.h"

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

// The tree of a document's text.
wxXmlNode* Parsed(const std::string& text) {
  wxStringInputStream in(wxString::FromUTF8(text));
  wxXmlDocument document(in);
  return document.IsOk() ? document.DetachRoot() : nullptr;
}

// A filter tree as registration builds it, in the text "<key>", "<value>"
// and "<id>" are put into: FilterSetting / Filter name= / UI with one element
// per setting.
std::string FilterTree(const std::string& key, const std::string& value, const std::string& id) {
  return "<FilterSetting><Filter name=\"" + id + "\"><UI><" + key + ">" + value + "</" + key +
         "><RESOLUTION>600</RESOLUTION></UI></Filter><Filter name=\"KYR.VDP.1\"><UI/></Filter>"
         "</FilterSetting>";
}

// The first setting's element of such a tree.
wxXmlNode* Setting(const wxXmlNode& tree) {
  return tree.GetChildren()->GetChildren()->GetChildren();
}

// The trees of filter_xml_cases.tsv, and trees no registration builds.
TEST(FilterXml, WritesWhatTheXmlLibraryWrites) {
  wxInitializer init;
  std::vector<std::pair<std::unique_ptr<wxXmlNode>, bool>> trees;  // and whether writable
  for (const CaseRow& c : ReadCases("store/filter_xml_cases.tsv"))
    trees.emplace_back(Parsed(FilterTree(c.at(0), c.at(1), c.at(2))), true);
  ASSERT_FALSE(trees.empty());
  trees.emplace_back(Parsed("<FilterSetting/>"), true);
  trees.emplace_back(Parsed("<FilterSetting><![CDATA[raw <cdata> & text]]><!-- a note -->"
                            "<?target data?></FilterSetting>"),
                     true);
  // What no document gives: an empty text, text written as is, a lone
  // surrogate (which has no UTF-8 form).
  trees.emplace_back(Parsed(FilterTree("SELECTEDDISTILLERPROFILE", "", "KYR.PS.1")), true);
  Setting(*trees.back().first)->AddChild(new wxXmlNode(wxXML_TEXT_NODE, wxString(), wxString()));
  auto* verbatim = new wxXmlNode(wxXML_TEXT_NODE, wxString(), "<kept as is>");
  verbatim->SetNoConversion(true);
  trees.back().first->AddChild(verbatim);
  trees.emplace_back(Parsed(FilterTree("V", "", "KYR.PDF.1")), false);
  Setting(*trees.back().first)
      ->AddChild(
          new wxXmlNode(wxXML_TEXT_NODE, wxString(), wxString(1, static_cast<wchar_t>(0xD800))));

  for (std::size_t i = 0; i < trees.size(); ++i) {
    SCOPED_TRACE(i);
    const auto& [tree, writable] = trees[i];
    ASSERT_TRUE(tree);
    std::string expected, written = "stale";
    EXPECT_EQ(SavedByWx(*tree, &expected), writable);
    EXPECT_EQ(db::FilterXmlText(*tree, &written), writable);
    EXPECT_EQ(written, writable ? expected : "");
  }
}

}  // namespace
