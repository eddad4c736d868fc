// The six records of one hot folder, handed to the real store; and the built
// hfstore.
#ifndef HF_TESTS_HOT_FOLDER_H_
#define HF_TESTS_HOT_FOLDER_H_

#include <string>
#include <vector>

#include "store/store.h"
#include "tests/run_program.h"

struct Folder : db::HotFolderRecordSet {
  explicit Folder(const wxString& path) { setting.FolderPath = folder.FolderPath = path; }
  long Create() {
    return RODuriZudaze::GetInstance().CreateHotFolder(setting, folder, job, filter, impose,
                                                       preflight);
  }
};

inline RunResult Hfstore(const std::vector<std::string>& args) {
  return RunProgram(BinDir() + "/hfstore", args);
}

#endif  // HF_TESTS_HOT_FOLDER_H_
