// Contract tests of the platform layer. The same file runs against the POSIX
// implementation and, cross-compiled, against the Windows one, so the
// host-neutral cases speak only through platform.h.
#include "platform/platform.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cwctype>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#ifdef _WIN32
#define WIN32_LEAN_AND_MEAN
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>
// The Windows headers turn these names into macros of their own.
#undef GetFileAttributes
#undef SetFileAttributes
#else
// POSIX host only: processes, the prefix, extended attributes.
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <sys/xattr.h>
#include <unistd.h>

extern char** environ;

#include "tests/temp_prefix.h"
#endif

namespace {

namespace fs = std::filesystem;
using platform::HostPath;

// A scratch directory named by a Windows path; removed afterwards.
class Scratch {
 public:
  Scratch() {
#ifdef _WIN32
    wchar_t temp[MAX_PATH + 1];
    GetTempPathW(MAX_PATH + 1, temp);
    static int count = 0;
    wchar_t long_temp[MAX_PATH + 1];  // the long form, as module paths are shown
    if (GetLongPathNameW(temp, long_temp, MAX_PATH + 1) != 0) wcscpy(temp, long_temp);
    root_ = std::wstring(temp) + L"hfplatform." + std::to_wstring(GetCurrentProcessId()) + L"." +
            std::to_wstring(++count);
#else
    root_ = L"D:\\scratch";
#endif
    EXPECT_TRUE(platform::CreateDirectories(root_));
  }
  ~Scratch() {
    std::error_code ignored;
    fs::remove_all(fs::path(platform::ToHostPath(root_)), ignored);
  }

  std::wstring Path(const std::wstring& relative) const {
    return root_ + L"\\" + relative;
  }

  void Write(const std::wstring& relative, const std::string& bytes) const {
    std::ofstream out(fs::path(platform::ToHostPath(Path(relative))), std::ios::binary);
    out << bytes;
  }

