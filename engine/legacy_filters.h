// The legacy filters, one row each. The folder.cfg reader, the filter
// conversion, the filter chain and the clearing of the settings maps all walk
// this one table, so a filter is added, or checked, in one place.
#ifndef HF_ENGINE_LEGACY_FILTERS_H_
#define HF_ENGINE_LEGACY_FILTERS_H_

#include <cstddef>

#include "engine/filter_tables.h"
#include "engine/migrator.h"

using SettingsMember = SettingsMap CHFMigrator::*;

// How a folder.cfg says that a filter is on.
enum class EnabledBy {
  kSection,     // the enable text of the container around the filter's own
                // settings section, taken as it stands
  kIdentifier,  // a FILTERID container with one of the filter's legacy
                // identifiers and the enable text "1"; the last one counts
  kCount,       // the enable texts of all such containers, summed as
                // numbers: on when the sum is positive
};

// A legacy identifier, compared exactly, trailing line feed included, or
// after trailing white space is removed.
struct LegacyIdentifier {
  const wchar_t* text;  // null ends a list
  bool trim_trailing_space;
};

// When the filter's conversion step writes its converted map.
enum class ConvertWhen {
  kNever,
  kWithSettings,  // only when the folder.cfg gave the filter settings
  kAlways,        // on every folder: the step's fixed settings only
};

// What an enabled filter does to the default chain (PDF, PS, TIFF, VDP).
enum class DefaultChain {
  kKept,
  kKeptWithoutTiff,  // the filter converts TIFF itself
  kReplaced,
};

struct LegacyFilter {
  const wchar_t* key;  // its entry in the filter-enable map, and the name of
                       // its settings section where it has one
  EnabledBy enabled_by;
  const LegacyIdentifier* legacy_ids;  // for kIdentifier and kCount
  SettingsMember legacy;               // its settings section; null: none
  SettingsMember converted;            // what its "Filter" element carries
  ConvertWhen convert_when;
  const ConversionStep& (*step)();  // built once, on first use
  bool pdf_switch;                  // "PDFCONVERSION" = "1" turns its output into PDF
  const char* identifier;
  const char* display_name;
  DefaultChain default_chain;
};

struct LegacyFilterTable {
  const LegacyFilter* rows;
  std::size_t count;
  const LegacyFilter* begin() const { return rows; }
  const LegacyFilter* end() const { return rows + count; }
  std::size_t size() const { return count; }
  const LegacyFilter& operator[](std::size_t i) const { return rows[i]; }
};

// In the order the chain tests and appends them.
extern const LegacyFilterTable kLegacyFilters;

#endif  // HF_ENGINE_LEGACY_FILTERS_H_
