// hfbench_measure OUT COMMAND [ARG...]
//
// Runs COMMAND and writes "<wall seconds> <peak RSS in KiB> <exit status>"
// to OUT. The peak is the child's own, from wait4, so neither this wrapper
// nor the shell around it is counted.
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdio>

int main(int argc, char** argv) {
  if (argc < 3) {
    std::fprintf(stderr, "usage: hfbench_measure OUT COMMAND [ARG...]\n");
    return 2;
  }
  auto start = std::chrono::steady_clock::now();
  pid_t child = fork();
  if (child < 0) return 1;
  if (child == 0) {
    execvp(argv[2], argv + 2);
    _exit(127);
  }
  int status = 0;
  rusage usage = {};
  while (wait4(child, &status, 0, &usage) < 0) {
    if (errno != EINTR) return 1;
  }
  std::chrono::duration<double> wall = std::chrono::steady_clock::now() - start;
  int code = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  std::FILE* out = std::fopen(argv[1], "w");
  if (!out) return 1;
  std::fprintf(out, "%.3f %ld %d\n", wall.count(), usage.ru_maxrss, code);
  return std::fclose(out) == 0 ? 0 : 1;
}
