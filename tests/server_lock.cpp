// Linked into every test program whose cases start, probe or stop the
// hotfolder.exe stand-in. The tool stops a server by its name, which is the
// same for every build directory, and ctest's resource lock covers one ctest
// run only; so each such test process holds one lock for the whole machine,
// taken before its first case and dropped by the kernel when it exits. Only
// a process that runs cases takes it: ctest lists a program's cases first,
// and a listing that waited for another run's cases would time out.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <stdio.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

constexpr char kLockFile[] = "/tmp/hfmigrate-hotfolder-tests.lock";

struct MachineWideServerLock : ::testing::Environment {
  void SetUp() override {
    const int fd = open(kLockFile, O_RDWR | O_CREAT | O_CLOEXEC, 0666);
    if (fd < 0 || flock(fd, LOCK_EX) != 0) {
      perror(kLockFile);
      _exit(2);  // running unguarded would make other runs' failures ours
    }
    fchmod(fd, 0666);  // any user's test run may take it after us
  }
};

::testing::Environment* const lock = ::testing::AddGlobalTestEnvironment(new MachineWideServerLock);

}  // namespace
