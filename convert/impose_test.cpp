#include <gtest/gtest.h>

#include <map>
#include <sstream>
#include <string>

#include "convert/templates.h"
#include "engine/migrator.h"
#include "tests/cases.h"
#include "tests/temp_prefix.h"

namespace {

const std::string kDir =
    "C:\\Program Files\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template\\";
const std::string kDirX86 =
    "C:\\Program Files (x86)\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template\\";

const std::string kCustom = "customTemplateHF2.x-";

// What properties that hold none of the keys read give: always written.
const std::map<std::string, std::string> kFixed = {
    {"QXImpFdGaps", "5 5 "},     {"QXImpFdValues", "1"},  {"QXImpLayout", " "},
    {"QXImpMarks", "0 0 0 0 0"}, {"QXImpSpineFold", "0"}, {"QXImpThickness", "0"}};

// Converts legacy settings written as in impose_cases.tsv into `out`;
// answers the entries that differ from kFixed, written as there.
std::string Convert(const std::string& settings, db::ImposeConfiguration out = {}) {
  CHFMigrator engine;
  std::istringstream in(settings);
  std::size_t given = 0;
  for (std::string item; std::getline(in, item, '|'); ++given) {
    SettingsMap& map = item[0] == 'I'   ? engine.m_ImposeInfo
                       : item[0] == 'P' ? engine.m_ImpositionProperties
                       : item[0] == 'D' ? engine.m_ImposeDeliveryInfo
                                        : engine.m_FolderSettings;
    map.GetOrInsert(item.substr(2, item.find('=') - 2)) = item.substr(item.find('=') + 1);
  }
  engine.ConvertImposeSettings(out);
  // Reading inserts nothing into the legacy maps.
  EXPECT_EQ(engine.m_ImposeInfo.Size() + engine.m_ImpositionProperties.Size() +
                engine.m_ImposeDeliveryInfo.Size() + engine.m_FolderSettings.Size(),
            given);
  std::string changed;
  for (const auto& [key, value] : kFixed) {
    if (!out.count(key)) changed += key + ";";
  }
  for (const auto& [key, entry] : out) {
    EXPECT_EQ(entry.Name, key);
    std::string value = entry.Value.ToStdString();
    if (value.rfind(kDir + kCustom, 0) == 0)
      value = "~" + value.substr(kDir.size() + kCustom.size());
    if (value.rfind(kDir, 0) == 0) value = ">" + value.substr(kDir.size());
    auto fixed = kFixed.find(key.ToStdString());
    if (fixed == kFixed.end() || fixed->second != value) changed += key + "=" + value + ";";
  }
  return changed;
}

// Every test runs in a prefix of its own, so the registry probe never sees
// the developer's own Wine installation.
class ImposeTest : public ::testing::Test {
 protected:
  TempPrefix prefix_;
};

TEST_F(ImposeTest, EntriesFromLegacyValues) {
  const std::vector<CaseRow> cases = ReadCases("convert/impose_cases.tsv");
  ASSERT_FALSE(cases.empty());
  for (const CaseRow& c : cases) EXPECT_EQ(Convert(c.at(0)), c.at(1)) << c[0];
}

// The converter adds entries; one already in the record stays.
TEST_F(ImposeTest, PresentEntriesStay) {
  EXPECT_EQ(Convert("P:PageSize=A4", {{"PageSize", {"PageSize", "Letter"}}}), "PageSize=Letter;");
}

// Which key chooses the directory; how the hive is read (letter case, no
// hive) is the platform's and the registry fuzzer's.
TEST_F(ImposeTest, RegistryKeyChoosesTheX86Directory) {
  const std::pair<const char*, bool> cases[] = {
      {"Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app\\\\3.0", true},
      {"Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app", false},
      {"Software\\\\Tessaly Systems\\\\Corvane_app\\\\3.0", false},
  };
  for (const auto& [section, x86] : cases) {
    TempPrefix prefix;
    prefix.WriteFile(prefix.root() / "system.reg",
                     std::string("WINE REGISTRY Version 2\n\n[") + section + "] 1700000000\n");
    EXPECT_EQ(HasWow6432ProductKey(), x86) << section;
    const std::string& dir = x86 ? kDirX86 : kDir;
    CHFMigrator engine;
    EXPECT_EQ(engine.MapLegacyTemplate("ImposeTemplate.2").ToStdString(), dir + "2up-perfect.dbt");
    EXPECT_EQ(engine.MakeCustomTemplatePath().ToStdString(), dir + "customTemplateHF2.x-.dbt");
  }
}

}  // namespace
