// Reading the store back: for the hfstore inspector and for tests. Opens the
// database read-only and never creates or changes it.
#ifndef HF_STORE_STORE_READER_H_
#define HF_STORE_STORE_READER_H_

#include <wx/string.h>

#include <string>
#include <vector>

#include "platform/platform.h"
#include "store/records.h"

struct StoredHotFolder {
  bool enabled = true;
  db::Setting setting;
  db::FolderConfiguration folderConfiguration;
  db::JobConfiguration jobConfiguration;
  wxString filterConfiguration;  // XML text, "FilterSetting" as root element
  db::ImposeConfiguration imposeConfiguration;
  db::PreflightConfiguration preflightConfiguration;
};

// The folder of the store at its fixed location, as a Windows path.
std::wstring StoreFolder();

// The host path of the store at its fixed location.
platform::HostPath StoreHostPath();

// Every hot folder of the database file, in registration order. False, with
// a one-line reason in `error`, when the file is missing or unreadable.
bool ReadStore(const platform::HostPath& file, std::vector<StoredHotFolder>* folders,
               wxString* error);

#endif  // HF_STORE_STORE_READER_H_
