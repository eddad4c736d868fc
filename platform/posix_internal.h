// Helpers shared by the POSIX implementation files of the platform layer.
// Nothing here is visible above the platform layer.
#ifndef HF_PLATFORM_POSIX_INTERNAL_H_
#define HF_PLATFORM_POSIX_INTERNAL_H_

#include <sys/stat.h>

#include <string>
#include <vector>

namespace platform {
namespace posix {

// Wide strings hold UTF-32 on POSIX hosts; host names are UTF-8 bytes. A code
// point that has no UTF-8 form becomes U+FFFD, as does an undecodable byte.
std::string WideToUtf8(const std::wstring& wide);
std::wstring Utf8ToWide(const std::string& bytes);

// Folds a character to lower case the way Windows compares names: ASCII,
// Latin-1, Latin Extended-A, Greek and Cyrillic letters. Others stay.
wchar_t FoldCase(wchar_t c);

// Whether two names are equal ignoring letter case.
bool EqualIgnoringCase(const std::wstring& a, const std::wstring& b);

// The Wine-style prefix directory: $WINEPREFIX, else $HOME/.wine, without a
// trailing slash. Empty when neither can be determined.
std::string PrefixDirectory();

// A Windows path placed on the host: the host directory of its drive or share
// and the components below it, each already
// matched to an existing entry where one differs only in case.
struct MappedPath {
  bool valid = false;
  std::string root;
  std::vector<std::string> parts;
  // What the mapping's own lookups showed of the whole path: present, with
  // its lstat in `status`; absent in any letter case; or not known (a
  // component matched in another case).
  enum class Entry { kUnknown, kPresent, kAbsent } entry = Entry::kUnknown;
  struct stat status = {};

  std::string Join() const;
};

// Maps a Windows path into the prefix. Not valid for a path that names no
// place (empty, rooted without a drive, a share without server or name,
// relative while the current directory lies outside every drive).
MappedPath MapWindowsPath(const std::wstring& windows_path);

// stat of a mapped path, answered from the mapping's lstat where that shows
// the same (the path is absent, or present and not a link).
bool StatMappedPath(const MappedPath& mapped, struct stat* st);

// The ANSI code page the prefix records for Windows programs ("ACP" in
// system.reg), read once per prefix; 0 when it records none.
unsigned PrefixAnsiCodePage();

// Creates a host directory and its missing parents (mode 0777 less umask).
bool CreateHostDirectories(const std::string& host_path);

}  // namespace posix
}  // namespace platform

#endif  // HF_PLATFORM_POSIX_INTERNAL_H_
