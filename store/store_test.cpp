#include <signal.h>
#include <spawn.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <fcntl.h>
#include <chrono>
#include <cstdint>
#include <fstream>
#include <random>
#include <sstream>
#include <thread>

#include "store/store.h"
#include "store/store_reader.h"
#include "tests/immutable.h"
#include "tests/temp_prefix.h"

extern char** environ;

namespace {

namespace fs = std::filesystem;
using nlohmann::json;

wxString W(const char* utf8) {
  return wxString::FromUTF8(utf8);
}

fs::path StoreFile(const TempPrefix& prefix) {
  return prefix.Drive('c') / "ProgramData" / "KYR" / "Dirorodiv" / "HotFolders.db";
}

std::string ReadBytes(const fs::path& file) {
  std::ifstream in(file, std::ios::binary);
  std::ostringstream bytes;
  bytes << in.rdbuf();
  return bytes.str();
}

void WriteBytes(const fs::path& file, const std::string& bytes) {
  fs::create_directories(file.parent_path());
  std::ofstream(file, std::ios::binary | std::ios::trunc) << bytes;
}

// The six records of one hot folder.
struct Folder {
  db::Setting setting;
  db::FolderConfiguration folder;
  db::JobConfiguration job;
  db::FilterConfiguration filter;
  db::ImposeConfiguration impose;
  db::PreflightConfiguration preflight;

