#include "legacy/folder_reader.h"

#include <gtest/gtest.h>
#include <wx/sstream.h>

#include <string>
#include <vector>

#include "tests/temp_prefix.h"

namespace {

using MapMember = SettingsMap CHFMigrator::*;

const std::string kOffice1 = "{8530FDC1-4FBB-4BD3-A116-33186DE16718}\n";
const std::string kOffice2 = "{728E7740-D6A7-4D5D-8A68-98DDF21E4132}\n";
const std::string kOffice3 = "{AE31FFA3-8524-4734-B35D-E6DB6FE9A371}\n";
const std::string kOffice4 = "{68FC3B4A-62B7-11D6-99CD-00E08101E712}\n";
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

struct Expect {
  MapMember map;
  const char* key;
  const char* value;  // null: the key must be absent
};

struct FolderCase {
  const char* name;
  std::string cfg;
  std::vector<Expect> expect;
};

class FolderReaderTest : public ::testing::Test {
 protected:
  // Lists folder D:\<name> with `flag` and writes its folder.cfg, unless
  // `cfg` is null.
  std::size_t AddFolder(const std::string& name, const std::string* cfg, const char* flag = "1") {
    if (cfg) {
      prefix_.WriteFile(prefix_.Drive('d') / name / "[_KYR_HotFolder_]" / "folder.cfg", *cfg);
    }
    engine_.m_Folders.Add("D:\\" + name);
    engine_.m_EnabledFlags.Add(flag);
    return engine_.m_Folders.size() - 1;
  }

  void CheckCases(const std::vector<FolderCase>& cases) {
    for (const FolderCase& c : cases) {
      SCOPED_TRACE(c.name);
      std::size_t index = AddFolder("F" + std::to_string(engine_.m_Folders.size()), &c.cfg);
      ASSERT_TRUE(ReadFolderConfiguration(engine_, index));
      for (const Expect& e : c.expect) {
        SCOPED_TRACE(e.key);
        const wxString* value = (engine_.*e.map).Find(e.key);
        if (!e.value) {
          EXPECT_EQ(value, nullptr) << *value;
        } else if (value) {
          EXPECT_EQ(*value, wxString::FromUTF8(e.value));
        } else {
          ADD_FAILURE() << "missing";
        }
      }
    }
  }

  TempPrefix prefix_;
  CHFMigrator engine_;
};

const MapMember kEnable = &CHFMigrator::m_FilterEnable;
const MapMember kFolder = &CHFMigrator::m_FolderSettings;

wxXmlNode* Parse(wxXmlDocument& doc, const std::string& xml) {
  wxStringInputStream in(wxString::FromUTF8(xml));
  EXPECT_TRUE(doc.Load(in));
  return doc.GetRoot();
}

TEST(FindElement, SearchOrder) {
  struct Case {
    const char* xml;
    const char* name;
    const char* found;  // the "id" attribute of the result; null for none
  } cases[] = {
      {"<r><a><x id='deep'/></a><x id='direct'/></r>", "x", "direct"},
      {"<r><a><b><c><x id='first-subtree'/></c></b></a><d><x id='later'/></d></r>", "x",
       "first-subtree"},
      {"<r><a><b><x id='b'/></b><x id='a'/></a></r>", "x", "a"},
      {"<r><a/><b><c><x id='deep'/></c></b><d><x id='later'/></d></r>", "x", "deep"},
      {"<x><y/></x>", "x", nullptr},
      {"<r><X id='upper'/></r>", "x", nullptr},
      {"<r>x<!--x--><?x x?><y/></r>", "x", nullptr},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.xml);
    wxXmlDocument doc;
    wxXmlNode* found = FindElement(Parse(doc, c.xml), c.name);
    if (!c.found) {
      EXPECT_EQ(found, nullptr);
    } else {
      ASSERT_NE(found, nullptr);
      EXPECT_EQ(found->GetAttribute("id"), c.found);
    }
  }
}