 private:
#ifndef _WIN32
  TempPrefix prefix_;  // first: the scratch directory lives on its drive D:
#endif
  std::wstring root_;
};

// Polls a condition for up to ten seconds.
bool Eventually(const std::function<bool()>& condition) {
  for (int i = 0; i < 500; ++i) {
    if (condition()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  return condition();
}

// The built server stand-in, from the directory ctest names in HF_BIN_DIR.
HostPath ServerProgram() {
#ifdef _WIN32
  const wchar_t* dir = _wgetenv(L"HF_BIN_DIR");
  return dir ? std::wstring(dir) + L"\\hotfolder.exe" : std::wstring();
#else
  const char* dir = getenv("HF_BIN_DIR");
  return dir ? std::string(dir) + "/hotfolder.exe" : std::string();
#endif
}

// A child process of the test, started from a host path; ended with the test.
class Child {
 public:
  explicit Child(const HostPath& program) {
#ifdef _WIN32
    STARTUPINFOW startup = {};
    startup.cb = sizeof startup;
    std::wstring command = L"\"" + program + L"\"";
    PROCESS_INFORMATION info = {};
    started_ = CreateProcessW(program.c_str(), command.data(), nullptr, nullptr, FALSE, 0, nullptr,
                              nullptr, &startup, &info) != 0;
    CloseHandle(info.hThread);
    handle_ = info.hProcess;
    id_ = info.dwProcessId;
#else
    char* argv[] = {const_cast<char*>(program.c_str()), nullptr};
    pid_t pid = 0;
    started_ = posix_spawn(&pid, program.c_str(), nullptr, nullptr, argv, environ) == 0;
    id_ = static_cast<platform::ProcessId>(pid);
#endif
  }
  ~Child() {
    int ignored;
    if (started_ && !ended_ && platform::TerminateProcess(id_)) WaitForEnd(&ignored);
  }

  bool started() const {
    return started_;
  }
  platform::ProcessId id() const {
    return id_;
  }

  // Waits up to ten seconds for the end; `status` is the exit status, or -1
  // after a signal.
  bool WaitForEnd(int* status) {
#ifdef _WIN32
    DWORD code = 0;
    ended_ = WaitForSingleObject(handle_, 10000) == WAIT_OBJECT_0 &&
             GetExitCodeProcess(handle_, &code) && CloseHandle(handle_);
    *status = static_cast<int>(code);
#else
    int raw = 0;
    const pid_t pid = static_cast<pid_t>(id_);
    ended_ = Eventually([&] { return waitpid(pid, &raw, WNOHANG) == pid; });
    *status = WIFEXITED(raw) ? WEXITSTATUS(raw) : -1;
#endif
    return ended_;
  }

 private:
  bool started_ = false;
  bool ended_ = false;
  platform::ProcessId id_ = 0;
#ifdef _WIN32
  HANDLE handle_ = nullptr;
#endif
};

// Puts a directory in front of the executable search path while it lives.
class SearchPathFirst {
 public:
#ifdef _WIN32
  explicit SearchPathFirst(const HostPath& dir)
      : old_(_wgetenv(L"PATH") ? _wgetenv(L"PATH") : L"") {
    _wputenv_s(L"PATH", (dir + L";" + old_).c_str());
  }
  ~SearchPathFirst() {
    _wputenv_s(L"PATH", old_.c_str());
  }
#else
  explicit SearchPathFirst(const HostPath& dir) : old_(getenv("PATH") ? getenv("PATH") : "") {
    setenv("PATH", (dir + ":" + old_).c_str(), 1);
  }
  ~SearchPathFirst() {
    setenv("PATH", old_.c_str(), 1);
  }
#endif

 private:
  HostPath old_;
};

bool SamePathIgnoringCase(const std::wstring& a, const std::wstring& b) {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                    [](wchar_t x, wchar_t y) { return towlower(x) == towlower(y); });
}

// The first process whose module is the file `windows_path`; 0 when none.
platform::ProcessId FindProcessOf(const std::wstring& windows_path) {
  std::vector<platform::ProcessId> ids;
  if (!platform::EnumerateProcesses(&ids)) return 0;
  for (platform::ProcessId id : ids) {
    std::wstring base_name, file_name;
    if (platform::QueryProcessModule(id, &base_name, &file_name) &&
        SamePathIgnoringCase(file_name, windows_path)) {
      return id;
    }
  }
  return 0;
}

TEST(PathTest, RemoveFileSpecActsLikeTheShell) {
  struct Case {
    const wchar_t* path;
    const wchar_t* result;
    bool removed;
  };
  const Case cases[] = {
      {L"C:\\a\\b.exe", L"C:\\a", true},
      {L"C:\\b.exe", L"C:\\", true},
      {L"C:\\", L"C:\\", false},
      {L"C:", L"C:", false},
      {L"C:b.exe", L"C:", true},
      {L"C:\\a\\", L"C:\\a", true},
      {L"\\b.exe", L"\\", true},
      {L"\\\\server\\share\\f.exe", L"\\\\server\\share", true},
      {L"\\\\server\\share", L"\\\\server", true},
      {L"b.exe", L"", true},
      {L"", L"", false},
#ifndef _WIN32
      // POSIX host: a host-form path outside every drive uses slashes.
      {L"/opt/hf/hotfolder.exe", L"/opt/hf", true},
      {L"/hotfolder.exe", L"/", true},
      {L"/", L"/", false},
      {L"/opt/a:b/x", L"/opt/a:b", true},
#endif
  };
  for (const Case& c : cases) {
    std::wstring path = c.path;
    EXPECT_EQ(platform::RemoveFileSpec(&path), c.removed) << c.path;
    EXPECT_EQ(path, c.result) << c.path;
  }
}

TEST(FileTest, ExistenceAndCreation) {
  Scratch scratch;
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"a\\b\\c")));
  EXPECT_TRUE(platform::CreateDirectories(scratch.Path(L"a\\b\\c")));  // already there
  scratch.Write(L"a\\f.txt", "x");
  EXPECT_TRUE(platform::DirectoryExists(scratch.Path(L"a\\b\\c")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"a\\f.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"a\\b")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"a\\f.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"missing")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"missing")));
  // A directory cannot be created through a file.
  EXPECT_FALSE(platform::CreateDirectories(scratch.Path(L"a\\f.txt\\d")));
  // Names differ only in case: the existing entries are found.
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"A\\F.TXT")));
  EXPECT_TRUE(platform::DirectoryExists(scratch.Path(L"A/B/c")));
}

