// Where the hot-folder server runs and what the server host is called.
#ifndef HF_CONVERT_SERVER_LOOKUP_H_
#define HF_CONVERT_SERVER_LOOKUP_H_

#include <wx/string.h>

// Resolves a server address to a short host name. On true `name` holds it;
// on false `name` is unchanged.
bool ResolveServerName(const wxString& address, wxString& name);

// Overwrites `directory` with the directory of the running "hotfolder.exe"
// (no trailing separator); leaves it as it was when no server is found.
void FindServerDirectory(wxString& directory);

#endif  // HF_CONVERT_SERVER_LOOKUP_H_
