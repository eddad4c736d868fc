#include "store/store.h"

#include "store/store_reader.h"
#include "store/store_writer.h"

namespace {

// The header gives the store object no members; its one connection lives
// here, for the life of the process.
db::StoreWriter& Writer() {
  static db::StoreWriter writer;
  return writer;
}

// Looked up on every call: the prefix that maps the fixed location may
// change between calls (tests switch it), and the writer reopens then.
db::StoreLocation Location() {
  return db::StoreLocation{StoreFolder(), StoreHostPath()};
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
  try {
    db::HotFolderRecords records{setting, folder, job, filter, impose, preflight};
    return Writer().Create(Location(), records) == db::CreateResult::kCreated ? 1 : 0;
  } catch (...) {
    return 0;
  }
}

bool RODuriZudaze::DisableHotFolder(const wxString& folderPath) {
  try {
    return Writer().Disable(Location(), folderPath);
  } catch (...) {
    return false;
  }
}
