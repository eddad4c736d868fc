#include "convert/filter_chain.h"
#include "server/server_process.h"

#include <gtest/gtest.h>
#include <wx/tokenzr.h>

#include <filesystem>
#include <string>
#include <tuple>
#include <vector>

#include "convert/host_resolver.h"
#include "convert/server_lookup.h"
#include "engine/migrator.h"
#include "store/store_reader.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace fs = std::filesystem;

// Readable failure messages for wide strings.
void PrintTo(const wxString& text, std::ostream* os) {
  *os << '"' << text.utf8_str() << '"';
}

namespace {

using namespace platform;

const char kSettingsDir[] = "[_KYR_HotFolder_]";
const char kRetiredDir[] = "[_KYR_HotFolder_Old]";

std::uint32_t AttributesOf(const fs::path& host_path) {
  std::uint32_t attributes = 0;
  EXPECT_TRUE(GetFileAttributes(FromHostPath(host_path.string()), &attributes));
  return attributes & ~kAttributeDirectory;
}

// Legacy folders on drive D: of a fresh prefix, registered into a real store.
class RegistrationTest : public ::testing::Test {
 protected:
  // Creates D:\Jobs\<name>\[_KYR_HotFolder_] and points the engine at it.
  fs::path MakeFolder(const std::string& name, const char* folder_path = nullptr) {
    fs::path folder = prefix_.Drive('d') / "Jobs" / name;
    fs::create_directories(folder / kSettingsDir);
    engine_.m_FolderSettings.GetOrInsert("HFFolderPath") =
        folder_path ? wxString(folder_path) : "D:\\Jobs\\" + name;
    return folder;
  }

  StoredHotFolder Register(bool expect_registered = true) {
    wxString path = engine_.m_FolderSettings.GetOrInsert("HFFolderPath");
    EXPECT_EQ(engine_.RegisterHotFolder(), expect_registered) << path;
    std::vector<StoredHotFolder> folders;
    wxString error;
    EXPECT_TRUE(ReadStore(StoreHostPath(), &folders, &error)) << error;
    if (folders.empty()) return StoredHotFolder();
    EXPECT_EQ(folders.back().folderConfiguration.FolderPath, path);  // the last registered
    return folders.back();
  }

