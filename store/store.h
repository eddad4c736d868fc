// RODuriZudaze: the configuration store of the hot-folder service.
//
// One SQLite database at C:\ProgramData\KYR\Dirorodiv\HotFolders.db (mapped
// through the platform layer), created with its folder on first use.
// CreateHotFolder stores the six records of one hot folder in one durable
// transaction; a FolderPath already registered is never overwritten. Every
// failure answers 0 or false; nothing is thrown into the caller.
//
// Beyond the service's calls the store offers the tool two of its own: a
// folder announced as disabled before its CreateHotFolder is stored
// disabled in that one transaction (the DisableHotFolder that follows then
// finds it so and answers true without a second commit), why the last
// creation was refused, and a question whether a folder path is
// registered, for finishing an interrupted run.
#ifndef HF_STORE_STORE_H_
#define HF_STORE_STORE_H_

#include <wx/string.h>

#include <optional>

#include "store/records.h"

class RODuriZudaze {
 public:
  static RODuriZudaze& GetInstance();

  long CreateHotFolder(db::Setting& setting, db::FolderConfiguration& folder,
                       db::JobConfiguration& job, db::FilterConfiguration& filter,
                       db::ImposeConfiguration& impose, db::PreflightConfiguration& preflight);

  bool DisableHotFolder(const wxString& folderPath);

  // The next CreateHotFolder, if it is of this folder path, stores the
  // folder disabled. Any CreateHotFolder forgets the announcement.
  void CreateNextDisabled(const wxString& folderPath);

  // Whether the last CreateHotFolder answered 0 because a hot folder of
  // that FolderPath is stored already: then that folder is in the store,
  // and nothing is wrong with it.
  bool RefusedAsRegistered() const;

  enum class Registration { kRegistered, kNotRegistered, kUnknown };
  // Whether a hot folder of that path is stored; kUnknown when the store
  // cannot be read. Creates nothing.
  Registration FindHotFolder(const wxString& folderPath);

  // Lets go of the store's connection, which is otherwise kept from one call
  // to the next; the next call opens the store afresh. For a process that
  // moves from one store to another: the tests and the fuzz target.
  void Close();

 private:
  RODuriZudaze() = default;
};

#endif  // HF_STORE_STORE_H_
