// The layout of the store's database, shared by the writer and the reader.
//
// One row of hot_folder per hot folder (the general setting, the enabled
// state and the filter tree as XML text), in registration order by id; the
// other records live in tables keyed by (hot_folder, position), position
// being the record's own order (list order, or map order for the job and
// imposition maps).
#ifndef HF_STORE_SCHEMA_H_
#define HF_STORE_SCHEMA_H_

#include <string>

namespace db {

// PRAGMA user_version of a database laid out as below. Version 1 has the
// same tables and columns, with the four tables keyed by (hot_folder,
// position) kept beside a separate index of that key: it is read and
// written as it is, and a new database gets version 2. A database of any
// other version is not ours to read or change.
constexpr int kSchemaVersion = 2;
constexpr int kFirstSchemaVersion = 1;

// Whether a database of that version is ours.
constexpr bool IsOurSchemaVersion(long long version) {
  return version >= kFirstSchemaVersion && version <= kSchemaVersion;
}

// The statements that create the tables of an empty database.
std::string CreateSchemaSql();

// The columns of db::Setting in hot_folder, in record order: "Name, String1, ...".
std::string SettingColumns();

// The columns of db::FolderConfiguration in folder_configuration.
std::string FolderColumns();

}  // namespace db

#endif  // HF_STORE_SCHEMA_H_
