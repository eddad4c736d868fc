// The conversion tables of the legacy filter settings: which legacy key
// becomes which new key by which rule, and which settings each converted
// filter always receives. They are data rather than code so that every row
// can be checked against the legacy filter's documentation one by one.
#ifndef HF_ENGINE_FILTER_TABLES_H_
#define HF_ENGINE_FILTER_TABLES_H_

#include <wx/string.h>

#include <vector>

#include "engine/settings_map.h"

enum class Rule {
  kCopy,                // the new key gets the legacy value unchanged
  kFlagPair,            // value == on_value: key "1", other_key "0"; else the
                        // reverse. key is written first.
  kFlagPairOtherFirst,  // as kFlagPair, but other_key is written first
  kPointsToInches,      // legacy points, new inches, printed as "%f"
  kAuto,                // "1" writes "Auto"; anything else writes nothing
  kPosition,            // legacy digit to position text (ImagePositionText)
  kZeroPair,            // key and other_key both "0", whatever the value
};

struct ConversionRow {
  const char* legacy_key;
  const char* key;
  const char* other_key;  // second key of a pair rule, else nullptr
  Rule rule;
  const char* on_value;  // flag pairs only, else nullptr
};

// Where the value of a fixed setting comes from. Most are literal; the others
// are read only when the setting is written, because reading them can change
// engine state (a get-or-insert, a process scan).
enum class FixedSource {
  kLiteral,           // `value`
  kPexFilterEnabled,  // "1" when the filter-enable map holds "1" for PEXFILTER
  kServerDirectory,   // the running server's directory, or empty
  kPrinterName,       // FILTERSETTINGS' PRINTERNAME when present, else `value`
};

struct FixedSetting {
  const char* key;
  const char* value;
  FixedSource source;
};

// A row and a fixed setting as the conversion reads them: texts made wide
// and keys hashed once per run, since every folder reads them all. An absent
// text is empty.
struct PreparedRow {
  explicit PreparedRow(const ConversionRow& row);
  SettingsKey legacy_key;
  SettingsKey key;
  SettingsKey other_key;
  Rule rule;
  wxString on_value;
};

struct PreparedFixed {
  explicit PreparedFixed(const FixedSetting& setting);
  SettingsKey key;
  wxString value;
  FixedSource source;
};

// One conversion step: its rows in matching order, and the settings written
// after the converted entries, in order.
struct ConversionStep {
  std::vector<PreparedRow> rows;
  std::vector<PreparedFixed> fixed;
};

// The three filters of the layout family share one table, with a column per
// filter saying whether a row exists for it.
enum LayoutColumn { kEpsColumn, kJpegColumn, kTiffColumn, kLayoutColumns };

ConversionStep LayoutStep(LayoutColumn column);
const ConversionStep& EpsStep();
const ConversionStep& JpegStep();
const ConversionStep& TiffStep();
const ConversionStep& TiffItStep();
const ConversionStep& OneBitTiffStep();
const ConversionStep& CtlwStep();
const ConversionStep& ExportPsStep();  // EXPORTPS and PDF2GO alike
const ConversionStep& PexFilterStep();

// Fixed settings only, written on every folder whatever the legacy maps hold.
const ConversionStep& MsOfficeStep();
const ConversionStep& DcsStep();

// The text of a legacy "IMAGEPOSITION" digit; nullptr for a value that is
// not a known position, which then writes nothing.
const wxString* ImagePositionText(const wxString& legacy);

#endif  // HF_ENGINE_FILTER_TABLES_H_
