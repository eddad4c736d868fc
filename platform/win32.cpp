// The platform layer on Windows: every service is the Win32 call the system
// was built around, so paths need no mapping and names are passed through as
// they are. Each handle this file opens is closed before the call returns,
// except the one mutex a process asks to hold for its whole life.
#include "platform/move_seam.h"
#include "platform/platform.h"

// winsock2.h must come before windows.h, which would pull in the old winsock.
#include <winsock2.h>

#include <windows.h>

#include <aclapi.h>
#include <knownfolders.h>
#include <psapi.h>
#include <sddl.h>
#include <shlobj.h>
#include <shlwapi.h>

#include <algorithm>
#include <climits>
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

// ---- Text -------------------------------------------------------------------

// Strict: a byte sequence the code page has no character for is refused,
// never replaced, so a path is either the one written or none.
bool DecodeAnsiText(const std::string& bytes, std::wstring* text) {
  if (text == nullptr || bytes.size() > INT_MAX) return false;
  if (bytes.empty()) {
    text->clear();
    return true;
  }
  const int size = static_cast<int>(bytes.size());
  const int length =
      MultiByteToWideChar(CP_ACP, MB_ERR_INVALID_CHARS, bytes.data(), size, nullptr, 0);
  if (length <= 0) return false;
  std::wstring decoded(static_cast<std::size_t>(length), L'\0');
  if (MultiByteToWideChar(CP_ACP, MB_ERR_INVALID_CHARS, bytes.data(), size, &decoded[0], length) !=
      length) {
    return false;
  }
  text->swap(decoded);
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

// Another process holding a handle inside the directory (the service, an
// Explorer window, a backup agent, a virus scanner) makes the move fail for
// as long as it holds it; every other error stays.
MoveOutcome MoveDirectory(const std::wstring& from, const std::wstring& to) {
  MoveOutcome refused;
  if (TakeFailedMove(&refused)) return refused;
  if (HasNul(from) || HasNul(to)) return MoveOutcome::kFailed;
  // Without MOVEFILE_REPLACE_EXISTING an existing target makes the move fail.
  if (MoveFileW(ToLongHostPath(from).c_str(), ToLongHostPath(to).c_str())) {
    return MoveOutcome::kMoved;
  }
  switch (GetLastError()) {
    case ERROR_SHARING_VIOLATION:
    case ERROR_LOCK_VIOLATION:
    case ERROR_ACCESS_DENIED:
      return MoveOutcome::kBusy;
    default:
      return MoveOutcome::kFailed;
  }
}

bool ReplaceFileDurably(const std::wstring& windows_path, const std::string& bytes) {
  if (HasNul(windows_path)) return false;
  // A stale entry under the temporary name goes first (DeleteFileW removes a
  // link itself). CREATE_NEW fails on any entry left, and with
  // FILE_FLAG_OPEN_REPARSE_POINT a link there counts as that entry instead
  // of being followed: no byte goes through someone else's link.
  const std::wstring target = ToLongHostPath(windows_path);
  const std::wstring temporary = target + L".new";
  DeleteFileW(temporary.c_str());
  bool written = false;
  {
    ScopedHandle file(
        FileHandle(CreateFileW(temporary.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW,
                               FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT, nullptr)));
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
  // Write-through: the call returns once the new name is on the disk. A
  // link under the final name is replaced as an entry, not followed.
  if (!written || !MoveFileExW(temporary.c_str(), target.c_str(),
                               MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH)) {
    DeleteFileW(temporary.c_str());
    return false;
  }
  return true;
}

FileRead ReadRegularFile(const std::wstring& windows_path, std::size_t max_bytes,
                         std::string* bytes, Links links) {
  bytes->clear();
  const std::wstring path = ToLongHostPath(windows_path);
  if (path.empty()) return FileRead::kMissing;
  // Opened as itself if it is a link and links are refused; without backup
  // semantics a directory does not open at all.
  const DWORD flags = links == Links::kFollowed ? 0 : FILE_FLAG_OPEN_REPARSE_POINT;
  ScopedHandle file(FileHandle(CreateFileW(path.c_str(), GENERIC_READ,
                                           FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                           nullptr, OPEN_EXISTING, flags, nullptr)));
  if (file.get() == nullptr) {
    const DWORD error = GetLastError();
    if (error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND) return FileRead::kMissing;
    const DWORD attributes = GetFileAttributesW(path.c_str());
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY)
               ? FileRead::kNotAFile
               : FileRead::kFailed;
  }
  BY_HANDLE_FILE_INFORMATION info;
  if (!GetFileInformationByHandle(file.get(), &info)) return FileRead::kFailed;
  // A file reached through a link may itself be a reparse point of another
  // kind (a deduplicated or cloud file), which reads as any other file.
  const DWORD refused = links == Links::kFollowed
                            ? FILE_ATTRIBUTE_DIRECTORY
                            : FILE_ATTRIBUTE_REPARSE_POINT | FILE_ATTRIBUTE_DIRECTORY;
  if (GetFileType(file.get()) != FILE_TYPE_DISK || (info.dwFileAttributes & refused) != 0) {
    return FileRead::kNotAFile;
  }
  char buffer[1 << 16];
  for (;;) {
    DWORD n = 0;
    if (!ReadFile(file.get(), buffer, sizeof buffer, &n, nullptr) ||
        bytes->size() + n > max_bytes) {
      bytes->clear();
      return FileRead::kFailed;
    }
    if (n == 0) return FileRead::kRead;
    bytes->append(buffer, n);
  }
}

bool IsLink(const HostPath& host_path) {
  if (host_path.empty() || HasNul(host_path)) return false;
  const DWORD attributes = GetFileAttributesW(ToLongHostPath(host_path).c_str());
  return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_REPARSE_POINT);
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

// ---- Folders of an elevated program -------------------------------------------

namespace {

// Administrators and SYSTEM: full control; Users: read and traverse. "P"
// keeps out what the folder above would pass on (under C:\ProgramData, the
// right of every user to create entries); the entries are inherited by
// everything made inside, the store's files and the run record included.
constexpr wchar_t kOwnFolderAccess[] = L"D:P(A;OICI;FA;;;BA)(A;OICI;FA;;;SY)(A;OICI;0x1200a9;;;BU)";

// The running user's SID, read from the process token.
std::vector<unsigned char> CurrentUserSid() {
  HANDLE raw = nullptr;
  if (!OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY, &raw)) return {};
  ScopedHandle token(raw);
  DWORD size = 0;
  GetTokenInformation(token.get(), TokenUser, nullptr, 0, &size);
  std::vector<unsigned char> buffer(size);
  if (size == 0 || !GetTokenInformation(token.get(), TokenUser, buffer.data(), size, &size)) {
    return {};
  }
  const PSID sid = reinterpret_cast<TOKEN_USER*>(buffer.data())->User.Sid;
  const unsigned char* begin = static_cast<const unsigned char*>(sid);
  return std::vector<unsigned char>(begin, begin + GetLengthSid(sid));
}

// Whether an administrator, SYSTEM or the running user owns the entry
// itself: a link is opened as the link, not as what it names.
bool OwnerTrusted(const std::wstring& path, const std::vector<unsigned char>& user) {
  ScopedHandle entry(FileHandle(CreateFileW(
      path.c_str(), READ_CONTROL, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
      OPEN_EXISTING, FILE_FLAG_OPEN_REPARSE_POINT | FILE_FLAG_BACKUP_SEMANTICS, nullptr)));
  if (entry.get() == nullptr) return false;
  PSID owner = nullptr;
  PSECURITY_DESCRIPTOR descriptor = nullptr;
  if (GetSecurityInfo(entry.get(), SE_FILE_OBJECT, OWNER_SECURITY_INFORMATION, &owner, nullptr,
                      nullptr, nullptr, &descriptor) != ERROR_SUCCESS) {
    return false;
  }
  const bool trusted =
      owner != nullptr && IsValidSid(owner) &&
      (IsWellKnownSid(owner, WinBuiltinAdministratorsSid) ||
       IsWellKnownSid(owner, WinLocalSystemSid) ||
       (!user.empty() && EqualSid(owner, const_cast<unsigned char*>(user.data()))));
  LocalFree(descriptor);
  return trusted;
}

bool CreateOwnDirectory(const std::wstring& path) {
  PSECURITY_DESCRIPTOR descriptor = nullptr;
  if (!ConvertStringSecurityDescriptorToSecurityDescriptorW(kOwnFolderAccess, SDDL_REVISION_1,
                                                            &descriptor, nullptr)) {
    return false;
  }
  SECURITY_ATTRIBUTES attributes = {sizeof(attributes), descriptor, FALSE};
  const bool created = CreateDirectoryW(path.c_str(), &attributes) != 0;
  LocalFree(descriptor);
  return created;
}

// Each directory from below the drive or share to the end of `path`, in
// turn; the drive or share itself is never made.
TrustedFolder Walk(const std::wstring& path, bool create) {
  const std::size_t root = RootLength(path);
  if (path.empty() || HasNul(path) || root == 0) return {FolderTrust::kFailed, path};
  const std::vector<unsigned char> user = CurrentUserSid();
  for (std::size_t end = root; end <= path.size(); ++end) {
    if (end < path.size() && !IsSeparator(path[end])) continue;
    if (end == root || IsSeparator(path[end - 1])) continue;  // no component ends here
    const std::wstring part = path.substr(0, end);
    const std::wstring long_part = ToLongHostPath(part);
    DWORD attributes = GetFileAttributesW(long_part.c_str());
    if (attributes == INVALID_FILE_ATTRIBUTES) {
      const DWORD error = GetLastError();
      if (error != ERROR_FILE_NOT_FOUND && error != ERROR_PATH_NOT_FOUND) {
        return {FolderTrust::kFailed, part};
      }
      if (!create) return {FolderTrust::kMissing, part};
      // Someone making it first is looked at like any existing entry.
      CreateOwnDirectory(long_part);
      attributes = GetFileAttributesW(long_part.c_str());
      if (attributes == INVALID_FILE_ATTRIBUTES) return {FolderTrust::kFailed, part};
    }
    if (attributes & FILE_ATTRIBUTE_REPARSE_POINT) {
      if (!OwnerTrusted(long_part, user)) return {FolderTrust::kForeignLink, part};
    } else if (!(attributes & FILE_ATTRIBUTE_DIRECTORY)) {
      return {FolderTrust::kNotADirectory, part};
    }
  }
  return {FolderTrust::kTrusted, path};
}

}  // namespace

