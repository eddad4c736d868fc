// RODuriZudaze: the configuration store of the hot-folder service.
//
// One SQLite database at C:\ProgramData\KYR\Dirorodiv\HotFolders.db (mapped
// through the platform layer), created with its folder on first use.
// CreateHotFolder stores the six records of one hot folder in one durable
// transaction; a FolderPath already registered is never overwritten. Every
// failure answers 0 or false; nothing is thrown into the caller.
#ifndef HF_STORE_STORE_H_
#define HF_STORE_STORE_H_

#include "store/records.h"

class RODuriZudaze {
 public:
  static RODuriZudaze& GetInstance();

  long CreateHotFolder(db::Setting& setting, db::FolderConfiguration& folder,
                       db::JobConfiguration& job, db::FilterConfiguration& filter,
                       db::ImposeConfiguration& impose, db::PreflightConfiguration& preflight);

  bool DisableHotFolder(const wxString& folderPath);

 private:
  RODuriZudaze() = default;
};

#endif  // HF_STORE_STORE_H_
