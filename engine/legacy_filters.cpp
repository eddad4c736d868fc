#include "engine/legacy_filters.h"

namespace {

using M = CHFMigrator;
constexpr EnabledBy kSection = EnabledBy::kSection;
constexpr EnabledBy kIdentifier = EnabledBy::kIdentifier;
constexpr EnabledBy kCount = EnabledBy::kCount;
constexpr ConvertWhen kNever = ConvertWhen::kNever;
constexpr ConvertWhen kWithSettings = ConvertWhen::kWithSettings;
constexpr ConvertWhen kAlways = ConvertWhen::kAlways;
constexpr DefaultChain kKept = DefaultChain::kKept;
constexpr DefaultChain kNoTiff = DefaultChain::kKeptWithoutTiff;
constexpr DefaultChain kReplaced = DefaultChain::kReplaced;
constexpr bool Y = true;
constexpr bool N = false;

// The office-document converters of the legacy service, one identifier each;
// several may be configured in one folder.
const LegacyIdentifier kOfficeIds[] = {
    {L"{8530FDC1-4FBB-4BD3-A116-33186DE16718}\n", false},
    {L"{728E7740-D6A7-4D5D-8A68-98DDF21E4132}\n", false},
    {L"{AE31FFA3-8524-4734-B35D-E6DB6FE9A371}\n", false},
    {L"{68FC3B4A-62B7-11D6-99CD-00E08101E712}\n", false},
    {nullptr, false},
};
const LegacyIdentifier kPdf2PsIds[] = {
    {L"{CDD70909-DACE-499B-9186-B6088CD46376}\n", false},
    {nullptr, false},
};
const LegacyIdentifier kXrxIds[] = {
    {L"{02AC69D4-CAEE-47E1-912E-95B0C9E8D86A}\n", false},
    {L"63EE9F15-C7B1-43C8-9958-E9EFE972EA00", true},
    {nullptr, false},
};

// clang-format off
const LegacyFilter kRows[] = {
// key              enabled by   ids          legacy map         converted map          convert        step            PDF  identifier          display name  default chain
  {L"EPS2PSFILTER", kSection,    nullptr,     &M::m_Eps2PsFilter, &M::m_Eps2PsFilterConv, kWithSettings, EpsStep,        Y, "KYR.EPS.1",        "EPS",        kReplaced},
  {L"JPEG2PDF",     kSection,    nullptr,     &M::m_Jpeg2Pdf,     &M::m_Jpeg2PdfConv,     kWithSettings, JpegStep,       Y, "KYR.JPEG.1",       "JPEG",       kKept},
  {L"TIFF2PDF",     kSection,    nullptr,     &M::m_Tiff2Pdf,     &M::m_Tiff2PdfConv,     kWithSettings, TiffStep,       Y, "KYR.TIFF.1",       "TIFF",       kNoTiff},
  {L"PDF2PS",       kIdentifier, kPdf2PsIds,  nullptr,            &M::m_PexFilterConv,    kNever,        nullptr,        N, "KYR.PDF.1",        "PDF",        kReplaced},
  {L"TIFFITFILTER", kSection,    nullptr,     &M::m_TiffItFilter, &M::m_TiffItFilterConv, kWithSettings, TiffItStep,     N, "KYR.TIFFIT.1",     "TIFFIT",     kReplaced},
  {L"ONEBITTIFF",   kSection,    nullptr,     &M::m_OneBitTiff,   &M::m_OneBitTiffConv,   kWithSettings, OneBitTiffStep, N, "KYR.ONEBITTIFF.1", "1-Bit TIFF", kReplaced},
  {L"CTLWFILTER",   kSection,    nullptr,     &M::m_CtlwFilter,   &M::m_CtlwFilterConv,   kWithSettings, CtlwStep,       Y, "KYR.CTLWtoPS.1",   "CT/LW",      kReplaced},
  {L"EXPORTPS",     kSection,    nullptr,     &M::m_ExportPs,     &M::m_ExportPsConv,     kWithSettings, ExportPsStep,   N, "KYR.ExportPS.1",   "ExportPS",   kReplaced},
  {L"PEXFILTER",    kSection,    nullptr,     &M::m_PexFilter,    &M::m_PexFilterConv,    kWithSettings, PexFilterStep,  N, "KYR.PDF.1",        "PDF",        kReplaced},
  {L"PDF2GO",       kSection,    nullptr,     &M::m_Pdf2Go,       &M::m_Pdf2GoConv,       kWithSettings, ExportPsStep,   N, "KYR.PDF2GO.1",     "PDF2GO",     kReplaced},
  {L"MICROSOFT",    kCount,      kOfficeIds,  nullptr,            &M::m_MsOffice,         kAlways,       MsOfficeStep,   Y, "KYR.MSOffice.1",   "Microsoft",  kKept},
  {L"DCS2FILTER",   kSection,    nullptr,     &M::m_Dcs2Filter,   &M::m_Dcs2FilterConv,   kAlways,       DcsStep,        N, "KYR.DCS.1",        "DCS",        kReplaced},
  {L"XRX",          kIdentifier, kXrxIds,     nullptr,            &M::m_PexFilterConv,    kNever,        nullptr,        N, "KYR.XRX.1",        "XRX",        kReplaced},
};
// clang-format on

}  // namespace

const LegacyFilterTable kLegacyFilters = {kRows, sizeof(kRows) / sizeof(kRows[0])};
