// Setting texts as hand-edited folder.cfg files write them, read by the real
// engine into a real store and seen through the built hfstore's dump; and
// relative folder paths in the legacy list.
#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "engine/migrator.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

const std::string kPdf2Ps = "<FILTERID>{CDD70909-DACE-499B-9186-B6088CD46376}\n";

// Each text whole as XML gives it: the pieces the parser splits it into
// (at line ends and references) all count, blank ones included. A folder is
// summed up as its filter chain, "|", and its job settings as "name=value;";
// "*" stands for the default chain.
TEST(SettingText, TakenWholeAsWritten) {
  const std::pair<std::string, std::string> cases[] = {
      {"<DriverSettings><K>\n  value</K></DriverSettings>", "*|K=\n  value;"},
      {"<DriverSettings><K>   &amp; B</K></DriverSettings>", "*|K=   & B;"},
      {"<DriverSettings><K> &#65;</K></DriverSettings>", "*|K= A;"},
      {"<DriverSettings><K>\r\nCRLF</K></DriverSettings>", "*|K=\nCRLF;"},
      {"<DriverSettings><K> \r\n\t </K></DriverSettings>", "*|"},
      {"<DriverSettings><K><?pi x?><!--x-->v</K></DriverSettings>", "*|K=v;"},
      {kPdf2Ps + "<Name/><Enabled>1</Enabled></FILTERID>", "PDF;|"},
      {"<FILTERID>\n" + kPdf2Ps.substr(10) + "<Name/><Enabled>1</Enabled></FILTERID>", "*|"},
      {kPdf2Ps + "<Name/><Enabled>\n1</Enabled></FILTERID>", "*|"},
      {kPdf2Ps + "<Name/><Enabled> &#49;</Enabled></FILTERID>", "*|"},
  };
  TempPrefix prefix;
  std::vector<LegacyFolder> listed;
  for (const auto& [body, summary] : cases) {
    const std::string name = "F" + std::to_string(listed.size());
    WriteFolderConfig(prefix, name,
                      "<HotFolderConfiguration>\n" + body + "\n</HotFolderConfiguration>");
    listed.push_back({"D:\\" + name, 2});
  }
  WriteLegacyList(prefix, listed);
  CHFMigrator().Run();

  CapturedRun run = RunCaptured(BinDir() + "/hfstore", {"dump"});
  const auto folders = nlohmann::json::parse(run.out, nullptr, false)["hotFolders"];
  ASSERT_EQ(folders.size(), std::size(cases)) << run.err;
  for (std::size_t i = 0; i < folders.size(); ++i) {
    std::string summary;
    for (const auto& filter : folders[i]["setting"]["Filters"])
      summary += filter["DisplayName"].get<std::string>() + ";";
    summary += "|";
    for (const auto& entry : folders[i]["jobConfiguration"])
      summary += entry["Name"].get<std::string>() + "=" + entry["Value"].get<std::string>() + ";";
    if (summary.rfind("PDF;PS;TIFF;VDP;|", 0) == 0) summary.replace(0, 16, "*");
    EXPECT_EQ(summary, cases[i].second) << cases[i].first;
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
