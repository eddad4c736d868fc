#include "legacy/folder_reader.h"

#include <gtest/gtest.h>
#include <wx/sstream.h>

#include <optional>
#include <string>
#include <utility>

#include "tests/legacy_fixture.h"

namespace {

const std::string kOffice[] = {
    "{8530FDC1-4FBB-4BD3-A116-33186DE16718}\n", "{728E7740-D6A7-4D5D-8A68-98DDF21E4132}\n",
    "{AE31FFA3-8524-4734-B35D-E6DB6FE9A371}\n", "{68FC3B4A-62B7-11D6-99CD-00E08101E712}\n"};
const std::string kPdf2Ps = "{CDD70909-DACE-499B-9186-B6088CD46376}\n";
const std::string kXrx = "{02AC69D4-CAEE-47E1-912E-95B0C9E8D86A}\n";
const std::string kXrxBare = "63EE9F15-C7B1-43C8-9958-E9EFE972EA00";

// A filter container as the legacy service wrote it: identifier text, a
// name, the enable text, then the filter's settings section if it has one.
std::string Container(const std::string& id, const std::string& enable,
                      const std::string& section = "") {
  return "<FILTERID>" + id + "<Name>n</Name><Enabled>" + enable + "</Enabled>" + section +
         "</FILTERID>";
}

std::string Doc(const std::string& body) {
  return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<HotFolder>\n" + body + "\n</HotFolder>\n";
}

// The map's entries as "key=value;...", in insertion order; empty values
// left out unless `all`.
std::string Dump(const SettingsMap& map, bool all = false) {
  std::string out;
  for (const auto& [key, value] : map) {
    if (all || !value.empty()) out += (key + "=" + value + ";").utf8_string();
  }
  return out;
}

class FolderReaderTest : public ::testing::Test {
 protected:
  // Lists folder D:\<name> (D:\F<n> when unnamed) with `flag`, writes its
  // folder.cfg unless null and reads it.
  bool Read(std::optional<std::string> cfg, const char* flag = "1", std::string name = "") {
    if (name.empty()) name = "F" + std::to_string(engine_.m_Folders.size());
    if (cfg) WriteFolderConfig(prefix_, name, *cfg);
    engine_.m_Folders.Add("D:\\" + name);
    engine_.m_EnabledFlags.Add(flag);
    return ReadFolderConfiguration(engine_, engine_.m_Folders.size() - 1);
  }