TEST(FileTest, AttributesRoundTrip) {
  Scratch scratch;
  const std::wstring dir = scratch.Path(L"[_KYR_HotFolder_]");
  const std::wstring file = scratch.Path(L"folder.cfg");
  ASSERT_TRUE(platform::CreateDirectories(dir));
  scratch.Write(L"folder.cfg", "<x/>");
  using platform::kAttributeArchive;
  using platform::kAttributeDirectory;
  using platform::kAttributeHidden;
  using platform::kAttributeReadOnly;
  using platform::kAttributeSystem;
  std::uint32_t bits = 0;

  struct Case {
    const std::wstring* path;
    std::uint32_t set;
    std::uint32_t read;
  };
  const Case cases[] = {
#ifdef _WIN32
      // Wine keeps no read-only bit on a directory, and always reports ARCHIVE
      // on a file; the file carries the read-only case here.
      {&file, kAttributeReadOnly | kAttributeHidden | kAttributeSystem | kAttributeArchive,
       kAttributeReadOnly | kAttributeHidden | kAttributeSystem | kAttributeArchive},
      {&dir, kAttributeHidden | kAttributeSystem,
       kAttributeHidden | kAttributeSystem | kAttributeDirectory},
#else
      {&dir, kAttributeReadOnly | kAttributeHidden | kAttributeSystem,
       kAttributeReadOnly | kAttributeHidden | kAttributeSystem | kAttributeDirectory},
#endif
      {&dir, kAttributeHidden, kAttributeHidden | kAttributeDirectory},
      {&file, kAttributeHidden | kAttributeArchive | kAttributeDirectory,  // DIRECTORY ignored
       kAttributeHidden | kAttributeArchive},
  };
  for (const Case& c : cases) {
    ASSERT_TRUE(platform::SetFileAttributes(*c.path, c.set)) << c.set;
    ASSERT_TRUE(platform::GetFileAttributes(*c.path, &bits));
    EXPECT_EQ(bits, c.read) << c.set;
  }
  EXPECT_FALSE(platform::GetFileAttributes(scratch.Path(L"missing"), &bits));
  EXPECT_FALSE(platform::SetFileAttributes(scratch.Path(L"missing"), kAttributeHidden));
#ifndef _WIN32
  // POSIX host: stored as Wine stores them, and a missing attribute reads as
  // no bits.
  char text[16] = {};
  const HostPath host_dir = platform::ToHostPath(dir);
  ASSERT_EQ(getxattr(host_dir.c_str(), "user.DOSATTRIB", text, sizeof text), 3);
  EXPECT_STREQ(text, "0x2");
  ASSERT_EQ(removexattr(host_dir.c_str(), "user.DOSATTRIB"), 0);
  ASSERT_TRUE(platform::GetFileAttributes(dir, &bits));
  EXPECT_EQ(bits, kAttributeDirectory);
#endif
}

TEST(FileTest, MoveNeverReplacesAnExistingDirectory) {
  Scratch scratch;
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"old")));
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"taken")));
  scratch.Write(L"old\\folder.cfg", "old");
  scratch.Write(L"taken\\keep.txt", "taken");
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"taken")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"TAKEN")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"old\\folder.cfg")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"taken\\keep.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"taken\\folder.cfg")));

  // An empty target is not replaced either.
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"empty")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"empty")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"old\\folder.cfg")));

  EXPECT_TRUE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"new")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"old")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"new\\folder.cfg")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"missing"), scratch.Path(L"other")));
}

