// The built hfmigrate killed at random moments of a long migration and run
// again, as a print shop whose machine loses power would run it. Every legacy
// folder must end either migrated once and whole, or untouched for the next
// run. Two short windows are allowed and counted: settings retired but the
// store's commit not yet made, and a folder listed disabled that was created
// but not yet disabled (the store takes the two in separate calls).
#include <gtest/gtest.h>
#include <signal.h>

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <map>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "platform/platform.h"
#include "store/store_reader.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

namespace fs = std::filesystem;
using Clock = std::chrono::steady_clock;

constexpr int kFolders = 1000;
constexpr int kKills = 30;
constexpr int kExitStatus = 255;  // the tool's -1

std::string FolderName(int i) {
  char name[16];
  std::snprintf(name, sizeof name, "F%04d", i);
  return name;
}

std::string FolderPath(int i) {
  return "D:\\Crash\\" + FolderName(i);
}

bool Enabled(int i) {
  return i % 4 != 3;
}

// Each folder carries its own number, so that a record that reached the
// wrong folder, or half a record, shows.
std::string Config(int i) {
  return "<HotFolderConfiguration><DriverSettings><NumCopies>" + std::to_string(i) +
         "</NumCopies></DriverSettings></HotFolderConfiguration>";
}

class RunningServer {
 public:
  RunningServer() : pid_(StartProgram(BinDir() + "/hotfolder.exe")) {
    WaitFor([] { return platform::NamedMutexExists(L"KYR Dirorodiv - Server"); });
  }
  ~RunningServer() {
    kill(pid_, SIGKILL);
    WaitProgram(pid_);
  }

 private:
  pid_t pid_;
};

class Installation {
 public:
  Installation() {
    std::vector<LegacyFolder> folders;
    for (int i = 0; i < kFolders; ++i) {
      folders.push_back({FolderPath(i), static_cast<std::uint16_t>(Enabled(i) ? 2 : 0)});
      WriteFolderConfig(prefix_, "Crash/" + FolderName(i), Config(i));
    }
    WriteLegacyList(prefix_, folders);
  }

  fs::path ListFile() const { return LegacyListHostPath(prefix_); }
  fs::path Dir(int i, const char* settings) const {
    return OnDriveD(prefix_, "Crash/" + FolderName(i)) / settings;
  }
  bool InPlace(int i) const { return fs::exists(Dir(i, "[_KYR_HotFolder_]/folder.cfg")); }
  bool Retired(int i) const { return fs::exists(Dir(i, "[_KYR_HotFolder_Old]/folder.cfg")); }

  int CountRetired() const {
    int count = 0;
    for (int i = 0; i < kFolders; ++i) count += !InPlace(i);
    return count;
  }

 private:
  TempPrefix prefix_;
};

int Occurrences(const std::string& text, const std::string& part) {
  int count = 0;
  for (auto at = text.find(part); at != std::string::npos; at = text.find(part, at + 1)) ++count;
  return count;
}

// What the store holds for one folder is whole: the default chain, the job
// setting of its own folder.cfg, its own paths.
bool Whole(const StoredHotFolder& stored, int i) {
  const db::JobConfiguration& job = stored.jobConfiguration;
  auto copies = job.find("num copies");
  std::vector<std::string> chain;
  for (const db::FilterEntry& entry : stored.setting.Filters) {
    chain.push_back(entry.DisplayName.utf8_string());
  }
  return stored.setting.Name == FolderName(i) &&
         stored.folderConfiguration.FolderPath == FolderPath(i) &&
         stored.folderConfiguration.WorkFolder ==
             FolderPath(i) + "\\[_KYR_HotFolder_]\\[WorkFolder]" &&
         job.size() == 1 && copies != job.end() && copies->second.Value == std::to_string(i) &&
         chain == std::vector<std::string>{"PDF", "PS", "TIFF", "VDP"} &&
         Occurrences(stored.filterConfiguration.utf8_string(), "<Filter ") == 4;
}

struct Tally {
  int migrated = 0;
  int untouched = 0;
  int retired_unregistered = 0;  // killed between the move and the commit
  int left_enabled = 0;          // killed between the commit and the disabling
};

