// Checks of the Windows platform layer against real system objects, run under
// Wine: mutexes with and without full access, a started hotfolder.exe, files
// in the temporary folder, keys in HKEY_LOCAL_MACHINE, the local resolver.
// Leaked handles are caught by counting the open ones: Wine reports no handle
// count of its own, but answers for every handle value whether it is open.
#include "platform/platform.h"

#include <winsock2.h>

#include <windows.h>

#include <sddl.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <functional>
#include <thread>

#include <gtest/gtest.h>

#undef GetFileAttributes
#undef SetFileAttributes

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

bool WaitFor(const std::function<bool()>& condition) {
  for (int i = 0; i < 200; ++i, std::this_thread::sleep_for(std::chrono::milliseconds(50))) {
    if (condition()) return true;
  }
  return false;
}

std::wstring Unique(const std::wstring& stem) {
  return stem + std::to_wstring(GetCurrentProcessId()) + L"-" + std::to_wstring(GetTickCount64());
}

// A securable object whose only grant is `sddl`.
class Restricted {
 public:
  explicit Restricted(const wchar_t* sddl) {
    ConvertStringSecurityDescriptorToSecurityDescriptorW(sddl, SDDL_REVISION_1, &descriptor_,
                                                         nullptr);
    attributes_ = {sizeof(attributes_), descriptor_, FALSE};
  }
  ~Restricted() { LocalFree(descriptor_); }
  SECURITY_ATTRIBUTES* get() { return &attributes_; }

 private:
  PSECURITY_DESCRIPTOR descriptor_ = nullptr;
  SECURITY_ATTRIBUTES attributes_;
};

TEST(Win32Mutex, ProbeSeesOnlyAHeldMutexThatOpensWithFullAccess) {
  const std::wstring name = Unique(L"hf-mutex-");
  EXPECT_FALSE(platform::NamedMutexExists(name));
  HANDLE held = CreateMutexW(nullptr, TRUE, name.c_str());
  EXPECT_TRUE(platform::NamedMutexExists(name));
  EXPECT_FALSE(platform::HoldNamedMutex(name)) << "created elsewhere";
  ExpectNoHandleLeft([&] { platform::NamedMutexExists(name); });
  CloseHandle(held);
  EXPECT_FALSE(platform::NamedMutexExists(name)) << "a probe kept the mutex alive";

  Restricted synchronize_only(L"D:(A;;0x100000;;;WD)");
  HANDLE restricted = CreateMutexW(synchronize_only.get(), FALSE, (name + L"-r").c_str());
  ASSERT_NE(restricted, nullptr);
  EXPECT_FALSE(platform::NamedMutexExists(name + L"-r"));
  CloseHandle(restricted);

  EXPECT_TRUE(platform::HoldNamedMutex(name + L"-h"));
  EXPECT_TRUE(platform::NamedMutexExists(name + L"-h"));
  EXPECT_TRUE(platform::HoldNamedMutex(name + L"-h"));
}

TEST(Win32Process, StartedServerIsFoundAndEndsWithExitCodeZero) {
  // A program that ends at once shows that both handles of a start are closed.
  ExpectNoHandleLeft([] { EXPECT_TRUE(platform::LaunchDetached(L"hostname.exe")); });
  EXPECT_FALSE(platform::LaunchDetached(L"hf-no-such-program.exe"));

  const wchar_t* bin = _wgetenv(L"HF_BIN_DIR");
  ASSERT_NE(bin, nullptr) << "HF_BIN_DIR must name the directory of hotfolder.exe";
  const std::wstring expected_path = std::wstring(bin) + L"\\hotfolder.exe";
  wchar_t old_path[32767] = {};
  GetEnvironmentVariableW(L"PATH", old_path, 32767);
  SetEnvironmentVariableW(L"PATH", (std::wstring(bin) + L";" + old_path).c_str());
  const std::wstring mutex = L"KYR Dirorodiv - Server";
  ASSERT_FALSE(platform::NamedMutexExists(mutex));
  EXPECT_TRUE(platform::LaunchDetached(L"hotfolder.exe"));
  SetEnvironmentVariableW(L"PATH", old_path);
  ASSERT_TRUE(WaitFor([&] { return platform::NamedMutexExists(mutex); }));

  // Found by base name in any letter case, as the tool finds it.
  platform::ProcessId server = 0;
  std::wstring base, path;
  std::vector<platform::ProcessId> ids;
  ASSERT_TRUE(platform::EnumerateProcesses(&ids));
  for (platform::ProcessId id : ids) {
    if (platform::QueryProcessModule(id, &base, nullptr) &&
        _wcsicmp(base.c_str(), L"HOTFOLDER.EXE") == 0) {
      server = id;
      break;
    }
  }
  ASSERT_NE(server, 0u);
  ASSERT_TRUE(platform::QueryProcessModule(server, &base, &path));
  EXPECT_EQ(_wcsicmp(path.c_str(), expected_path.c_str()), 0) << path.c_str();
  ExpectNoHandleLeft([&] { EXPECT_TRUE(platform::QueryProcessModule(server, &base, nullptr)); });
  ExpectNoHandleLeft([&] { platform::EnumerateProcesses(&ids); });

  HANDLE watch = OpenProcess(SYNCHRONIZE | PROCESS_QUERY_LIMITED_INFORMATION, FALSE, server);
  const int before = OpenHandleCount();
  EXPECT_TRUE(platform::TerminateProcess(server));
  EXPECT_EQ(before, OpenHandleCount());
  ASSERT_EQ(WaitForSingleObject(watch, 10000), WAIT_OBJECT_0);
  DWORD exit_code = 1;
  GetExitCodeProcess(watch, &exit_code);
  CloseHandle(watch);
  EXPECT_EQ(exit_code, 0u);
  EXPECT_TRUE(WaitFor([&] { return !platform::NamedMutexExists(mutex); }));
  EXPECT_FALSE(platform::TerminateProcess(0));
}