TEST(MutexTest, ExistsExactlyWhileTheServerHoldsIt) {
  Scratch scratch;  // on a POSIX host this is also a prefix of our own
  const HostPath program = ServerProgram();
  ASSERT_FALSE(program.empty()) << "HF_BIN_DIR must name the directory of hotfolder.exe";
  const std::wstring name = L"KYR Dirorodiv - Server";
  EXPECT_FALSE(platform::NamedMutexExists(name));
  Child server(program);
  ASSERT_TRUE(server.started());
  ASSERT_TRUE(Eventually([&] { return platform::NamedMutexExists(name); }));
  EXPECT_TRUE(platform::NamedMutexExists(name));  // a probe does not take it
  EXPECT_FALSE(platform::NamedMutexExists(L"KYR Dirorodiv - Server2"));

  Child second(program);
  int status = 0;
  ASSERT_TRUE(second.WaitForEnd(&status));
  EXPECT_EQ(status, 1);
  EXPECT_TRUE(platform::NamedMutexExists(name));

  ASSERT_TRUE(platform::TerminateProcess(server.id()));
  ASSERT_TRUE(server.WaitForEnd(&status));
  EXPECT_TRUE(Eventually([&] { return !platform::NamedMutexExists(name); }));
}

TEST(MutexTest, HoldingInThisProcess) {
  Scratch scratch;
  const std::wstring name = L"Local\\hf platform/test \u00fc " + std::to_wstring(__LINE__);
  EXPECT_FALSE(platform::NamedMutexExists(name));
  ASSERT_TRUE(platform::HoldNamedMutex(name));
  EXPECT_TRUE(platform::HoldNamedMutex(name));  // ours already
  EXPECT_TRUE(platform::NamedMutexExists(name));
  EXPECT_FALSE(platform::NamedMutexExists(L""));
  EXPECT_FALSE(platform::HoldNamedMutex(L""));
}

TEST(ProcessTest, LaunchedServerIsFoundByNameAndPathAndTerminated) {
  Scratch scratch;
  const HostPath program = ServerProgram();
  ASSERT_FALSE(program.empty()) << "HF_BIN_DIR must name the directory of hotfolder.exe";
  // A private copy: only the process started here can have its path.
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"bin")));
  const std::wstring copy = scratch.Path(L"bin\\hotfolder.exe");
  fs::copy_file(fs::path(program), fs::path(platform::ToHostPath(copy)));
  // Canonical: a POSIX search path cannot hold the colon of "dosdevices/d:".
  SearchPathFirst search(
      fs::canonical(fs::path(platform::ToHostPath(scratch.Path(L"bin")))).native());

  EXPECT_FALSE(platform::LaunchDetached(L"hf-no-such-program.exe"));
  ASSERT_TRUE(platform::LaunchDetached(L"hotfolder.exe"));
  ASSERT_TRUE(Eventually([] { return platform::NamedMutexExists(L"KYR Dirorodiv - Server"); }));
  platform::ProcessId id = 0;
  ASSERT_TRUE(Eventually([&] { return (id = FindProcessOf(copy)) != 0; }));
  std::wstring base_name;
  ASSERT_TRUE(platform::QueryProcessModule(id, &base_name, nullptr));
  EXPECT_EQ(base_name, L"hotfolder.exe");

  std::vector<platform::ProcessId> ids;
  ASSERT_TRUE(platform::EnumerateProcesses(&ids));
  EXPECT_LE(ids.size(), platform::kMaxProcesses);
#ifndef _WIN32
  EXPECT_TRUE(std::is_sorted(ids.begin(), ids.end()));  // POSIX host: ascending ids
#endif

  ASSERT_TRUE(platform::TerminateProcess(id));
  EXPECT_TRUE(Eventually([] { return !platform::NamedMutexExists(L"KYR Dirorodiv - Server"); }));
  EXPECT_TRUE(Eventually([&] { return FindProcessOf(copy) == 0; }));
  EXPECT_FALSE(platform::QueryProcessModule(0, &base_name, nullptr));
  EXPECT_FALSE(platform::QueryProcessModule(0xFFFFFFFFu, &base_name, nullptr));
}

