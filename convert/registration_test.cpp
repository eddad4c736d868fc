#include "convert/registration.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>
#include <wx/sstream.h>

#include <chrono>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include "app/migrator.h"
#include "convert/host_resolver.h"
#include "convert/server_lookup.h"
#include "platform/platform.h"
#include "store/store_reader.h"
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

std::uint32_t AttributesOf(const std::string& windows_path) {
  std::uint32_t attributes = 0;
  EXPECT_TRUE(GetFileAttributes(wxString(windows_path).ToStdWstring(), &attributes));
  return attributes & ~kAttributeDirectory;
}

// Each stored "Filter" as "name: key=value;key=value;".
std::vector<wxString> ParseFilters(const wxString& xml) {
  std::vector<wxString> filters;
  wxStringInputStream in(xml);
  wxXmlDocument doc;
  if (xml.empty() || !doc.Load(in)) return filters;
  for (wxXmlNode* f = doc.GetRoot()->GetChildren(); f; f = f->GetNext()) {
    wxString text = f->GetAttribute("name") + ":";
    for (wxXmlNode* s = f->GetChildren()->GetChildren(); s; s = s->GetNext()) {
      text << " " << s->GetName() << "=" << s->GetNodeContent() << ";";
    }
    filters.push_back(text);
  }
  return filters;
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
    for (const SettingsMap* map :
         {&engine_.m_DriverSettings, &engine_.m_ImpositionProperties, &engine_.m_ImposeDeliveryInfo,
          &engine_.m_ImposeInfo, &engine_.m_ImposeInfoVDP}) {
      EXPECT_TRUE(map->Empty()) << path;
    }
    std::vector<StoredHotFolder> folders;
    wxString error;
    EXPECT_TRUE(ReadStore(StoreHostPath(), &folders, &error)) << error;
    for (const StoredHotFolder& folder : folders) {
      if (folder.folderConfiguration.FolderPath == path) return folder;
    }
    ADD_FAILURE() << "not in the store: " << path;
    return StoredHotFolder();
  }

  TempPrefix prefix_;
  CHFMigrator engine_;
};

TEST_F(RegistrationTest, FilterChains) {
  const char* kDefault = " PDF/KYR.PDF.1 PS/KYR.PS.1 TIFF/KYR.TIFF.1 VDP/KYR.VDP.1";
  struct Case {
    std::vector<const char*> enabled;
    wxString chain;
  } cases[] = {
      {{}, kDefault},
      {{"JPEG2PDF"}, wxString(" JPEG/KYR.JPEG.1") + kDefault},
      {{"TIFF2PDF"}, " TIFF/KYR.TIFF.1 PDF/KYR.PDF.1 PS/KYR.PS.1 VDP/KYR.VDP.1"},
      {{"MICROSOFT"}, wxString(" Microsoft/KYR.MSOffice.1") + kDefault},
      {{"EPS2PSFILTER", "JPEG2PDF"}, " EPS/KYR.EPS.1 JPEG/KYR.JPEG.1"},
      {{"PDF2PS", "PEXFILTER"}, " PDF/KYR.PDF.1 PDF/KYR.PDF.1"},
  };
  int n = 0;
  for (const Case& c : cases) {
    engine_.ClearSettingsMaps();
    MakeFolder("Chain" + std::to_string(n++));
    engine_.m_FilterEnable.GetOrInsert("DCS2FILTER") = "01";  // only exactly "1" enables
    for (const char* key : c.enabled) engine_.m_FilterEnable.GetOrInsert(key) = "1";
    engine_.m_Tiff2PdfConv.GetOrInsert("RESOLUTION") = "300";
    engine_.m_PexFilterConv.GetOrInsert("JOBNAME") = " Proof 2 ";  // BuildFilterElement
    engine_.m_PexFilterConv.GetOrInsert("NOTE") = "";              // keeps both exactly
    StoredHotFolder stored = Register();
    wxString chain;
    for (const db::FilterEntry& e : stored.setting.Filters) {
      chain << " " << e.DisplayName << "/" << e.Identifier;
    }
    EXPECT_EQ(chain, c.chain);
    std::vector<wxString> filters = ParseFilters(stored.filterConfiguration);
    ASSERT_EQ(filters.size(), stored.setting.Filters.size()) << stored.filterConfiguration;
    for (size_t i = 0; i < filters.size(); ++i) {
      EXPECT_TRUE(filters[i].StartsWith(stored.setting.Filters[i].Identifier + ":"));
    }

    bool default_chain = c.chain.Contains("VDP");
    bool tiff_fixed = default_chain && !c.chain.StartsWith(" TIFF");
    EXPECT_EQ(engine_.m_PexFilterConv.Contains("ERRORPATH"), default_chain) << c.chain;
    EXPECT_EQ(engine_.m_Ps.Size(), default_chain ? 4u : 0u);
    EXPECT_EQ(engine_.m_Tiff2PdfConv.Size(), tiff_fixed ? 34u : 1u);
    EXPECT_EQ(*engine_.m_Tiff2PdfConv.Find("RESOLUTION"), tiff_fixed ? "600" : "300");
    if (default_chain && !filters.empty()) {
      EXPECT_EQ(filters.back(), "KYR.VDP.1:");  // an empty map, an empty "UI"
    }
    if (c.chain.StartsWith(" PDF/KYR.PDF.1 PDF") && filters.size() == 2) {
      EXPECT_EQ(filters[0], "KYR.PDF.1: JOBNAME= Proof 2 ; NOTE=;");
      EXPECT_EQ(filters[1], filters[0]);
    }
  }
}

