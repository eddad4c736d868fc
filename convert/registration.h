// Registration of one hot folder in two steps: its records are built from
// the engine's maps, then handed over (the settings directory retired and
// the records stored). CHFMigrator::RegisterHotFolder is the two in turn; the
// run's loop takes them apart so that the next folder can be read while the
// store commits this one.
#ifndef HF_CONVERT_REGISTRATION_H_
#define HF_CONVERT_REGISTRATION_H_

#include <functional>

#include "convert/settings_dir.h"
#include "engine/migrator.h"
#include "store/records.h"

// Everything the hand-over needs, so that it reads nothing of the engine's
// maps.
struct FolderRecords : db::HotFolderRecordSet {
  FolderPaths paths;
  bool enabled = true;
};

// Reads the engine's maps of the folder just read and converted.
void BuildFolderRecords(CHFMigrator& engine, FolderRecords* records);

// Retires the settings directory and stores the records; true when the
// folder is registered. `after_move` runs once the move is decided, before
// the store is asked. `*moved_back` tells whether a refusal put the settings
// directory back. Of the engine, only m_RunUndecided is touched.
bool HandOverFolder(CHFMigrator& engine, FolderRecords& records,
                    const std::function<void()>& after_move, bool* moved_back);

#endif  // HF_CONVERT_REGISTRATION_H_