TEST(NetworkTest, ResolvesTheLocalHost) {
  ASSERT_TRUE(platform::StartSockets());
  std::string name;
  EXPECT_TRUE(platform::LocalHostName(&name));
  EXPECT_FALSE(name.empty());
  std::string official;
  EXPECT_TRUE(platform::HostByName("localhost", &official));
  EXPECT_FALSE(official.empty());
  official.clear();
  EXPECT_TRUE(platform::HostByIPv4Address("127.0.0.1", &official));
  EXPECT_FALSE(official.empty());
  std::string kept = "kept";
  EXPECT_FALSE(platform::HostByIPv4Address("not an address", &kept));
  EXPECT_FALSE(platform::HostByIPv4Address("255.255.255.255", &kept));  // the "no address" value
  EXPECT_EQ(kept, "kept");
}

#ifndef _WIN32
// POSIX host: the Wine-style prefix mapping.
TEST(PrefixTest, MapsWindowsPathsIntoThePrefix) {
  TempPrefix prefix;
  fs::create_directories(prefix.Drive('d') / "Jobs" / "Brochures");
  fs::create_directories(prefix.Drive('d') / "Twice" / "Mixed");
  fs::create_directories(prefix.Drive('d') / "Twice" / "MIXED");
  const std::string devices = prefix.root().string() + "/dosdevices";
  struct Case {
    const wchar_t* windows;
    std::string host;  // after the prefix's dosdevices, or whole when relative
  };
  const Case cases[] = {
      {L"D:\\Jobs\\Brochures", "/d:/Jobs/Brochures"},
      {L"d:\\jobs\\BROCHURES\\New.txt", "/d:/Jobs/Brochures/New.txt"},
      {L"D:\\Twice\\mixed", "/d:/Twice/mixed"},  // two candidates: none chosen
      {L"Q:\\Jobs", "/q:/Jobs"},                 // no such drive
      {L"\\\\Server\\Share\\a\\b", "/unc/Server/Share/a/b"},
      {L"\\\\Server\\Share\\..\\..\\x", "/unc/Server/Share/x"},
      {L"D:\\..\\..\\Jobs", "/d:/Jobs"},
      {L"D:/Jobs/./Brochures/../Brochures/", "/d:/Jobs/Brochures"},
      {L"D:\\", "/d:"},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(platform::ToHostPath(c.windows), devices + c.host) << c.windows;
  }
  const Case relative[] = {
      {L"rel\\x.cfg", "rel/x.cfg"},      {L"a\\..\\..\\b", "../b"}, {L"", ""},
      {L"\\rooted\\without\\drive", ""}, {L"\\\\server-only", ""},
  };
  for (const Case& c : relative) {
    EXPECT_EQ(platform::ToHostPath(c.windows), c.host) << c.windows;
  }

  // Without WINEPREFIX the prefix is ~/.wine.
  const std::string home = getenv("HOME") ? getenv("HOME") : "";
  setenv("HOME", prefix.root().c_str(), 1);
  unsetenv("WINEPREFIX");
  EXPECT_EQ(platform::ToHostPath(L"C:\\x"), prefix.root().string() + "/.wine/dosdevices/c:/x");
  setenv("HOME", home.c_str(), 1);
  setenv("WINEPREFIX", prefix.root().c_str(), 1);
}

TEST(PrefixTest, MapsHostPathsBackThroughTheLongestDrive) {
  TempPrefix prefix;
  fs::create_directories(prefix.Drive('d') / "Jobs" / "bin");
  fs::create_directory_symlink("../drive_d/Jobs", prefix.root() / "dosdevices" / "e:");
  struct Case {
    std::string host;
    std::wstring windows;
  };
  const Case cases[] = {
      {(prefix.Drive('d') / "hotfolder.exe").string(), L"D:\\hotfolder.exe"},
      {(prefix.Drive('d') / "Jobs" / "bin" / "hotfolder.exe").string(), L"E:\\bin\\hotfolder.exe"},
      {prefix.Drive('c').string(), L"C:\\"},
      {"/nowhere/hotfolder.exe", L"/nowhere/hotfolder.exe"},
  };
  for (const Case& c : cases) EXPECT_EQ(platform::FromHostPath(c.host), c.windows) << c.host;
  // A Windows path survives the trip out and back.
  EXPECT_EQ(platform::FromHostPath(platform::ToHostPath(L"d:\\JOBS\\Bin")), L"E:\\bin");
}

