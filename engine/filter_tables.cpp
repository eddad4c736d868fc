#include "engine/filter_tables.h"

#include <cstddef>
#include <utility>

#include "engine/ascii_text.h"

namespace {

constexpr Rule kCopy = Rule::kCopy;
constexpr Rule kFlagPair = Rule::kFlagPair;
constexpr Rule kFlagPairOtherFirst = Rule::kFlagPairOtherFirst;
constexpr Rule kPointsToInches = Rule::kPointsToInches;
constexpr Rule kAuto = Rule::kAuto;
constexpr Rule kPosition = Rule::kPosition;
constexpr Rule kZeroPair = Rule::kZeroPair;
constexpr FixedSource kLiteral = FixedSource::kLiteral;
constexpr bool Y = true;
constexpr bool N = false;

// ---- Layout family: EPS2PSFILTER, JPEG2PDF, TIFF2PDF ------------------------

struct LayoutRow {
  ConversionRow row;
  bool in_step[kLayoutColumns];  // EPS, JPEG, TIFF
};

const LayoutRow kLayoutRows[] = {
    {{"CONSTRAINPROPORTIONS", "CONTRAINPROPORTION", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"PAGESIZEX", "FORCEPAGESIZEX", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"PAGESIZEY", "FORCEPAGESIZEY", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"IMAGEABLEAREA_URX", "IMAGEEABLESIZEURX", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"IMAGEABLEAREA_URY", "IMAGEEABLESIZEURY", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"IMAGEABLEAREA_LLX", "IMAGEEABLESIZELLX", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"IMAGEABLEAREA_LLY", "IMAGEEABLESIZELLY", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"PAGESIZE_COMMAND", "PAGESIZE_COMMAND", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"AUTOROTATE", "AUTOROTATE", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"PAGESIZE_NAME", "DEFAULTPAGESIZE", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"SHRINKIMAGES", "SHRINKTOFIT", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"EXPANDIMAGES", "FITTOPAGE", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"FORCESOURCESIZE", "CUSTOMSIZE", "ORIGINALSIZE", kFlagPair, "1"}, {Y, Y, Y}},
    {{"SOURCESIZEX", "ORIGINALWIDTH", nullptr, kPointsToInches, nullptr}, {Y, Y, Y}},
    {{"SOURCESIZEY", "ORIGINALHEIGHT", nullptr, kPointsToInches, nullptr}, {Y, Y, Y}},
    {{"FORCESOURCESIZEX", "ORIGINALWIDTHOPTION", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"FORCESOURCESIZEY", "ORIGINALHEIGHTOPTION", nullptr, kCopy, nullptr}, {Y, Y, Y}},
    {{"FORCE_RESOLUTION", "FORCERESOLUTION", nullptr, kCopy, nullptr}, {N, Y, Y}},
    {{"RESOLUTION", "RESOLUTION", nullptr, kCopy, nullptr}, {N, Y, Y}},
    {{"IMAGEPOSITION", "IMAGEPOSITION", nullptr, kPosition, nullptr}, {Y, Y, Y}},
    {{"CUSTOMPAGESIZE", "CUSTOMPAGEWIDTH", "CUSTOMPAGEHEIGHT", kZeroPair, nullptr}, {Y, Y, Y}},
};

// nullptr: the key is not written for that filter.
struct LayoutFixed {
  const char* key;
  const char* value[kLayoutColumns];  // EPS, JPEG, TIFF
};

const LayoutFixed kLayoutFixed[] = {
    {"OUTPUTFILETYPEPDF", {"0", "1", "1"}},
    {"OUTPUTFILETYPEPS", {"1", "0", "0"}},
    {"OUTPUTFILETYPETIFF", {nullptr, nullptr, "0"}},
    {"SELECTEDDISTILLERPROFILE", {"", "", ""}},
    {"COMBINEALLFILES", {"0", "0", "0"}},
    {"SCALETOPRINT", {"0", "0", "0"}},
    {"FORCEAUTOSCALE", {"0", "0", "0"}},
    {"ORIENTATIONPOTRAIT", {"1", "1", "1"}},
    {"ORIENTATIONLANDSCAPE", {"0", "0", "0"}},
    {"ORIGINALWIDTHUNIT", {"inch", "inch", "inch"}},
    {"ORIGINALHEIGHTUNIT", {"inch", "inch", "inch"}},
    {"CUSTOMPAGETUNIT", {"0", "0", "0"}},
};

// ---- Image position --------------------------------------------------------

struct PositionRow {
  const char* legacy;
  const char* text;
};

const PositionRow kImagePositions[] = {
    {"0", "Bottom left"},  {"1", "Top left"}, {"2", "Top right"},
    {"3", "Bottom right"}, {"4", "Center"},
};

// ---- TIFFITFILTER ----------------------------------------------------------

const ConversionRow kTiffItRows[] = {
    {"RESOLUTION", "RESOLUTIONDPI", nullptr, kCopy, nullptr},
    {"AUTORESOLUTION", "RESOLUTIONDPI", nullptr, kAuto, nullptr},
    {"ANTIALIASING", "NEARESTNEIGHBOR", "BILINEAR", kFlagPair, "0"},
    {"COMPRESSION", "COMPRESSIONNONE", "COMPRESSIONRLE", kFlagPair, "0"},
};

const FixedSetting kTiffItFixed[] = {
    {"OUTPUTFILETYPEPDF", "0", kLiteral},
    {"OUTPUTFILETYPEPS", "1", kLiteral},
    {"SELECTEDDISTILLERPROFILE", "", kLiteral},
    {"COMBINEALLFILES", "0", kLiteral},
};

// ---- ONEBITTIFF ------------------------------------------------------------

const ConversionRow kOneBitTiffRows[] = {
    {"CURFILENAMEPATTERN", "FILENAMESTRUCTURE", nullptr, kCopy, nullptr},
    {"FILENAMEPATTERN", "FILENAMESTRUCTURE", nullptr, kCopy, nullptr},
    {"EXTRACTFILESPACEFROMHEADER", "EXTRACTINFO", nullptr, kCopy, nullptr},
    {"ANALYZELEFTTORIGHT", "LEFTTORIGHT", "RIGHTTOLEFT", kFlagPairOtherFirst, "0"},
    {"PSORPDF", "OUTPUTFILETYPEPS", "OUTPUTFILETYPEPDF", kFlagPairOtherFirst, "0"},
};

const FixedSetting kOneBitTiffFixed[] = {
    {"SELECTEDDISTILLERPROFILE", "", kLiteral},
    {"COMBINEALLFILES", "0", kLiteral},
    {"NOOFFILES", "4", kLiteral},
};

// ---- CTLWFILTER ------------------------------------------------------------

const ConversionRow kCtlwRows[] = {
    {"RESOLUTION", "RESOLUTIONVALUE", nullptr, kCopy, nullptr},
    {"AUTORESOLUTION", "RESOLUTIONVALUE", nullptr, kAuto, nullptr},
};

const FixedSetting kCtlwFixed[] = {
    {"OUTPUTFILETYPEPDF", "0", kLiteral},
    {"OUTPUTFILETYPEPS", "1", kLiteral},
    {"SELECTEDDISTILLERPROFILE", "", kLiteral},
};

// ---- EXPORTPS and PDF2GO ---------------------------------------------------

const ConversionRow kExportPsRows[] = {
    {"RESOLUTION", "RESOLUTIONVALUE", nullptr, kCopy, nullptr},
    {"AUTORESOLUTION", "RESOLUTIONVALUE", nullptr, kAuto, nullptr},
    {"OUTPUTTYPE", "OUTPUTFILETYPEPS", "OUTPUTFILETYPEPDF", kFlagPairOtherFirst, "0"},
};

const FixedSetting kExportPsFixed[] = {
    {"SELECTEDDISTILLERPROFILE", "", kLiteral},
};

// ---- PEXFILTER -------------------------------------------------------------

const ConversionRow kPexFilterRows[] = {
    {"RESOLUTION", "RESOLUTIONDPI", nullptr, kCopy, nullptr},
    {"SAVEERRORLOG", "FORCEERRORREPORT", nullptr, kCopy, nullptr},
    {"SPECIFICATION", "FORCEPDFX1", "FORCEPDFX3", kFlagPair, "0"},
};

const FixedSetting kPexFilterFixed[] = {
    {"FORCEPDFX", nullptr, FixedSource::kPexFilterEnabled},
    {"OUTPUTFILETYPEPDF", "0", kLiteral},
    {"OUTPUTFILETYPEPS", "1", kLiteral},
    {"SELECTEDDISTILLERPROFILE", "", kLiteral},
    {"COMBINEALLFILES", "0", kLiteral},
    {"ERRORPATH", nullptr, FixedSource::kServerDirectory},
};

// ---- Filters without a conversion -----------------------------------------

const FixedSetting kMsOfficeFixed[] = {
    {"COLOR", "Color", kLiteral},
    {"PRINTSHADOWS", "205", kLiteral},
    {"FRAMESLIDES", "0", kLiteral},
    {"PRINTOUTPUTTYPE", "Slides", kLiteral},
    {"PRINTER", "Adobe PDF", FixedSource::kPrinterName},
    {"OUTPUTFILE", "PS", kLiteral},
    {"SCALETOFITPAGE", "0", kLiteral},
};

const FixedSetting kDcsFixed[] = {
    {"OUTPUTFILETYPEPDF", "0", kLiteral},
    {"OUTPUTFILETYPEPS", "1", kLiteral},
    {"SELECTEDDISTILLERPROFILE", "", kLiteral},
    {"COMBINEALLFILES", "0", kLiteral},
};

template <typename Prepared, typename Row, std::size_t N>
std::vector<Prepared> AsVector(const Row (&rows)[N]) {
  return std::vector<Prepared>(rows, rows + N);
}

template <std::size_t R, std::size_t F>
ConversionStep Step(const ConversionRow (&rows)[R], const FixedSetting (&fixed)[F]) {
  return ConversionStep{AsVector<PreparedRow>(rows), AsVector<PreparedFixed>(fixed)};
}

template <std::size_t F>
ConversionStep FixedOnlyStep(const FixedSetting (&fixed)[F]) {
  return ConversionStep{{}, AsVector<PreparedFixed>(fixed)};
}

wxString Wide(const char* ascii) {
  return ascii ? AsciiText(ascii) : wxString();
}

}  // namespace

