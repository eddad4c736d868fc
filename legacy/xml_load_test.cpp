#include "legacy/xml_load.h"

#include <gtest/gtest.h>
#include <wx/init.h>

#include <string>

#include "tests/temp_prefix.h"

namespace {

std::string Nested(int depth, const std::string& inside = "") {
  std::string xml = inside;
  for (int i = 0; i < depth; ++i) xml = "<d>" + xml + "</d>";
  return xml;
}

// UTF-16LE with its byte order mark: the same markup, a NUL after each
// ASCII byte.
std::string Utf16(const std::string& ascii) {
  std::string bytes = "\xFF\xFE";
  for (char c : ascii) bytes += std::string(1, c) + '\0';
  return bytes;
}

struct Case {
  const char* name;
  std::string bytes;
  bool loads;
};

// The nesting bound holds at the same depth whether a document is plain
// enough for the markup scan or needs the measuring parse (a comment, a
// DTD, another encoding), and expansion is refused either way.
TEST(XmlLoad, BoundsHoldOnEveryPath) {
  wxInitializer init;
  const std::string decl = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
  std::string expanding = "<!DOCTYPE d [<!ENTITY e '" + std::string(64 * 1024, 'e') + "'>]><d>" +
                          "<!--" + std::string(1024 * 1024, 'p') + "-->";
  for (int i = 0; i < 1100; ++i) expanding += "&e;";
  expanding += "</d>";
  const Case cases[] = {
      {"plain at the bound", decl + Nested(kMaxConfigDepth), true},
      {"plain past the bound", decl + Nested(kMaxConfigDepth + 1), false},
      {"plain, self-closing inside", decl + Nested(kMaxConfigDepth - 1, "<e/><e/>"), true},
      {"comment at the bound", decl + Nested(kMaxConfigDepth, "<!-- x -->"), true},
      {"comment past the bound", decl + Nested(kMaxConfigDepth + 1, "<!-- x -->"), false},
      {"UTF-16 at the bound", Utf16(Nested(kMaxConfigDepth)), true},
      {"UTF-16 past the bound", Utf16(Nested(kMaxConfigDepth + 1)), false},
      {"stray end tags first", "</d></d>" + Nested(kMaxConfigDepth + 1), false},
      {"entities past the size bound", expanding, false},
      {"malformed", decl + "<d><e></d>", false},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    TempPrefix prefix;
    prefix.WriteFile(prefix.Drive('d') / "folder.cfg", c.bytes);
    wxXmlDocument doc;
    EXPECT_EQ(LoadFolderConfig("D:\\folder.cfg", &doc), c.loads);
  }
}

}  // namespace
