// Assembly of the store records of one hot folder and its registration.
#include "convert/registration.h"

#include <wx/intl.h>

#include "convert/filter_chain.h"
#include "convert/server_lookup.h"
#include "convert/settings_dir.h"
#include "engine/ascii_text.h"
#include "engine/migrator.h"
#include "store/store.h"

namespace {

// The queue word, from the legacy logical printer's name. The words pass
// through the translation lookup as the rest of the user-visible texts do.
wxString QueueWord(const wxString& logical_printer) {
  wxString printer = logical_printer.Upper();
  if (printer.Contains(wxGetTranslation(TableText("PRINT")))) {
    return wxGetTranslation(TableText("print"));
  }
  if (printer.Contains(wxGetTranslation(TableText("DIRECT")))) {
    return wxGetTranslation(TableText("direct"));
  }
  return wxGetTranslation(TableText("hold"));
}

// A migration can hold thousands of folders naming the same few servers;
// each address is asked once per run.
bool ResolveCached(CHFMigrator& engine, const wxString& address, wxString* name) {
  auto found = engine.m_ResolvedNames.find(address);
  if (found == engine.m_ResolvedNames.end()) {
    wxString resolved;
    bool ok = ResolveServerName(address, resolved);
    found = engine.m_ResolvedNames.emplace(address, std::make_pair(ok, resolved)).first;
  }
  if (!found->second.first) return false;
  *name = found->second.second;
  return true;
}

void FillServer(CHFMigrator& engine, db::Setting* setting) {
  setting->ServerAddr = engine.m_FolderSettings.GetOrInsert(TableKey("ServerAddr"));
  setting->ServerName = engine.m_FolderSettings.GetOrInsert(TableKey("ServerName"));
  wxString resolved;
  if (!ResolveCached(engine, setting->ServerAddr, &resolved)) return;
  setting->ServerName = resolved;
  if (setting->ServerAddr.empty()) setting->ServerAddr = resolved;
}

db::Setting MakeSetting(CHFMigrator& engine, const FolderPaths& paths, FilterChain& chain) {
  db::Setting setting;
  setting.Name = paths.name;
  setting.FolderPath = paths.full_path;
  setting.String1 = wxString();
  setting.Queue = QueueWord(engine.m_FolderSettings.GetOrInsert(TableKey("LogicalPrinter")));
  setting.Queue2 = setting.Queue;
  FillServer(engine, &setting);
  setting.Flag1 = true;
  setting.Flag2 = true;
  setting.Flag3 = true;
  setting.Flag4 = false;
  setting.String3 = L"10";
  setting.Filters = std::move(chain.entries);
  return setting;
}

// The store keeps the copies the driver knows as "num copies", whatever case
// the legacy key was written in. The first of two keys that meet stays.
db::JobConfiguration MakeJobConfiguration(const SettingsMap& driver_settings) {
  db::JobConfiguration job;
  for (const SettingsMap::Entry& entry : driver_settings) {
    const wxString& key =
        entry.first.IsSameAs(TableText("NumCopies"), false) ? TableText("num copies") : entry.first;
    job.emplace(key, db::JobSettingEntry{entry.first, entry.second, wxString()});
  }
  return job;
}

}  // namespace

void BuildFolderRecords(CHFMigrator& engine, FolderRecords* records) {
  // Every record is complete before the settings directory moves, so the
  // time in which the folder is neither legacy nor registered is only the
  // store's own call.
  FilterChain chain = BuildFilterChain(engine, &records->filter);
  // A copy: the lookups below may add keys to the map, moving its texts.
  const wxString folder_path = engine.m_FolderSettings.GetOrInsert(TableKey("HFFolderPath"));
  records->paths = MakeFolderPaths(folder_path);
  records->enabled = engine.m_CurrentEnabled;
  records->setting = MakeSetting(engine, records->paths, chain);
  records->folder.FolderPath = folder_path;
  records->folder.WorkFolder = records->paths.work;
  records->folder.FailedFolder = records->paths.failed;
  records->folder.MoveFolder = records->paths.move;
  records->job = MakeJobConfiguration(engine.m_DriverSettings);
  if (!engine.m_ImpositionProperties.Empty()) engine.ConvertImposeSettings(records->impose);
}

bool HandOverFolder(CHFMigrator& engine, FolderRecords& records,
                    const std::function<void()>& after_move, bool* moved_back) {
  *moved_back = false;
  db::Setting& setting = records.setting;
  // Asked for before the move: it opens the store then, so that after the
  // move only the store's own transaction remains.
  RODuriZudaze& store = RODuriZudaze::GetInstance();
  // A folder listed disabled is stored disabled by the creation itself, so
  // that neither the running server nor a crash ever finds it enabled; the
  // DisableHotFolder below then finds it so.
  if (!records.enabled) store.CreateNextDisabled(setting.FolderPath);
  Retirement retirement = RetireSettingsDirectory(records.paths);
  if (after_move) after_move();
  bool registered = store.CreateHotFolder(setting, records.folder, records.job, records.filter,
                                          records.impose, records.preflight) != 0;
  // A folder refused because its path is registered already is in the
  // store (an earlier run registered it while its move failed or was lost
  // in a power cut): its settings stay retired. Any other refusal created
  // nothing, so the legacy settings go back where a later run finds them.
  // That move back may fail, and it is not synced: the run keeps its record
  // either way, so that the next run puts them back if they lie retired.
  if (!registered && !store.RefusedAsRegistered() && retirement.moved) {
    RestoreSettingsDirectory(records.paths, retirement);
    engine.m_RunUndecided = true;
    *moved_back = true;
  }
  if (registered && !records.enabled) {
    registered = RODuriZudaze::GetInstance().DisableHotFolder(setting.FolderPath);
  }
  return registered;
}

bool CHFMigrator::RegisterHotFolder() {
  FolderRecords records;
  BuildFolderRecords(*this, &records);
  bool moved_back = false;
  return HandOverFolder(*this, records, nullptr, &moved_back);
}
