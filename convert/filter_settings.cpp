#include "convert/filter_settings.h"

#include <cmath>

#include "convert/server_lookup.h"
#include "engine/ascii_text.h"
#include "engine/legacy_filters.h"
#include "engine/numbers.h"

namespace {

// Texts every folder writes, made once per run.
struct Texts {
  wxString on = AsciiText("1");
  wxString off = AsciiText("0");
  wxString automatic = AsciiText("Auto");
  SettingsKey pex_filter{AsciiText("PEXFILTER")};
  SettingsKey printer_name{AsciiText("PRINTERNAME")};
  SettingsKey pdf_conversion{AsciiText("PDFCONVERSION")};
  SettingsKey pdf_output{AsciiText("OUTPUTFILETYPEPDF")};
  SettingsKey ps_output{AsciiText("OUTPUTFILETYPEPS")};
};

const Texts& Literals() {
  static const Texts texts;
  return texts;
}

// Every write into a converted map is a get-or-insert: a key the map already
// holds (from this folder or an earlier one) keeps its place and takes the
// new value.
void Set(SettingsMap& map, const SettingsKey& key, const wxString& value) {
  map.GetOrInsert(key) = value;
}

void WriteFlagPair(const PreparedRow& row, const wxString& value, SettingsMap& out) {
  const bool on = value == row.on_value;
  const wxString& key_value = on ? Literals().on : Literals().off;
  const wxString& other_value = on ? Literals().off : Literals().on;
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
void WritePointsAsInches(const PreparedRow& row, const wxString& value, SettingsMap& out) {
  double points = 0.0;
  if (!ReadDouble(value, &points) || !std::isfinite(points)) return;
  Set(out, row.key, FormatFixed(points / 72.0));
}

void ApplyRule(const PreparedRow& row, const wxString& value, SettingsMap& out) {
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
      if (value == Literals().on) Set(out, row.key, Literals().automatic);
      break;
    case Rule::kPosition:
      if (const wxString* text = ImagePositionText(value)) Set(out, row.key, *text);
      break;
    case Rule::kZeroPair:
      Set(out, row.key, Literals().off);
      Set(out, row.other_key, Literals().off);
      break;
  }
}

// Values that are not literal are read only here, when the setting is
// written, so that a step with an empty legacy map neither inserts
// "PEXFILTER" into the filter-enable map nor scans for the server.
wxString FixedValue(CHFMigrator& engine, const PreparedFixed& setting) {
  switch (setting.source) {
    case FixedSource::kLiteral:
      return setting.value;
    case FixedSource::kPexFilterEnabled:
      return engine.m_FilterEnable.GetOrInsert(Literals().pex_filter) == Literals().on
                 ? Literals().on
                 : Literals().off;
    case FixedSource::kServerDirectory:
      return CachedServerDirectory(engine.m_ServerDirectory);
    case FixedSource::kPrinterName: {
      const wxString* name = engine.m_FilterSettings.Find(Literals().printer_name);
      return name ? *name : setting.value;
    }
  }
  return wxString();
}

void WriteFixed(CHFMigrator& engine, const std::vector<PreparedFixed>& fixed, SettingsMap& out) {
  for (const PreparedFixed& setting : fixed) {
    // A literal, nearly every one, is copied into the entry's own string.
    if (setting.source == FixedSource::kLiteral) {
      Set(out, setting.key, setting.value);
    } else {
      Set(out, setting.key, FixedValue(engine, setting));
    }
  }
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
  for (const PreparedRow& row : step.rows) {
    if (const wxString* value = legacy.Find(row.legacy_key)) {
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
  const wxString* switched = m_FilterSettings.Find(Literals().pdf_conversion);
  if (!switched || *switched != Literals().on) return;
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (!filter.pdf_switch) continue;
    Set(this->*filter.converted, Literals().pdf_output, Literals().on);
    Set(this->*filter.converted, Literals().ps_output, Literals().off);
  }
}
