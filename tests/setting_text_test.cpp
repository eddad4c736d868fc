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

using nlohmann::json;

const char kDefaultChain[] = "PDF;PS;TIFF;VDP;";
const std::string kPdf2Ps = "{CDD70909-DACE-499B-9186-B6088CD46376}\n";

std::string Driver(const std::string& text) {
  return "<DriverSettings><K>" + text + "</K></DriverSettings>";
}

std::string Container(const std::string& identifier, const std::string& enable) {
  return "<FILTERID>" + identifier + "<Name/><Enabled>" + enable + "</Enabled></FILTERID>";
}

// A folder as the store holds it: its filter chain, then "|" and its job
// settings as "name=value;".
std::string Summary(const json& folder) {
  std::string text;
  for (const json& filter : folder["setting"]["Filters"])
    text += filter["DisplayName"].get<std::string>() + ";";
  text += "|";
  for (const json& entry : folder["jobConfiguration"]) {
    text += entry["Name"].get<std::string>() + "=" + entry["Value"].get<std::string>() + ";";
  }
  return text;
}

// Each text whole as XML gives it: the pieces the parser splits it into
// (at line ends and references) all count, blank ones included.
TEST(SettingText, TakenWholeAsWritten) {
  const std::pair<std::string, std::string> cases[] = {
      {Driver("\n  value"), "|K=\n  value;"},
      {Driver("   &amp; B"), "|K=   & B;"},
      {Driver(" &#65;"), "|K= A;"},
      {Driver("\r\nCRLF"), "|K=\nCRLF;"},
      {Driver(" \r\n\t "), "|"},
      {Driver("<?pi x?><!--x-->v"), "|K=v;"},
      {Container(kPdf2Ps, "1"), "PDF;|"},
      {Container("\n" + kPdf2Ps, "1"), "|"},
      {Container(kPdf2Ps, "\n1"), "|"},
      {Container(kPdf2Ps, " &#49;"), "|"},
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
  const json folders = json::parse(run.out, nullptr, false)["hotFolders"];
  ASSERT_EQ(folders.size(), std::size(cases)) << run.err;
  for (std::size_t i = 0; i < folders.size(); ++i) {
    std::string summary = cases[i].second;
    if (summary[0] == '|') summary = kDefaultChain + summary;
    EXPECT_EQ(Summary(folders[i]), summary) << cases[i].first;
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