TEST_F(RegistrationTest, NameAndPathsAndQueue) {
  struct Case {
    const char* folder_path;
    const char* dir;              // D:\Jobs\<dir>
    const char* logical_printer;  // null: absent
    const char* name;
    const char* full_path;
    const char* queue;
  } cases[] = {
      {"D:\\Jobs\\Flyers.v2", "Flyers.v2", "Direct to Print", "Flyers", "D:\\Jobs\\Flyers.v2",
       "print"},
      {"D:\\Jobs\\Brochures\\", "Brochures", "pRiNt-dIrEcT", "", "D:\\Jobs\\Brochures\\", "print"},
      {"D:/Jobs/Slashed", "Slashed", "xdirectx", "Slashed", "D:\\Jobs\\Slashed", "direct"},
      {"D:\\Jobs\\Proof", "Proof", "Proof", "Proof", "D:\\Jobs\\Proof", "hold"},
      {"D:\\Jobs\\None", "None", nullptr, "None", "D:\\Jobs\\None", "hold"},
  };
  for (const Case& c : cases) {
    engine_.ClearSettingsMaps();
    fs::path folder = MakeFolder(c.dir, c.folder_path);
    if (c.logical_printer) {
      engine_.m_FolderSettings.GetOrInsert("LogicalPrinter") = c.logical_printer;
    }
    StoredHotFolder stored = Register();
    EXPECT_EQ(stored.setting.Name, c.name);
    EXPECT_EQ(stored.setting.FolderPath, c.full_path);
    EXPECT_EQ(stored.setting.Queue, c.queue);
    EXPECT_EQ(stored.setting.Queue2, c.queue);
    EXPECT_EQ(stored.folderConfiguration.FolderPath, c.folder_path);
    wxString settings_dir = wxString(c.full_path) + "\\[_KYR_HotFolder_]\\";
    EXPECT_EQ(stored.folderConfiguration.WorkFolder, settings_dir + "[WorkFolder]");
    EXPECT_EQ(stored.folderConfiguration.FailedFolder, settings_dir + "[FailedFolder]");
    EXPECT_EQ(stored.folderConfiguration.MoveFolder, settings_dir + "[MoveFolder]");
    EXPECT_TRUE(fs::is_directory(folder / kRetiredDir)) << c.folder_path;
  }
}

// Fakes of the host's name services, answering what each case sets.
struct FakeHosts {
  bool sockets;
  const char* local;   // null: the local name is unavailable
  const char* remote;  // null: no host entry
} g_hosts;
std::string g_queries;

bool FakeLookup(const std::string& query, std::string* name) {
  g_queries += query + ";";
  if (g_hosts.remote) *name = g_hosts.remote;
  return g_hosts.remote != nullptr;
}