// Picks the moment of the next kill: anywhere from start-up to a little past
// an even share of the remaining folders, so that the kills are spread over
// the whole migration and there are enough of them before it is done.
struct Schedule {
  std::mt19937 random{std::random_device{}()};
  double startup_seconds = 0.1;
  double per_folder_seconds = 0.005;

  double NextDelay(int remaining, int kills_left) {
    double share = static_cast<double>(remaining) / (kills_left + 1);
    std::uniform_real_distribution<double> spread(
        0, startup_seconds + 1.5 * share * per_folder_seconds);
    return spread(random);
  }

  void Learn(double delay, int progress) {
    if (progress <= 0 || delay <= startup_seconds) return;
    per_folder_seconds = (per_folder_seconds + (delay - startup_seconds) / progress) / 2;
  }
};

TEST(Crash, KilledRunsLeaveEveryFolderWholeOrUntouched) {
  Installation installation;
  RunningServer server;
  const std::string tool = BinDir() + "/hfmigrate";
  Schedule schedule;

  // A run without a list file costs the start-up alone.
  fs::path list = installation.ListFile();
  fs::rename(list, list.string() + ".away");
  schedule.startup_seconds = RunProgram(tool).seconds;
  fs::rename(list.string() + ".away", list);

  int kills = 0;
  for (int attempt = 0; kills < kKills && attempt < 4 * kKills; ++attempt) {
    int before = installation.CountRetired();
    if (before == kFolders) break;
    double delay = schedule.NextDelay(kFolders - before, kKills - kills);
    pid_t pid = StartProgram(tool);
    ASSERT_GT(pid, 0);
    std::this_thread::sleep_for(std::chrono::duration<double>(delay));
    kill(pid, SIGKILL);
    kills += WaitProgram(pid) == -1;  // a run that ended first was not killed
    schedule.Learn(delay, installation.CountRetired() - before);
  }
  EXPECT_GE(kills, 20);
  EXPECT_EQ(RunProgram(tool).status, kExitStatus);

  std::vector<StoredHotFolder> stored;
  wxString error;
  ASSERT_TRUE(ReadStore(StoreHostPath(), &stored, &error)) << error;
  std::map<wxString, std::vector<const StoredHotFolder*>> by_path;
  for (const StoredHotFolder& folder : stored)
    by_path[folder.setting.FolderPath].push_back(&folder);

  Tally tally;
  for (int i = 0; i < kFolders; ++i) {
    SCOPED_TRACE(FolderPath(i));
    auto found = by_path.find(FolderPath(i));
    int registrations = found == by_path.end() ? 0 : static_cast<int>(found->second.size());
    bool in_place = installation.InPlace(i);
    bool retired = installation.Retired(i);
    ASSERT_LE(registrations, 1) << "registered twice";
    ASSERT_NE(in_place, retired) << "settings directory lost or doubled";
    if (registrations == 0) {
      in_place ? ++tally.untouched : ++tally.retired_unregistered;
      continue;
    }
    const StoredHotFolder& folder = *found->second.front();
    ASSERT_TRUE(retired) << "registered with its legacy settings still in place";
    ASSERT_TRUE(Whole(folder, i)) << "partial record";
    if (folder.enabled != Enabled(i)) {
      // Only one way is possible: created, then killed before disabling.
      // Nothing can close this window while creating and disabling are two
      // calls to the store.
      ASSERT_TRUE(folder.enabled);
      ++tally.left_enabled;
    }
    ++tally.migrated;
  }
  ASSERT_EQ(by_path.size(), static_cast<std::size_t>(tally.migrated)) << "unknown folders stored";
  // The final run reached every folder still in place.
  EXPECT_EQ(tally.untouched, 0);
  std::printf(
      "[   KILLS  ] %d kills; %d migrated, %d retired but unregistered, "
      "%d left enabled, %d untouched\n",
      kills, tally.migrated, tally.retired_unregistered, tally.left_enabled, tally.untouched);
}

}  // namespace