TEST(ReadSection, ChildrenAndEarlierValues) {
  wxXmlDocument doc;
  wxXmlNode* section = Parse(doc,
                             "<S><Spaced>  two words \n</Spaced><Empty/><Nested><In>v</In></Nested>"
                             "<Kept></Kept><New>n</New><!--c--><Over>o</Over>loose text</S>");
  SettingsMap map;
  map.GetOrInsert("Empty") = "earlier";
  map.GetOrInsert("Kept") = "earlier";
  map.GetOrInsert("Over") = "earlier";
  ReadSection(section, map);
  ReadSection(nullptr, map);
  std::vector<std::pair<wxString, wxString>> entries(map.begin(), map.end());
  std::vector<std::pair<wxString, wxString>> expected = {
      {"Empty", "earlier"},         {"Kept", "earlier"}, {"Over", "o"},
      {"Spaced", "  two words \n"}, {"New", "n"},
  };
  EXPECT_EQ(entries, expected);
}

TEST_F(FolderReaderTest, SectionsAndFilterIdentifiers) {
  CheckCases({
      {"folder path set before reading",
       Doc("<FolderSettings><Queue>hold</Queue></FolderSettings>"),
       {{kFolder, "HFFolderPath", "D:\\F0"}, {kFolder, "Queue", "hold"}}},
      {"folder path overridden by the file",
       Doc("<FolderSettings><HFFolderPath>E:\\x</HFFolderPath></FolderSettings>"),
       {{kFolder, "HFFolderPath", "E:\\x"}}},
      {"a section directly under the root beats a deeper one",
       Doc("<Other><FolderSettings><Q>deep</Q></FolderSettings></Other>"
           "<FolderSettings><Q>top</Q></FolderSettings>"),
       {{kFolder, "Q", "top"}}},
      {"PDF2PS with line feed", Doc(Container(kPdf2Ps, "1")), {{kEnable, "PDF2PS", "1"}}},
      {"PDF2PS without line feed is unknown",
       Doc(Container(kPdf2Ps.substr(0, kPdf2Ps.size() - 1), "1")),
       {{kEnable, "PDF2PS", nullptr}}},
      {"PDF2PS off unless exactly 1", Doc(Container(kPdf2Ps, " 1")), {{kEnable, "PDF2PS", "0"}}},
      {"XRX braces form", Doc(Container(kXrx, "1")), {{kEnable, "XRX", "1"}}},
      {"XRX bare form with trailing line feed and spaces",
       Doc(Container(kXrxBare + "\n   ", "1")),
       {{kEnable, "XRX", "1"}}},
      {"XRX bare form in braces is unknown",
       Doc(Container("{" + kXrxBare + "}\n", "1")),
       {{kEnable, "XRX", nullptr}}},
      {"comments and instructions do not shift a container",
       Doc("<FILTERID><!--by hand-->" + kPdf2Ps +
           "<?pi x?><Name/><!--x--><Enabled><!--c-->1</Enabled></FILTERID>"),
       {{kEnable, "PDF2PS", "1"}}},
      {"containers too small are skipped",
       Doc("<FILTERID/><FILTERID>" + kPdf2Ps + "<Name/></FILTERID>" + Container(kXrx, "1")),
       {{kEnable, "PDF2PS", nullptr}, {kEnable, "XRX", "1"}}},
      {"the walk follows siblings of the first FILTERID only",
       Doc("<Filters><FILTERID>" + kPdf2Ps + "<a/><e>1</e></FILTERID><Other>" + kXrx +
           "<a/><e>1</e></Other></Filters><More>" + Container(kOffice1, "1") + "</More>"),
       {{kEnable, "PDF2PS", "1"}, {kEnable, "XRX", "1"}, {kEnable, "MICROSOFT", "0"}}},
      {"ImposeInfo flattened",
       Doc("<ImposeInfo><A>1</A><Layout><B>2</B><A>3</A></Layout><SheetSize><C>4</C></SheetSize>"
           "<Other><D>5</D></Other><PrinterMarks><E>6</E></PrinterMarks></ImposeInfo>"
           "<ImposeInfoVDP><PaperSize><P>7</P></PaperSize><SheetMargin><M>8</M></SheetMargin>"
           "</ImposeInfoVDP>"),
       {{&CHFMigrator::m_ImposeInfo, "A", "3"},
        {&CHFMigrator::m_ImposeInfo, "B", "2"},
        {&CHFMigrator::m_ImposeInfo, "C", "4"},
        {&CHFMigrator::m_ImposeInfo, "D", nullptr},
        {&CHFMigrator::m_ImposeInfo, "E", "6"},
        {&CHFMigrator::m_ImposeInfo, "Layout", nullptr},
        {&CHFMigrator::m_ImposeInfoVDP, "P", "7"},
        {&CHFMigrator::m_ImposeInfoVDP, "M", "8"}}},
      {"driver and imposition sections",
       Doc("<DriverSettings><NumCopies>2</NumCopies></DriverSettings>"
           "<ImpositionProperties><T>x</T></ImpositionProperties>"
           "<ImposeDeliveryInfo><G>5 5 </G></ImposeDeliveryInfo>"
           "<FILTERSETTINGS><K>v</K></FILTERSETTINGS>"),
       {{&CHFMigrator::m_DriverSettings, "NumCopies", "2"},
        {&CHFMigrator::m_ImpositionProperties, "T", "x"},
        {&CHFMigrator::m_ImposeDeliveryInfo, "G", "5 5 "},
        {&CHFMigrator::m_FilterSettings, "K", "v"}}},
      {"declared single-byte encoding",
       "<?xml version=\"1.0\" encoding=\"windows-1252\"?><r><FolderSettings><N>caf\xe9"
       "</N></FolderSettings></r>",
       {{kFolder, "N", "caf\xc3\xa9"}}},
  });
}

