#include "platform/platform.h"

namespace platform {

HostPath ToHostPath(const std::wstring&) { return HostPath(); }
std::wstring FromHostPath(const HostPath&) { return std::wstring(); }
std::wstring CommonAppDataFolder() { return L"C:\\ProgramData"; }
bool RemoveFileSpec(std::wstring*) { return false; }
bool FileExists(const std::wstring&) { return false; }
bool DirectoryExists(const std::wstring&) { return false; }
bool CreateDirectories(const std::wstring&) { return false; }
bool GetFileAttributes(const std::wstring&, std::uint32_t*) { return false; }
bool SetFileAttributes(const std::wstring&, std::uint32_t) { return false; }
bool MoveDirectory(const std::wstring&, const std::wstring&) { return false; }
bool NamedMutexExists(const std::wstring&) { return false; }
bool HoldNamedMutex(const std::wstring&) { return false; }
bool LaunchDetached(const std::wstring&) { return false; }
bool EnumerateProcesses(std::vector<ProcessId>*) { return false; }
bool QueryProcessModule(ProcessId, std::wstring*, std::wstring*) { return false; }
bool TerminateProcess(ProcessId) { return false; }
bool HklmKeyOpensForRead(const std::wstring&) { return false; }
bool StartSockets() { return false; }
bool LocalHostName(std::string*) { return false; }
bool HostByName(const std::string&, std::string*) { return false; }
bool HostByIPv4Address(const std::string&, std::string*) { return false; }

}  // namespace platform
