#include "store/schema.h"

#include "store/record_fields.h"

namespace db {

namespace {

const char* SqlType(FieldKind kind) {
  switch (kind) {
    case FieldKind::kText:
      return "TEXT NOT NULL";
    case FieldKind::kInt32:
    case FieldKind::kFlag:
      return "INTEGER NOT NULL";
    case FieldKind::kOptionalFlag:
      return "INTEGER";  // NULL while the flag has no value
    case FieldKind::kFilters:
      break;
  }
  return nullptr;
}

}  // namespace

std::string SettingColumns() {
  std::string columns;
  for (const SettingField& field : kSettingFields) {
    if (field.kind == FieldKind::kFilters) continue;
    if (!columns.empty()) columns += ", ";
    columns += field.name;
  }
  return columns;
}

std::string FolderColumns() {
  std::string columns;
  for (const FolderField& field : kFolderFields) {
    if (!columns.empty()) columns += ", ";
    columns += field.name;
  }
  return columns;
}

std::string CreateSchemaSql() {
  std::string sql = "CREATE TABLE hot_folder(id INTEGER PRIMARY KEY, enabled INTEGER NOT NULL";
  for (const SettingField& field : kSettingFields) {
    if (field.kind == FieldKind::kFilters) continue;
    sql += std::string(", ") + field.name + " " + SqlType(field.kind);
  }
  sql += ", FilterConfiguration TEXT NOT NULL);\n";
  // A folder is known by its path; the index also makes the duplicate test
  // and DisableHotFolder cheap with thousands of folders.
  sql += "CREATE UNIQUE INDEX hot_folder_path ON hot_folder(FolderPath);\n";
  sql += "CREATE TABLE folder_configuration(hot_folder INTEGER PRIMARY KEY";
  for (const FolderField& field : kFolderFields)
    sql += std::string(", ") + field.name + " TEXT NOT NULL";
  sql += ");\n";
  // Stored in the order of their key, without a rowid: each row goes into
  // one b-tree instead of a table and an index beside it, so a folder's
  // commit writes fewer pages.
  sql +=
      "CREATE TABLE filter_entry(hot_folder INTEGER NOT NULL, position INTEGER NOT NULL,"
      " DisplayName TEXT NOT NULL, Identifier TEXT NOT NULL, PRIMARY KEY(hot_folder, position))"
      " WITHOUT ROWID;\n"
      "CREATE TABLE job_setting(hot_folder INTEGER NOT NULL, position INTEGER NOT NULL,"
      " key TEXT NOT NULL, Name TEXT NOT NULL, Value TEXT NOT NULL, Extra TEXT NOT NULL,"
      " PRIMARY KEY(hot_folder, position)) WITHOUT ROWID;\n"
      "CREATE TABLE impose_setting(hot_folder INTEGER NOT NULL, position INTEGER NOT NULL,"
      " key TEXT NOT NULL, Name TEXT NOT NULL, Value TEXT NOT NULL,"
      " PRIMARY KEY(hot_folder, position)) WITHOUT ROWID;\n"
      "CREATE TABLE preflight_entry(hot_folder INTEGER NOT NULL, position INTEGER NOT NULL,"
      " First TEXT NOT NULL, Second TEXT NOT NULL, PRIMARY KEY(hot_folder, position))"
      " WITHOUT ROWID;\n";
  sql += "PRAGMA user_version = " + std::to_string(kSchemaVersion) + ";\n";
  return sql;
}

}  // namespace db
