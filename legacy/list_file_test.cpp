#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "engine/migrator.h"
#include "tests/legacy_fixture.h"

namespace {

// The list file's bytes with every record's reserved bytes set, since the
// reader must not examine them.
std::string List(const std::vector<LegacyFolder>& folders) {
  std::string bytes = LegacyListBytes(folders);
  for (std::size_t record = 40; record < bytes.size(); record += 264) bytes[record] = '\x5A';
  return bytes;
}

// `bytes` with `patch` written over them from `offset`.
std::string Patched(std::string bytes, std::size_t offset, const std::string& patch) {
  return bytes.replace(offset, patch.size(), patch);
}

TEST(ReadLegacyList, FileLayouts) {
  const std::string one = List({{"D:\\a", 2}});
  const std::string torn = List({{"D:\\a", 2}, {"D:\\torn", 2}});
  const struct {
    const char* name;
    std::string bytes;  // "<none>" for no file at all, "<fifo>" for a FIFO
    bool result;
    std::wstring folders;  // "flag path;" for each listed folder, "flag !bytes;" undecoded
    bool utf8 = false;     // the prefix's ANSI code page is UTF-8
  } cases[] = {
      {"header only", List({}), false, L""},
      {"wrong magic", Patched(one, 22, "f"), false, L""},
      {"magic in other case", Patched(one, 0, "KYR ZEROVUROVA DATABASE"), false, L""},
      {"magic with more text", Patched(one, 23, "!"), false, L""},
      {"version 2", Patched(one, 24, "\x02"), false, L""},
      {"shorter than a header", List({}).substr(0, 39), false, L""},
      {"empty file", "", false, L""},
      {"no file", "<none>", false, L""},
      {"a FIFO, which would wait for a writer", "<fifo>", false, L""},
      {"only an empty path", List({{"", 2}}), true, L""},
      {"empty path among others", List({{"D:\\a", 2}, {"", 2}, {"D:\\c", 0}}), true,
       L"1 D:\\a;0 D:\\c;"},
      {"states and kinds of path, in order",
       List({{"D:\\Jobs\\B", 0},
             {"C:\\A", 1},
             {"\\\\srv\\x\\", 2},
             {"D:\\s3", 3},
             {"D:\\high", 0x0102}}),
       true, L"0 D:\\Jobs\\B;0 C:\\A;1 \\\\srv\\x\\;0 D:\\s3;0 D:\\high;"},
      {"260-byte path without terminator", List({{std::string(260, 'p'), 2}, {"D:\\next", 0}}),
       true, L"1 " + std::wstring(260, L'p') + L";0 D:\\next;"},
      {"trailing partial record ignored", torn.substr(0, torn.size() - 164), true, L"1 D:\\a;"},
      {"partial record only", one.substr(0, 40 + 263), false, L""},
      {"Windows-1252 path", List({{"D:\\\x80 \x81\x8a\x9f\xe9\xff", 2}}), true,
       L"1 D:\\\u20AC \u0081\u0160\u0178\u00E9\u00FF;"},
      // A path that does not decode keeps its place, and nothing else is lost.
      {"UTF-8 code page",
       List({{"D:\\caf\xc3\xa9", 2}, {"D:\\caf\xe9", 0}, {"D:\\\xef\xbf\xbd", 2}}), true,
       L"1 D:\\caf\u00e9;0 !D:\\caf\u00e9;1 D:\\\uFFFD;", true},
  };
  alarm(60);  // a read that blocks ends the process: a hang fails
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    TempPrefix prefix;
    if (c.utf8) UseUtf8AnsiCodePage(prefix);
    if (c.bytes[0] != '<') prefix.WriteFile(LegacyListHostPath(prefix), c.bytes);
    if (c.bytes == "<fifo>") {
      std::filesystem::create_directories(LegacyListHostPath(prefix).parent_path());
      ASSERT_EQ(mkfifo(LegacyListHostPath(prefix).c_str(), 0600), 0);
    }
    CHFMigrator engine;
    EXPECT_EQ(engine.ReadLegacyList(), c.result);
    ASSERT_EQ(engine.m_Folders.size(), engine.m_EnabledFlags.size());
    std::wstring folders;
    for (std::size_t i = 0; i < engine.m_Folders.size(); ++i) {
      const auto undecoded = engine.m_UndecodedPaths.find(i);
      const wxString path =
          undecoded == engine.m_UndecodedPaths.end()
              ? engine.m_Folders[i]
              : "!" + wxString(undecoded->second.data(), wxConvISO8859_1, undecoded->second.size());
      EXPECT_EQ(engine.m_Folders[i].empty(), undecoded != engine.m_UndecodedPaths.end());
      folders += (engine.m_EnabledFlags[i] + " " + path + ";").ToStdWstring();
    }
    EXPECT_EQ(folders, c.folders);
    // Each gets an outcome; one without a path never reaches the folder reader.
    engine.MigrateFolders();
    ASSERT_EQ(engine.m_Status.size(), engine.m_Folders.size());
    for (std::size_t i = 0; i < engine.m_Status.size(); ++i) {
      EXPECT_EQ(engine.m_Status[i], engine.m_UndecodedPaths.count(i) ? "Failed; Path not decodable"
                                                                     : "Failed; File missing");
    }
  }
  alarm(0);
}

}  // namespace