class Win32Files : public testing::Test {
 protected:
  void SetUp() override {
    wchar_t temp[MAX_PATH] = {};
    GetTempPathW(MAX_PATH, temp);
    root_ = std::wstring(temp) + Unique(L"hf-files-");
    ASSERT_TRUE(platform::CreateDirectories(root_ + L"\\from\\inner"));
  }
  void TearDown() override {
    for (const auto& entry : std::filesystem::recursive_directory_iterator(root_)) {
      SetFileAttributesW(entry.path().c_str(), FILE_ATTRIBUTE_NORMAL);
    }
    std::filesystem::remove_all(root_);
  }
  std::wstring root_;
};

TEST_F(Win32Files, AttributesAreClearedOneByOneAndTheRestKept) {
  const std::wstring dir = root_ + L"\\from", file = dir + L"\\folder.cfg";
  std::ofstream(std::filesystem::path(file)) << "<x/>";
  const std::uint32_t ro = platform::kAttributeReadOnly, hidden = platform::kAttributeHidden,
                      system = platform::kAttributeSystem,
                      directory = platform::kAttributeDirectory;
  // Wine keeps no read-only bit on directories, so that one is tried on a file.
  const struct {
    const std::wstring& path;
    std::uint32_t set, expected;
  } kCases[] = {
      {file, ro | hidden | system, ro | hidden | system},
      {file, hidden, hidden},
      {file, 0, 0},
      {dir, hidden | system, hidden | system | directory},
      {dir, directory | hidden, hidden | directory},
      {dir, 0, directory},
  };
  for (const auto& c : kCases) {
    std::uint32_t read = 0;
    EXPECT_TRUE(platform::SetFileAttributes(c.path, c.set));
    ASSERT_TRUE(platform::GetFileAttributes(c.path, &read));
    EXPECT_EQ(read & (ro | hidden | system | directory), c.expected) << "set " << c.set;
    EXPECT_EQ(platform::FileExists(c.path), c.path == file);
    EXPECT_EQ(platform::DirectoryExists(c.path), c.path == dir);
  }
  std::uint32_t read = 0;
  EXPECT_FALSE(platform::GetFileAttributes(root_ + L"\\missing", &read));
  EXPECT_FALSE(platform::SetFileAttributes(root_ + L"\\missing", hidden));
}

TEST_F(Win32Files, MoveNeverReplacesAnExistingDirectory) {
  ASSERT_TRUE(platform::CreateDirectories(root_ + L"\\to\\kept"));
  EXPECT_FALSE(platform::MoveDirectory(root_ + L"\\from", root_ + L"\\to"));
  EXPECT_TRUE(platform::DirectoryExists(root_ + L"\\from\\inner"));
  EXPECT_TRUE(platform::DirectoryExists(root_ + L"\\to\\kept"));
  EXPECT_FALSE(platform::DirectoryExists(root_ + L"\\to\\inner"));

  EXPECT_TRUE(platform::MoveDirectory(root_ + L"\\from", root_ + L"\\moved"));
  EXPECT_TRUE(platform::DirectoryExists(root_ + L"\\moved\\inner"));
  EXPECT_FALSE(platform::DirectoryExists(root_ + L"\\from"));
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
  ExpectNoHandleLeft([&] { platform::HklmKeyOpensForRead(parent); });
  RegDeleteTreeW(HKEY_LOCAL_MACHINE, parent.c_str());
  EXPECT_FALSE(platform::HklmKeyOpensForRead(parent));
}

TEST(Win32Network, LocalhostResolvesAndNonAddressesDoNot) {
  ASSERT_TRUE(platform::StartSockets());
  std::string name;
  EXPECT_TRUE(platform::LocalHostName(&name));
  EXPECT_FALSE(name.empty());
  name.clear();
  EXPECT_TRUE(platform::HostByName("localhost", &name));
  EXPECT_FALSE(name.empty());
  name.clear();
  EXPECT_TRUE(platform::HostByIPv4Address("127.0.0.1", &name));
  EXPECT_FALSE(name.empty());
  for (const char* text : {"255.255.255.255", "1.2.3.999", "localhost"}) {
    EXPECT_FALSE(platform::HostByIPv4Address(text, &name)) << text;
  }
}

TEST(Win32Paths, PathsAreWindowsPathsAlready) {
  EXPECT_EQ(platform::ToHostPath(L"D:\\Jobs\\x"), L"D:\\Jobs\\x");
  EXPECT_EQ(platform::FromHostPath(L"D:\\Jobs\\x"), L"D:\\Jobs\\x");
  wchar_t expected[MAX_PATH] = {};
  GetEnvironmentVariableW(L"ProgramData", expected, MAX_PATH);
  EXPECT_EQ(platform::CommonAppDataFolder(), expected);
  EXPECT_TRUE(platform::DirectoryExists(platform::CommonAppDataFolder()));
}

}  // namespace