  explicit Folder(const wxString& path) {
    setting.FolderPath = path;
    folder.FolderPath = path;
  }
  long Create() {
    return RODuriZudaze::GetInstance().CreateHotFolder(setting, folder, job, filter, impose,
                                                       preflight);
  }
};

// "FilterSetting" with one "Filter" whose "UI" holds the given settings.
void SetFilterTree(db::FilterConfiguration* record,
                   const std::vector<std::pair<wxString, wxString>>& settings) {
  wxXmlNode root(wxXML_ELEMENT_NODE, "FilterSetting");
  auto* filter = new wxXmlNode(&root, wxXML_ELEMENT_NODE, "Filter");
  filter->AddAttribute("name", "KYR.PDF.1");
  auto* ui = new wxXmlNode(filter, wxXML_ELEMENT_NODE, "UI");
  for (auto it = settings.rbegin(); it != settings.rend(); ++it) {  // the ctor prepends
    auto* element = new wxXmlNode(ui, wxXML_ELEMENT_NODE, it->first);
    new wxXmlNode(element, wxXML_TEXT_NODE, "", it->second);
  }
  *record = root;
}

struct Outcome {
  int status = -1;
  std::string out;
  std::string err;
};

pid_t Spawn(const std::string& program, std::vector<std::string> args,
            posix_spawn_file_actions_t* actions) {
  args.insert(args.begin(), program);
  std::vector<char*> argv;
  for (std::string& arg : args) argv.push_back(arg.data());
  argv.push_back(nullptr);
  pid_t pid = -1;
  if (posix_spawn(&pid, program.c_str(), actions, nullptr, argv.data(), environ) != 0) return -1;
  return pid;
}

std::string BinDir() {
  const char* dir = getenv("HF_BIN_DIR");
  return dir ? dir : "build/bin";
}

Outcome RunHfstore(const TempPrefix& prefix, const std::vector<std::string>& args) {
  fs::path out = prefix.root() / "hfstore.out";
  fs::path err = prefix.root() / "hfstore.err";
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, 1, out.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
  posix_spawn_file_actions_addopen(&actions, 2, err.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
  pid_t pid = Spawn(BinDir() + "/hfstore", args, &actions);
  posix_spawn_file_actions_destroy(&actions);
  Outcome run;
  int status = 0;
  if (pid > 0 && waitpid(pid, &status, 0) == pid && WIFEXITED(status)) {
    run.status = WEXITSTATUS(status);
  }
  run.out = ReadBytes(out);
  run.err = ReadBytes(err);
  return run;
}

json Dump(const TempPrefix& prefix) {
  Outcome run = RunHfstore(prefix, {"dump"});
  EXPECT_EQ(run.status, 0) << run.err;
  return json::parse(run.out, nullptr, /*allow_exceptions=*/false);
}

TEST(Store, EveryMemberSurvivesCreateAndDump) {
  TempPrefix prefix;
  Folder plain("D:\\Jobs\\Plain");  // construction values only; Flag4 unset

  Folder odd(W(" D:\\Jobs\\Brochüre 😀 "));
  db::Setting& s = odd.setting;
  s.Name = W(" Brochüre 😀 ");
  s.ServerAddr = "  10.0.0.1";
  s.ServerName = "srv\t";
  s.Number1 = 2147483647;
  s.Queue = s.Queue2 = "hold";
  s.String2 = "\"quoted\\\"";
  s.Flag1 = s.Flag3 = s.Flag5 = true;
  s.Filters = {{"1-Bit TIFF", "KYR.ONEBITTIFF.1"}, {"PDF", "KYR.PDF.1"}, {"PDF", "KYR.PDF.1"}};
  s.Flag4 = false;
  s.String3 = "10";
  s.String4 = wxString("a\0b", 3);
  s.String9 = W("ｚ");
  odd.folder = {"F", "", W("M 😀"), " D "};
  for (const char* key : {"\xEF\xBC\x81", "\xF0\x9F\x98\x80", "a", "Z", ""}) {
    odd.job.emplace(W(key), db::JobSettingEntry{W(key), " v ", "x"});
  }
  odd.impose.emplace("QXImpFdGaps", db::ImposeSettingEntry{"QXImpFdGaps", "5 5 "});
  odd.preflight = {{"", " b "}};
  SetFilterTree(&odd.filter,
                {{"RESOLUTIONDPI", "  Auto "}, {"ERRORPATH", ""}, {"NOTE", W("a<b & é😀")}});

  ASSERT_NE(plain.Create(), 0);
  ASSERT_NE(odd.Create(), 0);
  json expected = json::parse(R"({"hotFolders": [
    {"enabled": true,
     "setting": {"Name": "", "String1": "", "ServerAddr": "", "ServerName": "", "Number1": -1,
       "Queue": "", "String2": "", "Queue2": "", "Flag1": false, "Filters": [], "Flag2": false,
       "Flag3": false, "Flag4": null, "String3": "", "FolderPath": "D:\\Jobs\\Plain",
       "String4": "", "String5": "", "String6": "", "String7": "", "String8": "",
       "Flag5": false, "Flag6": false, "String9": ""},
     "folderConfiguration": {"FailedFolder": "", "WorkFolder": "", "MoveFolder": "",
       "FolderPath": "D:\\Jobs\\Plain"},
     "jobConfiguration": [], "filterConfiguration": "", "imposeConfiguration": [],
     "preflightConfiguration": []},
    {"enabled": true,
     "setting": {"Name": " Brochüre 😀 ", "String1": "", "ServerAddr": "  10.0.0.1",
       "ServerName": "srv\t", "Number1": 2147483647, "Queue": "hold", "String2": "\"quoted\\\"",
       "Queue2": "hold", "Flag1": true,
       "Filters": [{"DisplayName": "1-Bit TIFF", "Identifier": "KYR.ONEBITTIFF.1"},
                   {"DisplayName": "PDF", "Identifier": "KYR.PDF.1"},
                   {"DisplayName": "PDF", "Identifier": "KYR.PDF.1"}],
       "Flag2": false, "Flag3": true, "Flag4": false, "String3": "10",
       "FolderPath": " D:\\Jobs\\Brochüre 😀 ", "String4": "a\u0000b", "String5": "", "String6": "",
       "String7": "", "String8": "", "Flag5": true, "Flag6": false, "String9": "ｚ"},
     "folderConfiguration": {"FailedFolder": "F", "WorkFolder": "", "MoveFolder": "M 😀",
       "FolderPath": " D "},
     "jobConfiguration": [
       {"key": "", "Name": "", "Value": " v ", "Extra": "x"},
       {"key": "Z", "Name": "Z", "Value": " v ", "Extra": "x"},
       {"key": "a", "Name": "a", "Value": " v ", "Extra": "x"},
       {"key": "😀", "Name": "😀", "Value": " v ", "Extra": "x"},
       {"key": "！", "Name": "！", "Value": " v ", "Extra": "x"}],
     "filterConfiguration": "<FilterSetting><Filter name=\"KYR.PDF.1\"><UI><RESOLUTIONDPI>  Auto </RESOLUTIONDPI><ERRORPATH></ERRORPATH><NOTE>a&lt;b &amp; é😀</NOTE></UI></Filter></FilterSetting>",
     "imposeConfiguration": [{"Name": "QXImpFdGaps", "Value": "5 5 "}],
     "preflightConfiguration": [{"First": "", "Second": " b "}]}]})");
  EXPECT_EQ(Dump(prefix), expected);
}

