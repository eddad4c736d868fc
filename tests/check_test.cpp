// hfstore check against hand-made installations, and a run that finds the
// record of an interrupted run: trusted only when whole, and never used to
// touch a retired directory the tool did not create.
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "engine/migrator.h"
#include "engine/run_record.h"
#include "store/store.h"
#include "store/store_reader.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"

namespace {

namespace fs = std::filesystem;

// One listed folder D:\Jobs\<name>: how it is listed, stored and left on disk.
struct Row {
  const char* name;
  bool listed_enabled;
  int stored;     // -1: not stored, else the stored enabled state
  bool config;    // [_KYR_HotFolder_]\folder.cfg
  bool retired;   // [_KYR_HotFolder_Old]
  bool recorded;  // in the record of an interrupted run that was retiring it
  const char* line;
};

const Row kRows[] = {
    {"A", true, 1, false, true, false, "migrated\tD:\\Jobs\\A\tenabled, as listed"},
    {"B", false, 0, false, true, false, "migrated\tD:\\Jobs\\B\tdisabled, as listed"},
    {"C", true, -1, false, false, false,
     "not migrated\tD:\\Jobs\\C\tno folder.cfg at D:\\Jobs\\C\\[_KYR_HotFolder_]\\folder.cfg"},
    {"D", true, -1, false, true, false,  // retired by someone else
     "not migrated\tD:\\Jobs\\D\tno folder.cfg at D:\\Jobs\\D\\[_KYR_HotFolder_]\\folder.cfg; "
     "D:\\Jobs\\D\\[_KYR_HotFolder_Old] is left alone: no interrupted run retired it"},
    // The list allows tabs and line feeds in a path: such a field is written
    // as its JSON string, so the line keeps its three fields.
    {"T\tab\nLF", true, -1, false, false, false,
     "not migrated\t\"D:\\\\Jobs\\\\T\\tab\\nLF\"\t\"no folder.cfg at "
     "D:\\\\Jobs\\\\T\\tab\\nLF\\\\[_KYR_HotFolder_]\\\\folder.cfg\""},
    {"E", true, -1, true, false, false,
     "not migrated\tD:\\Jobs\\E\tnot registered; its settings are still at "
     "D:\\Jobs\\E\\[_KYR_HotFolder_]\\folder.cfg"},
    {"F", true, -1, false, true, true,
     "interrupted\tD:\\Jobs\\F\tsettings retired but not registered: run hfmigrate again"},
    {"G", false, 1, false, true, false,
     "enabled state differs\tD:\\Jobs\\G\tlisted disabled, stored enabled"},
    {"H", true, 1, true, false, false,
     "settings not retired\tD:\\Jobs\\H\tregistered, but its settings are still at "
     "D:\\Jobs\\H\\[_KYR_HotFolder_]\\folder.cfg: run hfmigrate again"},
    // Not UTF-8, the machine's ANSI code page here: named by its bytes.
    {"Caf\xE9", true, -1, true, false, false,
     "path not decodable\tD:\\Jobs\\Caf\\xE9\tthe list's bytes for this path do not decode in "
     "this machine's ANSI code page: hfmigrate cannot find the folder"},
    {"I", true, 1, true, true, false,
     "settings not retired\tD:\\Jobs\\I\tregistered, but its settings are still at "
     "D:\\Jobs\\I\\[_KYR_HotFolder_]\\folder.cfg: D:\\Jobs\\I\\[_KYR_HotFolder_Old] already "
     "exists"},
};
constexpr int kAsListed = 5;  // the first rows: a run that went well

std::string Path(const Row& row) {
  return std::string("D:\\Jobs\\") + row.name;
}

void Lay(const TempPrefix& prefix, const Row* rows, int count) {
  UseUtf8AnsiCodePage(prefix);
  std::vector<LegacyFolder> list;
  std::vector<RunRecordEntry> record;
  for (const Row* row = rows; row != rows + count; ++row) {
    list.push_back({Path(*row), static_cast<std::uint16_t>(row->listed_enabled ? 2 : 0)});
    const fs::path dir = OnDriveD(prefix, std::string("Jobs/") + row->name);
    fs::create_directories(dir);
    if (row->config) prefix.WriteFile(dir / "[_KYR_HotFolder_]" / "folder.cfg", "<r/>");
    if (row->retired) prefix.WriteFile(dir / "[_KYR_HotFolder_Old]" / "folder.cfg", "<r/>");
    if (row->recorded) record.push_back({Path(*row), true});
    if (row->stored < 0) continue;
    db::Setting setting;
    setting.FolderPath = Path(*row);
    db::FolderConfiguration folder;
    db::JobConfiguration job;
    db::FilterConfiguration filter;
    db::ImposeConfiguration impose;
    db::PreflightConfiguration preflight;
    RODuriZudaze& store = RODuriZudaze::GetInstance();
    if (row->stored == 0) store.CreateNextDisabled(setting.FolderPath);
    ASSERT_NE(store.CreateHotFolder(setting, folder, job, filter, impose, preflight), 0);
  }
  WriteLegacyList(prefix, list);
  if (!record.empty()) {
    ASSERT_TRUE(WriteRunRecord(record));
  }
}

CapturedRun Hfstore(const std::vector<std::string>& args) {
  return RunCaptured(BinDir() + "/hfstore", args);
}

TEST(Check, EachKindOfFolderAndTheExitStatus) {
  TempPrefix prefix;
  Lay(prefix, kRows, std::size(kRows));
  std::string expected;
  for (const Row& row : kRows) expected += std::string(row.line) + "\n";
  expected +=
      "11 listed: 2 migrated, 4 not migrated, 1 interrupted, 1 enabled state differs,"
      " 2 settings not retired, 1 path not decodable; not every folder with legacy settings is"
      " migrated as listed\n";
  CapturedRun run = Hfstore({"check"});
  EXPECT_EQ(run.status, 1) << run.err;
  EXPECT_EQ(run.out, expected);

  run = Hfstore({"check", "--json"});
  EXPECT_EQ(run.status, 1);
  const nlohmann::json json = nlohmann::json::parse(run.out, nullptr, false);
  EXPECT_EQ(json["folders"][4]["folder"], "D:\\Jobs\\T\tab\nLF");
  EXPECT_EQ(json["folders"][6]["result"], "interrupted");
  EXPECT_EQ(json["folders"][7]["storedEnabled"], true);
  EXPECT_EQ(json["summary"]["not migrated"], 4);
  EXPECT_EQ(json["migratedAsListed"], false);

  // Usage errors; a list that cannot be read.
  EXPECT_EQ(Hfstore({"check", "extra"}).status, 2);
  EXPECT_EQ(Hfstore({"list", "--json"}).status, 2);
  fs::remove(LegacyListHostPath(prefix));
  EXPECT_EQ(Hfstore({"check"}).status, 1);
}

// A run that went well exits 0; any one folder with legacy settings that is
// not migrated as listed makes it 1 on its own.
TEST(Check, ExitStatusOfEachKindAlone) {
  for (int odd = kAsListed - 1; odd < static_cast<int>(std::size(kRows)); ++odd) {
    std::vector<Row> rows(kRows, kRows + kAsListed - 1);
    rows.push_back(kRows[odd]);
    SCOPED_TRACE(rows.back().line);
    TempPrefix prefix;
    Lay(prefix, rows.data(), static_cast<int>(rows.size()));
    const bool counts = odd >= kAsListed;
    CapturedRun run = Hfstore({"check"});
    EXPECT_EQ(run.status, counts ? 1 : 0) << run.out;
    EXPECT_NE(run.out.find(counts ? "; not every" : "; every"), std::string::npos);
  }
}

// D:\Jobs\X was retired by an interrupted run that did not register it, as
// its record says, unless the record cannot be trusted; D:\Jobs\Y waits.
TEST(RunRecord, TrustedOnlyWhenWholeAndOurs) {
  const std::string whole_r = EncodeRunRecord({{"D:\\Jobs\\X", true}});
  std::string flipped = whole_r;
  flipped[flipped.find('X')] = 'Z';
  struct Case {
    const char* what;
    std::string record;
    bool put_back;
    bool set_aside;
  } cases[] = {
      {"whole record", whole_r, true, false},
      {"directory not the run's", EncodeRunRecord({{"D:\\Jobs\\X", false}}), false, false},
      {"damaged record", flipped, false, true},
      {"foreign file", "X retired\n", false, true},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    TempPrefix prefix;
    const Row rows[] = {{"X", true, -1, false, true, false, ""},
                        {"Y", true, -1, true, false, false, ""}};
    Lay(prefix, rows, 2);
    const fs::path record = prefix.Drive('c') / "ProgramData/KYR/Dirorodiv/hfmigrate.run";
    prefix.WriteFile(record, c.record);
    CHFMigrator engine;
    engine.Run();

    std::vector<StoredHotFolder> stored;
    wxString error;
    ASSERT_TRUE(ReadStore(StoreHostPath(), &stored, &error)) << error;
    ASSERT_EQ(stored.size(), c.put_back ? 2u : 1u);
    EXPECT_EQ(stored.back().setting.FolderPath, "D:\\Jobs\\Y");
    EXPECT_FALSE(fs::exists(OnDriveD(prefix, "Jobs/X/[_KYR_HotFolder_]")));
    EXPECT_TRUE(fs::exists(OnDriveD(prefix, "Jobs/X/[_KYR_HotFolder_Old]/folder.cfg")));
    EXPECT_FALSE(fs::exists(record));
    EXPECT_EQ(TempPrefix::ReadFile(record.string() + ".damaged"), c.set_aside ? c.record : "");
  }
}

// The store refuses both folders (its file is damaged) and X's move back
// fails: X lies retired and unregistered, and the run keeps its record, so
// that the next run, with the store mended, puts X back and migrates it.
TEST(RunRecord, KeptWhileAFolderIsUndecided) {
  TempPrefix prefix;
  const Row rows[] = {{"X", true, -1, true, false, false, ""},
                      {"Y", true, -1, true, false, false, ""}};
  Lay(prefix, rows, 2);
  const fs::path record = prefix.Drive('c') / "ProgramData/KYR/Dirorodiv/hfmigrate.run";
  prefix.WriteFile(fs::path(StoreHostPath()), std::string(4096, 'x'));
  platform::FailNextMoves(1, platform::MoveOutcome::kFailed, /*skip=*/1);
  CHFMigrator().Run();
  EXPECT_EQ(platform::FailNextMoves(0, platform::MoveOutcome::kFailed), 0);
  EXPECT_EQ(TempPrefix::ReadFile(record),
            EncodeRunRecord({{"D:\\Jobs\\X", true}, {"D:\\Jobs\\Y", true}}));
  EXPECT_TRUE(fs::exists(OnDriveD(prefix, "Jobs/X/[_KYR_HotFolder_Old]/folder.cfg")));
  EXPECT_TRUE(fs::exists(OnDriveD(prefix, "Jobs/Y/[_KYR_HotFolder_]/folder.cfg")));

  RODuriZudaze::GetInstance().Close();
  fs::remove(StoreHostPath());
  CHFMigrator().Run();
  CapturedRun run = Hfstore({"check"});
  EXPECT_EQ(run.status, 0) << run.out;
  EXPECT_FALSE(fs::exists(record));
}

}  // namespace
