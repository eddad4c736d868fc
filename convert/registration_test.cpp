// Registration into a real store in a fresh prefix: what only this level
// sees. Chains, names, paths, queue words and job keys are checked end to
// end by the sample installation's reviewed dump (tests/migration_test.cpp).
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <optional>
#include <string>

#include "convert/host_resolver.h"
#include "convert/server_lookup.h"
#include "engine/migrator.h"
#include "store/store_reader.h"
#include "tests/cases.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

namespace fs = std::filesystem;
using namespace platform;

const std::uint32_t kRo = kAttributeReadOnly, kSys = kAttributeSystem, kHid = kAttributeHidden;

// A row of convert/resolve_cases.tsv: what the faked name services answer.
const CaseRow* g_case;
std::string g_queries;

bool Answer(int column, const std::string& query, std::string* name) {
  const std::string& answer = g_case->at(column);
  g_queries += query + ";";
  if (answer != "-") *name = answer;
  return answer != "-";
}

const HostResolver kFakeResolver = {
    [] { return g_case->at(0) == "yes"; },
    [](std::string* name) { return Answer(1, "local", name); },
    [](const std::string& q, std::string* name) { return Answer(2, "name:" + q, name); },
    [](const std::string& q, std::string* name) { return Answer(2, "addr:" + q, name); },
};

TEST(ResolveServerName, DispatchAndShortName) {
  UseHostResolver(&kFakeResolver);
  for (const CaseRow& c : ReadCases("convert/resolve_cases.tsv")) {
    g_case = &c;
    g_queries.clear();
    wxString name = "legacy";
    const bool resolved = c[4] != "-";
    EXPECT_EQ(ResolveServerName(wxString::FromUTF8(c[3]), name), resolved) << c[3];
    EXPECT_EQ(name + " " + g_queries, wxString::FromUTF8(resolved ? c[4] : "legacy") + " " + c[5]);
  }
  UseHostResolver(nullptr);
}