TEST(Store, RegisteredPathIsNeverOverwrittenAndDisableFindsIt) {
  TempPrefix prefix;
  Folder first("D:\\Jobs\\A");
  first.setting.Name = "A";
  ASSERT_NE(first.Create(), 0);
  std::string before = RunHfstore(prefix, {"dump"}).out;

  Folder again("D:\\Jobs\\A");
  again.setting.Name = "other";
  again.setting.Filters = {{"PDF", "KYR.PDF.1"}};
  EXPECT_EQ(again.Create(), 0);
  EXPECT_EQ(RunHfstore(prefix, {"dump"}).out, before);

  EXPECT_FALSE(RODuriZudaze::GetInstance().DisableHotFolder("D:\\Jobs\\Unknown"));
  EXPECT_FALSE(RODuriZudaze::GetInstance().DisableHotFolder("d:\\jobs\\a"));
  EXPECT_TRUE(RODuriZudaze::GetInstance().DisableHotFolder("D:\\Jobs\\A"));
  json dump = Dump(prefix);
  EXPECT_EQ(dump["hotFolders"][0]["enabled"], false);
  dump["hotFolders"][0]["enabled"] = true;
  EXPECT_EQ(dump, json::parse(before));
}

TEST(Store, StoreRemovedWhileOpenIsStartedAfresh) {
  TempPrefix prefix;
  Folder first("D:\\Jobs\\A");
  ASSERT_NE(first.Create(), 0);
  fs::remove_all(prefix.Drive('c') / "ProgramData");
  Folder second("D:\\Jobs\\B");
  ASSERT_NE(second.Create(), 0);
  EXPECT_EQ(RunHfstore(prefix, {"list"}).out, "enabled\t\tD:\\Jobs\\B\t\n");
}

TEST(Store, KeysOrderByUtf16CodeUnits) {
  struct Case {
    const char* a;
    const char* b;
    bool less;
  } cases[] = {
      {"", "a", true},
      {"a", "", false},
      {"a", "a", false},
      {"Z", "a", true},                            // case-sensitive: upper case first
      {"ab", "abc", true},                         // a prefix sorts first
      {"\xF0\x9F\x98\x80", "\xEF\xBC\x81", true},  // U+1F600 (D83D DE00) < U+FF01
      {"\xEF\xBC\x81", "\xF0\x9F\x98\x80", false},
      {"\xED\x9F\xBF", "\xF0\x9F\x98\x80", true},  // U+D7FF < any surrogate pair
      {"\xF0\x9F\x98\x80", "\xF0\x9F\x98\x81", true},
      {"\xF0\x90\x80\x80", "\xF4\x8F\xBF\xBF", true},  // U+10000 < U+10FFFF
  };
  db::Utf16Less less;
  for (const Case& c : cases) {
    EXPECT_EQ(less(W(c.a), W(c.b)), c.less) << c.a << " < " << c.b;
  }
}

// A folder is whole when every record the writer gives it is there.
void ExpectWhole(const StoredHotFolder& folder, std::size_t number) {
  wxString path = wxString::Format("D:\\Crash\\%zu", number);
  EXPECT_EQ(folder.setting.FolderPath, path);
  EXPECT_EQ(folder.folderConfiguration.FolderPath, path);
  EXPECT_EQ(folder.setting.Filters.size(), 3u);
  EXPECT_EQ(folder.jobConfiguration.size(), 2u);
  EXPECT_EQ(folder.imposeConfiguration.size(), 1u);
  EXPECT_EQ(folder.filterConfiguration, "<FilterSetting><Filter/></FilterSetting>");
}