const HostResolver kFakeResolver = {
    [] { return g_hosts.sockets; },
    [](std::string* name) {
      g_queries += "local;";
      if (g_hosts.local) *name = g_hosts.local;
      return g_hosts.local != nullptr;
    },
    [](const std::string& query, std::string* name) { return FakeLookup("name:" + query, name); },
    [](const std::string& query, std::string* name) { return FakeLookup("addr:" + query, name); },
};

TEST(ResolveServerNameTest, DispatchAndShortName) {
  struct Case {
    FakeHosts hosts;
    const wchar_t* address;
    const char* name;  // null: unresolved, name unchanged
    const char* queries;
  } cases[] = {
      {{true, "build7.lab.example", "x"}, L"LOCALHOST", "build7.lab.example", "local;"},
      {{true, "build7.lab.example", "x"}, L"127.0.0.1", "build7.lab.example", "local;"},
      {{true, nullptr, "localhost.localdomain"},
       L"localhost",
       "localhost",
       "local;name:localhost;"},
      {{true, nullptr, "spool.corp.example.com"}, L"spool", "spool", "name:spool;"},
      {{true, nullptr, "spool01.example"}, L"10.1.2.3", "spool01", "addr:10.1.2.3;"},
      {{true, nullptr, nullptr}, L"10.1.2.4", nullptr, "addr:10.1.2.4;"},
      {{true, nullptr, "somewhere"}, L"", nullptr, ""},
      {{false, "build7", "x"}, L"localhost", nullptr, ""},
      // U+0141 must not become 'A' (0x41) and name another host.
      {{true, nullptr, nullptr}, L"\u0141odz", nullptr, "addr:?odz;"},
  };
  for (const Case& c : cases) {
    g_hosts = c.hosts;
    g_queries.clear();
    wxString name = "legacy";
    EXPECT_EQ(ResolveServerNameWith(kFakeResolver, c.address, name), c.name != nullptr)
        << wxString(c.address);
    EXPECT_EQ(name, c.name ? c.name : "legacy") << wxString(c.address);
    EXPECT_EQ(g_queries, c.queries) << wxString(c.address);
  }
}

TEST_F(RegistrationTest, ServerAndJobConfiguration) {
  std::string local;
  bool have_local = LocalHostName(&local);
  MakeFolder("Local");
  engine_.m_FolderSettings.GetOrInsert("ServerAddr") = "LOCALHOST";
  engine_.m_FolderSettings.GetOrInsert("ServerName") = "legacy";
  for (const char* key : {"numCOPIES", "Duplex", "alpha", "num copies", "NumCopies"}) {
    engine_.m_DriverSettings.GetOrInsert(key) = wxString("v-") + key;
  }
  StoredHotFolder stored = Register();
  EXPECT_EQ(stored.setting.ServerAddr, "LOCALHOST");
  if (have_local) {
    EXPECT_EQ(stored.setting.ServerName, wxString(local));
  }
  std::vector<std::vector<wxString>> rows;
  for (const auto& [key, e] : stored.jobConfiguration) {
    rows.push_back({key, e.Name, e.Value, e.Extra});
  }
  EXPECT_EQ(rows, (std::vector<std::vector<wxString>>{
                      {"Duplex", "Duplex", "v-Duplex", ""},
                      {"alpha", "alpha", "v-alpha", ""},
                      {"num copies", "numCOPIES", "v-numCOPIES", ""},
                  }));

  MakeFolder("Nowhere");
  engine_.m_FolderSettings.GetOrInsert("ServerAddr") = "300.1.2.3";
  EXPECT_EQ(Register().setting.ServerName, "legacy");
}

