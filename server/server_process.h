// The hot-folder server as the tool knows it: the executable it launches by
// bare name, the named mutex the running server holds, and the two scans of
// the process list that find it. The scans differ on purpose: stopping
// matches the module name in any letter case, locating the server's
// directory matches it exactly.
#ifndef HF_SERVER_SERVER_PROCESS_H_
#define HF_SERVER_SERVER_PROCESS_H_

#include <string>
#include <vector>

#include "platform/platform.h"

inline constexpr wchar_t kServerExecutable[] = L"hotfolder.exe";
inline constexpr wchar_t kServerMutex[] = L"KYR Dirorodiv - Server";

// Ends the first listed process that can be opened, whose module is named
// "hotfolder.exe" in any letter case and that is not one of
// `running_before`. It need not be the one this run launched (that one may
// hand over to another process), but it is never a server that ran before
// the launch, such as another session's. At most one process ends.
void StopServer(const std::vector<platform::ProcessId>& running_before);

// Overwrites `directory` with the directory (no trailing separator) of the
// first listed process whose module is named exactly "hotfolder.exe" and
// whose full module path can be read; leaves it as it was when there is none.
void FindServerDirectory(std::wstring* directory);

#endif  // HF_SERVER_SERVER_PROCESS_H_
