// The platform layer on Windows: every service is the Win32 call the system
// was built around, so paths need no mapping and names are passed through as
// they are. Each handle this file opens is closed before the call returns,
// except the one mutex a process asks to hold for its whole life.
#include "platform/platform.h"

// winsock2.h must come before windows.h, which would pull in the old winsock.
#include <winsock2.h>

#include <windows.h>

#include <knownfolders.h>
#include <psapi.h>
#include <shlobj.h>
#include <shlwapi.h>

#include <algorithm>
#include <mutex>
#include <set>

// windows.h turns these into macros for its A/W variants; the interface's own
// functions of the same name must keep their names.
#undef GetFileAttributes
#undef SetFileAttributes

namespace platform {
namespace {

// All access rights of a mutex object: the probe must see exactly the mutex
// the server holds, with the rights the tool would need to use it.
constexpr DWORD kMutexAllAccess = 0x1F0001;

// Query information (0x400) + read process memory (0x10) + terminate (0x1):
// reading another process's module list needs the first two, stopping the
// server the third.
constexpr DWORD kProcessRights = 0x411;

constexpr DWORD kNameLength = kModuleNameLength;

// Closes a handle when the scope ends, so that no early return leaks one.
class ScopedHandle {
 public:
  explicit ScopedHandle(HANDLE handle) : handle_(handle) {}
  ~ScopedHandle() {
    if (handle_ != nullptr) CloseHandle(handle_);
  }
  ScopedHandle(const ScopedHandle&) = delete;
  ScopedHandle& operator=(const ScopedHandle&) = delete;
  HANDLE get() const { return handle_; }

 private:
  HANDLE handle_;
};

// Names of system objects cannot hold a NUL: the system would stop reading at
// it and act on another, shorter name.
bool HasNul(const std::wstring& name) {
  return name.find(L'\0') != std::wstring::npos;
}

// CreateFileW answers INVALID_HANDLE_VALUE, not null, when it fails.
HANDLE FileHandle(HANDLE handle) {
  return handle == INVALID_HANDLE_VALUE ? nullptr : handle;
}

bool IsSeparator(wchar_t c) {
  return c == L'\\' || c == L'/';
}

// Length of the part of a path that names a root and cannot be created:
// "X:\", "\\server\share\" or the extended-length "\\?\X:\". Zero for a relative
// path.
std::size_t RootLength(const std::wstring& path) {
  if (path.size() >= 2 && path[1] == L':') {
    return path.size() >= 3 && IsSeparator(path[2]) ? 3 : 2;
  }
  if (path.size() >= 2 && IsSeparator(path[0]) && IsSeparator(path[1])) {
    std::size_t separators = 0;
    for (std::size_t i = 2; i < path.size(); ++i) {
      if (IsSeparator(path[i]) && ++separators == 2) return i + 1;
    }
    return path.size();
  }
  return IsSeparator(path.empty() ? L'x' : path[0]) ? 1 : 0;
}

// The system's full-path normalisation, at any length.
std::wstring FullPath(const std::wstring& path) {
  std::wstring full(MAX_PATH, L'\0');
  for (;;) {
    const DWORD length =
        GetFullPathNameW(path.c_str(), static_cast<DWORD>(full.size()), &full[0], nullptr);
    if (length == 0) return std::wstring();
    if (length < full.size()) {
      full.resize(length);
      return full;
    }
    full.resize(length);  // the size needed, its terminating NUL included
  }
}

}  // namespace

// ---- Paths ------------------------------------------------------------------

HostPath ToHostPath(const std::wstring& windows_path) {
  return windows_path;
}

// An extended-length path reaches the file system as written, so the full
// path is made first, by the same normalisation the plain path would get:
// both forms name the same file.
HostPath ToLongHostPath(const std::wstring& windows_path) {
  if (HasNul(windows_path)) return std::wstring();
  if (windows_path.compare(0, 4, L"\\\\?\\") == 0 || windows_path.compare(0, 4, L"\\\\.\\") == 0) {
    return windows_path;
  }
  if (windows_path.empty()) return windows_path;
  const std::wstring full = FullPath(windows_path);
  if (full.size() >= 3 && full[1] == L':' && full[2] == L'\\') return L"\\\\?\\" + full;
  if (full.compare(0, 2, L"\\\\") == 0 && full.compare(0, 4, L"\\\\.\\") != 0 &&
      full.compare(0, 4, L"\\\\?\\") != 0) {
    return L"\\\\?\\UNC\\" + full.substr(2);
  }
  return full.empty() ? windows_path : full;  // a device, or nothing the system could complete
}

std::wstring FromHostPath(const HostPath& host_path) {
  return host_path;
}

std::wstring CommonAppDataFolder() {
  PWSTR folder = nullptr;
  std::wstring result;
  if (SUCCEEDED(SHGetKnownFolderPath(FOLDERID_ProgramData, 0, nullptr, &folder))) {
    result = folder;
  }
  // The shell allocates the text even for some failures; it is ours to free.
  CoTaskMemFree(folder);
  return result;
}

bool RemoveFileSpec(std::wstring* path) {
  if (path == nullptr) return false;
  std::wstring buffer = *path;
  buffer.push_back(L'\0');
  if (!PathRemoveFileSpecW(&buffer[0])) return false;
  path->assign(buffer.c_str());
  return true;
}

// ---- Files ------------------------------------------------------------------

bool FileExists(const std::wstring& windows_path) {
  DWORD attributes = GetFileAttributesW(ToLongHostPath(windows_path).c_str());
  return attributes != INVALID_FILE_ATTRIBUTES && !(attributes & FILE_ATTRIBUTE_DIRECTORY);
}

bool DirectoryExists(const std::wstring& windows_path) {
  DWORD attributes = GetFileAttributesW(ToLongHostPath(windows_path).c_str());
  return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY);
}

