#include "inspect/hfstore_check.h"

#include <algorithm>
#include <filesystem>
#include <iostream>
#include <map>
#include <nlohmann/json.hpp>
#include <set>
#include <string>
#include <vector>

#include "convert/settings_dir.h"
#include "engine/migrator.h"
#include "engine/run_record.h"
#include "store/store_file.h"
#include "store/store_reader.h"

namespace {

enum Result { kMigrated, kNotMigrated, kInterrupted, kDiffers, kNotRetired, kUndecoded, kResults };

// What each result is called, in lines and in the summary; whether it
// leaves a folder that had legacy settings short of migrated as listed is
// decided per folder (a folder without any folder.cfg had none).
const char* const kResultNames[kResults] = {
    "migrated",
    "not migrated",
    "interrupted",
    "enabled state differs",
    "settings not retired",
    "path not decodable",
};

struct FolderCheck {
  Result result = kNotMigrated;
  bool counts_against = false;  // had legacy settings and is not migrated as listed
  wxString folder;
  wxString detail;
  bool listed_enabled = true;
  const StoredHotFolder* stored = nullptr;
};

const char* EnabledWord(bool enabled) {
  return enabled ? "enabled" : "disabled";
}

struct Sources {
  std::map<wxString, const StoredHotFolder*> stored;  // by folder path
  std::set<wxString> recorded;                        // folders an interrupted run was retiring
};

FolderCheck CheckFolder(const Sources& sources, const wxString& folder, bool listed_enabled) {
  FolderCheck check;
  check.folder = folder;
  check.listed_enabled = listed_enabled;
  const FolderPaths paths = MakeFolderPaths(folder);
  const wxString config = LegacyConfigPath(folder);
  const bool has_config = platform::FileExists(config.ToStdWstring());
  auto found = sources.stored.find(paths.full_path);
  if (found != sources.stored.end()) {
    check.stored = found->second;
    if (check.stored->enabled != listed_enabled) {
      check.result = kDiffers;
      check.detail = wxString("listed ") + EnabledWord(listed_enabled) + ", stored " +
                     EnabledWord(check.stored->enabled);
    } else if (has_config) {
      // A retired directory already there is never replaced, so no run
      // can move these settings; otherwise the next run retires them.
      check.result = kNotRetired;
      check.detail = "registered, but its settings are still at " + config + ": " +
                     (platform::DirectoryExists(paths.retired.ToStdWstring())
                          ? paths.retired + " already exists"
                          : wxString("run hfmigrate again"));
    } else {
      check.result = kMigrated;
      check.detail = wxString(EnabledWord(listed_enabled)) + ", as listed";
    }
    check.counts_against = check.result != kMigrated;
  } else if (has_config) {
    check.detail = "not registered; its settings are still at " + config;
    check.counts_against = true;
  } else if (sources.recorded.count(folder) != 0 &&
             platform::DirectoryExists(paths.retired.ToStdWstring())) {
    check.result = kInterrupted;
    check.detail = "settings retired but not registered: run hfmigrate again";
    check.counts_against = true;
  } else {
    check.detail = "no folder.cfg at " + config;
    // Retired by someone else (an earlier tool, a person): hfmigrate will
    // not touch it, and says so.
    if (platform::DirectoryExists(paths.retired.ToStdWstring())) {
      check.detail += "; " + paths.retired + " is left alone: no interrupted run retired it";
    }
  }
  return check;
}

// A listed path whose bytes the host could not decode: nothing can find its
// folder, so it counts against the run. It is shown as its bytes, those
// outside printable ASCII (and a backslash before an "x") written as \xHH.
FolderCheck CheckUndecoded(const std::string& bytes, bool listed_enabled) {
  static const char kHex[] = "0123456789ABCDEF";
  std::string shown;
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    const unsigned char byte = static_cast<unsigned char>(bytes[i]);
    const bool escaped =
        byte < 0x20 || byte > 0x7E || (byte == '\\' && i + 1 < bytes.size() && bytes[i + 1] == 'x');
    if (escaped) {
      shown += {'\\', 'x', kHex[byte >> 4], kHex[byte & 0xF]};
    } else {
      shown.push_back(static_cast<char>(byte));
    }
  }
  FolderCheck check;
  check.result = kUndecoded;
  check.counts_against = true;
  check.folder = wxString::FromUTF8(shown.data(), shown.size());
  check.detail =
      "the list's bytes for this path do not decode in this machine's ANSI code page: "
      "hfmigrate cannot find the folder";
  check.listed_enabled = listed_enabled;
  return check;
}

