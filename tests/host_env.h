// The environment and waiting, for tests that are built for Windows hosts as
// well as POSIX ones (the platform tests).
#ifndef HF_TESTS_HOST_ENV_H_
#define HF_TESTS_HOST_ENV_H_

#include <stdlib.h>

#include <chrono>
#include <cstring>
#include <string>
#include <thread>

#include "platform/platform.h"

// A variable of the environment; empty when unset.
inline platform::HostPath Environment(const char* name) {
#ifdef _WIN32
  const wchar_t* value = _wgetenv(std::wstring(name, name + std::strlen(name)).c_str());
#else
  const char* value = getenv(name);
#endif
  return value ? value : platform::HostPath();
}

// Polls `condition` every 20 ms for up to `timeout_ms`.
template <typename Condition>
bool WaitFor(Condition condition, int timeout_ms = 10000) {
  for (int waited = 0; waited < timeout_ms; waited += 20) {
    if (condition()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  return condition();
}

#endif  // HF_TESTS_HOST_ENV_H_