TEST(Store, KilledWriterLeavesOnlyWholeFolders) {
  TempPrefix prefix;
  std::mt19937 random(std::random_device{}());
  std::size_t registered = 0;
  for (int round = 0; round < 3; ++round) {
    pid_t pid =
        Spawn(BinDir() + "/store_crash_writer", {std::to_string(registered), "1000000"}, nullptr);
    ASSERT_GT(pid, 0);
    for (int i = 0; i < 2000 && !fs::exists(StoreFile(prefix)); ++i) {
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(random() % 400));
    kill(pid, SIGKILL);
    int status = 0;
    ASSERT_EQ(waitpid(pid, &status, 0), pid);
    ASSERT_TRUE(WIFSIGNALED(status)) << "the writer ended before it was killed";

    std::vector<StoredHotFolder> folders;
    wxString error;
    ASSERT_TRUE(ReadStore(StoreFile(prefix).string(), &folders, &error)) << error;
    ASSERT_GE(folders.size(), registered);
    for (std::size_t i = 0; i < folders.size(); ++i) ExpectWhole(folders[i], i);
    registered = folders.size();
  }
  EXPECT_GT(registered, 0u);
  Folder after("D:\\Jobs\\After");
  EXPECT_NE(after.Create(), 0);
}

// Another application's SQLite database, with a table and a version.
void WriteSqlite(const fs::path& file, const char* sql) {
  fs::create_directories(file.parent_path());
  sqlite3* db = nullptr;
  ASSERT_EQ(sqlite3_open(file.c_str(), &db), SQLITE_OK);
  ASSERT_EQ(sqlite3_exec(db, sql, nullptr, nullptr, nullptr), SQLITE_OK);
  sqlite3_close(db);
}

