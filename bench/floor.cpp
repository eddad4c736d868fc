// hfbench_floor: the least any migration of the same folders must do.
//
//   hfbench_floor plan STORE          what a migration wrote, per folder:
//                                     "path<TAB>rows<TAB>bytes" on stdout
//   hfbench_floor run PREFIX PLAN     record the planned folders durably in
//                                     one file; then for each: read its
//                                     folder.cfg, move its settings directory,
//                                     and commit as many rows of as many bytes
//                                     in one durable transaction; remove the
//                                     record
//
// The plan is taken from a store a real migration wrote, so the floor writes
// what the tool writes and nothing is guessed. A migration that an
// interrupted run must be able to finish cannot do less: the run's record is
// one durable write before the first move, and each folder's commit is
// durable when it returns. The move itself needs no sync of its own: a move
// lost after its commit leaves a registered folder whose settings the next
// run retires, and one lost before it is covered by the run's record.
#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

namespace fs = std::filesystem;

namespace {

// Rows and text bytes per hot folder, over every table the store fills.
const char kPlanSql[] =
    "SELECT h.FolderPath,"
    " 2"
    " + (SELECT count(*) FROM filter_entry WHERE hot_folder = h.id)"
    " + (SELECT count(*) FROM job_setting WHERE hot_folder = h.id)"
    " + (SELECT count(*) FROM impose_setting WHERE hot_folder = h.id)"
    " + (SELECT count(*) FROM preflight_entry WHERE hot_folder = h.id),"
    " length(h.FilterConfiguration) + length(h.Name) + length(h.ServerAddr)"
    " + length(h.ServerName) + 2 * length(h.Queue) + length(h.FolderPath)"
    " + (SELECT length(FailedFolder) + length(WorkFolder) + length(MoveFolder)"
    "    + length(FolderPath) FROM folder_configuration WHERE hot_folder = h.id)"
    " + (SELECT ifnull(sum(length(DisplayName) + length(Identifier)), 0)"
    "    FROM filter_entry WHERE hot_folder = h.id)"
    " + (SELECT ifnull(sum(length(key) + length(Name) + length(Value)), 0)"
    "    FROM job_setting WHERE hot_folder = h.id)"
    " + (SELECT ifnull(sum(length(key) + length(Name) + length(Value)), 0)"
    "    FROM impose_setting WHERE hot_folder = h.id)"
    " FROM hot_folder h ORDER BY h.id";

int Plan(const char* store) {
  sqlite3* db = nullptr;
  sqlite3_stmt* st = nullptr;
  bool ok = sqlite3_open_v2(store, &db, SQLITE_OPEN_READONLY, nullptr) == SQLITE_OK &&
            sqlite3_prepare_v2(db, kPlanSql, -1, &st, nullptr) == SQLITE_OK;
  int step = SQLITE_ERROR;
  while (ok && (step = sqlite3_step(st)) == SQLITE_ROW) {
    std::printf("%s\t%lld\t%lld\n", reinterpret_cast<const char*>(sqlite3_column_text(st, 0)),
                sqlite3_column_int64(st, 1), sqlite3_column_int64(st, 2));
  }
  sqlite3_finalize(st);
  sqlite3_close(db);
  if (step != SQLITE_DONE) std::fprintf(stderr, "hfbench_floor: cannot read %s\n", store);
  return step == SQLITE_DONE ? 0 : 1;
}

// D:\a\b inside the prefix; the plan's paths are the generator's, which
// exist in exactly this case.
fs::path HostPath(const fs::path& prefix, const std::string& windows) {
  std::string rest = windows.substr(3);
  for (char& c : rest) {
    if (c == '\\') c = '/';
  }
  std::string drive(1, static_cast<char>(std::tolower(static_cast<unsigned char>(windows[0]))));
  return prefix / "dosdevices" / (drive + ":") / rest;
}

struct Writer {
  sqlite3* db = nullptr;
  sqlite3_stmt* insert = nullptr;

