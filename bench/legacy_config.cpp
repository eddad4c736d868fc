#include "bench/legacy_config.h"

#include <iterator>

namespace bench {

namespace {

template <typename T, std::size_t N>
const T& Pick(Random& random, const T (&table)[N]) {
  return table[random.Below(static_cast<std::uint32_t>(N))];
}

// `count` different rows of a table, from a random row on.
template <typename T, std::size_t N, typename Visit>
void PickDistinct(Random& random, const T (&table)[N], int count, Visit visit) {
  std::size_t first = random.Below(static_cast<std::uint32_t>(N));
  for (int i = 0; i < count && static_cast<std::size_t>(i) < N; ++i) visit(table[(first + i) % N]);
}

const char* const kLogicalPrinters[] = {
    "Hold", "Print Queue 1", "Direct to engine", "print-direct", "Hold for proof", "PRINT",
};

struct Server {
  const char* address;
  const char* name;
};

// A real installation names a handful of servers, most of them this one.
const Server kServers[] = {
    {"", ""},         {"localhost", "PRESS-01"}, {"127.0.0.1", ""},
    {"", "PRESS-02"}, {"PRESS-02", "PRESS-02"},  {"192.168.10.20", "RIP-A"},
};

// The legacy filters that carry a settings section, with settings as the
// legacy service wrote them.
struct FilterSection {
  const char* id;
  const char* label;
  const char* section;
  const char* settings;
};

const FilterSection kFilterSections[] = {
    {"{3F2B6A10-5C1D-4E8A-9B7F-0A1C2D3E4F50}", "EPS to PostScript", "EPS2PSFILTER",
     "<AUTOROTATE>1</AUTOROTATE><SHRINKIMAGES>1</SHRINKIMAGES><EXPANDIMAGES>0</EXPANDIMAGES>"
     "<SOURCESIZEX>842</SOURCESIZEX><SOURCESIZEY>1190.5</SOURCESIZEY>"
     "<IMAGEPOSITION>1</IMAGEPOSITION>"},
    {"{9D3A4B5C-6D7E-4F80-A192-334455667788}", "CT/LW", "CTLWFILTER",
     "<AUTORESOLUTION>1</AUTORESOLUTION><RESOLUTION>1200</RESOLUTION>"},
    {"{1F5C6D7E-8F90-41A2-C3B4-5566778899AA}", "TIFF/IT", "TIFFITFILTER",
     "<RESOLUTION>2400</RESOLUTION><ANTIALIASING>1</ANTIALIASING><COMPRESSION>0</COMPRESSION>"},
    {"{2A6D7E8F-9011-42B3-D4C5-66778899AABB}", "1-Bit TIFF", "ONEBITTIFF",
     "<FILENAMEPATTERN>%J_%C.tif</FILENAMEPATTERN><ANALYZELEFTTORIGHT>0</ANALYZELEFTTORIGHT>"
     "<PSORPDF>1</PSORPDF>"},
    {"{0E4B5C6D-7E8F-4091-B2A3-445566778899}", "PDF Export", "PEXFILTER",
     "<RESOLUTION>1200</RESOLUTION><SAVEERRORLOG>1</SAVEERRORLOG>"
     "<SPECIFICATION>0</SPECIFICATION>"},
    {"{6B1E2C3D-7A8B-4C9D-8E0F-112233445566}", "JPEG to PDF", "JPEG2PDF",
     "<CONSTRAINPROPORTIONS>1</CONSTRAINPROPORTIONS><PAGESIZE_NAME>Letter</PAGESIZE_NAME>"
     "<FORCESOURCESIZE>1</FORCESOURCESIZE><SOURCESIZEX>612</SOURCESIZEX>"
     "<SOURCESIZEY>792</SOURCESIZEY><RESOLUTION>300</RESOLUTION>"
     "<IMAGEPOSITION>4</IMAGEPOSITION>"},
    {"{7C2F3D4E-8B9C-4DAE-9F10-223344556677}", "TIFF to PDF", "TIFF2PDF",
     "<SOURCESIZEX>595.3</SOURCESIZEX><SOURCESIZEY>842</SOURCESIZEY>"
     "<FORCE_RESOLUTION>1</FORCE_RESOLUTION><RESOLUTION>600</RESOLUTION>"
     "<IMAGEPOSITION>0</IMAGEPOSITION><CUSTOMPAGESIZE>1</CUSTOMPAGESIZE>"},
    {"{4C8F9A0B-1C2D-43E4-F5A6-8899AABBCCDD}", "DCS 2.0", "DCS2FILTER",
     "<RESOLUTION>2400</RESOLUTION>"},
    {"{5D9A0B1C-2D3E-44F5-A6B7-99AABBCCDDEE}", "Export PostScript", "EXPORTPS",
     "<AUTORESOLUTION>0</AUTORESOLUTION><RESOLUTION>600</RESOLUTION>"
     "<OUTPUTTYPE>1</OUTPUTTYPE>"},
    {"{3B7E8F90-A1B2-45C3-D4E5-778899AABBCC}", "PDF to Go", "PDF2GO",
     "<RESOLUTION>300</RESOLUTION>"},
};

// Containers known by identifier alone: office documents and PDF to
// PostScript (its identifier, like the office ones, ends in a line feed).
const char* const kOfficeIds[] = {
    "{8530FDC1-4FBB-4BD3-A116-33186DE16718}",
    "{728E7740-D6A7-4D5D-8A68-98DDF21E4132}",
    "{AE31FFA3-8524-4734-B35D-E6DB6FE9A371}",
    "{68FC3B4A-62B7-11D6-99CD-00E08101E712}",
};
const char kPdf2PsId[] = "{CDD70909-DACE-499B-9186-B6088CD46376}";

const char* const kDriverSettings[] = {
    "<NumCopies>2</NumCopies>",         "<numcopies>500</numcopies>",
    "<Duplex>DuplexNoTumble</Duplex>",  "<MediaType>Coated</MediaType>",
    "<OutputBin>Stacker</OutputBin>",   "<Collate>True</Collate>",
    "<Resolution>1200dpi</Resolution>", "<InputSlot>Tray2</InputSlot>",
};

const char* const kTemplates[] = {"ImposeTemplate.2",  "ImposeTemplate.3", "ImposeTemplate.41",
                                  "imposetemplate.61", "ImposeTemplate.6", "ImposeTemplate.8"};
const char* const kBindings[] = {"SaddleStitch", "Perfect", "GangUpRepeat", "GangUpCollate",
                                 "NestedSaddleStitch"};

std::string Element(const char* name, const std::string& content) {
  return std::string("<") + name + ">" + content + "</" + name + ">";
}

std::string Container(const char* id, const char* label, bool enabled, const std::string& body) {
  return std::string("    <FILTERID>") + id + "\n<NAME>" + label + "</NAME><ENABLED>" +
         (enabled ? "1" : "0") + "</ENABLED>" + body + "</FILTERID>\n";
}

std::string FolderSettings(Random& random, const std::string& folder_path) {
  const Server& server = Pick(random, kServers);
  std::string body = Element("LogicalPrinter", Pick(random, kLogicalPrinters));
  if (*server.address) body += Element("ServerAddr", server.address);
  if (*server.name) body += Element("ServerName", server.name);
  if (random.Percent(60)) body += Element("WorkFolder", folder_path + "\\Work\\Spool");
  return "  " + Element("FolderSettings", body) + "\n";
}

// Most folders keep the default chain: no filter at all, or filters that
// were set up once and then switched off.
std::string Filters(Random& random) {
  int kind = random.Below(100);
  std::string containers;
  if (kind < 30) return containers;
  int count = 1 + random.Below(3);
  bool enabled = kind >= 45;
  PickDistinct(random, kFilterSections, count, [&](const FilterSection& filter) {
    std::string section = Element(filter.section, filter.settings);
    containers += Container(filter.id, filter.label, enabled && random.Percent(80), section);
  });
  if (random.Percent(15)) {
    PickDistinct(random, kOfficeIds, 2, [&](const char* id) {
      containers += Container(id, "Office documents", random.Percent(70), "");
    });
  }
  if (random.Percent(10)) containers += Container(kPdf2PsId, "PDF to PostScript", false, "");
  return "  <FILTERS>\n" + containers + "  </FILTERS>\n";
}

std::string DriverSettings(Random& random) {
  if (random.Percent(40)) return std::string();
  std::string body;
  int count = 1 + random.Below(4);
  PickDistinct(random, kDriverSettings, count, [&](const char* setting) { body += setting; });
  return "  " + Element("DriverSettings", body) + "\n";
}

std::string Imposition(Random& random) {
  if (!random.Percent(25)) return std::string();
  std::string properties = Element("FixedDuplexValue", "DuplexTumble") + Element("PageSize", "A4") +
                           Element("ZeroMarginsSupport", "TRUE") + Element("ZeroMargins", "1");
  properties += random.Percent(70) ? Element("Template", Pick(random, kTemplates))
                                   : Element("ImpInfoFile", "custom.imp");
  std::string layout = Element("x", std::to_string(1 + random.Below(4))) +
                       Element("y", std::to_string(1 + random.Below(2))) +
                       Element("HorizontalGap0", "0.25") + Element("VerticalGap0", "0");
  std::string marks = Element("ShowCropMarks", "YES") + Element("ShowFoldLines", "YES") +
                      Element("ShowJobName", "NO") + Element("ShowSheetInfo", "NO") +
                      Element("ShowDateAndTime", "NO");
  std::string info = Element("Binding", Pick(random, kBindings)) + Element("Edge", "Left") +
                     Element("ScaleFactor", "1") + Element("Orientation", "Portrait") +
                     Element("Creep", "0.5") + Element("Layout", layout) +
                     Element("PrinterMarks", marks);
  std::string delivery = Element("OutputSequence", "Reverse") + Element("SurfaceOrder", "FACEUP");
  return "  " + Element("ImpositionProperties", properties) + "\n  " + Element("ImposeInfo", info) +
         "\n  " + Element("ImposeDeliveryInfo", delivery) + "\n";
}

}  // namespace

std::uint64_t Random::Next() {
  std::uint64_t z = (state_ += 0x9E3779B97F4A7C15ull);
  z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
  z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
  return z ^ (z >> 31);
}

std::string MakeFolderConfig(Random& random, const std::string& folder_path) {
  std::string xml = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<HotFolderConfiguration>\n";
  xml += FolderSettings(random, folder_path);
  if (random.Percent(30)) {
    xml += "  " +
           Element("FILTERSETTINGS", Element("PDFCONVERSION", random.Percent(50) ? "1" : "0")) +
           "\n";
  }
  xml += Filters(random);
  xml += DriverSettings(random);
  xml += Imposition(random);
  return xml + "</HotFolderConfiguration>\n";
}

}  // namespace bench
