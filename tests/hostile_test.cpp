// Hostile and damaged legacy installations, run through the real engine in a
// temporary prefix with a real store. Whatever the input, the run ends, the
// legacy settings stay byte for byte somewhere a person can find them, the
// store holds whole folders only, and nothing outside the listed folders'
// settings directories changes.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/fs.h>
#include <sqlite3.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <functional>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "app/migrator.h"
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
constexpr unsigned kCaseSeconds = 60;  // a run that takes longer has hung

const char kPlainConfig[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<HotFolderConfiguration>
  <FolderSettings><LogicalPrinter>Print</LogicalPrinter></FolderSettings>
  <DriverSettings><NumCopies>2</NumCopies></DriverSettings>
</HotFolderConfiguration>
)";

std::string ReadBytes(const fs::path& path) {
  std::ifstream in(path, std::ios::binary | std::ios::ate);
  std::string bytes(in ? static_cast<std::size_t>(in.tellg()) : 0, '\0');
  in.seekg(0);
  in.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  return bytes;
}

fs::path StoreFile() {
  return fs::path(StoreHostPath());
}

// One case's installation, and what it must look like afterwards.
class Scene {
 public:
  explicit Scene(TempPrefix& prefix) : prefix_(prefix) {}
  ~Scene() { Release(); }

  TempPrefix& prefix() { return prefix_; }
  fs::path D(const std::string& relative) const { return OnDriveD(prefix_, relative); }

  void List(const std::vector<LegacyFolder>& folders) {
    listed_ = folders;
    WriteLegacyList(prefix_, folders);
  }
  // A list file of any bytes; `folders` are the ones it names.
  void ListBytes(const std::string& bytes, const std::vector<LegacyFolder>& folders = {}) {
    listed_ = folders;
    prefix_.WriteFile(LegacyListHostPath(prefix_), bytes);
  }

  // A folder.cfg on drive D: whose bytes must survive the run unchanged.
  void Config(const std::string& folder_on_d, const std::string& bytes) {
    WriteFolderConfig(prefix_, folder_on_d, bytes);
    configs_[folder_on_d] = bytes;
  }

  // Made immutable now, made mutable again before the prefix goes. A case
  // that requires the flag where the file system has none is not run.
  bool Freeze(const fs::path& path, bool required = true) {
    if (!SetImmutable(path, true)) {
      unavailable_ = required;
      return false;
    }
    frozen_.push_back(path);
    return true;
  }

  // Held from setup until the run is over.
  void HoldExclusiveLock() {
    ASSERT_EQ(sqlite3_open(StoreFile().c_str(), &locker_), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(locker_, "BEGIN EXCLUSIVE", nullptr, nullptr, nullptr), SQLITE_OK);
  }

  void Release() {
    for (const fs::path& path : frozen_) SetImmutable(path, false);
    frozen_.clear();
    if (locker_) sqlite3_close(locker_);
    locker_ = nullptr;
  }

  const std::vector<LegacyFolder>& listed() const { return listed_; }
  bool unavailable() const { return unavailable_; }
  const std::map<std::string, std::string>& configs() const { return configs_; }

 private:
  TempPrefix& prefix_;
  std::vector<LegacyFolder> listed_;
  std::map<std::string, std::string> configs_;
  std::vector<fs::path> frozen_;
  sqlite3* locker_ = nullptr;
  bool unavailable_ = false;
};

// Registers one folder the way the tool would, so that a case starts with a
// store that already holds something, then lets go of the store: the engine
// must open the file afresh, as a new process would. (The store reopens when
// its location changes, and a location under a file cannot be opened.)
void SeedStore(const std::string& folder_path) {
  db::Setting setting;
  setting.Name = "Seed";
  setting.FolderPath = folder_path;
  db::FolderConfiguration folder;
  folder.FolderPath = folder_path;
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

struct Entry {
  fs::file_type type;
  std::uintmax_t size;
  std::size_t hash;  // of the content, or of the link target
  bool operator==(const Entry& o) const {
    return type == o.type && size == o.size && hash == o.hash;
  }
};
using Snapshot = std::map<std::string, Entry>;

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
  std::set<std::string> seen;
  for (const LegacyFolder& folder : scene.listed()) {
    if (!seen.insert(folder.path).second) continue;
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
    Entry entry{it->symlink_status(ec).type(), 0, 0};
    if (entry.type == fs::file_type::regular) {
      entry.size = it->file_size(ec);
      entry.hash = std::hash<std::string>()(ReadBytes(path));
    } else if (entry.type == fs::file_type::symlink) {
      entry.hash = std::hash<std::string>()(fs::read_symlink(path, ec).string());
    }
    snapshot[fs::relative(path, root).string()] = entry;
  }
  return snapshot;
}