bool CreateDirectories(const std::wstring& windows_path) {
  const std::wstring path = ToLongHostPath(windows_path);
  if (path.empty()) return false;
  // Each parent in turn; one that exists already, or a share's root that
  // cannot be made, answers an error that the final test makes irrelevant.
  for (std::size_t i = RootLength(path); i < path.size(); ++i) {
    if (IsSeparator(path[i])) CreateDirectoryW(path.substr(0, i).c_str(), nullptr);
  }
  CreateDirectoryW(path.c_str(), nullptr);
  return DirectoryExists(path);
}

// The bits come back as the OS reports them, those without a kAttribute*
// name included, so that writing them back after clearing one keeps the rest.
bool GetFileAttributes(const std::wstring& windows_path, std::uint32_t* attributes) {
  if (attributes == nullptr) return false;
  DWORD bits = GetFileAttributesW(ToLongHostPath(windows_path).c_str());
  if (bits == INVALID_FILE_ATTRIBUTES) return false;
  *attributes = bits;
  return true;
}

bool SetFileAttributes(const std::wstring& windows_path, std::uint32_t attributes) {
  const DWORD settable = attributes & ~static_cast<DWORD>(FILE_ATTRIBUTE_DIRECTORY);
  return SetFileAttributesW(ToLongHostPath(windows_path).c_str(), settable) != 0;
}

bool MoveDirectory(const std::wstring& from, const std::wstring& to) {
  // Without MOVEFILE_REPLACE_EXISTING an existing target makes the move fail.
  return MoveFileW(ToLongHostPath(from).c_str(), ToLongHostPath(to).c_str()) != 0;
}

// A directory opened for writing can be flushed: NTFS then writes its
// entries, a rename inside it included, to the disk.
bool SyncDirectory(const std::wstring& windows_path) {
  if (HasNul(windows_path)) return false;
  ScopedHandle directory(
      FileHandle(CreateFileW(ToLongHostPath(windows_path).c_str(), GENERIC_READ | GENERIC_WRITE,
                             FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                             OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr)));
  if (directory.get() == nullptr) return false;
  return FlushFileBuffers(directory.get()) != 0;
}