// The settings directory retired with its attributes but read-only and
// system, or left in place when the retired name is taken; put back with
// the attributes it had when the store refuses the folder for a damaged
// store; left retired when the path is registered already (a second run
// over a folder whose move failed or was lost; it stays enabled though
// listed disabled). A busy directory is tried again until it is free, but
// only a bounded number of times. The PDF filter's error folder is the
// running server's directory, its module path cut to 259 characters first
// as Windows reads it.
TEST(Registration, RetiringAndRefusal) {
  enum Store { kGood, kDamaged, kRegistered };
  const struct {
    Store store;
    bool taken;
    std::uint32_t before, after;
    int busy;            // moves refused as busy before the directory is free
    std::string server;  // where a server runs on D:, "" for none
  } cases[] = {
      {kGood, false, kRo | kSys | kHid | kAttributeArchive, kHid | kAttributeArchive, 0, ""},
      {kGood, true, kRo | kHid, kHid, 0, ""},
      {kDamaged, false, kRo | kSys, kRo | kSys, 0, ""},
      {kRegistered, false, kRo | kHid, kHid, 0, ""},
      {kGood, false, kRo, 0, 5, std::string(100, 'L') + "/" + std::string(200, 'M')},
      {kGood, false, kRo, 0, 1000, ""},  // never free: registered all the same
  };
  const CaseRow local = {"yes", "build7.lab.example", "-", "", "-", "-"};
  g_case = &local;
  UseHostResolver(&kFakeResolver);
  for (const auto& c : cases) {
    SCOPED_TRACE(&c - cases);
    TempPrefix prefix;
    const fs::path folder = prefix.Drive('d') / "Jobs" / "A";
    const fs::path settings = folder / "[_KYR_HotFolder_]",
                   retired = folder / "[_KYR_HotFolder_Old]";
    fs::create_directories(settings);
    if (c.taken) fs::create_directory(retired);
    if (c.store == kDamaged) prefix.WriteFile(fs::path(StoreHostPath()), std::string(4096, 'x'));
    std::optional<RunningServer> server;
    if (!c.server.empty()) {
      fs::create_directories(prefix.Drive('d') / c.server);
      fs::copy(BinDir() + "/hotfolder.exe", prefix.Drive('d') / c.server / "hotfolder.exe");
      server.emplace((prefix.Drive('d') / c.server / "hotfolder.exe").string());
    }
    CHFMigrator engine;
    for (int round = c.store == kRegistered ? 0 : 1; round < 2; ++round) {
      ASSERT_TRUE(SetFileAttributes(FromHostPath(settings.string()), c.before));
      engine.m_FolderSettings.GetOrInsert("HFFolderPath") = "D:\\Jobs\\A";
      engine.m_FolderSettings.GetOrInsert("ServerAddr") = "LOCALHOST";
      engine.m_CurrentEnabled = c.store != kRegistered || round == 0;
      FailNextMoves(c.busy, MoveOutcome::kBusy);
      EXPECT_EQ(engine.RegisterHotFolder(), round == 0 || c.store == kGood);
      if (round == 0) fs::rename(retired, settings);
    }
    // Each busy move waits a little longer than the one before, a few
    // seconds in all; then the first move and the one after clearing the
    // attributes have been tried as often as they may be.
    constexpr int kMostAttempts = 12;
    const int attempts = c.busy - FailNextMoves(0, MoveOutcome::kBusy);
    EXPECT_EQ(attempts, std::min(c.busy, kMostAttempts));
    const bool moved = c.store != kDamaged && !c.taken && c.busy < kMostAttempts;
    EXPECT_EQ(fs::exists(settings), !moved);
    EXPECT_EQ(fs::exists(retired), moved || c.taken);
    std::uint32_t attributes = 0;
    EXPECT_TRUE(
        GetFileAttributes(FromHostPath((moved ? retired : settings).string()), &attributes));
    EXPECT_EQ(attributes & ~kAttributeDirectory, c.after);
    if (c.store == kDamaged) continue;
    std::vector<StoredHotFolder> stored;
    wxString error;
    ASSERT_TRUE(ReadStore(StoreHostPath(), &stored, &error)) << error;
    ASSERT_EQ(stored.size(), 1u);
    EXPECT_TRUE(stored[0].enabled);
    // The address stays as written; the name is the local host's, whole.
    EXPECT_EQ(stored[0].setting.ServerAddr + "|" + stored[0].setting.ServerName,
              "LOCALHOST|build7.lab.example");
    // D:\LLL...\MMM...\hotfolder.exe cut within MMM...; no server: empty.
    if (!c.server.empty() || ServerProcesses().empty()) {
      const std::string error_path = c.server.empty() ? "" : "D:\\" + c.server.substr(0, 100);
      EXPECT_NE(stored[0].filterConfiguration.Find("<ERRORPATH>" + error_path + "</ERRORPATH>"),
                wxNOT_FOUND);
    }
  }
  UseHostResolver(nullptr);
}

// A folder the store refuses gets its settings back; listed again under
// another spelling, it is read again after the move back, not before it,
// though the run reads each next folder while the store commits.
TEST(Registration, RefusedFolderListedAgainIsReadAfterTheMoveBack) {
  TempPrefix prefix;
  const fs::path settings = prefix.Drive('d') / "Jobs" / "A" / "[_KYR_HotFolder_]";
  prefix.WriteFile(settings / "folder.cfg", "<HotFolderConfiguration/>");
  prefix.WriteFile(fs::path(StoreHostPath()), std::string(4096, 'x'));
  CHFMigrator engine;
  engine.m_Folders.Add("D:\\Jobs\\A");
  engine.m_Folders.Add("d:\\jobs\\a\\");
  engine.MigrateFolders();
  EXPECT_EQ(wxJoin(engine.m_Status, '|').ToStdString(), "Unknown error|Unknown error");
  EXPECT_TRUE(fs::exists(settings / "folder.cfg"));
}

}  // namespace