// ---- The cases --------------------------------------------------------------

struct Case {
  const char* name;
  std::function<void(Scene&)> setup;
  std::vector<std::string> status = {};      // the engine's status list, in order
  std::vector<std::string> registered = {};  // FolderPath of each stored folder, in order
  std::vector<std::string> retired = {};     // configs (folder on D:) found retired afterwards
  std::function<void(Scene&, const std::vector<StoredHotFolder>&)> verify = nullptr;
};

std::vector<std::string> Statuses(std::initializer_list<std::pair<int, const char*>> runs) {
  std::vector<std::string> statuses;
  for (const auto& [count, text] : runs) statuses.insert(statuses.end(), count, text);
  return statuses;
}

const char kMissing[] = "Failed; File missing";

// A folder migrated from an unreadable folder.cfg gets the default chain and
// no driver settings: nothing of the damaged file reaches the store.
void ExpectDefaults(Scene&, const std::vector<StoredHotFolder>& stored) {
  ASSERT_EQ(stored.size(), 1u);
  EXPECT_EQ(stored[0].setting.Filters.size(), 4u);
  EXPECT_TRUE(stored[0].jobConfiguration.empty());
  EXPECT_EQ(stored[0].setting.Queue, "hold");
}

void ExpectCopies(const std::vector<StoredHotFolder>& stored, const char* copies) {
  ASSERT_EQ(stored.size(), 1u);
  auto found = stored[0].jobConfiguration.find("num copies");
  ASSERT_NE(found, stored[0].jobConfiguration.end());
  EXPECT_EQ(found->second.Value, copies);
}

std::string Utf16WithBom(const std::string& ascii) {
  std::string bytes("\xFF\xFE", 2);
  for (char c : ascii) bytes += std::string{c, '\0'};
  return bytes;
}

std::string Garbage(std::size_t size, unsigned seed) {
  std::mt19937 random(seed);
  std::string bytes(size, '\0');
  for (char& c : bytes) c = static_cast<char>(random());
  return bytes;
}

std::string Nested(int depth) {
  std::string xml;
  xml.reserve(depth * 7u);
  for (int i = 0; i < depth; ++i) xml += "<a>";
  for (int i = 0; i < depth; ++i) xml += "</a>";
  return xml;
}

// A valid document whose size is all in one comment.
std::string Huge(std::size_t size) {
  std::string xml =
      "<HotFolderConfiguration><DriverSettings><NumCopies>5</NumCopies>"
      "</DriverSettings><!--";
  xml.append(size, 'x');
  return xml + "--></HotFolderConfiguration>";
}

const char kBillionLaughs[] = R"(<?xml version="1.0"?>
<!DOCTYPE lolz [
 <!ENTITY lol "lol">
 <!ENTITY lol1 "&lol;&lol;&lol;&lol;&lol;&lol;&lol;&lol;&lol;&lol;">
 <!ENTITY lol2 "&lol1;&lol1;&lol1;&lol1;&lol1;&lol1;&lol1;&lol1;&lol1;&lol1;">
 <!ENTITY lol3 "&lol2;&lol2;&lol2;&lol2;&lol2;&lol2;&lol2;&lol2;&lol2;&lol2;">
 <!ENTITY lol4 "&lol3;&lol3;&lol3;&lol3;&lol3;&lol3;&lol3;&lol3;&lol3;&lol3;">
 <!ENTITY lol5 "&lol4;&lol4;&lol4;&lol4;&lol4;&lol4;&lol4;&lol4;&lol4;&lol4;">
 <!ENTITY lol6 "&lol5;&lol5;&lol5;&lol5;&lol5;&lol5;&lol5;&lol5;&lol5;&lol5;">
 <!ENTITY lol7 "&lol6;&lol6;&lol6;&lol6;&lol6;&lol6;&lol6;&lol6;&lol6;&lol6;">
 <!ENTITY lol8 "&lol7;&lol7;&lol7;&lol7;&lol7;&lol7;&lol7;&lol7;&lol7;&lol7;">
 <!ENTITY lol9 "&lol8;&lol8;&lol8;&lol8;&lol8;&lol8;&lol8;&lol8;&lol8;&lol8;">
]>
<HotFolderConfiguration><DriverSettings><Bomb>&lol9;</Bomb></DriverSettings></HotFolderConfiguration>
)";

