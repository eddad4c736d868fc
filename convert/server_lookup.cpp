#include "convert/server_lookup.h"

bool ResolveServerName(const wxString&, wxString&) { return false; }

void FindServerDirectory(wxString&) {}

const wxString& CachedServerDirectory(std::optional<wxString>& cache) {
  if (!cache) {
    cache.emplace();
    FindServerDirectory(*cache);
  }
  return *cache;
}
