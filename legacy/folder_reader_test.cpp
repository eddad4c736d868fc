#include "legacy/folder_reader.h"

#include <gtest/gtest.h>
#include <wx/sstream.h>

#include <string>
#include <vector>

#include "tests/temp_prefix.h"

namespace {

using MapMember = SettingsMap CHFMigrator::*;
const MapMember kEnable = &CHFMigrator::m_FilterEnable;
const MapMember kFolder = &CHFMigrator::m_FolderSettings;
const MapMember kImpose = &CHFMigrator::m_ImposeInfo;

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

// The map's non-empty entries as "key=value;...", in insertion order.
std::string Dump(const SettingsMap& map) {
  std::string out;
  for (const auto& [key, value] : map) {
    if (!value.empty()) out += (key + "=" + value + ";").utf8_string();
  }
  return out;
}

wxXmlNode* Parse(wxXmlDocument& doc, const std::string& xml) {
  wxStringInputStream in(wxString::FromUTF8(xml));
  EXPECT_TRUE(doc.Load(in));
  return doc.GetRoot();
}

class FolderReaderTest : public ::testing::Test {
 protected:
  // Lists folder D:\<name> with `flag`; writes its folder.cfg unless null.
  std::size_t AddFolder(const std::string& name, const std::string* cfg, const char* flag = "1") {
    if (cfg) prefix_.WriteFile(prefix_.Drive('d') / name / "[_KYR_HotFolder_]/folder.cfg", *cfg);
    engine_.m_Folders.Add("D:\\" + name);
    engine_.m_EnabledFlags.Add(flag);
    return engine_.m_Folders.size() - 1;
  }

  std::size_t Read(const std::string& cfg) {
    std::size_t index = AddFolder("F" + std::to_string(engine_.m_Folders.size()), &cfg);
    EXPECT_TRUE(ReadFolderConfiguration(engine_, index));
    return index;
  }

