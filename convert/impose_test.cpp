#include <gtest/gtest.h>

#include <map>
#include <sstream>
#include <string>

#include "app/migrator.h"
#include "convert/templates.h"
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

// Converts legacy settings written as "I:key=value|P:key=value" (I the
// ImposeInfo map, P ImpositionProperties, D ImposeDeliveryInfo, F
// FolderSettings) into `out`. Answers the entries that differ from kFixed
// as "key=value;" in the record's order, a fixed key missing as "key;", ">"
// for the template directory and "~" for it with the custom template's prefix.
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

#define GAPS "I:HorizontalGap0=0.25|I:HorizontalGap1=.5|I:HorizontalGap9=9th|I:VerticalGap0=1|"
#define CUSTOM "P:ImpInfoFile=a.imp|"
#define FULL_DELIVERY "D:OutputSequence=REVERSE|D:SurfaceOrder=FACEUP|"
#define LEGACY "P:ImpInfoFile=a.imp|P:Template="
#define WORK "P:ImpInfoFile=a.imp|F:WorkFolder="

TEST_F(ImposeTest, EntriesFromLegacyValues) {
  const std::pair<const char*, const char*> cases[] = {
      // Properties holding none of the keys read give exactly the fixed six.
      {"P:ImpInfoFileVDP=vdp.imp", ""},
      {"I:Binding=perfect", "QXImpBinding=2;"},
      {"I:Binding=SADDLE", "QXImpBinding=0;"},
      {"I:Binding=gangupcollatemulti", "QXImpBinding=11;"},
      {"I:Binding=PERFECT ", "QXImpBinding=0;"},
      {"I:Edge=right", "QXImpBindEdge=1;"},
      {"I:Edge=", "QXImpBindEdge=-1;"},
      {"I:AutoScale=no", "QXImpAutoPScal=2;"},
      {"I:AutoScale=1", "QXImpAutoPScal=0;"},
      {"I:Orientation=landscape", "QXImpOrient=2;"},
      {"I:Orientation=POTRAIT", "QXImpOrient=-1;"},
      {"I:Watermarks=Yes", "QXImpWatermark=1;"},
      {"I:GangupStyle=reversal_alternate", "QXGangupStyle=1004;"},
      {"I:GangupStyle=", "QXGangupStyle=0;"},
      // Unchanged texts.
      {"I:GroupsOf= 4 ", "QXImpPPGrp= 4 ;"},
      {"P:PageRegion=|P:PageSize= A4|P:CustomPageSize=1 ",
       "CustomPageSize=1 ;PageRegion=;PageSize= A4;"},
      {"P:FixedDuplexValue=x|I:CreepDirection=in", "QXDuplex=x;QXImpCreepDir=in;"},
      {"I:FrontCover=f |I:BackCover= b", "QXBackCover= b;QXFrontCover=f ;"},
      // Marks: the field is there whatever the value.
      {"I:ShowCropMarks=YES|I:ShowFoldLines=yes|I:ShowJobName=Yes|I:ShowSheetInfo=yES|"
       "I:ShowDateAndTime=YES",
       "QXImpMarks=1 1 1 1 1;"},
      {"I:ShowCropMarks=no|I:ShowFoldLines=NO|I:ShowJobName=No|I:ShowSheetInfo=nO|"
       "I:ShowDateAndTime=no",
       "QXImpMarks=2 2 2 2 2;"},
      {"I:ShowCropMarks=YES|I:ShowFoldLines=NO|I:ShowJobName=maybe|I:ShowSheetInfo=",
       "QXImpMarks=1 2 0 0 0;"},
      // Layout and gaps: limits are signed; ten gaps only with zero margins.
      {GAPS "I:x=2|I:y=1", "QXImpFdGaps=5 0.25 .5 5 1 ;QXImpLayout=2 1;"},
      {GAPS "I:x=11|I:y=1", "QXImpFdGaps;QXImpLayout=11 1;"},
      {GAPS "I:x=2|I:y=12", "QXImpFdGaps;QXImpLayout=2 12;"},
      {GAPS "I:x=99999999999", "QXImpFdGaps;QXImpLayout=99999999999 ;"},
      {GAPS "I:x=-3|I:y=10mm", "QXImpFdGaps=5 0.25 .5 5 1 ;QXImpLayout=-3 10mm;"},
      {GAPS "P:ZeroMarginsSupport=true", "QXImpFdGaps=10 0.25 .5 9th 10 1 ;"},
      {GAPS "P:ZeroMarginsSupport=FALSE", "QXImpFdGaps=5 0.25 .5 5 1 ;"},
      // Fixed point: truncated toward zero; NaN and overflow explicit.
      {"I:ScaleFactor=1", "QXImpFdPgScale=65536.000000;QXImpPageScale=1;"},
      {"I:ScaleFactor=1.5mm", "QXImpFdPgScale=98304.000000;QXImpPageScale=1.5mm;"},
      {"I:ScaleFactor=-0.25", "QXImpFdPgScale=-16384.000000;QXImpPageScale=-0.25;"},
      {"I:ScaleFactor=-0.00001", "QXImpFdPgScale=0.000000;QXImpPageScale=-0.00001;"},
      {"I:ScaleFactor=abc", "QXImpFdPgScale=0.000000;QXImpPageScale=abc;"},
      {"I:ScaleFactor=32767.99999", "QXImpFdPgScale=2147483647.000000;QXImpPageScale=32767.99999;"},
      {"I:ScaleFactor=32768", "QXImpFdPgScale=-2147483648.000000;QXImpPageScale=32768;"},
      {"I:ScaleFactor=1e12", "QXImpFdPgScale=-2147483648.000000;QXImpPageScale=1e12;"},
      {"I:ScaleFactor=nan", "QXImpFdPgScale=-2147483648.000000;QXImpPageScale=nan;"},
      {"I:ScaleFactor=-inf", "QXImpFdPgScale=-2147483648.000000;QXImpPageScale=-inf;"},
      // Bleed and creep.
      {"I:HorizontalBleed=9", "QXImpBleed=589824.000000 ;QXImpFdBleed=9 ;"},
      {"I:HorizontalBleed=1|I:VerticalBleed=0.5",
       "QXImpBleed=65536.000000 32768.000000;QXImpFdBleed=1 0.5;"},
      {"I:VerticalBleed=3", ""},
      {"I:Creep=0.5", "QXImpCreeps=32768.000000 32768.000000;QXImpFdCreeps=0.5 0.5;"},
      // Zero margins: only "1", and only with the flag.
      {"P:ZeroMarginsSupport=TRUE|P:ZeroMargins=1", "QXImpFdGaps=10 10 ;QXImpZeroMargin=True;"},
      {"P:ZeroMarginsSupport=tRuE|P:ZeroMargins=1", "QXImpFdGaps=10 10 ;QXImpZeroMargin=True;"},
      {"P:ZeroMarginsSupport=FALSE|P:ZeroMargins=1", ""},
      {"P:ZeroMargins=1", ""},
      {"P:ZeroMarginsSupport=TRUE|P:ZeroMargins=0", "QXImpFdGaps=10 10 ;"},
      {"P:ZeroMarginsSupport=TRUE|P:ZeroMargins= 1", "QXImpFdGaps=10 10 ;"},
      // Template and delivery: a legacy template decides alone, even one
      // that names no file.
      {CUSTOM FULL_DELIVERY "P:Template=ImposeTemplate.2", "QXImposeTemplate=>2up-perfect.dbt;"},
      {CUSTOM FULL_DELIVERY "P:Template=Template.2", "QXImposeTemplate=;"},
      {CUSTOM FULL_DELIVERY "P:Template=",
       "QXDeliverySeq=1;QXDeliverySur=FACEUP;QXImposeTemplate=~.dbt;"},
      {CUSTOM "D:OutputSequence=FORWARD", "QXDeliverySeq=-1;QXImposeTemplate=~.dbt;"},
      {CUSTOM "D:OutputSequence=default", "QXDeliverySeq=0;QXImposeTemplate=~.dbt;"},
      {CUSTOM "D:NestedSaddleOutputSequence=REVERSE|D:SurfaceOrder=faceup",
       "QXDeliveryNSSeq=REVERSE;QXDeliverySur=faceup;QXImposeTemplate=~.dbt;"},
      {"P:ImpInfoFile=|" FULL_DELIVERY, ""},
      // Legacy templates: the first row whose text the identifier holds.
      {LEGACY "imposetemplate.2", "QXImposeTemplate=>2up-perfect.dbt;"},
      {LEGACY "IMPOSETEMPLATE.2", "QXImposeTemplate=;"},
      {LEGACY "Imposetemplate.2", "QXImposeTemplate=;"},
      {LEGACY "ImposeTemplate.41", "QXImposeTemplate=>3up-trifold_brochure26.dbt;"},
      {LEGACY "ImposeTemplate.4", "QXImposeTemplate=>3up-trifold_brochure.dbt;"},
      {LEGACY "imposetemplate.51", "QXImposeTemplate=>4up-gate_fold26.dbt;"},
      {LEGACY "imposetemplate.61", "QXImposeTemplate=>4up-head_to_head26.dbt;"},
      {LEGACY "ImposeTemplate.6", "QXImposeTemplate=>4up-head_to_head.dbt;"},
      {LEGACY "ImposeTemplate.71", "QXImposeTemplate=>4up-z_fold26.dbt;"},
      {LEGACY "ImposeTemplate.12", "QXImposeTemplate=>1up-full_bleed.dbt;"},
      {LEGACY "OldImposeTemplate.3.tpl", "QXImposeTemplate=>2up-saddle.dbt;"},
      {LEGACY "imposetemplate.5", "QXImposeTemplate=>4up-gate_fold.dbt;"},
      {LEGACY "ImposeTemplate.7", "QXImposeTemplate=>4up-z_fold.dbt;"},
      {LEGACY "ImposeTemplate.8", "QXImposeTemplate=;"},
      {LEGACY "ImposeTemplate.0", "QXImposeTemplate=;"},
      // Custom templates: named after the folder two levels above the work
      // folder, not after the hot folder.
      {WORK "D:\\Jobs\\Brochures\\Work\\Spool", "QXImposeTemplate=~Brochures.dbt;"},
      {WORK "D:\\Jobs\\Brochures\\Work\\Spool\\", "QXImposeTemplate=~Work.dbt;"},
      {WORK "D:\\Jobs\\Flyers.v2\\Work\\Spool", "QXImposeTemplate=~Flyers.dbt;"},
      {WORK "D:/Jobs/Brochures/Work/Spool", "QXImposeTemplate=~Brochures.dbt;"},
      {WORK "D:\\Work\\Spool", "QXImposeTemplate=~.dbt;"},
      {WORK "Spool", "QXImposeTemplate=~.dbt;"},
      {WORK, "QXImposeTemplate=~.dbt;"},
      {CUSTOM "F:HFFolderPath=D:\\Jobs\\Brochures", "QXImposeTemplate=~.dbt;"},
  };
  for (const auto& [settings, changed] : cases) EXPECT_EQ(Convert(settings), changed) << settings;
}

