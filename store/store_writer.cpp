#include "store/store_writer.h"

#ifndef _WIN32
#include <sys/stat.h>
#endif

#include <cstring>
#include <filesystem>
#include <fstream>

#include "store/filter_xml.h"
#include "store/record_fields.h"
#include "store/schema.h"
#include "store/store_file.h"

namespace db {

namespace {

// Long enough to outlast another process's commit, short enough that a
// store held open by a stuck process fails the folder instead of the run.
constexpr int kBusyTimeoutMs = 3000;

enum class FileState { kMissing, kEmpty, kSqlite, kUnusable };

// Looks at the file without SQLite, so that a file of another kind is
// refused before anything could write to it.
FileState Classify(const std::filesystem::path& file) {
  std::error_code ec;
  std::filesystem::file_status status = std::filesystem::symlink_status(file, ec);
  if (status.type() == std::filesystem::file_type::not_found) return FileState::kMissing;
  if (ec || !std::filesystem::is_regular_file(status)) return FileState::kUnusable;
  std::ifstream in(file, std::ios::binary);
  if (!in) return FileState::kUnusable;
  static const char kMagic[16] = "SQLite format 3";  // with its NUL: 16 bytes
  char header[sizeof(kMagic)] = {};
  in.read(header, sizeof(header));
  if (in.gcount() == 0 && in.eof()) return FileState::kEmpty;
  if (in.gcount() == sizeof(header) && std::memcmp(header, kMagic, sizeof(kMagic)) == 0) {
    return FileState::kSqlite;
  }
  return FileState::kUnusable;
}

bool QueryInt(sqlite3* db, const char* sql, std::int64_t* value) {
  Statement statement;
  if (!statement.Prepare(db, sql) || !statement.Step()) return false;
  *value = statement.ColumnInt(0);
  return true;
}

bool QuickCheckPasses(sqlite3* db) {
  Statement statement;
  if (!statement.Prepare(db, "PRAGMA quick_check") || !statement.Step()) return false;
  return statement.ColumnText(0) == "ok" && !statement.Step() && !statement.Failed();
}

// 0 for an empty database, its version for ours, -1 for anything else.
int SchemaState(sqlite3* db) {
  std::int64_t version = 0;
  std::int64_t objects = 0;
  if (!QueryInt(db, "PRAGMA user_version", &version)) return -1;
  if (!QueryInt(db, "SELECT count(*) FROM sqlite_master", &objects)) return -1;
  if (version == 0 && objects == 0) return 0;
  return IsOurSchemaVersion(version) ? static_cast<int>(version) : -1;
}

std::string Placeholders(std::size_t count) {
  std::string text;
  for (std::size_t i = 0; i < count; ++i) text += i == 0 ? "?" : ", ?";
  return text;
}

std::size_t SettingColumnCount() {
  std::size_t count = 0;
  for (const SettingField& field : kSettingFields) count += field.kind != FieldKind::kFilters;
  return count;
}

}  // namespace

struct StoreWriter::Statements {
  Statement begin, commit, rollback, find, insert_folder, insert_folder_config, insert_filter,
      insert_job, insert_impose, insert_preflight, enabled, disable;

