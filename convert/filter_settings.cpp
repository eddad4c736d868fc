#include "convert/filter_settings.h"

#include <cmath>

#include "app/migrator.h"
#include "convert/ascii_text.h"
#include "convert/numbers.h"
#include "convert/server_lookup.h"

namespace {

// Every write into a converted map is a get-or-insert: a key the map already
// holds (from this folder or an earlier one) keeps its place and takes the
// new value.
void Set(SettingsMap& map, const char* key, const wxString& value) {
  map.GetOrInsert(AsciiText(key)) = value;
}

void Set(SettingsMap& map, const char* key, const char* value) {
  Set(map, key, AsciiText(value));
}

void WriteFlagPair(const ConversionRow& row, const wxString& value, SettingsMap& out) {
  const bool on = value == AsciiText(row.on_value);
  const char* key_value = on ? "1" : "0";
  const char* other_value = on ? "0" : "1";
  if (row.rule == Rule::kFlagPairOtherFirst) {
    Set(out, row.other_key, other_value);
    Set(out, row.key, key_value);
  } else {
    Set(out, row.key, key_value);
    Set(out, row.other_key, other_value);
  }
}

// A size in which no number can be read leaves its key unwritten: writing 0,
// or repeating the size read before, would hand the filter a size the legacy
// folder never had. Infinities and NaN, which strtod reads as numbers too, are
// no size either.
void WritePointsAsInches(const ConversionRow& row, const wxString& value, SettingsMap& out) {
  double points = 0.0;
  if (!ReadDouble(value, &points) || !std::isfinite(points)) return;
  Set(out, row.key, FormatFixed(points / 72.0));
}

void ApplyRule(const ConversionRow& row, const wxString& value, SettingsMap& out) {
  switch (row.rule) {
    case Rule::kCopy:
      Set(out, row.key, value);
      break;
    case Rule::kFlagPair:
    case Rule::kFlagPairOtherFirst:
      WriteFlagPair(row, value, out);
      break;
    case Rule::kPointsToInches:
      WritePointsAsInches(row, value, out);
      break;
    case Rule::kAuto:
      if (value == wxS("1")) Set(out, row.key, "Auto");
      break;
    case Rule::kPosition:
      if (const char* text = ImagePositionText(value)) Set(out, row.key, text);
      break;
    case Rule::kZeroPair:
      Set(out, row.key, "0");
      Set(out, row.other_key, "0");
      break;
  }
}

// Values that are not literal are read only here, when the setting is
// written, so that a step with an empty legacy map neither inserts
// "PEXFILTER" into the filter-enable map nor scans for the server.
wxString FixedValue(CHFMigrator& m, const FixedSetting& setting) {
  switch (setting.source) {
    case FixedSource::kLiteral:
      return AsciiText(setting.value);
    case FixedSource::kPexFilterEnabled:
      return m.m_FilterEnable.GetOrInsert(wxS("PEXFILTER")) == wxS("1") ? wxS("1") : wxS("0");
    case FixedSource::kServerDirectory:
      return CachedServerDirectory(m.m_ServerDirectory);
    case FixedSource::kPrinterName: {
      const wxString* name = m.m_FilterSettings.Find(wxS("PRINTERNAME"));
      return name ? *name : AsciiText(setting.value);
    }
  }
  return wxString();
}

void WriteFixed(CHFMigrator& m, const std::vector<FixedSetting>& fixed, SettingsMap& out) {
  for (const FixedSetting& setting : fixed) Set(out, setting.key, FixedValue(m, setting));
}

// The legacy map each step reads and the converted map it writes, in the
// order the steps run.
struct StepMaps {
  SettingsMap CHFMigrator::*legacy;
  SettingsMap CHFMigrator::*converted;
  ConversionStep (*table)();
};

const StepMaps kSteps[] = {
    {&CHFMigrator::m_Eps2PsFilter, &CHFMigrator::m_Eps2PsFilterConv, EpsStep},
    {&CHFMigrator::m_Jpeg2Pdf, &CHFMigrator::m_Jpeg2PdfConv, JpegStep},
    {&CHFMigrator::m_Tiff2Pdf, &CHFMigrator::m_Tiff2PdfConv, TiffStep},
    {&CHFMigrator::m_TiffItFilter, &CHFMigrator::m_TiffItFilterConv, TiffItStep},
    {&CHFMigrator::m_OneBitTiff, &CHFMigrator::m_OneBitTiffConv, OneBitTiffStep},
    {&CHFMigrator::m_CtlwFilter, &CHFMigrator::m_CtlwFilterConv, CtlwStep},
    {&CHFMigrator::m_ExportPs, &CHFMigrator::m_ExportPsConv, ExportPsStep},
    {&CHFMigrator::m_Pdf2Go, &CHFMigrator::m_Pdf2GoConv, ExportPsStep},
    {&CHFMigrator::m_PexFilter, &CHFMigrator::m_PexFilterConv, PexFilterStep},
};

// The maps whose output "PDFCONVERSION" turns into PDF, in the order they
// are switched. The other converted filters keep the output their step gave.
SettingsMap CHFMigrator::*const kPdfConversionMaps[] = {
    &CHFMigrator::m_CtlwFilterConv, &CHFMigrator::m_Eps2PsFilterConv, &CHFMigrator::m_Jpeg2PdfConv,
    &CHFMigrator::m_Tiff2PdfConv,   &CHFMigrator::m_MsOffice,
};

}  // namespace

// The rows are walked in table order and each looks its legacy key up,
// rather than the legacy entries being visited in the map's order. Where two
// legacy keys write the same new key ("CURFILENAMEPATTERN" and
// "FILENAMEPATTERN"; "RESOLUTION" and "AUTORESOLUTION" = "1") the later row
// therefore always wins, whatever order the legacy file listed them in, and
// the converted keys come out in table order, which is also the order of the
// filter's settings in the store.
void RunConversionStep(CHFMigrator& migrator, const SettingsMap& legacy, const ConversionStep& step,
                       SettingsMap& converted) {
  if (legacy.Empty()) return;
  for (const ConversionRow& row : step.rows) {
    if (const wxString* value = legacy.Find(AsciiText(row.legacy_key))) {
      ApplyRule(row, *value, converted);
    }
  }
  WriteFixed(migrator, step.fixed, converted);
}

void ConvertFilterMaps(CHFMigrator& m) {
  for (const StepMaps& step : kSteps) {
    RunConversionStep(m, m.*step.legacy, step.table(), m.*step.converted);
  }
  WriteFixed(m, MsOfficeSettings(), m.m_MsOffice);
  WriteFixed(m, DcsSettings(), m.m_Dcs2FilterConv);
  m.ApplyPdfConversion();
}

bool CHFMigrator::ConvertFilterSettings() {
  ConvertFilterMaps(*this);
  return RegisterHotFolder();
}

void CHFMigrator::ApplyPdfConversion() {
  const wxString* switched = m_FilterSettings.Find(wxS("PDFCONVERSION"));
  if (!switched || *switched != wxS("1")) return;
  for (SettingsMap CHFMigrator::*map : kPdfConversionMaps) {
    Set(this->*map, "OUTPUTFILETYPEPDF", "1");
    Set(this->*map, "OUTPUTFILETYPEPS", "0");
  }
}
