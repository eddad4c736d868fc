// The run's order: the list file, then each listed folder read, converted
// and registered in turn.
#include "engine/migrator.h"
#include "legacy/folder_reader.h"

bool CHFMigrator::Run() {
  bool read = ReadLegacyList();
  BeginRun();
  MigrateFolders();
  EndRun();
  return read;
}

void CHFMigrator::MigrateFolders() {
  // One outcome per folder: room for all of them at once, rather than
  // copies of every outcome so far each time the list grows.
  m_Status.Alloc(m_Status.size() + m_Folders.size());
  for (std::size_t i = 0; i < m_Folders.size(); ++i) {
    if (m_UndecodedPaths.count(i) != 0) {
      m_Status.Add("Failed; Path not decodable");
      continue;
    }
    if (!ReadFolderConfiguration(*this, i)) {
      m_Status.Add("Failed; File missing");
      continue;
    }
    ConvertFilterSettings();
    m_Status.Add(RegisterHotFolder() ? "Success" : "Unknown error");
    ClearDriverAndImposeMaps();
  }
}
