#include "platform/platform.h"

namespace platform {

bool NamedMutexExists(const std::wstring&) {
  return false;
}
bool HoldNamedMutex(const std::wstring&) {
  return false;
}
bool LaunchDetached(const std::wstring&) {
  return false;
}
bool EnumerateProcesses(std::vector<ProcessId>*) {
  return false;
}
bool QueryProcessModule(ProcessId, std::wstring*, std::wstring*) {
  return false;
}
bool TerminateProcess(ProcessId) {
  return false;
}
bool HklmKeyOpensForRead(const std::wstring&) {
  return false;
}
bool StartSockets() {
  return false;
}
bool LocalHostName(std::string*) {
  return false;
}
bool HostByName(const std::string&, std::string*) {
  return false;
}
bool HostByIPv4Address(const std::string&, std::string*) {
  return false;
}

}  // namespace platform