  TempPrefix prefix_;
  CHFMigrator engine_;
};

TEST(FindElement, SearchOrder) {
  struct {
    const char* xml;
    const char* found;  // the "id" of the first "x"; "" for none
  } cases[] = {
      {"<r><a><x id='deep'/></a><x id='direct'/></r>", "direct"},
      {"<r><a><b><c><x id='first-subtree'/></c></b></a><d><x id='later'/></d></r>",
       "first-subtree"},
      {"<r><a><b><x id='b'/></b><x id='a'/></a></r>", "a"},
      {"<r><a/><b><c><x id='deep'/></c></b><d><x id='later'/></d></r>", "deep"},
      {"<x><y/></x>", ""},
      {"<r><X id='upper'/></r>", ""},
      {"<r>x<!--x--><?x x?><y/></r>", ""},
  };
  for (const auto& c : cases) {
    wxXmlDocument doc;
    wxXmlNode* found = FindElement(Parse(doc, c.xml), "x");
    EXPECT_EQ(found ? found->GetAttribute("id") : "", c.found) << c.xml;
  }
}

TEST(ReadSection, ChildrenAndEarlierValues) {
  wxXmlDocument doc;
  SettingsMap map;
  map.GetOrInsert("Empty") = "earlier";
  map.GetOrInsert("Over") = "earlier";
  ReadSection(Parse(doc,
                    "<S><Sp>  two words \n</Sp><Empty/><Nested><In>v</In></Nested>"
                    "<New>n</New><!--c--><Over>o</Over>loose text</S>"),
              map);
  ReadSection(nullptr, map);
  EXPECT_EQ(Dump(map), "Empty=earlier;Over=o;Sp=  two words \n;New=n;");
  EXPECT_EQ(map.Size(), 4u);
}

TEST_F(FolderReaderTest, SectionsAndFilterIdentifiers) {
  struct {
    const char* name;
    std::string cfg;
    MapMember map;
    const char* dump;
  } cases[] = {
      {"folder path set before reading", Doc("<FolderSettings><Q>hold</Q></FolderSettings>"),
       kFolder, "HFFolderPath=D:\\F0;Q=hold;"},
      {"folder path overridden",
       Doc("<FolderSettings><HFFolderPath>E:\\x</HFFolderPath></FolderSettings>"), kFolder,
       "HFFolderPath=E:\\x;"},
      {"direct child of the root wins",
       Doc("<O><FolderSettings><Q>deep</Q></FolderSettings></O><FolderSettings><Q>top</Q>"
           "</FolderSettings>"),
       kFolder, "HFFolderPath=D:\\F2;Q=top;"},
      {"PDF2PS", Doc(Container(kPdf2Ps, "1")), kEnable, "PDF2PS=1;MICROSOFT=0;"},
      {"PDF2PS without line feed", Doc(Container(kPdf2Ps.substr(0, 38), "1")), kEnable,
       "MICROSOFT=0;"},
      {"PDF2PS not exactly 1", Doc(Container(kPdf2Ps, " 1")), kEnable, "PDF2PS=0;MICROSOFT=0;"},
      {"XRX braces", Doc(Container(kXrx, "1")), kEnable, "XRX=1;MICROSOFT=0;"},
      {"XRX bare with trailing space", Doc(Container(kXrxBare + "\n   ", "1")), kEnable,
       "XRX=1;MICROSOFT=0;"},
      {"XRX bare in braces", Doc(Container("{" + kXrxBare + "}\n", "1")), kEnable, "MICROSOFT=0;"},
      {"comments and blank text do not count",
       Doc("<FILTERID><!--by hand-->" + kPdf2Ps +
           "<?pi x?>\n  <Name/>\n  <!--x--><Enabled><!--c-->1</Enabled></FILTERID>"),
       kEnable, "PDF2PS=1;MICROSOFT=0;"},
      {"small containers skipped",
       Doc("<FILTERID/><FILTERID>" + kPdf2Ps + "<Name/></FILTERID>" + Container(kXrx, "1")),
       kEnable, "XRX=1;MICROSOFT=0;"},
      {"walk stays among siblings of the first FILTERID",
       Doc("<F><FILTERID>" + kPdf2Ps + "<a/><e>1</e></FILTERID><O>" + kXrx +
           "<a/><e>1</e></O></F><M>" + Container(kOffice[0], "1") + "</M>"),
       kEnable, "PDF2PS=1;XRX=1;MICROSOFT=0;"},
      {"office 1 and 0", Doc(Container(kOffice[0], "1") + Container(kOffice[1], "0")), kEnable,
       "MICROSOFT=1;"},
      {"office 0 and 0", Doc(Container(kOffice[2], "0") + Container(kOffice[3], "0")), kEnable,
       "MICROSOFT=0;"},
      {"office with space and signs",
       Doc(Container(kOffice[0], " -1") + Container(kOffice[3], "\n+2x")), kEnable, "MICROSOFT=1;"},
      // "yes" holds no number; it must not count the -1 read before it again.
      {"office text not a number",
       Doc(Container(kOffice[0], "2") + Container(kOffice[1], "-1") + Container(kOffice[2], "yes")),
       kEnable, "MICROSOFT=1;"},
      {"office counts do not wrap",
       Doc(Container(kOffice[0], "2147483647") + Container(kOffice[1], "2147483647")), kEnable,
       "MICROSOFT=1;"},
      {"ImposeInfo flattened",
       Doc("<ImposeInfo><A>1</A><Layout><B>2</B><A>3</A></Layout><SheetSize><C>4</C></SheetSize>"
           "<Other><D>5</D></Other><PrinterMarks><E>6</E></PrinterMarks></ImposeInfo>"),
       kImpose, "A=3;B=2;C=4;E=6;"},
      {"ImposeInfoVDP flattened",
       Doc("<ImposeInfoVDP><PaperSize><P>7</P></PaperSize><SheetMargin><M>8</M></SheetMargin>"
           "</ImposeInfoVDP><ImposeInfo><Z>1</Z></ImposeInfo>"),
       &CHFMigrator::m_ImposeInfoVDP, "P=7;M=8;"},
      {"driver settings", Doc("<DriverSettings><NumCopies>2</NumCopies></DriverSettings>"),
       &CHFMigrator::m_DriverSettings, "NumCopies=2;"},
      {"declared single-byte encoding",
       "<?xml version=\"1.0\" encoding=\"windows-1252\"?><r><FolderSettings><N>caf\xe9"
       "</N></FolderSettings></r>",
       kFolder, "HFFolderPath=D:\\F20;N=caf\xc3\xa9;"},
  };
  for (const auto& c : cases) {
    Read(c.cfg);
    EXPECT_EQ(Dump(engine_.*c.map), c.dump) << c.name;
  }
}

TEST_F(FolderReaderTest, TenFilterEnableTexts) {
  const char* names[] = {"ONEBITTIFF", "CTLWFILTER", "DCS2FILTER", "EPS2PSFILTER", "EXPORTPS",
                         "JPEG2PDF",   "PDF2GO",     "PEXFILTER",  "TIFF2PDF",     "TIFFITFILTER"};
  // DCS2FILTER has no section and JPEG2PDF no enable text: neither may
  // borrow the "1" of the filter before it.
  const char* enable[] = {"1", "1", nullptr, "0", " 1 ", "", "1", "2", "0", "1"};
  std::string body, expected;
  for (int i = 0; i < 10; ++i) {
    std::string section = std::string("<") + names[i] + "><K>v</K></" + names[i] + ">";
    if (enable[i] && *enable[i]) body += Container("id\n", enable[i], section);
    if (enable[i] && !*enable[i]) body += "<FILTERID>id\n<a/><e/>" + section + "</FILTERID>";
    expected += std::string(names[i]) + "=" + (enable[i] ? enable[i] : "") + ";";
  }
  Read(Doc(body));
  std::string all;
  for (const auto& [key, value] : engine_.m_FilterEnable)
    all += (key + "=" + value + ";").utf8_string();
  EXPECT_EQ(all, expected + "MICROSOFT=0;");
  EXPECT_EQ(Dump(engine_.m_TiffItFilter), "K=v;");
  EXPECT_TRUE(engine_.m_Dcs2Filter.Empty());
}

TEST_F(FolderReaderTest, UnreadableDocumentsLeaveOnlyTheFolderPath) {
  const std::string settings = "<FolderSettings><Q>x</Q></FolderSettings>";
  std::string deep = settings;
  for (int i = 0; i < 300; ++i) deep = "<d>" + deep + "</d>";
  // Padded ahead of the references to stay within expat's own amplification
  // limit, yet 70 MiB once expanded.
  std::string expanding = "<!DOCTYPE r [<!ENTITY e '" + std::string(64 * 1024, 'e') + "'>]><r>" +
                          settings + "<!--" + std::string(1024 * 1024, 'p') + "-->";
  for (int i = 0; i < 1100; ++i) expanding += "&e;";
  expanding += "</r>";
  const std::string documents[] = {
      Doc(deep),
      Doc(settings + "<!--" + std::string(64u << 20, 'p') + "-->"),
      expanding,
      "",
      "not xml",
      "<r><FolderSettings><Q>x</Q></r>",
      "<r>" + settings + "</r><second/>",
  };
  for (const std::string& cfg : documents) {
    engine_.m_DriverSettings.GetOrInsert("left") = "over";
    std::size_t index = Read(cfg);
    EXPECT_EQ(Dump(engine_.m_FolderSettings), "HFFolderPath=D:\\F" + std::to_string(index) + ";")
        << cfg.substr(0, 60);
    EXPECT_TRUE(engine_.m_DriverSettings.Empty());
    EXPECT_TRUE(engine_.m_FilterEnable.Empty());
  }
}

// Nothing of one folder may reach the next, whatever map it is in.
TEST_F(FolderReaderTest, FoldersReadInARowAreIsolated) {
  std::string first =
      Doc("<FolderSettings><Server>s1</Server></FolderSettings>" + Container(kPdf2Ps, "1") +
          Container(kXrx, "1") + "<DriverSettings><NumCopies>2</NumCopies></DriverSettings>");
  std::string second = Doc("<FolderSettings/>");
  AddFolder("First", &first, "0");
  AddFolder("Second", &second, "2");
  ASSERT_TRUE(ReadFolderConfiguration(engine_, 0));
  EXPECT_FALSE(engine_.m_CurrentEnabled);
  engine_.m_PexFilterConv.GetOrInsert("converted") = "for the first folder";

  ASSERT_TRUE(ReadFolderConfiguration(engine_, 1));
  EXPECT_TRUE(engine_.m_CurrentEnabled);
  EXPECT_EQ(Dump(engine_.m_FolderSettings), "HFFolderPath=D:\\Second;");
  EXPECT_EQ(Dump(engine_.m_FilterEnable), "MICROSOFT=0;");
  EXPECT_TRUE(engine_.m_DriverSettings.Empty());
  EXPECT_TRUE(engine_.m_PexFilterConv.Empty());

  // A folder without folder.cfg changes nothing at all.
  std::size_t missing = AddFolder("Missing", nullptr, "0");
  EXPECT_FALSE(ReadFolderConfiguration(engine_, missing));
  EXPECT_EQ(Dump(engine_.m_FolderSettings), "HFFolderPath=D:\\Second;");
  EXPECT_TRUE(engine_.m_CurrentEnabled);
}

TEST_F(FolderReaderTest, LoopRecordsOneStatusPerFolder) {
  engine_.MigrateFolders();
  EXPECT_TRUE(engine_.m_Status.empty());

  std::string cfg = Doc("<FolderSettings/>");
  AddFolder("One", &cfg);
  AddFolder("Two", nullptr);
  AddFolder("Three", &cfg, "0");
  engine_.MigrateFolders();
  ASSERT_EQ(engine_.m_Status.size(), 3u);
  EXPECT_NE(engine_.m_Status[0], "Failed; File missing");
  EXPECT_EQ(engine_.m_Status[1], "Failed; File missing");
  EXPECT_NE(engine_.m_Status[2], "Failed; File missing");
}

}  // namespace
