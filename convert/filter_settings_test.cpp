#include "convert/filter_settings.h"

#include <gtest/gtest.h>
#include <locale.h>
#include <stdio.h>
#include <stdlib.h>

#include <string>
#include <utility>
#include <vector>

#include "app/migrator.h"
#include "store/store_reader.h"
#include "tests/temp_prefix.h"

namespace {

using Entries = std::vector<std::pair<std::string, std::string>>;
using MapPtr = SettingsMap CHFMigrator::*;

Entries EntriesOf(const SettingsMap& map) {
  Entries out;
  for (const auto& [key, value] : map) out.emplace_back(key.utf8_string(), value.utf8_string());
  return out;
}

void Fill(SettingsMap& map, const Entries& entries) {
  for (const auto& [key, value] : entries) map.GetOrInsert(key) = value;
}

// A migrator whose server directory is already known, so that "ERRORPATH"
// does not depend on which processes happen to run on the machine.
struct Migrator : CHFMigrator {
  Migrator() { m_ServerDirectory = wxString("C:\\Server"); }
};

// clang-format off
const Entries kDcs = {{"OUTPUTFILETYPEPDF", "0"}, {"OUTPUTFILETYPEPS", "1"},
                      {"SELECTEDDISTILLERPROFILE", ""}, {"COMBINEALLFILES", "0"}};

Entries LayoutFixed(const char* pdf, const char* ps, bool tiff) {
  Entries fixed = {{"OUTPUTFILETYPEPDF", pdf}, {"OUTPUTFILETYPEPS", ps}};
  if (tiff) fixed.push_back({"OUTPUTFILETYPETIFF", "0"});
  Entries rest = {{"SELECTEDDISTILLERPROFILE", ""}, {"COMBINEALLFILES", "0"}, {"SCALETOPRINT", "0"},
                  {"FORCEAUTOSCALE", "0"}, {"ORIENTATIONPOTRAIT", "1"}, {"ORIENTATIONLANDSCAPE", "0"},
                  {"ORIGINALWIDTHUNIT", "inch"}, {"ORIGINALHEIGHTUNIT", "inch"}, {"CUSTOMPAGETUNIT", "0"}};
  fixed.insert(fixed.end(), rest.begin(), rest.end());
  return fixed;
}

struct Step {
  const char* name;
  MapPtr legacy;
  MapPtr converted;
  Entries fixed;  // what a legacy map holding only an unknown key gives
};

const Step kSteps[] = {
    {"EPS", &CHFMigrator::m_Eps2PsFilter, &CHFMigrator::m_Eps2PsFilterConv, LayoutFixed("0", "1", false)},
    {"JPEG", &CHFMigrator::m_Jpeg2Pdf, &CHFMigrator::m_Jpeg2PdfConv, LayoutFixed("1", "0", false)},
    {"TIFF", &CHFMigrator::m_Tiff2Pdf, &CHFMigrator::m_Tiff2PdfConv, LayoutFixed("1", "0", true)},
    {"TIFFIT", &CHFMigrator::m_TiffItFilter, &CHFMigrator::m_TiffItFilterConv, kDcs},
    {"ONEBITTIFF", &CHFMigrator::m_OneBitTiff, &CHFMigrator::m_OneBitTiffConv,
     {{"SELECTEDDISTILLERPROFILE", ""}, {"COMBINEALLFILES", "0"}, {"NOOFFILES", "4"}}},
    {"CTLW", &CHFMigrator::m_CtlwFilter, &CHFMigrator::m_CtlwFilterConv,
     {{"OUTPUTFILETYPEPDF", "0"}, {"OUTPUTFILETYPEPS", "1"}, {"SELECTEDDISTILLERPROFILE", ""}}},
    {"EXPORTPS", &CHFMigrator::m_ExportPs, &CHFMigrator::m_ExportPsConv, {{"SELECTEDDISTILLERPROFILE", ""}}},
    {"PDF2GO", &CHFMigrator::m_Pdf2Go, &CHFMigrator::m_Pdf2GoConv, {{"SELECTEDDISTILLERPROFILE", ""}}},
    {"PEX", &CHFMigrator::m_PexFilter, &CHFMigrator::m_PexFilterConv,
     {{"FORCEPDFX", "0"}, {"OUTPUTFILETYPEPDF", "0"}, {"OUTPUTFILETYPEPS", "1"},
      {"SELECTEDDISTILLERPROFILE", ""}, {"COMBINEALLFILES", "0"}, {"ERRORPATH", "C:\\Server"}}},
};
enum { kEps, kJpeg, kTiff, kTiffIt, kOneBit, kCtlw, kExportPs, kPdf2Go, kPex };

Entries MsOffice(const char* printer) {
  return {{"COLOR", "Color"}, {"PRINTSHADOWS", "205"}, {"FRAMESLIDES", "0"}, {"PRINTOUTPUTTYPE", "Slides"},
          {"PRINTER", printer}, {"OUTPUTFILE", "PS"}, {"SCALETOFITPAGE", "0"}};
}
// clang-format on

// Converts `legacy` in step `step` of a fresh engine; the converted map's
// entries, fixed keys included.
Entries Convert(int step, const Entries& legacy) {
  Migrator m;
  Fill(m.*kSteps[step].legacy, legacy);
  ConvertFilterMaps(m);
  return EntriesOf(m.*kSteps[step].converted);
}

Entries Concat(Entries a, const Entries& b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

TEST(FilterSettings, UnknownKeyGivesExactlyTheFixedKeysAndEmptyMapGivesNothing) {
  for (int i = 0; i <= kPex; ++i) {
    SCOPED_TRACE(kSteps[i].name);
    EXPECT_EQ(Convert(i, {{"UNKNOWN", "1"}}), kSteps[i].fixed);
    EXPECT_EQ(Convert(i, {}), Entries());
  }
  Migrator m;
  ConvertFilterMaps(m);
  EXPECT_FALSE(m.m_FilterEnable.Contains("PEXFILTER"));  // read only when converting
  EXPECT_EQ(EntriesOf(m.m_MsOffice), MsOffice("Adobe PDF"));
  EXPECT_EQ(EntriesOf(m.m_Dcs2FilterConv), kDcs);
  EXPECT_FALSE(m.m_FilterSettings.Contains("PRINTERNAME"));

  Migrator named;
  named.m_FilterSettings.GetOrInsert("PRINTERNAME") = "Plotter 7";
  ConvertFilterMaps(named);
  EXPECT_EQ(EntriesOf(named.m_MsOffice), MsOffice("Plotter 7"));
}

struct RowCase {
  std::vector<int> steps;
  Entries legacy;
  Entries written;  // before the step's fixed keys
};

const std::vector<int> kLayout = {kEps, kJpeg, kTiff};
const std::vector<int> kResolutionValue = {kCtlw, kExportPs, kPdf2Go};

// clang-format off
const RowCase kRowCases[] = {
    // Given against table order, the converted keys still come out in it.
    {kLayout, {{"EXPANDIMAGES", "0"}, {"SHRINKIMAGES", "1"}, {"PAGESIZE_NAME", "Letter"},
               {"AUTOROTATE", "1"}, {"PAGESIZE_COMMAND", "a4"}, {"IMAGEABLEAREA_LLY", "4"},
               {"IMAGEABLEAREA_LLX", "3"}, {"IMAGEABLEAREA_URY", "2"}, {"IMAGEABLEAREA_URX", "1"},
               {"PAGESIZEY", "792"}, {"PAGESIZEX", "612"}, {"CONSTRAINPROPORTIONS", "1"}},
              {{"CONTRAINPROPORTION", "1"}, {"FORCEPAGESIZEX", "612"}, {"FORCEPAGESIZEY", "792"},
               {"IMAGEEABLESIZEURX", "1"}, {"IMAGEEABLESIZEURY", "2"}, {"IMAGEEABLESIZELLX", "3"},
               {"IMAGEEABLESIZELLY", "4"}, {"PAGESIZE_COMMAND", "a4"}, {"AUTOROTATE", "1"},
               {"DEFAULTPAGESIZE", "Letter"}, {"SHRINKTOFIT", "1"}, {"FITTOPAGE", "0"}}},
    {kLayout, {{"FORCESOURCESIZE", "1"}, {"FORCESOURCESIZEX", "1"}, {"FORCESOURCESIZEY", "0"}},
              {{"CUSTOMSIZE", "1"}, {"ORIGINALSIZE", "0"}, {"ORIGINALWIDTHOPTION", "1"},
               {"ORIGINALHEIGHTOPTION", "0"}}},
    {kLayout, {{"FORCESOURCESIZE", "true"}}, {{"CUSTOMSIZE", "0"}, {"ORIGINALSIZE", "1"}}},
    {kLayout, {{"SOURCESIZEX", "612"}, {"SOURCESIZEY", " 842"}},
              {{"ORIGINALWIDTH", "8.500000"}, {"ORIGINALHEIGHT", "11.694444"}}},
    {kLayout, {{"SOURCESIZEX", "595.3"}, {"SOURCESIZEY", "792"}},
              {{"ORIGINALWIDTH", "8.268056"}, {"ORIGINALHEIGHT", "11.000000"}}},
    {kLayout, {{"SOURCESIZEX", "612pt"}, {"SOURCESIZEY", "abc"}}, {{"ORIGINALWIDTH", "8.500000"}}},
    {kLayout, {{"SOURCESIZEX", "inf"}, {"SOURCESIZEY", "nan"}}, {}},
    {{kEps}, {{"FORCE_RESOLUTION", "1"}, {"RESOLUTION", "300"}}, {}},
    {{kJpeg, kTiff}, {{"RESOLUTION", "300"}, {"FORCE_RESOLUTION", "1"}},
                     {{"FORCERESOLUTION", "1"}, {"RESOLUTION", "300"}}},
    {kLayout, {{"IMAGEPOSITION", "0"}}, {{"IMAGEPOSITION", "Bottom left"}}},
    {kLayout, {{"IMAGEPOSITION", "1"}}, {{"IMAGEPOSITION", "Top left"}}},
    {kLayout, {{"IMAGEPOSITION", "2"}}, {{"IMAGEPOSITION", "Top right"}}},
    {kLayout, {{"IMAGEPOSITION", "3"}}, {{"IMAGEPOSITION", "Bottom right"}}},
    {kLayout, {{"IMAGEPOSITION", "4"}}, {{"IMAGEPOSITION", "Center"}}},
    {kLayout, {{"IMAGEPOSITION", "5"}}, {}},
    {kLayout, {{"IMAGEPOSITION", "Center"}}, {}},
    {kLayout, {{"CUSTOMPAGESIZE", "1"}}, {{"CUSTOMPAGEWIDTH", "0"}, {"CUSTOMPAGEHEIGHT", "0"}}},
    {kLayout, {{"CUSTOMPAGESIZE", "0"}}, {{"CUSTOMPAGEWIDTH", "0"}, {"CUSTOMPAGEHEIGHT", "0"}}},
    {{kTiffIt, kPex}, {{"RESOLUTION", "300"}}, {{"RESOLUTIONDPI", "300"}}},
    {{kTiffIt}, {{"ANTIALIASING", "0"}, {"COMPRESSION", " 0"}},
                {{"NEARESTNEIGHBOR", "1"}, {"BILINEAR", "0"},
                 {"COMPRESSIONNONE", "0"}, {"COMPRESSIONRLE", "1"}}},
    {{kTiffIt}, {{"ANTIALIASING", "1"}, {"COMPRESSION", "0"}},
                {{"NEARESTNEIGHBOR", "0"}, {"BILINEAR", "1"},
                 {"COMPRESSIONNONE", "1"}, {"COMPRESSIONRLE", "0"}}},
    {{kOneBit}, {{"CURFILENAMEPATTERN", "a*"}}, {{"FILENAMESTRUCTURE", "a*"}}},
    {{kOneBit}, {{"FILENAMEPATTERN", "b*"}, {"EXTRACTFILESPACEFROMHEADER", "1"}},
                {{"FILENAMESTRUCTURE", "b*"}, {"EXTRACTINFO", "1"}}},
    {{kOneBit}, {{"ANALYZELEFTTORIGHT", "0"}, {"PSORPDF", "1"}},
                {{"RIGHTTOLEFT", "0"}, {"LEFTTORIGHT", "1"},
                 {"OUTPUTFILETYPEPDF", "1"}, {"OUTPUTFILETYPEPS", "0"}}},
    {{kOneBit}, {{"ANALYZELEFTTORIGHT", "1"}, {"PSORPDF", "0"}},
                {{"RIGHTTOLEFT", "1"}, {"LEFTTORIGHT", "0"},
                 {"OUTPUTFILETYPEPDF", "0"}, {"OUTPUTFILETYPEPS", "1"}}},
    {kResolutionValue, {{"RESOLUTION", "300"}}, {{"RESOLUTIONVALUE", "300"}}},
    {{kTiffIt}, {{"AUTORESOLUTION", "1"}}, {{"RESOLUTIONDPI", "Auto"}}},
    {kResolutionValue, {{"AUTORESOLUTION", "1"}}, {{"RESOLUTIONVALUE", "Auto"}}},
    {{kTiffIt, kCtlw, kExportPs, kPdf2Go}, {{"AUTORESOLUTION", "0"}}, {}},
    {{kExportPs, kPdf2Go}, {{"OUTPUTTYPE", "0"}}, {{"OUTPUTFILETYPEPDF", "0"}, {"OUTPUTFILETYPEPS", "1"}}},
    {{kExportPs, kPdf2Go}, {{"OUTPUTTYPE", "2"}}, {{"OUTPUTFILETYPEPDF", "1"}, {"OUTPUTFILETYPEPS", "0"}}},
    {{kPex}, {{"SPECIFICATION", "0"}, {"SAVEERRORLOG", "1"}},
             {{"FORCEERRORREPORT", "1"}, {"FORCEPDFX1", "1"}, {"FORCEPDFX3", "0"}}},
    {{kPex}, {{"SPECIFICATION", "1"}}, {{"FORCEPDFX1", "0"}, {"FORCEPDFX3", "1"}}},
    // Two legacy keys writing one new key: the later row wins in either order.
    {{kOneBit}, {{"FILENAMEPATTERN", "b*"}, {"CURFILENAMEPATTERN", "a*"}}, {{"FILENAMESTRUCTURE", "b*"}}},
    {{kTiffIt}, {{"AUTORESOLUTION", "1"}, {"RESOLUTION", "300"}}, {{"RESOLUTIONDPI", "Auto"}}},
    {kResolutionValue, {{"AUTORESOLUTION", "1"}, {"RESOLUTION", "300"}}, {{"RESOLUTIONVALUE", "Auto"}}},
    {kResolutionValue, {{"AUTORESOLUTION", "0"}, {"RESOLUTION", "300"}}, {{"RESOLUTIONVALUE", "300"}}},
};
// clang-format on

TEST(FilterSettings, EveryRowOfEveryStep) {
  for (const RowCase& c : kRowCases) {
    for (int step : c.steps) {
      SCOPED_TRACE(std::string(kSteps[step].name) + " " + c.legacy[0].first + "=" +
                   c.legacy[0].second);
      EXPECT_EQ(Convert(step, c.legacy), Concat(c.written, kSteps[step].fixed));
    }
  }
  // A value its rule cannot use leaves what the converted map already held.
  const Entries held = {{"IMAGEPOSITION", "Top left"}, {"ORIGINALWIDTH", "1.000000"}};
  Migrator m;
  Fill(m.m_Eps2PsFilterConv, held);
  Fill(m.m_Eps2PsFilter, {{"IMAGEPOSITION", "5"}, {"SOURCESIZEX", "abc"}});
  ConvertFilterMaps(m);
  EXPECT_EQ(EntriesOf(m.m_Eps2PsFilterConv), Concat(held, kSteps[kEps].fixed));
}

TEST(FilterSettings, ForcePdfxFollowsThePexFilterEnableText) {
  const std::pair<const char*, const char*> cases[] = {
      {"1", "1"}, {"0", "0"}, {"", "0"}, {" 1", "0"}};
  for (const auto& [enable, forced] : cases) {
    Migrator m;
    m.m_FilterEnable.GetOrInsert("PEXFILTER") = enable;
    m.m_PexFilter.GetOrInsert("RESOLUTION") = "300";
    ConvertFilterMaps(m);
    EXPECT_EQ(*m.m_PexFilterConv.Find("FORCEPDFX"), forced) << "enable text '" << enable << "'";
  }
}

// Whether LC_NUMERIC could be switched to a locale with a decimal comma,
// compiling one into a temporary LOCPATH when the machine has none installed.
bool UseCommaLocale(const TempPrefix& scratch) {
  if (setlocale(LC_NUMERIC, "de_DE.UTF-8")) return true;
  std::string dir = scratch.root().string();
  std::string command = "localedef -i de_DE -f UTF-8 " + dir + "/de_DE.UTF-8 >/dev/null 2>&1";
  if (system(command.c_str()) != 0) return false;
  setenv("LOCPATH", dir.c_str(), 1);
  bool switched = setlocale(LC_NUMERIC, "de_DE.UTF-8") != nullptr;
  unsetenv("LOCPATH");
  return switched;
}

TEST(FilterSettings, SizesIgnoreTheHostDecimalComma) {
  TempPrefix scratch;
  if (!UseCommaLocale(scratch)) GTEST_SKIP() << "no locale with a decimal comma";
  char probe[16];
  snprintf(probe, sizeof(probe), "%.1f", 8.5);
  EXPECT_STREQ(probe, "8,5");  // the locale really is in force
  Entries converted = Convert(kEps, {{"SOURCESIZEX", "595.3"}, {"SOURCESIZEY", "8,5"}});
  setlocale(LC_NUMERIC, "C");
  EXPECT_EQ(converted[0], (std::pair<std::string, std::string>("ORIGINALWIDTH", "8.268056")));
  EXPECT_EQ(converted[1], (std::pair<std::string, std::string>("ORIGINALHEIGHT", "0.111111")));
}

// Every legacy filter but EPS present with a key of no row.
Migrator ConvertedWithSwitch(const char* pdf_conversion) {
  Migrator m;
  for (const Step& step : kSteps) (m.*step.legacy).GetOrInsert("UNKNOWN") = "1";
  m.m_Eps2PsFilter.Clear();
  if (pdf_conversion) m.m_FilterSettings.GetOrInsert("PDFCONVERSION") = pdf_conversion;
  ConvertFilterMaps(m);
  return m;
}

TEST(FilterSettings, PdfConversionSwitchesExactlyFiveMaps) {
  const MapPtr switched[] = {&CHFMigrator::m_CtlwFilterConv, &CHFMigrator::m_Eps2PsFilterConv,
                             &CHFMigrator::m_Jpeg2PdfConv, &CHFMigrator::m_Tiff2PdfConv,
                             &CHFMigrator::m_MsOffice};
  const MapPtr kept[] = {&CHFMigrator::m_TiffItFilterConv, &CHFMigrator::m_OneBitTiffConv,
                         &CHFMigrator::m_ExportPsConv,     &CHFMigrator::m_Pdf2GoConv,
                         &CHFMigrator::m_PexFilterConv,    &CHFMigrator::m_Dcs2FilterConv};
  const Migrator plain = ConvertedWithSwitch(nullptr);
  EXPECT_FALSE(plain.m_FilterSettings.Contains("PDFCONVERSION"));
  const char* values[] = {"1", "0", "true", " 1"};
  for (const char* value : values) {
    SCOPED_TRACE(value);
    const Migrator after = ConvertedWithSwitch(value);
    for (MapPtr map : kept) EXPECT_EQ(EntriesOf(after.*map), EntriesOf(plain.*map));
    for (MapPtr map : switched) {
      SettingsMap expected = plain.*map;
      if (std::string(value) == "1") {
        expected.GetOrInsert("OUTPUTFILETYPEPDF") = "1";
        expected.GetOrInsert("OUTPUTFILETYPEPS") = "0";
      }
      EXPECT_EQ(EntriesOf(after.*map), EntriesOf(expected));
    }
  }
}

// ConvertFilterSettings ends by registering the folder; its answer is the
// registration's, which the store can confirm.
TEST(FilterSettings, ConvertFilterSettingsAnswersWhatRegistrationDid) {
  TempPrefix prefix;
  std::filesystem::create_directories(prefix.Drive('d') / "Jobs/Brochures/[_KYR_HotFolder_]");
  Migrator m;
  m.m_FolderSettings.GetOrInsert("HFFolderPath") = "D:\\Jobs\\Brochures";
  m.m_Jpeg2Pdf.GetOrInsert("RESOLUTION") = "300";
  bool registered = m.ConvertFilterSettings();
  EXPECT_EQ(*m.m_Jpeg2PdfConv.Find("RESOLUTION"), "300");
  EXPECT_EQ(*m.m_MsOffice.Find("PRINTER"), "Adobe PDF");
  std::vector<StoredHotFolder> stored;
  wxString error;
  bool found = ReadStore(StoreHostPath(), &stored, &error) && !stored.empty() &&
               stored[0].setting.FolderPath == "D:\\Jobs\\Brochures";
  EXPECT_EQ(registered, found);
}

}  // namespace
