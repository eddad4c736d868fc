// Files on a POSIX host. Attribute bits other than DIRECTORY live in the
// "user.DOSATTRIB" extended attribute, in the hex-text form Wine writes, so a
// Wine program and this tool see the same attributes.
#include <errno.h>
#include <fcntl.h>
#include <stdio.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string>

#include "platform/move_seam.h"
#include "platform/platform.h"
#include "platform/posix_internal.h"

namespace platform {
namespace {

constexpr char kAttributeName[] = "user.DOSATTRIB";

bool StatWindowsPath(const std::wstring& windows_path, struct stat* st) {
  return posix::StatMappedPath(posix::MapWindowsPath(windows_path), st);
}

// Reads "0x<hex>" at the start of the attribute text. Anything else (such
// as a value some other program wrote in its own form) counts as no bits.
std::uint32_t ParseAttributeText(const char* text, size_t size) {
  const std::string value(text, size);
  if (value.size() < 3 || value[0] != '0' || (value[1] != 'x' && value[1] != 'X')) return 0;
  char* end = nullptr;
  errno = 0;
  const unsigned long long bits = std::strtoull(value.c_str() + 2, &end, 16);
  if (errno != 0 || end == value.c_str() + 2 || bits > 0xFFFFFFFFull) return 0;
  return static_cast<std::uint32_t>(bits);
}

bool IsNoAttribute(int error) {
  return error == ENODATA || error == ENOTSUP;
}

bool SyncHostDirectory(const std::string& dir) {
  const int fd = open(dir.empty() ? "." : dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (fd < 0) return false;
  const bool synced = fsync(fd) == 0;
  close(fd);
  return synced;
}

std::string HostParent(const std::string& host) {
  const std::string::size_type slash = host.rfind('/');
  if (slash == std::string::npos) return ".";
  return slash == 0 ? "/" : host.substr(0, slash);
}

bool WriteAll(int fd, const std::string& bytes) {
  std::size_t done = 0;
  while (done < bytes.size()) {
    const ssize_t n = write(fd, bytes.data() + done, bytes.size() - done);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) return false;
    done += static_cast<std::size_t>(n);
  }
  return true;
}

}  // namespace

bool FileExists(const std::wstring& windows_path) {
  // Only a regular file: a FIFO or device under that name would block or
  // misbehave when a caller goes on to read it.
  struct stat st;
  return StatWindowsPath(windows_path, &st) && S_ISREG(st.st_mode);
}

bool DirectoryExists(const std::wstring& windows_path) {
  struct stat st;
  return StatWindowsPath(windows_path, &st) && S_ISDIR(st.st_mode);
}

bool CreateDirectories(const std::wstring& windows_path) {
  const posix::MappedPath mapped = posix::MapWindowsPath(windows_path);
  if (!mapped.valid) return false;
  // The drive or share must exist already: creating a path never creates a
  // drive, as on Windows.
  struct stat st;
  if (!mapped.root.empty() && (stat(mapped.root.c_str(), &st) != 0 || !S_ISDIR(st.st_mode))) {
    return false;
  }
  std::string dir = mapped.root;
  for (const std::string& part : mapped.parts) {
    dir += (dir.empty() ? "" : "/") + part;
    if (mkdir(dir.c_str(), 0777) == 0) continue;
    if (errno != EEXIST || stat(dir.c_str(), &st) != 0 || !S_ISDIR(st.st_mode)) return false;
  }
  return true;
}

bool GetFileAttributes(const std::wstring& windows_path, std::uint32_t* attributes) {
  const posix::MappedPath mapped = posix::MapWindowsPath(windows_path);
  struct stat st;
  if (attributes == nullptr || !posix::StatMappedPath(mapped, &st)) return false;
  const HostPath host = mapped.Join();
  char text[256];
  const ssize_t size = getxattr(host.c_str(), kAttributeName, text, sizeof text);
  std::uint32_t bits = 0;
  if (size >= 0) {
    bits = ParseAttributeText(text, static_cast<size_t>(size));
  } else if (errno != ERANGE && !IsNoAttribute(errno)) {
    return false;
  }
  bits &= ~kAttributeDirectory;
  if (S_ISDIR(st.st_mode)) bits |= kAttributeDirectory;
  *attributes = bits;
  return true;
}

bool SetFileAttributes(const std::wstring& windows_path, std::uint32_t attributes) {
  const HostPath host = ToHostPath(windows_path);
  struct stat st;
  if (host.empty() || stat(host.c_str(), &st) != 0) return false;
  const std::uint32_t bits = attributes & ~kAttributeDirectory;
  if (bits == 0) {
    // No bits and no attribute read the same; a file system without
    // extended attributes holds no bits already.
    return removexattr(host.c_str(), kAttributeName) == 0 || IsNoAttribute(errno);
  }
  char text[16];
  const int size = snprintf(text, sizeof text, "0x%x", static_cast<unsigned>(bits));
  return setxattr(host.c_str(), kAttributeName, text, static_cast<size_t>(size), 0) == 0;
}

namespace {

// Renames without ever replacing the target. kUnsupported when the file
// system cannot refuse by itself, and the caller must reserve the name.
enum class NoReplace { kDone, kFailed, kUnsupported };

NoReplace RenameNoReplace(const HostPath& source, const HostPath& target) {
  if (source.empty() || target.empty()) return NoReplace::kFailed;
  if (renameat2(AT_FDCWD, source.c_str(), AT_FDCWD, target.c_str(), RENAME_NOREPLACE) == 0) {
    return NoReplace::kDone;
  }
  return errno == EINVAL || errno == ENOSYS ? NoReplace::kUnsupported : NoReplace::kFailed;
}

}  // namespace

namespace {

MoveOutcome FailedMove(int error) {
  return error == EBUSY || error == EACCES || error == EPERM ? MoveOutcome::kBusy
                                                             : MoveOutcome::kFailed;
}

// HF_TEST_FAIL_MOVES, "<count> busy" or "<count> failed" and optionally
// the moves to let through first: refusals for a test of the built
// programs. Read once, before the first move.
void ReadMoveRefusals() {
  static const bool read = [] {
    const char* text = getenv("HF_TEST_FAIL_MOVES");
    char kind[8] = {};
    int count = 0, skip = 0;
    if (text != nullptr && sscanf(text, "%d %7s %d", &count, kind, &skip) >= 2) {
      const std::string name(kind);
      if (name == "busy" || name == "failed") {
        FailNextMoves(count, name == "busy" ? MoveOutcome::kBusy : MoveOutcome::kFailed, skip);
      }
    }
    return true;
  }();
  (void)read;
}

}  // namespace

MoveOutcome MoveDirectory(const std::wstring& from, const std::wstring& to) {
  ReadMoveRefusals();
  MoveOutcome refused;
  if (TakeFailedMove(&refused)) return refused;
  const HostPath source = ToHostPath(from);
  const HostPath target = ToHostPath(to);
  const NoReplace moved = RenameNoReplace(source, target);
  if (moved == NoReplace::kDone) return MoveOutcome::kMoved;
  if (moved == NoReplace::kFailed) {
    return source.empty() || target.empty() ? MoveOutcome::kFailed : FailedMove(errno);
  }
  // The file system cannot refuse to replace by itself. Reserving the name
  // with mkdir is atomic, and rename replaces only that empty placeholder.
  struct stat st;
  if (stat(source.c_str(), &st) != 0 || !S_ISDIR(st.st_mode)) return MoveOutcome::kFailed;
  if (mkdir(target.c_str(), 0700) != 0) return FailedMove(errno);
  if (rename(source.c_str(), target.c_str()) == 0) return MoveOutcome::kMoved;
  const int error = errno;
  rmdir(target.c_str());
  return FailedMove(error);
}

bool ReplaceFileDurably(const std::wstring& windows_path, const std::string& bytes) {
  const HostPath host = ToHostPath(windows_path);
  if (host.empty()) return false;
  // Whatever is under the temporary name goes first; unlink removes a link
  // itself. The file is then made new (O_EXCL fails on any entry, a link
  // included), so no byte is written through someone else's link.
  const std::string temporary = host + ".new";
  if (unlink(temporary.c_str()) != 0 && errno != ENOENT) return false;
  const int fd =
      open(temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0644);
  if (fd < 0) return false;
  bool written = WriteAll(fd, bytes) && fsync(fd) == 0;
  written = close(fd) == 0 && written;
  // rename replaces an entry under the final name, a link included, without
  // following it.
  if (!written || rename(temporary.c_str(), host.c_str()) != 0) {
    unlink(temporary.c_str());
    return false;
  }
  return SyncHostDirectory(HostParent(host));
}

FileRead ReadRegularFile(const std::wstring& windows_path, std::size_t max_bytes,
                         std::string* bytes, Links links) {
  bytes->clear();
  const HostPath host = ToHostPath(windows_path);
  if (host.empty()) return FileRead::kMissing;
  // O_NONBLOCK: a FIFO under the name must not hold the read up.
  const int no_follow = links == Links::kFollowed ? 0 : O_NOFOLLOW;
  const int fd = open(host.c_str(), O_RDONLY | no_follow | O_NONBLOCK | O_CLOEXEC);
  if (fd < 0) {
    if (errno == ENOENT) return FileRead::kMissing;
    return errno == ELOOP ? FileRead::kNotAFile : FileRead::kFailed;
  }
  struct stat st;
  FileRead result = fstat(fd, &st) != 0   ? FileRead::kFailed
                    : S_ISREG(st.st_mode) ? FileRead::kRead
                                          : FileRead::kNotAFile;
  // Read straight into the result, sized from the file's own size: one byte
  // more than that shows the end at once, or that the file has grown.
  std::size_t size = 0;
  if (result == FileRead::kRead) {
    bytes->resize(std::min(static_cast<std::size_t>(st.st_size), max_bytes) + 1);
  }
  while (result == FileRead::kRead) {
    if (size == bytes->size()) bytes->resize(std::min(2 * size, max_bytes + 1));
    const ssize_t n = read(fd, &(*bytes)[size], bytes->size() - size);
    if (n < 0 && errno == EINTR) continue;
    if (n == 0) break;
    size += n < 0 ? 0 : static_cast<std::size_t>(n);
    if (n < 0 || size > max_bytes) result = FileRead::kFailed;
  }
  bytes->resize(size);
  close(fd);
  if (result != FileRead::kRead) bytes->clear();
  return result;
}

bool IsLink(const HostPath& host_path) {
  struct stat st;
  return !host_path.empty() && lstat(host_path.c_str(), &st) == 0 && S_ISLNK(st.st_mode);
}

bool RenameFile(const std::wstring& from, const std::wstring& to) {
  const HostPath source = ToHostPath(from);
  const HostPath target = ToHostPath(to);
  const NoReplace renamed = RenameNoReplace(source, target);
  if (renamed != NoReplace::kUnsupported) return renamed == NoReplace::kDone;
  // A second name refuses an existing target by itself; then the first goes.
  return link(source.c_str(), target.c_str()) == 0 && unlink(source.c_str()) == 0;
}

bool RemoveFile(const std::wstring& windows_path) {
  const HostPath host = ToHostPath(windows_path);
  struct stat st;
  if (host.empty()) return false;
  if (lstat(host.c_str(), &st) != 0) return errno == ENOENT;
  return S_ISREG(st.st_mode) && unlink(host.c_str()) == 0;
}

}  // namespace platform
