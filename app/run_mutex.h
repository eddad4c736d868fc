// The named mutex a run of the tool holds from its first step to its exit,
// so that a second run on the same machine leaves at once: two interleaved
// runs would refuse each other's folders and undo each other's retirements.
// In the global namespace on Windows, so runs in other sessions see it too;
// on a POSIX host it is a lock file under the prefix, one per installation.
#ifndef HF_APP_RUN_MUTEX_H_
#define HF_APP_RUN_MUTEX_H_

inline constexpr wchar_t kRunMutex[] = L"Global\\KYR HotFolder Migration - Run";

#endif  // HF_APP_RUN_MUTEX_H_
