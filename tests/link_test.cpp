// Links planted where the tool keeps its files, as an ordinary user could
// below the all-users folder: the run writes nothing through a link owned by
// someone else and creates nothing beyond it; a folder whose store is
// refused keeps its legacy settings, and hfstore says why it refuses. A link
// of the running user's own is followed as before.
#include <gtest/gtest.h>
#include <unistd.h>

#include "engine/migrator.h"
#include "engine/run_record.h"
#include "store/store_reader.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/snapshot.h"

namespace {

namespace fs = std::filesystem;

constexpr uid_t kOtherUser = 65534;

struct Row {
  const char* at;  // below C:\ProgramData\KYR
  bool directory;  // a link to a directory (what stood there moves behind it)
  bool target_exists;
  uid_t owner;  // 0: the running user
  bool migrated;
  const char* refusal;  // what hfstore says, or null when it reads the store
};

const Row kRows[] = {
    {"Dirorodiv/hfmigrate.run.new", false, true, kOtherUser, true, nullptr},
    {"Dirorodiv/hfmigrate.run", false, true, kOtherUser, true, nullptr},
    {"Dirorodiv/HotFolders.db", false, false, kOtherUser, false, "HotFolders.db is a link"},
    {"Dirorodiv/HotFolders.db-wal", false, false, kOtherUser, false, "-wal is a link"},
    {"Dirorodiv/HotFolders.db-shm", false, false, kOtherUser, false, "-shm is a link"},
    {"Dirorodiv/HotFolders.db-journal", false, false, kOtherUser, false, "-journal is a link"},
    {"Dirorodiv", true, true, kOtherUser, false, "Dirorodiv is a link owned by another user"},
    {"", true, true, kOtherUser, false, "KYR is a link owned by another user"},
    {"Dirorodiv", true, true, 0, true, nullptr},
};

TEST(Links, NothingWrittenThroughAnotherUsersLink) {
  if (geteuid() != 0) GTEST_SKIP() << "planting another user's link needs root";
  for (const Row& row : kRows) {
    SCOPED_TRACE(std::string("KYR/") + row.at + (row.owner ? " of another user" : " of our own"));
    TempPrefix prefix;
    const fs::path kyr = prefix.Drive('c') / "ProgramData/KYR";
    const fs::path outside = prefix.root() / "outside", target = outside / "target";
    const fs::path at = *row.at ? kyr / row.at : kyr;
    // D:\Jobs\A is listed; D:\Jobs\X was retired by someone, and the record
    // behind a link names it as this tool's.
    WriteLegacyList(prefix, {{"D:\\Jobs\\A", 2}});
    WriteFolderConfig(prefix, "Jobs/A", "<r/>");
    prefix.WriteFile(OnDriveD(prefix, "Jobs/X/[_KYR_HotFolder_Old]/folder.cfg"), "<r/>");
    fs::create_directories(outside);
    if (row.directory) {
      fs::create_directories(kyr / "Dirorodiv");
      fs::rename(at, target);
    } else if (row.target_exists) {
      prefix.WriteFile(target, EncodeRunRecord({{"D:\\Jobs\\X", true}}));
    }
    fs::create_directories(at.parent_path());
    fs::create_symlink(target, at);
    ASSERT_EQ(lchown(at.c_str(), row.owner, row.owner), 0);
    const Tree outside_before = Snapshot(outside), drive_before = Snapshot(prefix.Drive('d'));

    CHFMigrator engine;
    engine.Run();

    const Tree retired = Retired(drive_before, {"Jobs/A/[_KYR_HotFolder_]"});
    EXPECT_EQ(Snapshot(prefix.Drive('d')) == retired, row.migrated);
    EXPECT_EQ(Snapshot(prefix.Drive('d')) == drive_before, !row.migrated);
    EXPECT_EQ(Snapshot(outside) == outside_before, row.owner != 0);
    for (const char* command : {"list", "check"}) {
      const CapturedRun run = RunCaptured(BinDir() + "/hfstore", {command});
      EXPECT_EQ(run.status, row.refusal ? 1 : 0) << command << run.err;
      EXPECT_NE(run.err.find(row.refusal ? row.refusal : ""), std::string::npos) << run.err;
    }
    EXPECT_EQ(RunCaptured(BinDir() + "/hfstore", {"list"}).out,
              row.migrated ? "enabled\tA\tD:\\Jobs\\A\tPDF > PS > TIFF > VDP\n" : "");
  }
}

}  // namespace
