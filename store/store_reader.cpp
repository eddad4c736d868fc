#include "store/store_reader.h"

#include <cctype>
#include <cstring>
#include <filesystem>
#include <unordered_map>

#include "store/record_fields.h"
#include "store/schema.h"
#include "store/sqlite_statement.h"
#include "store/store_file.h"

std::wstring StoreFolder() {
  return platform::CommonAppDataFolder() + L"\\KYR\\Dirorodiv";
}

platform::HostPath StoreHostPath() {
  return platform::ToHostPath(StoreFolder() + L"\\HotFolders.db");
}

namespace {

using IdIndex = std::unordered_map<std::int64_t, StoredHotFolder*>;

void ReadSetting(db::Statement& row, int* column, db::Setting* setting) {
  for (const db::SettingField& field : db::kSettingFields) {
    switch (field.kind) {
      case db::FieldKind::kText:
        setting->*field.text = row.ColumnText((*column)++);
        break;
      case db::FieldKind::kInt32:
        setting->*field.int32 = static_cast<std::int32_t>(row.ColumnInt((*column)++));
        break;
      case db::FieldKind::kFlag:
        setting->*field.flag = row.ColumnInt((*column)++) != 0;
        break;
      case db::FieldKind::kOptionalFlag: {
        int c = (*column)++;
        if (row.ColumnIsNull(c)) {
          (setting->*field.optional_flag).reset();
        } else {
          setting->*field.optional_flag = row.ColumnInt(c) != 0;
        }
        break;
      }
      case db::FieldKind::kFilters:
        break;
    }
  }
}

bool ReadFolders(sqlite3* db, std::vector<StoredHotFolder>* folders,
                 std::vector<std::int64_t>* ids) {
  db::Statement row;
  if (!row.Prepare(db, "SELECT id, enabled, " + db::SettingColumns() +
                           ", FilterConfiguration FROM hot_folder ORDER BY id")) {
    return false;
  }
  while (row.Step()) {
    StoredHotFolder folder;
    ids->push_back(row.ColumnInt(0));
    folder.enabled = row.ColumnInt(1) != 0;
    int column = 2;
    ReadSetting(row, &column, &folder.setting);
    folder.filterConfiguration = row.ColumnText(column);
    folders->push_back(std::move(folder));
  }
  return !row.Failed() && !row.TextWasBad();
}

// Walks one child table in (hot_folder, position) order and hands each row
// to `add` together with the folder it belongs to.
template <typename Add>
bool ReadChildren(sqlite3* db, const std::string& sql, const IdIndex& index, Add add) {
  db::Statement row;
  if (!row.Prepare(db, sql)) return false;
  while (row.Step()) {
    auto found = index.find(row.ColumnInt(0));
    if (found == index.end()) return false;  // a row of no hot folder
    add(row, found->second);
  }
  return !row.Failed() && !row.TextWasBad();
}

bool ReadAll(sqlite3* db, std::vector<StoredHotFolder>* folders) {
  std::vector<std::int64_t> ids;
  if (!ReadFolders(db, folders, &ids)) return false;
  IdIndex index;
  for (std::size_t i = 0; i < ids.size(); ++i) index[ids[i]] = &(*folders)[i];
  const std::string order = " ORDER BY hot_folder, position";
  return ReadChildren(
             db, "SELECT hot_folder, " + db::FolderColumns() + " FROM folder_configuration", index,
             [](db::Statement& row, StoredHotFolder* folder) {
               int column = 1;
               for (const db::FolderField& field : db::kFolderFields) {
                 folder->folderConfiguration.*field.member = row.ColumnText(column++);
               }
             }) &&
         ReadChildren(db, "SELECT hot_folder, DisplayName, Identifier FROM filter_entry" + order,
                      index,
                      [](db::Statement& row, StoredHotFolder* folder) {
                        folder->setting.Filters.push_back({row.ColumnText(1), row.ColumnText(2)});
                      }) &&
         ReadChildren(
             db, "SELECT hot_folder, key, Name, Value, Extra FROM job_setting" + order, index,
             [](db::Statement& row, StoredHotFolder* folder) {
               folder->jobConfiguration.emplace(
                   row.ColumnText(1),
                   db::JobSettingEntry{row.ColumnText(2), row.ColumnText(3), row.ColumnText(4)});
             }) &&
         ReadChildren(db, "SELECT hot_folder, key, Name, Value FROM impose_setting" + order, index,
                      [](db::Statement& row, StoredHotFolder* folder) {
                        folder->imposeConfiguration.emplace(
                            row.ColumnText(1),
                            db::ImposeSettingEntry{row.ColumnText(2), row.ColumnText(3)});
                      }) &&
         ReadChildren(
             db, "SELECT hot_folder, First, Second FROM preflight_entry" + order, index,
             [](db::Statement& row, StoredHotFolder* folder) {
               folder->preflightConfiguration.push_back({row.ColumnText(1), row.ColumnText(2)});
             });
}

// Reads the database `name` names (a file name, or a URI when `flags` say so).
bool ReadDatabase(const std::string& name, int flags, const wxString& shown,
                  std::vector<StoredHotFolder>* folders, wxString* error) {
  folders->clear();
  std::string reason;
  db::Database db = db::OpenDatabase(name, flags, &reason);
  if (!db) {
    *error = "cannot open store " + shown + ": " + wxString::FromUTF8(reason);
    return false;
  }
  sqlite3_busy_timeout(db.get(), 3000);
  std::int64_t version = -1;
  {
    db::Statement query;
    if (query.Prepare(db.get(), "PRAGMA user_version") && query.Step()) {
      version = query.ColumnInt(0);
    }
  }
  // A database without any table is a store whose first folder was never
  // committed (the writer died before its schema transaction): it holds no
  // hot folder, exactly as the writer treats it.
  if (version == 0) {
    db::Statement objects;
    if (objects.Prepare(db.get(), "SELECT count(*) FROM sqlite_master") && objects.Step() &&
        objects.ColumnInt(0) == 0) {
      return true;
    }
  }
  if (!db::IsOurSchemaVersion(version)) {
    *error = version < 0 ? "cannot read store " + shown + ": " +
                               wxString::FromUTF8(sqlite3_errmsg(db.get()))
                         : wxString::Format("%s is not a hot-folder store of version %d to %d",
                                            shown, db::kFirstSchemaVersion, db::kSchemaVersion);
    return false;
  }
  // One read transaction, so a writer committing meanwhile cannot show
  // half of its folder.
  bool ok = db::Exec(db.get(), "BEGIN") && ReadAll(db.get(), folders);
  db::Exec(db.get(), "COMMIT");
  if (!ok) {
    folders->clear();
    const char* why =
        sqlite3_errcode(db.get()) == SQLITE_OK ? "unexpected content" : sqlite3_errmsg(db.get());
    *error = "cannot read store " + shown + ": " + wxString::FromUTF8(why);
  }
  return ok;
}

// What tells whether a writer touched the store while it was read.
struct Stamp {
  bool has_wal = false;
  std::uintmax_t size = 0;
  std::filesystem::file_time_type time;

