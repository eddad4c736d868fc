#include "legacy/xml_load.h"

#include <gtest/gtest.h>
#include <wx/init.h>

#include <string>
#include <tuple>

#include "tests/legacy_fixture.h"
#include "tests/temp_prefix.h"

namespace {

// The nesting bound holds at the same depth whether a document is plain
// enough for the markup scan or needs the measuring parse (a comment, a
// DTD, another encoding), and size and expansion are refused either way.
TEST(XmlLoad, BoundsHoldOnEveryPath) {
  wxInitializer init;
  const std::string decl = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
  const int bound = kMaxConfigDepth;
  const std::tuple<const char*, std::string, bool> cases[] = {
      {"plain at the bound", decl + NestedXml(bound), true},
      {"plain past the bound", decl + NestedXml(bound + 1), false},
      {"plain, self-closing inside", decl + NestedXml(bound - 1, "<e/><e/>"), true},
      {"comment at the bound", decl + NestedXml(bound, "<!-- x -->"), true},
      {"comment past the bound", decl + NestedXml(bound + 1, "<!-- x -->"), false},
      {"UTF-16 at the bound", Utf16LeWithBom(NestedXml(bound)), true},
      {"UTF-16 past the bound", Utf16LeWithBom(NestedXml(bound + 1)), false},
      {"stray end tags first", "</d></d>" + NestedXml(bound + 1), false},
      {"past the size bound", "<r><!--" + std::string(kMaxConfigBytes, 'p') + "--></r>", false},
      {"entities past the size bound", ExpandingXml(), false},
      {"malformed", decl + "<d><e></d>", false},
  };
  TempPrefix prefix;
  for (const auto& [name, bytes, loads] : cases) {
    prefix.WriteFile(prefix.Drive('d') / "folder.cfg", bytes);
    ConfigTree tree;
    EXPECT_EQ(LoadFolderConfig("D:\\folder.cfg", &tree), loads) << name;
  }
}

}  // namespace
