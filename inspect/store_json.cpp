#include "inspect/store_json.h"

#include "store/record_fields.h"

namespace {

using Json = nlohmann::ordered_json;

std::string Utf8(const wxString& text) {
  wxScopedCharBuffer utf8 = text.utf8_str();
  return std::string(utf8.data(), utf8.length());
}

Json FiltersJson(const std::vector<db::FilterEntry>& filters) {
  Json list = Json::array();
  for (const db::FilterEntry& entry : filters) {
    list.push_back(
        {{"DisplayName", Utf8(entry.DisplayName)}, {"Identifier", Utf8(entry.Identifier)}});
  }
  return list;
}

Json SettingJson(const db::Setting& setting) {
  Json object = Json::object();
  for (const db::SettingField& field : db::kSettingFields) {
    Json& value = object[field.name];
    switch (field.kind) {
      case db::FieldKind::kText:
        value = Utf8(setting.*field.text);
        break;
      case db::FieldKind::kInt32:
        value = setting.*field.int32;
        break;
      case db::FieldKind::kFlag:
        value = setting.*field.flag;
        break;
      case db::FieldKind::kOptionalFlag:
        // A flag without a value shows as null, not as a made-up false.
        if (const std::optional<bool>& flag = setting.*field.optional_flag) value = *flag;
        break;
      case db::FieldKind::kFilters:
        value = FiltersJson(setting.Filters);
        break;
    }
  }
  return object;
}

Json FolderJson(const db::FolderConfiguration& folder) {
  Json object = Json::object();
  for (const db::FolderField& field : db::kFolderFields)
    object[field.name] = Utf8(folder.*field.member);
  return object;
}

Json JobJson(const db::JobConfiguration& job) {
  Json list = Json::array();
  for (const auto& [key, entry] : job) {
    list.push_back({{"key", Utf8(key)},
                    {"Name", Utf8(entry.Name)},
                    {"Value", Utf8(entry.Value)},
                    {"Extra", Utf8(entry.Extra)}});
  }
  return list;
}

Json ImposeJson(const db::ImposeConfiguration& impose) {
  Json list = Json::array();
  for (const auto& [key, entry] : impose) {
    Json item = {{"Name", Utf8(entry.Name)}, {"Value", Utf8(entry.Value)}};
    // The key is the entry's name; should a caller ever differ, the key is
    // shown too rather than lost.
    if (key != entry.Name) item["key"] = Utf8(key);
    list.push_back(std::move(item));
  }
  return list;
}

Json PreflightJson(const db::PreflightConfiguration& preflight) {
  Json list = Json::array();
  for (const db::PreflightEntry& entry : preflight) {
    list.push_back({{"First", Utf8(entry.First)}, {"Second", Utf8(entry.Second)}});
  }
  return list;
}

}  // namespace

Json StoreToJson(const std::vector<StoredHotFolder>& folders) {
  Json list = Json::array();
  for (const StoredHotFolder& folder : folders) {
    Json object = Json::object();
    object["enabled"] = folder.enabled;
    object["setting"] = SettingJson(folder.setting);
    object["folderConfiguration"] = FolderJson(folder.folderConfiguration);
    object["jobConfiguration"] = JobJson(folder.jobConfiguration);
    object["filterConfiguration"] = Utf8(folder.filterConfiguration);
    object["imposeConfiguration"] = ImposeJson(folder.imposeConfiguration);
    object["preflightConfiguration"] = PreflightJson(folder.preflightConfiguration);
    list.push_back(std::move(object));
  }
  Json store = Json::object();
  store["hotFolders"] = std::move(list);
  return store;
}
