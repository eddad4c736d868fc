// Windows paths on a POSIX host: the Wine-style prefix mapping and the
// Windows path helpers. This is the only place where a Windows path turns
// into a host path.
#include <dirent.h>
#include <errno.h>
#include <limits.h>
#include <pwd.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string_view>

#include "platform/platform.h"
#include "platform/posix_internal.h"

namespace platform {
namespace posix {
namespace {

bool IsAsciiLetter(wchar_t c) {
  return (c >= L'a' && c <= L'z') || (c >= L'A' && c <= L'Z');
}

// Adds the components of `rest` (backslash-separated UTF-8) to `parts`. "."
// and empty components vanish; ".." removes the previous component but never
// one of the first `floor` (the share's server and name). A ".." at the root
// is dropped, as Windows does, so no path leaves its drive.
void AddComponents(std::string_view rest, size_t floor, std::vector<std::string>* parts) {
  size_t start = 0;
  while (start <= rest.size()) {
    size_t end = rest.find('\\', start);
    if (end == std::string_view::npos) end = rest.size();
    const std::string_view part = rest.substr(start, end - start);
    start = end + 1;
    if (part.empty() || part == ".") continue;
    if (part != "..") {
      parts->emplace_back(part);
    } else if (parts->size() > floor) {
      parts->pop_back();
    }
  }
}

// The entry of `dir` that `name` names: itself when it exists in that case,
// else the single entry that differs from it only in case. Empty when there
// is none (or more than one). `tried` says an lstat of the name in its own
// case has failed already.
std::string MatchEntry(const std::string& dir, const std::string& name, bool tried) {
  struct stat st;
  if (!tried && lstat((dir + "/" + name).c_str(), &st) == 0) return name;
  DIR* handle = opendir(dir.c_str());
  if (handle == nullptr) return std::string();
  const std::wstring wanted = Utf8ToWide(name);
  std::string match;
  int matches = 0;
  while (const dirent* entry = readdir(handle)) {
    if (EqualIgnoringCase(Utf8ToWide(entry->d_name), wanted)) {
      match = entry->d_name;
      ++matches;
    }
  }
  closedir(handle);
  return matches == 1 ? match : std::string();
}

// How many leading components exist exactly as written, as far as one or two
// lstat calls can tell: nearly every path the tool touches exists, or all of
// it but its last component does (a name about to be created). An lstat of
// such a path shows that each of those components matches itself, which is
// what the walk in ResolveParts finds with one lstat per component. The
// whole path's lstat is kept in `mapped`, so that callers need not ask again.
size_t ExactPrefix(const std::string& dir, const std::vector<std::string>& parts,
                   MappedPath* mapped) {
  if (parts.empty()) return 0;
  std::string path = dir;
  for (const std::string& part : parts) {
    path += '/';
    path += part;
  }
  if (lstat(path.c_str(), &mapped->status) == 0) {
    mapped->entry = MappedPath::Entry::kPresent;
    return parts.size();
  }
  if (parts.size() < 2) return 0;
  path.resize(path.size() - parts.back().size() - 1);
  struct stat st;
  return lstat(path.c_str(), &st) == 0 ? parts.size() - 1 : 0;
}

// Turns the components into host components below `root`, following the
// case of existing entries for as long as the path exists. Where the walk
// stops, nothing of that name exists in any case, so neither does the path.
void ResolveParts(std::vector<std::string> parts, MappedPath* mapped) {
  std::string dir = mapped->root.empty() ? "." : mapped->root;
  mapped->parts = std::move(parts);
  std::vector<std::string>& names = mapped->parts;
  const size_t exact = ExactPrefix(dir, names, mapped);
  for (size_t i = 0; i < exact; ++i) {
    dir += '/';
    dir += names[i];
  }
  for (size_t i = exact; i < names.size(); ++i) {
    // With all but the last component there, ExactPrefix has tried it.
    const bool tried = i == exact && exact + 1 == names.size();
    const std::string match = MatchEntry(dir, names[i], tried);
    if (match.empty()) {
      mapped->entry = MappedPath::Entry::kAbsent;
      break;  // the rest does not exist; it keeps its case
    }
    names[i] = match;
    dir += '/';
    dir += match;
  }
}

// Splits a host path into its directory and last component.
void SplitHostPath(const std::string& path, std::string* dir, std::string* name) {
  const size_t slash = path.find_last_of('/');
  *dir = slash == 0 ? "/" : path.substr(0, slash);
  *name = path.substr(slash + 1);
}

// The canonical absolute form of a host path that may not exist yet: the
// longest existing ancestor resolved, the rest appended as it is.
std::string CanonicalHostPath(const std::string& path) {
  std::string absolute = path;
  if (absolute.empty() || absolute[0] != '/') {
    char cwd[PATH_MAX];
    if (getcwd(cwd, sizeof cwd) == nullptr) return std::string();
    absolute = std::string(cwd) + "/" + absolute;
  }
  std::string suffix;
  for (;;) {
    if (char* resolved = realpath(absolute.c_str(), nullptr)) {
      std::string result = resolved;
      free(resolved);
      if (!suffix.empty()) result += (result == "/" ? "" : "/") + suffix;
      return result;
    }
    if (absolute == "/") return std::string();
    std::string dir, name;
    SplitHostPath(absolute, &dir, &name);
    suffix = suffix.empty() ? name : name + "/" + suffix;
    absolute = dir;
  }
}

// Whether `path` lies within the directory `dir` (both canonical).
bool IsWithin(const std::string& path, const std::string& dir) {
  if (dir == "/") return true;
  return path.compare(0, dir.size(), dir) == 0 &&
         (path.size() == dir.size() || path[dir.size()] == '/');
}

// The current directory as a Windows path ("D:\Jobs"); empty when it lies
// outside every drive of the prefix.
std::wstring CurrentWindowsDirectory() {
  char cwd[PATH_MAX];
  if (getcwd(cwd, sizeof cwd) == nullptr) return std::wstring();
  const std::wstring windows = FromHostPath(cwd);
  const bool on_drive =
      windows.size() >= 3 && IsAsciiLetter(windows[0]) && windows.compare(1, 2, L":\\") == 0;
  return on_drive ? windows : std::wstring();
}

}  // namespace

std::string MappedPath::Join() const {
  std::string path = root;
  for (const std::string& part : parts) {
    if (!path.empty()) path += '/';
    path += part;
  }
  return path.empty() ? "." : path;
}

std::string PrefixDirectory() {
  std::string prefix;
  if (const char* wineprefix = getenv("WINEPREFIX"); wineprefix != nullptr && *wineprefix) {
    prefix = wineprefix;
  } else if (const char* home = getenv("HOME"); home != nullptr && *home) {
    prefix = std::string(home) + "/.wine";
  } else if (const passwd* user = getpwuid(getuid()); user != nullptr && user->pw_dir) {
    prefix = std::string(user->pw_dir) + "/.wine";
  }
  while (prefix.size() > 1 && prefix.back() == '/') prefix.pop_back();
  return prefix;
}

MappedPath MapWindowsPath(const std::wstring& windows_path) {
  MappedPath mapped;
  // The Windows file API reads a path up to its first NUL.
  std::wstring path = windows_path.substr(0, windows_path.find(L'\0'));
  for (wchar_t& c : path) {
    if (c == L'/') c = L'\\';
  }
  if (path.empty()) return mapped;
  const std::string prefix = PrefixDirectory();
  std::vector<std::string> parts;
  if (path.compare(0, 2, L"\\\\") == 0) {
    // A share: its server and name are the root that ".." cannot leave.
    const size_t server_end = path.find(L'\\', 2);
    const size_t share_end =
        path.find(L'\\', server_end == std::wstring::npos ? path.size() : server_end + 1);
    if (server_end == std::wstring::npos) return mapped;
    const std::wstring server = path.substr(2, server_end - 2);
    const std::wstring share = path.substr(server_end + 1, share_end - server_end - 1);
    for (const std::wstring& name : {server, share}) {
      if (name.empty() || name == L"." || name == L"..") return mapped;
    }
    parts = {WideToUtf8(server), WideToUtf8(share)};
    if (share_end != std::wstring::npos) {
      AddComponents(WideToUtf8(path.substr(share_end + 1)), 2, &parts);
    }
    mapped.root = prefix + "/dosdevices/unc";
  } else if (path.size() >= 2 && IsAsciiLetter(path[0]) && path[1] == L':') {
    // "X:rest" has no current directory of its own here: it counts from X:\.
    AddComponents(WideToUtf8(path.substr(2)), 0, &parts);
    mapped.root = prefix + "/dosdevices/" + static_cast<char>(FoldCase(path[0])) + ":";
  } else if (path[0] == L'\\') {
    // Rooted on "the current drive": there is none to take it from.
    return mapped;
  } else {
    // Relative to the current directory, as on Windows: its Windows form
    // comes first. Outside every drive there is none, and the path names
    // nothing rather than a host file beyond the prefix's drives.
    const std::wstring current = CurrentWindowsDirectory();
    if (current.empty()) return mapped;
    return MapWindowsPath(current + L"\\" + path);
  }
  if (prefix.empty() && !mapped.root.empty()) return mapped;
  ResolveParts(std::move(parts), &mapped);
  mapped.valid = true;
  return mapped;
}

bool StatMappedPath(const MappedPath& mapped, struct stat* st) {
  if (!mapped.valid || mapped.entry == MappedPath::Entry::kAbsent) return false;
  if (mapped.entry == MappedPath::Entry::kPresent && !S_ISLNK(mapped.status.st_mode)) {
    *st = mapped.status;
    return true;
  }
  return stat(mapped.Join().c_str(), st) == 0;
}

bool CreateHostDirectories(const std::string& host_path) {
  for (size_t slash = host_path.find('/', 1);; slash = host_path.find('/', slash + 1)) {
    const std::string dir = host_path.substr(0, slash);
    if (!dir.empty() && mkdir(dir.c_str(), 0777) != 0 && errno != EEXIST) return false;
    if (slash == std::string::npos) break;
  }
  struct stat st;
  return stat(host_path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

}  // namespace posix

HostPath ToHostPath(const std::wstring& windows_path) {
  const posix::MappedPath mapped = posix::MapWindowsPath(windows_path);
  return mapped.valid ? mapped.Join() : HostPath();
}

// A POSIX host has no path length limit of the Windows kind.
HostPath ToLongHostPath(const std::wstring& windows_path) {
  return ToHostPath(windows_path);
}

std::wstring FromHostPath(const HostPath& host_path) {
  if (host_path.empty()) return std::wstring();
  const std::string path = posix::CanonicalHostPath(host_path);
  const std::string devices = posix::PrefixDirectory() + "/dosdevices";
  DIR* handle = path.empty() ? nullptr : opendir(devices.c_str());
  if (handle == nullptr) return posix::Utf8ToWide(host_path);
  std::string best_target;
  char best_letter = 0;
  while (const dirent* entry = readdir(handle)) {
    const std::string name = entry->d_name;
    if (name.size() != 2 || name[1] != ':' || !posix::IsAsciiLetter(name[0])) continue;
    const std::string target = posix::CanonicalHostPath(devices + "/" + name);
    if (target.empty() || !posix::IsWithin(path, target)) continue;
    if (best_letter == 0 || target.size() > best_target.size()) {
      best_target = target;
      best_letter = name[0];
    }
  }
  closedir(handle);
  if (best_letter == 0) return posix::Utf8ToWide(host_path);
  std::wstring windows;
  windows.push_back(posix::FoldCase(best_letter) - L'a' + L'A');
  windows += L":\\";
  std::string rest = path.substr(best_target == "/" ? 1 : best_target.size());
  if (!rest.empty() && rest[0] == '/') rest.erase(0, 1);
  for (wchar_t c : posix::Utf8ToWide(rest)) windows.push_back(c == L'/' ? L'\\' : c);
  return windows;
}

std::wstring CommonAppDataFolder() {
  return L"C:\\ProgramData";
}

bool RemoveFileSpec(std::wstring* path) {
  if (path == nullptr) return false;
  std::wstring& p = *path;
  // A host path that no drive holds keeps its host form (see FromHostPath);
  // its separator is the slash, and a colon is an ordinary character in it.
  const bool host_form = !p.empty() && p[0] == L'/';
  const wchar_t separator = host_form ? L'/' : L'\\';
  size_t i = 0;
  size_t cut = 0;  // where the last component begins
  // The root of "\name" or of a share "\\server\share" is not removed.
  if (i < p.size() && p[i] == separator) cut = ++i;
  if (i < p.size() && p[i] == separator) cut = ++i;
  for (; i < p.size() && p[i] != L'\0'; ++i) {
    if (p[i] == separator) {
      cut = i;
    } else if (p[i] == L':' && !host_form) {
      // A drive and its root separator stay: "C:\b.exe" gives "C:\".
      cut = i + 1;
      if (i + 1 < p.size() && p[i + 1] == separator) cut = ++i + 1;
    }
  }
  if (cut >= p.size() || p[cut] == L'\0') return false;
  p.erase(cut);
  return true;
}

}  // namespace platform
