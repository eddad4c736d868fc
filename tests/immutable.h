// The immutable file flag, for tests that need a file or directory nobody
// may change: permission bits mean nothing to root, which CI runs as.
#ifndef HF_TESTS_IMMUTABLE_H_
#define HF_TESTS_IMMUTABLE_H_

#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <filesystem>

// Sets or clears the flag, which stops even root from renaming entries of a
// directory or writing a file. False where the file system has no such flag
// or the caller may not set it.
inline bool SetImmutable(const std::filesystem::path& path, bool on) {
  int fd = open(path.c_str(), O_RDONLY | O_NONBLOCK);
  if (fd < 0) return false;
  int flags = 0;
  bool ok = ioctl(fd, FS_IOC_GETFLAGS, &flags) == 0;
  flags = on ? (flags | FS_IMMUTABLE_FL) : (flags & ~FS_IMMUTABLE_FL);
  ok = ok && ioctl(fd, FS_IOC_SETFLAGS, &flags) == 0;
  close(fd);
  return ok;
}

#endif  // HF_TESTS_IMMUTABLE_H_
