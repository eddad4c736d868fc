// The store against real SQLite files in a temporary prefix, read back
// through the built hfstore and killed mid-write.
#include <sqlite3.h>

#include <gtest/gtest.h>
#include <wx/sstream.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <sstream>

#include "store/record_fields.h"
#include "store/schema.h"
#include "store/store_reader.h"
#include "tests/cases.h"
#include "tests/hot_folder.h"
#include "tests/temp_prefix.h"

namespace {

namespace fs = std::filesystem;
using nlohmann::json;

const auto Disable = [](const char* path) {
  return RODuriZudaze::GetInstance().DisableHotFolder(path);
};

json Dump() {
  RunResult run = Hfstore({"dump"});
  EXPECT_EQ(run.status, 0) << run.err;
  return json::parse(run.out, nullptr, /*allow_exceptions=*/false);
}

// The records of one hot folder of a dump, as the store was handed them;
// map entries handed over in reverse, so the order shown is the map's.
Folder FromDump(const json& dumped) {
  const auto W = [](const json& text) {
    const std::string utf8 = text;
    return wxString::FromUTF8(utf8.data(), utf8.size());
  };
  const json& setting = dumped["setting"];
  Folder f(W(setting["FolderPath"]));
  for (const db::SettingField& field : db::kSettingFields) {
    const json& value = setting[field.name];
    if (field.kind == db::FieldKind::kText) f.setting.*field.text = W(value);
    if (field.kind == db::FieldKind::kInt32) f.setting.*field.int32 = value;
    if (field.kind == db::FieldKind::kFlag) f.setting.*field.flag = value;
    if (field.kind == db::FieldKind::kOptionalFlag && !value.is_null())
      f.setting.*field.optional_flag = value.get<bool>();
  }
  for (const json& e : setting["Filters"])
    f.setting.Filters.push_back({W(e["DisplayName"]), W(e["Identifier"])});
  for (const db::FolderField& field : db::kFolderFields)
    f.folder.*field.member = W(dumped["folderConfiguration"][field.name]);
  for (auto e = dumped["jobConfiguration"].rbegin(); e != dumped["jobConfiguration"].rend(); ++e)
    f.job.emplace(W((*e)["key"]),
                  db::JobSettingEntry{W((*e)["Name"]), W((*e)["Value"]), W((*e)["Extra"])});
  for (auto e = dumped["imposeConfiguration"].rbegin(); e != dumped["imposeConfiguration"].rend();
       ++e)
    f.impose.emplace(W((*e)["Name"]), db::ImposeSettingEntry{W((*e)["Name"]), W((*e)["Value"])});
  for (const json& e : dumped["preflightConfiguration"])
    f.preflight.push_back({W(e["First"]), W(e["Second"])});
  wxStringInputStream tree(W(dumped["filterConfiguration"]));
  f.filter = *wxXmlDocument(tree).GetRoot();
  return f;
}

// Odd texts in every member survive the store and the built hfstore's dump
// (store/round_trip.json): spaces, quotes, a NUL, characters beyond the
// basic plane, job keys in UTF-16 code unit order.
TEST(Store, EveryMemberSurvivesCreateAndDump) {
  TempPrefix prefix;
  const json expected = json::parse(TempPrefix::ReadFile(HF_SOURCE_DIR "/store/round_trip.json"));
  for (const json& folder : expected["hotFolders"]) ASSERT_NE(FromDump(folder).Create(), 0);
  EXPECT_EQ(Dump(), expected);
}

TEST(Store, StoreRemovedWhileOpenIsStartedAfresh) {
  TempPrefix prefix;
  ASSERT_NE(Folder("D:\\Jobs\\A").Create(), 0);
  fs::remove_all(prefix.Drive('c') / "ProgramData");
  ASSERT_NE(Folder("D:\\Jobs\\B").Create(), 0);
  EXPECT_EQ(Hfstore({"list"}).out, "enabled\t\tD:\\Jobs\\B\t\n");
}

// Another application's SQLite database.
void WriteSqlite(const fs::path& file, const char* sql) {
  fs::create_directories(file.parent_path());
  sqlite3* db = nullptr;
  ASSERT_EQ(sqlite3_open(file.c_str(), &db), SQLITE_OK);
  ASSERT_EQ(sqlite3_exec(db, sql, nullptr, nullptr, nullptr), SQLITE_OK);
  sqlite3_close(db);
}

// A store an earlier build wrote (version 1: the keyed tables with a rowid
// and an index beside each) is read and written as it stands.
TEST(Store, FirstLayoutIsReadAndWrittenAsItStands) {
  TempPrefix prefix;
  std::string sql = db::CreateSchemaSql();
  for (size_t at; (at = sql.find(" WITHOUT ROWID")) != std::string::npos;) sql.erase(at, 14);
  WriteSqlite(StoreHostPath(), (sql + "PRAGMA user_version = 1;").c_str());
  ASSERT_NE(Folder("D:\\Jobs\\A").Create(), 0);
  EXPECT_TRUE(Disable("D:\\Jobs\\A"));
  EXPECT_EQ(Hfstore({"list"}).out, "disabled\t\tD:\\Jobs\\A\t\n");
}

TEST(Store, RefusedFileStaysUnchanged) {
  const struct {
    const char* what;
    const char* sql;  // null: a text file
  } cases[] = {
      {"text file", nullptr},
      {"foreign database", "CREATE TABLE mail(x); INSERT INTO mail VALUES(1);"},
      {"unknown version", "PRAGMA user_version = 7;"},
      {"damaged store",
       "PRAGMA user_version = 1; CREATE TABLE hot_folder(x); WITH RECURSIVE n(i) AS (SELECT 1"
       " UNION ALL SELECT i + 1 FROM n WHERE i < 500) INSERT INTO hot_folder SELECT randomblob(100)"
       " FROM n;"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    TempPrefix prefix;
    const fs::path file = StoreHostPath();
    if (!c.sql) prefix.WriteFile(file, std::string("not a database\n\0\x01", 17));
    if (c.sql) WriteSqlite(file, c.sql);
    if (c.what[0] == 'd')  // page 2
      prefix.WriteFile(file, TempPrefix::ReadFile(file).replace(4096, 4096, 4096, '\xFF'));
    const std::string before = TempPrefix::ReadFile(file);
    EXPECT_EQ(Folder("D:\\Jobs\\A").Create(), 0);
    EXPECT_FALSE(Disable("D:\\Jobs\\A"));
    RunResult run = Hfstore({"list"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(std::count(run.err.begin(), run.err.end(), '\n'), 1) << run.err;
    EXPECT_EQ(TempPrefix::ReadFile(file), before);
    EXPECT_EQ(std::distance(fs::directory_iterator(file.parent_path()), {}), 1);  // no journal
  }
}

// A failed call leaves nothing behind that fails the next one.
TEST(Store, UnwritableOrLockedLocationFailsUntilFreed) {
  TempPrefix prefix;
  const fs::path kyr = prefix.Drive('c') / "ProgramData" / "KYR";
  prefix.WriteFile(kyr, "x");  // where the store's folder belongs
  Folder folder("D:\\Jobs\\A");
  EXPECT_EQ(folder.Create(), 0);
  EXPECT_EQ(TempPrefix::ReadFile(kyr), "x");
  fs::remove(kyr);
  ASSERT_NE(folder.Create(), 0);

  sqlite3* other = nullptr;
  ASSERT_EQ(sqlite3_open(StoreHostPath().c_str(), &other), SQLITE_OK);
  ASSERT_EQ(sqlite3_exec(other, "BEGIN EXCLUSIVE", nullptr, nullptr, nullptr), SQLITE_OK);
  Folder blocked("D:\\Jobs\\B");
  EXPECT_EQ(blocked.Create(), 0);  // after the busy timeout
  sqlite3_close(other);
  EXPECT_NE(blocked.Create(), 0);
}

TEST(Hfstore, ExitStatusAndMessages) {
  TempPrefix prefix;
  RunResult missing = Hfstore({"list"});
  EXPECT_EQ(missing.status, 1);
  EXPECT_NE(missing.err.find("no store at"), std::string::npos) << missing.err;
  EXPECT_FALSE(fs::exists(prefix.Drive('c') / "ProgramData"));  // created nothing

  Folder folder("D:\\Jobs\\Brochures");
  folder.setting.Name = "Bro\tchures";
  folder.setting.Filters = {{"PDF", "KYR.PDF.1"}, {"1-Bit TIFF", "KYR.ONEBITTIFF.1"}};
  ASSERT_NE(folder.Create(), 0);
  // Disabling matches a registered path exactly.
  EXPECT_FALSE(Disable("D:\\Jobs\\Unknown") || Disable("d:\\jobs\\brochures"));
  ASSERT_TRUE(Disable("D:\\Jobs\\Brochures"));
  for (const CaseRow& c : ReadCases("store/hfstore_cases.tsv")) {
    SCOPED_TRACE(c[0]);
    std::string line = c[0];
    for (std::size_t at; (at = line.find("$PREFIX")) != std::string::npos;)
      line.replace(at, 7, prefix.root().string());
    std::vector<std::string> args;
    std::istringstream words(line);
    for (std::string word; words >> word;) args.push_back(word);
    RunResult run = Hfstore(args);
    EXPECT_EQ(run.status, std::stoi(c[1])) << run.err;
    const std::string& out = c[2];
    const bool start_only = out.size() >= 3 && out.compare(out.size() - 3, 3, "...") == 0;
    EXPECT_EQ(start_only ? run.out.substr(0, out.size() - 3) : run.out,
              start_only ? out.substr(0, out.size() - 3) : out);
    EXPECT_NE(run.err.find(c[3]), std::string::npos) << run.err;
  }
  EXPECT_FALSE(fs::exists(prefix.root() / "none.db"));
  // A store no writer has open is read without leaving SQLite's companion
  // files behind, which a writer of another user might not be able to open.
  RODuriZudaze::GetInstance().Close();
  EXPECT_EQ(Hfstore({"list"}).status, 0);
  EXPECT_EQ(std::distance(fs::directory_iterator(fs::path(StoreHostPath()).parent_path()), {}), 1);
  std::string help = Hfstore({"--help"}).out;
  for (const char* word : {"list", "dump", "--store", "tab", "JSON", "Exit status"}) {
    EXPECT_NE(help.find(word), std::string::npos) << word;
  }
}

}  // namespace
