// What the contract tests cannot see of the Windows layer, checked under Wine:
// handles left open, the access rights asked for, the exit code given, the
// known-folder and registry answers. Leaked handles are caught by counting
// the open ones: Wine keeps no handle count, but answers for every handle
// value whether it is open.
#include "platform/platform.h"

#include <winsock2.h>

#include <windows.h>

#include <sddl.h>

#include <functional>

#include <gtest/gtest.h>

namespace {

int OpenHandleCount() {
  int count = 0;
  DWORD flags = 0;
  for (ULONG_PTR value = 4; value < 0x4000; value += 4) {
    if (GetHandleInformation(reinterpret_cast<HANDLE>(value), &flags)) ++count;
  }
  return count;
}

// Calls `call` once to let the system load what it keeps for good, then
// twice more, which must leave no handle open.
void ExpectNoHandleLeft(const std::function<void()>& call) {
  call();
  const int before = OpenHandleCount();
  call();
  call();
  EXPECT_EQ(before, OpenHandleCount());
}

std::wstring Unique(const std::wstring& stem) {
  return stem + std::to_wstring(GetCurrentProcessId()) + L"-" + std::to_wstring(GetTickCount64());
}

TEST(Win32Mutex, ProbeNeedsFullAccessAndKeepsNothingOpen) {
  const std::wstring name = Unique(L"hf-mutex-");
  HANDLE held = CreateMutexW(nullptr, TRUE, name.c_str());
  EXPECT_TRUE(platform::NamedMutexExists(name));
  EXPECT_FALSE(platform::HoldNamedMutex(name)) << "held by another holder";
  const std::wstring cut = name + std::wstring(1, L'\0') + L"more";
  EXPECT_FALSE(platform::NamedMutexExists(cut)) << "a NUL must not shorten the name";
  ExpectNoHandleLeft([&] { platform::NamedMutexExists(name); });
  CloseHandle(held);
  EXPECT_FALSE(platform::NamedMutexExists(name)) << "a probe kept the mutex alive";

  // A mutex that grants only waiting on it does not count as the server's.
  PSECURITY_DESCRIPTOR descriptor = nullptr;
  ASSERT_TRUE(ConvertStringSecurityDescriptorToSecurityDescriptorW(
      L"D:(A;;0x100000;;;WD)", SDDL_REVISION_1, &descriptor, nullptr));
  SECURITY_ATTRIBUTES synchronize_only = {sizeof(synchronize_only), descriptor, FALSE};
  HANDLE restricted = CreateMutexW(&synchronize_only, FALSE, name.c_str());
  ASSERT_NE(restricted, nullptr);
  EXPECT_FALSE(platform::NamedMutexExists(name));
  CloseHandle(restricted);
  LocalFree(descriptor);
}

TEST(Win32Process, ServerIsQueriedAndEndedWithExitCodeZeroLeavingNoHandle) {
  // A program that ends at once shows that both handles of a start are closed.
  ExpectNoHandleLeft([] { EXPECT_TRUE(platform::LaunchDetached(L"hostname.exe")); });

  const wchar_t* bin = _wgetenv(L"HF_BIN_DIR");
  ASSERT_NE(bin, nullptr) << "HF_BIN_DIR must name the directory of hotfolder.exe";
  std::wstring program = std::wstring(bin) + L"\\hotfolder.exe";
  STARTUPINFOW startup = {};
  startup.cb = sizeof(startup);
  PROCESS_INFORMATION server = {};
  ASSERT_TRUE(CreateProcessW(program.c_str(), &program[0], nullptr, nullptr, FALSE, 0, nullptr,
                             nullptr, &startup, &server));
  CloseHandle(server.hThread);
  // Holding its mutex, it is past the start-up that lists its modules.
  for (int i = 0; i < 500 && !platform::NamedMutexExists(L"KYR Dirorodiv - Server"); ++i) Sleep(20);

  std::wstring base_name, file_name;
  ExpectNoHandleLeft([&] {
    EXPECT_TRUE(platform::QueryProcessModule(server.dwProcessId, &base_name, &file_name));
  });
  EXPECT_EQ(_wcsicmp(file_name.c_str(), program.c_str()), 0) << file_name.c_str();
  std::vector<platform::ProcessId> ids;
  ExpectNoHandleLeft([&] { EXPECT_TRUE(platform::EnumerateProcesses(&ids)); });

  const int before = OpenHandleCount();
  EXPECT_TRUE(platform::TerminateProcess(server.dwProcessId));
  EXPECT_EQ(before, OpenHandleCount());
  ASSERT_EQ(WaitForSingleObject(server.hProcess, 10000), WAIT_OBJECT_0);
  DWORD exit_code = 1;
  GetExitCodeProcess(server.hProcess, &exit_code);
  CloseHandle(server.hProcess);
  EXPECT_EQ(exit_code, 0u);
}

TEST(Win32Registry, KeyCreatedUnderHklmOpensForReadAndMissingDoesNot) {
  const std::wstring parent = L"SOFTWARE\\" + Unique(L"hf-test-");
  HKEY created = nullptr;
  ASSERT_EQ(RegCreateKeyExW(HKEY_LOCAL_MACHINE, (parent + L"\\Sub").c_str(), 0, nullptr, 0,
                            KEY_ALL_ACCESS, nullptr, &created, nullptr),
            ERROR_SUCCESS);
  RegCloseKey(created);
  EXPECT_TRUE(platform::HklmKeyOpensForRead(parent));
  EXPECT_TRUE(platform::HklmKeyOpensForRead(parent + L"\\Sub"));
  EXPECT_FALSE(platform::HklmKeyOpensForRead(parent + L"\\Missing"));
  EXPECT_FALSE(platform::HklmKeyOpensForRead(parent + std::wstring(1, L'\0') + L"\\Missing"));
  ExpectNoHandleLeft([&] { platform::HklmKeyOpensForRead(parent); });
  RegDeleteTreeW(HKEY_LOCAL_MACHINE, parent.c_str());
  EXPECT_FALSE(platform::HklmKeyOpensForRead(parent));
}

TEST(Win32Paths, WindowsPathsNeedNoMappingAndProgramDataComesFromTheSystem) {
  EXPECT_EQ(platform::ToHostPath(L"D:\\Jobs\\x"), L"D:\\Jobs\\x");
  EXPECT_EQ(platform::FromHostPath(L"D:\\Jobs\\x"), L"D:\\Jobs\\x");
  wchar_t expected[MAX_PATH] = {};
  GetEnvironmentVariableW(L"ProgramData", expected, MAX_PATH);
  EXPECT_EQ(platform::CommonAppDataFolder(), expected);
  EXPECT_TRUE(platform::DirectoryExists(platform::CommonAppDataFolder()));
}

}  // namespace