TEST_F(FolderReaderTest, OfficeCount) {
  CheckCases({
      {"1 and 0",
       Doc(Container(kOffice1, "1") + Container(kOffice2, "0")),
       {{kEnable, "MICROSOFT", "1"}}},
      {"0 and 0",
       Doc(Container(kOffice3, "0") + Container(kOffice4, "0")),
       {{kEnable, "MICROSOFT", "0"}}},
      {"no FILTERID", Doc("<FolderSettings/>"), {{kEnable, "MICROSOFT", "0"}}},
      {"white space and signs",
       Doc(Container(kOffice1, " -1") + Container(kOffice4, "\n+2x")),
       {{kEnable, "MICROSOFT", "1"}}},
      // "yes" parses to nothing; it must not repeat the -1 read before it.
      {"non-numeric counts 0",
       Doc(Container(kOffice1, "2") + Container(kOffice2, "-1") + Container(kOffice3, "yes")),
       {{kEnable, "MICROSOFT", "1"}}},
      {"huge counts do not wrap",
       Doc(Container(kOffice1, "2147483647") + Container(kOffice2, "2147483647")),
       {{kEnable, "MICROSOFT", "1"}}},
  });
}

TEST_F(FolderReaderTest, TenFilterEnableTexts) {
  const char* names[] = {"ONEBITTIFF", "CTLWFILTER", "DCS2FILTER", "EPS2PSFILTER", "EXPORTPS",
                         "JPEG2PDF",   "PDF2GO",     "PEXFILTER",  "TIFF2PDF",     "TIFFITFILTER"};
  // Texts taken exactly; DCS2FILTER has no section, JPEG2PDF's container no
  // enable text, and neither may borrow the "1" of the filter before it.
  const char* enable[] = {"1", "1", nullptr, "0", " 1 ", "", "1", "2", "0", "1"};
  std::string body;
  for (int i = 0; i < 10; ++i) {
    std::string section = std::string("<") + names[i] + "><K" + std::to_string(i) + ">v</K" +
                          std::to_string(i) + "></" + names[i] + ">";
    if (!enable[i]) continue;
    body += *enable[i] ? Container("id\n", enable[i], section)
                       : "<FILTERID>id\n<Name/><Enabled/>" + section + "</FILTERID>";
  }
  std::vector<Expect> expect;
  const char* expected[] = {"1", "1", "", "0", " 1 ", "", "1", "2", "0", "1"};
  for (int i = 0; i < 10; ++i) expect.push_back({kEnable, names[i], expected[i]});
  expect.push_back({&CHFMigrator::m_Eps2PsFilter, "K3", "v"});
  expect.push_back({&CHFMigrator::m_TiffItFilter, "K9", "v"});
  expect.push_back({&CHFMigrator::m_Dcs2Filter, "K2", nullptr});
  CheckCases({{"ten filters", Doc(body), expect}});
}