// The converter adds entries; one already in the record stays.
TEST_F(ImposeTest, PresentEntriesStay) {
  EXPECT_EQ(Convert("P:PageSize=A4", {{"PageSize", {"PageSize", "Letter"}}}), "PageSize=Letter;");
}

TEST_F(ImposeTest, RegistryKeyChoosesTheX86Directory) {
  const std::pair<const char*, bool> cases[] = {
      // System registry sections; null for no system.reg at all.
      {nullptr, false},
      {"", false},
      {"[Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app\\\\3.0] 1700000000\n", true},
      {"[SOFTWARE\\\\WOW6432NODE\\\\tessaly systems\\\\corvane_app\\\\3.0] 1700000000\n", true},
      {"[Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app] 1700000000\n", false},
      {"[Software\\\\Tessaly Systems\\\\Corvane_app\\\\3.0] 1700000000\n", false},
  };
  for (const auto& [sections, x86] : cases) {
    TempPrefix prefix;
    if (sections) {
      prefix.WriteFile(prefix.root() / "system.reg",
                       std::string("WINE REGISTRY Version 2\n\n") + sections);
    }
    EXPECT_EQ(HasWow6432ProductKey(), x86) << (sections ? sections : "no system.reg");
    const std::string& dir = x86 ? kDirX86 : kDir;
    CHFMigrator engine;
    EXPECT_EQ(engine.MapLegacyTemplate("ImposeTemplate.2").ToStdString(), dir + "2up-perfect.dbt");
    EXPECT_EQ(engine.MakeCustomTemplatePath().ToStdString(), dir + "customTemplateHF2.x-.dbt");
  }
}

}  // namespace
