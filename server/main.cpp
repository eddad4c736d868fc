// hotfolder.exe: a stand-in for the hot-folder server. It holds the named
// mutex "KYR Dirorodiv - Server" until it is terminated and does nothing
// else. A second instance exits at once with status 1.
//
// "hotfolder.exe --probe" only looks: status 0 when a server holds the
// mutex, 3 when none does. A test that asks whether a server runs where it
// cannot see the mutex itself (under Wine) must not take the mutex, or a
// server starting at that moment would leave as a second instance.
#include <chrono>
#include <cstring>
#include <thread>

#include "platform/platform.h"
#include "server/server_process.h"

int main(int argc, char** argv) {
  if (argc > 1 && std::strcmp(argv[1], "--probe") == 0) {
    return platform::NamedMutexExists(kServerMutex) ? 0 : 3;
  }
  if (!platform::HoldNamedMutex(kServerMutex)) return 1;
  for (;;) std::this_thread::sleep_for(std::chrono::hours(1));
}
