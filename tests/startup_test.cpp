// Start-up of the built hfmigrate: one run at a time, server probe, launch
// and wait, stop, and the exit status.
#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "app/run_mutex.h"
#include "platform/platform.h"
#include "tests/legacy_fixture.h"
#include "tests/run_program.h"
#include "tests/snapshot.h"
#include "tests/temp_prefix.h"

namespace {

// Puts first on PATH a "hotfolder.exe" that logs its process id in the prefix
// and hands over to a copy of the real stand-in named "HOTFOLDER.EXE", in a
// process of its own whose id it logs too; PATH comes back afterwards.
class CountingLauncher {
 public:
  explicit CountingLauncher(const TempPrefix& prefix) {
    const std::filesystem::path exe = prefix.root() / "launcher" / "hotfolder.exe",
                                server = prefix.root() / "server" / "HOTFOLDER.EXE";
    std::filesystem::create_directories(server.parent_path());
    std::filesystem::copy_file(BinDir() + "/hotfolder.exe", server);
    prefix.WriteFile(exe, "#!/bin/sh\necho $$ >> \"$WINEPREFIX/launches.log\"\n\"" +
                              server.string() +
                              "\" \"$@\" &\necho $! >> \"$WINEPREFIX/servers.log\"\n");
    std::filesystem::permissions(exe, std::filesystem::perms::owner_all);
    setenv("PATH", (exe.parent_path().string() + ":" + old_path_).c_str(), 1);
  }
  ~CountingLauncher() { setenv("PATH", old_path_.c_str(), 1); }

 private:
  std::string old_path_ = getenv("PATH") ? getenv("PATH") : "";
};

std::vector<platform::ProcessId> Logged(const TempPrefix& prefix, const char* log_name) {
  std::ifstream log(prefix.root() / log_name);
  return {std::istream_iterator<platform::ProcessId>(log), {}};
}

// Alive and not yet a zombie, whatever its name.
bool Alive(platform::ProcessId id) {
  std::wstring base_name;
  return platform::QueryProcessModule(id, &base_name, nullptr);
}

// A running server is neither waited for nor stopped, and arguments have no
// effect: the exit status is -1 whatever happens. Then the only slow part:
// the fixed seven-second wait after launching. A second run meanwhile leaves
// at once and changes nothing. The server launched hands over to another
// process, which is found by name and stopped; a stand-in of another
// installation, running before the launch, is left alone.
TEST(Startup, ServerLaunchedOnlyWhenAbsentAwaitedAndStoppedOneRunAtATime) {
  TempPrefix other;
  CountingLauncher other_launcher(other);
  const pid_t bystander = StartProgram(BinDir() + "/hotfolder.exe");
  ASSERT_TRUE(WaitFor([] { return platform::NamedMutexExists(kServerMutex); }));
  RunResult run = RunProgram(BinDir() + "/hfmigrate", {"--help", "D:\\Jobs", "-v"});
  EXPECT_EQ(run.status, 255);
  EXPECT_LT(run.seconds, 5.0) << "no start-up wait when the server runs";
  EXPECT_TRUE(Logged(other, "launches.log").empty());
  EXPECT_TRUE(platform::NamedMutexExists(kServerMutex)) << "the running server was stopped";
  // A second stand-in finds the mutex taken and leaves at once.
  RunResult second_server = RunProgram(BinDir() + "/hotfolder.exe");
  EXPECT_EQ(second_server.status, 1);
  EXPECT_LT(second_server.seconds, 5.0);

  TempPrefix prefix;
  CountingLauncher launcher(prefix);
  WriteLegacyList(prefix, {{"D:\\Jobs\\A", 2}});
  WriteFolderConfig(prefix, "Jobs/A", "<HotFolder/>");
  const Tree installed = Snapshot(prefix.Drive('d'));
  ASSERT_FALSE(platform::NamedMutexExists(kServerMutex));

  const auto start = std::chrono::steady_clock::now();
  const pid_t first = StartProgram(BinDir() + "/hfmigrate");
  ASSERT_TRUE(WaitFor([] { return platform::NamedMutexExists(kRunMutex); }));
  RunResult second = RunProgram(BinDir() + "/hfmigrate");
  EXPECT_EQ(second.status, 255);
  EXPECT_LT(second.seconds, 5.0) << "the second run did not leave at once";
  EXPECT_EQ(Snapshot(prefix.Drive('d')), installed) << "the second run changed the installation";

  EXPECT_EQ(WaitProgram(first), 255);
  EXPECT_GE(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count(), 7.0);
  EXPECT_NE(Snapshot(prefix.Drive('d')), installed) << "the first run migrated nothing";
  EXPECT_EQ(Logged(prefix, "launches.log").size(), 1u);
  const std::vector<platform::ProcessId> launched = Logged(prefix, "servers.log");
  ASSERT_EQ(launched.size(), 1u);
  EXPECT_TRUE(WaitFor([&] { return !Alive(launched[0]); }, 2000))
      << "the server the tool started is still running";
  EXPECT_FALSE(platform::NamedMutexExists(kServerMutex));
  EXPECT_TRUE(Alive(bystander)) << "a server that ran before the launch was stopped";
  if (Alive(launched[0])) platform::TerminateProcess(launched[0]);
  kill(bystander, SIGKILL);
  WaitProgram(bystander);
}

}  // namespace
