// The hot-folder server as the tool knows it: the executable it launches by
// bare name, the named mutex the running server holds, and the two scans of
// the process list that find it. The scans differ on purpose: stopping
// matches the module name in any letter case, locating the server's
// directory matches it exactly.
#ifndef HF_SERVER_SERVER_PROCESS_H_
#define HF_SERVER_SERVER_PROCESS_H_

#include <string>

inline constexpr wchar_t kServerExecutable[] = L"hotfolder.exe";
inline constexpr wchar_t kServerMutex[] = L"KYR Dirorodiv - Server";

// Ends the first listed process that can be opened and whose module is named
// "hotfolder.exe" in any letter case. It need not be the one this run
// launched: the server is known by name only. At most one process ends.
void StopServer();

// Overwrites `directory` with the directory (no trailing separator) of the
// first listed process whose module is named exactly "hotfolder.exe" and
// whose full module path can be read; leaves it as it was when there is none.
void FindServerDirectory(std::wstring* directory);

#endif  // HF_SERVER_SERVER_PROCESS_H_