  bool operator==(const Stamp& other) const {
    return has_wal == other.has_wal && size == other.size && time == other.time;
  }
};

Stamp StampOf(const std::filesystem::path& file) {
  std::error_code ec;
  Stamp stamp;
  std::filesystem::path wal = file;
  wal += "-wal";
  stamp.has_wal = std::filesystem::exists(wal, ec);
  stamp.size = std::filesystem::file_size(file, ec);
  stamp.time = std::filesystem::last_write_time(file, ec);
  return stamp;
}

// An SQLite URI that opens the file as immutable.
std::string ImmutableUri(const std::filesystem::path& file) {
  std::string path = file.generic_u8string();
  if (path.empty() || path[0] != '/') path.insert(0, "/");  // "C:/x" becomes "/C:/x"
  std::string uri = "file:";
  const char* hex = "0123456789ABCDEF";
  for (unsigned char c : path) {
    if (std::isalnum(c) || std::strchr("/-._~:", c) != nullptr) {
      uri += static_cast<char>(c);
    } else {
      uri += {'%', hex[c >> 4], hex[c & 15]};
    }
  }
  return uri + "?immutable=1";
}

}  // namespace

bool ReadStore(const platform::HostPath& file, std::vector<StoredHotFolder>* folders,
               wxString* error) {
  folders->clear();
  wxString shown = wxString::FromUTF8(std::filesystem::path(file).u8string());
  // Read through the same rules as the writer's, since even a reader may
  // create SQLite's companion files: no link of someone else's on the way,
  // none at the store's files, and SQLite told to follow none.
  const db::StoreFile placed = db::CheckStoreFile(file);
  if (placed.path.empty()) {
    *error = placed.missing ? "no store at " + shown
                            : "refusing store " + shown + ": " + wxString::FromUTF8(placed.refusal);
    return false;
  }
  const std::filesystem::path path(placed.path);
  std::error_code ec;
  // Checked first: SQLite would create a missing file on some paths, and a
  // reader must never leave a database behind.
  if (!std::filesystem::is_regular_file(std::filesystem::symlink_status(path, ec))) {
    *error = "no store at " + shown;
    return false;
  }
  // A read-only connection to a WAL database creates the -wal and -shm
  // companions when they are missing and cannot remove them again. Without
  // a -wal file the store is at rest, every commit in the file itself, and
  // is read as immutable, touching nothing. Should a writer have come by
  // meanwhile (its -wal appears, the file changes), the read is repeated
  // the ordinary way.
  Stamp before = StampOf(path);
  if (!before.has_wal &&
      ReadDatabase(ImmutableUri(path),
                   SQLITE_OPEN_READONLY | SQLITE_OPEN_URI | SQLITE_OPEN_NOFOLLOW, shown, folders,
                   error) &&
      StampOf(path) == before) {
    return true;
  }
  return ReadDatabase(path.u8string(), SQLITE_OPEN_READONLY | SQLITE_OPEN_NOFOLLOW, shown, folders,
                      error);
}
