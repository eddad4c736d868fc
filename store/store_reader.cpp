#include "store/store_reader.h"

platform::HostPath StoreHostPath() {
  return platform::ToHostPath(platform::CommonAppDataFolder() + L"\\KYR\\Dirorodiv\\HotFolders.db");
}

bool ReadStore(const platform::HostPath&, std::vector<StoredHotFolder>*, wxString* error) {
  *error = "not built yet";
  return false;
}
