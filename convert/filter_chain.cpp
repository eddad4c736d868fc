#include "convert/filter_chain.h"

#include <cstddef>
#include <iterator>
#include <vector>

#include "convert/ascii_text.h"
#include "convert/server_lookup.h"
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

void Append(FilterChain* chain, wxXmlNode* root, const SettingsMap& settings,
            const char* identifier, const char* display_name) {
  wxString id = AsciiText(identifier);
  root->AddChild(BuildFilterElement(settings, id));
  chain->entries.push_back({AsciiText(display_name), id});
}

// The fixed values as wide texts, made once per run: every folder of the
// default chain writes all of them.
struct WideFixedValue {
  wxString key;
  wxString value;
  bool server_directory;
};

const std::vector<WideFixedValue>& WideFixedValues(std::size_t filter) {
  static const std::vector<std::vector<WideFixedValue>> tables = [] {
    std::vector<std::vector<WideFixedValue>> wide(std::size(kDefaultChain));
    for (std::size_t f = 0; f < std::size(kDefaultChain); ++f) {
      for (std::size_t i = 0; i < kDefaultChain[f].fixed_count; ++i) {
        const FixedValue& fixed = kDefaultChain[f].fixed_values[i];
        wide[f].push_back({AsciiText(fixed.key), fixed.value ? AsciiText(fixed.value) : wxString(),
                           fixed.value == nullptr});
      }
    }
    return wide;
  }();
  return tables[filter];
}

void WriteFixedValues(CHFMigrator& engine, std::size_t filter) {
  SettingsMap& settings = engine.*kDefaultChain[filter].settings;
  for (const WideFixedValue& fixed : WideFixedValues(filter)) {
    settings.GetOrInsert(fixed.key) =
        fixed.server_directory ? CachedServerDirectory(engine.m_ServerDirectory) : fixed.value;
  }
}

}  // namespace

wxXmlNode* BuildFilterElement(const SettingsMap& settings, const wxString& identifier) {
  auto* filter = new wxXmlNode(wxXML_ELEMENT_NODE, L"Filter");
  filter->AddAttribute(L"name", identifier);
  auto* ui = new wxXmlNode(wxXML_ELEMENT_NODE, L"UI");
  // AddChild walks to the end each time; inserting after the last child
  // keeps a large map linear.
  wxXmlNode* last = nullptr;
  for (const SettingsMap::Entry& entry : settings) {
    auto* element = new wxXmlNode(wxXML_ELEMENT_NODE, entry.first);
    element->AddChild(new wxXmlNode(wxXML_TEXT_NODE, wxString(), entry.second));
    ui->InsertChildAfter(element, last);
    last = element;
  }
  filter->AddChild(ui);
  return filter;
}

FilterChain BuildFilterChain(CHFMigrator& engine, wxXmlNode* root) {
  FilterChain chain;
  root->SetType(wxXML_ELEMENT_NODE);
  root->SetName(L"FilterSetting");
  bool default_chain = true;
  bool default_tiff = true;
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (engine.m_FilterEnable.GetOrInsert(filter.key) != wxS("1")) continue;
    Append(&chain, root, engine.*filter.converted, filter.identifier, filter.display_name);
    if (filter.default_chain == DefaultChain::kReplaced) default_chain = false;
    if (filter.default_chain == DefaultChain::kKeptWithoutTiff) default_tiff = false;
  }
  if (!default_chain) return chain;
  for (std::size_t i = 0; i < std::size(kDefaultChain); ++i) {
    const DefaultFilter& filter = kDefaultChain[i];
    if (filter.skipped_with_legacy_tiff && !default_tiff) continue;
    WriteFixedValues(engine, i);
    Append(&chain, root, engine.*filter.settings, filter.identifier, filter.display_name);
  }
  return chain;
}
