// Hostile and damaged legacy installations, run through the real engine in a
// temporary prefix with a real store. Whatever the input, the run ends, the
// legacy settings stay byte for byte somewhere a person can find them, the
// store holds whole folders only, and nothing outside the listed folders'
// settings directories changes.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <functional>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <tuple>

#include "engine/migrator.h"
#include "platform/platform.h"
#include "store/store.h"
#include "store/store_reader.h"
#include "tests/immutable.h"
#include "tests/legacy_fixture.h"
#include "tests/temp_prefix.h"

namespace {

namespace fs = std::filesystem;

const char kSecret[] = "HF-SECRET-7d1c-NEVER-STORED";
const char kSettingsDir[] = "[_KYR_HotFolder_]";
const char kRetiredDir[] = "[_KYR_HotFolder_Old]";
const char kMissing[] = "Failed; File missing";
constexpr unsigned kCaseSeconds = 60;  // a run that takes longer has hung

const char kPlainConfig[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<HotFolderConfiguration>
  <FolderSettings><LogicalPrinter>Print</LogicalPrinter></FolderSettings>
  <DriverSettings><NumCopies>2</NumCopies></DriverSettings>
</HotFolderConfiguration>
)";

const auto ReadBytes = TempPrefix::ReadFile;
const auto StoreFile = [] { return fs::path(StoreHostPath()); };

// One case's installation, and what it must look like afterwards.
struct Scene {
  ~Scene() { Release(); }

  fs::path D(const std::string& relative) const { return OnDriveD(prefix, relative); }

  void List(const std::vector<LegacyFolder>& folders) {
    ListBytes(LegacyListBytes(folders), folders);
  }
  // A list file of any bytes; `folders` are the ones it names.
  void ListBytes(const std::string& bytes, const std::vector<LegacyFolder>& folders = {}) {
    listed = folders;
    prefix.WriteFile(LegacyListHostPath(prefix), bytes);
  }

  // A folder.cfg on drive D: whose bytes must survive the run unchanged.
  void Config(const std::string& folder_on_d, const std::string& bytes) {
    WriteFolderConfig(prefix, folder_on_d, bytes);
    configs[folder_on_d] = bytes;
  }

  // Made immutable now, made mutable again before the prefix goes. A case
  // that requires the flag where the file system has none is not run.
  bool Freeze(const fs::path& path, bool required = true) {
    const bool frozen = SetImmutable(path, true);
    if (frozen) frozen_paths.push_back(path);
    unavailable = unavailable || (!frozen && required);
    return frozen;
  }

  // Held from setup until the run is over.
  void HoldExclusiveLock() {
    ASSERT_EQ(sqlite3_open(StoreFile().c_str(), &locker), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(locker, "BEGIN EXCLUSIVE", nullptr, nullptr, nullptr), SQLITE_OK);
  }

  void Release() {
    for (const fs::path& path : frozen_paths) SetImmutable(path, false);
    frozen_paths.clear();
    if (locker) sqlite3_close(locker);
    locker = nullptr;
  }

