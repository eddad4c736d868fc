#include "convert/filter_settings.h"

#include <gtest/gtest.h>
#include <locale.h>
#include <stdio.h>
#include <stdlib.h>

#include <map>
#include <sstream>
#include <string>

#include "engine/migrator.h"
#include "tests/cases.h"
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

// The legacy and the converted map of each step, by the step's name.
#define MAPS(legacy) &CHFMigrator::m_##legacy, &CHFMigrator::m_##legacy##Conv
const std::map<std::string, std::pair<MapPtr, MapPtr>> kMaps = {
    {"EPS", {MAPS(Eps2PsFilter)}},    {"JPEG", {MAPS(Jpeg2Pdf)}},     {"TIFF", {MAPS(Tiff2Pdf)}},
    {"TIFFIT", {MAPS(TiffItFilter)}}, {"ONEBIT", {MAPS(OneBitTiff)}}, {"CTLW", {MAPS(CtlwFilter)}},
    {"EXPORTPS", {MAPS(ExportPs)}},   {"PDF2GO", {MAPS(Pdf2Go)}},     {"PEX", {MAPS(PexFilter)}}};

struct Step {
  std::string name;
  MapPtr legacy;
  MapPtr converted;
  std::string fixed;  // what a legacy map holding only an unknown key gives
};

const std::vector<CaseRow> kCases = ReadCases("convert/filter_settings_cases.tsv");

// The steps, in the order of the case file.
std::vector<Step> Steps() {
  std::vector<Step> steps;
  for (const CaseRow& row : kCases) {
    if (row.at(0) != "step") continue;
    const auto& [legacy, converted] = kMaps.at(row.at(1));
    steps.push_back({row[1], legacy, converted, row.at(2)});
  }
  return steps;
}

// Converts `legacy` in step `step` of a fresh engine whose converted map
// already holds `held`; the converted map's entries, fixed keys included.
std::string Convert(const Step& step, const std::string& legacy, const std::string& held) {
  Migrator m;
  Fill(m.*step.legacy, legacy);
  Fill(m.*step.converted, held);
  m.ConvertFilterSettings();
  return Dump(m.*step.converted);
}

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
  const std::vector<Step> steps = Steps();
  ASSERT_EQ(steps.size(), kMaps.size());
  for (const CaseRow& c : kCases) {
    for (const Step& step : steps) {
      if (c.at(0) == "step" || (" " + c[0] + " ").find(" " + step.name + " ") == std::string::npos)
        continue;
      EXPECT_EQ(Convert(step, c.at(1), c.at(3)), c.at(2) + step.fixed) << step.name << " " << c[1];
    }
  }
  setlocale(LC_NUMERIC, "C");
  // Empty maps give nothing, and the switches are read only when converting.
  Migrator empty;
  empty.ConvertFilterSettings();
  for (const Step& step : steps) EXPECT_EQ(Dump(empty.*step.converted), "") << step.name;
  EXPECT_EQ(Dump(empty.m_FilterEnable) + Dump(empty.m_FilterSettings), "");
}

// The PDF switch and the PEX filter's enable text, one of the values of a
// "switch" row in both, each legacy filter but EPS holding a key of no row,
// with the row's FILTERSETTINGS entries: the maps written, shown as the row
// shows them. Reading the settings inserts nothing.
TEST(FilterSettings, PdfSwitchAndForcedPdfx) {
  const std::vector<Step> steps = Steps();
  for (const CaseRow& row : kCases) {
    std::istringstream values(row.at(0) == "switch" ? row.at(1) : "");
    for (std::string value; std::getline(values, value, '|');) {
      Migrator m;
      for (const Step& step : steps) Fill(m.*step.legacy, step.name == "EPS" ? "" : "U=1");
      Fill(m.m_FilterSettings, row.at(2) + (value.empty() ? "" : "PDFCONVERSION=" + value));
      m.m_FilterEnable.GetOrInsert("PEXFILTER") = value;
      const std::string given = Dump(m.m_FilterSettings) + Dump(m.m_FilterEnable);
      m.ConvertFilterSettings();
      std::string maps = Dump(m.m_MsOffice) + "\n" + Dump(m.m_Dcs2FilterConv);
      for (const Step& step : steps) maps += "\n" + Dump(m.*step.converted);
      EXPECT_EQ(Dump(m.m_FilterSettings) + Dump(m.m_FilterEnable), given);
      EXPECT_EQ(maps, row.at(3)) << "'" << value << "'";
    }
  }
}

}  // namespace