TEST(Store, RefusedFileStaysUnchanged) {
  struct Case {
    const char* what;
    void (*make)(const fs::path& file);
  } cases[] = {
      {"text file",
       [](const fs::path& file) { WriteBytes(file, std::string("not a database\n\0\x01", 17)); }},
      {"foreign database",
       [](const fs::path& file) {
         WriteSqlite(file, "CREATE TABLE mail(x); INSERT INTO mail VALUES(1);");
       }},
      {"unknown version",
       [](const fs::path& file) { WriteSqlite(file, "PRAGMA user_version = 7;"); }},
      {"damaged store",
       [](const fs::path& file) {
         WriteSqlite(file,
                     "PRAGMA user_version = 1; CREATE TABLE hot_folder(x);"
                     "WITH RECURSIVE n(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM n WHERE i < 500)"
                     " INSERT INTO hot_folder SELECT randomblob(100) FROM n;");
         std::string bytes = ReadBytes(file);
         bytes.replace(4096, 4096, 4096, '\xFF');  // page 2
         WriteBytes(file, bytes);
       }},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    TempPrefix prefix;
    fs::path file = StoreFile(prefix);
    c.make(file);
    std::string before = ReadBytes(file);
    Folder folder("D:\\Jobs\\A");
    EXPECT_EQ(folder.Create(), 0);
    EXPECT_FALSE(RODuriZudaze::GetInstance().DisableHotFolder("D:\\Jobs\\A"));
    Outcome run = RunHfstore(prefix, {"list"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(std::count(run.err.begin(), run.err.end(), '\n'), 1) << run.err;
    EXPECT_EQ(ReadBytes(file), before);
    EXPECT_EQ(std::distance(fs::directory_iterator(file.parent_path()), {}), 1);  // no journal
  }
}

TEST(Store, UnwritableOrLockedLocationFails) {
  TempPrefix prefix;
  // The store's folder cannot be created where a file holds its name.
  prefix.WriteFile(prefix.Drive('c') / "ProgramData" / "KYR", "x");
  Folder folder("D:\\Jobs\\A");
  EXPECT_EQ(folder.Create(), 0);
  EXPECT_EQ(ReadBytes(prefix.Drive('c') / "ProgramData" / "KYR"), "x");
  fs::remove(prefix.Drive('c') / "ProgramData" / "KYR");

  ASSERT_NE(folder.Create(), 0);
  fs::path file = StoreFile(prefix);
  sqlite3* other = nullptr;
  ASSERT_EQ(sqlite3_open(file.c_str(), &other), SQLITE_OK);
  ASSERT_EQ(sqlite3_exec(other, "BEGIN EXCLUSIVE", nullptr, nullptr, nullptr), SQLITE_OK);
  Folder blocked("D:\\Jobs\\B");
  EXPECT_EQ(blocked.Create(), 0);  // after the busy timeout
  sqlite3_exec(other, "ROLLBACK", nullptr, nullptr, nullptr);
  sqlite3_close(other);
  EXPECT_NE(blocked.Create(), 0);
}

// Made by another process, so that this one opens it only once it is
// read-only. The immutable flag, since permission bits do not stop root.
TEST(Store, ReadOnlyStoreFails) {
  TempPrefix prefix;
  pid_t pid = Spawn(BinDir() + "/store_crash_writer", {"0", "1"}, nullptr);
  int status = 0;
  ASSERT_EQ(waitpid(pid, &status, 0), pid);
  fs::path file = StoreFile(prefix);
  std::string before = ReadBytes(file);
  ASSERT_TRUE(SetImmutable(file, true) && SetImmutable(file.parent_path(), true))
      << "the file system of the temporary directory has no immutable flag";
  Folder refused("D:\\Jobs\\C");
  EXPECT_EQ(refused.Create(), 0);
  EXPECT_FALSE(RODuriZudaze::GetInstance().DisableHotFolder("D:\\Crash\\0"));
  SetImmutable(file.parent_path(), false);
  SetImmutable(file, false);
  EXPECT_EQ(ReadBytes(file), before);
}

TEST(Hfstore, ExitStatusAndMessages) {
  TempPrefix prefix;
  Outcome missing = RunHfstore(prefix, {"list"});
  EXPECT_EQ(missing.status, 1);
  EXPECT_NE(missing.err.find("no store at"), std::string::npos) << missing.err;
  EXPECT_FALSE(fs::exists(prefix.Drive('c') / "ProgramData"));  // created nothing

  Folder folder("D:\\Jobs\\Brochures");
  folder.setting.Name = "Bro\tchures";
  folder.setting.Filters = {{"PDF", "KYR.PDF.1"}, {"1-Bit TIFF", "KYR.ONEBITTIFF.1"}};
  ASSERT_NE(folder.Create(), 0);
  ASSERT_TRUE(RODuriZudaze::GetInstance().DisableHotFolder("D:\\Jobs\\Brochures"));
  struct Case {
    std::vector<std::string> args;
    int status;
    std::string out;  // the whole output, or a part of it when it ends in "..."
    std::string err;  // a part of standard error
  } cases[] = {
      {{"list"}, 0, "disabled\tBro chures\tD:\\Jobs\\Brochures\tPDF > 1-Bit TIFF\n", ""},
      {{"list", "--store", StoreFile(prefix).string()}, 0, "disabled\tBro chures\t...", ""},
      {{"dump", "--store=" + StoreFile(prefix).string()}, 0, "{\n  \"hotFolders\": [...", ""},
      {{"--help"}, 0, "...", ""},
      {{"list", "--store", (prefix.root() / "none.db").string()}, 1, "", "none.db"},
      {{}, 2, "", "required"},
      {{"show"}, 2, "", "unknown command 'show'"},
      {{"list", "extra"}, 2, "", "extra"},
      {{"dump", "--verbose"}, 2, "", "verbose"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.args.empty() ? "(none)" : c.args[0]);
    Outcome run = RunHfstore(prefix, c.args);
    EXPECT_EQ(run.status, c.status) << run.err;
    if (c.out.size() >= 3 && c.out.compare(c.out.size() - 3, 3, "...") == 0) {
      EXPECT_EQ(run.out.substr(0, c.out.size() - 3), c.out.substr(0, c.out.size() - 3));
    } else {
      EXPECT_EQ(run.out, c.out);
    }
    EXPECT_NE(run.err.find(c.err), std::string::npos) << run.err;
  }
  EXPECT_FALSE(fs::exists(prefix.root() / "none.db"));
  std::string help = RunHfstore(prefix, {"--help"}).out;
  for (const char* word : {"list", "dump", "--store", "tab", "JSON", "Exit status"}) {
    EXPECT_NE(help.find(word), std::string::npos) << word;
  }
}

// A store no writer has open is read without leaving SQLite's companion
// files behind, which a writer of another user might not be able to open.
TEST(Hfstore, StoreAtRestStaysAlone) {
  TempPrefix prefix;
  pid_t pid = Spawn(BinDir() + "/store_crash_writer", {"0", "2"}, nullptr);
  int status = 0;
  ASSERT_EQ(waitpid(pid, &status, 0), pid);
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
  Outcome run = RunHfstore(prefix, {"list"});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out,
            "enabled\t0\tD:\\Crash\\0\tPDF > PS > VDP\nenabled\t1\tD:\\Crash\\1\tPDF > PS > VDP\n");
  EXPECT_EQ(std::distance(fs::directory_iterator(StoreFile(prefix).parent_path()), {}), 1);
}

}  // namespace
