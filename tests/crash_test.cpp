// The built hfmigrate killed at random moments of a long migration and run
// again, as a print shop whose machine loses power would run it; some kills
// land while a rerun is finishing the interrupted run, having put back the
// settings that run retired but never registered. Between kills
// hfstore check names exactly the folders left interrupted, and no folder
// is ever stored with another enabled state than listed. In the end every
// legacy folder is migrated once, whole, as listed, with its settings
// retired, and a "[_KYR_HotFolder_Old]" that was there before the first run
// is untouched.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <nlohmann/json.hpp>

#include <cstdio>
#include <map>
#include <optional>
#include <random>
#include <regex>
#include <set>

#include "store/store_reader.h"
#include "tests/hot_folder.h"
#include "tests/legacy_fixture.h"

namespace {

namespace fs = std::filesystem;

constexpr int kFolders = 1000;
constexpr int kKills = 60;
constexpr int kKillsAimedAt = 75;   // timing varies; at least kKills must land
const char kKept[] = "Crash/Kept";  // listed; its retired settings are not the tool's

const auto FolderPath = [](int i) { return "D:\\Crash\\F" + std::to_string(i); };
const auto Enabled = [](int i) { return i % 4 != 3; };

struct Installation {
  // Each folder carries its own number, so that a record that reached the
  // wrong folder, or half a record, shows.
  Installation() {
    std::vector<LegacyFolder> folders;
    for (int i = 0; i < kFolders; ++i) {
      folders.push_back({FolderPath(i), static_cast<std::uint16_t>(Enabled(i) ? 2 : 0)});
      WriteFolderConfig(prefix, "Crash/F" + std::to_string(i),
                        "<HotFolderConfiguration><DriverSettings><NumCopies>" + std::to_string(i) +
                            "</NumCopies></DriverSettings></HotFolderConfiguration>");
    }
    folders.push_back({"D:\\Crash\\Kept", 2});
    prefix.WriteFile(KeptConfig(), "kept");
    WriteLegacyList(prefix, folders);
  }

  bool Has(int i, const char* settings) const {
    return fs::exists(OnDriveD(prefix, "Crash/F" + std::to_string(i)) / settings / "folder.cfg");
  }
  fs::path KeptConfig() const {
    return OnDriveD(prefix, kKept) / "[_KYR_HotFolder_Old]" / "folder.cfg";
  }
  bool KeptUntouched() const {
    return TempPrefix::ReadFile(KeptConfig()) == "kept" &&
           !fs::exists(OnDriveD(prefix, kKept) / "[_KYR_HotFolder_]");
  }
  std::string Record() const {
    return TempPrefix::ReadFile(prefix.Drive('c') / "ProgramData/KYR/Dirorodiv/hfmigrate.run");
  }

