// Running the built executables from end-to-end tests.
#ifndef HF_TESTS_RUN_PROGRAM_H_
#define HF_TESTS_RUN_PROGRAM_H_

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

extern char** environ;

// The directory of the built executables, as ctest passes it.
inline std::string BinDir() {
  const char* dir = getenv("HF_BIN_DIR");
  return dir ? dir : "build/bin";
}

// Starts a program with the current environment; answers its pid or -1.
inline pid_t StartProgram(const std::string& path, const std::vector<std::string>& args = {}) {
  std::vector<char*> argv;
  std::string arg0 = path;
  argv.push_back(arg0.data());
  std::vector<std::string> copies(args);
  for (std::string& a : copies) argv.push_back(a.data());
  argv.push_back(nullptr);
  pid_t pid = -1;
  if (posix_spawnp(&pid, path.c_str(), nullptr, nullptr, argv.data(), environ) != 0) return -1;
  return pid;
}

// Waits for a started program; answers its exit status, or -1 when it did
// not exit normally.
inline int WaitProgram(pid_t pid) {
  int status = 0;
  if (waitpid(pid, &status, 0) != pid) return -1;
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

struct RunResult {
  int status = -1;
  double seconds = 0;
};

inline RunResult RunProgram(const std::string& path, const std::vector<std::string>& args = {}) {
  auto start = std::chrono::steady_clock::now();
  RunResult result;
  pid_t pid = StartProgram(path, args);
  if (pid > 0) result.status = WaitProgram(pid);
  result.seconds =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  return result;
}

// Polls `condition` every 20 ms for up to `timeout_ms`.
template <typename Condition>
bool WaitFor(Condition condition, int timeout_ms = 5000) {
  for (int waited = 0; waited < timeout_ms; waited += 20) {
    if (condition()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  return condition();
}

#endif  // HF_TESTS_RUN_PROGRAM_H_