  TempPrefix prefix_;
  CHFMigrator engine_;
};

TEST(FindElement, SearchOrder) {
  const std::pair<const char*, const char*> cases[] = {
      // The "id" of the first "x" found; "" for none.
      {"<r><a><x id='deep'/></a><x id='direct'/></r>", "direct"},
      {"<r><a><b><c><x id='first'/></c></b></a><d><x id='later'/></d></r>", "first"},
      {"<r><a><b><x id='b'/></b><x id='a'/></a></r>", "a"},
      {"<r><a/><b><c><x id='deep'/></c></b><d><x id='later'/></d></r>", "deep"},
      {"<x><y/></x>", ""},
      {"<r><X id='upper'/></r>", ""},
      {"<r>x<!--x--><?x x?><y/></r>", ""},
  };
  for (const auto& [xml, id] : cases) {
    wxXmlDocument doc;
    wxStringInputStream in(xml);
    ASSERT_TRUE(doc.Load(in)) << xml;
    wxXmlNode* found = FindElement(doc.GetRoot(), "x");
    EXPECT_EQ(found ? found->GetAttribute("id") : "", id) << xml;
  }
}

// Each case's folder, impose, VDP and driver settings, "|" between them.
TEST_F(FolderReaderTest, Sections) {
  const std::pair<std::string, const char*> cases[] = {
      // The folder path is set before reading; an empty element keeps it.
      // Text is kept exactly; nested sections, comments and loose text are
      // not settings.
      {Doc("<FolderSettings><Sp>  two words \n</Sp><HFFolderPath/><Nested><In>v</In></Nested>"
           "<New>n</New><!--c-->loose text</FolderSettings>"),
       "HFFolderPath=D:\\F0;Sp=  two words \n;New=n;|||"},
      // A direct child of the root wins over a deeper one found first, and a
      // folder path in it overrides the listed one.
      {Doc("<O><FolderSettings><Q>deep</Q></FolderSettings></O><FolderSettings><Q>top</Q>"
           "<HFFolderPath>E:\\x</HFFolderPath></FolderSettings>"),
       "HFFolderPath=E:\\x;Q=top;|||"},
      // Impose sections are flattened from their known groups only.
      {Doc("<ImposeInfoVDP><PaperSize><P>7</P></PaperSize><SheetMargin><M>8</M></SheetMargin>"
           "</ImposeInfoVDP><ImposeInfo><A>1</A><Layout><B>2</B><A>3</A></Layout><SheetSize><C>4"
           "</C></SheetSize><Other><D>5</D></Other><PrinterMarks><E>6</E></PrinterMarks>"
           "</ImposeInfo><DriverSettings><NumCopies>2</NumCopies></DriverSettings>"),
       "HFFolderPath=D:\\F2;|A=3;B=2;C=4;E=6;|P=7;M=8;|NumCopies=2;"},
      {"<?xml version=\"1.0\" encoding=\"windows-1252\"?><r><FolderSettings><N>caf\xe9"
       "</N></FolderSettings></r>",
       "HFFolderPath=D:\\F3;N=caf\xc3\xa9;|||"},
  };
  for (const auto& [cfg, dump] : cases) {
    EXPECT_TRUE(Read(cfg));
    EXPECT_EQ(Dump(engine_.m_FolderSettings) + "|" + Dump(engine_.m_ImposeInfo) + "|" +
                  Dump(engine_.m_ImposeInfoVDP) + "|" + Dump(engine_.m_DriverSettings),
              dump)
        << cfg;
  }
}

TEST_F(FolderReaderTest, FilterIdentifiers) {
  const std::string most = Container(kOffice[0], "2147483647");
  const std::pair<std::string, const char*> cases[] = {
      {Container(kPdf2Ps, "1"), "PDF2PS=1;MICROSOFT=0;"},
      {Container(kPdf2Ps.substr(0, 38), "1"), "MICROSOFT=0;"},  // no line feed
      {Container(kPdf2Ps, " 1"), "PDF2PS=0;MICROSOFT=0;"},
      {Container(kXrx, "1"), "XRX=1;MICROSOFT=0;"},
      {Container(kXrxBare + "\n   ", "1"), "XRX=1;MICROSOFT=0;"},
      {Container("{" + kXrxBare + "}\n", "1"), "MICROSOFT=0;"},
      // Comments and blank text are not children that count.
      {"<FILTERID><!--by hand-->" + kPdf2Ps +
           "<?pi x?>\n  <Name/>\n  <!--x--><Enabled><!--c-->1</Enabled></FILTERID>",
       "PDF2PS=1;MICROSOFT=0;"},
      // Containers too small to hold an enable text are skipped.
      {"<FILTERID/><FILTERID>" + kPdf2Ps + "<Name/></FILTERID>" + Container(kXrx, "1"),
       "XRX=1;MICROSOFT=0;"},
      // The walk stays among the siblings of the first FILTERID.
      {"<F><FILTERID>" + kPdf2Ps + "<a/><e>1</e></FILTERID><O>" + kXrx + "<a/><e>1</e></O></F><M>" +
           Container(kOffice[0], "1") + "</M>",
       "PDF2PS=1;XRX=1;MICROSOFT=0;"},
      {Container(kOffice[0], "1") + Container(kOffice[1], "0"), "MICROSOFT=1;"},
      {Container(kOffice[2], "0") + Container(kOffice[3], "0"), "MICROSOFT=0;"},
      {Container(kOffice[0], " -1") + Container(kOffice[3], "\n+2x"), "MICROSOFT=1;"},
      // "yes" holds no number; it must not count the -1 read before it again.
      {Container(kOffice[0], "2") + Container(kOffice[1], "-1") + Container(kOffice[2], "yes"),
       "MICROSOFT=1;"},
      {most + most, "MICROSOFT=1;"},  // counts do not wrap
  };
  for (const auto& [body, dump] : cases) {
    EXPECT_TRUE(Read(Doc(body)));
    EXPECT_EQ(Dump(engine_.m_FilterEnable), dump) << body;
  }
}

TEST_F(FolderReaderTest, TenFilterEnableTexts) {
  // DCS2FILTER has no section and JPEG2PDF no enable text: neither may
  // borrow the "1" of the filter before it.
  const std::pair<const char*, const char*> filters[] = {
      {"ONEBITTIFF", "1"}, {"CTLWFILTER", "1"},  {"DCS2FILTER", nullptr}, {"EPS2PSFILTER", "0"},
      {"EXPORTPS", " 1 "}, {"JPEG2PDF", ""},     {"PDF2GO", "1"},         {"PEXFILTER", "2"},
      {"TIFF2PDF", "0"},   {"TIFFITFILTER", "1"}};
  std::string body;
  for (const auto& [name, enable] : filters) {
    std::string section = std::string("<") + name + "><K>v</K></" + name + ">";
    if (enable && *enable) body += Container("id\n", enable, section);
    if (enable && !*enable) body += "<FILTERID>id\n<a/><e/>" + section + "</FILTERID>";
  }
  EXPECT_TRUE(Read(Doc(body)));
  // Entries come in the order of the table of legacy filters.
  EXPECT_EQ(Dump(engine_.m_FilterEnable, true),
            "EPS2PSFILTER=0;JPEG2PDF=;TIFF2PDF=0;TIFFITFILTER=1;ONEBITTIFF=1;CTLWFILTER=1;"
            "EXPORTPS= 1 ;PEXFILTER=2;PDF2GO=1;DCS2FILTER=;MICROSOFT=0;");
  EXPECT_EQ(Dump(engine_.m_TiffItFilter) + Dump(engine_.m_Dcs2Filter, true), "K=v;");
}

TEST_F(FolderReaderTest, UnreadableDocumentsLeaveOnlyTheFolderPath) {
  // The deep and the expanding document are bounded by the loader; here
  // they show the reader loads through it.
  const std::string settings = "<FolderSettings><Q>x</Q></FolderSettings>";
  const std::string documents[] = {Doc(NestedXml(300, settings)),
                                   ExpandingXml(settings),
                                   "",
                                   "not xml",
                                   "<r><FolderSettings><Q>x</Q></r>",
                                   "<r>" + settings + "</r><second/>"};
  for (const std::string& cfg : documents) {
    engine_.m_DriverSettings.GetOrInsert("left") = "over";
    EXPECT_TRUE(Read(cfg));
    EXPECT_EQ(Dump(engine_.m_FolderSettings) + Dump(engine_.m_DriverSettings, true) +
                  Dump(engine_.m_FilterEnable, true),
              "HFFolderPath=D:\\F" + std::to_string(engine_.m_Folders.size() - 1) + ";")
        << cfg.substr(0, 60);
  }
}

// Nothing of one folder may reach the next, whatever map it is in.
TEST_F(FolderReaderTest, FoldersReadInARowAreIsolated) {
  ASSERT_TRUE(
      Read(Doc("<FolderSettings><Server>s1</Server></FolderSettings>" + Container(kPdf2Ps, "1") +
               Container(kXrx, "1") + "<DriverSettings><NumCopies>2</NumCopies></DriverSettings>"),
           "0", "First"));
  EXPECT_FALSE(engine_.m_CurrentEnabled);
  engine_.m_PexFilterConv.GetOrInsert("converted") = "for the first folder";

  ASSERT_TRUE(Read(Doc("<FolderSettings/>"), "2", "Second"));
  EXPECT_TRUE(engine_.m_CurrentEnabled);
  EXPECT_EQ(Dump(engine_.m_FolderSettings) + Dump(engine_.m_FilterEnable) +
                Dump(engine_.m_DriverSettings, true) + Dump(engine_.m_PexFilterConv, true),
            "HFFolderPath=D:\\Second;MICROSOFT=0;");

  // A folder without folder.cfg changes nothing at all.
  EXPECT_FALSE(Read(std::nullopt, "0", "Missing"));
  EXPECT_EQ(Dump(engine_.m_FolderSettings), "HFFolderPath=D:\\Second;");
  EXPECT_TRUE(engine_.m_CurrentEnabled);
}

}  // namespace
