#include "convert/filter_settings.h"

#include <gtest/gtest.h>
#include <locale.h>
#include <stdio.h>
#include <stdlib.h>

#include <sstream>
#include <string>

#include "app/migrator.h"
#include "tests/temp_prefix.h"

namespace {

using MapPtr = SettingsMap CHFMigrator::*;

// A map's entries as "key=value;", in order.
std::string Dump(const SettingsMap& map) {
  std::string out;
  for (const auto& [key, value] : map) out += (key + "=" + value + ";").utf8_string();
  return out;
}

// Fills `map` from "key=value;" entries.
void Fill(SettingsMap& map, const std::string& entries) {
  std::istringstream in(entries);
  for (std::string e; std::getline(in, e, ';');)
    map.GetOrInsert(e.substr(0, e.find('='))) = e.substr(e.find('=') + 1);
}

// A migrator whose server directory is already known, so that "ERRORPATH"
// does not depend on which processes happen to run on the machine.
struct Migrator : CHFMigrator {
  Migrator() { m_ServerDirectory = wxString("C:\\Server"); }
};

// The output type keys, set to PostScript or to PDF.
const std::string kPs = "OUTPUTFILETYPEPDF=0;OUTPUTFILETYPEPS=1;";
const std::string kPdf = "OUTPUTFILETYPEPDF=1;OUTPUTFILETYPEPS=0;";
const std::string kDcs = kPs + "SELECTEDDISTILLERPROFILE=;COMBINEALLFILES=0;";

std::string LayoutFixed(const std::string& type, bool tiff) {
  return type + (tiff ? "OUTPUTFILETYPETIFF=0;" : "") +
         "SELECTEDDISTILLERPROFILE=;COMBINEALLFILES=0;SCALETOPRINT=0;FORCEAUTOSCALE=0;"
         "ORIENTATIONPOTRAIT=1;ORIENTATIONLANDSCAPE=0;ORIGINALWIDTHUNIT=inch;"
         "ORIGINALHEIGHTUNIT=inch;CUSTOMPAGETUNIT=0;";
}

struct Step {
  const char* name;
  MapPtr legacy;
  MapPtr converted;
  bool switched;      // whether "PDFCONVERSION" sets its output type
  std::string fixed;  // what a legacy map holding only an unknown key gives
};

#define MAPS(legacy) &CHFMigrator::m_##legacy, &CHFMigrator::m_##legacy##Conv
const Step kSteps[] = {
    {"EPS", MAPS(Eps2PsFilter), true, LayoutFixed(kPs, false)},
    {"JPEG", MAPS(Jpeg2Pdf), true, LayoutFixed(kPdf, false)},
    {"TIFF", MAPS(Tiff2Pdf), true, LayoutFixed(kPdf, true)},
    {"TIFFIT", MAPS(TiffItFilter), false, kDcs},
    {"ONEBIT", MAPS(OneBitTiff), false, "SELECTEDDISTILLERPROFILE=;COMBINEALLFILES=0;NOOFFILES=4;"},
    {"CTLW", MAPS(CtlwFilter), true, kPs + "SELECTEDDISTILLERPROFILE=;"},
    {"EXPORTPS", MAPS(ExportPs), false, "SELECTEDDISTILLERPROFILE=;"},
    {"PDF2GO", MAPS(Pdf2Go), false, "SELECTEDDISTILLERPROFILE=;"},
    {"PEX", MAPS(PexFilter), false,
     "FORCEPDFX=0;" + kPs + "SELECTEDDISTILLERPROFILE=;COMBINEALLFILES=0;ERRORPATH=C:\\Server;"},
};
// Sets of steps, one bit per row of kSteps.
enum : unsigned { kEps = 1, kJpeg = 2, kTiff = 4, kTiffIt = 8, kOneBit = 16, kCtlw = 32 };
enum : unsigned { kExportPs = 64, kPdf2Go = 128, kPex = 256, kAll = 511 };
const unsigned kLayout = kEps | kJpeg | kTiff, kResolutionValue = kCtlw | kExportPs | kPdf2Go;

std::string MsOffice(const std::string& printer) {
  return "COLOR=Color;PRINTSHADOWS=205;FRAMESLIDES=0;PRINTOUTPUTTYPE=Slides;PRINTER=" + printer +
         ";OUTPUTFILE=PS;SCALETOFITPAGE=0;";
}

// Converts `legacy` in step `step` of a fresh engine whose converted map
// already holds `held`; the converted map's entries, fixed keys included.
std::string Convert(const Step& step, const std::string& legacy, const std::string& held) {
  Migrator m;
  Fill(m.*step.legacy, legacy);
  Fill(m.*step.converted, held);
  ConvertFilterMaps(m);
  return Dump(m.*step.converted);
}

struct RowCase {
  unsigned steps;
  const char* legacy;
  const char* written;  // before the step's fixed keys
  const char* held = "";
};

const RowCase kRowCases[] = {
    // A map holding only keys of no row gives exactly the fixed keys; an empty
    // map gives nothing at all (below).
    {kAll, "UNKNOWN=1", ""},
    // Given against table order, the converted keys still come out in it.
    {kLayout,
     "CUSTOMPAGESIZE=1;IMAGEPOSITION=0;FORCESOURCESIZEY=0;FORCESOURCESIZEX=1;SOURCESIZEY= 842;"
     "SOURCESIZEX=612;FORCESOURCESIZE=1;EXPANDIMAGES=0;SHRINKIMAGES=1;PAGESIZE_NAME=Letter;"
     "AUTOROTATE=1;PAGESIZE_COMMAND=a4;IMAGEABLEAREA_LLY=4;IMAGEABLEAREA_LLX=3;"
     "IMAGEABLEAREA_URY=2;IMAGEABLEAREA_URX=1;PAGESIZEY=792;PAGESIZEX=612;CONSTRAINPROPORTIONS=1",
     "CONTRAINPROPORTION=1;FORCEPAGESIZEX=612;FORCEPAGESIZEY=792;IMAGEEABLESIZEURX=1;"
     "IMAGEEABLESIZEURY=2;IMAGEEABLESIZELLX=3;IMAGEEABLESIZELLY=4;PAGESIZE_COMMAND=a4;"
     "AUTOROTATE=1;DEFAULTPAGESIZE=Letter;SHRINKTOFIT=1;FITTOPAGE=0;CUSTOMSIZE=1;ORIGINALSIZE=0;"
     "ORIGINALWIDTH=8.500000;ORIGINALHEIGHT=11.694444;ORIGINALWIDTHOPTION=1;"
     "ORIGINALHEIGHTOPTION=0;IMAGEPOSITION=Bottom left;CUSTOMPAGEWIDTH=0;CUSTOMPAGEHEIGHT=0;"},
    {kLayout, "FORCESOURCESIZE=true", "CUSTOMSIZE=0;ORIGINALSIZE=1;"},
    {kLayout, "SOURCESIZEX=595.3;SOURCESIZEY=8,5",
     "ORIGINALWIDTH=8.268056;ORIGINALHEIGHT=0.111111;"},
    {kLayout, "SOURCESIZEX=612pt;SOURCESIZEY=abc", "ORIGINALWIDTH=8.500000;"},
    {kLayout, "SOURCESIZEX=inf;SOURCESIZEY=nan", ""},
    {kEps, "FORCE_RESOLUTION=1;RESOLUTION=300", ""},
    {kJpeg | kTiff, "RESOLUTION=300;FORCE_RESOLUTION=1", "FORCERESOLUTION=1;RESOLUTION=300;"},
    {kLayout, "IMAGEPOSITION=1", "IMAGEPOSITION=Top left;"},
    {kLayout, "IMAGEPOSITION=2", "IMAGEPOSITION=Top right;"},
    {kLayout, "IMAGEPOSITION=3", "IMAGEPOSITION=Bottom right;"},
    {kLayout, "IMAGEPOSITION=4", "IMAGEPOSITION=Center;"},
    {kLayout, "IMAGEPOSITION=5", ""},
    {kLayout, "IMAGEPOSITION=Center", ""},
    {kLayout, "CUSTOMPAGESIZE=0", "CUSTOMPAGEWIDTH=0;CUSTOMPAGEHEIGHT=0;"},
    // A value its rule cannot use leaves what the converted map already held.
    {kLayout, "IMAGEPOSITION=5;SOURCESIZEX=abc", "IMAGEPOSITION=Top left;ORIGINALWIDTH=1.000000;",
     "IMAGEPOSITION=Top left;ORIGINALWIDTH=1.000000"},
    {kTiffIt | kPex, "RESOLUTION=300", "RESOLUTIONDPI=300;"},
    {kTiffIt, "ANTIALIASING=0;COMPRESSION= 0",
     "NEARESTNEIGHBOR=1;BILINEAR=0;COMPRESSIONNONE=0;COMPRESSIONRLE=1;"},
    {kTiffIt, "ANTIALIASING=1;COMPRESSION=0",
     "NEARESTNEIGHBOR=0;BILINEAR=1;COMPRESSIONNONE=1;COMPRESSIONRLE=0;"},
    {kOneBit, "CURFILENAMEPATTERN=a*", "FILENAMESTRUCTURE=a*;"},
    {kOneBit, "FILENAMEPATTERN=b*;EXTRACTFILESPACEFROMHEADER=1",
     "FILENAMESTRUCTURE=b*;EXTRACTINFO=1;"},
    {kOneBit, "ANALYZELEFTTORIGHT=0;PSORPDF=1",
     "RIGHTTOLEFT=0;LEFTTORIGHT=1;OUTPUTFILETYPEPDF=1;OUTPUTFILETYPEPS=0;"},
    {kOneBit, "ANALYZELEFTTORIGHT=1;PSORPDF=0",
     "RIGHTTOLEFT=1;LEFTTORIGHT=0;OUTPUTFILETYPEPDF=0;OUTPUTFILETYPEPS=1;"},
    {kExportPs | kPdf2Go, "OUTPUTTYPE=0", "OUTPUTFILETYPEPDF=0;OUTPUTFILETYPEPS=1;"},
    {kExportPs | kPdf2Go, "OUTPUTTYPE=2", "OUTPUTFILETYPEPDF=1;OUTPUTFILETYPEPS=0;"},
    {kPex, "SPECIFICATION=0;SAVEERRORLOG=1", "FORCEERRORREPORT=1;FORCEPDFX1=1;FORCEPDFX3=0;"},
    {kPex, "SPECIFICATION=1", "FORCEPDFX1=0;FORCEPDFX3=1;"},
    // Two legacy keys writing one new key: the later row wins in either order.
    {kOneBit, "FILENAMEPATTERN=b*;CURFILENAMEPATTERN=a*", "FILENAMESTRUCTURE=b*;"},
    {kTiffIt, "AUTORESOLUTION=1;RESOLUTION=300", "RESOLUTIONDPI=Auto;"},
    {kResolutionValue, "AUTORESOLUTION=1;RESOLUTION=300", "RESOLUTIONVALUE=Auto;"},
    {kResolutionValue, "AUTORESOLUTION=0;RESOLUTION=300", "RESOLUTIONVALUE=300;"},
    {kTiffIt, "AUTORESOLUTION=0;RESOLUTION=300", "RESOLUTIONDPI=300;"},
};

// Whether LC_NUMERIC could be switched to a locale with a decimal comma,
// compiling one into a temporary LOCPATH when the machine has none installed.
bool UseCommaLocale() {
  TempPrefix scratch;  // the compiled locale stays mapped once loaded
  if (setlocale(LC_NUMERIC, "de_DE.UTF-8")) return true;
  std::string dir = scratch.root().string();
  if (system(("localedef -i de_DE -f UTF-8 " + dir + "/de_DE.UTF-8 >/dev/null 2>&1").c_str()))
    return false;
  setenv("LOCPATH", dir.c_str(), 1);
  bool switched = setlocale(LC_NUMERIC, "de_DE.UTF-8") != nullptr;
  unsetenv("LOCPATH");
  return switched;
}

// Sizes are read and written the same under a host locale with a decimal
// comma, so the table runs under one where the machine can provide it.
TEST(FilterSettings, EveryRowOfEveryStep) {
  if (!UseCommaLocale()) printf("[   NOTE   ] no decimal comma locale: rows run in C\n");
  for (const RowCase& c : kRowCases) {
    for (int i = 0; i < 9; ++i) {
      if (!(c.steps & (1u << i))) continue;
      EXPECT_EQ(Convert(kSteps[i], c.legacy, c.held), c.written + kSteps[i].fixed)
          << kSteps[i].name << " " << c.legacy;
    }
  }
  setlocale(LC_NUMERIC, "C");
  // Empty maps give nothing, and the switches are read only when converting.
  Migrator empty;
  ConvertFilterMaps(empty);
  for (const Step& step : kSteps) EXPECT_EQ(Dump(empty.*step.converted), "") << step.name;
  EXPECT_EQ(Dump(empty.m_FilterEnable) + Dump(empty.m_FilterSettings), "");
}

// Every legacy filter but EPS holds a key of no row. The PDF switch sets the
// output type of five maps, the empty EPS one included, and the PEX filter's
// enable text forces PDF/X: each only on exactly "1". Reading the settings
// inserts nothing.
TEST(FilterSettings, PdfSwitchAndForcedPdfxOnlyOnOne) {
  for (std::string value : {"", "1", "0", "true", " 1"}) {
    Migrator m;
    for (const Step& step : kSteps) Fill(m.*step.legacy, &step == kSteps ? "" : "U=1");
    if (!value.empty()) Fill(m.m_FilterSettings, "PDFCONVERSION=" + value);
    m.m_FilterEnable.GetOrInsert("PEXFILTER") = value;
    ConvertFilterMaps(m);
    const bool on = value == "1";
    EXPECT_EQ(Dump(m.m_FilterSettings) + Dump(m.m_FilterEnable),
              (value.empty() ? "" : "PDFCONVERSION=" + value + ";") + "PEXFILTER=" + value + ";");
    EXPECT_EQ(Dump(m.m_MsOffice), MsOffice("Adobe PDF") + (on ? kPdf : "")) << value;
    EXPECT_EQ(Dump(m.m_Dcs2FilterConv), kDcs) << value;
    EXPECT_EQ(Dump(m.m_Eps2PsFilterConv), on ? kPdf : "") << value;
    for (const Step& step : kSteps) {
      if (&step == kSteps) continue;
      std::string expected = step.fixed;
      if (on && step.switched && expected.rfind(kPs, 0) == 0) expected.replace(0, kPs.size(), kPdf);
      if (on && step.legacy == &CHFMigrator::m_PexFilter) expected.replace(0, 11, "FORCEPDFX=1");
      EXPECT_EQ(Dump(m.*step.converted), expected) << step.name << " " << value;
    }
  }
  Migrator named;
  Fill(named.m_FilterSettings, "PRINTERNAME=Plotter 7");
  ConvertFilterMaps(named);
  EXPECT_EQ(Dump(named.m_MsOffice), MsOffice("Plotter 7"));
}

}  // namespace