bool ReplaceFileDurably(const std::wstring& windows_path, const std::string& bytes) {
  if (HasNul(windows_path)) return false;
  const std::wstring target = ToLongHostPath(windows_path);
  const std::wstring temporary = target + L".new";
  bool written = false;
  {
    ScopedHandle file(FileHandle(CreateFileW(temporary.c_str(), GENERIC_WRITE, 0, nullptr,
                                             CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr)));
    if (file.get() == nullptr) return false;
    std::size_t done = 0;
    written = true;
    while (written && done < bytes.size()) {
      DWORD chunk = static_cast<DWORD>(std::min<std::size_t>(bytes.size() - done, 1 << 20));
      DWORD n = 0;
      written = WriteFile(file.get(), bytes.data() + done, chunk, &n, nullptr) != 0 && n > 0;
      done += n;
    }
    written = written && FlushFileBuffers(file.get()) != 0;
  }
  // Write-through: the call returns once the new name is on the disk.
  if (!written || !MoveFileExW(temporary.c_str(), target.c_str(),
                               MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH)) {
    DeleteFileW(temporary.c_str());
    return false;
  }
  return true;
}

bool RenameFile(const std::wstring& from, const std::wstring& to) {
  if (HasNul(from) || HasNul(to)) return false;
  return MoveFileExW(ToLongHostPath(from).c_str(), ToLongHostPath(to).c_str(),
                     MOVEFILE_WRITE_THROUGH) != 0;
}

bool RemoveFile(const std::wstring& windows_path) {
  if (HasNul(windows_path)) return false;
  if (DeleteFileW(ToLongHostPath(windows_path).c_str())) return true;
  const DWORD error = GetLastError();
  return error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND;
}

// ---- Named mutex ------------------------------------------------------------

bool NamedMutexExists(const std::wstring& name) {
  // An empty name would open nothing named; it is no mutex.
  if (name.empty() || HasNul(name)) return false;
  ScopedHandle mutex(OpenMutexW(kMutexAllAccess, FALSE, name.c_str()));
  return mutex.get() != nullptr;
}

bool HoldNamedMutex(const std::wstring& name) {
  // An empty name would create an unnamed mutex that no one else can see.
  if (name.empty() || HasNul(name)) return false;
  // Asking again for a mutex this process holds answers yes without a second
  // handle; the system could not tell that case from another holder.
  static std::mutex guard;
  static std::set<std::wstring> held;
  std::lock_guard<std::mutex> lock(guard);
  if (held.count(name) != 0) return true;
  HANDLE mutex = CreateMutexW(nullptr, TRUE, name.c_str());
  if (mutex == nullptr) return false;
  if (GetLastError() == ERROR_ALREADY_EXISTS) {
    CloseHandle(mutex);
    return false;
  }
  // Deliberately left open: the mutex exists exactly as long as this process,
  // and the system closes the handle when the process ends however it ends.
  held.insert(name);
  return true;
}

// ---- Processes --------------------------------------------------------------

bool LaunchDetached(const std::wstring& file_name) {
  // The name is quoted so that spaces stay part of it; a quote inside it could
  // only end the name early and run something else.
  // Like the file API, the search reads the name up to its first NUL.
  const std::wstring name = file_name.substr(0, file_name.find(L'\0'));
  if (name.empty() || name.find(L'"') != std::wstring::npos) return false;
  // CreateProcessW may write into the command line, so it gets its own copy.
  std::wstring command_line = L"\"" + name + L"\"";
  STARTUPINFOW startup = {};
  startup.cb = sizeof(startup);
  PROCESS_INFORMATION process = {};
  // No application name: the command line's first token is found by the
  // system's executable search, as a bare name typed at a prompt would be.
  if (!CreateProcessW(nullptr, &command_line[0], nullptr, nullptr, FALSE, CREATE_NO_WINDOW, nullptr,
                      nullptr, &startup, &process)) {
    return false;
  }
  CloseHandle(process.hThread);
  CloseHandle(process.hProcess);
  return true;
}

