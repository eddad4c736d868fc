// hotfolder.exe: a stand-in for the hot-folder server. It holds the named
// mutex "KYR Dirorodiv - Server" until it is terminated and does nothing
// else. A second instance exits at once with status 1.
#include <chrono>
#include <thread>

#include "platform/platform.h"
#include "server/server_process.h"

int main() {
  if (!platform::HoldNamedMutex(kServerMutex)) return 1;
  for (;;) std::this_thread::sleep_for(std::chrono::hours(1));
}