TEST_F(FolderReaderTest, UnreadableDocumentsLeaveOnlyTheFolderPath) {
  std::string deep;
  for (int i = 0; i < 300; ++i) deep += "<d>";
  deep += "<FolderSettings><Q>x</Q></FolderSettings>";
  for (int i = 0; i < 300; ++i) deep += "</d>";
  std::string huge =
      Doc("<FolderSettings><Q>x</Q></FolderSettings><!--" + std::string(64u << 20, 'p') + "-->");
  const std::string documents[] = {
      Doc(deep),
      huge,
      "",
      "not xml",
      "<HotFolder><FolderSettings><Q>x</Q></HotFolder>",
      "<HotFolder><FolderSettings><Q>x</Q></FolderSettings></HotFolder><second/>",
  };
  for (const std::string& cfg : documents) {
    SCOPED_TRACE(cfg.substr(0, 60));
    engine_.m_DriverSettings.GetOrInsert("left") = "over";
    std::size_t index = AddFolder("U" + std::to_string(engine_.m_Folders.size()), &cfg);
    ASSERT_TRUE(ReadFolderConfiguration(engine_, index));
    std::vector<std::pair<wxString, wxString>> entries(engine_.m_FolderSettings.begin(),
                                                       engine_.m_FolderSettings.end());
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_EQ(entries[0].first, "HFFolderPath");
    EXPECT_EQ(entries[0].second, engine_.m_Folders[index]);
    EXPECT_TRUE(engine_.m_DriverSettings.Empty());
    EXPECT_TRUE(engine_.m_FilterEnable.Empty());
  }
}

// A value of one folder must never reach the next, whatever map it is in.
TEST_F(FolderReaderTest, FoldersReadInARowAreIsolated) {
  std::string first =
      Doc("<FolderSettings><Server>s1</Server></FolderSettings>" + Container(kPdf2Ps, "1") +
          Container(kXrx, "1") + Container(kOffice1, "1") +
          "<DriverSettings><NumCopies>2</NumCopies></DriverSettings>");
  std::string second = Doc("<FolderSettings/>");
  AddFolder("First", &first, "0");
  AddFolder("Second", &second, "2");
  ASSERT_TRUE(ReadFolderConfiguration(engine_, 0));
  EXPECT_FALSE(engine_.m_CurrentEnabled);
  engine_.m_PexFilterConv.GetOrInsert("converted") = "for the first folder";

  ASSERT_TRUE(ReadFolderConfiguration(engine_, 1));
  EXPECT_TRUE(engine_.m_CurrentEnabled);
  EXPECT_EQ(engine_.m_FolderSettings.Size(), 1u);
  EXPECT_EQ(engine_.m_FolderSettings.GetOrInsert("HFFolderPath"), "D:\\Second");
  EXPECT_FALSE(engine_.m_FilterEnable.Contains("PDF2PS"));
  EXPECT_FALSE(engine_.m_FilterEnable.Contains("XRX"));
  EXPECT_EQ(*engine_.m_FilterEnable.Find("MICROSOFT"), "0");
  EXPECT_TRUE(engine_.m_DriverSettings.Empty());
  EXPECT_TRUE(engine_.m_PexFilterConv.Empty());
}

TEST_F(FolderReaderTest, MissingConfigurationChangesNothing) {
  engine_.m_FolderSettings.GetOrInsert("HFFolderPath") = "D:\\Earlier";
  engine_.m_CurrentEnabled = false;
  std::size_t index = AddFolder("Missing", nullptr, "1");
  EXPECT_FALSE(ReadFolderConfiguration(engine_, index));
  EXPECT_FALSE(ReadFolderConfiguration(engine_, index + 1));
  EXPECT_EQ(*engine_.m_FolderSettings.Find("HFFolderPath"), "D:\\Earlier");
  EXPECT_FALSE(engine_.m_CurrentEnabled);
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
