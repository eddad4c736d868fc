// Start-up of the built hfmigrate: server probe, launch and wait, stop, and
// the exit status.
#include <gtest/gtest.h>
#include <signal.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "platform/platform.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

const wchar_t kServerMutex[] = L"KYR Dirorodiv - Server";

// A directory put first on PATH whose "hotfolder.exe" counts its launches in
// the prefix and then becomes the real stand-in (same module name, so the
// tool can find and stop it).
std::string MakeCountingLauncher(const TempPrefix& prefix) {
  std::filesystem::path dir = prefix.root() / "launcher";
  prefix.WriteFile(dir / "hotfolder.exe",
                   "#!/bin/sh\necho launch >> \"$WINEPREFIX/launches.log\"\n"
                   "exec \"" +
                       BinDir() + "/hotfolder.exe\" \"$@\"\n");
  std::filesystem::permissions(dir / "hotfolder.exe", std::filesystem::perms::owner_all);
  return dir.string();
}

int Launches(const TempPrefix& prefix) {
  std::ifstream log(prefix.root() / "launches.log");
  std::string line;
  int count = 0;
  while (std::getline(log, line)) ++count;
  return count;
}

// hotfolder.exe processes started for this prefix (their environment names
// it); with `kill`, they are ended as well.
int ServersOfPrefix(const TempPrefix& prefix, bool kill = false) {
  std::vector<platform::ProcessId> ids;
  if (!platform::EnumerateProcesses(&ids)) return -1;
  int count = 0;
  for (platform::ProcessId id : ids) {
    std::wstring base;
    if (!platform::QueryProcessModule(id, &base, nullptr) || base != L"hotfolder.exe") continue;
    std::ifstream environ_file("/proc/" + std::to_string(id) + "/environ", std::ios::binary);
    std::string env((std::istreambuf_iterator<char>(environ_file)), {});
    if (env.find("WINEPREFIX=" + prefix.root().string() + '\0') == std::string::npos) continue;
    ++count;
    if (kill) platform::TerminateProcess(id);
  }
  return count;
}

class PathOverride {
 public:
  explicit PathOverride(const std::string& first) : old_(getenv("PATH") ? getenv("PATH") : "") {
    setenv("PATH", (first + ":" + old_).c_str(), 1);
  }
  ~PathOverride() { setenv("PATH", old_.c_str(), 1); }

 private:
  std::string old_;
};

TEST(Startup, RunningServerIsNeitherWaitedForNorStopped) {
  TempPrefix prefix;
  PathOverride path(MakeCountingLauncher(prefix));
  pid_t server = StartProgram(BinDir() + "/hotfolder.exe");
  ASSERT_GT(server, 0);
  ASSERT_TRUE(WaitFor([] { return platform::NamedMutexExists(kServerMutex); }));

  // Arguments have no effect; the exit status is -1 whatever happens.
  for (const std::vector<std::string>& args :
       {std::vector<std::string>{}, std::vector<std::string>{"--help", "D:\\Jobs", "-v"}}) {
    RunResult run = RunProgram(BinDir() + "/hfmigrate", args);
    EXPECT_EQ(run.status, 255);
    EXPECT_LT(run.seconds, 5.0) << "no start-up wait when the server runs";
  }
  EXPECT_EQ(Launches(prefix), 0);
  int status = 0;
  EXPECT_EQ(waitpid(server, &status, WNOHANG), 0) << "the running server was stopped";
  kill(server, SIGKILL);
  waitpid(server, &status, 0);
}

// The only slow test: the fixed seven-second wait after launching.
TEST(Startup, AbsentServerIsLaunchedOnceAwaitedAndStopped) {
  TempPrefix prefix;
  PathOverride path(MakeCountingLauncher(prefix));
  ASSERT_FALSE(platform::NamedMutexExists(kServerMutex));

  RunResult run = RunProgram(BinDir() + "/hfmigrate");
  EXPECT_EQ(run.status, 255);
  EXPECT_GE(run.seconds, 7.0);
  EXPECT_EQ(Launches(prefix), 1);
  EXPECT_TRUE(WaitFor([&] { return ServersOfPrefix(prefix) == 0; }, 2000))
      << "the server the tool started is still running";
  EXPECT_FALSE(platform::NamedMutexExists(kServerMutex));
  ServersOfPrefix(prefix, /*kill=*/true);
}

}  // namespace
