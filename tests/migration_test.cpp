// The built hfmigrate over a generated legacy installation, checked through
// the built hfstore's JSON dump.
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

using nlohmann::json;

// Legacy folder.cfg documents: a print queue with driver settings, an EPS
// filter, and imposition settings.
const char kPrintFolder[] =
    "<HotFolderConfiguration><FolderSettings><LogicalPrinter>Print Queue</LogicalPrinter>"
    "<ServerName>PRESS-01</ServerName></FolderSettings><DriverSettings><NUMCOPIES>3</NUMCOPIES>"
    "<MediaType> Coated </MediaType></DriverSettings></HotFolderConfiguration>";
const char kEpsFolder[] =
    "<HotFolderConfiguration><FILTERS><FILTERID>{3F2B6A10-5C1D-4E8A-9B7F-0A1C2D3E4F50}\n"
    "<NAME>EPS</NAME><ENABLED>1</ENABLED><EPS2PSFILTER><SOURCESIZEX>612</SOURCESIZEX>"
    "</EPS2PSFILTER></FILTERID></FILTERS></HotFolderConfiguration>";
const char kImposedFolder[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<HotFolderConfiguration>
  <FolderSettings><WorkFolder>D:\Jobs\Booklets\Work\Spool</WorkFolder></FolderSettings>
  <ImpositionProperties><PageSize>A4</PageSize><ZeroMarginsSupport>true</ZeroMarginsSupport>
    <ZeroMargins>1</ZeroMargins><ImpInfoFile>booklets.imp</ImpInfoFile></ImpositionProperties>
  <ImposeInfo><Binding>saddlestitch</Binding><Creep>0.5</Creep>
    <Layout><x>2</x><y>1</y><HorizontalGap0>0.25</HorizontalGap0></Layout>
    <PrinterMarks><ShowCropMarks>YES</ShowCropMarks><ShowFoldLines>NO</ShowFoldLines></PrinterMarks>
  </ImposeInfo>
  <ImposeDeliveryInfo><OutputSequence>reverse</OutputSequence></ImposeDeliveryInfo>
</HotFolderConfiguration>
)";

json DumpStore() {
  CapturedRun run = RunCaptured(BinDir() + "/hfstore", {"dump"});
  return run.status == 0 ? json::parse(run.out, nullptr, false) : json();
}

// Each element's `name`, or "name=value" when `value` is given, ";" after each.
std::string Join(const json& list, const char* name, const char* value = nullptr) {
  std::string text;
  for (const json& e : list) {
    text += e[name].get<std::string>() + (value ? "=" + e[value].get<std::string>() : "") + ";";
  }
  return text;
}

TEST(Migration, WholeInstallationEndToEnd) {
  TempPrefix prefix;
  WriteLegacyList(prefix, {{"D:\\Jobs\\Brochures", 2},
                           {"D:\\Jobs\\Missing", 2},
                           {"D:\\Jobs\\Flyers.v2", 0},
                           {"D:\\Jobs\\Broken", 2},
                           {"D:\\Jobs\\Booklets", 2}});
  WriteFolderConfig(prefix, "Jobs/Brochures", kPrintFolder);
  std::filesystem::create_directories(OnDriveD(prefix, "Jobs/Missing"));
  WriteFolderConfig(prefix, "Jobs/Flyers.v2", kEpsFolder);
  WriteFolderConfig(prefix, "Jobs/Broken", "<HotFolderConfiguration><FolderSettings>");
  WriteFolderConfig(prefix, "Jobs/Booklets", kImposedFolder);
  RunningServer server;

  EXPECT_EQ(RunProgram(BinDir() + "/hfmigrate").status, 255);

  const json dump = DumpStore();
  ASSERT_TRUE(dump.is_object()) << "hfstore dump failed";
  const json& folders = dump["hotFolders"];
  ASSERT_EQ(folders.size(), 4u);
  // Flyers is disabled in the legacy list, Broken's folder.cfg is malformed:
  // each is registered from what it has, and nothing of another folder.
  const std::pair<const char*, json> fields[] = {
      {"/0/enabled", true},
      {"/0/setting/Name", "Brochures"},
      {"/0/setting/FolderPath", "D:\\Jobs\\Brochures"},
      {"/0/setting/Queue", "print"},
      {"/0/setting/ServerName", "PRESS-01"},
      {"/0/setting/Number1", -1},
      {"/0/setting/String3", "10"},
      {"/0/folderConfiguration/WorkFolder", "D:\\Jobs\\Brochures\\[_KYR_HotFolder_]\\[WorkFolder]"},
      {"/0/jobConfiguration",
       {{{"key", "MediaType"}, {"Name", "MediaType"}, {"Value", " Coated "}, {"Extra", ""}},
        {{"key", "num copies"}, {"Name", "NUMCOPIES"}, {"Value", "3"}, {"Extra", ""}}}},
      {"/0/imposeConfiguration", json::array()},
      {"/1/jobConfiguration", json::array()},
      {"/1/enabled", false},
      {"/1/setting/Name", "Flyers"},
      {"/1/setting/Queue", "hold"},
      {"/1/setting/ServerName", ""},
      {"/2/setting/Name", "Broken"},
  };
  for (const auto& [pointer, value] : fields) {
    json::json_pointer at(pointer);
    EXPECT_EQ(folders.contains(at) ? folders[at] : json("absent"), value) << pointer;
  }
  const char* chains[] = {"PDF;PS;TIFF;VDP;", "EPS;", "PDF;PS;TIFF;VDP;"};
  for (int i = 0; i < 3; ++i)
    EXPECT_EQ(Join(folders[i]["setting"]["Filters"], "DisplayName"), chains[i]);
  for (const char* text : {"<Filter name=\"KYR.VDP.1\">", "<ERRORPATH>"}) {
    EXPECT_NE(folders[0]["filterConfiguration"].get<std::string>().find(text), std::string::npos);
  }
  EXPECT_NE(folders[1]["filterConfiguration"].get<std::string>().find(
                "<ORIGINALWIDTH>8.500000</ORIGINALWIDTH>"),
            std::string::npos);

  // In the store's key order (UTF-16 code units: capitals before "Imp"...).
  const std::string templates =
      "C:\\Program Files\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template\\";
  EXPECT_EQ(Join(folders[3]["imposeConfiguration"], "Name", "Value"),
            "PageSize=A4;QXDeliverySeq=1;QXImpBinding=3;QXImpCreeps=32768.000000 32768.000000;"
            "QXImpFdCreeps=0.5 0.5;QXImpFdGaps=10 0.25 10 ;QXImpFdValues=1;QXImpLayout=2 1;"
            "QXImpMarks=1 2 0 0 0;QXImpSpineFold=0;QXImpThickness=0;QXImpZeroMargin=True;"
            "QXImposeTemplate=" +
                templates + "customTemplateHF2.x-Booklets.dbt;");

  for (const char* retired : {"Jobs/Brochures", "Jobs/Flyers.v2", "Jobs/Broken", "Jobs/Booklets"}) {
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
