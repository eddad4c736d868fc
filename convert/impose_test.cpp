#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <vector>

#include "app/migrator.h"
#include "convert/templates.h"
#include "tests/temp_prefix.h"

namespace {

const std::string kDir =
    "C:\\Program Files\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template\\";
const std::string kDirX86 =
    "C:\\Program Files (x86)\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template\\";

// Legacy settings written as "I:key=value|P:key=value": I the ImposeInfo map,
// P ImpositionProperties, D ImposeDeliveryInfo, F FolderSettings.
void Load(CHFMigrator& engine, const std::string& settings) {
  std::size_t start = 0;
  while (start < settings.size()) {
    std::size_t end = settings.find('|', start);
    if (end == std::string::npos) end = settings.size();
    std::string item = settings.substr(start, end - start);
    std::size_t eq = item.find('=');
    SettingsMap* map = item[0] == 'I'   ? &engine.m_ImposeInfo
                       : item[0] == 'P' ? &engine.m_ImpositionProperties
                       : item[0] == 'D' ? &engine.m_ImposeDeliveryInfo
                                        : &engine.m_FolderSettings;
    map->GetOrInsert(item.substr(2, eq - 2)) = item.substr(eq + 1);
    start = end + 1;
  }
}

db::ImposeConfiguration Convert(const std::string& settings) {
  CHFMigrator engine;
  Load(engine, settings);
  db::ImposeConfiguration out;
  engine.ConvertImposeSettings(out);
  return out;
}

std::vector<std::string> Entries(const db::ImposeConfiguration& out) {
  std::vector<std::string> entries;
  for (const auto& [key, entry] : out) {
    EXPECT_EQ(entry.Name, key);
    entries.push_back(key.ToStdString() + "=" + entry.Value.ToStdString());
  }
  return entries;
}

// Every test runs in a prefix of its own, so the registry probe never sees
// the developer's own Wine installation.
class ImposeTest : public ::testing::Test {
 protected:
  TempPrefix prefix_;
};

TEST_F(ImposeTest, UnreadPropertiesGiveTheSixFixedEntries) {
  CHFMigrator engine;
  Load(engine, "P:ImpInfoFileVDP=vdp.imp");
  db::ImposeConfiguration out;
  engine.ConvertImposeSettings(out);
  EXPECT_EQ(Entries(out), (std::vector<std::string>{"QXImpFdGaps=5 5 ", "QXImpFdValues=1",
                                                    "QXImpLayout= ", "QXImpMarks=0 0 0 0 0",
                                                    "QXImpSpineFold=0", "QXImpThickness=0"}));
  // Reading inserts nothing into the legacy maps.
  EXPECT_EQ(engine.m_ImposeInfo.Size() + engine.m_ImposeDeliveryInfo.Size(), 0u);
  EXPECT_EQ(engine.m_ImpositionProperties.Size(), 1u);
}

TEST_F(ImposeTest, KeywordsInCodeUnitOrderAndPresentEntriesKept) {
  CHFMigrator engine;
  Load(engine,
       "I:Binding=1|I:GroupsOf=1|I:Edge=1|I:AutoScale=1|I:ScaleFactor=1|I:Orientation=1|"
       "I:HorizontalBleed=1|I:Creep=1|I:CreepDirection=1|I:Watermarks=1|I:GangupStyle=1|"
       "I:FrontCover=1|I:BackCover=1|P:FixedDuplexValue=1|P:CustomPageSize=1|P:PageSize=A4|"
       "P:PageRegion=1|P:ZeroMarginsSupport=TRUE|P:ZeroMargins=1|P:ImpInfoFile=1|"
       "D:OutputSequence=1|D:SurfaceOrder=1|D:NestedSaddleOutputSequence=1");
  db::ImposeConfiguration out;
  out.insert({"PageSize", {"PageSize", "Letter"}});
  engine.ConvertImposeSettings(out);
  std::vector<std::string> keys;
  for (const auto& entry : out) keys.push_back(entry.first.ToStdString());
  EXPECT_EQ(keys, (std::vector<std::string>{
                      "CustomPageSize",  "PageRegion",      "PageSize",        "QXBackCover",
                      "QXDeliveryNSSeq", "QXDeliverySeq",   "QXDeliverySur",   "QXDuplex",
                      "QXFrontCover",    "QXGangupStyle",   "QXImpAutoPScal",  "QXImpBindEdge",
                      "QXImpBinding",    "QXImpBleed",      "QXImpCreepDir",   "QXImpCreeps",
                      "QXImpFdBleed",    "QXImpFdCreeps",   "QXImpFdGaps",     "QXImpFdPgScale",
                      "QXImpFdValues",   "QXImpLayout",     "QXImpMarks",      "QXImpOrient",
                      "QXImpPPGrp",      "QXImpPageScale",  "QXImpSpineFold",  "QXImpThickness",
                      "QXImpWatermark",  "QXImpZeroMargin", "QXImposeTemplate"}));
  EXPECT_EQ(out["PageSize"].Value, "Letter");
}

#define GAPS "I:HorizontalGap0=0.25|I:HorizontalGap1=.5|I:HorizontalGap9=9th|I:VerticalGap0=1|"
#define CUSTOM "F:WorkFolder=D:\\Jobs\\Brochures\\Work\\Spool|P:ImpInfoFile=a.imp|"
#define FULL_DELIVERY "D:OutputSequence=REVERSE|D:SurfaceOrder=FACEUP|"

// One entry per case; a null `want` means no entry, a leading '>' stands
// for the template directory.
TEST_F(ImposeTest, EntriesFromLegacyValues) {
  struct Case {
    const char* settings;
    const char* keyword;
    const char* want;
  } cases[] = {
      {"I:Binding=perfect", "QXImpBinding", "2"},
      {"I:Binding=SADDLE", "QXImpBinding", "0"},
      {"I:Binding=gangupcollatemulti", "QXImpBinding", "11"},
      {"I:Binding=PERFECT ", "QXImpBinding", "0"},
      {"I:Edge=right", "QXImpBindEdge", "1"},
      {"I:Edge=", "QXImpBindEdge", "-1"},
      {"I:AutoScale=no", "QXImpAutoPScal", "2"},
      {"I:AutoScale=1", "QXImpAutoPScal", "0"},
      {"I:Orientation=landscape", "QXImpOrient", "2"},
      {"I:Orientation=POTRAIT", "QXImpOrient", "-1"},
      {"I:Watermarks=Yes", "QXImpWatermark", "1"},
      {"I:GangupStyle=reversal_alternate", "QXGangupStyle", "1004"},
      {"I:GangupStyle=", "QXGangupStyle", "0"},
      {"I:GroupsOf= 4 ", "QXImpPPGrp", " 4 "},
      {"P:PageRegion=", "PageRegion", ""},
      // Marks: the field is there whatever the value.
      {"I:ShowCropMarks=YES|I:ShowFoldLines=yes|I:ShowJobName=Yes|I:ShowSheetInfo=yES|"
       "I:ShowDateAndTime=YES",
       "QXImpMarks", "1 1 1 1 1"},
      {"I:ShowCropMarks=no|I:ShowFoldLines=NO|I:ShowJobName=No|I:ShowSheetInfo=nO|"
       "I:ShowDateAndTime=no",
       "QXImpMarks", "2 2 2 2 2"},
      {"I:ShowCropMarks=YES|I:ShowFoldLines=NO|I:ShowJobName=maybe|I:ShowSheetInfo=", "QXImpMarks",
       "1 2 0 0 0"},
      // Layout and gaps: limits are signed; ten gaps only with zero margins.
      {GAPS "I:x=2|I:y=1", "QXImpLayout", "2 1"},
      {GAPS "I:x=2|I:y=1", "QXImpFdGaps", "5 0.25 .5 5 1 "},
      {GAPS "I:x=11|I:y=1", "QXImpFdGaps", nullptr},
      {GAPS "I:x=2|I:y=12", "QXImpFdGaps", nullptr},
      {GAPS "I:x=99999999999", "QXImpFdGaps", nullptr},
      {GAPS "I:x=-3|I:y=10mm", "QXImpFdGaps", "5 0.25 .5 5 1 "},
      {GAPS "I:x=-3", "QXImpLayout", "-3 "},
      {GAPS "P:ZeroMarginsSupport=true", "QXImpFdGaps", "10 0.25 .5 9th 10 1 "},
      {GAPS "P:ZeroMarginsSupport=FALSE", "QXImpFdGaps", "5 0.25 .5 5 1 "},
      // Fixed point: truncated toward zero; NaN and overflow explicit.
      {"I:ScaleFactor=1", "QXImpFdPgScale", "65536.000000"},
      {"I:ScaleFactor=1.5mm", "QXImpFdPgScale", "98304.000000"},
      {"I:ScaleFactor=-0.25", "QXImpFdPgScale", "-16384.000000"},
      {"I:ScaleFactor=-0.00001", "QXImpFdPgScale", "0.000000"},
      {"I:ScaleFactor=abc", "QXImpFdPgScale", "0.000000"},
      {"I:ScaleFactor=abc", "QXImpPageScale", "abc"},
      {"I:ScaleFactor=32767.99999", "QXImpFdPgScale", "2147483647.000000"},
      {"I:ScaleFactor=32768", "QXImpFdPgScale", "-2147483648.000000"},
      {"I:ScaleFactor=1e12", "QXImpFdPgScale", "-2147483648.000000"},
      {"I:ScaleFactor=nan", "QXImpFdPgScale", "-2147483648.000000"},
      {"I:ScaleFactor=-inf", "QXImpFdPgScale", "-2147483648.000000"},
      // Bleed and creep.
      {"I:HorizontalBleed=9", "QXImpBleed", "589824.000000 "},
      {"I:HorizontalBleed=9", "QXImpFdBleed", "9 "},
      {"I:HorizontalBleed=1|I:VerticalBleed=0.5", "QXImpBleed", "65536.000000 32768.000000"},
      {"I:HorizontalBleed=1|I:VerticalBleed=0.5", "QXImpFdBleed", "1 0.5"},
      {"I:VerticalBleed=3", "QXImpBleed", nullptr},
      {"I:VerticalBleed=3", "QXImpFdBleed", nullptr},
      {"I:Creep=0.5", "QXImpCreeps", "32768.000000 32768.000000"},
      {"I:Creep=0.5", "QXImpFdCreeps", "0.5 0.5"},
      // Zero margins: only "1", and only with the flag.
      {"P:ZeroMarginsSupport=TRUE|P:ZeroMargins=1", "QXImpZeroMargin", "True"},
      {"P:ZeroMarginsSupport=tRuE|P:ZeroMargins=1", "QXImpZeroMargin", "True"},
      {"P:ZeroMarginsSupport=FALSE|P:ZeroMargins=1", "QXImpZeroMargin", nullptr},
      {"P:ZeroMargins=1", "QXImpZeroMargin", nullptr},
      {"P:ZeroMarginsSupport=TRUE|P:ZeroMargins=0", "QXImpZeroMargin", nullptr},
      {"P:ZeroMarginsSupport=TRUE|P:ZeroMargins= 1", "QXImpZeroMargin", nullptr},
      // Template and delivery: a legacy template decides alone.
      {CUSTOM "P:Template=ImposeTemplate.2", "QXImposeTemplate", ">2up-perfect.dbt"},
      {CUSTOM FULL_DELIVERY "P:Template=ImposeTemplate.2", "QXDeliverySeq", nullptr},
      {CUSTOM FULL_DELIVERY "P:Template=Template.2", "QXImposeTemplate", ""},
      {CUSTOM FULL_DELIVERY "P:Template=Template.2", "QXDeliverySur", nullptr},
      {CUSTOM "P:Template=", "QXImposeTemplate", ">customTemplateHF2.x-Brochures.dbt"},
      {CUSTOM FULL_DELIVERY "P:Template=", "QXDeliverySeq", "1"},
      {CUSTOM "D:OutputSequence=FORWARD", "QXDeliverySeq", "-1"},
      {CUSTOM "D:OutputSequence=default", "QXDeliverySeq", "0"},
      {CUSTOM "D:SurfaceOrder=faceup", "QXDeliverySur", "faceup"},
      {CUSTOM "D:NestedSaddleOutputSequence=REVERSE", "QXDeliveryNSSeq", "REVERSE"},
      {"P:ImpInfoFile=|" FULL_DELIVERY, "QXImposeTemplate", nullptr},
      {"P:ImpInfoFile=|" FULL_DELIVERY, "QXDeliverySeq", nullptr},
  };
  for (const Case& c : cases) {
    db::ImposeConfiguration out = Convert(c.settings);
    auto found = out.find(c.keyword);
    std::optional<std::string> got;
    if (found != out.end()) got = found->second.Value.ToStdString();
    std::optional<std::string> want;
    if (c.want) want = c.want[0] == '>' ? kDir + (c.want + 1) : c.want;
    EXPECT_EQ(got, want) << c.settings << " -> " << c.keyword;
  }
}

TEST_F(ImposeTest, LegacyTemplateTableFirstSubstringMatch) {
  struct Case {
    const char* identifier;
    const char* file;  // empty: no row matches
  } cases[] = {
      {"ImposeTemplate.2", "2up-perfect.dbt"},
      {"imposetemplate.2", "2up-perfect.dbt"},
      {"IMPOSETEMPLATE.2", ""},
      {"Imposetemplate.2", ""},
      {"ImposeTemplate.41", "3up-trifold_brochure26.dbt"},
      {"ImposeTemplate.4", "3up-trifold_brochure.dbt"},
      {"imposetemplate.51", "4up-gate_fold26.dbt"},
      {"imposetemplate.61", "4up-head_to_head26.dbt"},
      {"ImposeTemplate.6", "4up-head_to_head.dbt"},
      {"ImposeTemplate.71", "4up-z_fold26.dbt"},
      {"ImposeTemplate.12", "1up-full_bleed.dbt"},
      {"OldImposeTemplate.3.tpl", "2up-saddle.dbt"},
      {"imposetemplate.5", "4up-gate_fold.dbt"},
      {"ImposeTemplate.7", "4up-z_fold.dbt"},
      {"ImposeTemplate.8", ""},
      {"ImposeTemplate.0", ""},
      {"Template.2", ""},
  };
  CHFMigrator engine;
  for (const Case& c : cases) {
    std::string want = *c.file ? kDir + c.file : "";
    EXPECT_EQ(engine.MapLegacyTemplate(c.identifier).ToStdString(), want) << c.identifier;
  }
}

TEST_F(ImposeTest, CustomTemplateNamedTwoLevelsAboveTheWorkFolder) {
  struct Case {
    const char* settings;
    const char* name;
  } cases[] = {
      {"F:WorkFolder=D:\\Jobs\\Brochures\\Work\\Spool", "Brochures"},
      {"F:WorkFolder=D:\\Jobs\\Brochures\\Work\\Spool\\", "Work"},
      {"F:WorkFolder=D:\\Jobs\\Flyers.v2\\Work\\Spool", "Flyers"},
      {"F:WorkFolder=D:/Jobs/Brochures/Work/Spool", "Brochures"},
      {"F:WorkFolder=D:\\Work\\Spool", ""},
      {"F:WorkFolder=Spool", ""},
      {"F:WorkFolder=", ""},
      {"F:HFFolderPath=D:\\Jobs\\Brochures", ""},
  };
  for (const Case& c : cases) {
    CHFMigrator engine;
    Load(engine, c.settings);
    EXPECT_EQ(engine.MakeCustomTemplatePath().ToStdString(),
              kDir + "customTemplateHF2.x-" + c.name + ".dbt")
        << c.settings;
    EXPECT_EQ(engine.m_FolderSettings.Size(), 1u);  // nothing inserted
  }
}

TEST_F(ImposeTest, RegistryKeyChoosesTheX86Directory) {
  struct Case {
    const char* sections;  // null: no system.reg at all
    bool x86;
  } cases[] = {
      {nullptr, false},
      {"", false},
      {"[Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app\\\\3.0] 1700000000\n", true},
      {"[SOFTWARE\\\\WOW6432NODE\\\\tessaly systems\\\\corvane_app\\\\3.0] 1700000000\n", true},
      {"[Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app] 1700000000\n", false},
      {"[Software\\\\Tessaly Systems\\\\Corvane_app\\\\3.0] 1700000000\n", false},
  };
  for (const Case& c : cases) {
    TempPrefix prefix;
    if (c.sections) {
      prefix.WriteFile(prefix.root() / "system.reg",
                       std::string("WINE REGISTRY Version 2\n\n") + c.sections);
    }
    EXPECT_EQ(HasWow6432ProductKey(), c.x86) << (c.sections ? c.sections : "no system.reg");
    const std::string& dir = c.x86 ? kDirX86 : kDir;
    CHFMigrator engine;
    EXPECT_EQ(engine.MapLegacyTemplate("ImposeTemplate.2").ToStdString(), dir + "2up-perfect.dbt");
    EXPECT_EQ(engine.MakeCustomTemplatePath().ToStdString(), dir + "customTemplateHF2.x-.dbt");
  }
}

}  // namespace
