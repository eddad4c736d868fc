// Folders of an elevated program on a POSIX host: the path is walked one
// component at a time, as the kernel would resolve it, and a symbolic link
// is followed only when root or the running user owns it. The result names
// the directory without any link, so that files opened below it with
// O_NOFOLLOW (or SQLite's no-follow open) cannot be redirected on the way.
#include <errno.h>
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include <deque>
#include <string>
#include <utility>

#include "platform/platform.h"
#include "platform/posix_internal.h"

namespace platform {
namespace {

// Linux gives up on a path after as many links.
constexpr int kMaxLinks = 40;

struct Component {
  std::string name;
  bool creatable;  // below the drive: the tool may make it
};

void AddComponents(const std::string& path, bool creatable, std::deque<Component>* pending,
                   bool at_front) {
  std::deque<Component> parts;
  for (std::size_t start = 0; start <= path.size();) {
    std::size_t slash = path.find('/', start);
    if (slash == std::string::npos) slash = path.size();
    if (slash > start) parts.push_back({path.substr(start, slash - start), creatable});
    start = slash + 1;
  }
  pending->insert(at_front ? pending->begin() : pending->end(), parts.begin(), parts.end());
}

std::string Absolute(const std::string& path) {
  if (!path.empty() && path[0] == '/') return path;
  char cwd[PATH_MAX];
  return getcwd(cwd, sizeof cwd) == nullptr ? std::string() : std::string(cwd) + "/" + path;
}

bool TrustedOwner(uid_t owner) {
  return owner == 0 || owner == geteuid();
}

TrustedFolder Walk(std::deque<Component> pending, bool create) {
  std::string current;  // resolved so far: no link in it
  int links = 0;
  while (!pending.empty()) {
    const Component part = std::move(pending.front());
    pending.pop_front();
    if (part.name == ".") continue;
    if (part.name == "..") {
      current.erase(current.empty() ? 0 : current.rfind('/'));
      continue;
    }
    const std::string next = current + "/" + part.name;
    struct stat st;
    if (lstat(next.c_str(), &st) != 0) {
      if (errno != ENOENT) return {FolderTrust::kFailed, next};
      if (!create || !part.creatable) return {FolderTrust::kMissing, next};
      // Owner full, everyone else read; someone making it first is looked
      // at like any existing entry.
      if ((mkdir(next.c_str(), 0755) != 0 && errno != EEXIST) || lstat(next.c_str(), &st) != 0) {
        return {FolderTrust::kFailed, next};
      }
    }
    if (S_ISLNK(st.st_mode)) {
      if (!TrustedOwner(st.st_uid)) return {FolderTrust::kForeignLink, next};
      std::string target(PATH_MAX, '\0');
      const ssize_t size = readlink(next.c_str(), &target[0], target.size());
      if (size <= 0 || static_cast<std::size_t>(size) >= target.size() || ++links > kMaxLinks) {
        return {FolderTrust::kFailed, next};
      }
      target.resize(static_cast<std::size_t>(size));
      if (target[0] == '/') current.clear();
      // What the link names is walked like the rest, its own links checked.
      AddComponents(target, false, &pending, /*at_front=*/true);
      continue;
    }
    if (!S_ISDIR(st.st_mode)) return {FolderTrust::kNotADirectory, next};
    current = next;
  }
  return {FolderTrust::kTrusted, current.empty() ? "/" : current};
}

}  // namespace

TrustedFolder OpenTrustedFolder(const std::wstring& windows_path, bool create) {
  const posix::MappedPath mapped = posix::MapWindowsPath(windows_path);
  const std::string root = mapped.valid ? Absolute(mapped.root) : std::string();
  if (root.empty()) return {FolderTrust::kMissing, HostPath()};
  // The drive is never made: only what lies below it.
  std::deque<Component> pending;
  AddComponents(root, false, &pending, /*at_front=*/false);
  for (const std::string& part : mapped.parts) pending.push_back({part, true});
  return Walk(std::move(pending), create);
}

TrustedFolder CheckTrustedHostFolder(const HostPath& host_path) {
  const std::string path = Absolute(host_path);
  if (path.empty()) return {FolderTrust::kFailed, host_path};
  std::deque<Component> pending;
  AddComponents(path, false, &pending, /*at_front=*/false);
  return Walk(std::move(pending), /*create=*/false);
}

}  // namespace platform