  TempPrefix prefix;
  std::vector<LegacyFolder> listed;
  std::map<std::string, std::string> configs;
  std::vector<fs::path> frozen_paths;
  sqlite3* locker = nullptr;
  bool unavailable = false;
};

// Registers one folder the way the tool would, so that a case starts with a
// store that already holds something, then lets go of the store: the engine
// must open the file afresh, as a new process would. (The store reopens when
// its location changes, and a location under a file cannot be opened.)
void SeedStore(const std::string& folder_path) {
  db::Setting setting;
  setting.Name = "Seed";
  db::FolderConfiguration folder;
  setting.FolderPath = folder.FolderPath = folder_path;
  db::JobConfiguration job;
  db::FilterConfiguration filter;
  filter = wxXmlNode(wxXML_ELEMENT_NODE, "FilterSetting");
  db::ImposeConfiguration impose;
  db::PreflightConfiguration preflight;
  RODuriZudaze& store = RODuriZudaze::GetInstance();
  ASSERT_NE(store.CreateHotFolder(setting, folder, job, filter, impose, preflight), 0);
  std::string prefix = getenv("WINEPREFIX");
  setenv("WINEPREFIX", "/dev/null/none", 1);
  store.CreateHotFolder(setting, folder, job, filter, impose, preflight);
  setenv("WINEPREFIX", prefix.c_str(), 1);
}

// ---- Snapshot of the prefix ---------------------------------------------

// Type, size, and a hash of the content or of the link target.
using Snapshot = std::map<std::string, std::tuple<fs::file_type, std::uintmax_t, std::size_t>>;

bool Under(const fs::path& path, const std::set<fs::path>& roots) {
  for (fs::path p = path; !p.empty() && p != p.root_path(); p = p.parent_path()) {
    if (roots.count(p)) return true;
  }
  return false;
}

// The listed folders' settings directories and the store's folder: the only
// places a run may change.
std::set<fs::path> ChangeableRoots(const Scene& scene) {
  std::set<fs::path> roots{fs::weakly_canonical(StoreFile()).parent_path()};
  for (const LegacyFolder& folder : scene.listed) {
    wxString windows(folder.path.c_str(), wxConvISO8859_1);
    platform::HostPath host = platform::ToHostPath(windows.ToStdWstring());
    // A run moves settings directories, it creates no folders.
    std::error_code ec;
    if (host.empty() || !fs::is_directory(host, ec)) continue;
    fs::path dir = fs::weakly_canonical(fs::absolute(host));
    roots.insert(dir / kSettingsDir);
    roots.insert(dir / kRetiredDir);
  }
  return roots;
}

Snapshot Take(const fs::path& root, const std::set<fs::path>& skip) {
  Snapshot snapshot;
  std::error_code ec;
  for (auto it = fs::recursive_directory_iterator(root, ec);
       it != fs::recursive_directory_iterator(); it.increment(ec)) {
    const fs::path& path = it->path();
    if (Under(path, skip)) {
      if (it->is_directory(ec) && !it->is_symlink(ec)) it.disable_recursion_pending();
      continue;
    }
    const fs::file_type type = it->symlink_status(ec).type();
    std::string content;
    if (type == fs::file_type::regular) content = ReadBytes(path);
    if (type == fs::file_type::symlink) content = fs::read_symlink(path, ec).string();
    snapshot[fs::relative(path, root).string()] = {type, content.size(),
                                                   std::hash<std::string>()(content)};
  }
  return snapshot;
}

// ---- Hostile inputs ---------------------------------------------------------

using Verify = std::function<void(Scene&, const std::vector<StoredHotFolder>&)>;

struct Case {
  Case(const char* name, std::vector<LegacyFolder> listed, std::vector<std::string> configs,
       std::vector<std::string> status, std::vector<std::string> registered = {},
       std::vector<std::string> retired = {}, std::function<void(Scene&)> setup = nullptr,
       Verify verify = nullptr)
      : name(name),
        listed(std::move(listed)),
        configs(std::move(configs)),
        status(std::move(status)),
        registered(std::move(registered)),
        retired(std::move(retired)),
        setup(std::move(setup)),
        verify(std::move(verify)) {}