// A secret on drive C:, named by host path, as an attacker who can write a
// folder.cfg but not read the machine would name it.
std::string WriteSecret(Scene& scene) {
  fs::path secret = scene.prefix().Drive('c') / "secret.txt";
  scene.prefix().WriteFile(secret, kSecret);
  scene.prefix().WriteFile(scene.prefix().Drive('c') / "secret.dtd",
                           std::string("<!ENTITY leak \"") + kSecret + "\">");
  return secret.string();
}

std::string ExternalEntity(const std::string& secret) {
  return "<?xml version=\"1.0\"?>\n<!DOCTYPE HotFolderConfiguration [\n"
         " <!ENTITY leak SYSTEM \"file://" +
         secret +
         "\">\n]>\n"
         "<HotFolderConfiguration><DriverSettings><NumCopies>3</NumCopies>"
         "<Leak>&leak;</Leak></DriverSettings></HotFolderConfiguration>\n";
}

std::string ExternalDtd(const std::string& secret) {
  std::string dtd = fs::path(secret).replace_filename("secret.dtd").string();
  return "<?xml version=\"1.0\"?>\n<!DOCTYPE HotFolderConfiguration SYSTEM \"" + dtd +
         "\">\n"
         "<HotFolderConfiguration><DriverSettings><NumCopies>4</NumCopies>"
         "<Leak>&leak;</Leak></DriverSettings></HotFolderConfiguration>\n";
}

// The store file and its journals, byte for byte.
std::string StoreBytes() {
  std::string bytes;
  for (const char* suffix : {"", "-wal", "-shm", "-journal"}) {
    fs::path file = StoreFile().string() + suffix;
    if (fs::is_regular_file(file)) bytes += ReadBytes(file);
  }
  return bytes;
}

// A case whose store is damaged before the run: the folder is refused, its
// settings go back in place, and the file is left exactly as it was.
Case RefusedStore(const char* name, std::function<void(Scene&)> damage,
                  std::vector<std::string> registered) {
  auto before = std::make_shared<std::string>();
  return Case{name,
              [damage, before](Scene& scene) {
                scene.List({{"D:\\Jobs\\Refused", 2}});
                scene.Config("Jobs/Refused", kPlainConfig);
                damage(scene);
                if (fs::is_regular_file(StoreFile())) *before = ReadBytes(StoreFile());
              },
              {"Unknown error"},
              registered,
              {},
              [before](Scene& scene, const std::vector<StoredHotFolder>&) {
                EXPECT_FALSE(fs::exists(scene.D("Jobs/Refused") / kRetiredDir));
                if (fs::is_regular_file(StoreFile())) {
                  EXPECT_TRUE(ReadBytes(StoreFile()) == *before) << "store file changed";
                }
              }};
}

