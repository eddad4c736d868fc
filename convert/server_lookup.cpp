#include "convert/server_lookup.h"

bool ResolveServerName(const wxString&, wxString&) { return false; }

void FindServerDirectory(wxString&) {}
