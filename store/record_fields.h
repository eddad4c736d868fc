// The members of the records, as data: the store's columns, the reader and
// the JSON dump all walk these tables, so a member cannot be persisted under
// one name and shown under another, or forgotten by one of them.
#ifndef HF_STORE_RECORD_FIELDS_H_
#define HF_STORE_RECORD_FIELDS_H_

#include <cstdint>
#include <iterator>
#include <optional>

#include "store/records.h"

namespace db {

enum class FieldKind { kText, kInt32, kFlag, kOptionalFlag, kFilters };

// One member of db::Setting; exactly the pointer that matches `kind` is set.
// The filter chain has no column of its own (it is a table of entries) but
// keeps its place here so the dump shows members in record order.
struct SettingField {
  const char* name;
  FieldKind kind;
  wxString Setting::*text;
  std::int32_t Setting::*int32;
  bool Setting::*flag;
  std::optional<bool> Setting::*optional_flag;
};

constexpr SettingField TextField(const char* name, wxString Setting::*m) {
  return {name, FieldKind::kText, m, nullptr, nullptr, nullptr};
}
constexpr SettingField Int32Field(const char* name, std::int32_t Setting::*m) {
  return {name, FieldKind::kInt32, nullptr, m, nullptr, nullptr};
}
constexpr SettingField FlagField(const char* name, bool Setting::*m) {
  return {name, FieldKind::kFlag, nullptr, nullptr, m, nullptr};
}
constexpr SettingField OptionalFlagField(const char* name, std::optional<bool> Setting::*m) {
  return {name, FieldKind::kOptionalFlag, nullptr, nullptr, nullptr, m};
}

inline constexpr SettingField kSettingFields[] = {
    TextField("Name", &Setting::Name),
    TextField("String1", &Setting::String1),
    TextField("ServerAddr", &Setting::ServerAddr),
    TextField("ServerName", &Setting::ServerName),
    Int32Field("Number1", &Setting::Number1),
    TextField("Queue", &Setting::Queue),
    TextField("String2", &Setting::String2),
    TextField("Queue2", &Setting::Queue2),
    FlagField("Flag1", &Setting::Flag1),
    {"Filters", FieldKind::kFilters, nullptr, nullptr, nullptr, nullptr},
    FlagField("Flag2", &Setting::Flag2),
    FlagField("Flag3", &Setting::Flag3),
    OptionalFlagField("Flag4", &Setting::Flag4),
    TextField("String3", &Setting::String3),
    TextField("FolderPath", &Setting::FolderPath),
    TextField("String4", &Setting::String4),
    TextField("String5", &Setting::String5),
    TextField("String6", &Setting::String6),
    TextField("String7", &Setting::String7),
    TextField("String8", &Setting::String8),
    FlagField("Flag5", &Setting::Flag5),
    FlagField("Flag6", &Setting::Flag6),
    TextField("String9", &Setting::String9),
};

struct FolderField {
  const char* name;
  wxString FolderConfiguration::*member;
};

inline constexpr FolderField kFolderFields[] = {
    {"FailedFolder", &FolderConfiguration::FailedFolder},
    {"WorkFolder", &FolderConfiguration::WorkFolder},
    {"MoveFolder", &FolderConfiguration::MoveFolder},
    {"FolderPath", &FolderConfiguration::FolderPath},
};

}  // namespace db

#endif  // HF_STORE_RECORD_FIELDS_H_
