#include "convert/filter_chain.h"

#include <cstddef>
#include <iterator>
#include <vector>

#include "convert/server_lookup.h"
#include "engine/ascii_text.h"
#include "engine/legacy_filters.h"

namespace {

struct FixedValue {
  const char* key;
  const char* value;  // null: the server's directory
};

const FixedValue kPdfFixedValues[] = {
    {"RESOLUTIONDPI", "Auto"}, {"FORCEERRORREPORT", "0"},
    {"FORCEPDFX1", "1"},       {"FORCEPDFX3", "0"},
    {"FORCEPDFX", "0"},        {"OUTPUTFILETYPEPDF", "1"},
    {"OUTPUTFILETYPEPS", "0"}, {"SELECTEDDISTILLERPROFILE", ""},
    {"COMBINEALLFILES", "0"},  {"ERRORPATH", nullptr},
};

const FixedValue kPsFixedValues[] = {
    {"OUTPUTFILETYPEPDF", "0"},
    {"OUTPUTFILETYPEPS", "1"},
    {"SELECTEDDISTILLERPROFILE", ""},
    {"COMBINEALLFILES", "0"},
};

const FixedValue kTiffFixedValues[] = {
    {"CONTRAINPROPORTION", "1"},
    {"FORCEPAGESIZEX", "0"},
    {"FORCEPAGESIZEY", "0"},
    {"IMAGEEABLESIZEURX", "0"},
    {"IMAGEEABLESIZEURY", "0"},
    {"IMAGEEABLESIZELLX", "0"},
    {"IMAGEEABLESIZELLY", "0"},
    {"AUTOROTATE", "0"},
    {"DEFAULTPAGESIZE", "A4"},
    {"SHRINKTOFIT", "0"},
    {"FITTOPAGE", "1"},
    {"CUSTOMSIZE", "0"},
    {"ORIGINALSIZE", "1"},
    {"ORIGINALWIDTH", "0.0"},
    {"ORIGINALHEIGHT", "0.0"},
    {"ORIGINALWIDTHOPTION", "1"},
    {"ORIGINALHEIGHTOPTION", "0"},
    {"FORCERESOLUTION", "0"},
    {"RESOLUTION", "600"},
    {"IMAGEPOSITION", "Center"},
    {"CUSTOMPAGEWIDTH", "0.0"},
    {"CUSTOMPAGEHEIGHT", "0.0"},
    {"OUTPUTFILETYPEPDF", "0"},
    {"OUTPUTFILETYPEPS", "0"},
    {"OUTPUTFILETYPETIFF", "1"},
    {"SELECTEDDISTILLERPROFILE", ""},
    {"COMBINEALLFILES", "0"},
    {"SCALETOPRINT", "0"},
    {"FORCEAUTOSCALE", "0"},
    {"ORIENTATIONPOTRAIT", "1"},
    {"ORIENTATIONLANDSCAPE", "0"},
    {"ORIGINALWIDTHUNIT", "inch"},
    {"ORIGINALHEIGHTUNIT", "inch"},
    {"CUSTOMPAGETUNIT", "0"},
};
static_assert(sizeof(kTiffFixedValues) / sizeof(kTiffFixedValues[0]) == 34,
              "the TIFF output filter has 34 fixed settings");

struct DefaultFilter {
  SettingsMember settings;
  const FixedValue* fixed_values;
  std::size_t fixed_count;
  const char* identifier;
  const char* display_name;
  bool skipped_with_legacy_tiff;  // a legacy TIFF filter already converts TIFF
};

template <std::size_t N>
constexpr std::size_t Count(const FixedValue (&)[N]) {
  return N;
}

const DefaultFilter kDefaultChain[] = {
    {&CHFMigrator::m_PexFilterConv, kPdfFixedValues, Count(kPdfFixedValues), "KYR.PDF.1", "PDF",
     false},
    {&CHFMigrator::m_Ps, kPsFixedValues, Count(kPsFixedValues), "KYR.PS.1", "PS", false},
    {&CHFMigrator::m_Tiff2PdfConv, kTiffFixedValues, Count(kTiffFixedValues), "KYR.TIFF.1", "TIFF",
     true},
    {&CHFMigrator::m_Vdp, nullptr, 0, "KYR.VDP.1", "VDP", false},
};

// The texts of the chain's tables, made wide once per run: every folder
// reads the filter-enable map for each legacy filter and appends several
// filters.
struct ChainFilter {
  wxString identifier;
  wxString display_name;
};

ChainFilter Wide(const char* identifier, const char* display_name) {
  return {AsciiText(identifier), AsciiText(display_name)};
}

struct WideFixedValue {
  SettingsKey key;
  wxString value;
  bool server_directory;
};

struct WideTables {
  wxString on = AsciiText("1");
  wxString filter_setting = AsciiText("FilterSetting");
  std::vector<SettingsKey> enable_keys;                   // by row of kLegacyFilters
  std::vector<ChainFilter> legacy;                        // by row of kLegacyFilters
  std::vector<ChainFilter> defaults;                      // by row of kDefaultChain
  std::vector<std::vector<WideFixedValue>> fixed_values;  // by row of kDefaultChain

