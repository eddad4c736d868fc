#include "convert/filter_settings.h"

#include <cmath>

#include "convert/ascii_text.h"
#include "convert/server_lookup.h"
#include "engine/legacy_filters.h"
#include "engine/numbers.h"

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
wxString FixedValue(CHFMigrator& engine, const FixedSetting& setting) {
  switch (setting.source) {
    case FixedSource::kLiteral:
      return AsciiText(setting.value);
    case FixedSource::kPexFilterEnabled:
      return engine.m_FilterEnable.GetOrInsert(wxS("PEXFILTER")) == wxS("1") ? wxS("1") : wxS("0");
    case FixedSource::kServerDirectory:
      return CachedServerDirectory(engine.m_ServerDirectory);
    case FixedSource::kPrinterName: {
      const wxString* name = engine.m_FilterSettings.Find(wxS("PRINTERNAME"));
      return name ? *name : AsciiText(setting.value);
    }
  }
  return wxString();
}

void WriteFixed(CHFMigrator& engine, const std::vector<FixedSetting>& fixed, SettingsMap& out) {
  for (const FixedSetting& setting : fixed) Set(out, setting.key, FixedValue(engine, setting));
}

}  // namespace

// The rows are walked in table order and each looks its legacy key up,
// rather than the legacy entries being visited in the map's order. Where two
// legacy keys write the same new key ("CURFILENAMEPATTERN" and
// "FILENAMEPATTERN"; "RESOLUTION" and "AUTORESOLUTION" = "1") the later row
// therefore always wins, whatever order the legacy file listed them in, and
// the converted keys come out in table order, which is also the order of the
// filter's settings in the store.
void RunConversionStep(CHFMigrator& engine, const SettingsMap& legacy, const ConversionStep& step,
                       SettingsMap& converted) {
  for (const ConversionRow& row : step.rows) {
    if (const wxString* value = legacy.Find(AsciiText(row.legacy_key))) {
      ApplyRule(row, *value, converted);
    }
  }
  WriteFixed(engine, step.fixed, converted);
}

void CHFMigrator::ConvertFilterSettings() {
  static const SettingsMap kNoSettings;
  for (const LegacyFilter& filter : kLegacyFilters) {
    const SettingsMap& legacy = filter.legacy ? this->*filter.legacy : kNoSettings;
    if (filter.convert_when == ConvertWhen::kNever) continue;
    if (filter.convert_when == ConvertWhen::kWithSettings && legacy.Empty()) continue;
    RunConversionStep(*this, legacy, filter.step(), this->*filter.converted);
  }
  ApplyPdfConversion();
}

void CHFMigrator::ApplyPdfConversion() {
  const wxString* switched = m_FilterSettings.Find(wxS("PDFCONVERSION"));
  if (!switched || *switched != wxS("1")) return;
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (!filter.pdf_switch) continue;
    Set(this->*filter.converted, "OUTPUTFILETYPEPDF", "1");
    Set(this->*filter.converted, "OUTPUTFILETYPEPS", "0");
  }
}
