// What the contract tests cannot see of the Windows layer, checked under Wine:
// handles left open, the access rights asked for, the exit code given, the
// registry answers. Leaked handles are caught by counting
// the open ones: Wine keeps no handle count, but answers for every handle
// value whether it is open.
#include "platform/platform.h"

#include <windows.h>

#include <sddl.h>

#include <gtest/gtest.h>

#include <cwchar>
#include <string>
#include <utility>

#include "tests/host_env.h"

// windows.h's A/W macros would rename the platform layer's own functions.
#undef GetFileAttributes
#undef SetFileAttributes

namespace {

int OpenHandleCount() {
  int count = 0;
  DWORD flags = 0;
  for (ULONG_PTR value = 4; value < 0x4000; value += 4)
    count += GetHandleInformation(reinterpret_cast<HANDLE>(value), &flags) ? 1 : 0;
  return count;
}

// One of each: a mutex of another holder, a key under HKEY_LOCAL_MACHINE, the
// server stand-in started here.
TEST(Win32, AnswersAsWindowsDoesAndLeavesNoHandle) {
  const auto id = std::to_wstring(GetCurrentProcessId()) + L"-" + std::to_wstring(GetTickCount64());
  const std::wstring name = L"hf-mutex-" + id, key = L"SOFTWARE\\hf-test-" + id;
  HANDLE held = CreateMutexW(nullptr, TRUE, name.c_str());
  // Creates the key and Sub with it, and keeps no handle.
  ASSERT_EQ(RegSetKeyValueW(HKEY_LOCAL_MACHINE, (key + L"\\Sub").c_str(), nullptr, REG_SZ, L"", 2),
            ERROR_SUCCESS);
  std::wstring program = Environment("HF_BIN_DIR") + L"\\hotfolder.exe";
  STARTUPINFOW startup = {};
  startup.cb = sizeof(startup);
  PROCESS_INFORMATION server = {};
  ASSERT_TRUE(CreateProcessW(program.c_str(), &program[0], nullptr, nullptr, FALSE, 0, nullptr,
                             nullptr, &startup, &server))
      << "HF_BIN_DIR must name the directory of hotfolder.exe";
  CloseHandle(server.hThread);
  // Holding its mutex, it is past the start-up that lists its modules.
  Eventually([] { return platform::NamedMutexExists(L"KYR Dirorodiv - Server"); });

  // Each once to let the system load what it keeps for good, then twice more.
  std::wstring base_name, file_name;
  std::vector<platform::ProcessId> ids;
  const std::function<bool()> calls[] = {
      [] { return platform::LaunchDetached(L"hostname.exe"); },  // both handles of a start
      [&] { return platform::NamedMutexExists(name); },
      [&] { return platform::QueryProcessModule(server.dwProcessId, &base_name, &file_name); },
      [&] { return platform::EnumerateProcesses(&ids); },
      [&] { return platform::HklmKeyOpensForRead(key); },
  };
  for (const auto& call : calls) {
    EXPECT_TRUE(call());
    const int before = OpenHandleCount();
    EXPECT_TRUE(call() && call());
    EXPECT_EQ(before, OpenHandleCount()) << &call - calls;
  }

  const int before = OpenHandleCount();
  EXPECT_TRUE(platform::TerminateProcess(server.dwProcessId));
  EXPECT_EQ(before, OpenHandleCount());
  DWORD exit_code = 1;
  EXPECT_EQ(WaitForSingleObject(server.hProcess, 10000), WAIT_OBJECT_0);
  EXPECT_TRUE(GetExitCodeProcess(server.hProcess, &exit_code) && exit_code == 0) << exit_code;
  CloseHandle(server.hProcess);

  EXPECT_FALSE(platform::HoldNamedMutex(name)) << "held by another holder";
  // A NUL must not cut the name short to the held one's.
  EXPECT_FALSE(platform::NamedMutexExists(name + std::wstring(1, L'\0') + L"more"));
  CloseHandle(held);
  // A mutex that grants only waiting on it exists all the same: its holder
  // runs with more rights than the probe.
  PSECURITY_DESCRIPTOR descriptor = nullptr;
  ASSERT_TRUE(ConvertStringSecurityDescriptorToSecurityDescriptorW(
      L"D:(A;;0x100000;;;WD)", SDDL_REVISION_1, &descriptor, nullptr));
  SECURITY_ATTRIBUTES synchronize_only = {sizeof(synchronize_only), descriptor, FALSE};
  HANDLE restricted = CreateMutexW(&synchronize_only, FALSE, name.c_str());
  ASSERT_NE(restricted, nullptr);
  EXPECT_TRUE(platform::NamedMutexExists(name));
  CloseHandle(restricted);
  LocalFree(descriptor);
  EXPECT_FALSE(platform::NamedMutexExists(name)) << "closed";
  // A service's mutex, in the global namespace, is seen from the session too.
  HANDLE global = CreateMutexW(nullptr, FALSE, (L"Global\\" + name).c_str());
  ASSERT_NE(global, nullptr);
  EXPECT_TRUE(platform::NamedMutexExists(name));
  CloseHandle(global);

  // Cut at the NUL, the name would be the key, which exists.
  EXPECT_FALSE(platform::HklmKeyOpensForRead(key + std::wstring(1, L'\0') + L"\\Missing"));
  RegDeleteTreeW(HKEY_LOCAL_MACHINE, key.c_str());
}

// Paths reach the file API in extended-length form, normalised first as the
// system does for a plain path, so that the two name the same file.
TEST(Win32, LongPathsNameTheSameFileAtAnyLength) {
  wchar_t cwd[MAX_PATH] = {};
  ASSERT_GT(GetCurrentDirectoryW(MAX_PATH, cwd), 0u);
  const std::wstring here =
      std::wstring(L"\\\\?\\") + cwd + (cwd[wcslen(cwd) - 1] == L'\\' ? L"" : L"\\");
  const std::pair<std::wstring, std::wstring> cases[] = {
      {L"C:\\a\\b", L"\\\\?\\C:\\a\\b"},
      {L"c:/a/./b/../c", L"\\\\?\\c:\\a\\c"},
      {L"\\\\server\\share\\x", L"\\\\?\\UNC\\server\\share\\x"},
      {L"\\\\?\\C:\\as\\..\\is", L"\\\\?\\C:\\as\\..\\is"},
      {L"\\\\.\\pipe\\x", L"\\\\.\\pipe\\x"},
      {L"relative", here + L"relative"},
      {L"", L""},
      {std::wstring(L"C:\\a\0b", 6), L""},
  };
  for (const auto& [path, long_form] : cases) EXPECT_EQ(platform::ToLongHostPath(path), long_form);

  // Every file service on a tree deeper than MAX_PATH.
  wchar_t temp[MAX_PATH] = {};
  ASSERT_GT(GetTempPathW(MAX_PATH, temp), 0u);
  const std::wstring root = std::wstring(temp) + L"hf-long-" + std::to_wstring(GetTickCount64());
  std::wstring deep = root;
  while (deep.size() < 300) deep += L"\\" + std::wstring(60, L'd');
  const std::wstring settings = deep + L"\\[_KYR_HotFolder_]", file = settings + L"\\folder.cfg";
  ASSERT_TRUE(platform::CreateDirectories(settings));
  ASSERT_TRUE(platform::ReplaceFileDurably(file, "<x/>"));
  EXPECT_TRUE(platform::FileExists(file) && platform::DirectoryExists(settings));
  std::uint32_t bits = 0;
  EXPECT_TRUE(platform::SetFileAttributes(settings, platform::kAttributeHidden) &&
              platform::GetFileAttributes(settings, &bits) && (bits & platform::kAttributeHidden));
  EXPECT_TRUE(platform::SyncDirectory(settings));
  EXPECT_TRUE(platform::RenameFile(file, file + L".aside") &&
              platform::RenameFile(file + L".aside", file));
  const std::wstring retired = deep + L"\\[_KYR_HotFolder_Old]";
  EXPECT_TRUE(platform::MoveDirectory(settings, retired));
  EXPECT_TRUE(platform::FileExists(retired + L"\\folder.cfg"));
  EXPECT_TRUE(platform::RemoveFile(retired + L"\\folder.cfg") &&
              !platform::FileExists(retired + L"\\folder.cfg"));
  for (std::wstring dir = retired; dir.size() > root.size(); dir.resize(dir.rfind(L'\\')))
    RemoveDirectoryW(platform::ToLongHostPath(dir).c_str());
  RemoveDirectoryW(root.c_str());
}

}  // namespace
