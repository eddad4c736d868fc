// Start-up of the built hfmigrate: server probe, launch and wait, stop, and
// the exit status.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "platform/platform.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"

namespace {

// Puts first on PATH a "hotfolder.exe" that logs its process id in the prefix
// and then becomes the real stand-in under that id (same module name, so the
// tool can find and stop it); PATH comes back afterwards.
class CountingLauncher {
 public:
  explicit CountingLauncher(const TempPrefix& prefix) {
    std::filesystem::path exe = prefix.root() / "launcher" / "hotfolder.exe";
    prefix.WriteFile(exe, "#!/bin/sh\necho $$ >> \"$WINEPREFIX/launches.log\"\nexec \"" + BinDir() +
                              "/hotfolder.exe\" \"$@\"\n");
    std::filesystem::permissions(exe, std::filesystem::perms::owner_all);
    setenv("PATH", (exe.parent_path().string() + ":" + old_path_).c_str(), 1);
  }
  ~CountingLauncher() { setenv("PATH", old_path_.c_str(), 1); }

 private:
  std::string old_path_ = getenv("PATH") ? getenv("PATH") : "";
};

std::vector<platform::ProcessId> Launched(const TempPrefix& prefix) {
  std::ifstream log(prefix.root() / "launches.log");
  return {std::istream_iterator<platform::ProcessId>(log), {}};
}

bool ServerAlive(platform::ProcessId id) {
  std::vector<platform::ProcessId> servers = ServerProcesses();
  return std::find(servers.begin(), servers.end(), id) != servers.end();
}

TEST(Startup, RunningServerIsNeitherWaitedForNorStopped) {
  TempPrefix prefix;
  CountingLauncher launcher(prefix);
  RunningServer server;

  // Arguments have no effect; the exit status is -1 whatever happens.
  RunResult run = RunProgram(BinDir() + "/hfmigrate", {"--help", "D:\\Jobs", "-v"});
  EXPECT_EQ(run.status, 255);
  EXPECT_LT(run.seconds, 5.0) << "no start-up wait when the server runs";
  EXPECT_TRUE(Launched(prefix).empty());
  EXPECT_TRUE(platform::NamedMutexExists(kServerMutex)) << "the running server was stopped";

  // A second stand-in finds the mutex taken and leaves at once.
  RunResult second = RunProgram(BinDir() + "/hotfolder.exe");
  EXPECT_EQ(second.status, 1);
  EXPECT_LT(second.seconds, 5.0);
}

// The only slow test: the fixed seven-second wait after launching.
TEST(Startup, AbsentServerIsLaunchedOnceAwaitedAndStopped) {
  TempPrefix prefix;
  CountingLauncher launcher(prefix);
  ASSERT_FALSE(platform::NamedMutexExists(kServerMutex));

  RunResult run = RunProgram(BinDir() + "/hfmigrate");
  EXPECT_EQ(run.status, 255);
  EXPECT_GE(run.seconds, 7.0);
  std::vector<platform::ProcessId> launched = Launched(prefix);
  ASSERT_EQ(launched.size(), 1u);
  EXPECT_TRUE(WaitFor([&] { return !ServerAlive(launched[0]); }, 2000))
      << "the server the tool started is still running";
  EXPECT_FALSE(platform::NamedMutexExists(kServerMutex));
  if (ServerAlive(launched[0])) platform::TerminateProcess(launched[0]);
}

}  // namespace
