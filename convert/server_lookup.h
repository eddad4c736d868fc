// Where the hot-folder server runs and what the server host is called.
#ifndef HF_CONVERT_SERVER_LOOKUP_H_
#define HF_CONVERT_SERVER_LOOKUP_H_

#include <wx/string.h>

#include <optional>

// Resolves a server address to a short host name. On true `name` holds it;
// on false `name` is unchanged.
bool ResolveServerName(const wxString& address, wxString& name);

// The server directory (server/server_process.h), looked up once and then kept in `cache` for the
// rest of the run (the engine's m_ServerDirectory): the server does not move while the tool runs,
// and scanning every process once per folder would make a large migration slow. Empty when the
// server is not running.
const wxString& CachedServerDirectory(std::optional<wxString>& cache);

#endif  // HF_CONVERT_SERVER_LOOKUP_H_