bool EnumerateProcesses(std::vector<ProcessId>* ids) {
  if (ids == nullptr) return false;
  std::vector<DWORD> table(kMaxProcesses, 0);
  DWORD bytes = 0;
  if (!K32EnumProcesses(table.data(), static_cast<DWORD>(table.size() * sizeof(DWORD)), &bytes)) {
    return false;
  }
  std::size_t count = bytes / sizeof(DWORD);
  if (count > kMaxProcesses) count = kMaxProcesses;
  ids->assign(table.begin(), table.begin() + count);
  return true;
}

bool QueryProcessModule(ProcessId id, std::wstring* base_name, std::wstring* file_name) {
  if (base_name == nullptr) return false;
  ScopedHandle process(OpenProcess(kProcessRights, FALSE, id));
  if (process.get() == nullptr) return false;
  // Room for one module: the first one listed is the executable.
  HMODULE module = nullptr;
  DWORD needed = 0;
  if (!K32EnumProcessModules(process.get(), &module, sizeof(module), &needed)) return false;
  // A fresh buffer per process: a failed read never yields a name left over
  // from the process before.
  wchar_t name[kNameLength] = {};
  DWORD length = K32GetModuleBaseNameW(process.get(), module, name, kNameLength);
  if (length == 0) return false;
  if (file_name != nullptr) {
    wchar_t path[kNameLength] = {};
    DWORD path_length = K32GetModuleFileNameExW(process.get(), module, path, kNameLength);
    if (path_length == 0) return false;
    // A cut name may be reported at the buffer's full size, with or without
    // its terminating NUL.
    file_name->assign(path, std::min<DWORD>(path_length, kNameLength - 1));
  }
  base_name->assign(name, length);
  return true;
}

bool TerminateProcess(ProcessId id) {
  ScopedHandle process(OpenProcess(kProcessRights, FALSE, id));
  if (process.get() == nullptr) return false;
  return ::TerminateProcess(process.get(), 0) != 0;
}

// ---- Registry ---------------------------------------------------------------

bool HklmKeyOpensForRead(const std::wstring& key) {
  if (HasNul(key)) return false;
  HKEY opened = nullptr;
  if (RegOpenKeyExW(HKEY_LOCAL_MACHINE, key.c_str(), 0, KEY_READ, &opened) != ERROR_SUCCESS) {
    return false;
  }
  RegCloseKey(opened);
  return true;
}

// ---- Network ----------------------------------------------------------------

bool StartSockets() {
  WSADATA data;
  return WSAStartup(MAKEWORD(2, 2), &data) == 0;
}

bool LocalHostName(std::string* name) {
  if (name == nullptr) return false;
  char buffer[128] = {};
  if (gethostname(buffer, sizeof(buffer)) != 0) return false;
  buffer[sizeof(buffer) - 1] = '\0';
  *name = buffer;
  return true;
}

bool HostByName(const std::string& name, std::string* official_name) {
  // A name with a NUL in it would be looked up as its first part only; an
  // empty one would answer for the local host instead of for no host.
  if (official_name == nullptr || name.empty() || name.find('\0') != std::string::npos) {
    return false;
  }
  const hostent* host = gethostbyname(name.c_str());
  if (host == nullptr || host->h_name == nullptr) return false;
  *official_name = host->h_name;
  return true;
}

bool HostByIPv4Address(const std::string& dotted, std::string* official_name) {
  if (official_name == nullptr || dotted.find('\0') != std::string::npos) return false;
  unsigned long address = inet_addr(dotted.c_str());
  if (address == INADDR_NONE) return false;
  const hostent* host = gethostbyaddr(reinterpret_cast<const char*>(&address), 4, AF_INET);
  if (host == nullptr || host->h_name == nullptr) return false;
  *official_name = host->h_name;
  return true;
}

}  // namespace platform