TrustedFolder OpenTrustedFolder(const std::wstring& windows_path, bool create) {
  return Walk(windows_path, create);
}

TrustedFolder CheckTrustedHostFolder(const HostPath& host_path) {
  // A relative path counts from the current directory.
  const std::wstring full = HasNul(host_path) ? std::wstring() : FullPath(host_path);
  if (full.empty()) return {FolderTrust::kFailed, host_path};
  return Walk(full, /*create=*/false);
}

// ---- Named mutex ------------------------------------------------------------

// A mutex that refuses the access asked for exists all the same: its holder
// runs elevated or as another user. A service's server holds its mutex in
// the global namespace, which a name without a namespace does not reach from
// a user's session.
bool NamedMutexExists(const std::wstring& name) {
  // An empty name would open nothing named; it is no mutex.
  if (name.empty() || HasNul(name)) return false;
  const auto exists = [](const std::wstring& full_name) {
    ScopedHandle mutex(OpenMutexW(kMutexAllAccess, FALSE, full_name.c_str()));
    return mutex.get() != nullptr || GetLastError() == ERROR_ACCESS_DENIED;
  };
  if (exists(name)) return true;
  const bool has_namespace =
      _wcsnicmp(name.c_str(), L"Global\\", 7) == 0 || _wcsnicmp(name.c_str(), L"Local\\", 6) == 0;
  return !has_namespace && exists(L"Global\\" + name);
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

bool EnumerateProcesses(std::vector<ProcessId>* ids, std::size_t limit) {
  if (ids == nullptr) return false;
  // The system does not say how many there are: a table it fills may mean
  // that more did not fit, so a larger one is tried up to the limit.
  std::vector<DWORD> table(std::min(limit, kMaxProcesses), 0);
  DWORD bytes = 0;
  for (;;) {
    if (!K32EnumProcesses(table.data(), static_cast<DWORD>(table.size() * sizeof(DWORD)), &bytes)) {
      return false;
    }
    if (bytes < table.size() * sizeof(DWORD) || table.size() >= limit) break;
    table.assign(std::min(limit, table.size() * 2), 0);
  }
  const std::size_t count = std::min<std::size_t>(bytes / sizeof(DWORD), table.size());
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