std::string Utf8(const wxString& text) {
  wxScopedCharBuffer utf8 = text.utf8_str();
  return std::string(utf8.data(), utf8.length());
}

// A field of a tab-separated line must not break the line apart, nor be
// mistaken for another text: one that holds a control character (the list
// file allows tabs and line feeds in a path) or starts with a double quote
// is written as the JSON string --json gives it, quotes included.
std::string Field(const wxString& text) {
  const std::string field = Utf8(text);
  const bool plain =
      std::none_of(field.begin(), field.end(), [](unsigned char c) { return c < 0x20; }) &&
      (field.empty() || field[0] != '"');
  return plain
             ? field
             : nlohmann::json(field).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

void PrintLines(const std::vector<FolderCheck>& checks, const int (&counts)[kResults], bool ok) {
  for (const FolderCheck& check : checks) {
    std::cout << kResultNames[check.result] << '\t' << Field(check.folder) << '\t'
              << Field(check.detail) << '\n';
  }
  std::cout << checks.size() << " listed:";
  for (int r = 0; r < kResults; ++r) {
    std::cout << (r == 0 ? " " : ", ") << counts[r] << ' ' << kResultNames[r];
  }
  std::cout << (ok ? "; every folder with legacy settings is migrated as listed\n"
                   : "; not every folder with legacy settings is migrated as listed\n");
}

void PrintJson(const std::vector<FolderCheck>& checks, const int (&counts)[kResults], bool ok) {
  using nlohmann::ordered_json;
  ordered_json folders = ordered_json::array();
  for (const FolderCheck& check : checks) {
    folders.push_back({{"result", kResultNames[check.result]},
                       {"folder", Utf8(check.folder)},
                       {"detail", Utf8(check.detail)},
                       {"listedEnabled", check.listed_enabled},
                       {"storedEnabled", check.stored ? ordered_json(check.stored->enabled)
                                                      : ordered_json(nullptr)}});
  }
  ordered_json summary = {{"listed", checks.size()}};
  for (int r = 0; r < kResults; ++r) summary[kResultNames[r]] = counts[r];
  ordered_json out = {{"folders", folders}, {"summary", summary}, {"migratedAsListed", ok}};
  std::cout << out.dump(2, ' ', false, ordered_json::error_handler_t::replace) << '\n';
}

}  // namespace

int RunCheck(const platform::HostPath& store_file, bool json) {
  CHFMigrator engine;
  if (!engine.ReadLegacyList() && engine.m_Folders.empty()) {
    std::cerr << "hfstore: no legacy hot-folder list to check (missing, unreadable or empty)\n";
    return 1;
  }
  // A store that is not there holds no folder: nothing was migrated. One
  // refused (behind another user's link, or a link itself) is said so.
  std::vector<StoredHotFolder> stored;
  const db::StoreFile placed = db::CheckStoreFile(store_file);
  std::error_code ec;
  if (!placed.missing &&
      (placed.path.empty() ||
       std::filesystem::exists(std::filesystem::symlink_status(placed.path, ec)))) {
    wxString error;
    if (!ReadStore(store_file, &stored, &error)) {
      std::cerr << "hfstore: " << Field(error) << '\n';
      return 1;
    }
  }
  Sources sources;
  for (const StoredHotFolder& folder : stored) sources.stored[folder.setting.FolderPath] = &folder;
  std::vector<RunRecordEntry> record;
  if (ReadRunRecord(&record) == RunRecordState::kFound) {
    for (const RunRecordEntry& entry : record) {
      if (entry.retires) sources.recorded.insert(entry.folder);
    }
  }

  std::vector<FolderCheck> checks;
  int counts[kResults] = {};
  bool ok = true;
  for (std::size_t i = 0; i < engine.m_Folders.size(); ++i) {
    const bool listed_enabled =
        i >= engine.m_EnabledFlags.size() || engine.m_EnabledFlags[i] != "0";
    const auto undecoded = engine.m_UndecodedPaths.find(i);
    checks.push_back(undecoded != engine.m_UndecodedPaths.end()
                         ? CheckUndecoded(undecoded->second, listed_enabled)
                         : CheckFolder(sources, engine.m_Folders[i], listed_enabled));
    ++counts[checks.back().result];
    ok = ok && !checks.back().counts_against;
  }
  if (json) {
    PrintJson(checks, counts, ok);
  } else {
    PrintLines(checks, counts, ok);
  }
  if (!std::cout.flush()) {
    std::cerr << "hfstore: cannot write the output\n";
    return 1;
  }
  return ok ? 0 : 1;
}