TEST_F(RegistrationTest, RetiringTheSettingsDirectory) {
  struct Case {
    bool retired_exists;
    std::uint32_t before;
    std::uint32_t after;
  } cases[] = {
      {false, 0, 0},
      {false, kAttributeReadOnly | kAttributeSystem | kAttributeHidden, kAttributeHidden},
      {false, kAttributeHidden | kAttributeArchive, kAttributeHidden | kAttributeArchive},
      {true, 0, 0},
      {true, kAttributeReadOnly | kAttributeHidden, kAttributeHidden},
  };
  int n = 0;
  for (const Case& c : cases) {
    std::string name = "Retire" + std::to_string(n++);
    fs::path folder = MakeFolder(name);
    std::string windows = "D:\\Jobs\\" + name + "\\";
    if (c.retired_exists) fs::create_directory(folder / kRetiredDir);
    ASSERT_TRUE(SetFileAttributes(wxString(windows + kSettingsDir).ToStdWstring(), c.before));
    Register();
    EXPECT_EQ(fs::exists(folder / kSettingsDir), c.retired_exists) << name;
    EXPECT_EQ(AttributesOf(windows + (c.retired_exists ? kSettingsDir : kRetiredDir)), c.after);
  }
}

TEST_F(RegistrationTest, StoreAnswers) {
  // An unreadable store refuses: the directory comes back with its attributes.
  fs::path store(StoreHostPath());
  prefix_.WriteFile(store, std::string(4096, 'x'));
  fs::path folder = MakeFolder("Corrupt");
  const std::uint32_t attributes = kAttributeReadOnly | kAttributeSystem;
  ASSERT_TRUE(SetFileAttributes(L"D:\\Jobs\\Corrupt\\[_KYR_HotFolder_]", attributes));
  engine_.m_ImpositionProperties.GetOrInsert("Template") = "ImposeTemplate.2";
  EXPECT_FALSE(engine_.RegisterHotFolder());
  EXPECT_TRUE(engine_.m_ImpositionProperties.Empty());
  EXPECT_FALSE(fs::exists(folder / kRetiredDir));
  EXPECT_EQ(AttributesOf("D:\\Jobs\\Corrupt\\[_KYR_HotFolder_]"), attributes);
  fs::remove(store);

  MakeFolder("Off");
  engine_.m_CurrentEnabled = false;
  EXPECT_FALSE(Register().enabled);

  // Already registered: refused, and the stored folder is not disabled.
  engine_.m_CurrentEnabled = true;
  folder = MakeFolder("Twice");
  EXPECT_TRUE(Register().enabled);
  fs::rename(folder / kRetiredDir, folder / kSettingsDir);
  engine_.m_CurrentEnabled = false;
  engine_.m_DriverSettings.GetOrInsert("Duplex") = "On";
  EXPECT_TRUE(Register(false).enabled);
  EXPECT_TRUE(fs::is_directory(folder / kSettingsDir));
  EXPECT_FALSE(fs::exists(folder / kRetiredDir));
}

// Any hotfolder.exe of this host, whoever started it.
bool ServerRunning() {
  std::error_code ec;
  for (const fs::directory_entry& proc : fs::directory_iterator("/proc", ec)) {
    if (fs::read_symlink(proc.path() / "exe", ec).filename() == "hotfolder.exe") return true;
  }
  return false;
}

TEST(ServerDirectoryTest, DirectoryOfTheRunningServer) {
  const char* bin = getenv("HF_BIN_DIR");
  if (!bin) GTEST_SKIP() << "HF_BIN_DIR names the directory of hotfolder.exe";
  if (ServerRunning()) GTEST_SKIP() << "another hotfolder.exe is running";
  TempPrefix prefix;
  wxString directory = "unchanged";
  FindServerDirectory(directory);
  EXPECT_EQ(directory, "unchanged");

  std::string exe = std::string(bin) + "/hotfolder.exe";
  char* argv[] = {exe.data(), nullptr};
  pid_t pid = 0;
  ASSERT_EQ(posix_spawn(&pid, exe.c_str(), nullptr, nullptr, argv, environ), 0);
  for (int i = 0; i < 100 && directory == "unchanged"; ++i) {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    FindServerDirectory(directory);
  }
  // The default chain's PDF filter reports errors into that directory.
  CHFMigrator engine;
  engine.m_FolderSettings.GetOrInsert("HFFolderPath") = "D:\\Jobs\\Error";
  engine.RegisterHotFolder();
  kill(pid, SIGKILL);
  waitpid(pid, nullptr, 0);

  wxString expected(FromHostPath(fs::canonical(bin).string()));
  EXPECT_EQ(directory, expected);
  EXPECT_EQ(engine.m_PexFilterConv.GetOrInsert("ERRORPATH"), expected);
}

}  // namespace
