#include "convert/filter_chain.h"

#include <cstddef>
#include <cstring>

#include "convert/ascii_text.h"
#include "convert/registration.h"
#include "convert/server_lookup.h"

namespace {

using MapMember = SettingsMap CHFMigrator::*;

struct LegacyFilter {
  const char* enable_key;
  MapMember settings;
  const char* identifier;
  const char* display_name;
  bool suppresses_default_chain;
};

// In the order they are tested and appended.
const LegacyFilter kLegacyFilters[] = {
    {"EPS2PSFILTER", &CHFMigrator::m_Eps2PsFilterConv, "KYR.EPS.1", "EPS", true},
    {"JPEG2PDF", &CHFMigrator::m_Jpeg2PdfConv, "KYR.JPEG.1", "JPEG", false},
    {"TIFF2PDF", &CHFMigrator::m_Tiff2PdfConv, "KYR.TIFF.1", "TIFF", false},
    {"PDF2PS", &CHFMigrator::m_PexFilterConv, "KYR.PDF.1", "PDF", true},
    {"TIFFITFILTER", &CHFMigrator::m_TiffItFilterConv, "KYR.TIFFIT.1", "TIFFIT", true},
    {"ONEBITTIFF", &CHFMigrator::m_OneBitTiffConv, "KYR.ONEBITTIFF.1", "1-Bit TIFF", true},
    {"CTLWFILTER", &CHFMigrator::m_CtlwFilterConv, "KYR.CTLWtoPS.1", "CT/LW", true},
    {"EXPORTPS", &CHFMigrator::m_ExportPsConv, "KYR.ExportPS.1", "ExportPS", true},
    {"PEXFILTER", &CHFMigrator::m_PexFilterConv, "KYR.PDF.1", "PDF", true},
    {"PDF2GO", &CHFMigrator::m_Pdf2GoConv, "KYR.PDF2GO.1", "PDF2GO", true},
    {"MICROSOFT", &CHFMigrator::m_MsOffice, "KYR.MSOffice.1", "Microsoft", false},
    {"DCS2FILTER", &CHFMigrator::m_Dcs2FilterConv, "KYR.DCS.1", "DCS", true},
    {"XRX", &CHFMigrator::m_PexFilterConv, "KYR.XRX.1", "XRX", true},
};

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
  MapMember settings;
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

void Append(FilterChain* chain, const SettingsMap& settings, const char* identifier,
            const char* display_name) {
  wxString id = AsciiText(identifier);
  chain->root->AddChild(BuildFilterElement(settings, id));
  chain->entries.push_back({AsciiText(display_name), id});
}

void WriteFixedValues(CHFMigrator& engine, const DefaultFilter& filter) {
  SettingsMap& settings = engine.*filter.settings;
  for (std::size_t i = 0; i < filter.fixed_count; ++i) {
    const FixedValue& fixed = filter.fixed_values[i];
    settings.GetOrInsert(AsciiText(fixed.key)) =
        fixed.value ? AsciiText(fixed.value) : CachedServerDirectory(engine.m_ServerDirectory);
  }
}

}  // namespace

FilterChain BuildFilterChain(CHFMigrator& engine) {
  FilterChain chain;
  chain.root = std::make_unique<wxXmlNode>(wxXML_ELEMENT_NODE, "FilterSetting");
  bool default_chain = true;
  bool legacy_tiff = false;
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (engine.m_FilterEnable.GetOrInsert(AsciiText(filter.enable_key)) != wxS("1")) {
      continue;
    }
    Append(&chain, engine.*filter.settings, filter.identifier, filter.display_name);
    if (filter.suppresses_default_chain) default_chain = false;
    if (std::strcmp(filter.enable_key, "TIFF2PDF") == 0) legacy_tiff = true;
  }
  if (!default_chain) return chain;
  for (const DefaultFilter& filter : kDefaultChain) {
    if (filter.skipped_with_legacy_tiff && legacy_tiff) continue;
    WriteFixedValues(engine, filter);
    Append(&chain, engine.*filter.settings, filter.identifier, filter.display_name);
  }
  return chain;
}
