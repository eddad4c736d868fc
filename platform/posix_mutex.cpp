// Named mutexes on a POSIX host: one lock file per name under the prefix,
// "<prefix>/.mutex/<name>", held with an exclusive open-file-description
// lock (F_OFD_SETLK). The kernel drops the lock when the holder dies, however
// it dies.
//
// Our design notes name flock for this. Open-file-description locks are used
// instead because F_OFD_GETLK tests for a holder without taking the lock: a
// probe built on flock must take and release it, and for that moment a
// server starting up would find the mutex held and give up. Unlike classic
// fcntl locks, an OFD lock is also not lost when the holding process closes
// some other descriptor of the same file.
#include <errno.h>
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <mutex>

#include "platform/platform.h"
#include "platform/posix_internal.h"

namespace platform {
namespace {

// Mutex names may hold any character but a file name may not, so everything
// outside a plain set of bytes is written as %XX (a leading dot too, so no
// name becomes "." or ".." or a hidden file).
std::string SafeFileName(const std::wstring& name) {
  static const char kHex[] = "0123456789ABCDEF";
  std::string safe;
  for (unsigned char byte : posix::WideToUtf8(name)) {
    const bool plain = (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
                       (byte >= '0' && byte <= '9') || byte == ' ' || byte == '-' || byte == '_' ||
                       (byte == '.' && !safe.empty());
    if (plain) {
      safe.push_back(static_cast<char>(byte));
    } else {
      safe += {'%', kHex[byte >> 4], kHex[byte & 0xF]};
    }
  }
  return safe;
}

std::string LockDirectory() {
  return posix::PrefixDirectory() + "/.mutex";
}

// The lock file of a name; empty for a name no mutex can have.
std::string LockFile(const std::wstring& name) {
  if (name.empty() || name.find(L'\0') != std::wstring::npos) return std::string();
  const std::string prefix = posix::PrefixDirectory();
  return prefix.empty() ? std::string() : LockDirectory() + "/" + SafeFileName(name);
}

struct flock WholeFileWriteLock() {
  struct flock lock = {};
  lock.l_type = F_WRLCK;
  lock.l_whence = SEEK_SET;
  return lock;  // start 0, length 0: the whole file; pid 0 as OFD locks need
}

}  // namespace

bool NamedMutexExists(const std::wstring& name) {
  const std::string file = LockFile(name);
  if (file.empty()) return false;
  // A missing lock file is a mutex nobody holds; the probe creates nothing.
  // One the probe may not open belongs to a holder with other rights, and
  // counts as held, as a mutex that refuses access does on Windows.
  const int fd = open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW);
  if (fd < 0) return errno == EACCES;
  struct flock lock = WholeFileWriteLock();
  const bool held = fcntl(fd, F_OFD_GETLK, &lock) == 0 && lock.l_type != F_UNLCK;
  close(fd);
  return held;
}

bool HoldNamedMutex(const std::wstring& name) {
  const std::string file = LockFile(name);
  if (file.empty()) return false;
  // Taking a mutex this process holds already succeeds, as it does on
  // Windows; a second lock of our own would conflict with the first.
  static std::mutex guard;
  static std::vector<std::string> held;
  const std::lock_guard<std::mutex> lock_held(guard);
  if (std::find(held.begin(), held.end(), file) != held.end()) return true;
  if (!posix::CreateHostDirectories(LockDirectory())) return false;
  // Readable by all, so that any user's probe can see whether it is held.
  const int fd = open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0644);
  if (fd < 0) return false;
  struct flock lock = WholeFileWriteLock();
  if (fcntl(fd, F_OFD_SETLK, &lock) != 0) {
    close(fd);
    return false;
  }
  held.push_back(file);
  return true;  // the descriptor stays open, and the lock held, until exit
}

}  // namespace platform
