// Setting texts as hand-edited folder.cfg files write them, read by the real
// engine into a real store and seen through the built hfstore's dump; and
// relative folder paths in the legacy list.
#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "engine/migrator.h"
#include "tests/cases.h"
#include "tests/hot_folder.h"
#include "tests/legacy_fixture.h"

namespace {

// Setting texts as written (tests/setting_text_cases.tsv): body, summary.
TEST(SettingText, TakenWholeAsWritten) {
  const std::vector<CaseRow> cases = ReadCases("tests/setting_text_cases.tsv");
  TempPrefix prefix;
  std::vector<LegacyFolder> listed;
  for (const CaseRow& c : cases) {
    const std::string name = "F" + std::to_string(listed.size());
    WriteFolderConfig(prefix, name,
                      "<HotFolderConfiguration>\n" + c[0] + "\n</HotFolderConfiguration>");
    listed.push_back({"D:\\" + name, 2});
  }
  WriteLegacyList(prefix, listed);
  CHFMigrator().Run();

  RunResult run = Hfstore({"dump"});
  const auto folders = nlohmann::json::parse(run.out, nullptr, false)["hotFolders"];
  ASSERT_EQ(folders.size(), cases.size()) << run.err;
  for (std::size_t i = 0; i < folders.size(); ++i) {
    std::string summary;
    for (const auto& filter : folders[i]["setting"]["Filters"])
      summary += filter["DisplayName"].get<std::string>() + ";";
    summary += "|";
    for (const auto& entry : folders[i]["jobConfiguration"])
      summary += entry["Name"].get<std::string>() + "=" + entry["Value"].get<std::string>() + ";";
    if (summary.rfind("PDF;PS;TIFF;VDP;|", 0) == 0) summary.replace(0, 16, "*");
    EXPECT_EQ(summary, cases[i][1]) << cases[i][0];
  }
}

// A relative path counts from the current directory's Windows form; from
// outside every drive it names nothing, though a host file lies there.
TEST(SettingText, RelativeFolderPathStaysOnTheDrives) {
  const std::filesystem::path original = std::filesystem::current_path();
  for (bool on_drive : {false, true}) {
    TempPrefix prefix;
    WriteLegacyList(prefix, {{"Rel", 2}});
    const std::filesystem::path current = on_drive ? prefix.Drive('d') : prefix.root();
    prefix.WriteFile(current / "Rel" / "[_KYR_HotFolder_]" / "folder.cfg", "<r/>");
    std::filesystem::current_path(current);
    CHFMigrator engine;
    engine.Run();
    std::filesystem::current_path(original);
    EXPECT_EQ(engine.m_Status.size() == 1 ? engine.m_Status[0].utf8_string() : "",
              on_drive ? "Success" : "Failed; File missing");
  }
}

}  // namespace