  WideTables() {
    for (const LegacyFilter& filter : kLegacyFilters) {
      enable_keys.emplace_back(wxString(filter.key));
      legacy.push_back(Wide(filter.identifier, filter.display_name));
    }
    for (const DefaultFilter& filter : kDefaultChain) {
      defaults.push_back(Wide(filter.identifier, filter.display_name));
      std::vector<WideFixedValue>& wide = fixed_values.emplace_back();
      for (std::size_t i = 0; i < filter.fixed_count; ++i) {
        const FixedValue& fixed = filter.fixed_values[i];
        wide.push_back({SettingsKey(AsciiText(fixed.key)),
                        fixed.value ? AsciiText(fixed.value) : wxString(), fixed.value == nullptr});
      }
    }
  }
};

const WideTables& Tables() {
  static const WideTables tables;
  return tables;
}

void Append(FilterChain* chain, wxXmlNode* root, const SettingsMap& settings,
            const ChainFilter& filter) {
  root->AddChild(BuildFilterElement(settings, filter.identifier));
  chain->entries.push_back({filter.display_name, filter.identifier});
}

void WriteFixedValues(CHFMigrator& engine, std::size_t filter) {
  SettingsMap& settings = engine.*kDefaultChain[filter].settings;
  for (const WideFixedValue& fixed : Tables().fixed_values[filter]) {
    settings.GetOrInsert(fixed.key) =
        fixed.server_directory ? CachedServerDirectory(engine.m_ServerDirectory) : fixed.value;
  }
}

}  // namespace

wxXmlNode* BuildFilterElement(const SettingsMap& settings, const wxString& identifier) {
  static const wxString kFilter(L"Filter");
  static const wxString kName(L"name");
  static const wxString kUi(L"UI");
  static const wxString kNoName;
  auto* filter = new wxXmlNode(wxXML_ELEMENT_NODE, kFilter);
  filter->AddAttribute(kName, identifier);
  auto* ui = new wxXmlNode(filter, wxXML_ELEMENT_NODE, kUi);
  // A node made with its parent comes first among the parent's children, so
  // the settings are made last to first; each is then linked in one step
  // rather than after a walk to the end of the list.
  for (auto entry = std::make_reverse_iterator(settings.end());
       entry != std::make_reverse_iterator(settings.begin()); ++entry) {
    auto* element = new wxXmlNode(ui, wxXML_ELEMENT_NODE, entry->first);
    new wxXmlNode(element, wxXML_TEXT_NODE, kNoName, entry->second);
  }
  return filter;
}

FilterChain BuildFilterChain(CHFMigrator& engine, wxXmlNode* root) {
  const WideTables& tables = Tables();
  FilterChain chain;
  root->SetType(wxXML_ELEMENT_NODE);
  root->SetName(tables.filter_setting);
  bool default_chain = true;
  bool default_tiff = true;
  for (std::size_t i = 0; i < kLegacyFilters.size(); ++i) {
    const LegacyFilter& filter = kLegacyFilters[i];
    if (engine.m_FilterEnable.GetOrInsert(tables.enable_keys[i]) != tables.on) continue;
    Append(&chain, root, engine.*filter.converted, tables.legacy[i]);
    if (filter.default_chain == DefaultChain::kReplaced) default_chain = false;
    if (filter.default_chain == DefaultChain::kKeptWithoutTiff) default_tiff = false;
  }
  if (!default_chain) return chain;
  for (std::size_t i = 0; i < std::size(kDefaultChain); ++i) {
    const DefaultFilter& filter = kDefaultChain[i];
    if (filter.skipped_with_legacy_tiff && !default_tiff) continue;
    WriteFixedValues(engine, i);
    Append(&chain, root, engine.*filter.settings, tables.defaults[i]);
  }
  return chain;
}
