// Running the built executables from end-to-end tests.
#ifndef HF_TESTS_RUN_PROGRAM_H_
#define HF_TESTS_RUN_PROGRAM_H_

#include <signal.h>
#include <spawn.h>
#include <stdio.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <string>
#include <vector>

#include "platform/platform.h"
#include "server/server_process.h"
#include "tests/host_env.h"
#include "tests/temp_prefix.h"

extern char** environ;

// The directory of the built executables, as ctest passes it.
inline std::string BinDir() {
  const char* dir = getenv("HF_BIN_DIR");
  return dir ? dir : "build/bin";
}

// Starts a program with the current environment; answers its pid or -1.
inline pid_t StartProgram(const std::string& path, const std::vector<std::string>& args = {},
                          const posix_spawn_file_actions_t* actions = nullptr) {
  std::vector<std::string> copies{path};
  copies.insert(copies.end(), args.begin(), args.end());
  std::vector<char*> argv;
  for (std::string& a : copies) argv.push_back(a.data());
  argv.push_back(nullptr);
  pid_t pid = -1;
  if (posix_spawnp(&pid, path.c_str(), actions, nullptr, argv.data(), environ) != 0) return -1;
  return pid;
}

// Waits for a started program; answers its exit status, or -1 when it did
// not exit normally.
inline int WaitProgram(pid_t pid) {
  int status = 0;
  if (waitpid(pid, &status, 0) != pid) return -1;
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// A finished run: its exit status (-1 when it did not exit normally), how
// long it took, and what it wrote to standard output and error.
struct RunResult {
  int status = -1;
  double seconds = 0;
  std::string out;
  std::string err;
};

inline RunResult RunProgram(const std::string& path, const std::vector<std::string>& args = {}) {
  const auto start = std::chrono::steady_clock::now();
  RunResult run;
  FILE* streams[2] = {tmpfile(), tmpfile()};  // files, so neither can fill and block the child
  if (streams[0] && streams[1]) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, fileno(streams[0]), 1);
    posix_spawn_file_actions_adddup2(&actions, fileno(streams[1]), 2);
    pid_t pid = StartProgram(path, args, &actions);
    posix_spawn_file_actions_destroy(&actions);
    if (pid > 0) run.status = WaitProgram(pid);
    run.out = TempPrefix::ReadFile("/proc/self/fd/" + std::to_string(fileno(streams[0])));
    run.err = TempPrefix::ReadFile("/proc/self/fd/" + std::to_string(fileno(streams[1])));
  }
  for (FILE* stream : streams) {
    if (stream) fclose(stream);
  }
  run.seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  return run;
}

// The hotfolder.exe stand-in, running until the scope ends, so that the tool
// has no start-up wait.
class RunningServer {
 public:
  explicit RunningServer(const std::string& program = BinDir() + "/hotfolder.exe")
      : pid_(StartProgram(program)) {
    WaitFor([] { return platform::NamedMutexExists(kServerMutex); });
  }
  ~RunningServer() {
    kill(pid_, SIGKILL);
    WaitProgram(pid_);
  }
  RunningServer(const RunningServer&) = delete;
  RunningServer& operator=(const RunningServer&) = delete;

 private:
  pid_t pid_;
};

// The hotfolder.exe processes of this host, whoever started them.
inline std::vector<platform::ProcessId> ServerProcesses() {
  std::vector<platform::ProcessId> ids, servers;
  platform::EnumerateProcesses(&ids);
  for (platform::ProcessId id : ids) {
    std::wstring base;
    if (platform::QueryProcessModule(id, &base, nullptr) && base == kServerExecutable) {
      servers.push_back(id);
    }
  }
  return servers;
}

#endif  // HF_TESTS_RUN_PROGRAM_H_
