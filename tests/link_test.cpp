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
#include "tests/cases.h"
#include "tests/hot_folder.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/snapshot.h"

namespace {

namespace fs = std::filesystem;

constexpr uid_t kOtherUser = 65534;

TEST(Links, NothingWrittenThroughAnotherUsersLink) {
  if (geteuid() != 0) GTEST_SKIP() << "planting another user's link needs root";
  const std::vector<CaseRow> rows = ReadCases("tests/link_cases.tsv");
  ASSERT_FALSE(rows.empty());
  for (const CaseRow& row : rows) {
    const bool directory = row.at(1) == "dir", migrated = row.at(3) == "migrated";
    const uid_t owner = row.at(2) == "own" ? 0 : kOtherUser;
    const std::string refusal = row.size() > 4 ? row[4] : "";
    SCOPED_TRACE("KYR/" + row[0] + " of " + row[2]);
    TempPrefix prefix;
    const fs::path kyr = prefix.Drive('c') / "ProgramData/KYR";
    const fs::path outside = prefix.root() / "outside", target = outside / "target";
    const fs::path at = row[0].empty() ? kyr : kyr / row[0];
    // D:\Jobs\A is listed; D:\Jobs\X was retired by someone, and the record
    // behind a link names it as this tool's.
    WriteLegacyList(prefix, {{"D:\\Jobs\\A", 2}});
    WriteFolderConfig(prefix, "Jobs/A", "<r/>");
    prefix.WriteFile(OnDriveD(prefix, "Jobs/X/[_KYR_HotFolder_Old]/folder.cfg"), "<r/>");
    fs::create_directories(outside);
    if (directory) {
      fs::create_directories(kyr / "Dirorodiv");
      fs::rename(at, target);
    } else if (row[1] == "record") {
      prefix.WriteFile(target, EncodeRunRecord({{"D:\\Jobs\\X", true}}));
    }
    fs::create_directories(at.parent_path());
    fs::create_symlink(target, at);
    ASSERT_EQ(lchown(at.c_str(), owner, owner), 0);
    const Tree outside_before = Snapshot(outside), drive_before = Snapshot(prefix.Drive('d'));

    CHFMigrator engine;
    engine.Run();

    const Tree retired = Retired(drive_before, {"Jobs/A/[_KYR_HotFolder_]"});
    EXPECT_EQ(Snapshot(prefix.Drive('d')) == retired, migrated);
    EXPECT_EQ(Snapshot(prefix.Drive('d')) == drive_before, !migrated);
    EXPECT_EQ(Snapshot(outside) == outside_before, owner != 0);
    for (const char* command : {"list", "check"}) {
      const RunResult run = Hfstore({command});
      EXPECT_EQ(run.status, refusal.empty() ? 0 : 1) << command << run.err;
      EXPECT_NE(run.err.find(refusal), std::string::npos) << run.err;
    }
    EXPECT_EQ(Hfstore({"list"}).out,
              migrated ? "enabled\tA\tD:\\Jobs\\A\tPDF > PS > TIFF > VDP\n" : "");
  }
}

}  // namespace