  TempPrefix prefix;
};

std::map<wxString, std::vector<StoredHotFolder>> StoredByPath() {
  std::vector<StoredHotFolder> stored;
  wxString error;
  EXPECT_TRUE(ReadStore(StoreHostPath(), &stored, &error) || !fs::exists(StoreHostPath())) << error;
  std::map<wxString, std::vector<StoredHotFolder>> by_path;
  for (StoredHotFolder& folder : stored) by_path[folder.setting.FolderPath].push_back(folder);
  return by_path;
}

// What the store holds for one folder is whole: the default chain, the job
// setting of its own folder.cfg, its own paths, its listed enabled state.
bool Whole(const StoredHotFolder& stored, int i) {
  const db::JobConfiguration& job = stored.jobConfiguration;
  auto copies = job.find("num copies");
  wxString chain;
  for (const db::FilterEntry& entry : stored.setting.Filters) chain += entry.DisplayName + ">";
  const std::string xml = stored.filterConfiguration.utf8_string();
  const std::regex filter("<Filter ");
  const auto filters = std::distance(std::sregex_iterator(xml.begin(), xml.end(), filter), {});
  return stored.setting.Name == "F" + std::to_string(i) &&
         stored.folderConfiguration.FolderPath == FolderPath(i) &&
         stored.folderConfiguration.WorkFolder ==
             FolderPath(i) + "\\[_KYR_HotFolder_]\\[WorkFolder]" &&
         job.size() == 1 && copies != job.end() && copies->second.Value == std::to_string(i) &&
         chain == "PDF>PS>TIFF>VDP>" && filters == 4 && stored.enabled == Enabled(i);
}

// After a kill: hfstore check names exactly the folders whose settings are
// retired but not stored, and nothing is stored in another state than
// listed. Answers the interrupted folders.
std::vector<int> CheckBetweenKills(const Installation& installation) {
  const auto stored = StoredByPath();
  std::set<std::string> interrupted;
  std::vector<int> numbers;
  int pending = 0;
  for (int i = 0; i < kFolders; ++i) {
    pending += installation.Has(i, "[_KYR_HotFolder_]");
    if (!installation.Has(i, "[_KYR_HotFolder_]") && !stored.count(FolderPath(i))) {
      interrupted.insert(FolderPath(i));
      numbers.push_back(i);
    }
  }
  RunResult run = Hfstore({"check", "--json"});
  EXPECT_EQ(run.status, pending + interrupted.size() == 0 ? 0 : 1) << run.err;
  const nlohmann::json check = nlohmann::json::parse(run.out, nullptr, false);
  std::set<std::string> reported;
  for (const auto& folder : check["folders"]) {
    if (folder["result"] == "interrupted") reported.insert(folder["folder"]);
  }
  EXPECT_EQ(reported, interrupted);
  EXPECT_EQ(check["summary"]["enabled state differs"], 0);
  EXPECT_EQ(check["summary"]["settings not retired"], 0);
  for (const auto& [path, folders] : stored) {
    int i = std::stoi(path.AfterLast('F').ToStdString());
    EXPECT_TRUE(folders.size() == 1 && Whole(folders[0], i)) << path;
  }
  EXPECT_TRUE(installation.KeptUntouched());
  return numbers;
}

// Holds the store's write lock while it lives, so that a run that has just
// moved a folder's settings waits at that folder's commit (for the store's
// busy timeout) and is killed there. A store not made yet is not locked.
struct StoreWriteLock {
  StoreWriteLock() {
    if (!fs::exists(StoreHostPath()) ||
        sqlite3_open_v2(StoreHostPath().c_str(), &db, SQLITE_OPEN_READWRITE, nullptr) !=
            SQLITE_OK ||
        sqlite3_exec(db, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr) != SQLITE_OK) {
      sqlite3_close(db);
      db = nullptr;
    }
  }
  ~StoreWriteLock() { sqlite3_close(db); }  // closing rolls the transaction back
  sqlite3* db = nullptr;
};

// Each run is killed at one of four moments: while it finishes an
// interrupted run, the moment it has put the settings back; during start-up
// (the run record is written then); just after a move, before its commit,
// which leaves a folder interrupted (the store held locked, so that the run
// waits there; the folder is the first one left, unless a rerun must put
// back an interrupted one first); or anywhere from that move to a few
// folders later. The folder it is killed at lies a
// random way into an even share of the folders left, so that the kills are
// spread over the whole migration.
TEST(Crash, KilledRunsAreFinishedByTheNextRun) {
  Installation installation;
  RunningServer server;
  const std::string tool = BinDir() + "/hfmigrate";
  std::mt19937 random{std::random_device{}()};
  // A run without a list file costs the start-up alone.
  const fs::path list = LegacyListHostPath(installation.prefix);
  fs::rename(list, list.string() + ".away");
  const double startup_seconds = RunProgram(tool).seconds;
  fs::rename(list.string() + ".away", list);
  int kills = 0, recovery_kills = 0, move_kills = 0, most_interrupted = 0;
  std::vector<int> interrupted;
  for (int attempt = 0; kills < kKillsAimedAt && attempt < 4 * kKillsAimedAt; ++attempt) {
    int next = 0;
    while (next < kFolders && !installation.Has(next, "[_KYR_HotFolder_]")) ++next;
    if (next == kFolders && interrupted.empty()) break;
    const std::string record = installation.Record();
    const bool in_recovery = !interrupted.empty() && random() % 2 == 0;
    const bool after_move = !in_recovery && random() % 4 == 0;
    const bool in_startup = !in_recovery && !after_move && random() % 6 == 0;
    const int share = (kFolders - next) / (kKillsAimedAt - kills + 1);
    const bool at_commit = after_move && interrupted.empty() && next < kFolders;
    const int target =
        at_commit ? next : std::min(kFolders - 1, next + static_cast<int>(random() % (share + 1)));
    const int watched = in_recovery ? interrupted[0] : target;
    std::optional<StoreWriteLock> store_lock;
    if (at_commit) store_lock.emplace();
    pid_t pid = StartProgram(tool);
    ASSERT_GT(pid, 0);
    const auto start = std::chrono::steady_clock::now();
    while (!in_startup && installation.Has(watched, "[_KYR_HotFolder_]") == !in_recovery &&
           std::chrono::steady_clock::now() - start < std::chrono::seconds(10)) {
    }
    if (in_startup) {
      std::this_thread::sleep_for(std::chrono::duration<double>(
          std::uniform_real_distribution<double>(0, startup_seconds)(random)));
    } else if (!in_recovery && !after_move) {
      std::this_thread::sleep_for(std::chrono::microseconds(random() % 20000));
    }
    kill(pid, SIGKILL);
    const int status = WaitProgram(pid);
    store_lock.reset();
    if (status != -1) continue;  // a run that ended first was not killed
    ++kills;
    // Killed after putting settings back, before its own record replaced
    // the one it was finishing.
    recovery_kills += in_recovery && installation.Record() == record;
    interrupted = CheckBetweenKills(installation);
    move_kills += after_move && !interrupted.empty();
    most_interrupted = std::max(most_interrupted, static_cast<int>(interrupted.size()));
    if (::testing::Test::HasFailure()) return;
  }
  EXPECT_GE(kills, kKills);
  EXPECT_GE(recovery_kills, 3);
  EXPECT_EQ(RunProgram(tool).status, 255);  // the tool's -1

  // Every folder retired, none interrupted: each is stored once and whole,
  // and hfstore check exits 0 (CheckBetweenKills).
  int retired = 0;
  for (int i = 0; i < kFolders; ++i)
    retired +=
        installation.Has(i, "[_KYR_HotFolder_Old]") && !installation.Has(i, "[_KYR_HotFolder_]");
  EXPECT_EQ(retired, kFolders) << "settings not retired";
  EXPECT_EQ(CheckBetweenKills(installation), std::vector<int>{}) << "interrupted";
  EXPECT_EQ(StoredByPath().size(), static_cast<std::size_t>(kFolders)) << "not all registered";
  EXPECT_EQ(installation.Record(), "");  // a complete run removes it
  std::printf(
      "[   KILLS  ] %d kills: %d between a move and its commit, %d while finishing an"
      " interrupted run; at most %d folders interrupted at once\n",
      kills, move_kills, recovery_kills, most_interrupted);
}

}  // namespace