std::vector<Case> Cases() {
  std::vector<LegacyFolder> many;
  for (int i = 0; i < 100000; ++i) many.push_back({"D:\\Many\\F" + std::to_string(i), 2});
  return {
      {"list truncated mid-header",
       [](Scene& s) { s.ListBytes(LegacyListBytes({}).substr(0, 20)); }},
      {"list truncated mid-record",
       [](Scene& s) {
         s.Config("Jobs/Whole", kPlainConfig);
         s.Config("Jobs/Torn", kPlainConfig);
         std::string bytes = LegacyListBytes({{"D:\\Jobs\\Whole", 2}, {"D:\\Jobs\\Torn", 2}});
         s.ListBytes(bytes.substr(0, bytes.size() - 100), {{"D:\\Jobs\\Whole", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\Whole"},
       {"Jobs/Whole"}},
      {"list file is a FIFO",
       [](Scene& s) {
         fs::create_directories(LegacyListHostPath(s.prefix()).parent_path());
         ASSERT_EQ(mkfifo(LegacyListHostPath(s.prefix()).c_str(), 0600), 0);
       }},
      {"100,000 records",
       [many](Scene& s) {
         s.List(many);
         s.Config("Many/F0", kPlainConfig);
         s.Config("Many/F99999", kPlainConfig);
       },
       Statuses({{1, "Success"}, {99998, kMissing}, {1, "Success"}}),
       {"D:\\Many\\F0", "D:\\Many\\F99999"},
       {"Many/F0", "Many/F99999"}},
      {"dot-dot cannot leave the drive",
       [](Scene& s) {
         // Climbing out of D: would reach drive_c\Victim through the prefix.
         s.prefix().WriteFile(s.prefix().Drive('c') / "Victim" / kSettingsDir / "folder.cfg",
                              kPlainConfig);
         s.Config("Jobs/Dots", kPlainConfig);
         s.List({{"D:\\..\\drive_c\\Victim", 2},
                 {"D:\\..\\..\\..\\..\\drive_c\\Victim", 2},
                 {"D:\\Jobs\\..\\..\\..\\Jobs\\Dots", 2}});
       },
       {kMissing, kMissing, "Success"},
       {"D:\\Jobs\\..\\..\\..\\Jobs\\Dots"},
       {"Jobs/Dots"}},
      {"device names",
       [](Scene& s) {
         s.Config("Jobs/CON", kPlainConfig);
         fs::create_directories(s.D("Jobs/NUL"));
         s.List({{"D:\\Jobs\\CON", 2},
                 {"D:\\Jobs\\NUL", 2},
                 {"\\\\.\\NUL", 2},
                 {"CON", 2},
                 {"NUL:", 2}});
       },
       {"Success", kMissing, kMissing, kMissing, kMissing},
       {"D:\\Jobs\\CON"},
       {"Jobs/CON"}},
      {"undecodable, overlong, rooted and share paths",
       [](Scene& s) {
         s.Config("Jobs/Ok", kPlainConfig);
         s.List({{"D:\\Jobs\\\x81\x8D\x8F\x90\x9D", 2},
                 {"D:\\Jobs\\\x01\x1F\x7F", 2},
                 {"D:\\" + std::string(256, 'A'), 2},
                 {"\\Jobs\\Ok", 2},
                 {"\\\\server\\share\\Jobs\\Ok", 2},
                 {"\\\\..\\..\\drive_d\\Jobs\\Ok", 2}});
       },
       {kMissing, kMissing, kMissing, kMissing, kMissing, kMissing}},
      {"drive root",
       [](Scene& s) {
         s.Config("", kPlainConfig);
         s.List({{"D:\\", 2}});
       },
       {"Success"},
       {"D:\\"},
       {""},
       [](Scene&, const std::vector<StoredHotFolder>& stored) {
         EXPECT_EQ(stored[0].setting.Name, "");
         EXPECT_EQ(stored[0].folderConfiguration.WorkFolder,
                   "D:\\\\[_KYR_HotFolder_]\\[WorkFolder]");
       }},
      {"forward slashes",
       [](Scene& s) {
         s.Config("Jobs/Fwd", kPlainConfig);
         s.List({{"D:/Jobs/Fwd", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\Fwd"},
       {"Jobs/Fwd"}},
      {"a file where a directory belongs",
       [](Scene& s) {
         s.prefix().WriteFile(s.D("Jobs/notes.txt"), "not a folder");
         s.prefix().WriteFile(s.D("Jobs/FileSettings") / kSettingsDir, "not a folder");
         fs::create_directories(s.D("Jobs/DirConfig") / kSettingsDir / "folder.cfg");
         s.List({{"D:\\Jobs\\notes.txt", 2},
                 {"D:\\Jobs\\FileSettings", 2},
                 {"D:\\Jobs\\DirConfig", 2}});
       },
       {kMissing, kMissing, kMissing}},
      {"folder.cfg is a FIFO or a device",
       [](Scene& s) {
         fs::create_directories(s.D("Jobs/Fifo") / kSettingsDir);
         ASSERT_EQ(mkfifo((s.D("Jobs/Fifo") / kSettingsDir / "folder.cfg").c_str(), 0600), 0);
         fs::create_directories(s.D("Jobs/Zero") / kSettingsDir);
         fs::create_symlink("/dev/zero", s.D("Jobs/Zero") / kSettingsDir / "folder.cfg");
         s.List({{"D:\\Jobs\\Fifo", 2}, {"D:\\Jobs\\Zero", 2}});
       },
       {kMissing, kMissing}},
      {"listed twice",
       [](Scene& s) {
         s.Config("Jobs/Twice", kPlainConfig);
         s.List({{"D:\\Jobs\\Twice", 2}, {"D:\\Jobs\\Twice", 0}, {"d:\\jobs\\twice\\", 2}});
       },
       // The first retires the settings: the repeats find nothing to migrate,
       // and the folder is stored once, enabled as first listed.
       {"Success", kMissing, kMissing},
       {"D:\\Jobs\\Twice"},
       {"Jobs/Twice"},
       [](Scene&, const std::vector<StoredHotFolder>& stored) { EXPECT_TRUE(stored[0].enabled); }},
      {"empty folder.cfg",
       [](Scene& s) {
         s.Config("Jobs/F", "");
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       ExpectDefaults},
      {"binary garbage",
       [](Scene& s) {
         s.Config("Jobs/F", Garbage(65536, 1));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       ExpectDefaults},
      {"invalid UTF-8",
       [](Scene& s) {
         s.Config("Jobs/F", std::string(kPlainConfig).replace(100, 1, "\xC3\x28\xFF"));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       ExpectDefaults},
      {"UTF-16 with byte-order mark",
       [](Scene& s) {
         s.Config("Jobs/F", Utf16WithBom("<?xml version=\"1.0\" encoding=\"UTF-16\"?>"
                                         "<C><DriverSettings><NumCopies>6</NumCopies>"
                                         "</DriverSettings></C>"));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       [](Scene&, const std::vector<StoredHotFolder>& stored) { ExpectCopies(stored, "6"); }},
      {"nested a million deep",
       [](Scene& s) {
         s.Config("Jobs/F", Nested(1000000));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       ExpectDefaults},
      {"100 MB folder.cfg",
       [](Scene& s) {
         s.Config("Jobs/F", Huge(100u << 20));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       ExpectDefaults},
      {"billion laughs",
       [](Scene& s) {
         s.Config("Jobs/F", kBillionLaughs);
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       ExpectDefaults},
      {"external entity",
       [](Scene& s) {
         s.Config("Jobs/F", ExternalEntity(WriteSecret(s)));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       [](Scene&, const std::vector<StoredHotFolder>& stored) { ExpectCopies(stored, "3"); }},
      {"DOCTYPE naming a local file",
       [](Scene& s) {
         s.Config("Jobs/F", ExternalDtd(WriteSecret(s)));
         s.List({{"D:\\Jobs\\F", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\F"},
       {"Jobs/F"},
       [](Scene&, const std::vector<StoredHotFolder>& stored) { ExpectCopies(stored, "4"); }},
      {"settings directory that cannot be moved",
       [](Scene& s) {
         s.Config("Jobs/Stuck", kPlainConfig);
         s.List({{"D:\\Jobs\\Stuck", 2}});
         // Root renames regardless of permission bits; only the immutable
         // flag stops it. Where there is none, a name already taken does.
         if (!s.Freeze(s.D("Jobs/Stuck"), /*required=*/false)) {
           fs::create_directories(s.D("Jobs/Stuck") / kRetiredDir);
         }
       },
       {"Success"},
       {"D:\\Jobs\\Stuck"},
       {}},
      {"retired name already taken",
       [](Scene& s) {
         s.Config("Jobs/Taken", kPlainConfig);
         s.prefix().WriteFile(s.D("Jobs/Taken") / kRetiredDir / "folder.cfg", "older");
         s.List({{"D:\\Jobs\\Taken", 2}});
       },
       {"Success"},
       {"D:\\Jobs\\Taken"},
       {},
       [](Scene& s, const std::vector<StoredHotFolder>&) {
         EXPECT_EQ(ReadBytes(s.D("Jobs/Taken") / kRetiredDir / "folder.cfg"), "older");
       }},
      RefusedStore("store locked",
                   [](Scene& s) {
                     SeedStore("D:\\Seed");
                     s.HoldExclusiveLock();
                   },
                   {"D:\\Seed"}),
      RefusedStore("store file read-only",
                   [](Scene& s) {
                     SeedStore("D:\\Seed");
                     s.Freeze(StoreFile());
                   },
                   {"D:\\Seed"}),
      RefusedStore("store folder read-only",
                   [](Scene& s) {
                     fs::create_directories(StoreFile().parent_path());
                     s.Freeze(StoreFile().parent_path());
                   },
                   {}),
      RefusedStore("store path is a directory", [](Scene&) { fs::create_directories(StoreFile()); },
                   {}),
      RefusedStore("store of garbage bytes",
                   [](Scene& s) { s.prefix().WriteFile(StoreFile(), Garbage(8192, 2)); }, {}),
      RefusedStore("store with a SQLite header and garbage",
                   [](Scene& s) {
                     s.prefix().WriteFile(StoreFile(),
                                          std::string("SQLite format 3", 16) + Garbage(8176, 3));
                   },
                   {}),
  };
}

std::vector<std::string> Narrow(const wxArrayString& texts) {
  std::vector<std::string> narrow;
  for (const wxString& text : texts) narrow.push_back(text.utf8_string());
  return narrow;
}

// Compares long lists without printing a hundred thousand lines.
void ExpectSameList(const std::vector<std::string>& actual,
                    const std::vector<std::string>& expected, const char* what) {
  EXPECT_EQ(actual.size(), expected.size()) << what;
  for (std::size_t i = 0; i < std::min(actual.size(), expected.size()); ++i) {
    if (actual[i] == expected[i]) continue;
    ADD_FAILURE() << what << " [" << i << "]: " << actual[i] << " != " << expected[i];
    return;
  }
}

void ExpectSettingsKept(const Scene& scene, const Case& c) {
  for (const auto& [folder, bytes] : scene.configs()) {
    fs::path dir = scene.D(folder);
    bool retired = std::count(c.retired.begin(), c.retired.end(), folder) > 0;
    fs::path where = dir / (retired ? kRetiredDir : kSettingsDir) / "folder.cfg";
    EXPECT_TRUE(ReadBytes(where) == bytes) << folder << " lost its settings";
    if (retired) {
      EXPECT_FALSE(fs::exists(dir / kSettingsDir)) << folder;
    }
  }
}

void ExpectUnchanged(const Snapshot& before, const Snapshot& after) {
  for (const auto& [path, entry] : before) {
    auto found = after.find(path);
    EXPECT_TRUE(found != after.end() && found->second == entry) << "changed: " << path;
  }
  for (const auto& [path, entry] : after) {
    EXPECT_TRUE(before.count(path)) << "appeared: " << path;
  }
}

void RunCase(const Case& c) {
  TempPrefix prefix;
  Scene scene(prefix);
  c.setup(scene);
  if (testing::Test::HasFatalFailure()) return;
  if (scene.unavailable()) {
    std::printf("[ NOT RUN  ] %s: the file system has no immutable flag\n", c.name);
    return;
  }
  fs::path root = fs::canonical(prefix.root());
  std::set<fs::path> changeable = ChangeableRoots(scene);
  Snapshot before = Take(root, changeable);

  CHFMigrator engine;
  alarm(kCaseSeconds);  // the default action ends the process: a hang fails
  engine.Run();
  alarm(0);
  scene.Release();

  ExpectSameList(Narrow(engine.m_Status), c.status, "status");
  std::vector<StoredHotFolder> stored;
  wxString error;
  ReadStore(StoreHostPath(), &stored, &error);
  std::vector<std::string> registered;
  for (const StoredHotFolder& folder : stored) {
    registered.push_back(folder.setting.FolderPath.utf8_string());
  }
  ExpectSameList(registered, c.registered, "registered");
  ExpectSettingsKept(scene, c);
  EXPECT_EQ(StoreBytes().find(kSecret), std::string::npos) << "a local file reached the store";
  ExpectUnchanged(before, Take(root, changeable));
  if (c.verify) c.verify(scene, stored);
}

TEST(Hostile, EveryInputEndsSoundly) {
  for (const Case& c : Cases()) {
    SCOPED_TRACE(c.name);
    RunCase(c);
  }
}

}  // namespace