  const char* name;
  std::vector<LegacyFolder> listed;     // the list file, unless empty
  std::vector<std::string> configs;     // folders on D: whose folder.cfg is kPlainConfig
  std::vector<std::string> status;      // the engine's status list, in order
  std::vector<std::string> registered;  // FolderPath of each stored folder, in order
  std::vector<std::string> retired;     // configs (folder on D:) found retired afterwards
  std::function<void(Scene&)> setup;
  Verify verify;
};

// A folder migrated from an unreadable folder.cfg gets the default chain and
// no driver settings: nothing of the damaged file reaches the store.
void ExpectDefaults(Scene&, const std::vector<StoredHotFolder>& stored) {
  ASSERT_EQ(stored.size(), 1u);
  EXPECT_EQ(stored[0].setting.Filters.size(), 4u);
  EXPECT_TRUE(stored[0].jobConfiguration.empty());
  EXPECT_EQ(stored[0].setting.Queue, "hold");
}

Verify ExpectCopies(const char* copies) {
  return [copies](Scene&, const std::vector<StoredHotFolder>& stored) {
    ASSERT_EQ(stored.size(), 1u);
    auto found = stored[0].jobConfiguration.find("num copies");
    ASSERT_NE(found, stored[0].jobConfiguration.end());
    EXPECT_EQ(found->second.Value, copies);
  };
}

// D:\Jobs\F, listed enabled, with a folder.cfg of the given bytes: migrated
// and its settings retired whatever they hold.
Case Migrated(const char* name, std::function<std::string(Scene&)> config,
              Verify verify = ExpectDefaults) {
  return Case(
      name, {{"D:\\Jobs\\F", 2}}, {}, {"Success"}, {"D:\\Jobs\\F"}, {"Jobs/F"},
      [config](Scene& s) { s.Config("Jobs/F", config(s)); }, verify);
}

std::string Garbage(std::size_t size, unsigned seed) {
  std::mt19937 random(seed);
  std::string bytes(size, '\0');
  for (char& c : bytes) c = static_cast<char>(random());
  return bytes;
}

std::string BillionLaughs() {
  std::string xml = "<?xml version=\"1.0\"?>\n<!DOCTYPE lolz [\n <!ENTITY lol0 \"lol\">\n";
  for (int i = 1; i <= 9; ++i) {
    xml += " <!ENTITY lol" + std::to_string(i) + " \"";
    for (int j = 0; j < 10; ++j) xml += "&lol" + std::to_string(i - 1) + ";";
    xml += "\">\n";
  }
  return xml +
         "]>\n<HotFolderConfiguration><DriverSettings><Bomb>&lol9;</Bomb>"
         "</DriverSettings></HotFolderConfiguration>\n";
}

// A document that names a secret on drive C: by host path, as an attacker who
// can write a folder.cfg but not read the machine would name it, through an
// external entity or an external DTD that defines "leak".
std::string Leaking(Scene& scene, bool through_dtd, const char* copies) {
  const fs::path secret = scene.prefix.Drive('c') / "secret.txt";
  const fs::path dtd = scene.prefix.Drive('c') / "secret.dtd";
  scene.prefix.WriteFile(secret, kSecret);
  scene.prefix.WriteFile(dtd, std::string("<!ENTITY leak \"") + kSecret + "\">");
  const std::string doctype =
      through_dtd ? " SYSTEM \"" + dtd.string() + "\""
                  : " [\n <!ENTITY leak SYSTEM \"file://" + secret.string() + "\">\n]";
  return "<?xml version=\"1.0\"?>\n<!DOCTYPE HotFolderConfiguration" + doctype +
         ">\n<HotFolderConfiguration><DriverSettings><NumCopies>" + copies +
         "</NumCopies><Leak>&leak;</Leak></DriverSettings></HotFolderConfiguration>\n";
}

// A case whose store is damaged before the run: the folder is refused, its
// settings go back in place, and the file is left exactly as it was.
Case RefusedStore(const char* name, std::function<void(Scene&)> damage, bool seeded = false) {
  auto before = std::make_shared<std::string>();
  return Case(
      name, {{"D:\\Jobs\\Refused", 2}}, {"Jobs/Refused"}, {"Unknown error"},
      seeded ? std::vector<std::string>{"D:\\Seed"} : std::vector<std::string>{}, {},
      [damage, before, seeded](Scene& scene) {
        if (seeded) SeedStore("D:\\Seed");
        damage(scene);
        *before = ReadBytes(StoreFile());
      },
      [before](Scene& scene, const std::vector<StoredHotFolder>&) {
        EXPECT_FALSE(fs::exists(scene.D("Jobs/Refused") / kRetiredDir));
        EXPECT_TRUE(ReadBytes(StoreFile()) == *before) << "store file changed";
      });
}

std::vector<Case> Cases() {
  std::vector<LegacyFolder> many;
  for (int i = 0; i < 100000; ++i) many.push_back({"D:\\Many\\F" + std::to_string(i), 2});
  std::vector<std::string> many_status(many.size(), kMissing);
  many_status.front() = many_status.back() = "Success";
  return {
      Case("list truncated mid-header", {}, {}, {}, {}, {},
           [](Scene& s) { s.ListBytes(LegacyListBytes({}).substr(0, 20)); }),
      Case("list truncated mid-record", {}, {"Jobs/Whole", "Jobs/Torn"}, {"Success"},
           {"D:\\Jobs\\Whole"}, {"Jobs/Whole"},
           [](Scene& s) {
             std::string bytes = LegacyListBytes({{"D:\\Jobs\\Whole", 2}, {"D:\\Jobs\\Torn", 2}});
             s.ListBytes(bytes.substr(0, bytes.size() - 100), {{"D:\\Jobs\\Whole", 2}});
           }),
      Case("list file is a FIFO", {}, {}, {}, {}, {},
           [](Scene& s) {
             fs::create_directories(LegacyListHostPath(s.prefix).parent_path());
             ASSERT_EQ(mkfifo(LegacyListHostPath(s.prefix).c_str(), 0600), 0);
           }),
      Case("100,000 records", many, {"Many/F0", "Many/F99999"}, many_status,
           {"D:\\Many\\F0", "D:\\Many\\F99999"}, {"Many/F0", "Many/F99999"}),
      // Climbing out of D: would reach drive_c\Victim through the prefix.
      Case("dot-dot cannot leave the drive",
           {{"D:\\..\\drive_c\\Victim", 2},
            {"D:\\..\\..\\..\\..\\drive_c\\Victim", 2},
            {"D:\\Jobs\\..\\..\\..\\Jobs\\Dots", 2}},
           {"Jobs/Dots"}, {kMissing, kMissing, "Success"}, {"D:\\Jobs\\..\\..\\..\\Jobs\\Dots"},
           {"Jobs/Dots"},
           [](Scene& s) {
             s.prefix.WriteFile(s.prefix.Drive('c') / "Victim" / kSettingsDir / "folder.cfg",
                                kPlainConfig);
           }),
      Case("device names",
           {{"D:\\Jobs\\CON", 2}, {"D:\\Jobs\\NUL", 2}, {"\\\\.\\NUL", 2}, {"CON", 2}, {"NUL:", 2}},
           {"Jobs/CON"}, {"Success", kMissing, kMissing, kMissing, kMissing}, {"D:\\Jobs\\CON"},
           {"Jobs/CON"}, [](Scene& s) { fs::create_directories(s.D("Jobs/NUL")); }),
      Case("undecodable, overlong, rooted and share paths",
           {{"D:\\Jobs\\\x81\x8D\x8F\x90\x9D", 2},
            {"D:\\Jobs\\\x01\x1F\x7F", 2},
            {"D:\\" + std::string(256, 'A'), 2},
            {"\\Jobs\\Ok", 2},
            {"\\\\server\\share\\Jobs\\Ok", 2},
            {"\\\\..\\..\\drive_d\\Jobs\\Ok", 2}},
           {"Jobs/Ok"}, std::vector<std::string>(6, kMissing)),
      Case("drive root", {{"D:\\", 2}}, {""}, {"Success"}, {"D:\\"}, {""}, nullptr,
           [](Scene&, const std::vector<StoredHotFolder>& stored) {
             EXPECT_EQ(stored[0].setting.Name, "");
             EXPECT_EQ(stored[0].folderConfiguration.WorkFolder,
                       "D:\\\\[_KYR_HotFolder_]\\[WorkFolder]");
           }),
      Case("forward slashes", {{"D:/Jobs/Fwd", 2}}, {"Jobs/Fwd"}, {"Success"}, {"D:\\Jobs\\Fwd"},
           {"Jobs/Fwd"}),
      Case("a file where a directory belongs",
           {{"D:\\Jobs\\notes.txt", 2}, {"D:\\Jobs\\FileSettings", 2}, {"D:\\Jobs\\DirConfig", 2}},
           {}, {kMissing, kMissing, kMissing}, {}, {},
           [](Scene& s) {
             s.prefix.WriteFile(s.D("Jobs/notes.txt"), "not a folder");
             s.prefix.WriteFile(s.D("Jobs/FileSettings") / kSettingsDir, "not a folder");
             fs::create_directories(s.D("Jobs/DirConfig") / kSettingsDir / "folder.cfg");
           }),
      Case("folder.cfg is a FIFO or a device", {{"D:\\Jobs\\Fifo", 2}, {"D:\\Jobs\\Zero", 2}}, {},
           {kMissing, kMissing}, {}, {},
           [](Scene& s) {
             fs::create_directories(s.D("Jobs/Fifo") / kSettingsDir);
             ASSERT_EQ(mkfifo((s.D("Jobs/Fifo") / kSettingsDir / "folder.cfg").c_str(), 0600), 0);
             fs::create_directories(s.D("Jobs/Zero") / kSettingsDir);
             fs::create_symlink("/dev/zero", s.D("Jobs/Zero") / kSettingsDir / "folder.cfg");
           }),
      // The first retires the settings: the repeats find nothing to migrate,
      // and the folder is stored once, enabled as first listed.
      Case("listed twice",
           {{"D:\\Jobs\\Twice", 2}, {"D:\\Jobs\\Twice", 0}, {"d:\\jobs\\twice\\", 2}},
           {"Jobs/Twice"}, {"Success", kMissing, kMissing}, {"D:\\Jobs\\Twice"}, {"Jobs/Twice"},
           nullptr,
           [](Scene&, const std::vector<StoredHotFolder>& stored) {
             EXPECT_TRUE(stored[0].enabled);
           }),
      Migrated("empty folder.cfg", [](Scene&) { return std::string(); }),
      Migrated("binary garbage", [](Scene&) { return Garbage(65536, 1); }),
      Migrated("invalid UTF-8",
               [](Scene&) { return std::string(kPlainConfig).replace(100, 1, "\xC3\x28\xFF"); }),
      Migrated(
          "UTF-16 with byte-order mark",
          [](Scene&) {
            return Utf16LeWithBom(
                "<?xml version=\"1.0\" encoding=\"UTF-16\"?><C><DriverSettings>"
                "<NumCopies>6</NumCopies></DriverSettings></C>");
          },
          ExpectCopies("6")),
      Migrated("nested a million deep", [](Scene&) { return NestedXml(1000000); }),
      // A valid document whose size is all in one comment.
      Migrated("100 MB folder.cfg",
               [](Scene&) {
                 return "<HotFolderConfiguration><DriverSettings><NumCopies>5</NumCopies>"
                        "</DriverSettings><!--" +
                        std::string(100u << 20, 'x') + "--></HotFolderConfiguration>";
               }),
      Migrated("billion laughs", [](Scene&) { return BillionLaughs(); }),
      Migrated(
          "external entity", [](Scene& s) { return Leaking(s, false, "3"); }, ExpectCopies("3")),
      Migrated(
          "DOCTYPE naming a local file", [](Scene& s) { return Leaking(s, true, "4"); },
          ExpectCopies("4")),
      // Root renames regardless of permission bits; only the immutable flag
      // stops it. Where there is none, a name already taken does.
      Case("settings directory that cannot be moved", {{"D:\\Jobs\\Stuck", 2}}, {"Jobs/Stuck"},
           {"Success"}, {"D:\\Jobs\\Stuck"}, {},
           [](Scene& s) {
             if (!s.Freeze(s.D("Jobs/Stuck"), /*required=*/false)) {
               fs::create_directories(s.D("Jobs/Stuck") / kRetiredDir);
             }
           }),
      Case(
          "retired name already taken", {{"D:\\Jobs\\Taken", 2}}, {"Jobs/Taken"}, {"Success"},
          {"D:\\Jobs\\Taken"}, {},
          [](Scene& s) {
            s.prefix.WriteFile(s.D("Jobs/Taken") / kRetiredDir / "folder.cfg", "older");
          },
          [](Scene& s, const std::vector<StoredHotFolder>&) {
            EXPECT_EQ(ReadBytes(s.D("Jobs/Taken") / kRetiredDir / "folder.cfg"), "older");
          }),
      RefusedStore(
          "store locked", [](Scene& s) { s.HoldExclusiveLock(); }, /*seeded=*/true),
      RefusedStore(
          "store file read-only", [](Scene& s) { s.Freeze(StoreFile()); }, /*seeded=*/true),
      RefusedStore("store folder read-only",
                   [](Scene& s) {
                     fs::create_directories(StoreFile().parent_path());
                     s.Freeze(StoreFile().parent_path());
                   }),
      RefusedStore("store path is a directory",
                   [](Scene&) { fs::create_directories(StoreFile()); }),
      RefusedStore("store of garbage bytes",
                   [](Scene& s) { s.prefix.WriteFile(StoreFile(), Garbage(8192, 2)); }),
      RefusedStore("store with a SQLite header and garbage",
                   [](Scene& s) {
                     s.prefix.WriteFile(StoreFile(),
                                        std::string("SQLite format 3", 16) + Garbage(8176, 3));
                   }),
  };
}

// Compares long lists without printing a hundred thousand lines.
template <typename Texts>
void ExpectSameList(const Texts& actual, const std::vector<std::string>& expected,
                    const char* what) {
  EXPECT_EQ(actual.size(), expected.size()) << what;
  for (std::size_t i = 0; i < std::min<std::size_t>(actual.size(), expected.size()); ++i) {
    const std::string text = wxString(actual[i]).utf8_string();
    if (text == expected[i]) continue;
    ADD_FAILURE() << what << " [" << i << "]: " << text << " != " << expected[i];
    return;
  }
}

void RunCase(const Case& c) {
  Scene scene;
  if (!c.listed.empty()) scene.List(c.listed);
  for (const std::string& folder : c.configs) scene.Config(folder, kPlainConfig);
  if (c.setup) c.setup(scene);
  if (testing::Test::HasFatalFailure()) return;
  if (scene.unavailable) {
    std::printf("[ NOT RUN  ] %s: the file system has no immutable flag\n", c.name);
    return;
  }
  const fs::path root = fs::canonical(scene.prefix.root());
  const std::set<fs::path> changeable = ChangeableRoots(scene);
  const Snapshot before = Take(root, changeable);

  CHFMigrator engine;
  alarm(kCaseSeconds);  // the default action ends the process: a hang fails
  engine.Run();
  alarm(0);
  scene.Release();

  ExpectSameList(engine.m_Status, c.status, "status");
  std::vector<StoredHotFolder> stored;
  wxString error;
  ReadStore(StoreHostPath(), &stored, &error);
  std::vector<wxString> registered;
  for (const StoredHotFolder& folder : stored) registered.push_back(folder.setting.FolderPath);
  ExpectSameList(registered, c.registered, "registered");
  for (const auto& [folder, bytes] : scene.configs) {
    const bool retired = std::count(c.retired.begin(), c.retired.end(), folder) > 0;
    const fs::path dir = scene.D(folder);
    EXPECT_TRUE(ReadBytes(dir / (retired ? kRetiredDir : kSettingsDir) / "folder.cfg") == bytes)
        << folder << " lost its settings";
    EXPECT_FALSE(retired && fs::exists(dir / kSettingsDir)) << folder;
  }
  std::string store_bytes;  // the store file and its journals
  for (const char* suffix : {"", "-wal", "-shm", "-journal"}) {
    store_bytes += ReadBytes(StoreFile().string() + suffix);
  }
  EXPECT_EQ(store_bytes.find(kSecret), std::string::npos) << "a local file reached the store";
  const Snapshot after = Take(root, changeable);
  for (const auto& [path, entry] : before) {
    auto found = after.find(path);
    EXPECT_TRUE(found != after.end() && found->second == entry) << "changed: " << path;
  }
  for (const auto& [path, entry] : after) EXPECT_TRUE(before.count(path)) << "appeared: " << path;
  if (c.verify) c.verify(scene, stored);
}

TEST(Hostile, EveryInputEndsSoundly) {
  for (const Case& c : Cases()) {
    SCOPED_TRACE(c.name);
    RunCase(c);
  }
}

}  // namespace
