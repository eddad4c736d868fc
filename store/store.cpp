#include "store/store.h"

#include <cstdlib>
#include <string>

#include "store/store_reader.h"
#include "store/store_writer.h"

namespace {

// The header gives the store object no members; its one connection lives
// here, for the life of the process.
db::StoreWriter& Writer() {
  static db::StoreWriter writer;
  return writer;
}

std::string EnvironmentValue(const char* name) {
  const char* value = std::getenv(name);
  return value == nullptr ? std::string() : std::string(value);
}

// The folder path announced by CreateNextDisabled, until the next creation.
std::optional<wxString>& NextDisabled() {
  static std::optional<wxString> path;
  return path;
}

// Mapping the fixed location walks the prefix's directories, which cost more
// than the rest of a call. The prefix may change between calls (tests switch
// it), so the mapping is kept per prefix, and only while the writer holds
// the store open: a store that is gone is looked for afresh, under whatever
// names its directories now have.

const db::StoreLocation& Location() {
  static std::string prefix, home;
  static db::StoreLocation location;
  std::string current_prefix = EnvironmentValue("WINEPREFIX");
  std::string current_home = EnvironmentValue("HOME");
  if (!Writer().IsOpen() || location.file.empty() || current_prefix != prefix ||
      current_home != home) {
    location = db::StoreLocation{StoreFolder(), StoreHostPath()};
    prefix = std::move(current_prefix);
    home = std::move(current_home);
  }
  return location;
}

// Why the last CreateHotFolder answered what it did.
db::CreateResult& LastCreation() {
  static db::CreateResult result = db::CreateResult::kFailed;
  return result;
}

}  // namespace

// The tool asks for the store just before it hands over a folder whose legacy
// settings are already retired. Opening and checking the database here keeps
// that hand-over down to its own transaction; a database that does not exist
// yet is left for CreateHotFolder to make.
RODuriZudaze& RODuriZudaze::GetInstance() {
  static RODuriZudaze store;
  try {
    Writer().OpenExisting(Location());
  } catch (...) {
  }
  return store;
}

// Nothing may escape into the tool: an exception (out of memory, a string
// conversion) is a failure like any other.
long RODuriZudaze::CreateHotFolder(db::Setting& setting, db::FolderConfiguration& folder,
                                   db::JobConfiguration& job, db::FilterConfiguration& filter,
                                   db::ImposeConfiguration& impose,
                                   db::PreflightConfiguration& preflight) {
  std::optional<wxString> disabled;
  disabled.swap(NextDisabled());
  LastCreation() = db::CreateResult::kFailed;
  try {
    db::HotFolderRecords records{setting, folder, job, filter, impose, preflight};
    const bool enabled = !disabled || *disabled != setting.FolderPath;
    LastCreation() = Writer().Create(Location(), records, enabled);
    return LastCreation() == db::CreateResult::kCreated ? 1 : 0;
  } catch (...) {
    LastCreation() = db::CreateResult::kFailed;
    return 0;
  }
}

bool RODuriZudaze::RefusedAsRegistered() const {
  return LastCreation() == db::CreateResult::kAlreadyRegistered;
}

void RODuriZudaze::CreateNextDisabled(const wxString& folderPath) {
  try {
    NextDisabled() = folderPath;
  } catch (...) {
    NextDisabled().reset();  // the folder is then created enabled and disabled after
  }
}

RODuriZudaze::Registration RODuriZudaze::FindHotFolder(const wxString& folderPath) {
  try {
    switch (Writer().Find(Location(), folderPath)) {
      case db::Registration::kRegistered:
        return Registration::kRegistered;
      case db::Registration::kNotRegistered:
        return Registration::kNotRegistered;
      case db::Registration::kUnknown:
        break;
    }
  } catch (...) {
  }
  return Registration::kUnknown;
}

bool RODuriZudaze::DisableHotFolder(const wxString& folderPath) {
  try {
    return Writer().Disable(Location(), folderPath);
  } catch (...) {
    return false;
  }
}

void RODuriZudaze::Close() {
  Writer().Close();
}
