// The built hfmigrate over a generated legacy installation, checked through
// the built hfstore's JSON dump.
#include <gtest/gtest.h>
#include <signal.h>
#include <stdio.h>

#include <nlohmann/json.hpp>
#include <string>

#include "platform/platform.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

using nlohmann::json;

// Runs "hfstore dump" for the current prefix and parses its output.
json DumpStore() {
  std::string command = BinDir() + "/hfstore dump";
  FILE* pipe = popen(command.c_str(), "r");
  std::string out;
  char buffer[4096];
  size_t n;
  while (pipe && (n = fread(buffer, 1, sizeof(buffer), pipe)) > 0) out.append(buffer, n);
  if (!pipe || pclose(pipe) != 0) return json();
  return json::parse(out, nullptr, false);
}

std::vector<std::string> FilterNames(const json& folder) {
  std::vector<std::string> names;
  for (const json& filter : folder["setting"]["Filters"]) names.push_back(filter["DisplayName"]);
  return names;
}

// A running server, so that the run has no seven-second wait.
class RunningServer {
 public:
  RunningServer() : pid_(StartProgram(BinDir() + "/hotfolder.exe")) {
    WaitFor([] { return platform::NamedMutexExists(L"KYR Dirorodiv - Server"); });
  }
  ~RunningServer() {
    kill(pid_, SIGKILL);
    WaitProgram(pid_);
  }

 private:
  pid_t pid_;
};

const char kPrintFolder[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<HotFolderConfiguration>
  <FolderSettings>
    <LogicalPrinter>Print Queue</LogicalPrinter>
    <ServerName>PRESS-01</ServerName>
  </FolderSettings>
  <DriverSettings><NUMCOPIES>3</NUMCOPIES><MediaType> Coated </MediaType></DriverSettings>
</HotFolderConfiguration>
)";

const char kDisabledEpsFolder[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<HotFolderConfiguration>
  <FILTERS>
    <FILTERID>{3F2B6A10-5C1D-4E8A-9B7F-0A1C2D3E4F50}
<NAME>EPS</NAME><ENABLED>1</ENABLED><EPS2PSFILTER><SOURCESIZEX>612</SOURCESIZEX></EPS2PSFILTER></FILTERID>
  </FILTERS>
</HotFolderConfiguration>
)";

TEST(Migration, WholeInstallationEndToEnd) {
  TempPrefix prefix;
  WriteLegacyList(prefix, {{"D:\\Jobs\\Brochures", 2},
                           {"D:\\Jobs\\Missing", 2},
                           {"D:\\Jobs\\Flyers.v2", 0},
                           {"D:\\Jobs\\Broken", 2}});
  WriteFolderConfig(prefix, "Jobs/Brochures", kPrintFolder);
  std::filesystem::create_directories(OnDriveD(prefix, "Jobs/Missing"));
  WriteFolderConfig(prefix, "Jobs/Flyers.v2", kDisabledEpsFolder);
  WriteFolderConfig(prefix, "Jobs/Broken", "<HotFolderConfiguration><FolderSettings>");
  RunningServer server;

  EXPECT_EQ(RunProgram(BinDir() + "/hfmigrate").status, 255);

  json dump = DumpStore();
  ASSERT_TRUE(dump.is_object()) << "hfstore dump failed";
  const json& folders = dump["hotFolders"];
  ASSERT_EQ(folders.size(), 3u);

  const json& brochures = folders[0];
  EXPECT_EQ(brochures["enabled"], true);
  EXPECT_EQ(brochures["setting"]["Name"], "Brochures");
  EXPECT_EQ(brochures["setting"]["FolderPath"], "D:\\Jobs\\Brochures");
  EXPECT_EQ(brochures["setting"]["Queue"], "print");
  EXPECT_EQ(brochures["setting"]["ServerName"], "PRESS-01");
  EXPECT_EQ(brochures["setting"]["Number1"], -1);
  EXPECT_EQ(brochures["setting"]["String3"], "10");
  EXPECT_EQ(FilterNames(brochures), (std::vector<std::string>{"PDF", "PS", "TIFF", "VDP"}));
  EXPECT_EQ(brochures["folderConfiguration"]["WorkFolder"],
            "D:\\Jobs\\Brochures\\[_KYR_HotFolder_]\\[WorkFolder]");
  ASSERT_EQ(brochures["jobConfiguration"].size(), 2u);
  EXPECT_EQ(brochures["jobConfiguration"][0]["key"], "MediaType");
  EXPECT_EQ(brochures["jobConfiguration"][0]["Value"], " Coated ");
  EXPECT_EQ(brochures["jobConfiguration"][1]["key"], "num copies");
  EXPECT_EQ(brochures["jobConfiguration"][1]["Name"], "NUMCOPIES");
  EXPECT_EQ(brochures["imposeConfiguration"].size(), 0u);
  std::string filters = brochures["filterConfiguration"];
  EXPECT_NE(filters.find("<Filter name=\"KYR.VDP.1\">"), std::string::npos) << filters;
  EXPECT_NE(filters.find("<ERRORPATH>"), std::string::npos) << filters;

  // Disabled in the legacy list; nothing of the first folder leaks into it.
  const json& flyers = folders[1];
  EXPECT_EQ(flyers["enabled"], false);
  EXPECT_EQ(flyers["setting"]["Name"], "Flyers");
  EXPECT_EQ(flyers["setting"]["Queue"], "hold");
  EXPECT_EQ(flyers["setting"]["ServerName"], "");
  EXPECT_EQ(FilterNames(flyers), std::vector<std::string>{"EPS"});
  EXPECT_EQ(flyers["jobConfiguration"].size(), 0u);
  std::string eps = flyers["filterConfiguration"];
  EXPECT_NE(eps.find("<ORIGINALWIDTH>8.500000</ORIGINALWIDTH>"), std::string::npos) << eps;

  // A malformed folder.cfg is registered from its folder path alone.
  const json& broken = folders[2];
  EXPECT_EQ(broken["setting"]["Name"], "Broken");
  EXPECT_EQ(FilterNames(broken), (std::vector<std::string>{"PDF", "PS", "TIFF", "VDP"}));

  for (const char* retired : {"Jobs/Brochures", "Jobs/Flyers.v2", "Jobs/Broken"}) {
    EXPECT_TRUE(
        std::filesystem::exists(OnDriveD(prefix, retired) / "[_KYR_HotFolder_Old]" / "folder.cfg"))
        << retired;
    EXPECT_FALSE(std::filesystem::exists(OnDriveD(prefix, retired) / "[_KYR_HotFolder_]"));
  }

  // A second run finds nothing left to migrate and changes nothing.
  EXPECT_EQ(RunProgram(BinDir() + "/hfmigrate").status, 255);
  EXPECT_EQ(DumpStore(), dump);
}

}  // namespace

