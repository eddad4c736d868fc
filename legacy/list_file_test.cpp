#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <sstream>
#include <string>
#include <vector>

#include "engine/migrator.h"
#include "tests/cases.h"
#include "tests/legacy_fixture.h"

namespace {

// The list file's bytes for a row's folders ("state path|..."), every
// record's reserved bytes set, since the reader must not examine them; then
// the row's edit.
std::string List(const std::string& folders, const std::string& edit) {
  std::vector<LegacyFolder> listed;
  std::istringstream in(folders);
  for (std::string f; std::getline(in, f, '|');)
    listed.push_back({f.substr(f.find(' ') + 1), static_cast<std::uint16_t>(std::stoi(f))});
  std::string bytes = LegacyListBytes(listed);
  for (std::size_t record = 40; record < bytes.size(); record += 264) bytes[record] = '\x5A';
  if (edit.empty()) return bytes;
  const long n = std::stol(edit.substr(edit.find(' ')));
  if (edit[0] == 'c') return bytes.substr(0, n < 0 ? bytes.size() + n : n);
  const std::string patch = edit.substr(edit.find(' ', 3) + 1);
  return bytes.replace(n, patch.size(), patch);
}

// The rows of list_file_cases.tsv.
TEST(ReadLegacyList, FileLayouts) {
  alarm(60);  // a read that blocks ends the process: a hang fails
  const std::vector<CaseRow> cases = ReadCases("legacy/list_file_cases.tsv");
  ASSERT_FALSE(cases.empty());
  for (const CaseRow& c : cases) {
    SCOPED_TRACE(c.at(0));
    TempPrefix prefix;
    if (c.size() > 5) UseUtf8AnsiCodePage(prefix);
    if (c.at(1)[0] != '<') prefix.WriteFile(LegacyListHostPath(prefix), List(c[1], c.at(2)));
    if (c[1] == "<fifo>") {
      std::filesystem::create_directories(LegacyListHostPath(prefix).parent_path());
      ASSERT_EQ(mkfifo(LegacyListHostPath(prefix).c_str(), 0600), 0);
    }
    CHFMigrator engine;
    EXPECT_EQ(engine.ReadLegacyList(), c.at(3) == "1");
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
    EXPECT_EQ(folders, wxString::FromUTF8(c.at(4)).ToStdWstring());
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
