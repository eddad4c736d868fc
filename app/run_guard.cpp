// The run record around a migration run: an interrupted run is finished by
// the next one, and a "[_KYR_HotFolder_Old]" the tool did not create is
// never touched.
#include <vector>

#include "engine/migrator.h"
#include "convert/settings_dir.h"
#include "platform/platform.h"
#include "engine/run_record.h"
#include "store/store.h"

namespace {

// Whether the settings of a folder the interrupted run meant to retire lie
// retired and unregistered: then that run was killed between the move and
// the store's commit, and they go back where this run finds them. A folder
// the store cannot be asked about is kept in the record for a later run.
void FinishFolder(const RunRecordEntry& entry, std::vector<RunRecordEntry>* undecided) {
  if (!entry.retires) return;
  const FolderPaths paths = MakeFolderPaths(entry.folder);
  if (platform::DirectoryExists(paths.settings.ToStdWstring()) ||
      !platform::DirectoryExists(paths.retired.ToStdWstring())) {
    return;
  }
  switch (RODuriZudaze::GetInstance().FindHotFolder(paths.full_path)) {
    case RODuriZudaze::Registration::kRegistered:
      return;
    case RODuriZudaze::Registration::kNotRegistered:
      if (PutBackSettingsDirectory(paths)) return;
      break;
    case RODuriZudaze::Registration::kUnknown:
      break;
  }
  undecided->push_back(entry);
}

}  // namespace

void CHFMigrator::BeginRun() {
  std::vector<RunRecordEntry> entries;
  std::vector<RunRecordEntry> interrupted;
  switch (ReadRunRecord(&interrupted)) {
    case RunRecordState::kFound:
      for (const RunRecordEntry& entry : interrupted) FinishFolder(entry, &entries);
      break;
    case RunRecordState::kDamaged:
      // Not trusted: the run goes on as a first run would.
      SetAsideRunRecord();
      break;
    case RunRecordState::kNone:
      break;
  }
  // What the interrupted run left and this run could not finish.
  m_RunUndecided = !entries.empty();
  // Room for every folder at once: the record is the run's largest piece of
  // memory, and growing it step by step would hold two copies of it.
  entries.reserve(entries.size() + m_Folders.size());
  // The folders this run will retire: those the folder reader will find.
  // One that has a retired directory already keeps it, as the move fails.
  for (const wxString& folder : m_Folders) {
    if (folder.empty()) continue;  // a path the host could not decode names nothing
    if (!platform::FileExists(LegacyConfigPath(folder).ToStdWstring())) continue;
    const FolderPaths paths = MakeFolderPaths(folder);
    entries.push_back({folder, !platform::DirectoryExists(paths.retired.ToStdWstring())});
  }
  // The old record is replaced only now, once nothing of it is needed.
  // Without a record the run goes on as the tool always did.
  m_RunRecorded = entries.empty() ? RemoveRunRecord() : WriteRunRecord(entries);
}

// A record this run could not write may still hold what an earlier run
// left undecided, so only this run's own record is removed, and only when
// it names nothing undecided.
void CHFMigrator::EndRun() {
  if (m_RunRecorded && !m_RunUndecided) RemoveRunRecord();
  m_RunRecorded = false;
  m_RunUndecided = false;
}
