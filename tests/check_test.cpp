// hfstore check against hand-made installations, and a run that finds the
// record of an interrupted run: trusted only when whole, and never used to
// touch a retired directory the tool did not create.
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "engine/migrator.h"
#include "engine/run_record.h"
#include "store/store_reader.h"
#include "tests/cases.h"
#include "tests/hot_folder.h"
#include "tests/legacy_fixture.h"

namespace {

namespace fs = std::filesystem;

// Lays out listed folders D:\Jobs\<name>, each a row as in
// tests/check_cases.tsv: name, listed, stored, on disk, recorded.
void Lay(const TempPrefix& prefix, const std::vector<CaseRow>& rows) {
  UseUtf8AnsiCodePage(prefix);
  std::vector<LegacyFolder> list;
  std::vector<RunRecordEntry> record;
  for (const CaseRow& row : rows) {
    const std::string path = "D:\\Jobs\\" + row[0];
    list.push_back({path, static_cast<std::uint16_t>(row[1] == "enabled" ? 2 : 0)});
    const fs::path dir = OnDriveD(prefix, "Jobs/" + row[0]);
    fs::create_directories(dir);
    if (row[3].find("cfg") != std::string::npos)
      prefix.WriteFile(dir / "[_KYR_HotFolder_]" / "folder.cfg", "<r/>");
    if (row[3].find("Old") != std::string::npos)
      prefix.WriteFile(dir / "[_KYR_HotFolder_Old]" / "folder.cfg", "<r/>");
    if (row[4] == "recorded") record.push_back({path, true});
    if (row[2] == "-") continue;
    if (row[2] == "disabled") RODuriZudaze::GetInstance().CreateNextDisabled(path);
    ASSERT_NE(Folder(path).Create(), 0);
  }
  WriteLegacyList(prefix, list);
  if (!record.empty()) {
    ASSERT_TRUE(WriteRunRecord(record));
  }
}

std::string Line(const CaseRow& row) {
  return row[6] + "\t" + row[7] + "\t" + row[8] + "\n";
}

TEST(Check, EachKindOfFolderAndTheExitStatus) {
  TempPrefix prefix;
  const std::vector<CaseRow> rows = ReadCases("tests/check_cases.tsv");
  Lay(prefix, rows);
  std::string expected;
  for (const CaseRow& row : rows) expected += Line(row);
  expected +=
      "11 listed: 2 migrated, 4 not migrated, 1 interrupted, 1 enabled state differs,"
      " 2 settings not retired, 1 path not decodable; not every folder with legacy settings is"
      " migrated as listed\n";
  RunResult run = Hfstore({"check"});
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

  // A list that cannot be read.
  fs::remove(LegacyListHostPath(prefix));
  EXPECT_EQ(Hfstore({"check"}).status, 1);
}

// A run that went well exits 0; any one folder with legacy settings that is
// not migrated as listed makes it 1 on its own.
TEST(Check, ExitStatusOfEachKindAlone) {
  const std::vector<CaseRow> all = ReadCases("tests/check_cases.tsv");
  std::vector<CaseRow> passing;
  for (const CaseRow& row : all) {
    if (row[5] == "pass") passing.push_back(row);
  }
  for (const CaseRow& odd : all) {
    const bool passes = odd[5] == "pass";
    if (passes && &odd != &all[0]) continue;  // once with the passing rows alone
    std::vector<CaseRow> rows = passing;
    if (!passes) rows.push_back(odd);
    SCOPED_TRACE(Line(rows.back()));
    TempPrefix prefix;
    Lay(prefix, rows);
    RunResult run = Hfstore({"check"});
    EXPECT_EQ(run.status, passes ? 0 : 1) << run.out;
    EXPECT_NE(run.out.find(passes ? "; every" : "; not every"), std::string::npos);
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
    Lay(prefix, {{"X", "enabled", "-", "Old", "-"}, {"Y", "enabled", "-", "cfg", "-"}});
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
  Lay(prefix, {{"X", "enabled", "-", "cfg", "-"}, {"Y", "enabled", "-", "cfg", "-"}});
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
  RunResult run = Hfstore({"check"});
  EXPECT_EQ(run.status, 0) << run.out;
  EXPECT_FALSE(fs::exists(record));
}

}  // namespace
