#include "server/server_process.h"

#include <algorithm>
#include <cwctype>
#include <vector>

#include "platform/platform.h"

namespace {

bool SameIgnoringCase(const std::wstring& a, const std::wstring& b) {
  if (a.size() != b.size()) return false;
  for (std::size_t i = 0; i < a.size(); ++i) {
    if (std::towlower(a[i]) != std::towlower(b[i])) return false;
  }
  return true;
}

}  // namespace

void StopServer(const std::vector<platform::ProcessId>& running_before) {
  std::vector<platform::ProcessId> ids;
  if (!platform::EnumerateProcesses(&ids)) return;
  for (platform::ProcessId id : ids) {
    if (std::find(running_before.begin(), running_before.end(), id) != running_before.end()) {
      continue;
    }
    std::wstring base_name;
    if (!platform::QueryProcessModule(id, &base_name, nullptr)) continue;
    if (!SameIgnoringCase(base_name, kServerExecutable)) continue;
    platform::TerminateProcess(id);
    return;
  }
}

void FindServerDirectory(std::wstring* directory) {
  std::vector<platform::ProcessId> ids;
  if (!platform::EnumerateProcesses(&ids)) return;
  for (platform::ProcessId id : ids) {
    std::wstring base_name;
    std::wstring file_name;
    if (!platform::QueryProcessModule(id, &base_name, &file_name)) continue;
    if (base_name != kServerExecutable || file_name.empty()) continue;
    platform::RemoveFileSpec(&file_name);
    *directory = file_name;
    return;
  }
}