  TempPrefix prefix_;
  CHFMigrator engine_;
};

// The filter tree is stored as written: one "Filter" per chain entry, in
// chain order; `tree` is how it ends, or all of it.
TEST_F(RegistrationTest, FilterChains) {
  auto empty = [](const std::string& id) { return "<Filter name=\"" + id + "\"><UI/></Filter>"; };
  const std::string kVdp = empty("KYR.VDP.1") + "</FilterSetting>";
  const std::string kPdf =  // BuildFilterElement keeps both texts exactly
      "<Filter name=\"KYR.PDF.1\"><UI><JOBNAME> Proof 2 </JOBNAME><NOTE></NOTE></UI></Filter>";
  const wxString kDefault = " PDF/KYR.PDF.1 PS/KYR.PS.1 TIFF/KYR.TIFF.1 VDP/KYR.VDP.1";
  const std::tuple<const char*, wxString, std::string> cases[] = {
      {"", kDefault, kVdp},
      {"JPEG2PDF", " JPEG/KYR.JPEG.1" + kDefault, kVdp},
      {"TIFF2PDF", " TIFF/KYR.TIFF.1 PDF/KYR.PDF.1 PS/KYR.PS.1 VDP/KYR.VDP.1", kVdp},
      {"MICROSOFT", " Microsoft/KYR.MSOffice.1" + kDefault, kVdp},
      {"EPS2PSFILTER JPEG2PDF", " EPS/KYR.EPS.1 JPEG/KYR.JPEG.1",
       "<FilterSetting>" + empty("KYR.EPS.1") + empty("KYR.JPEG.1") + "</FilterSetting>"},
      {"PDF2PS PEXFILTER", " PDF/KYR.PDF.1 PDF/KYR.PDF.1",
       "<FilterSetting>" + kPdf + kPdf + "</FilterSetting>"},
  };
  for (const auto& [enabled, expected_chain, expected_tree] : cases) {
    engine_.ClearSettingsMaps();
    MakeFolder(std::string("Chain-") + enabled);
    for (const auto& key : wxStringTokenize(enabled)) engine_.m_FilterEnable.GetOrInsert(key) = "1";
    engine_.m_FilterEnable.GetOrInsert("DCS2FILTER") = "01";  // only exactly "1" enables
    engine_.m_Tiff2PdfConv.GetOrInsert("RESOLUTION") = "300";
    engine_.m_PexFilterConv.GetOrInsert("JOBNAME") = " Proof 2 ";
    engine_.m_PexFilterConv.GetOrInsert("NOTE") = "";
    StoredHotFolder stored = Register();
    wxString chain, ids;
    for (const db::FilterEntry& e : stored.setting.Filters) {
      chain << " " << e.DisplayName << "/" << e.Identifier;
      ids << " " << e.Identifier;
    }
    EXPECT_EQ(chain, expected_chain);
    std::string tree = stored.filterConfiguration.utf8_string(), names;
    for (std::size_t at = 0; (at = tree.find("<Filter name=\"", at)) != std::string::npos; at += 14)
      names += " " + tree.substr(at + 14, tree.find('"', at + 14) - at - 14);
    EXPECT_EQ(wxString::FromUTF8(names), ids);
    EXPECT_TRUE(wxString::FromUTF8(tree).EndsWith(expected_tree)) << tree;

    bool default_chain = chain.Contains("VDP");
    bool tiff_fixed = default_chain && !chain.StartsWith(" TIFF");
    EXPECT_EQ(engine_.m_PexFilterConv.Contains("ERRORPATH"), default_chain) << chain;
    EXPECT_EQ(engine_.m_Ps.Size(), default_chain ? 4u : 0u);
    EXPECT_EQ(engine_.m_Tiff2PdfConv.Size(), tiff_fixed ? 34u : 1u);
    EXPECT_EQ(*engine_.m_Tiff2PdfConv.Find("RESOLUTION"), tiff_fixed ? "600" : "300");
  }
}

// Each folder's name, paths and queue, and its settings directory retired
// with the attributes it had (read-only and system cleared), or left in place
// with them when the retired name is taken.
TEST_F(RegistrationTest, NamePathsQueueAndRetiring) {
  const std::uint32_t kRo = kAttributeReadOnly, kSys = kAttributeSystem;
  const std::uint32_t kHid = kAttributeHidden, kArc = kAttributeArchive;
  // Folder path, logical printer (null: absent), stored name, folder path and
  // queue, whether the retired name is taken, attributes before and after.
  using Case =
      std::tuple<const char*, const char*, const char*, bool, std::uint32_t, std::uint32_t>;
  const Case cases[] = {
      {"D:\\Jobs\\Flyers.v2", "Direct to Print", "Flyers|D:\\Jobs\\Flyers.v2|print", false, 0, 0},
      {"D:\\Jobs\\Brochures\\", "pRiNt-dIrEcT", "|D:\\Jobs\\Brochures\\|print", false,
       kRo | kSys | kHid, kHid},
      {"D:/Jobs/Slashed", "xdirectx", "Slashed|D:\\Jobs\\Slashed|direct", false, kHid | kArc,
       kHid | kArc},
      {"D:\\Jobs\\Proof", "Proof", "Proof|D:\\Jobs\\Proof|hold", true, 0, 0},
      {"D:\\Jobs\\None", nullptr, "None|D:\\Jobs\\None|hold", true, kRo | kHid, kHid},
  };
  for (const auto& [path, printer, expected, taken, before, after] : cases) {
    engine_.ClearSettingsMaps();
    std::string dir = wxString(path).Mid(8).BeforeFirst('\\').utf8_string();
    fs::path folder = MakeFolder(dir, path);
    if (taken) fs::create_directory(folder / kRetiredDir);
    ASSERT_TRUE(SetFileAttributes(FromHostPath((folder / kSettingsDir).string()), before));
    if (printer) engine_.m_FolderSettings.GetOrInsert("LogicalPrinter") = printer;
    const auto [enabled, setting, config, jobs, tree, impose, preflight] = Register();
    EXPECT_EQ(setting.Name + "|" + setting.FolderPath + "|" + setting.Queue, expected);
    EXPECT_EQ(setting.Queue2, setting.Queue);
    wxString settings = setting.FolderPath + "\\[_KYR_HotFolder_]\\";
    EXPECT_EQ(config.FolderPath + "|" + config.WorkFolder + "|" + config.FailedFolder + "|" +
                  config.MoveFolder,
              wxString(path) + "|" + settings + "[WorkFolder]|" + settings + "[FailedFolder]|" +
                  settings + "[MoveFolder]");
    EXPECT_TRUE(fs::is_directory(folder / kRetiredDir)) << path;
    EXPECT_EQ(fs::exists(folder / kSettingsDir), taken) << path;
    EXPECT_EQ(AttributesOf(folder / (taken ? kSettingsDir : kRetiredDir)), after);
  }
}

// What the faked name services answer (sockets start, the local name and the
// host entry; null: none), the address asked, the outcome (null: unresolved,
// name unchanged) and the queries made.
using ResolveCase =
    std::tuple<bool, const char*, const char*, const wchar_t*, const char*, const char*>;
const ResolveCase* g_case;
std::string g_queries;

// Records the query; answers the case's field `kAnswer`.
template <int kAnswer>
bool Answer(const std::string& query, std::string* name) {
  const char* answer = std::get<kAnswer>(*g_case);
  g_queries += query + ";";
  if (answer) *name = answer;
  return answer != nullptr;
}

const HostResolver kFakeResolver = {
    [] { return std::get<0>(*g_case); },
    [](std::string* name) { return Answer<1>("local", name); },
    [](const std::string& q, std::string* name) { return Answer<2>("name:" + q, name); },
    [](const std::string& q, std::string* name) { return Answer<2>("addr:" + q, name); },
};

TEST(ResolveServerNameTest, DispatchAndShortName) {
  const ResolveCase cases[] = {
      {true, "build7.lab.example", "x", L"LOCALHOST", "build7.lab.example", "local;"},
      {true, "build7.lab.example", "x", L"127.0.0.1", "build7.lab.example", "local;"},
      {true, nullptr, "localhost.localdomain", L"localhost", "localhost", "local;name:localhost;"},
      {true, nullptr, "spool.corp.example.com", L"spool", "spool", "name:spool;"},
      {true, nullptr, "spool01.example", L"10.1.2.3", "spool01", "addr:10.1.2.3;"},
      {true, nullptr, nullptr, L"10.1.2.4", nullptr, "addr:10.1.2.4;"},
      {true, nullptr, "somewhere", L"", nullptr, ""},
      {false, "build7", "x", L"localhost", nullptr, ""},
      // U+0141 must not become 'A' (0x41) and name another host.
      {true, nullptr, nullptr, L"\u0141odz", nullptr, "addr:?odz;"},
  };
  UseHostResolver(&kFakeResolver);
  for (const ResolveCase& c : cases) {
    const auto& [sockets, local, remote, address, resolved, queries] = c;
    g_case = &c;
    g_queries.clear();
    wxString name = "legacy";
    EXPECT_EQ(ResolveServerName(address, name), resolved != nullptr) << wxString(address);
    EXPECT_EQ(name + " " + g_queries, wxString(resolved ? resolved : "legacy") + " " + queries);
  }
  UseHostResolver(nullptr);
}

TEST_F(RegistrationTest, StoreServerJobsAndSecondRegistration) {
  // An unreadable store refuses: the directory comes back with its attributes.
  prefix_.WriteFile(fs::path(StoreHostPath()), std::string(4096, 'x'));
  fs::path folder = MakeFolder("Corrupt");
  const std::uint32_t attributes = kAttributeReadOnly | kAttributeSystem;
  ASSERT_TRUE(SetFileAttributes(FromHostPath((folder / kSettingsDir).string()), attributes));
  engine_.m_ImpositionProperties.GetOrInsert("Template") = "ImposeTemplate.2";
  EXPECT_FALSE(engine_.RegisterHotFolder());
  EXPECT_FALSE(fs::exists(folder / kRetiredDir));
  EXPECT_EQ(AttributesOf(folder / kSettingsDir), attributes);
  fs::remove(fs::path(StoreHostPath()));

  folder = MakeFolder("Local");
  engine_.m_FolderSettings.GetOrInsert("ServerAddr") = "LOCALHOST";
  engine_.m_FolderSettings.GetOrInsert("ServerName") = "legacy";
  for (const char* key : {"numCOPIES", "Duplex", "alpha", "num copies", "NumCopies"})
    engine_.m_DriverSettings.GetOrInsert(key) = key;
  StoredHotFolder stored = Register();
  EXPECT_EQ(stored.setting.ServerAddr, "LOCALHOST");
  std::string local;
  if (LocalHostName(&local)) {
    EXPECT_EQ(stored.setting.ServerName, wxString(local));
  }
  wxString rows;
  for (const auto& [key, e] : stored.jobConfiguration)
    rows << key << "=" << e.Name << "/" << e.Value << "/" << e.Extra << ";";
  EXPECT_EQ(rows, "Duplex=Duplex/Duplex/;alpha=alpha/alpha/;num copies=numCOPIES/numCOPIES/;");

  // Already registered: refused, and the stored folder is not disabled.
  fs::rename(folder / kRetiredDir, folder / kSettingsDir);
  engine_.m_CurrentEnabled = false;
  engine_.m_DriverSettings.GetOrInsert("Duplex") = "On";
  EXPECT_TRUE(Register(false).enabled);
  EXPECT_TRUE(fs::is_directory(folder / kSettingsDir));
  EXPECT_FALSE(fs::exists(folder / kRetiredDir));
}

TEST_F(RegistrationTest, DirectoryOfTheRunningServer) {
  if (!ServerProcesses().empty()) GTEST_SKIP() << "another hotfolder.exe is running";
  std::wstring directory = L"unchanged";
  FindServerDirectory(&directory);
  EXPECT_EQ(directory, L"unchanged");
  {
    RunningServer server;
    EXPECT_TRUE(WaitFor([&] {
      FindServerDirectory(&directory);
      return directory != L"unchanged";
    }));
    // The default chain's PDF filter reports errors into that directory.
    MakeFolder("Error");
    engine_.RegisterHotFolder();
  }
  wxString expected(FromHostPath(fs::canonical(BinDir()).string()));
  EXPECT_EQ(wxString(directory), expected);
  EXPECT_EQ(engine_.m_PexFilterConv.GetOrInsert("ERRORPATH"), expected);
}

}  // namespace
