// The built hfmigrate over a legacy installation of ordinary and hostile
// folders (installation/setup.tsv), checked through the built hfstore's dump
// against a reviewed one (installation/dump.json) and against the disk: the
// settings directories it names retired byte for byte, nothing else changed,
// and a second run changing nothing at all.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "store/schema.h"
#include "tests/cases.h"
#include "tests/hot_folder.h"
#include "tests/legacy_fixture.h"
#include "tests/snapshot.h"
#include "tests/temp_prefix.h"

namespace {

namespace fs = std::filesystem;
using nlohmann::json;

const std::string kData = std::string(HF_SOURCE_DIR) + "/tests/installation/";
const char kStoreDir[] = "drive_c/ProgramData/KYR/Dirorodiv";

// Host path of a path on a drive of the prefix.
fs::path Host(const TempPrefix& prefix, std::string windows) {
  std::replace(windows.begin(), windows.end(), '\\', '/');
  return prefix.Drive(static_cast<char>(tolower(windows[0]))) / windows.substr(3);
}

std::string Content(const TempPrefix& prefix, std::string text) {
  if (text[0] == '@') text = TempPrefix::ReadFile(kData + text.substr(1));
  for (std::size_t at; (at = text.find("$PREFIX")) != std::string::npos;)
    text.replace(at, 7, prefix.root().string());
  return text;
}

// Builds the installation; answers the tree the run must leave.
Tree Install(const TempPrefix& prefix) {
  std::vector<LegacyFolder> listed;
  std::vector<std::string> retired;
  for (const CaseRow& row : ReadCases("tests/installation/setup.tsv")) {
    const fs::path path = row[0] == "list" ? fs::path() : Host(prefix, row.at(1));
    if (row[0] != "list" && row[0] != "retired") fs::create_directories(path.parent_path());
    if (row[0] == "file") prefix.WriteFile(path, Content(prefix, row.at(2)));
    if (row[0] == "dir") fs::create_directories(path);
    if (row[0] == "fifo") mkfifo(path.c_str(), 0600);
    if (row[0] == "link") fs::create_symlink(row.at(2), path);
    if (row[0] == "retired")
      retired.push_back(fs::relative(path / "[_KYR_HotFolder_]", prefix.root()).generic_string());
    const int count = row.size() > 3 ? std::stoi(row[3]) : 0;
    for (int i = 0; row[0] == "list" && i < std::max(count, 1); ++i)
      listed.push_back({row.at(2) + (count ? std::to_string(i) : ""),
                        static_cast<std::uint16_t>(std::stoi(row[1]))});
  }
  WriteLegacyList(prefix, listed);
  return Retired(Snapshot(prefix.root()), retired);
}

// The names that differ, the store's folder and the lock files of named
// mutexes (each run holds one of its own) left out.
std::string Differences(const Tree& all, const Tree& with_locks) {
  const Tree after = Without(Without(all, kStoreDir), ".mutex/");
  const Tree expected = Without(with_locks, ".mutex/");
  std::string names;
  for (const auto& [name, entry] : after)
    if (!expected.count(name) || expected.at(name) != entry) names += name + "\n";
  for (const auto& [name, entry] : expected) names += after.count(name) ? "" : name + "\n";
  return names;
}

// The dump with the server's directory, which depends on where the tests
// are built, written as "<server>".
json Dump() {
  std::string text = Hfstore({"dump"}).out;
  const std::wstring host = platform::FromHostPath(fs::canonical(BinDir()).string());
  const std::string server(host.begin(), host.end());
  for (std::size_t at; (at = text.find(server)) != std::string::npos;)
    text.replace(at, server.size(), "<server>");
  return json::parse(text, nullptr, false);
}

// Runs SQL on the store (made if missing); answers the first column of the
// last row as a number, -1 for none.
int StoreSql(const TempPrefix& prefix, const std::string& sql) {
  const fs::path file = prefix.root() / kStoreDir / "HotFolders.db";
  fs::create_directories(file.parent_path());
  sqlite3* db = nullptr;
  int number = -1;
  const auto first = [](void* n, int, char** v, char**) {
    return *static_cast<int*>(n) = std::stoi(v[0]), 0;
  };
  if (sqlite3_open(file.c_str(), &db) == SQLITE_OK)
    sqlite3_exec(db, sql.c_str(), first, &number, nullptr);
  sqlite3_close(db);
  return number;
}

// The store, made ahead of the run, logs every change of a folder's enabled
// state: a folder listed disabled is created disabled in its one commit.
const std::string kLogEnabledChanges =
    db::CreateSchemaSql() +
    "CREATE TABLE enabled_log(path); CREATE TRIGGER log AFTER UPDATE OF enabled ON hot_folder "
    "BEGIN INSERT INTO enabled_log VALUES(new.FolderPath); END;";

TEST(Migration, InstallationEndToEnd) {
  TempPrefix prefix;
  RunningServer server;  // before the picture: it keeps its mutex in the prefix
  const Tree expected = Install(prefix);
  StoreSql(prefix, kLogEnabledChanges);
  const json golden = json::parse(TempPrefix::ReadFile(kData + "dump.json"), nullptr, false);
  for (int run = 0; run < 2; ++run) {
    SCOPED_TRACE(run);
    EXPECT_EQ(RunProgram("timeout", {"60", BinDir() + "/hfmigrate"}).status, 255);
    EXPECT_EQ(json::diff(golden, Dump()).dump(1), "[]");
    EXPECT_EQ(Differences(Snapshot(prefix.root()), expected), "");
    EXPECT_EQ(StoreSql(prefix, "SELECT count(*) FROM enabled_log"), 0);
  }
}

// A refused move (both attempts at A's, the first folder's) and a move
// lost after its commit was durable (C's, put back by hand after the run):
// each folder is registered once, and a second run retires what is left
// without changing what the store holds.
TEST(Migration, RefusedOrLostMovesFinishedByTheNextRun) {
  TempPrefix prefix;
  RunningServer server;
  std::vector<LegacyFolder> listed;
  for (const char* name : {"A", "B", "C"}) {
    WriteFolderConfig(prefix, std::string("Jobs/") + name, "<HotFolderConfiguration/>");
    listed.push_back(
        {std::string("D:\\Jobs\\") + name, static_cast<std::uint16_t>(*name == 'A' ? 0 : 2)});
  }
  WriteLegacyList(prefix, listed);
  const auto settings = [&](const char* name, const char* dir) {
    return OnDriveD(prefix, std::string("Jobs/") + name) / dir;
  };
  setenv("HF_TEST_FAIL_MOVES", "2 failed", 1);
  EXPECT_EQ(RunProgram(BinDir() + "/hfmigrate").status, 255);
  unsetenv("HF_TEST_FAIL_MOVES");
  RunResult check = Hfstore({"check"});
  EXPECT_EQ(check.status, 1);
  EXPECT_NE(check.out.find("settings not retired\tD:\\Jobs\\A\t"), std::string::npos) << check.out;
  EXPECT_NE(check.out.find(": run hfmigrate again\n"), std::string::npos) << check.out;
  const json stored = Dump();
  fs::rename(settings("C", "[_KYR_HotFolder_Old]"), settings("C", "[_KYR_HotFolder_]"));

  EXPECT_EQ(RunProgram(BinDir() + "/hfmigrate").status, 255);
  EXPECT_EQ(json::diff(stored, Dump()).dump(1), "[]");
  EXPECT_EQ(stored["hotFolders"].size(), 3u);
  check = Hfstore({"check"});
  EXPECT_EQ(check.status, 0) << check.out;
  for (const char* name : {"A", "B", "C"}) {
    EXPECT_TRUE(fs::exists(settings(name, "[_KYR_HotFolder_Old]/folder.cfg")) &&
                !fs::exists(settings(name, "[_KYR_HotFolder_]")))
        << name;
  }
  EXPECT_FALSE(fs::exists(prefix.Drive('c') / "ProgramData/KYR/Dirorodiv/hfmigrate.run"));
}

}  // namespace