namespace {

const char kImposedFolder[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<HotFolderConfiguration>
  <FolderSettings><WorkFolder>D:\Jobs\Booklets\Work\Spool</WorkFolder></FolderSettings>
  <ImpositionProperties>
    <PageSize>A4</PageSize>
    <ZeroMarginsSupport>true</ZeroMarginsSupport>
    <ZeroMargins>1</ZeroMargins>
    <ImpInfoFile>booklets.imp</ImpInfoFile>
  </ImpositionProperties>
  <ImposeInfo>
    <Binding>saddlestitch</Binding>
    <Creep>0.5</Creep>
    <Layout><x>2</x><y>1</y><HorizontalGap0>0.25</HorizontalGap0></Layout>
    <PrinterMarks><ShowCropMarks>YES</ShowCropMarks><ShowFoldLines>NO</ShowFoldLines></PrinterMarks>
  </ImposeInfo>
  <ImposeDeliveryInfo><OutputSequence>reverse</OutputSequence></ImposeDeliveryInfo>
</HotFolderConfiguration>
)";

TEST(Migration, ImpositionPropertiesReachTheStore) {
  TempPrefix prefix;
  WriteLegacyList(prefix, {{"D:\\Jobs\\Booklets", 2}});
  WriteFolderConfig(prefix, "Jobs/Booklets", kImposedFolder);
  RunningServer server;

  EXPECT_EQ(RunProgram(BinDir() + "/hfmigrate").status, 255);

  json dump = DumpStore();
  ASSERT_TRUE(dump.is_object()) << "hfstore dump failed";
  ASSERT_EQ(dump["hotFolders"].size(), 1u);
  std::vector<std::pair<std::string, std::string>> entries;
  for (const json& entry : dump["hotFolders"][0]["imposeConfiguration"]) {
    entries.emplace_back(entry["Name"], entry["Value"]);
  }
  const std::string kTemplates =
      "C:\\Program Files\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template\\";
  // In the store's key order (UTF-16 code units: capitals before "Imp"...).
  const std::vector<std::pair<std::string, std::string>> expected = {
      {"PageSize", "A4"},
      {"QXDeliverySeq", "1"},
      {"QXImpBinding", "3"},
      {"QXImpCreeps", "32768.000000 32768.000000"},
      {"QXImpFdCreeps", "0.5 0.5"},
      {"QXImpFdGaps", "10 0.25 10 "},
      {"QXImpFdValues", "1"},
      {"QXImpLayout", "2 1"},
      {"QXImpMarks", "1 2 0 0 0"},
      {"QXImpSpineFold", "0"},
      {"QXImpThickness", "0"},
      {"QXImpZeroMargin", "True"},
      {"QXImposeTemplate", kTemplates + "customTemplateHF2.x-Booklets.dbt"},
  };
  EXPECT_EQ(entries, expected);
}

}  // namespace
