#include "store/store.h"

RODuriZudaze& RODuriZudaze::GetInstance() {
  static RODuriZudaze store;
  return store;
}

long RODuriZudaze::CreateHotFolder(db::Setting&, db::FolderConfiguration&, db::JobConfiguration&,
                                   db::FilterConfiguration&, db::ImposeConfiguration&,
                                   db::PreflightConfiguration&) {
  return 0;
}

bool RODuriZudaze::DisableHotFolder(const wxString&) { return false; }
