// What the contract tests cannot see of the Windows layer, checked under Wine:
// handles left open, the access rights asked for, the exit code given, the
// registry answers. Leaked handles are caught by counting
// the open ones: Wine keeps no handle count, but answers for every handle
// value whether it is open.
#include "platform/platform.h"

#include <windows.h>

#include <aclapi.h>
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
  WaitFor([] { return platform::NamedMutexExists(L"KYR Dirorodiv - Server"); });

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
  EXPECT_TRUE(platform::RenameFile(file, file + L".aside") &&
              platform::RenameFile(file + L".aside", file));
  const std::wstring retired = deep + L"\\[_KYR_HotFolder_Old]";
  // Held open without sharing deletion, as a server or an Explorer window
  // holds it: busy, not failed.
  HANDLE held = CreateFileW(platform::ToLongHostPath(settings).c_str(), GENERIC_READ,
                            FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING,
                            FILE_FLAG_BACKUP_SEMANTICS, nullptr);
  ASSERT_NE(held, INVALID_HANDLE_VALUE);
  EXPECT_EQ(platform::MoveDirectory(settings, retired), platform::MoveOutcome::kBusy);
  CloseHandle(held);
  EXPECT_EQ(platform::MoveDirectory(settings, retired), platform::MoveOutcome::kMoved);
  EXPECT_TRUE(platform::FileExists(retired + L"\\folder.cfg"));
  EXPECT_TRUE(platform::RemoveFile(retired + L"\\folder.cfg") &&
              !platform::FileExists(retired + L"\\folder.cfg"));
  for (std::wstring dir = retired; dir.size() > root.size(); dir.resize(dir.rfind(L'\\')))
    RemoveDirectoryW(platform::ToLongHostPath(dir).c_str());
  RemoveDirectoryW(root.c_str());
}

// The descriptor Wine reports for a directory, as text.
std::wstring Descriptor(const std::wstring& dir) {
  PSECURITY_DESCRIPTOR descriptor = nullptr;
  LPWSTR text = nullptr;
  const SECURITY_INFORMATION what = OWNER_SECURITY_INFORMATION | DACL_SECURITY_INFORMATION;
  if (GetNamedSecurityInfoW(dir.c_str(), SE_FILE_OBJECT, what, nullptr, nullptr, nullptr, nullptr,
                            &descriptor) != ERROR_SUCCESS ||
      !ConvertSecurityDescriptorToStringSecurityDescriptorW(descriptor, SDDL_REVISION_1, what,
                                                            &text, nullptr)) {
    return L"?";
  }
  std::wstring result = text;
  LocalFree(text);
  LocalFree(descriptor);
  return result;
}

// The folder an elevated run keeps its files in, and the run record's files.
// Wine maps a descriptor given at creation onto the host's file mode and
// hands back what that mode grants, so the made folder is compared with one
// made with the descriptor written out here and with one that inherits; "P"
// and the Users entry themselves it cannot show. Links come from the host
// (Wine's CreateSymbolicLinkW makes none): test_win32.sh plants them in
// HF_LINK_DIR. Wine shows a host link to a directory as a reparse point but
// one to a file as the file, and names the running user as every file's
// owner, so neither a refused link of another user nor a record refused for
// being a link shows here: the Linux link test plants those.
TEST(Win32, OwnFolderAndRecordFilesNeverThroughALink) {
  wchar_t temp[MAX_PATH] = {};
  ASSERT_GT(GetTempPathW(MAX_PATH, temp), 0u);
  const std::wstring root = std::wstring(temp) + L"hf-own-" + std::to_wstring(GetTickCount64());
  const std::wstring folder = root + L"\\KYR\\Dirorodiv";
  const platform::TrustedFolder made = platform::OpenTrustedFolder(folder, true);
  EXPECT_EQ(made.trust, platform::FolderTrust::kTrusted);
  EXPECT_EQ(made.path, folder);
  PSECURITY_DESCRIPTOR written = nullptr;
  ASSERT_TRUE(ConvertStringSecurityDescriptorToSecurityDescriptorW(
      L"D:P(A;OICI;FA;;;BA)(A;OICI;FA;;;SY)(A;OICI;0x1200a9;;;BU)", SDDL_REVISION_1, &written,
      nullptr));
  SECURITY_ATTRIBUTES attributes = {sizeof(attributes), written, FALSE};
  ASSERT_TRUE(CreateDirectoryW((root + L"\\reference").c_str(), &attributes));
  LocalFree(written);
  ASSERT_TRUE(CreateDirectoryW((root + L"\\inherits").c_str(), nullptr));
  for (const std::wstring& dir : {root, root + L"\\KYR", folder})
    EXPECT_EQ(Descriptor(dir), Descriptor(root + L"\\reference"));
  EXPECT_NE(Descriptor(root + L"\\inherits"), Descriptor(root + L"\\reference"));
  EXPECT_EQ(platform::OpenTrustedFolder(root + L"\\none\\x", false).trust,
            platform::FolderTrust::kMissing);
  for (const wchar_t* dir : {L"\\KYR\\Dirorodiv", L"\\KYR", L"\\inherits", L"\\reference", L""})
    RemoveDirectoryW((root + dir).c_str());

  // A link of the running user's own on the way is followed. The record's
  // temporary file is made new: where a link stands in its place that the
  // system cannot remove (Wine's DeleteFileW cannot remove a dangling host
  // link; Windows' removes the link itself), nothing is written and nothing
  // made where it points. A link under the record's name is replaced, and
  // what it named stays as it was.
  const std::wstring links = Environment("HF_LINK_DIR");
  ASSERT_FALSE(links.empty()) << "HF_LINK_DIR must name the planted links";
  EXPECT_TRUE(platform::IsLink(links + L"\\dirlink") && !platform::IsLink(links + L"\\dir"));
  EXPECT_EQ(platform::OpenTrustedFolder(links + L"\\dirlink", false).trust,
            platform::FolderTrust::kTrusted);
  EXPECT_EQ(platform::CheckTrustedHostFolder(links + L"\\target\\x").trust,
            platform::FolderTrust::kNotADirectory);
  EXPECT_FALSE(platform::ReplaceFileDurably(links + L"\\stale", "record"));
  EXPECT_FALSE(platform::FileExists(links + L"\\nowhere") ||
               platform::FileExists(links + L"\\stale"));
  std::string bytes;
  EXPECT_TRUE(platform::ReplaceFileDurably(links + L"\\run", "record"));
  EXPECT_EQ(platform::ReadRegularFile(links + L"\\target", 100, &bytes), platform::FileRead::kRead);
  EXPECT_EQ(bytes, "outside");
  EXPECT_EQ(platform::ReadRegularFile(links + L"\\run", 100, &bytes), platform::FileRead::kRead);
  EXPECT_EQ(bytes, "record");
  EXPECT_EQ(platform::ReadRegularFile(links + L"\\dir", 100, &bytes),
            platform::FileRead::kNotAFile);
  EXPECT_EQ(platform::ReadRegularFile(links + L"\\none", 100, &bytes),
            platform::FileRead::kMissing);
}

}  // namespace
