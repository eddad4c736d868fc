// What the migration tool needs of the operating system.
//
// Everything above this layer speaks Windows: paths are Windows paths
// ("D:\Jobs\Brochures"), names are wide strings. Only the implementation
// (posix.cpp or win32.cpp) turns a Windows path into a path of the host, at
// the moment the file system is touched.
//
// Every service answers failure as "no" (false, empty, not found) and never
// throws. The header holds no type of either host, so both implementations
// are written against the same declarations.
#ifndef HF_PLATFORM_PLATFORM_H_
#define HF_PLATFORM_PLATFORM_H_

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace platform {

// A path as the host's own file API takes it: UTF-16 on Windows, UTF-8
// bytes on POSIX hosts.
#ifdef _WIN32
using HostPath = std::wstring;
#else
using HostPath = std::string;
#endif

// ---- Paths ----------------------------------------------------------------

// Maps a Windows path to the host path that names the same file. On Windows
// this is the identity. On POSIX hosts drives live in the Wine-style prefix
// ($WINEPREFIX, else $HOME/.wine): "X:\rest" is "<prefix>/dosdevices/x:/rest",
// "\\server\share\rest" is "<prefix>/dosdevices/unc/server/share/rest", a
// relative path counts from the current directory's Windows form and names
// nothing (empty) when that lies outside every drive. "." and ".." are
// resolved in Windows form and never climb above the drive or share root. A
// component missing in its exact case is matched by a single directory entry
// that differs only in case.
HostPath ToHostPath(const std::wstring& windows_path);

// The form of a Windows path that the host's file API takes at any length.
// On Windows: the full path in extended-length form, "\\?\C:\..." or
// "\\?\UNC\server\share\...", which the wide file functions accept beyond
// MAX_PATH and which names the same file the plain path names (the system's
// own normalisation, "." and ".." and "/" included, is done first); a device
// path ("\\.\...") or an extended-length one stays as it is, and a path
// holding a NUL is empty. On POSIX hosts: ToHostPath. Every file service of
// this layer passes its paths through it, and a file opened above it should
// be too. ToHostPath keeps the plain form on Windows: the C runtime's stat,
// under std::filesystem, refuses a name that holds a '?'.
HostPath ToLongHostPath(const std::wstring& windows_path);

// The reverse: a host path shown as a Windows path, through the drive whose
// target holds it (longest match). A host path outside every drive keeps its
// host form.
std::wstring FromHostPath(const HostPath& host_path);

// The all-users application-data folder, as a Windows path
// ("C:\ProgramData").
std::wstring CommonAppDataFolder();

// Removes the last component and its separator, as PathRemoveFileSpecW does:
// "C:\a\b.exe" gives "C:\a", "C:\b.exe" gives "C:\". Answers whether
// anything was removed.
bool RemoveFileSpec(std::wstring* path);

// ---- Text -----------------------------------------------------------------

// Decodes narrow text that a program wrote through the Windows ANSI API (the
// legacy list's paths) in the host's ANSI code page: on Windows the
// machine's; on POSIX hosts the prefix's, as Wine records it in system.reg
// ("ACP" under System\CurrentControlSet\Control\Nls\CodePage):
// UTF-8 (65001) where it says so, else Windows-1252, which decodes every
// byte. False, leaving `text` as it was, for bytes the code page cannot
// decode.
bool DecodeAnsiText(const std::string& bytes, std::wstring* text);

// ---- Files ----------------------------------------------------------------

constexpr std::uint32_t kAttributeReadOnly = 0x1;
constexpr std::uint32_t kAttributeHidden = 0x2;
constexpr std::uint32_t kAttributeSystem = 0x4;
constexpr std::uint32_t kAttributeDirectory = 0x10;
constexpr std::uint32_t kAttributeArchive = 0x20;

// True when a regular file (not a directory) exists at the path.
bool FileExists(const std::wstring& windows_path);

// True when a directory exists at the path.
bool DirectoryExists(const std::wstring& windows_path);

// Creates the directory and its missing parents.
bool CreateDirectories(const std::wstring& windows_path);

// The file's attribute bits (kAttribute*). False when they cannot be read.
bool GetFileAttributes(const std::wstring& windows_path, std::uint32_t* attributes);

// Sets the attribute bits; DIRECTORY is derived from the file and ignored.
bool SetFileAttributes(const std::wstring& windows_path, std::uint32_t attributes);

// How a directory move ended. kBusy: the host refused it for now, as
// Windows does while another process holds a handle inside the directory
// (a sharing or lock violation, access denied; on POSIX hosts EBUSY, EACCES
// and EPERM); it may succeed when tried again. kFailed: any other failure.
enum class MoveOutcome { kMoved, kBusy, kFailed };

// Moves (renames) a directory. Fails, changing nothing, when the target
// exists: an existing directory is never replaced.
MoveOutcome MoveDirectory(const std::wstring& from, const std::wstring& to);

// For tests, on every host: after letting `skip` moves through, the next
// `count` calls of MoveDirectory answer `outcome` and touch nothing.
// Answers how many refusals an earlier call left unused, so
// FailNextMoves(0, ...) ends them and tells how many moves were tried. On
// POSIX hosts the environment variable HF_TEST_FAIL_MOVES ("<count> busy"
// or "<count> failed", then optionally the moves to skip), read at the
// first move, does the same for a built program. The Windows layer reads
// no such variable: a shipped tool cannot be steered into refusing moves.
int FailNextMoves(int count, MoveOutcome outcome, int skip = 0);

// Writes a file anew, durably: the bytes go to a file beside it ("<name>.new",
// created new, never through a link; a stale entry of that name is removed
// first), are flushed, and that file is renamed over the old one, so a reader
// or a crash finds the old file or the new one whole, never a part of either.
// A link under the file's own name is replaced, never followed.
bool ReplaceFileDurably(const std::wstring& windows_path, const std::string& bytes);

// Renames a regular file. Fails, changing nothing, when the target exists.
bool RenameFile(const std::wstring& from, const std::wstring& to);

// Removes a regular file. True when none is left under that name.
bool RemoveFile(const std::wstring& windows_path);

// Reads a whole regular file of at most `max_bytes`. A directory or anything
// else under the name is kNotAFile; so is a link, unless `links` says that it
// is followed to the file it names, as any program opening the file would.
enum class FileRead { kRead, kMissing, kNotAFile, kFailed };
enum class Links { kRefused, kFollowed };
FileRead ReadRegularFile(const std::wstring& windows_path, std::size_t max_bytes,
                         std::string* bytes, Links links = Links::kRefused);

// ---- Folders of an elevated program -----------------------------------------
//
// The tool may run elevated and keeps its files below the all-users folder,
// where ordinary users may be able to create entries. It writes nothing
// through a link it did not make: a link on the way to its folder is
// followed only when an administrator, SYSTEM or the running user owns it
// (on POSIX hosts: root or the running user).

enum class FolderTrust {
  kTrusted,        // a directory, reached through no link but trusted ones
  kMissing,        // it, or a directory on the way, does not exist
  kForeignLink,    // a link on the way is owned by someone else
  kNotADirectory,  // something other than a directory stands on the way
  kFailed,         // the file system did not answer
};

struct TrustedFolder {
  FolderTrust trust = FolderTrust::kFailed;
  // kTrusted: the directory as the host names it, on POSIX hosts with every
  // link resolved, so that files below it can be opened refusing any link.
  // Otherwise the entry that was refused or missing.
  HostPath path;
};

// Walks the directory named by a Windows path and every directory on the
// way to it. With `create`, missing directories below the drive are made,
// writable by administrators (POSIX: the owner) and readable by everyone,
// with nothing inherited from the folder above.
TrustedFolder OpenTrustedFolder(const std::wstring& windows_path, bool create);

// The same walk, creating nothing, for a directory named by a host path.
TrustedFolder CheckTrustedHostFolder(const HostPath& host_path);

// True when the entry is a link (a symbolic link, a junction or another
// reparse point), looked at without following it.
bool IsLink(const HostPath& host_path);

// ---- Named mutex ----------------------------------------------------------

// True while a named mutex of that name exists: one that opens with full
// access, one that exists but refuses that access (its holder runs with
// more rights), and on Windows one in the global namespace ("Global\" and
// the name: a service's) as well as one in this session's. The probe opens
// nothing for longer than the call.
bool NamedMutexExists(const std::wstring& name);

// Takes the named mutex for the rest of this process's life. False when
// another process holds it already.
bool HoldNamedMutex(const std::wstring& name);

// ---- Processes ------------------------------------------------------------

using ProcessId = std::uint32_t;

// At most this many processes are examined by one enumeration.
constexpr std::size_t kMaxProcesses = 1024;

// Starts a program by bare file name, found by the host's executable search,
// without waiting for it. Answers whether it was started.
bool LaunchDetached(const std::wstring& file_name);

// The identifiers of the running processes, at most `limit` of them, in the
// host's enumeration order. False when the enumeration fails.
constexpr std::size_t kAllProcesses = static_cast<std::size_t>(-1);
bool EnumerateProcesses(std::vector<ProcessId>* ids, std::size_t limit = kMaxProcesses);

// Module names are read as the Windows build reads them, into buffers of the
// classic path length: a name of more characters is cut to the first
// kModuleNameLength - 1, on every host alike.
constexpr std::size_t kModuleNameLength = 260;

// Opens the process (query, read and terminate rights) and reads its first
// module's base name and, when `file_name` is not null, the module's full
// file name (shown as a Windows path where a drive holds it), each cut as
// above. False when the process cannot be opened or its module cannot be
// queried.
bool QueryProcessModule(ProcessId id, std::wstring* base_name, std::wstring* file_name);

// Ends the process unconditionally with exit code 0.
bool TerminateProcess(ProcessId id);

// ---- Registry -------------------------------------------------------------

// True when the key (such as "SOFTWARE\Vendor\App") opens for reading under
// HKEY_LOCAL_MACHINE.
bool HklmKeyOpensForRead(const std::wstring& key);

// ---- Network --------------------------------------------------------------

// Starts the host's socket library where it needs starting.
bool StartSockets();

// The local host name, unshortened.
bool LocalHostName(std::string* name);

// The official name of a host looked up by name.
bool HostByName(const std::string& name, std::string* official_name);

// The official name of a host looked up in reverse by a dotted IPv4 address.
// False when the text is not an address (the all-ones "no address" value) or
// the lookup finds no entry.
bool HostByIPv4Address(const std::string& dotted, std::string* official_name);

}  // namespace platform

#endif  // HF_PLATFORM_PLATFORM_H_
