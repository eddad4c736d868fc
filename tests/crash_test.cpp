// The built hfmigrate killed at random moments of a long migration and run
// again, as a print shop whose machine loses power would run it. Every legacy
// folder must end either migrated once and whole, or untouched for the next
// run. Two short windows are allowed and counted: settings retired but the
// store's commit not yet made, and a folder listed disabled that was created
// but not yet disabled (the store takes the two in separate calls).
#include <gtest/gtest.h>

#include <cstdio>
#include <map>
#include <random>
#include <regex>

#include "store/store_reader.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

namespace fs = std::filesystem;

constexpr int kFolders = 1000;
constexpr int kKills = 30;

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
    WriteLegacyList(prefix, folders);
  }

  bool Has(int i, const char* settings) const {
    return fs::exists(OnDriveD(prefix, "Crash/F" + std::to_string(i)) / settings / "folder.cfg");
  }
  int CountRetired() const {
    int count = 0;
    for (int i = 0; i < kFolders; ++i) count += !Has(i, "[_KYR_HotFolder_]");
    return count;
  }

  TempPrefix prefix;
};

// What the store holds for one folder is whole: the default chain, the job
// setting of its own folder.cfg, its own paths.
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
         chain == "PDF>PS>TIFF>VDP>" && filters == 4;
}

// Picks the moment of the next kill: anywhere from start-up to a little past
// an even share of the remaining folders, so that the kills are spread over
// the whole migration and there are enough of them before it is done.
struct Schedule {
  std::mt19937 random{std::random_device{}()};
  double startup_seconds = 0.1;
  double per_folder_seconds = 0.005;

  double NextDelay(int remaining, int kills_left) {
    double share = static_cast<double>(remaining) / (kills_left + 1);
    return std::uniform_real_distribution<double>(
        0, startup_seconds + 1.5 * share * per_folder_seconds)(random);
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
  const fs::path list = LegacyListHostPath(installation.prefix);
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
  EXPECT_EQ(RunProgram(tool).status, 255);  // the tool's -1

  std::vector<StoredHotFolder> stored;
  wxString error;
  ASSERT_TRUE(ReadStore(StoreHostPath(), &stored, &error)) << error;
  std::map<wxString, std::vector<const StoredHotFolder*>> by_path;
  for (const StoredHotFolder& folder : stored)
    by_path[folder.setting.FolderPath].push_back(&folder);

  int migrated = 0, retired_unregistered = 0, left_enabled = 0;
  for (int i = 0; i < kFolders; ++i) {
    SCOPED_TRACE(FolderPath(i));
    auto found = by_path.find(FolderPath(i));
    bool retired = installation.Has(i, "[_KYR_HotFolder_Old]");
    // The final run reached every folder still in place: none is untouched.
    ASSERT_TRUE(retired && !installation.Has(i, "[_KYR_HotFolder_]"))
        << "settings directory lost, doubled or left in place";
    if (found == by_path.end()) {
      ++retired_unregistered;  // killed between the move and the commit
      continue;
    }
    ASSERT_EQ(found->second.size(), 1u) << "registered twice";
    const StoredHotFolder& folder = *found->second.front();
    ASSERT_TRUE(Whole(folder, i)) << "partial record";
    // Only one way is possible: created, then killed before disabling.
    // Nothing can close this window while creating and disabling are two
    // calls to the store.
    ASSERT_TRUE(folder.enabled || !Enabled(i)) << "disabled, though listed enabled";
    left_enabled += folder.enabled != Enabled(i);
    ++migrated;
  }
  ASSERT_EQ(by_path.size(), static_cast<std::size_t>(migrated)) << "unknown folders stored";
  std::printf("[   KILLS  ] %d kills; %d migrated, %d retired but unregistered, %d left enabled\n",
              kills, migrated, retired_unregistered, left_enabled);
}

}  // namespace