PreparedRow::PreparedRow(const ConversionRow& row)
    : legacy_key(Wide(row.legacy_key)),
      key(Wide(row.key)),
      other_key(Wide(row.other_key)),
      rule(row.rule),
      on_value(Wide(row.on_value)) {}

PreparedFixed::PreparedFixed(const FixedSetting& setting)
    : key(Wide(setting.key)), value(Wide(setting.value)), source(setting.source) {}

ConversionStep LayoutStep(LayoutColumn column) {
  ConversionStep step;
  for (const LayoutRow& row : kLayoutRows) {
    if (row.in_step[column]) step.rows.emplace_back(row.row);
  }
  for (const LayoutFixed& fixed : kLayoutFixed) {
    if (fixed.value[column]) {
      step.fixed.emplace_back(FixedSetting{fixed.key, fixed.value[column], kLiteral});
    }
  }
  return step;
}

const ConversionStep& EpsStep() {
  static const ConversionStep step = LayoutStep(kEpsColumn);
  return step;
}
const ConversionStep& JpegStep() {
  static const ConversionStep step = LayoutStep(kJpegColumn);
  return step;
}
const ConversionStep& TiffStep() {
  static const ConversionStep step = LayoutStep(kTiffColumn);
  return step;
}
const ConversionStep& TiffItStep() {
  static const ConversionStep step = Step(kTiffItRows, kTiffItFixed);
  return step;
}
const ConversionStep& OneBitTiffStep() {
  static const ConversionStep step = Step(kOneBitTiffRows, kOneBitTiffFixed);
  return step;
}
const ConversionStep& CtlwStep() {
  static const ConversionStep step = Step(kCtlwRows, kCtlwFixed);
  return step;
}
const ConversionStep& ExportPsStep() {
  static const ConversionStep step = Step(kExportPsRows, kExportPsFixed);
  return step;
}
const ConversionStep& PexFilterStep() {
  static const ConversionStep step = Step(kPexFilterRows, kPexFilterFixed);
  return step;
}

const ConversionStep& MsOfficeStep() {
  static const ConversionStep step = FixedOnlyStep(kMsOfficeFixed);
  return step;
}
const ConversionStep& DcsStep() {
  static const ConversionStep step = FixedOnlyStep(kDcsFixed);
  return step;
}

const wxString* ImagePositionText(const wxString& legacy) {
  static const std::vector<std::pair<wxString, wxString>> kWide = [] {
    std::vector<std::pair<wxString, wxString>> wide;
    for (const PositionRow& row : kImagePositions)
      wide.emplace_back(Wide(row.legacy), Wide(row.text));
    return wide;
  }();
  for (const auto& [digit, text] : kWide) {
    if (legacy == digit) return &text;
  }
  return nullptr;
}