  bool Open(const fs::path& file) {
    std::error_code ignored;
    fs::create_directories(file.parent_path(), ignored);
    return sqlite3_open(file.c_str(), &db) == SQLITE_OK &&
           sqlite3_exec(db,
                        "PRAGMA journal_mode = WAL; PRAGMA synchronous = FULL;"
                        "CREATE TABLE row(folder INTEGER, position INTEGER, payload TEXT)",
                        nullptr, nullptr, nullptr) == SQLITE_OK &&
           sqlite3_prepare_v2(db, "INSERT INTO row VALUES(?, ?, ?)", -1, &insert, nullptr) ==
               SQLITE_OK;
  }

  bool Commit(long long folder, long long rows, long long bytes) {
    if (sqlite3_exec(db, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr) != SQLITE_OK) return false;
    std::string payload(static_cast<std::size_t>(bytes / rows), 'x');
    for (long long i = 0; i < rows; ++i) {
      sqlite3_bind_int64(insert, 1, folder);
      sqlite3_bind_int64(insert, 2, i);
      sqlite3_bind_text(insert, 3, payload.data(), static_cast<int>(payload.size()), SQLITE_STATIC);
      if (sqlite3_step(insert) != SQLITE_DONE) return false;
      sqlite3_reset(insert);
    }
    return sqlite3_exec(db, "COMMIT", nullptr, nullptr, nullptr) == SQLITE_OK;
  }

  ~Writer() {
    sqlite3_finalize(insert);
    sqlite3_close(db);
  }
};

bool SyncDirectory(const fs::path& dir) {
  int fd = open(dir.c_str(), O_RDONLY | O_DIRECTORY);
  bool synced = fd >= 0 && fsync(fd) == 0;
  if (fd >= 0) close(fd);
  return synced;
}

// The plan's folders written to a file beside the store, flushed, renamed
// into place and its directory synced: one durable commit for the run.
bool WriteRecord(const fs::path& file, const std::string& text) {
  const fs::path temporary = file.string() + ".new";
  int fd = open(temporary.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0666);
  bool written = fd >= 0 &&
                 write(fd, text.data(), text.size()) == static_cast<ssize_t>(text.size()) &&
                 fsync(fd) == 0;
  if (fd >= 0) close(fd);
  return written && rename(temporary.c_str(), file.c_str()) == 0 &&
         SyncDirectory(file.parent_path());
}

bool ReadWhole(const fs::path& file, std::string* bytes) {
  std::ifstream in(file, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  *bytes = text.str();
  return static_cast<bool>(in);
}

int Run(const fs::path& prefix, const char* plan_file) {
  std::ifstream plan(plan_file);
  std::ostringstream plan_text;
  plan_text << plan.rdbuf();
  plan.clear();
  plan.seekg(0);
  const fs::path store_dir = prefix / "drive_c" / "ProgramData" / "KYR" / "Dirorodiv";
  Writer writer;
  if (!plan || !writer.Open(store_dir / "HotFolders.db") ||
      !WriteRecord(store_dir / "run.record", plan_text.str())) {
    std::fprintf(stderr, "hfbench_floor: cannot start\n");
    return 1;
  }
  std::string line;
  long long folder = 0;
  while (std::getline(plan, line)) {
    std::istringstream fields(line);
    std::string path;
    long long rows = 0, bytes = 0;
    if (!std::getline(fields, path, '\t') || !(fields >> rows >> bytes) || rows <= 0) continue;
    fs::path dir = HostPath(prefix, path);
    std::string config;
    std::error_code error;
    if (!ReadWhole(dir / "[_KYR_HotFolder_]" / "folder.cfg", &config)) return 1;
    fs::rename(dir / "[_KYR_HotFolder_]", dir / "[_KYR_HotFolder_Old]", error);
    if (error || !writer.Commit(++folder, rows, bytes)) return 1;
  }
  return fs::remove(store_dir / "run.record") ? 0 : 1;
}

}  // namespace

int main(int argc, char** argv) {
  std::string mode = argc > 1 ? argv[1] : "";
  if (mode == "plan" && argc == 3) return Plan(argv[2]);
  if (mode == "run" && argc == 4) return Run(argv[2], argv[3]);
  std::fprintf(stderr, "usage: hfbench_floor plan STORE | hfbench_floor run PREFIX PLAN\n");
  return 2;
}