  bool Prepare(sqlite3* db) {
    std::string folder_sql = "INSERT INTO hot_folder(enabled, " + SettingColumns() +
                             ", FilterConfiguration) VALUES(" +
                             Placeholders(SettingColumnCount() + 2) + ")";
    std::string config_sql = "INSERT INTO folder_configuration(hot_folder, " + FolderColumns() +
                             ") VALUES(" + Placeholders(std::size(kFolderFields) + 1) + ")";
    return begin.Prepare(db, "BEGIN IMMEDIATE") && commit.Prepare(db, "COMMIT") &&
           rollback.Prepare(db, "ROLLBACK") &&
           find.Prepare(db, "SELECT id FROM hot_folder WHERE FolderPath = ?") &&
           insert_folder.Prepare(db, folder_sql) && insert_folder_config.Prepare(db, config_sql) &&
           insert_filter.Prepare(db,
                                 "INSERT INTO filter_entry(hot_folder, position, DisplayName,"
                                 " Identifier) VALUES(?, ?, ?, ?)") &&
           insert_job.Prepare(db,
                              "INSERT INTO job_setting(hot_folder, position, key, Name, Value,"
                              " Extra) VALUES(?, ?, ?, ?, ?, ?)") &&
           insert_impose.Prepare(db,
                                 "INSERT INTO impose_setting(hot_folder, position, key, Name,"
                                 " Value) VALUES(?, ?, ?, ?, ?)") &&
           insert_preflight.Prepare(db,
                                    "INSERT INTO preflight_entry(hot_folder, position, First,"
                                    " Second) VALUES(?, ?, ?, ?)") &&
           enabled.Prepare(db, "SELECT enabled FROM hot_folder WHERE FolderPath = ?") &&
           disable.Prepare(db, "UPDATE hot_folder SET enabled = 0 WHERE FolderPath = ?");
  }
};

StoreWriter::StoreWriter() = default;

StoreWriter::~StoreWriter() {
  Close();
}

void StoreWriter::Close() {
  statements_.reset();  // statements go before the connection they belong to
  db_.reset();
  file_.clear();
}

bool StoreWriter::Identify(const platform::HostPath& file, FileId* id) {
#ifdef _WIN32
  // Windows deletes or replaces no file that SQLite holds open.
  (void)file;
  *id = FileId();
  return true;
#else
  struct stat st;
  if (stat(file.c_str(), &st) != 0) return false;
  id->device = static_cast<std::uint64_t>(st.st_dev);
  id->inode = static_cast<std::uint64_t>(st.st_ino);
  return true;
#endif
}

bool StoreWriter::EnsureOpen(const StoreLocation& location, bool create) {
  // A store deleted or replaced while open would take commits into a file
  // nobody will read again, and answer success for them.
  FileId id;
  if (db_ && location.file == file_ && Identify(file_, &id) && id == file_id_) return true;
  Close();
  if (location.file.empty() || !Open(location, create) || !Identify(location.file, &file_id_)) {
    Close();
    return false;
  }
  file_ = location.file;
  return true;
}

bool StoreWriter::Open(const StoreLocation& location, bool create) {
  // The folder is made only for a store about to be created; either way it
  // and the store's files are reached through no link of someone else's.
  const StoreFile placed = PlaceStoreFile(platform::OpenTrustedFolder(location.folder, create),
                                          std::filesystem::path(location.file).filename().native());
  if (placed.path.empty()) return false;
  const std::filesystem::path file(placed.path);
  FileState state = Classify(file);
  if (state == FileState::kUnusable || (state == FileState::kMissing && !create)) return false;
  db_ = OpenDatabase(file.u8string(),
                     SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOFOLLOW, nullptr);
  // SQLite quietly falls back to reading a file it may not write.
  if (!db_ || sqlite3_db_readonly(db_.get(), "main") != 0) return false;
  sqlite3* db = db_.get();
  sqlite3_busy_timeout(db, kBusyTimeoutMs);

  // Only reads until the file has shown it is an empty database or ours:
  // the journal mode and the schema are written to nothing else.
  int schema = SchemaState(db);
  if (schema < 0 || (schema > 0 && !QuickCheckPasses(db))) return false;
  // A folder's commit rewrites the last page of each of its tables, mostly
  // to add a row or two; with pages of 1 KiB instead of 4 KiB that is well
  // under half the bytes to write and sync. Set before the first write, as
  // only a new database takes it; a store made earlier keeps its own.
  if (schema == 0 && !Exec(db, "PRAGMA page_size = 1024")) return false;
  if (!Exec(db, "PRAGMA journal_mode = WAL; PRAGMA synchronous = FULL;")) return false;
  if (schema == 0) {
    // Another process may be creating the same store; whoever comes second
    // finds the schema in place.
    if (!Exec(db, "BEGIN IMMEDIATE")) return false;
    schema = SchemaState(db);
    bool created = schema > 0 || (schema == 0 && Exec(db, CreateSchemaSql().c_str()));
    if (!created || !Exec(db, "COMMIT")) {
      Exec(db, "ROLLBACK");
      return false;
    }
  }
  statements_ = std::make_unique<Statements>();
  return statements_->Prepare(db);
}

bool StoreWriter::OpenExisting(const StoreLocation& location) {
  return EnsureOpen(location, /*create=*/false);
}

CreateResult StoreWriter::Create(const StoreLocation& location, const HotFolderRecords& records,
                                 bool enabled) {
  if (!EnsureOpen(location, /*create=*/true)) return CreateResult::kFailed;
  bool duplicate = false;
  if (Insert(records, enabled, &duplicate)) return CreateResult::kCreated;
  if (duplicate) return CreateResult::kAlreadyRegistered;
  Close();
  return CreateResult::kFailed;
}

bool StoreWriter::Disable(const StoreLocation& location, const wxString& folder_path) {
  if (!EnsureOpen(location, /*create=*/false)) return false;
  // A folder created disabled needs no second commit.
  Statement& enabled = statements_->enabled;
  if (!enabled.BindText(1, folder_path)) {
    Close();
    return false;
  }
  const bool found = enabled.Step();
  const bool failed = enabled.Failed();
  const bool already = found && enabled.ColumnInt(0) == 0;
  enabled.Reset();
  if (failed) {
    Close();
    return false;
  }
  if (!found || already) return found;
  Statement& disable = statements_->disable;
  if (!disable.BindText(1, folder_path) || !disable.Run()) {
    Close();
    return false;
  }
  return sqlite3_changes(db_.get()) > 0;
}

Registration StoreWriter::Find(const StoreLocation& location, const wxString& folder_path) {
  FileState state = Classify(std::filesystem::path(location.file));
  if (state == FileState::kMissing || state == FileState::kEmpty) {
    return Registration::kNotRegistered;
  }
  if (!EnsureOpen(location, /*create=*/false)) return Registration::kUnknown;
  Statement& find = statements_->find;
  if (!find.BindText(1, folder_path)) return Registration::kUnknown;
  const bool found = find.Step();
  const bool failed = find.Failed();
  find.Reset();
  if (failed) {
    Close();
    return Registration::kUnknown;
  }
  return found ? Registration::kRegistered : Registration::kNotRegistered;
}

bool StoreWriter::Insert(const HotFolderRecords& records, bool enabled, bool* duplicate) {
  Statements& s = *statements_;
  if (!s.begin.Run()) return false;
  if (InsertRecords(records, enabled, duplicate) && s.commit.Run()) return true;
  if (sqlite3_get_autocommit(db_.get()) == 0) s.rollback.Run();
  return false;
}

bool StoreWriter::InsertRecords(const HotFolderRecords& records, bool enabled, bool* duplicate) {
  Statements& s = *statements_;
  const Setting& setting = records.setting;
  if (!s.find.BindText(1, setting.FolderPath)) return false;
  *duplicate = s.find.Step();
  bool find_failed = s.find.Failed();
  s.find.Reset();
  if (*duplicate || find_failed) return false;

  std::string filter_xml;
  if (!FilterXmlText(records.filter, &filter_xml)) return false;
  int index = 0;
  bool ok = s.insert_folder.BindInt(++index, enabled ? 1 : 0);
  for (const SettingField& field : kSettingFields) {
    switch (field.kind) {
      case FieldKind::kText:
        ok = ok && s.insert_folder.BindText(++index, setting.*field.text);
        break;
      case FieldKind::kInt32:
        ok = ok && s.insert_folder.BindInt(++index, setting.*field.int32);
        break;
      case FieldKind::kFlag:
        ok = ok && s.insert_folder.BindInt(++index, setting.*field.flag ? 1 : 0);
        break;
      case FieldKind::kOptionalFlag: {
        const std::optional<bool>& flag = setting.*field.optional_flag;
        ++index;
        ok = ok && (flag ? s.insert_folder.BindInt(index, *flag ? 1 : 0)
                         : s.insert_folder.BindNull(index));
        break;
      }
      case FieldKind::kFilters:
        break;
    }
  }
  ok = ok && s.insert_folder.BindUtf8(++index, filter_xml) && s.insert_folder.Run();
  if (!ok) return false;
  std::int64_t id = sqlite3_last_insert_rowid(db_.get());

  Statement& config = s.insert_folder_config;
  index = 1;
  ok = config.BindInt(index, id);
  for (const FolderField& field : kFolderFields) {
    ok = ok && config.BindText(++index, records.folder.*field.member);
  }
  ok = ok && config.Run();

  std::int64_t position = 0;
  for (const FilterEntry& entry : setting.Filters) {
    Statement& st = s.insert_filter;
    ok = ok && st.BindInt(1, id) && st.BindInt(2, position++) &&
         st.BindText(3, entry.DisplayName) && st.BindText(4, entry.Identifier) && st.Run();
  }
  position = 0;
  for (const auto& [key, entry] : records.job) {
    Statement& st = s.insert_job;
    ok = ok && st.BindInt(1, id) && st.BindInt(2, position++) && st.BindText(3, key) &&
         st.BindText(4, entry.Name) && st.BindText(5, entry.Value) && st.BindText(6, entry.Extra) &&
         st.Run();
  }
  position = 0;
  for (const auto& [key, entry] : records.impose) {
    Statement& st = s.insert_impose;
    ok = ok && st.BindInt(1, id) && st.BindInt(2, position++) && st.BindText(3, key) &&
         st.BindText(4, entry.Name) && st.BindText(5, entry.Value) && st.Run();
  }
  position = 0;
  for (const PreflightEntry& entry : records.preflight) {
    Statement& st = s.insert_preflight;
    ok = ok && st.BindInt(1, id) && st.BindInt(2, position++) && st.BindText(3, entry.First) &&
         st.BindText(4, entry.Second) && st.Run();
  }
  return ok;
}

}  // namespace db
