// The run's order: the list file, then each listed folder read, converted
// and registered in turn.
#include <cstddef>
#include <memory>

#include "app/worker.h"
#include "convert/registration.h"
#include "engine/migrator.h"
#include "legacy/folder_reader.h"

bool CHFMigrator::Run() {
  bool read = ReadLegacyList();
  BeginRun();
  MigrateFolders();
  EndRun();
  return read;
}

namespace {

// One folder read and converted: its records, or the outcome that ends it.
struct PreparedFolder {
  const char* outcome = nullptr;
  std::unique_ptr<FolderRecords> records;
};

// Writes nothing and asks nothing of the store: it reads the folder's
// folder.cfg (and what conversion looks up: the registry's templates, the
// server's name and directory) and builds the records in memory.
PreparedFolder PrepareFolder(CHFMigrator& engine, std::size_t index) {
  PreparedFolder prepared;
  if (engine.m_UndecodedPaths.count(index) != 0) {
    prepared.outcome = "Failed; Path not decodable";
  } else if (!ReadFolderConfiguration(engine, index)) {
    prepared.outcome = "Failed; File missing";
  } else {
    engine.ConvertFilterSettings();
    prepared.records = std::make_unique<FolderRecords>();
    BuildFolderRecords(engine, prepared.records.get());
    engine.ClearDriverAndImposeMaps();
  }
  return prepared;
}

}  // namespace

// Most of a folder's time is its commit, spent waiting for the disk. The
// next folder is read and converted meanwhile, on a second thread: it starts
// once this folder's settings directory has moved, so it sees every file as
// it would after this folder; and the engine's maps are the worker's alone
// until it is done. Moves and commits stay on this thread, one folder after
// the other, as before. Only a move back after a refusal changes files
// after the next folder was read, so that folder is then read again.
void CHFMigrator::MigrateFolders() {
  // One outcome per folder: room for all of them at once, rather than
  // copies of every outcome so far each time the list grows.
  m_Status.Alloc(m_Status.size() + m_Folders.size());
  if (m_Folders.empty()) return;
  Worker worker;
  // The records of a folder done with, freed by the worker, which made them.
  std::unique_ptr<FolderRecords> spent;
  PreparedFolder next = PrepareFolder(*this, 0);
  for (std::size_t i = 0; i < m_Folders.size(); ++i) {
    PreparedFolder current = std::move(next);
    next = PreparedFolder();
    const bool last = i + 1 == m_Folders.size();
    bool read_ahead = false;
    bool moved_back = false;
    if (current.records) {
      auto read_next = [&] {
        if (last) return;
        worker.Start([&] {
          spent.reset();
          next = PrepareFolder(*this, i + 1);
        });
        read_ahead = true;
      };
      bool registered = false;
      try {
        registered = HandOverFolder(*this, *current.records, read_next, &moved_back);
      } catch (...) {
        if (read_ahead) worker.Wait();
        throw;
      }
      if (read_ahead) worker.Wait();
      current.outcome = registered ? "Success" : "Unknown error";
      spent = std::move(current.records);
    }
    m_Status.Add(current.outcome);
    if (!last && (!read_ahead || moved_back)) next = PrepareFolder(*this, i + 1);
  }
}