TEST(PrefixTest, NeverCreatesADrive) {
  TempPrefix prefix;
  EXPECT_FALSE(platform::CreateDirectories(L"Q:\\Jobs"));
  EXPECT_FALSE(fs::exists(prefix.root() / "dosdevices" / "q:"));
  EXPECT_EQ(platform::CommonAppDataFolder(), L"C:\\ProgramData");
  EXPECT_TRUE(platform::CreateDirectories(L"C:\\ProgramData\\KYR\\Dirorodiv"));
  EXPECT_TRUE(fs::is_directory(prefix.Drive('c') / "ProgramData" / "KYR" / "Dirorodiv"));
}

// POSIX host: kill() reads 0 as "my process group"; such ids are refused. The
// check runs in a child with a group of its own, so a failure ends only that.
TEST(ProcessTest, TerminateRefusesProcessGroupIds) {
  const pid_t child = fork();
  if (child == 0) {
    setpgid(0, 0);
    _exit(platform::TerminateProcess(0) ? 2 : 0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
}

// POSIX host: HKEY_LOCAL_MACHINE is the prefix's system.reg.
TEST(RegistryTest, ReadsTheWineSystemHive) {
  TempPrefix prefix;
  const std::wstring product = L"SOFTWARE\\Wow6432Node\\Tessaly Systems\\Corvane_app\\3.0";
  EXPECT_FALSE(platform::HklmKeyOpensForRead(product));  // no hive at all
  prefix.WriteFile(prefix.root() / "system.reg",
                   "WINE REGISTRY Version 2\n"
                   ";; All keys relative to \\\\Machine\n\n#arch=win64\n\n"
                   "[Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app\\\\3.0\\\\Paths] "
                   "1700000000\n#time=1d9a0b2c3d4e5f6\n\"Dir\"=\"C:\\\\x\"\n\n"
                   "[Software\\\\Vendor\\\\App\\\\3.01] 1700000000\n"
                   "[Software\\\\Vendor\\\\Other\\\\3.0x] 1700000000\n"
                   "[Software\\\\Vendor\\\\Br\\[ack\\]et\\x00fc] 1700000000\n"
                   "[Software\\\\Unclosed\n");
  struct Case {
    std::wstring key;
    bool opens;
  };
  const Case cases[] = {
      {product, true},  // a parent of a section
      {L"software\\wow6432node\\TESSALY SYSTEMS\\corvane_app\\3.0\\paths", true},
      {L"SOFTWARE", true},
      {L"SOFTWARE\\Wow6432Node\\Tessaly Systems\\Corvane_app\\3", false},
      {L"SOFTWARE\\Vendor\\App\\3.0", false},  // only a sibling "3.01"
      {L"SOFTWARE\\Vendor\\Other\\3.0", false},
      {L"SOFTWARE\\Vendor\\App\\3.01\\Below", false},
      {L"SOFTWARE\\Vendor\\Br[ack]et\u00dc", true},  // escapes, and case beyond ASCII
      {L"SOFTWARE\\Unclosed", false},
      {L"SOFTWARE\\Missing", false},
  };
  for (const Case& c : cases) EXPECT_EQ(platform::HklmKeyOpensForRead(c.key), c.opens) << c.key;

  // Any bytes at all give an answer.
  std::string noise = "[\\x\\\\\\[\\xd800\\xdc00]\n[\\";
  for (int i = 0; i < 4096; ++i) noise.push_back(static_cast<char>((i * 7919) % 256));
  prefix.WriteFile(prefix.root() / "system.reg", noise);
  EXPECT_FALSE(platform::HklmKeyOpensForRead(product));
}
#endif

}  // namespace
