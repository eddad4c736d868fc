// Processes on a POSIX host, seen through /proc. A process whose executable
// link cannot be read (another user's, a kernel thread, one that is gone)
// counts as one that cannot be opened.
#include <dirent.h>
#include <errno.h>
#include <fcntl.h>
#include <limits.h>
#include <signal.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>

#include "platform/platform.h"
#include "platform/posix_internal.h"

extern char** environ;

namespace platform {
namespace {

// Whether the id names a single process to kill(): 0 and values that turn
// negative as a pid_t address process groups or every process.
bool IsSingleProcess(ProcessId id) {
  return id > 0 && id <= static_cast<ProcessId>(INT_MAX);
}

bool ParseProcessId(const char* name, ProcessId* id) {
  unsigned long long value = 0;
  if (*name == '\0') return false;
  for (const char* c = name; *c; ++c) {
    if (*c < '0' || *c > '9' || value > 0xFFFFFFFFull / 10) return false;
    value = value * 10 + static_cast<unsigned>(*c - '0');
  }
  if (value > 0xFFFFFFFFull) return false;
  *id = static_cast<ProcessId>(value);
  return true;
}

bool ReadLink(const std::string& link, std::string* target) {
  for (size_t size = 256; size <= 65536; size *= 2) {
    std::string buffer(size, '\0');
    const ssize_t length = readlink(link.c_str(), buffer.data(), buffer.size());
    if (length < 0) return false;
    if (static_cast<size_t>(length) < buffer.size()) {
      *target = buffer.substr(0, static_cast<size_t>(length));
      return true;
    }
  }
  return false;
}

}  // namespace

bool LaunchDetached(const std::wstring& file_name) {
  const std::string name = posix::WideToUtf8(file_name.substr(0, file_name.find(L'\0')));
  if (name.empty()) return false;
  // Prepared before fork: the child of a threaded process should only make
  // the calls it must.
  char* argv[] = {const_cast<char*>(name.c_str()), nullptr};
  posix_spawnattr_t attributes;
  if (posix_spawnattr_init(&attributes) != 0) return false;
  sigset_t no_signals, all_signals;
  sigemptyset(&no_signals);
  sigfillset(&all_signals);
  posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF);
  posix_spawnattr_setsigmask(&attributes, &no_signals);
  posix_spawnattr_setsigdefault(&attributes, &all_signals);
  // A detached program keeps none of our standard streams: a server that
  // outlives us must not hold our caller's pipes open (a test runner or a
  // script reading our output would otherwise wait for the server to end).
  posix_spawn_file_actions_t streams;
  if (posix_spawn_file_actions_init(&streams) != 0) {
    posix_spawnattr_destroy(&attributes);
    return false;
  }
  posix_spawn_file_actions_addopen(&streams, 0, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_addopen(&streams, 1, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_addopen(&streams, 2, "/dev/null", O_WRONLY, 0);
  const pid_t child = fork();
  if (child == 0) {
    // The intermediate child starts a session of its own, spawns the program
    // and leaves at once: the program is adopted by init, so it never lingers
    // as a zombie of ours nor receives our terminal's signals.
    setsid();
    pid_t program;
    _exit(posix_spawnp(&program, argv[0], &streams, &attributes, argv, environ) == 0 ? 0 : 1);
  }
  posix_spawn_file_actions_destroy(&streams);
  posix_spawnattr_destroy(&attributes);
  if (child < 0) return false;
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) return false;
  }
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

bool EnumerateProcesses(std::vector<ProcessId>* ids, std::size_t limit) {
  if (ids == nullptr) return false;
  DIR* proc = opendir("/proc");
  if (proc == nullptr) return false;
  std::vector<ProcessId> found;
  while (const dirent* entry = readdir(proc)) {
    ProcessId id;
    if (ParseProcessId(entry->d_name, &id)) found.push_back(id);
  }
  closedir(proc);
  std::sort(found.begin(), found.end());
  if (found.size() > limit) found.resize(limit);
  *ids = std::move(found);
  return true;
}

bool QueryProcessModule(ProcessId id, std::wstring* base_name, std::wstring* file_name) {
  std::string target;
  if (!IsSingleProcess(id) || !ReadLink("/proc/" + std::to_string(id) + "/exe", &target)) {
    return false;
  }
  // A module replaced on disk while it runs still has the name it started
  // with; the kernel only marks the link.
  static const std::string kDeleted = " (deleted)";
  struct stat st;
  if (target.size() > kDeleted.size() &&
      target.compare(target.size() - kDeleted.size(), kDeleted.size(), kDeleted) == 0 &&
      lstat(target.c_str(), &st) != 0) {
    target.resize(target.size() - kDeleted.size());
  }
  if (base_name != nullptr) {
    base_name->assign(posix::Utf8ToWide(target.substr(target.rfind('/') + 1)));
    base_name->resize(std::min(base_name->size(), kModuleNameLength - 1));
  }
  if (file_name != nullptr) {
    file_name->assign(FromHostPath(target));
    file_name->resize(std::min(file_name->size(), kModuleNameLength - 1));
  }
  return true;
}

bool TerminateProcess(ProcessId id) {
  return IsSingleProcess(id) && kill(static_cast<pid_t>(id), SIGKILL) == 0;
}

}  // namespace platform
