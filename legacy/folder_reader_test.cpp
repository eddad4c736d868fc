#include "legacy/folder_reader.h"

#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <vector>

#include "tests/cases.h"
#include "tests/legacy_fixture.h"

namespace {

// The map's entries as "key=value;...", in insertion order; empty values
// left out unless `all`.
std::string Dump(const SettingsMap& map, bool all = false) {
  std::string out;
  for (const auto& [key, value] : map) {
    if (all || !value.empty()) out += (key + "=" + value + ";").utf8_string();
  }
  return out;
}

class FolderReaderTest : public ::testing::Test {
 protected:
  // Lists folder D:\<name> with `flag`, writes its folder.cfg unless null
  // and reads it.
  bool Read(std::optional<std::string> cfg, const char* flag, const std::string& name) {
    if (cfg) WriteFolderConfig(prefix_, name, *cfg);
    engine_.m_Folders.Add("D:\\" + name);
    engine_.m_EnabledFlags.Add(flag);
    return ReadFolderConfiguration(engine_, engine_.m_Folders.size() - 1);
  }

  TempPrefix prefix_;
  CHFMigrator engine_;
};

// The cases of folder_reader_cases.tsv, in one engine.
TEST_F(FolderReaderTest, CasesFromData) {
  const std::vector<CaseRow> cases = ReadCases("legacy/folder_reader_cases.tsv");
  ASSERT_FALSE(cases.empty());
  for (const CaseRow& c : cases) {
    if (c.at(0) == "find") {
      ConfigTree tree;
      ASSERT_TRUE(tree.Parse(c.at(1))) << c[1];
      ConfigTree::Id found = FindElement(tree, tree.Root(), L"x");
      ConfigTree::Id text = found == ConfigTree::kNone ? found : tree.FirstChild(found);
      EXPECT_EQ(text == ConfigTree::kNone ? "" : tree.Content(text), c.at(2)) << c[1];
      continue;
    }
    engine_.m_DriverSettings.GetOrInsert("left") = "over";
    EXPECT_TRUE(Read(c.at(1), "1", "F"));
    EXPECT_EQ(Dump(engine_.m_FolderSettings) + "|" + Dump(engine_.m_ImposeInfo) + "|" +
                  Dump(engine_.m_ImposeInfoVDP) + "|" + Dump(engine_.m_DriverSettings, true) + "|" +
                  Dump(engine_.m_FilterEnable, true) + "|" + Dump(engine_.m_TiffItFilter, true) +
                  Dump(engine_.m_Dcs2Filter, true),
              c.at(2))
        << c[1].substr(0, 200);
  }
}

// Nothing of one folder may reach the next, whatever map it is in.
TEST_F(FolderReaderTest, FoldersReadInARowAreIsolated) {
  // Two filters as the legacy service wrote them, and driver settings.
  ASSERT_TRUE(
      Read("<HotFolder><FolderSettings><Server>s1</Server></FolderSettings>"
           "<FILTERID>{CDD70909-DACE-499B-9186-B6088CD46376}\n<Enabled>1</Enabled>"
           "</FILTERID><FILTERID>{02AC69D4-CAEE-47E1-912E-95B0C9E8D86A}\n<Enabled>1"
           "</Enabled></FILTERID><DriverSettings><NumCopies>2</NumCopies></DriverSettings>"
           "</HotFolder>",
           "0", "First"));
  EXPECT_FALSE(engine_.m_CurrentEnabled);
  engine_.m_PexFilterConv.GetOrInsert("converted") = "for the first folder";

  ASSERT_TRUE(Read("<HotFolder><FolderSettings/></HotFolder>", "2", "Second"));
  EXPECT_TRUE(engine_.m_CurrentEnabled);
  EXPECT_EQ(Dump(engine_.m_FolderSettings) + Dump(engine_.m_FilterEnable) +
                Dump(engine_.m_DriverSettings, true) + Dump(engine_.m_PexFilterConv, true),
            "HFFolderPath=D:\\Second;MICROSOFT=0;");

  // A folder without folder.cfg changes nothing at all.
  EXPECT_FALSE(Read(std::nullopt, "0", "Missing"));
  EXPECT_EQ(Dump(engine_.m_FolderSettings), "HFFolderPath=D:\\Second;");
  EXPECT_TRUE(engine_.m_CurrentEnabled);
}

}  // namespace
