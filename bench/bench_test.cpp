// The benchmark's tools against the real parts they stand beside: the
// generated installation is read by the engine's own list reader, the floor
// plans from a store the real store wrote, and the floor does what it plans.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <wx/init.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include "app/migrator.h"
#include "platform/platform.h"
#include "store/store.h"
#include "store/store_reader.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace fs = std::filesystem;

namespace {

std::string Bin(const char* name) {
  return BinDir() + "/" + name;
}

std::string ReadFile(const fs::path& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// Every file under `root`, by relative path, with its bytes.
std::string Tree(const fs::path& root) {
  std::string all;
  for (const auto& entry : fs::recursive_directory_iterator(root)) {
    if (!entry.is_regular_file()) continue;
    all += fs::relative(entry.path(), root).string() + "\n" + ReadFile(entry.path()) + "\n";
  }
  return all;
}

int CountConfigs(const fs::path& root) {
  int count = 0;
  for (const auto& entry : fs::recursive_directory_iterator(root)) {
    count += entry.path().filename() == "folder.cfg";
  }
  return count;
}

// D:\\rest inside a generated prefix.
fs::path HostDir(const fs::path& prefix, std::string windows) {
  std::replace(windows.begin(), windows.end(), '\\', '/');
  return prefix / "drive_d" / windows.substr(3);
}

int FloorRows(const fs::path& prefix) {
  fs::path file = prefix / "drive_c" / "ProgramData" / "KYR" / "Dirorodiv" / "HotFolders.db";
  sqlite3* db = nullptr;
  sqlite3_stmt* count = nullptr;
  int rows = -1;
  if (sqlite3_open_v2(file.c_str(), &db, SQLITE_OPEN_READONLY, nullptr) == SQLITE_OK &&
      sqlite3_prepare_v2(db, "SELECT count(*) FROM row", -1, &count, nullptr) == SQLITE_OK &&
      sqlite3_step(count) == SQLITE_ROW) {
    rows = sqlite3_column_int(count, 0);
  }
  sqlite3_finalize(count);
  sqlite3_close(db);
  return rows;
}

class BenchTest : public ::testing::Test {
 protected:
  wxInitializer init_;
  TempPrefix scratch_;  // holds generated prefixes; WINEPREFIX names it until a test resets it
};

TEST_F(BenchTest, GeneratedInstallationIsDeterministicAndReadByTheEngine) {
  const fs::path a = scratch_.root() / "a", b = scratch_.root() / "b", c = scratch_.root() / "c";
  ASSERT_EQ(RunProgram(Bin("hfbench_generate"), {a.string(), "120", "7"}).status, 0);
  ASSERT_EQ(RunProgram(Bin("hfbench_generate"), {b.string(), "120", "7"}).status, 0);
  ASSERT_EQ(RunProgram(Bin("hfbench_generate"), {c.string(), "120", "8"}).status, 0);
  EXPECT_EQ(Tree(a), Tree(b));
  EXPECT_NE(Tree(a), Tree(c));
  EXPECT_EQ(RunProgram(Bin("hfbench_generate"), {a.string(), "120", "7"}).status, 2)
      << "an existing prefix is never written over";

  setenv("WINEPREFIX", a.c_str(), 1);
  CHFMigrator engine;
  ASSERT_TRUE(engine.ReadLegacyList());
  ASSERT_EQ(engine.m_Folders.size(), 120u);
  int disabled = 0, with_config = 0;
  for (std::size_t i = 0; i < engine.m_Folders.size(); ++i) {
    std::wstring folder = engine.m_Folders[i].ToStdWstring();
    EXPECT_TRUE(platform::DirectoryExists(folder)) << engine.m_Folders[i];
    with_config += platform::FileExists(folder + L"\\[_KYR_HotFolder_]\\folder.cfg");
    disabled += engine.m_EnabledFlags[i] == "0";
  }
  EXPECT_EQ(with_config, CountConfigs(a));
  EXPECT_GT(disabled, 0);
  EXPECT_LT(with_config, 120);  // some folders have lost their settings
}

TEST_F(BenchTest, FloorWritesWhatTheStorePlans) {
  // Two folders registered through the real store, the second disabled.
  const fs::path tool = scratch_.root() / "tool", floor = scratch_.root() / "floor";
  for (const fs::path& prefix : {tool, floor}) {
    ASSERT_EQ(RunProgram(Bin("hfbench_generate"), {prefix.string(), "2", "3"}).status, 0);
  }
  setenv("WINEPREFIX", tool.c_str(), 1);
  CHFMigrator engine;
  ASSERT_TRUE(engine.ReadLegacyList());
  for (std::size_t i = 0; i < 2; ++i) {
    db::Setting setting;
    setting.FolderPath = engine.m_Folders[i];
    setting.Filters = {{"PDF", "KYR.PDF.1"}, {"PS", "KYR.PS.1"}};
    db::FolderConfiguration folder;
    db::JobConfiguration job;
    job.emplace("Collate", db::JobSettingEntry{"Collate", "True", ""});
    db::FilterConfiguration filter;
    db::ImposeConfiguration impose;
    db::PreflightConfiguration preflight;
    RODuriZudaze& store = RODuriZudaze::GetInstance();
    ASSERT_NE(store.CreateHotFolder(setting, folder, job, filter, impose, preflight), 0);
    if (i == 1) {
      ASSERT_TRUE(store.DisableHotFolder(setting.FolderPath));
    }
  }

  const fs::path plan = scratch_.root() / "plan", out = scratch_.root() / "out";
  // hfbench_measure runs the planner and keeps its standard output apart.
  std::string command = "'" + Bin("hfbench_floor") + "' plan '" + std::string(StoreHostPath()) +
                        "' > '" + plan.string() + "'";
  ASSERT_EQ(RunProgram(Bin("hfbench_measure"), {out.string(), "/bin/sh", "-c", command}).status, 0);
  std::istringstream measured(ReadFile(out));
  double wall = -1;
  long rss = 0;
  int status = -1;
  measured >> wall >> rss >> status;
  EXPECT_EQ(status, 0);
  EXPECT_GE(wall, 0);
  EXPECT_GT(rss, 0);

  // Record, folder configuration, two filters, one job setting; one more
  // row for the update that disabled the second.
  std::istringstream lines(ReadFile(plan));
  std::string line;
  int rows[2] = {0, 0};
  for (int i = 0; i < 2 && std::getline(lines, line); ++i) {
    std::istringstream fields(line.substr(line.find('\t') + 1));
    fields >> rows[i];
    EXPECT_EQ(line.substr(0, line.find('\t')), engine.m_Folders[i].utf8_string());
  }
  EXPECT_EQ(rows[0], 5);
  EXPECT_EQ(rows[1], 6);

  ASSERT_EQ(RunProgram(Bin("hfbench_floor"), {"run", floor.string(), plan.string()}).status, 0);
  for (std::size_t i = 0; i < 2; ++i) {
    fs::path dir = HostDir(floor, engine.m_Folders[i].utf8_string());
    EXPECT_TRUE(fs::exists(dir / "[_KYR_HotFolder_Old]" / "folder.cfg")) << dir;
    EXPECT_FALSE(fs::exists(dir / "[_KYR_HotFolder_]")) << dir;
  }
  EXPECT_EQ(FloorRows(floor), rows[0] + rows[1]);
}

}  // namespace
